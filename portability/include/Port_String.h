// Port::StringBase<char>: the 8-bit text of every interface of the layer and the library.
//
// A StringBase holds bytes with an explicit length; it may hold NUL bytes. It is a value type:
// copies are independent, and every text a function returns belongs to the caller.
// Indexes are std::size_t. Port::NPOS (all bits set) is the "not found" result of the search
// operations, and as a count it means "up to the terminating zero" of a C text.
// No operation reads or writes outside the text, whatever index or range it is given.
#ifndef PORT_STRING_H
#define PORT_STRING_H

#include <cstdarg>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "Port_Export.h"

namespace Port {

constexpr std::size_t NPOS = static_cast<std::size_t>(-1);

// How two texts are compared or searched. The types are plain integers, so that a caller may
// pass the number (0, 1) as well as the name.
using CompareType = int;
constexpr CompareType COMPARE_EXACT = 0;   // byte for byte; also every value other than 1
constexpr CompareType COMPARE_NOCASE = 1;  // ASCII letters compared without regard to case;
                                           // other bytes exactly

// Which ends of a text Trim works on; any other value trims nothing.
using TrimType = int;
constexpr TrimType TRIM_START = 0;
constexpr TrimType TRIM_END = 1;
constexpr TrimType TRIM_BOTH = 2;

}  // namespace Port

// An inclusive pair of character indexes: `first` and `last` are both part of the range.
// A `last` past the end of a text stops at the end; a `first` at or past the end, or past
// `last`, denotes the empty range.
struct Port_Range {
    std::size_t first;
    std::size_t last;
};

namespace Port {

template <typename CharT>
class StringBase;

template <>
class PORT_API StringBase<char> {
  public:
    StringBase() = default;
    // Copies the C text up to its terminating zero; a null pointer gives the empty text.
    StringBase(const char* text);  // NOLINT(google-explicit-constructor): texts convert freely
    // Copies `count` bytes (NUL bytes included); NPOS means up to the terminating zero.
    StringBase(const char* text, std::size_t count);
    StringBase(const std::string& text);      // NOLINT(google-explicit-constructor)
    StringBase(std::string&& text) noexcept;  // NOLINT(google-explicit-constructor)
    StringBase(const StringBase&) = default;
    StringBase(StringBase&&) noexcept = default;
    StringBase& operator=(const StringBase&) = default;
    StringBase& operator=(StringBase&&) noexcept = default;
    StringBase& operator=(const char* text);
    ~StringBase() = default;

    // --- content -------------------------------------------------------------------------
    // Replaces the content by `count` bytes of `text` (NPOS: up to the terminating zero;
    // a null pointer: the empty text). Returns *this.
    StringBase& Assign(const char* text, std::size_t count = NPOS);
    // Replaces the content by a copy of `other`. With `releaseSpare` true, spare capacity is
    // given back after the copy; the text is the same either way.
    StringBase& Assign(const StringBase& other, bool releaseSpare = false);
    StringBase& Append(const StringBase& other);
    // Appends `count` bytes of `text` (NPOS: up to the terminating zero; null: nothing).
    StringBase& Append(const char* text, std::size_t count = NPOS);
    // Appends `count` copies of the character `c`.
    StringBase& Append(std::size_t count, char c);
    StringBase& operator+=(const StringBase& other) { return Append(other); }
    StringBase& operator+=(const char* text) { return Append(text); }
    StringBase& operator+=(char c) { return Append(1, c); }
    // Makes the text empty.
    void Empty() { text_.clear(); }
    void Reserve(std::size_t capacity) { text_.reserve(capacity); }

    // --- access --------------------------------------------------------------------------
    bool IsEmpty() const { return text_.empty(); }
    std::size_t GetLength() const { return text_.size(); }
    // The bytes, always followed by a terminating zero (the text itself may hold NUL bytes).
    const char* GetText() const { return text_.c_str(); }
    // The character at `index`, or NUL when `index` is past the end.
    char GetChar(std::size_t index) const { return index < text_.size() ? text_[index] : '\0'; }
    // The last character, or NUL for the empty text.
    char GetLastChar() const { return text_.empty() ? '\0' : text_.back(); }
    const std::string& str() const { return text_; }

    // --- comparison and search -----------------------------------------------------------
    // 0 when equal under `type`; otherwise negative or positive as for strcmp on the
    // (case-folded) bytes, the shorter text ordering first. A null `text` is the empty text.
    int Compare(const char* text, CompareType type = COMPARE_EXACT) const;
    int Compare(const StringBase& other, CompareType type = COMPARE_EXACT) const;
    // Index of the first occurrence of `what` at or after `start`, or NPOS. The empty text is
    // found at `start` when `start` <= length.
    std::size_t GetIndexOfString(const StringBase& what, CompareType type = COMPARE_EXACT,
                                 std::size_t start = 0) const;
    std::size_t GetIndexOfString(const char* what, CompareType type = COMPARE_EXACT,
                                 std::size_t start = 0) const;
    // Index of the first character equal to `c`, or to `alt` when `alt` is not NUL; NPOS when
    // there is none.
    std::size_t GetIndexOfFirstChar(char c, char alt = '\0') const;
    // Index of the last character equal to `c`, or to `alt` when `alt` is not NUL; NPOS when
    // there is none.
    std::size_t GetIndexOfLastChar(char c, char alt = '\0') const;

    // --- pieces and edits ----------------------------------------------------------------
    // The characters of `range` (see Port_Range); never more than the text holds.
    StringBase Extract(const Port_Range& range) const;
    // Replaces the first occurrence of `from` by `to`. Returns true when one was replaced.
    // An empty `from` replaces nothing. Callers that want every occurrence loop.
    bool Replace(const StringBase& from, const StringBase& to, CompareType type = COMPARE_EXACT);
    // Replaces every character `from` by `to`; returns how many were replaced.
    std::size_t ReplaceChars(char from, char to);
    // Removes the characters of `set` (a C text) from the start, the end or both ends.
    StringBase& Trim(const char* set, TrimType type = TRIM_BOTH);
    // Splits the text at every occurrence of `separator` (a C text, compared exactly) and
    // returns the fields in order, changing no character. With `keepEmpty` true, empty fields
    // are kept (so n separators give n + 1 fields, and the empty text gives one empty field);
    // with false they are left out. `openQuotes` and `closeQuotes` are characters that
    // bracket a quoted stretch in which separators do not split (the i-th opening character
    // pairs with the i-th closing one); empty or null texts mean no quoting. The quote
    // characters stay in the fields. An empty or null separator gives the whole text as the
    // single field.
    std::vector<StringBase> Split(const char* separator, bool keepEmpty = true,
                                  const char* openQuotes = "", const char* closeQuotes = "") const;

    // --- numbers and checksums -----------------------------------------------------------
    // Parses the characters of `range` as an optional sign followed by decimal digits, all of
    // the range and nothing else. On success stores the value and returns true; on an empty
    // range, any other character or a value outside the 32-bit signed range returns false and
    // leaves `value` unchanged.
    bool GetINT32(const Port_Range& range, std::int32_t& value) const;
    // The standard CRC-32 of the bytes (reflected polynomial 0xEDB88320, initial value and
    // final XOR 0xFFFFFFFF, as zlib and gzip compute it): "123456789" gives 0xcbf43926.
    std::uint32_t CRC32() const;
    // Continues a CRC-32 over more bytes: start from 0 and pass each result back in, and the
    // final value equals the CRC-32 of all the bytes in one piece.
    static std::uint32_t CRC32(std::uint32_t crc, const void* data, std::size_t length);
    // Name of the CRC-32 implementation compiled in ("isa-l", "libdeflate" or "zlib").
    static const char* CRC32Implementation();

    // --- formatting ----------------------------------------------------------------------
    // Replaces the content by the printf-style formatting of `format` and the arguments, of
    // any length. Returns *this. Outside texts must never be passed as `format`.
    StringBase& Format(const char* format, ...) PORT_PRINTF(2, 3);
    // As Format, with a va_list.
    StringBase& FormatV(const char* format, std::va_list args) PORT_PRINTF(2, 0);
    // Returns a new text formatted from `format` and the arguments.
    static StringBase doFormat(const char* format, ...) PORT_PRINTF(1, 2);

    friend bool operator==(const StringBase& a, const StringBase& b) { return a.text_ == b.text_; }
    friend bool operator!=(const StringBase& a, const StringBase& b) { return a.text_ != b.text_; }
    friend bool operator<(const StringBase& a, const StringBase& b) { return a.text_ < b.text_; }
    friend StringBase operator+(StringBase a, const StringBase& b) { return a.Append(b); }

  private:
    std::string text_;
};

using String = StringBase<char>;

}  // namespace Port

#endif
