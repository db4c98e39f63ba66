// Port::StringBase<char>: bounds, searching, editing, parsing, formatting and CRC-32.
#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <cstdint>
#include <string>
#include <vector>

#include "Port_String.h"

using Port::NPOS;
using Port::String;

namespace {

std::vector<std::string> texts(const std::vector<String>& fields) {
    std::vector<std::string> out;
    for (const String& f : fields) {
        out.push_back(f.str());
    }
    return out;
}

TEST(PortString, ExtractStaysInsideTheText) {
    const String s("abcdef");
    EXPECT_EQ(s.Extract({1, 3}).str(), "bcd");
    EXPECT_EQ(s.Extract({4, 100}).str(), "ef");
    EXPECT_EQ(s.Extract({0, NPOS}).str(), "abcdef");
    EXPECT_EQ(s.Extract({5, 5}).str(), "f");
    EXPECT_TRUE(s.Extract({6, 10}).IsEmpty());
    EXPECT_TRUE(s.Extract({NPOS, NPOS}).IsEmpty());
    EXPECT_TRUE(s.Extract({3, 2}).IsEmpty());
    EXPECT_TRUE(String().Extract({0, 0}).IsEmpty());
}

TEST(PortString, NulBytesSurviveEveryCopy) {
    const char raw[] = {'a', '\0', 'b', ',', '\0', ',', 'c'};
    String s;
    s.Assign(raw, 3).Append(raw + 3, 4);
    ASSERT_EQ(s.GetLength(), 7u);
    EXPECT_EQ(s.str(), std::string(raw, 7));
    EXPECT_EQ(s.Extract({1, 4}).str(), std::string(raw + 1, 4));
    EXPECT_EQ(texts(s.Split(",")),
              (std::vector<std::string>{std::string("a\0b", 3), std::string(1, '\0'), "c"}));
    EXPECT_EQ(s.GetIndexOfFirstChar('\0'), 1u);
    EXPECT_EQ(String("ab", NPOS).GetLength(), 2u);
    EXPECT_NE(String(raw, 7).Compare(String(raw, 6)), 0);
}

TEST(PortString, ReplaceChangesTheFirstOccurrenceOnly) {
    String s("a--b--c");
    EXPECT_TRUE(s.Replace("--", "+"));
    EXPECT_EQ(s.str(), "a+b--c");
    EXPECT_FALSE(s.Replace("", "x"));
    EXPECT_FALSE(s.Replace("zz", "x"));
    EXPECT_EQ(s.str(), "a+b--c");
    String mixed("xABcabc");
    EXPECT_TRUE(mixed.Replace("abc", "!", Port::COMPARE_NOCASE));
    EXPECT_EQ(mixed.str(), "x!abc");
    String self("ab");
    EXPECT_TRUE(self.Replace("b", self));
    EXPECT_EQ(self.str(), "aab");
    String chars("a/b/c");
    EXPECT_EQ(chars.ReplaceChars('/', '\\'), 2u);
    EXPECT_EQ(chars.str(), "a\\b\\c");
}

TEST(PortString, GetINT32AcceptsSignedDecimalsOnly) {
    struct Case {
        const char* text;
        bool ok;
        std::int32_t value;
    };
    const Case cases[] = {
        {"0", true, 0},
        {"+17", true, 17},
        {"-17", true, -17},
        {"007", true, 7},
        {"2147483647", true, INT32_MAX},
        {"-2147483648", true, INT32_MIN},
        {"2147483648", false, 0},
        {"-2147483649", false, 0},
        {"99999999999999999999", false, 0},
        {"", false, 0},
        {"-", false, 0},
        {"+", false, 0},
        {" 1", false, 0},
        {"1 ", false, 0},
        {"1a", false, 0},
        {"0x10", false, 0},
        {"--1", false, 0},
    };
    for (const Case& c : cases) {
        const String s(c.text);
        std::int32_t value = 12345;
        EXPECT_EQ(s.GetINT32({0, s.GetLength()}, value), c.ok) << c.text;
        EXPECT_EQ(value, c.ok ? c.value : 12345) << c.text;
    }
    // Ranges are clipped like Extract's.
    const String s("ab-42cd");
    std::int32_t value = 0;
    EXPECT_TRUE(s.GetINT32({2, 4}, value));
    EXPECT_EQ(value, -42);
    EXPECT_TRUE(String("x5").GetINT32({1, NPOS}, value));
    EXPECT_EQ(value, 5);
    EXPECT_FALSE(s.GetINT32({7, 9}, value));
    EXPECT_FALSE(s.GetINT32({4, 3}, value));
}

TEST(PortString, FormatHasNoLengthLimit) {
    const std::string big(100 * 1024, 'x');
    String s("old");
    s.Format("<%s|%d>", big.c_str(), 42);
    EXPECT_EQ(s.str(), "<" + big + "|42>");
    EXPECT_EQ(String::doFormat("%8x", 0xabcdeu).str(), "   abcde");
    EXPECT_EQ(String::doFormat("%8x", 0xcbf43926u).str(), "cbf43926");
    EXPECT_EQ(String::doFormat("%s", "").str(), "");
    for (std::size_t n = 250; n < 260; ++n) {  // around the size of any small first buffer
        EXPECT_EQ(String::doFormat("%s", std::string(n, 'y').c_str()).str(), std::string(n, 'y'));
    }
    // Arguments that point into the text being formatted.
    String self(big);
    self.Format("%s-%s", self.GetText(), self.GetText());
    EXPECT_EQ(self.str(), big + "-" + big);
    String small("ab");
    small.Format("[%s]", small.GetText());
    EXPECT_EQ(small.str(), "[ab]");
}

TEST(PortString, CompareExactAndIgnoringLetterCase) {
    const String s("Root");
    EXPECT_EQ(s.Compare("Root"), 0);
    EXPECT_NE(s.Compare("root"), 0);
    EXPECT_EQ(s.Compare("rOOT", Port::COMPARE_NOCASE), 0);
    EXPECT_NE(s.Compare("roots", Port::COMPARE_NOCASE), 0);
    EXPECT_LT(String("abc").Compare("abd"), 0);
    EXPECT_GT(String("abd").Compare("abc"), 0);
    EXPECT_LT(String("ab").Compare("abc"), 0);
    EXPECT_GT(String("abc").Compare(nullptr), 0);
    EXPECT_EQ(String().Compare(nullptr), 0);
    EXPECT_GT(String("\xe9").Compare("e"), 0);  // bytes are unsigned
    // Folding touches ASCII letters only: '[' and '{' stay distinct, as do 0xC9 and 0xE9.
    EXPECT_NE(String("[").Compare("{", Port::COMPARE_NOCASE), 0);
    EXPECT_NE(String("\xc9").Compare("\xe9", Port::COMPARE_NOCASE), 0);
    EXPECT_LT(String("_").Compare("A", Port::COMPARE_NOCASE), 0);  // folds to lower case
    // The types may be given as numbers: 1 ignores case, 0 and any other value compare exactly.
    EXPECT_EQ(s.Compare("rOOT", 1), 0);
    EXPECT_NE(s.Compare("rOOT", 0), 0);
    EXPECT_NE(s.Compare("rOOT", 7), 0);
    EXPECT_EQ(String("a/b").GetIndexOfString("/B", 1), 1u);
    EXPECT_EQ(String("a/b").GetIndexOfString("/B", 0), NPOS);
}

TEST(PortString, SearchesHonourStartAndAlternative) {
    const String s("a.b/c.d\\e");
    EXPECT_EQ(s.GetIndexOfString("."), 1u);
    EXPECT_EQ(s.GetIndexOfString(".", Port::COMPARE_EXACT, 2), 5u);
    EXPECT_EQ(s.GetIndexOfString(".", Port::COMPARE_EXACT, 6), NPOS);
    EXPECT_EQ(s.GetIndexOfString("", Port::COMPARE_EXACT, 9), 9u);
    EXPECT_EQ(s.GetIndexOfString("", Port::COMPARE_EXACT, 10), NPOS);
    EXPECT_EQ(s.GetIndexOfString("C.D", Port::COMPARE_NOCASE), 4u);
    EXPECT_EQ(s.GetIndexOfString("C.D"), NPOS);
    EXPECT_EQ(s.GetIndexOfString("E", Port::COMPARE_NOCASE, 8), 8u);
    EXPECT_EQ(s.GetIndexOfString("d\\e!", Port::COMPARE_NOCASE), NPOS);
    EXPECT_EQ(String("ab").GetIndexOfString("AbC", Port::COMPARE_NOCASE), NPOS);
    EXPECT_EQ(String("abc").GetIndexOfString("C", Port::COMPARE_NOCASE, 3), NPOS);
    EXPECT_EQ(s.GetIndexOfFirstChar('/'), 3u);
    EXPECT_EQ(s.GetIndexOfFirstChar('\\', '/'), 3u);
    EXPECT_EQ(s.GetIndexOfLastChar('/'), 3u);
    EXPECT_EQ(s.GetIndexOfLastChar('/', '\\'), 7u);
    EXPECT_EQ(s.GetIndexOfFirstChar('#'), NPOS);
    EXPECT_EQ(s.GetIndexOfLastChar('#', '%'), NPOS);
}

TEST(PortString, SplitKeepsOrDropsEmptyFieldsAndHonoursQuotes) {
    const String s(",a,,b,");
    EXPECT_EQ(texts(s.Split(",")), (std::vector<std::string>{"", "a", "", "b", ""}));
    EXPECT_EQ(texts(s.Split(",", false)), (std::vector<std::string>{"a", "b"}));
    EXPECT_EQ(texts(String().Split("\n")), (std::vector<std::string>{""}));
    EXPECT_TRUE(String().Split("\n", false).empty());
    EXPECT_EQ(texts(String("a::b:c").Split("::")), (std::vector<std::string>{"a", "b:c"}));
    EXPECT_EQ(texts(String("a,b").Split("")), (std::vector<std::string>{"a,b"}));
    EXPECT_EQ(texts(String("l1\r\nl2\n").Split("\n")),
              (std::vector<std::string>{"l1\r", "l2", ""}));
    const String q("x=\"a b\" (c d) [e f");
    EXPECT_EQ(texts(q.Split(" ", true, "\"(", "\")")),
              (std::vector<std::string>{"x=\"a b\"", "(c d)", "[e", "f"}));
    EXPECT_EQ(texts(String("(a \"b) c").Split(" ", true, "(\"", ")\"")),
              (std::vector<std::string>{"(a \"b)", "c"}));
    // An opening character without a closing partner does not quote.
    EXPECT_EQ(texts(String("[a b]").Split(" ", true, "([", ")")),
              (std::vector<std::string>{"[a", "b]"}));
    EXPECT_EQ(texts(String("a 'b c").Split(" ", true, "'", "'")),
              (std::vector<std::string>{"a", "'b c"}));
}

TEST(PortString, TrimWorksOnTheRequestedEnds) {
    EXPECT_EQ(String(" \tab c\t ").Trim(" \t", Port::TRIM_START).str(), "ab c\t ");
    EXPECT_EQ(String(" \tab c\t ").Trim(" \t", Port::TRIM_END).str(), " \tab c");
    EXPECT_EQ(String(" \tab c\t ").Trim(" \t", Port::TRIM_BOTH).str(), "ab c");
    for (Port::TrimType type : {Port::TRIM_START, Port::TRIM_END, Port::TRIM_BOTH}) {
        EXPECT_TRUE(String(" \t \t").Trim(" \t", type).IsEmpty()) << type;
    }
    EXPECT_EQ(String(" a ").Trim("").str(), " a ");
    EXPECT_EQ(String(" a ").Trim(nullptr).str(), " a ");
}

// The standard CRC-32 whichever library computes it: known values of texts and of prefixes of
// a long pattern (lengths around the libraries' 16-, 64- and 256-byte steps), each also computed
// in pieces cut at several places.
TEST(PortString, Crc32IsTheStandardOneAndContinues) {
    std::string pattern;
    for (int i = 0; i < (1 << 20); ++i) {
        pattern.push_back(static_cast<char>(i * 7 + (i >> 8)));
    }
    const struct {
        std::string data;
        std::uint32_t crc;
    } cases[] = {
        {"", 0u},
        {"a", 0xe8b7be43u},
        {"123456789", 0xcbf43926u},
        {pattern.substr(0, 15), 0xc356fbb9u},
        {pattern.substr(0, 16), 0x54126ba2u},
        {pattern.substr(0, 17), 0xba8b4e1eu},
        {pattern.substr(0, 63), 0xfd395ff8u},
        {pattern.substr(0, 64), 0xd324a7d4u},
        {pattern.substr(0, 65), 0xc80b1f57u},
        {pattern.substr(0, 255), 0x89b9aecbu},
        {pattern.substr(0, 256), 0x1a5c07a3u},
        {pattern.substr(0, 1000), 0x668f073du},
        {pattern.substr(0, 4099), 0xc3fdbc3au},
        {pattern.substr(0, 100000), 0xe72bddc1u},
        {pattern, 0xa2dcf263u},
    };
    for (const auto& c : cases) {
        const std::size_t n = c.data.size();
        EXPECT_EQ(String(c.data).CRC32(), c.crc) << n;
        EXPECT_EQ(String::CRC32(0, c.data.data(), n), c.crc) << n;
        for (const std::size_t cut : {std::size_t{1}, n / 3, n / 2, n - 1}) {
            if (cut == 0 || cut >= n) {
                continue;
            }
            const std::uint32_t head = String::CRC32(0, c.data.data(), cut);
            EXPECT_EQ(String::CRC32(head, c.data.data() + cut, n - cut), c.crc)
                << n << " at " << cut;
        }
        // Many uneven pieces, growing from one byte.
        std::uint32_t crc = 0;
        for (std::size_t at = 0, piece = 1; at < n; at += piece, piece = piece * 3 + 1) {
            crc = String::CRC32(crc, c.data.data() + at, std::min(piece, n - at));
        }
        EXPECT_EQ(crc, c.crc) << n;
        EXPECT_EQ(String::CRC32(c.crc, nullptr, 0), c.crc);
        EXPECT_EQ(String::CRC32(c.crc, c.data.data(), 0), c.crc);
    }
    const std::string name = String::CRC32Implementation();
    EXPECT_TRUE(name == "isa-l" || name == "libdeflate" || name == "zlib") << name;
}

}  // namespace
