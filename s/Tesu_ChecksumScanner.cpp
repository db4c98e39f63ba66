// The checksummed-file scanner: the state kept between blocks, the marker and the text after
// it, the CRC runs, and the choice of the loop for the processor (Tesu_ChecksumKernel.h).
#include "Tesu_ChecksumScanner.h"

#include <cstdlib>
#include <cstring>

#include "Port_String.h"
#include "Tesu_ChecksumKernel.h"

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

namespace Tesu {
namespace checksumscan {

namespace {

// The plain loop: any processor.
struct Plain {
    static constexpr bool kCompress = false;
    static std::uint64_t Specials(const char* p) {
        std::uint64_t mask = 0;
        for (unsigned i = 0; i < kChunk; ++i) {
            if (p[i] == '\n' || p[i] == '#') {
                mask |= std::uint64_t{1} << i;
            }
        }
        return mask;
    }
    static void Copy64(char* to, const char* from) { std::memcpy(to, from, kChunk); }
};

#if defined(__SSE2__)
struct Sse2 {
    static constexpr bool kCompress = false;
    static std::uint64_t Specials(const char* p) {
        const __m128i lineBreak = _mm_set1_epi8('\n');
        const __m128i hash = _mm_set1_epi8('#');
        std::uint64_t mask = 0;
        for (unsigned i = 0; i < 4; ++i) {
            const __m128i bytes = _mm_loadu_si128(reinterpret_cast<const __m128i*>(p + 16 * i));
            const auto bits = static_cast<std::uint32_t>(_mm_movemask_epi8(
                _mm_or_si128(_mm_cmpeq_epi8(bytes, lineBreak), _mm_cmpeq_epi8(bytes, hash))));
            mask |= std::uint64_t{bits} << (16 * i);
        }
        return mask;
    }
    static void Copy64(char* to, const char* from) {
        for (unsigned i = 0; i < 4; ++i) {
            _mm_storeu_si128(reinterpret_cast<__m128i*>(to + 16 * i),
                             _mm_loadu_si128(reinterpret_cast<const __m128i*>(from + 16 * i)));
        }
    }
};
#endif

using Kernel = void (*)(KernelState&, const char*, std::size_t);

struct KernelChoice {
    const char* name;
    Kernel run;
};

// The loops built in, best first, with whether this processor can run them.
bool Runs(const char* name) {
#if defined(__GNUC__) && (defined(__x86_64__) || defined(__i386__))
    __builtin_cpu_init();
    if (std::strcmp(name, "avx512") == 0) {
        return __builtin_cpu_supports("avx512bw") != 0 &&
               __builtin_cpu_supports("avx512vbmi2") != 0 && __builtin_cpu_supports("popcnt") != 0;
    }
    if (std::strcmp(name, "avx2") == 0) {
        return __builtin_cpu_supports("avx2") != 0;
    }
#endif
    (void)name;
    return true;
}

KernelChoice ChooseKernel() {
    static const KernelChoice built[] = {
#if defined(TESU_CHECKSUM_AVX512)
        {"avx512", ScanBlockAvx512},
#endif
#if defined(TESU_CHECKSUM_AVX2)
        {"avx2", ScanBlockAvx2},
#endif
#if defined(__SSE2__)
        {"sse2", ScanBlockSse2},
#endif
        {"plain", ScanBlockPlain},
    };
    const char* wanted = std::getenv("TESU_CHECKSUM_KERNEL");
    if (wanted != nullptr) {
        for (const KernelChoice& choice : built) {
            if (std::strcmp(wanted, choice.name) == 0 && Runs(choice.name)) {
                return choice;
            }
        }
    }
    for (const KernelChoice& choice : built) {
        if (Runs(choice.name)) {
            return choice;
        }
    }
    return built[sizeof built / sizeof built[0] - 1];
}

const KernelChoice& TheKernel() {
    static const KernelChoice kernel = ChooseKernel();
    return kernel;
}

// The text after the first marker, from the file's bytes as they come: the lines each followed
// by "\n" (a "\r" before a "\n" dropped), of which the first character is skipped and the next
// eight are the stored text, and the marker's own line gives at most nine characters.
class Collector {
  public:
    bool Done() const { return taken_ >= kWanted; }
    // More bytes of the file; takes only what is still wanted.
    void Feed(const char* data, std::size_t size) {
        for (std::size_t i = 0; i < size && !Done(); ++i) {
            const char c = data[i];
            if (carriageReturn_) {
                carriageReturn_ = false;
                if (c == '\n') {
                    Take('\n');
                    continue;
                }
                Take('\r');
                if (Done()) {
                    break;
                }
            }
            if (c == '\r') {
                carriageReturn_ = true;
            } else {
                Take(c);
            }
        }
    }
    // At the end of the file, whose last byte is `last`: a "\r" held back belongs to the last
    // line, and a last line without a line break is followed by "\n" all the same.
    void End(char last) {
        if (carriageReturn_ && !Done()) {
            carriageReturn_ = false;
            Take('\r');
        }
        if (last != '\n' && !Done()) {
            Take('\n');
        }
    }
    std::string field;
    std::string stored;

  private:
    // The skipped character and the eight of the stored text.
    static constexpr unsigned kWanted = 9;

    void Take(char c) {
        if (onMarkerLine_) {
            if (c == '\n') {
                onMarkerLine_ = false;
            } else {
                field.push_back(c);
            }
        }
        if (taken_ > 0) {
            stored.push_back(c);
        }
        ++taken_;
    }

    unsigned taken_ = 0;
    bool carriageReturn_ = false;
    bool onMarkerLine_ = true;
};

}  // namespace

struct Scanner::State {
    State() : out(new char[kOutCapacity]) {
        kernel.out = out.get();
        kernel.owner = this;
    }

    std::unique_ptr<char[]> out;
    KernelState kernel;
    Kernel run = TheKernel().run;
    std::uint64_t blockOffset = 0;  // offset in the file of the block being scanned
    char lastByte = '\0';           // the last byte of the blocks so far ('\0' before any)
    const char* firstLineBreak = "";
    bool lineBreakSeen = false;
    bool marked = false;
    std::uint64_t markerOffset = 0;
    std::size_t partial = 0;  // marker bytes matched at the end of the last block
    std::uint64_t partialOffset = 0;
    Collector collector;
};

void KernelFlush(KernelState& k) {
    if (k.lineStart > 0) {
        k.crc = Port::StringBase<char>::CRC32(k.crc, k.out, k.lineStart);
    }
    std::size_t kept = 0;
    if (k.inData && k.dst > k.lineStart) {
        // The open line's bytes continue the side CRC, except a last "\r", which may turn out to
        // be part of the line end: it stays.
        std::size_t length = k.dst - k.lineStart;
        const bool carriageReturn = k.out[k.dst - 1] == '\r';
        if (carriageReturn) {
            --length;
        }
        if (length > 0) {
            k.side = Port::StringBase<char>::CRC32(k.sideActive ? k.side : k.crc,
                                                   k.out + k.lineStart, length);
            k.sideActive = true;
        }
        if (carriageReturn) {
            k.out[0] = '\r';
            kept = 1;
        }
    }
    k.lineStart = 0;
    k.dst = kept;
}

void KernelMarker(KernelState& k, const char* at) {
    Scanner::State& s = *static_cast<Scanner::State*>(k.owner);
    k.searching = false;
    s.marked = true;
    s.markerOffset = s.blockOffset + static_cast<std::uint64_t>(at - k.blockBegin);
    at += kMarkerLength;
    s.collector.Feed(at, static_cast<std::size_t>(k.blockEnd - at));
}

void KernelMarkerAtBlockEnd(KernelState& k, const char* at) {
    Scanner::State& s = *static_cast<Scanner::State*>(k.owner);
    const auto available = static_cast<std::size_t>(k.blockEnd - at);
    if (std::memcmp(at, kMarkerText, available) == 0) {
        k.searching = false;
        s.partial = available;
        s.partialOffset = s.blockOffset + static_cast<std::uint64_t>(at - k.blockBegin);
    }
}

void ScanBlockPlain(KernelState& state, const char* block, std::size_t size) {
    ScanBlockWith<Plain>(state, block, size);
}

#if defined(__SSE2__)
void ScanBlockSse2(KernelState& state, const char* block, std::size_t size) {
    ScanBlockWith<Sse2>(state, block, size);
}
#endif

Scanner::Scanner() : state_(new State) {}
Scanner::~Scanner() = default;

void Scanner::Block(const char* data, std::size_t size) {
    if (size == 0) {
        return;
    }
    State& s = *state_;
    if (s.partial > 0) {
        // The marker's first bytes ended the last block: do these bytes complete it?
        const std::size_t wanted = kMarkerLength - s.partial;
        const std::size_t compared = size < wanted ? size : wanted;
        if (std::memcmp(data, kMarkerText + s.partial, compared) != 0) {
            s.partial = 0;
            s.kernel.searching = true;
        } else if (compared < wanted) {
            s.partial += compared;
        } else {
            s.partial = 0;
            s.marked = true;
            s.markerOffset = s.partialOffset;
            s.collector.Feed(data + wanted, size - wanted);
        }
    } else if (s.marked && !s.collector.Done()) {
        s.collector.Feed(data, size);
    }
    if (!s.lineBreakSeen) {
        const void* found = std::memchr(data, '\n', size);
        if (found != nullptr) {
            const char* lineBreak = static_cast<const char*>(found);
            const char before = lineBreak > data ? lineBreak[-1] : s.lastByte;
            s.firstLineBreak = before == '\r' ? "\r\n" : "\n";
            s.lineBreakSeen = true;
        }
    }
    s.run(s.kernel, data, size);
    s.blockOffset += size;
    s.lastByte = data[size - 1];
    s.kernel.lastBefore = s.lastByte;
}

void Scanner::Finish() {
    State& s = *state_;
    KernelState& k = s.kernel;
    // A last line without a line break counts as it stands, a "\r" at its end included.
    if (k.inData) {
        if (k.sideActive) {
            k.crc = k.side;
            k.sideActive = false;
        }
        k.lineStart = k.dst;
    }
    if (k.lineStart > 0) {
        k.crc = Port::StringBase<char>::CRC32(k.crc, k.out, k.lineStart);
    }
    k.lineStart = 0;
    k.dst = 0;
    if (s.marked) {
        s.collector.End(s.lastByte);
    }
}

std::uint32_t Scanner::Crc() const {
    return state_->kernel.crc;
}

bool Scanner::Marked() const {
    return state_->marked;
}

std::uint64_t Scanner::MarkerOffset() const {
    return state_->markerOffset;
}

const std::string& Scanner::MarkerField() const {
    return state_->collector.field;
}

const std::string& Scanner::Stored() const {
    return state_->collector.stored;
}

const char* Scanner::FirstLineBreak() const {
    return state_->firstLineBreak;
}

const char* Scanner::KernelName() {
    return TheKernel().name;
}

}  // namespace checksumscan
}  // namespace Tesu
