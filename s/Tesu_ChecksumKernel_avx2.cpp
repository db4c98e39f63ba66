// The checksummed-file scanner's loop for processors with AVX2; built with -mavx2 and called
// only where the processor has it.
#include <immintrin.h>

#include "Tesu_ChecksumKernel.h"

namespace Tesu {
namespace checksumscan {
namespace {

struct Avx2 {
    static constexpr bool kCompress = false;
    static std::uint64_t Specials(const char* p) {
        const __m256i lineBreak = _mm256_set1_epi8('\n');
        const __m256i hash = _mm256_set1_epi8('#');
        const __m256i low = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(p));
        const __m256i high = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(p + 32));
        const auto lowBits = static_cast<std::uint32_t>(_mm256_movemask_epi8(
            _mm256_or_si256(_mm256_cmpeq_epi8(low, lineBreak), _mm256_cmpeq_epi8(low, hash))));
        const auto highBits = static_cast<std::uint32_t>(_mm256_movemask_epi8(
            _mm256_or_si256(_mm256_cmpeq_epi8(high, lineBreak), _mm256_cmpeq_epi8(high, hash))));
        return lowBits | (std::uint64_t{highBits} << 32);
    }
    static void Copy64(char* to, const char* from) {
        const __m256i low = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(from));
        const __m256i high = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(from + 32));
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(to), low);
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(to + 32), high);
    }
};

}  // namespace

void ScanBlockAvx2(KernelState& state, const char* block, std::size_t size) {
    ScanBlockWith<Avx2>(state, block, size);
}

}  // namespace checksumscan
}  // namespace Tesu
