// Port::StringBase<char>: an 8-bit text with a length, backed by std::string.
//
// Every index and range given by a caller is checked against the length before any byte is
// touched, so no operation reads or writes outside the text.
#include "Port_String.h"

#include <cstdio>
#include <cstring>
#include <utility>

#if defined(PORT_CRC32_ISAL)
#include <isa-l/crc.h>
#elif defined(PORT_CRC32_LIBDEFLATE)
#include <libdeflate.h>
#elif defined(PORT_CRC32_ZLIB)
#include <zlib.h>
#else
#error "Define PORT_CRC32_ISAL, PORT_CRC32_LIBDEFLATE or PORT_CRC32_ZLIB to choose the CRC-32"
#endif

namespace Port {

namespace {

// ASCII letters to lower case; every other byte unchanged (no locale is consulted).
inline unsigned char foldCase(unsigned char c) {
    return (c >= 'A' && c <= 'Z') ? static_cast<unsigned char>(c + ('a' - 'A')) : c;
}

inline std::size_t lengthOf(const char* text, std::size_t count) {
    if (text == nullptr) {
        return 0;
    }
    return count == NPOS ? std::strlen(text) : count;
}

// strcmp-like ordering of two byte ranges: the first differing (folded) byte decides, read as
// unsigned; when one range is a prefix of the other, the shorter one orders first.
int compareBytes(const char* a, std::size_t aLength, const char* b, std::size_t bLength,
                 CompareType type) {
    const std::size_t common = aLength < bLength ? aLength : bLength;
    if (type == COMPARE_NOCASE) {
        for (std::size_t i = 0; i < common; ++i) {
            const unsigned char ca = foldCase(static_cast<unsigned char>(a[i]));
            const unsigned char cb = foldCase(static_cast<unsigned char>(b[i]));
            if (ca != cb) {
                return ca < cb ? -1 : 1;
            }
        }
    } else if (common > 0) {
        const int r = std::memcmp(a, b, common);
        if (r != 0) {
            return r < 0 ? -1 : 1;
        }
    }
    if (aLength == bLength) {
        return 0;
    }
    return aLength < bLength ? -1 : 1;
}

// Index of the first occurrence of `what` in `text` at or after `start`, or NPOS.
std::size_t findBytes(const std::string& text, const char* what, std::size_t whatLength,
                      CompareType type, std::size_t start) {
    if (start > text.size()) {
        return NPOS;
    }
    if (type != COMPARE_NOCASE) {
        const std::size_t found = text.find(what, start, whatLength);
        return found == std::string::npos ? NPOS : found;
    }
    if (whatLength > text.size() - start) {
        return NPOS;
    }
    const std::size_t lastStart = text.size() - whatLength;
    for (std::size_t i = start; i <= lastStart; ++i) {
        std::size_t j = 0;
        while (j < whatLength && foldCase(static_cast<unsigned char>(text[i + j])) ==
                                     foldCase(static_cast<unsigned char>(what[j]))) {
            ++j;
        }
        if (j == whatLength) {
            return i;
        }
    }
    return NPOS;
}

// The part of a text of `length` bytes that `range` denotes, as a first index and a count;
// the count is 0 for the empty range.
inline std::pair<std::size_t, std::size_t> clipRange(const Port_Range& range, std::size_t length) {
    if (range.first >= length || range.first > range.last) {
        return {0, 0};
    }
    const std::size_t last = range.last < length ? range.last : length - 1;
    return {range.first, last - range.first + 1};
}

}  // namespace

// --- construction and content ---------------------------------------------------------------

StringBase<char>::StringBase(const char* text) {
    if (text != nullptr) {
        text_.assign(text);
    }
}

StringBase<char>::StringBase(const char* text, std::size_t count)
    : text_(text == nullptr ? std::string() : std::string(text, lengthOf(text, count))) {}

StringBase<char>::StringBase(const std::string& text) : text_(text) {}

StringBase<char>::StringBase(std::string&& text) noexcept : text_(std::move(text)) {}

StringBase<char>& StringBase<char>::operator=(const char* text) {
    return Assign(text);
}

StringBase<char>& StringBase<char>::Assign(const char* text, std::size_t count) {
    if (text == nullptr) {
        text_.clear();
    } else {
        // std::string::assign keeps the capacity and copes with `text` pointing into it.
        text_.assign(text, lengthOf(text, count));
    }
    return *this;
}

StringBase<char>& StringBase<char>::Assign(const StringBase& other, bool releaseSpare) {
    if (&other != this) {
        text_.assign(other.text_);
    }
    if (releaseSpare) {
        text_.shrink_to_fit();
    }
    return *this;
}

StringBase<char>& StringBase<char>::Append(const StringBase& other) {
    text_.append(other.text_);
    return *this;
}

StringBase<char>& StringBase<char>::Append(const char* text, std::size_t count) {
    if (text != nullptr) {
        text_.append(text, lengthOf(text, count));
    }
    return *this;
}

StringBase<char>& StringBase<char>::Append(std::size_t count, char c) {
    text_.append(count, c);
    return *this;
}

// --- comparison and search ------------------------------------------------------------------

int StringBase<char>::Compare(const char* text, CompareType type) const {
    return compareBytes(text_.data(), text_.size(), text == nullptr ? "" : text,
                        lengthOf(text, NPOS), type);
}

int StringBase<char>::Compare(const StringBase& other, CompareType type) const {
    return compareBytes(text_.data(), text_.size(), other.text_.data(), other.text_.size(), type);
}

std::size_t StringBase<char>::GetIndexOfString(const StringBase& what, CompareType type,
                                               std::size_t start) const {
    return findBytes(text_, what.text_.data(), what.text_.size(), type, start);
}

std::size_t StringBase<char>::GetIndexOfString(const char* what, CompareType type,
                                               std::size_t start) const {
    return findBytes(text_, what == nullptr ? "" : what, lengthOf(what, NPOS), type, start);
}

std::size_t StringBase<char>::GetIndexOfFirstChar(char c, char alt) const {
    std::size_t found;
    if (alt == '\0') {
        found = text_.find(c);
    } else {
        const char both[2] = {c, alt};
        found = text_.find_first_of(both, 0, 2);
    }
    return found == std::string::npos ? NPOS : found;
}

std::size_t StringBase<char>::GetIndexOfLastChar(char c, char alt) const {
    std::size_t found;
    if (alt == '\0') {
        found = text_.rfind(c);
    } else {
        const char both[2] = {c, alt};
        found = text_.find_last_of(both, std::string::npos, 2);
    }
    return found == std::string::npos ? NPOS : found;
}

// --- pieces and edits -----------------------------------------------------------------------

StringBase<char> StringBase<char>::Extract(const Port_Range& range) const {
    const auto piece = clipRange(range, text_.size());
    return StringBase(text_.data() + piece.first, piece.second);
}

bool StringBase<char>::Replace(const StringBase& from, const StringBase& to, CompareType type) {
    if (from.text_.empty()) {
        return false;
    }
    const std::size_t at = findBytes(text_, from.text_.data(), from.text_.size(), type, 0);
    if (at == NPOS) {
        return false;
    }
    // `from` or `to` may be this very text: take the length first, and let
    // std::string::replace copy a replacement that overlaps the text it edits.
    const std::size_t fromLength = from.text_.size();
    if (&to == this) {
        const std::string copy(to.text_);
        text_.replace(at, fromLength, copy);
    } else {
        text_.replace(at, fromLength, to.text_);
    }
    return true;
}

std::size_t StringBase<char>::ReplaceChars(char from, char to) {
    // memchr skips the stretches without `from`, which are most of a text.
    std::size_t count = 0;
    char* next = text_.data();
    char* const end = next + text_.size();
    while (next != end) {
        next = static_cast<char*>(std::memchr(next, from, static_cast<std::size_t>(end - next)));
        if (next == nullptr) {
            break;
        }
        *next++ = to;
        ++count;
    }
    return count;
}

StringBase<char>& StringBase<char>::Trim(const char* set, TrimType type) {
    if (set == nullptr || *set == '\0' || text_.empty()) {
        return *this;
    }
    const bool start = type == TRIM_START || type == TRIM_BOTH;
    const bool end = type == TRIM_END || type == TRIM_BOTH;
    if (end) {
        const std::size_t last = text_.find_last_not_of(set);
        if (last == std::string::npos) {
            text_.clear();
            return *this;
        }
        text_.erase(last + 1);
    }
    if (start) {
        const std::size_t first = text_.find_first_not_of(set);
        if (first == std::string::npos) {
            text_.clear();
        } else {
            text_.erase(0, first);
        }
    }
    return *this;
}

std::vector<StringBase<char>> StringBase<char>::Split(const char* separator, bool keepEmpty,
                                                      const char* openQuotes,
                                                      const char* closeQuotes) const {
    std::vector<StringBase> fields;
    auto addField = [&](std::size_t first, std::size_t count) {
        if (count > 0 || keepEmpty) {
            fields.emplace_back(text_.data() + first, count);
        }
    };

    const std::size_t sepLength = lengthOf(separator, NPOS);
    if (sepLength == 0) {
        addField(0, text_.size());
        return fields;
    }

    // Only pairs with both an opening and a closing character take part.
    const std::size_t openCount = lengthOf(openQuotes, NPOS);
    const std::size_t closeCount = lengthOf(closeQuotes, NPOS);
    const std::size_t pairs = openCount < closeCount ? openCount : closeCount;

    std::size_t fieldStart = 0;
    if (pairs == 0) {
        for (;;) {
            const std::size_t at = text_.find(separator, fieldStart, sepLength);
            if (at == std::string::npos) {
                break;
            }
            addField(fieldStart, at - fieldStart);
            fieldStart = at + sepLength;
        }
    } else {
        // Inside a quoted stretch only its closing character matters: separators and other
        // opening characters are plain text there. An unclosed quote runs to the end.
        char closing = '\0';
        bool quoted = false;
        std::size_t i = 0;
        while (i < text_.size()) {
            const char c = text_[i];
            if (quoted) {
                if (c == closing) {
                    quoted = false;
                }
                ++i;
            } else if (text_.compare(i, sepLength, separator, sepLength) == 0) {
                addField(fieldStart, i - fieldStart);
                i += sepLength;
                fieldStart = i;
            } else {
                const char* open = static_cast<const char*>(std::memchr(openQuotes, c, pairs));
                if (open != nullptr) {
                    closing = closeQuotes[open - openQuotes];
                    quoted = true;
                }
                ++i;
            }
        }
    }
    addField(fieldStart, text_.size() - fieldStart);
    return fields;
}

// --- numbers and checksums ------------------------------------------------------------------

bool StringBase<char>::GetINT32(const Port_Range& range, std::int32_t& value) const {
    const auto piece = clipRange(range, text_.size());
    const char* p = text_.data() + piece.first;
    const char* const end = p + piece.second;
    if (p == end) {
        return false;
    }
    bool negative = false;
    if (*p == '+' || *p == '-') {
        negative = *p == '-';
        ++p;
    }
    if (p == end) {
        return false;
    }
    // The magnitude may reach 2^31 for a negative value; stop as soon as it passes that.
    const std::uint64_t limit = negative ? 2147483648ULL : 2147483647ULL;
    std::uint64_t magnitude = 0;
    for (; p != end; ++p) {
        if (*p < '0' || *p > '9') {
            return false;
        }
        magnitude = magnitude * 10 + static_cast<std::uint64_t>(*p - '0');
        if (magnitude > limit) {
            return false;
        }
    }
    value = negative ? static_cast<std::int32_t>(-static_cast<std::int64_t>(magnitude))
                     : static_cast<std::int32_t>(magnitude);
    return true;
}

std::uint32_t StringBase<char>::CRC32() const {
    return CRC32(0, text_.data(), text_.size());
}

// All three libraries take and return the running value without its final inversion (0 to
// start), so a CRC continues from where the last piece left it.
std::uint32_t StringBase<char>::CRC32(std::uint32_t crc, const void* data, std::size_t length) {
    if (data == nullptr || length == 0) {
        return crc;
    }
#if defined(PORT_CRC32_ISAL)
    return crc32_gzip_refl(crc, static_cast<const unsigned char*>(data), length);
#elif defined(PORT_CRC32_LIBDEFLATE)
    return libdeflate_crc32(crc, data, length);
#else
    // zlib counts in unsigned int: feed it pieces of at most 1 GiB.
    constexpr std::size_t maxPiece = std::size_t{1} << 30;
    const auto* bytes = static_cast<const Bytef*>(data);
    uLong value = crc;
    while (length > 0) {
        const std::size_t piece = length < maxPiece ? length : maxPiece;
        value = ::crc32(value, bytes, static_cast<uInt>(piece));
        bytes += piece;
        length -= piece;
    }
    return static_cast<std::uint32_t>(value);
#endif
}

const char* StringBase<char>::CRC32Implementation() {
#if defined(PORT_CRC32_ISAL)
    return "isa-l";
#elif defined(PORT_CRC32_LIBDEFLATE)
    return "libdeflate";
#else
    return "zlib";
#endif
}

// --- formatting -----------------------------------------------------------------------------

StringBase<char>& StringBase<char>::Format(const char* format, ...) {
    std::va_list args;
    va_start(args, format);
    FormatV(format, args);
    va_end(args);
    return *this;
}

StringBase<char>& StringBase<char>::FormatV(const char* format, std::va_list args) {
    if (format == nullptr) {
        text_.clear();
        return *this;
    }
    // Most texts fit the stack buffer and cost one formatting pass. A longer one is formatted
    // again into a buffer of the exact size. Either way the result is built apart from text_,
    // so that arguments pointing into this text stay valid until formatting is done.
    char small[256];
    std::va_list first;
    va_copy(first, args);
    const int needed = std::vsnprintf(small, sizeof small, format, first);
    va_end(first);
    if (needed < 0) {
        text_.clear();  // an encoding error: there is no text to give
        return *this;
    }
    const auto length = static_cast<std::size_t>(needed);
    if (length < sizeof small) {
        text_.assign(small, length);
        return *this;
    }
    std::string large(length, '\0');
    std::va_list second;
    va_copy(second, args);
    std::vsnprintf(&large[0], length + 1, format, second);
    va_end(second);
    text_.swap(large);
    return *this;
}

StringBase<char> StringBase<char>::doFormat(const char* format, ...) {
    StringBase result;
    std::va_list args;
    va_start(args, format);
    result.FormatV(format, args);
    va_end(args);
    return result;
}

}  // namespace Port
