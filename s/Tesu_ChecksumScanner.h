// Internal to libTesu_Utilities (not installed): one pass over a checksummed file, a block at
// a time, giving everything the checksum operations decide on. The file is taken as its lines
// (split at "\n", the "\r" of a "\r\n" end dropped, a last line without a line break kept as it
// is); memory use is fixed, whatever the lengths of the lines.
#ifndef TESU_CHECKSUMSCANNER_H
#define TESU_CHECKSUMSCANNER_H

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>

namespace Tesu {
namespace checksumscan {

class Scanner {
  public:
    Scanner();
    ~Scanner();
    Scanner(const Scanner&) = delete;
    Scanner& operator=(const Scanner&) = delete;

    // The next bytes of the file, in order; they are only read, and not kept after the call.
    void Block(const char* data, std::size_t size);
    // After the last block: completes the last line and the results.
    void Finish();

    // The CRC-32 of the lines that hold no "#", joined.
    std::uint32_t Crc() const;
    // True when the file holds "# CRC:"; the byte offset of the first one's "#".
    bool Marked() const;
    std::uint64_t MarkerOffset() const;
    // What follows the first marker on its line, at most nine characters, without the line
    // break or the "\r" of a "\r\n" end.
    const std::string& MarkerField() const;
    // The eight characters of the lines, each followed by "\n", that come after the first
    // marker and one skipped character; fewer when the file ends first.
    const std::string& Stored() const;
    // How the first line ends: "\n", "\r\n", or "" when the file holds no "\n".
    const char* FirstLineBreak() const;

    // Which loop runs ("avx512", "avx2", "sse2" or "plain"): the best the processor has, or a
    // lesser one named by the environment variable TESU_CHECKSUM_KERNEL (for tests).
    static const char* KernelName();

    // What is kept between blocks (the .cpp file's, where the loop's callbacks reach it too).
    struct State;

  private:
    std::unique_ptr<State> state_;
};

}  // namespace checksumscan
}  // namespace Tesu

#endif
