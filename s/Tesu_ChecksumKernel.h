// Internal to libTesu_Utilities (not installed): the inner loop of the checksummed-file
// scanner, shared by the variants built for different instruction sets (SSE2, AVX2, AVX-512 in
// their own source files, each compiled with its own flags, and a plain one).
//
// Only what the variants share is here, and none of it has external linkage apart from the
// plain data of KernelState and the three functions the loop calls back: code compiled for
// AVX2 must never be merged by the linker with code that runs where AVX2 may be missing.
//
// The loop takes a block of the file 64 bytes at a time. A variant's Specials() gives a bit for
// each "\n" and "#" of 64 bytes; between them the bytes of lines that hold no "#" are moved
// together into the `out` buffer (64 bytes copied at a time, the pointer advanced by the number
// that count), a line found to hold "#" is taken back out, and the "\r" of a "\r\n" end is
// dropped. The CRC then runs over `out` in long stretches. A line that is still open when
// `out` fills goes to a side CRC continued from the main one, adopted if the line ends without
// "#", so memory does not depend on line length.
#ifndef TESU_CHECKSUMKERNEL_H
#define TESU_CHECKSUMKERNEL_H

#include <cstddef>
#include <cstdint>
#include <cstring>

namespace Tesu {
namespace checksumscan {

// Bytes taken at a time.
constexpr std::size_t kChunk = 64;
// The CRC is run over `out` once it holds this much.
constexpr std::size_t kFlushAt = 32 * 1024;
// Room for a chunk's bytes past kFlushAt, the 64 bytes a copy may write beyond what counts,
// and a margin.
constexpr std::size_t kOutCapacity = kFlushAt + 4 * kChunk;

// The state the loop works on, kept between blocks. Plain data, shared by every variant.
struct KernelState {
    char* out = nullptr;               // kOutCapacity bytes: data-line bytes waiting for the CRC
    std::size_t lineStart = 0;         // where the open line's bytes begin in `out`
    std::size_t dst = 0;               // end of the bytes in `out`
    bool inData = true;                // the open line holds no "#" so far
    std::uint32_t crc = 0;             // CRC of the data-line bytes before out[0]
    std::uint32_t side = 0;            // with sideActive: `crc` continued over the open line's
    bool sideActive = false;           // bytes that left `out` before it ended
    bool searching = true;             // the marker is still to be looked for at each "#"
    const char* blockBegin = nullptr;  // the block being scanned
    const char* blockEnd = nullptr;
    char lastBefore = '\0';  // the byte before the block ('\0' at the start of the file)
    void* owner = nullptr;   // the scanner this state belongs to
};

// Called back by the loop: runs the CRC over what `out` holds (the open line's bytes to the side
// CRC) and empties it.
void KernelFlush(KernelState& state);
// A "#" followed by "# CRC:"'s other five characters, at `at` in the block.
void KernelMarker(KernelState& state, const char* at);
// A "#" less than six bytes before the end of the block: the marker may go on in the next one.
void KernelMarkerAtBlockEnd(KernelState& state, const char* at);

// The variants, each defined in the file built for its instruction set. A block may have any
// size; its bytes are only read.
void ScanBlockPlain(KernelState& state, const char* block, std::size_t size);
void ScanBlockSse2(KernelState& state, const char* block, std::size_t size);
void ScanBlockAvx2(KernelState& state, const char* block, std::size_t size);
void ScanBlockAvx512(KernelState& state, const char* block, std::size_t size);

// The loop's body is used twice and must be inlined both times, so that its variables stay in
// registers.
#if defined(__GNUC__)
#define TESU_KERNEL_INLINE __attribute__((always_inline))
#else
#define TESU_KERNEL_INLINE
#endif

namespace {

constexpr char kMarkerText[] = "# CRC:";
constexpr std::size_t kMarkerLength = sizeof kMarkerText - 1;

inline unsigned LowestBit(std::uint64_t mask) {
#if defined(__GNUC__)
    return static_cast<unsigned>(__builtin_ctzll(mask));
#else
    unsigned bit = 0;
    while ((mask & 1) == 0) {
        mask >>= 1;
        ++bit;
    }
    return bit;
#endif
}

inline unsigned CountBits(std::uint64_t mask) {
#if defined(__GNUC__)
    return static_cast<unsigned>(__builtin_popcountll(mask));
#else
    unsigned count = 0;
    for (; mask != 0; mask &= mask - 1) {
        ++count;
    }
    return count;
#endif
}

// The bits up to and including the highest one of a mask that is not 0.
inline std::uint64_t UpToHighestBit(std::uint64_t mask) {
#if defined(__GNUC__)
    return ~std::uint64_t{0} >> __builtin_clzll(mask);
#else
    for (unsigned shift = 1; shift < 64; shift *= 2) {
        mask |= mask >> shift;
    }
    return mask;
#endif
}

// The loop over one block with the variant V, which gives
//   static std::uint64_t Specials(const char* p): bit i set when p[i] is "\n" or "#", i < 64;
//   static void Copy64(char* to, const char* from): 64 bytes, `to` before or apart from `from`;
//   kCompress: true when it also gives
//     static void Masks(const char* p, std::uint64_t& lineBreaks, std::uint64_t& hashes,
//                       std::uint64_t& carriageReturns): the bits of "\n", "#" and "\r";
//     static void StoreKept(char* to, const char* from, std::uint64_t keep): the bytes of the
//       64 at `from` whose bits are set in `keep`, in order, stored from `to` (64 bytes written).
// With kCompress, a chunk that holds no "#" and continues a data line is moved in one step.
template <class V>
inline void ScanBlockWith(KernelState& s, const char* block, std::size_t size) {
    char* const out = s.out;
    std::size_t dst = s.dst;
    std::size_t lineStart = s.lineStart;
    bool inData = s.inData;
    s.blockBegin = block;
    s.blockEnd = block + size;

    auto flushIfFull = [&]() TESU_KERNEL_INLINE {
        if (dst >= kFlushAt) {
            s.dst = dst;
            s.lineStart = lineStart;
            s.inData = inData;
            KernelFlush(s);
            dst = s.dst;
            lineStart = s.lineStart;
        }
    };

    // One chunk at `c`, of which `valid` bytes count; `real` is where its bytes stand in the
    // block. Copy64 reads 64 bytes from any point of the chunk, so the chunk must have 64 more
    // readable bytes behind it.
    auto chunk = [&](const char* c, std::size_t valid, const char* real) TESU_KERNEL_INLINE {
        const std::uint64_t validBits =
            valid == kChunk ? ~std::uint64_t{0} : (std::uint64_t{1} << valid) - 1;
        std::uint64_t mask;
        if constexpr (V::kCompress) {
            std::uint64_t lineBreaks;
            std::uint64_t hashes;
            std::uint64_t returns;
            V::Masks(c, lineBreaks, hashes, returns);
            lineBreaks &= validBits;
            hashes &= validBits;
            if (inData && hashes == 0) {
                if ((lineBreaks & 1) != 0) {
                    // A "\r" that ended the chunk before is part of this line end.
                    const char before = real > s.blockBegin ? real[-1] : s.lastBefore;
                    dst -= before == '\r' ? 1 : 0;
                }
                const std::uint64_t keep =
                    ~(lineBreaks | (returns & (lineBreaks >> 1))) & validBits;
                V::StoreKept(out + dst, c, keep);
                if (lineBreaks != 0) {
                    lineStart = dst + CountBits(keep & UpToHighestBit(lineBreaks));
                    if (s.sideActive) {
                        s.crc = s.side;
                        s.sideActive = false;
                    }
                }
                dst += CountBits(keep);
                flushIfFull();
                return;
            }
            mask = lineBreaks | hashes;
        } else {
            mask = V::Specials(c) & validBits;
        }
        if (inData) {
            V::Copy64(out + dst, c);
        }
        const char* pos = c;  // the first byte not yet counted into `out`
        while (mask != 0) {
            const unsigned k = LowestBit(mask);
            mask &= mask - 1;
            const char* at = c + k;
            if (*at == '\n') {
                if (inData) {
                    // The byte before the line break is read where it stands in the file, not
                    // from `out`, whose store may not have completed.
                    const char* here = real + k;
                    const char before = here > s.blockBegin ? here[-1] : s.lastBefore;
                    dst += static_cast<std::size_t>(at - pos);
                    dst -= before == '\r' ? 1 : 0;
                    if (s.sideActive) {
                        s.crc = s.side;
                        s.sideActive = false;
                    }
                    lineStart = dst;
                } else {
                    inData = true;
                }
                pos = at + 1;
                V::Copy64(out + dst, pos);
            } else {
                if (inData) {
                    inData = false;
                    dst = lineStart;
                    s.sideActive = false;
                }
                if (s.searching) {
                    const char* marker = real + k;
                    if (static_cast<std::size_t>(s.blockEnd - marker) >= kMarkerLength) {
                        if (std::memcmp(marker, kMarkerText, kMarkerLength) == 0) {
                            KernelMarker(s, marker);
                        }
                    } else {
                        KernelMarkerAtBlockEnd(s, marker);
                    }
                }
            }
        }
        if (inData) {
            dst += static_cast<std::size_t>(c + valid - pos);
        }
        flushIfFull();
    };

    const char* c = block;
    if (size >= 2 * kChunk) {
        const char* const last = block + size - 2 * kChunk;
        for (; c <= last; c += kChunk) {
            chunk(c, kChunk, c);
        }
    }
    // The last bytes (fewer than 128) from a copy with room behind it.
    const std::size_t rest = static_cast<std::size_t>(block + size - c);
    if (rest > 0) {
        alignas(64) char pad[4 * kChunk];
        std::memcpy(pad, c, rest);
        std::memset(pad + rest, 0, sizeof pad - rest);
        for (std::size_t at = 0; at < rest; at += kChunk) {
            chunk(pad + at, rest - at < kChunk ? rest - at : kChunk, c + at);
        }
    }
    s.dst = dst;
    s.lineStart = lineStart;
    s.inData = inData;
}

}  // namespace
}  // namespace checksumscan
}  // namespace Tesu

#endif
