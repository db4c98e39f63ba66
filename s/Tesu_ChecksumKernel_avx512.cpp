// The checksummed-file scanner's loop for processors with AVX-512BW and VBMI2 (byte compress);
// built with those instruction sets and called only where the processor has them.
#include <immintrin.h>

#include "Tesu_ChecksumKernel.h"

namespace Tesu {
namespace checksumscan {
namespace {

struct Avx512 {
    static constexpr bool kCompress = true;
    static std::uint64_t Specials(const char* p) {
        const __m512i bytes = _mm512_loadu_si512(p);
        return _mm512_cmpeq_epi8_mask(bytes, _mm512_set1_epi8('\n')) |
               _mm512_cmpeq_epi8_mask(bytes, _mm512_set1_epi8('#'));
    }
    static void Masks(const char* p, std::uint64_t& lineBreaks, std::uint64_t& hashes,
                      std::uint64_t& carriageReturns) {
        const __m512i bytes = _mm512_loadu_si512(p);
        lineBreaks = _mm512_cmpeq_epi8_mask(bytes, _mm512_set1_epi8('\n'));
        hashes = _mm512_cmpeq_epi8_mask(bytes, _mm512_set1_epi8('#'));
        carriageReturns = _mm512_cmpeq_epi8_mask(bytes, _mm512_set1_epi8('\r'));
    }
    static void Copy64(char* to, const char* from) {
        _mm512_storeu_si512(to, _mm512_loadu_si512(from));
    }
    static void StoreKept(char* to, const char* from, std::uint64_t keep) {
        _mm512_storeu_si512(to, _mm512_maskz_compress_epi8(keep, _mm512_loadu_si512(from)));
    }
};

}  // namespace

void ScanBlockAvx512(KernelState& state, const char* block, std::size_t size) {
    ScanBlockWith<Avx512>(state, block, size);
}

}  // namespace checksumscan
}  // namespace Tesu
