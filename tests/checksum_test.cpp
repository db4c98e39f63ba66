// Checksummed files: the checksum text of a body of text, and the check of real files against
// their own "# CRC:" line.
#include <gtest/gtest.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <random>
#include <string>
#include <vector>

#include "Port_File.h"
#include "Port_String.h"
#include "TestPlatform.h"
#include "TestSupport.h"
#include "Tesu_Utilities.h"

namespace {

using Tesu::Utilities;

std::string Sum(const std::string& text) {
    Port::StringBase<char> checksum("stale text");
    EXPECT_EQ(0u, Utilities::CalculateChecksum(Port::StringBase<char>(text), checksum));
    return checksum.str();
}

struct Outcome {
    unsigned int result;
    bool verdict;
    std::string messages;
};

// Validates `path` twice, once with the verdict starting true and once false, so that a
// verdict left unwritten shows up as a difference between the two runs.
Outcome Validate(const std::string& path) {
    Outcome outcome{};
    for (const bool initial : {true, false}) {
        tesutest::MessageCapture capture;
        bool verdict = initial;
        const unsigned int result =
            Utilities::ValidateFileChecksum(Port::StringBase<char>(path), verdict);
        if (initial) {
            outcome = Outcome{result, verdict, capture.text()};
            // The silent scan reads the file the same way and says nothing.
            Tesu::ChecksumScan scan;
            EXPECT_EQ(result, Utilities::ScanChecksummedFile(Port::StringBase<char>(path), scan))
                << path;
            EXPECT_EQ(result == 0 && verdict, scan.valid && result == 0) << path;
            EXPECT_EQ(result != 0, !scan.reason.IsEmpty()) << path;
            EXPECT_EQ(outcome.messages, capture.text()) << path;
        } else {
            EXPECT_EQ(outcome.result, result) << path;
            EXPECT_EQ(outcome.verdict, verdict) << path;
            EXPECT_EQ(outcome.messages, capture.text()) << path;
        }
    }
    return outcome;
}

void ExpectValid(const tesutest::TempDir& dir, const std::string& content,
                 const std::string& what) {
    const Outcome outcome = Validate(dir.write("file.txt", content));
    EXPECT_EQ(0u, outcome.result) << what;
    EXPECT_TRUE(outcome.verdict) << what;
    EXPECT_EQ("", outcome.messages) << what;
}

void ExpectInvalid(const tesutest::TempDir& dir, const std::string& content,
                   const std::string& what) {
    const Outcome outcome = Validate(dir.write("file.txt", content));
    EXPECT_EQ(0u, outcome.result) << what;
    EXPECT_FALSE(outcome.verdict) << what;
    EXPECT_EQ("", outcome.messages) << what;
}

// The body used by most cases, and its checksum line as a writer stamps it.
const std::string kBody = "module top;\n  wire a;\n\n  assign a = 1'b0;\nendmodule\n";
std::string StampLine() {
    return "# CRC: " + Sum(kBody) + "\n";
}

TEST(CalculateChecksum, GivesBlankPaddedLowerCaseHexOfTheCrc) {
    EXPECT_EQ("cbf43926", Sum("123456789"));
    EXPECT_EQ("       0", Sum(""));
    // A CRC with five significant digits is padded with three blanks, never zeros.
    EXPECT_EQ("   72fb8", Sum("line 2060"));
    EXPECT_EQ("15e87871", Sum(std::string("a\0b", 3)));
}

TEST(CalculateChecksum, OnlyLinesWithoutHashCountAndLineBreaksDoNot) {
    const std::string alphabeta = "281dec23";
    EXPECT_EQ(alphabeta, Sum("alphabeta"));
    EXPECT_EQ(alphabeta, Sum("alpha\nbeta"));
    EXPECT_EQ(alphabeta, Sum("\nalpha\n\n\nbeta\n\n"));
    EXPECT_EQ(alphabeta, Sum("# head\nalpha\nbe#ta\nbeta\n#"));
    EXPECT_EQ(alphabeta, Sum("alpha\n# CRC: 00000000\nbeta"));
    // Only "\n" separates lines; a carriage return is data.
    EXPECT_EQ("e61c25ab", Sum("alpha\rbeta"));
}

TEST(ValidateFileChecksum, StampedFileStaysValidUnderHarmlessEdits) {
    tesutest::TempDir dir;
    const std::string stamp = StampLine();
    ExpectValid(dir, stamp + kBody, "checksum line first");
    ExpectValid(dir, kBody + stamp, "checksum line last");
    ExpectValid(dir, "module top;\n  wire a;\n" + stamp + "\n  assign a = 1'b0;\nendmodule\n",
                "checksum line moved between data lines");
    ExpectValid(dir, stamp + "module top;  wire a;\n\n  assign a = 1'b0;endmodule\n",
                "data lines joined");
    ExpectValid(dir, stamp + "module \ntop;\n  wire a;\n\n  assign a\n = 1'b0;\nendmodule\n",
                "data lines split");
    ExpectValid(dir,
                "# generated\n" + stamp + "module top;\n# a note\n  wire a;\n\n" +
                    "  assign a = 1'b0;\n  # indented note\nendmodule\n",
                "comments added");
    ExpectValid(dir, "\n\n" + stamp + "\n" + kBody + "\n\n", "blank lines added");
    ExpectValid(dir, kBody + stamp.substr(0, stamp.size() - 1), "no final line break");
    ExpectValid(dir, "# Written by hand # CRC: " + Sum(kBody) + " and more\n" + kBody,
                "marker inside a comment, text after the stored value ignored");
    // The stored text is compared without regard to letter case.
    ExpectValid(dir, "# CRC: 281DEC23\nalpha\nbeta\n", "upper-case stored value");
}

TEST(ValidateFileChecksum, EditsThatChangeTheSumOrTheStoredTextAreCaught) {
    tesutest::TempDir dir;
    const std::string stamp = StampLine();
    ExpectInvalid(dir, stamp + "module top;\n  wire b;\n\n  assign a = 1'b0;\nendmodule\n",
                  "data character changed");
    ExpectInvalid(dir, stamp + "module top;\n  wire a; #\n\n  assign a = 1'b0;\nendmodule\n",
                  "hash inserted into a data line removes it from the sum");
    ExpectInvalid(dir, stamp + kBody + "extra\n", "data line added");
    // Zero padding where the checksum text pads with blanks.
    ASSERT_EQ("   72fb8", Sum("line 2060"));
    ExpectValid(dir, "# CRC:    72fb8\nline 2060\n", "blank padding");
    ExpectInvalid(dir, "# CRC: 00072fb8\nline 2060\n", "zero padding");
    // Without the separator the first digit is skipped and the line break is read.
    ExpectInvalid(dir, "# CRC:" + Sum(kBody) + "\n" + kBody, "no separator character");
    // The first marker counts, even inside an earlier comment.
    ExpectInvalid(dir, "# notes: # CRC: is written below\n" + stamp + kBody,
                  "earlier comment holding the marker");
    // The marker is matched exactly: another letter case is no marker at all, so a file whose
    // only such line is wrong is still accepted unchecked.
    ExpectValid(dir, "# crc: ffffffff\n" + kBody, "lower-case marker");
    ExpectValid(dir, "# no checksum here\n" + kBody, "no marker");
}

TEST(ValidateFileChecksum, StoredTextIsReadAcrossLineBreaks) {
    tesutest::TempDir dir;
    const std::string sum = Sum(kBody);
    // The character after the colon is the line break itself; the value is on the next line
    // (a comment, so it does not count).
    ExpectValid(dir, kBody + "# CRC:\n" + sum + "#\n", "value on the line after the marker");
    ExpectInvalid(dir, kBody + "# CRC: " + sum.substr(0, 4) + "\n" + sum.substr(4) + "#\n",
                  "value broken over two lines");
    ExpectInvalid(dir, kBody + "# CRC:\n\n" + sum + "#\n", "value two lines further");
    // A checksum line at the very end that runs short never matches.
    ExpectInvalid(dir, kBody + "# CRC: " + sum.substr(0, 7), "seven characters at the end");
    ExpectInvalid(dir, kBody + "# CRC:", "marker ends the file");
}

TEST(ValidateFileChecksum, LineEndsAndBytesThatAreNotPlainText) {
    tesutest::TempDir dir;
    // CR-LF ends: the reader drops the "\r", so the file matches its LF text's sum.
    ExpectValid(dir, "# CRC: 281dec23\r\nalpha\r\nbeta\r\n", "CR-LF line ends");
    // A lone carriage return stays in its line.
    ExpectValid(dir, "# CRC: e61c25ab\nalpha\rbeta\n", "carriage return inside a line");
    ExpectInvalid(dir, "# CRC: 281dec23\nalpha\rbeta\n", "carriage return counted");
    // NUL bytes are data like any other byte.
    const std::string withNul("a\0b\n", 4);
    ExpectValid(dir, "# CRC: 15e87871\n" + withNul, "NUL byte in a data line");
    ExpectInvalid(dir, "# CRC: 15e87871\nab\n", "NUL byte left out");

    // A data line of several megabytes.
    std::string longLine;
    for (int i = 0; longLine.size() < 5u * 1024 * 1024; ++i) {
        longLine += "word" + std::to_string(i) + ' ';
    }
    const std::string stamp = "# CRC: " + Sum(longLine) + "\n";
    ExpectValid(dir, stamp + longLine + "\n", "long data line");
    std::string changed = longLine;
    changed[changed.size() / 2] = '!';
    ExpectInvalid(dir, stamp + changed + "\n", "long data line changed in the middle");
}

// The reader works through a file in blocks of up to 64 KiB of line text or 4096 lines. The
// checksum line, in its plain form and in the form whose value stands on the next line, is
// put at every place around the end of a first block, by bytes and by lines.
TEST(ValidateFileChecksum, ChecksumLineAtTheEdgesOfTheReadersBlocks) {
    tesutest::TempDir dir;
    const std::string after = "tail\n\nend\n";
    auto check = [&](const std::string& before, const std::string& what) {
        const std::string sum = Sum(before + after);
        ExpectValid(dir, before + "# CRC: " + sum + "\n" + after, what + ", plain");
        ExpectValid(dir, before + "# CRC:\n" + sum + "#\n" + after, what + ", value below");
        ExpectInvalid(dir, before + "# CRC: " + sum + "\n#" + after,
                      what + ", next line a comment");
        ExpectInvalid(dir, before + "# CRC:\n" + sum + "#\nt" + after,
                      what + ", next data changed");
    };
    std::string lines;
    for (int i = 0; i < 1000; ++i) {
        lines += std::string(60, static_cast<char>('a' + i % 26)) + "\n";
    }
    // 60,000 characters of lines, a line of `pad` characters, then the checksum line.
    for (std::size_t pad = 5500; pad <= 5540; ++pad) {
        check(lines + std::string(pad, 'p') + "\n", "after " + std::to_string(60000 + pad));
    }
    // Around the end of the layer's first read block (256 KiB), with plain and CR-LF line
    // ends: the marker, the stored value and a "\r\n" pair each fall across the edge.
    std::string bigLines;
    std::string bigCrLfLines;
    for (int i = 0; i < 4290; ++i) {
        const std::string text(60, static_cast<char>('a' + i % 26));
        bigLines += text + "\n";
        bigCrLfLines += text + "\r\n";
    }
    for (std::size_t pad = 430; pad <= 470; ++pad) {
        check(bigLines + std::string(pad, 'p') + "\n", "LF, pad " + std::to_string(pad));
    }
    std::string lfOfCrLf = bigCrLfLines;
    for (std::size_t at = lfOfCrLf.find('\r'); at != std::string::npos;
         at = lfOfCrLf.find('\r', at)) {
        lfOfCrLf.erase(at, 1);
    }
    // A prefix of 0 to 61 characters puts every byte of a 62-byte line on the edge once.
    for (std::size_t pad = 0; pad < 62; ++pad) {
        const std::string prefix(pad, 'q');
        ExpectValid(
            dir,
            prefix + bigCrLfLines + "# CRC: " + Sum(prefix + lfOfCrLf + after) + "\r\n" + after,
            "CR-LF lines after a prefix of " + std::to_string(pad));
    }
    for (int count = 4088; count <= 4098; ++count) {
        std::string shortLines;
        for (int i = 0; i < count; ++i) {
            shortLines += i % 9 == 0 ? "# c\n" : "l\n";
        }
        check(shortLines, "after " + std::to_string(count) + " lines");
    }
}

// Lines longer than the reader's blocks, among short ones, hold data, comments and the value.
TEST(ValidateFileChecksum, LongLinesAmongShortOnes) {
    tesutest::TempDir dir;
    const std::string longData(200 * 1024, 'd');
    const std::string longComment = "#" + std::string(100 * 1024, 'c');
    const std::string body = "short\n" + longData + "\n" + longComment + "\nshort again\n" +
                             std::string(70 * 1024, 'e') + "\n";
    const std::string sum = Sum(body);
    ExpectValid(dir, body + "# CRC: " + sum + "\n", "checksum line after long lines");
    ExpectValid(dir, "# CRC: " + sum + "\n" + body, "checksum line before long lines");
    ExpectValid(dir, "# CRC:\n" + sum + longComment + "\n" + body,
                "value at the start of a long comment line");
    ExpectValid(dir, "x" + longComment + " # CRC: " + sum + "\n" + body,
                "marker at the end of a long comment line");
    ExpectInvalid(dir, "# CRC: " + sum + "\n" + body + longData + "\n", "long data line added");
    // A CR-LF data line whose "\r" falls on every byte around 32 KiB, where the scanner's
    // buffer of data-line bytes fills and goes to the CRC while the line is still open.
    for (std::size_t length = 32 * 1024 - 70; length <= 32 * 1024 + 70; ++length) {
        const std::string line(length, 'x');
        ExpectValid(dir, line + "\r\ntail\r\n# CRC: " + Sum(line + "\ntail\n") + "\r\n",
                    "CR-LF line of " + std::to_string(length));
    }
}

TEST(ValidateFileChecksum, FilesWithNothingToSum) {
    tesutest::TempDir dir;
    ExpectValid(dir, "", "empty file");
    ExpectValid(dir, "\n\n", "blank lines only");
    // Only the checksum line: the stored value is the checksum text of nothing.
    ExpectValid(dir, "# CRC:        0\n", "checksum line alone");
    ExpectValid(dir, "# CRC:        0", "checksum line alone, no line break");
    ExpectInvalid(dir, "# CRC: 00000000\n", "checksum line alone, zero padded");
    ExpectInvalid(dir, "# CRC:        0\nx\n", "checksum of nothing over data");
}

TEST(ValidateFileChecksum, NamesThatDoNotOpenAreReportedAsPassed) {
    tesutest::TempDir dir;
    const std::string missing = dir.path() + "//sub/../missing%s%d.txt";
    Outcome outcome = Validate(missing);
    EXPECT_EQ(1u, outcome.result);
    EXPECT_FALSE(outcome.verdict);
    EXPECT_EQ("ERROR:tesutil - Could not open " + missing + "\n", outcome.messages);

    const std::string directory = dir.mkdir("a directory");
    outcome = Validate(directory);
    EXPECT_EQ(1u, outcome.result);
    EXPECT_FALSE(outcome.verdict);
    EXPECT_EQ("ERROR:tesutil - Could not open " + directory + "\n", outcome.messages);

    outcome = Validate("");
    EXPECT_EQ(1u, outcome.result);
    EXPECT_EQ("ERROR:tesutil - Could not open \n", outcome.messages);
}

// The scan tells a writer where the checksum line is and how the file's lines end; its CRC
// and verdict are those of CalculateChecksum and ValidateFileChecksum.
TEST(ScanChecksummedFile, TellsWhereTheChecksumLineStandsAndHowLinesEnd) {
    struct Case {
        std::string content;
        bool marked;
        std::uint64_t offset;
        std::string field;
        std::string stored;
        std::string lineBreak;
    };
    const std::string sum = Sum(kBody);
    const std::string longLine(300 * 1024, 'x');
    const Case cases[] = {
        {kBody, false, 0, "", "", "\n"},
        {"", false, 0, "", "", ""},
        {"no break", false, 0, "", "", ""},
        {"# CRC: " + sum + "\n" + kBody, true, 0, " " + sum, sum, "\n"},
        {"a\r\nb # CRC: 1234abcd tail\r\n", true, 5, " 1234abcd", "1234abcd", "\r\n"},
        // The rest of a short checksum line, without its CR-LF; the value runs on below.
        {"x\n# CRC:ab\r\ncd\n", true, 2, "ab", "b\ncd\n", "\n"},
        {"# CRC:", true, 0, "", "", ""},
        // Only the first marker counts, also after a line longer than the reader's blocks.
        {longLine + "\n# CRC: 1\n# CRC: 2\n", true, longLine.size() + 1, " 1", "1\n# CRC:", "\n"},
        {"#" + longLine + "# CRC:\r", true, longLine.size() + 1, "\r", "\n", ""},
    };
    tesutest::TempDir dir;
    for (const Case& c : cases) {
        const std::string what = c.content.substr(0, 40);
        const std::string path = dir.write("scanned.txt", c.content);
        Tesu::ChecksumScan scan;
        scan.reason = "stale";
        ASSERT_EQ(0u, Utilities::ScanChecksummedFile(Port::StringBase<char>(path), scan)) << what;
        EXPECT_EQ(c.marked, scan.marked) << what;
        EXPECT_EQ(c.offset, scan.markerOffset) << what;
        EXPECT_EQ(c.field, scan.markerField.str()) << what;
        EXPECT_EQ(c.stored, scan.stored.str()) << what;
        EXPECT_EQ(c.lineBreak, scan.firstLineBreak.str()) << what;
        EXPECT_EQ("", scan.reason.str()) << what;
        std::string data;    // the lines, each ended by "\n"
        std::string joined;  // the lines without "#", joined
        for (std::size_t at = 0; at < c.content.size();) {
            std::size_t end = c.content.find('\n', at);
            end = end == std::string::npos ? c.content.size() : end;
            std::string line = c.content.substr(at, end - at);
            if (end < c.content.size() && !line.empty() && line.back() == '\r') {
                line.pop_back();
            }
            data += line + "\n";
            joined += line.find('#') == std::string::npos ? line : "";
            at = end + 1;
        }
        EXPECT_EQ(Sum(data), scan.checksum.str()) << what;
        EXPECT_EQ(Port::StringBase<char>(joined).CRC32(), scan.crc) << what;
        bool verdict = false;
        Utilities::ValidateFileChecksum(Port::StringBase<char>(path), verdict);
        EXPECT_EQ(verdict, scan.valid) << what;

        // The same content through an open stream, which the scan leaves open.
        Port::Stream* stream =
            Port::File::open(Port::StringBase<char>(path), Port::File::READ, true);
        ASSERT_NE(nullptr, stream);
        Tesu::ChecksumScan streamed;
        EXPECT_EQ(0u, Utilities::ScanChecksummedStream(*stream, streamed)) << what;
        EXPECT_EQ(scan.crc, streamed.crc) << what;
        EXPECT_EQ(scan.markerOffset, streamed.markerOffset) << what;
        EXPECT_EQ(scan.stored, streamed.stored) << what;
        EXPECT_TRUE(Port::File::close(stream));
    }
}

// What a scan must find in `bytes`, worked out from the file's lines as the layer's line reader
// splits them, one line at a time.
Tesu::ChecksumScan ModelScan(const std::string& bytes) {
    Tesu::ChecksumScan model;
    std::string content;  // the lines, each followed by "\n"
    std::string joined;   // the lines without "#"
    for (std::size_t at = 0; at < bytes.size();) {
        std::size_t end = bytes.find('\n', at);
        const bool broken = end != std::string::npos;
        end = broken ? end : bytes.size();
        std::string line = bytes.substr(at, end - at);
        const bool crlf = broken && !line.empty() && line.back() == '\r';
        if (crlf) {
            line.pop_back();
        }
        if (broken && model.firstLineBreak.IsEmpty()) {
            model.firstLineBreak = crlf ? "\r\n" : "\n";
        }
        content += line + "\n";
        if (line.find('#') == std::string::npos) {
            joined += line;
        }
        at = end + 1;
    }
    model.crc = Port::StringBase<char>(joined).CRC32();
    model.checksum.Format("%8x", static_cast<unsigned int>(model.crc));
    const std::size_t marker = content.find("# CRC:");
    model.marked = marker != std::string::npos;
    if (model.marked) {
        model.markerOffset = bytes.find("# CRC:");
        const std::size_t field = marker + 6;
        model.markerField =
            content.substr(field, std::min<std::size_t>(9, content.find('\n', field) - field));
        model.stored = marker + 7 <= content.size() ? content.substr(marker + 7, 8) : "";
        model.valid = model.stored == model.checksum;
    }
    return model;
}

// Random files, small ones and ones whose interesting bytes straddle the end of the reader's
// first block (256 KiB), built from line breaks of both kinds, lone "\r", "#", markers whole
// and cut, stamps and lines longer than the scanner's buffers; every field of the scan must be
// the model's.
TEST(ScanChecksummedFile, AgreesWithTheLineModelOnRandomFiles) {
    const std::string pieces[] = {"a",          "data",   "\r",      "\n",      "\r\n", "#",
                                  " ",          "# CRC:", "# CRC: ", "# CR",    "C:",   "\n\n",
                                  "0123abcd\n", "\r\r\n", "ab#cd",   "\n# CRC:"};
    std::mt19937 random(20261207);
    tesutest::TempDir dir;
    for (int round = 0; round < 160; ++round) {
        std::string bytes;
        const int kind = round % 4;
        // Lines of any length with either line break, up to a few bytes before the block's
        // end or to some small size.
        const std::size_t edge = kind >= 2 ? 256 * 1024 - random() % 80 : random() % 2000;
        while (bytes.size() < edge) {
            bytes += std::string(std::min<std::size_t>(random() % 100, edge - bytes.size()), 'l');
            bytes += random() % 2 == 0 ? "\n" : "\r\n";
        }
        const int count = 1 + static_cast<int>(random() % 40);
        for (int i = 0; i < count; ++i) {
            if (random() % 16 == 0) {
                // A run longer than the scanner's buffer, with or without a "#" in it.
                std::string run(20 * 1024 + random() % (80 * 1024), 'r');
                if (random() % 2 == 0) {
                    run[random() % run.size()] = '#';
                }
                bytes += run;
            } else {
                bytes += pieces[random() % (sizeof pieces / sizeof pieces[0])];
            }
        }
        if (kind == 1 || kind == 3) {
            // Stamped with the file's own checksum at a random place.
            const Tesu::ChecksumScan plain = ModelScan(bytes);
            if (!plain.marked) {
                const std::size_t at = random() % (bytes.size() + 1);
                bytes.insert(at, "\n# CRC: " + plain.checksum.str() + "\n");
            }
        }
        const Tesu::ChecksumScan model = ModelScan(bytes);
        const std::string path = dir.write("random.txt", bytes);
        Tesu::ChecksumScan scan;
        ASSERT_EQ(0u, Utilities::ScanChecksummedFile(Port::StringBase<char>(path), scan));
        const std::string what = "round " + std::to_string(round);
        EXPECT_EQ(model.crc, scan.crc) << what;
        EXPECT_EQ(model.checksum, scan.checksum) << what;
        EXPECT_EQ(model.marked, scan.marked) << what;
        EXPECT_EQ(model.markerOffset, scan.markerOffset) << what;
        EXPECT_EQ(model.markerField, scan.markerField) << what;
        EXPECT_EQ(model.stored, scan.stored) << what;
        EXPECT_EQ(model.valid, scan.valid) << what;
        EXPECT_EQ(model.firstLineBreak, scan.firstLineBreak) << what;
        bool verdict = !model.valid;
        EXPECT_EQ(0u, Utilities::ValidateFileChecksum(Port::StringBase<char>(path), verdict));
        EXPECT_EQ(model.valid, verdict) << what;
    }
}

TEST(ScanChecksummedFile, GivesTheSystemsReasonForAFileThatDoesNotOpen) {
    tesutest::TempDir dir;
    tesutest::MessageCapture capture;
    Tesu::ChecksumScan scan;
    scan.marked = true;
    EXPECT_EQ(1u,
              Utilities::ScanChecksummedFile(Port::StringBase<char>(dir.join("missing")), scan));
    EXPECT_EQ(std::strerror(ENOENT), scan.reason.str());
    EXPECT_FALSE(scan.marked);
    EXPECT_EQ(1u, Utilities::ScanChecksummedFile(Port::StringBase<char>(dir.mkdir("d")), scan));
    EXPECT_EQ(std::strerror(EISDIR), scan.reason.str());
    EXPECT_EQ("", capture.text());
}

TEST(ValidateFileChecksum, UnreadableFileDoesNotOpen) {
    if (const char* reason = tesutest::WhyPermissionsDoNotLockOut()) {
        GTEST_SKIP() << reason;
    }
    tesutest::TempDir dir;
    const std::string path = dir.write("locked.txt", StampLine() + kBody);
    std::filesystem::permissions(path, std::filesystem::perms::none);
    const Outcome outcome = Validate(path);
    EXPECT_EQ(1u, outcome.result);
    EXPECT_FALSE(outcome.verdict);
    EXPECT_EQ("ERROR:tesutil - Could not open " + path + "\n", outcome.messages);
    Tesu::ChecksumScan scan;
    EXPECT_EQ(1u, Utilities::ScanChecksummedFile(Port::StringBase<char>(path), scan));
    EXPECT_EQ(std::strerror(EACCES), scan.reason.str());
}

}  // namespace
