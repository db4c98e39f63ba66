// The string operations that take ranges, indexes and pieces of text, on texts and numbers
// chosen by the input (indexes anywhere in the range of std::size_t, the ends included), each
// compared with the same operation written plainly over std::string. AddressSanitizer reports
// any read past a text.
#include <fuzzer/FuzzedDataProvider.h>

#include <cstddef>
#include <cstdint>
#include <limits>
#include <string>
#include <vector>

#include "FuzzSupport.h"
#include "Port_String.h"

namespace {

using Text = Port::StringBase<char>;
constexpr std::size_t kNpos = Port::NPOS;

// An index: mostly near the text, sometimes at the far end of the type.
std::size_t Index(FuzzedDataProvider& in, std::size_t length) {
    switch (in.ConsumeIntegralInRange<int>(0, 3)) {
        case 0:
            return kNpos - in.ConsumeIntegralInRange<std::size_t>(0, 2);
        case 1:
            return in.ConsumeIntegral<std::size_t>();
        default:
            return in.ConsumeIntegralInRange<std::size_t>(0, length + 2);
    }
}

char Fold(char c) {
    return (c >= 'A' && c <= 'Z') ? static_cast<char>(c - 'A' + 'a') : c;
}

std::string Folded(std::string s) {
    for (char& c : s) {
        c = Fold(c);
    }
    return s;
}

std::size_t Find(const std::string& s, const std::string& what, bool nocase, std::size_t start) {
    const std::size_t at = nocase ? Folded(s).find(Folded(what), start) : s.find(what, start);
    return at == std::string::npos ? kNpos : at;
}

int Sign(int v) {
    return v < 0 ? -1 : (v > 0 ? 1 : 0);
}

// The 32-bit value of an optional sign and decimal digits, nothing else; false otherwise.
bool ParseInt32(const std::string& s, std::int32_t& value) {
    std::size_t i = 0;
    const bool negative = !s.empty() && s[0] == '-';
    if (!s.empty() && (s[0] == '-' || s[0] == '+')) {
        i = 1;
    }
    if (i == s.size()) {
        return false;
    }
    long long magnitude = 0;
    for (; i < s.size(); ++i) {
        if (s[i] < '0' || s[i] > '9') {
            return false;
        }
        magnitude = magnitude * 10 + (s[i] - '0');
        if (magnitude > 2147483648LL) {
            return false;
        }
    }
    const long long v = negative ? -magnitude : magnitude;
    if (v > std::numeric_limits<std::int32_t>::max()) {
        return false;
    }
    value = static_cast<std::int32_t>(v);
    return true;
}

std::string Piece(const std::string& s, std::size_t first, std::size_t last) {
    if (first >= s.size() || first > last) {
        return std::string();
    }
    const std::size_t end = last < s.size() ? last : s.size() - 1;
    return s.substr(first, end - first + 1);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    FuzzedDataProvider in(data, size);
    const std::string other = in.ConsumeRandomLengthString(64);
    const std::string set = in.ConsumeRandomLengthString(4);
    const char c = in.ConsumeIntegral<char>();
    const char alt = in.ConsumeIntegral<char>();
    const bool nocase = in.ConsumeBool();
    const Port::CompareType type = nocase ? Port::COMPARE_NOCASE : Port::COMPARE_EXACT;
    const std::size_t first = Index(in, 64);
    const std::size_t last = Index(in, 64);
    const std::size_t start = Index(in, 64);
    const std::string s = in.ConsumeRemainingBytesAsString();
    const Text text(s);

    // Extract: never more than asked, never past the end, exactly the piece.
    const Text piece = text.Extract(Port_Range{first, last});
    FUZZ_CHECK(piece.str() == Piece(s, first, last));
    FUZZ_CHECK(piece.IsEmpty() || (first <= last && piece.GetLength() - 1 <= last - first));

    // GetINT32 over the same range; the value is untouched on failure.
    std::int32_t value = 12345;
    std::int32_t expected = 12345;
    const bool parsed = text.GetINT32(Port_Range{first, last}, value);
    FUZZ_CHECK(parsed == ParseInt32(Piece(s, first, last), expected));
    FUZZ_CHECK(value == expected);
    // And over the whole text, as its callers pass it (the last index one past the end).
    value = 12345;
    expected = 12345;
    FUZZ_CHECK(text.GetINT32(Port_Range{0, s.size()}, value) == ParseInt32(s, expected));
    FUZZ_CHECK(value == expected);

    // Searches.
    FUZZ_CHECK(text.GetIndexOfString(Text(other), type, start) == Find(s, other, nocase, start));
    FUZZ_CHECK(text.GetIndexOfString(other.c_str(), type, start) ==
               Find(s, std::string(other.c_str()), nocase, start));
    const std::string both = alt == '\0' ? std::string(1, c) : std::string{c, alt};
    const std::size_t firstChar = s.find_first_of(both);
    const std::size_t lastChar = s.find_last_of(both);
    FUZZ_CHECK(text.GetIndexOfFirstChar(c, alt) ==
               (firstChar == std::string::npos ? kNpos : firstChar));
    FUZZ_CHECK(text.GetIndexOfLastChar(c, alt) ==
               (lastChar == std::string::npos ? kNpos : lastChar));

    // Compare: equality, and the sign of an ordering by unsigned bytes, shorter first.
    const std::string a = nocase ? Folded(s) : s;
    const std::string b = nocase ? Folded(other) : other;
    const int order = Sign(text.Compare(Text(other), type));
    FUZZ_CHECK(order == Sign(a.compare(b)));
    FUZZ_CHECK(Sign(Text(other).Compare(text, type)) == -order);

    // Replace: the first occurrence only.
    Text replaced(s);
    const std::size_t at = Find(s, set, nocase, 0);
    const bool didReplace = replaced.Replace(Text(set), Text(other), type);
    FUZZ_CHECK(didReplace == (!set.empty() && at != kNpos));
    FUZZ_CHECK(replaced.str() ==
               (didReplace ? s.substr(0, at) + other + s.substr(at + set.size()) : s));

    // ReplaceChars.
    Text swapped(s);
    const std::size_t count = swapped.ReplaceChars(c, alt);
    std::string swappedExpected = s;
    std::size_t countExpected = 0;
    for (char& ch : swappedExpected) {
        if (ch == c) {
            ch = alt;
            ++countExpected;
        }
    }
    FUZZ_CHECK(count == countExpected && swapped.str() == swappedExpected);

    // Trim, with a set that is a C text (up to its first NUL).
    const std::string cset(set.c_str());
    for (Port::TrimType trim : {Port::TRIM_START, Port::TRIM_END, Port::TRIM_BOTH}) {
        Text trimmed(s);
        trimmed.Trim(set.c_str(), trim);
        std::string t = s;
        if (!cset.empty()) {
            if (trim != Port::TRIM_START) {
                const std::size_t keep = t.find_last_not_of(cset);
                t = keep == std::string::npos ? std::string() : t.substr(0, keep + 1);
            }
            if (trim != Port::TRIM_END) {
                const std::size_t skip = t.find_first_not_of(cset);
                t = skip == std::string::npos ? std::string() : t.substr(skip);
            }
        }
        FUZZ_CHECK(trimmed.str() == t);
    }

    // Split then join gives the text back, with or without quoting; without empty fields,
    // the same fields less the empty ones.
    const std::string separator(other.c_str());
    const char* quotes[][2] = {{"", ""}, {"\"'", "\"'"}, {"([", ")]"}};
    for (const auto& quote : quotes) {
        const std::vector<Text> fields = text.Split(separator.c_str(), true, quote[0], quote[1]);
        FUZZ_CHECK(!fields.empty());
        std::string joined = fields[0].str();
        for (std::size_t i = 1; i < fields.size(); ++i) {
            FUZZ_CHECK(!separator.empty());
            joined += separator + fields[i].str();
        }
        FUZZ_CHECK(joined == s);
        const std::vector<Text> nonEmpty = text.Split(separator.c_str(), false, quote[0], quote[1]);
        std::size_t j = 0;
        for (const Text& field : fields) {
            if (!field.IsEmpty()) {
                FUZZ_CHECK(j < nonEmpty.size() && nonEmpty[j] == field);
                ++j;
            }
        }
        FUZZ_CHECK(j == nonEmpty.size());
    }
    if (!separator.empty()) {
        std::size_t separators = 0;
        for (std::size_t p = s.find(separator); p != std::string::npos;
             p = s.find(separator, p + separator.size())) {
            ++separators;
        }
        FUZZ_CHECK(text.Split(separator.c_str()).size() == separators + 1);
    }

    // CRC-32 continued over two pieces equals the CRC-32 of the whole.
    const std::size_t cut = s.empty() ? 0 : first % (s.size() + 1);
    const std::uint32_t head = Text::CRC32(0, s.data(), cut);
    FUZZ_CHECK(Text::CRC32(head, s.data() + cut, s.size() - cut) == text.CRC32());
    return 0;
}
