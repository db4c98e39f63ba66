// Port::File, Port::Stream and UT_DIR on real files in a temporary directory.
#include <gtest/gtest.h>
#ifndef _WIN32
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>
#endif

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <random>
#include <stdexcept>
#include <string>
#include <vector>

#include "Port_File.h"
#include "Port_FileName.h"
#include "TestPlatform.h"
#include "TestSupport.h"

namespace fs = std::filesystem;
using Port::File;
using Port::Stream;

namespace {

// Every line of `path`, read the way the library's readers do: geteof before each readline.
// Each count returned must be the length of the line stored.
std::vector<std::string> readLines(const std::string& path) {
    std::vector<std::string> lines;
    Stream* stream = File::open(path.c_str(), File::READ, true);
    EXPECT_NE(stream, nullptr) << path;
    if (stream == nullptr) {
        return lines;
    }
    Port::StringBase<char> line("left over");
    while (!stream->geteof()) {
        const std::int64_t count = stream->readline(line);
        EXPECT_EQ(count, static_cast<std::int64_t>(line.GetLength()));
        lines.push_back(line.str());
    }
    // Past the end nothing more comes, and the line is emptied.
    EXPECT_EQ(stream->readline(line), -1);
    EXPECT_TRUE(line.IsEmpty());
    EXPECT_TRUE(File::close(stream));
    return lines;
}

// The lines a reader must see in `content`: split at "\n", the "\r" of "\r\n" dropped, no
// extra line after a final "\n".
std::vector<std::string> expectedLines(const std::string& content) {
    std::vector<std::string> lines;
    std::size_t start = 0;
    while (start < content.size()) {
        std::size_t end = content.find('\n', start);
        if (end == std::string::npos) {
            lines.push_back(content.substr(start));
            break;
        }
        std::size_t length = end - start;
        if (length > 0 && content[end - 1] == '\r') {
            --length;
        }
        lines.push_back(content.substr(start, length));
        start = end + 1;
    }
    return lines;
}

using Lines = std::vector<std::string>;

}  // namespace

TEST(PortStream, LineEnds) {
    tesutest::TempDir tmp;
    EXPECT_EQ(readLines(tmp.write("crlf", "a\r\nb\r\n")), (Lines{"a", "b"}));
    EXPECT_EQ(readLines(tmp.write("mixed", "a\r\nb\nc\r\n")), (Lines{"a", "b", "c"}));
    EXPECT_EQ(readLines(tmp.write("no-break", "x\ny")), (Lines{"x", "y"}));
    EXPECT_EQ(readLines(tmp.write("crlf-no-break", "x\r\ny")), (Lines{"x", "y"}));
    EXPECT_EQ(readLines(tmp.write("empty-lines", "a\n\n\nb\n")), (Lines{"a", "", "", "b"}));
    EXPECT_EQ(readLines(tmp.write("one-break", "\n")), (Lines{""}));
    EXPECT_EQ(readLines(tmp.write("one-crlf", "\r\n")), (Lines{""}));
    // A "\r" not followed by "\n" is part of the line, also at the very end.
    EXPECT_EQ(readLines(tmp.write("lone-cr", "a\rb\n")), (Lines{"a\rb"}));
    EXPECT_EQ(readLines(tmp.write("cr-at-end", "a\r")), (Lines{"a\r"}));
    EXPECT_EQ(readLines(tmp.write("double-cr", "a\r\r\n")), (Lines{"a\r"}));
    EXPECT_EQ(readLines(tmp.write("only-cr", "\r")), (Lines{"\r"}));
    const std::string withNul("a\0b\n\0\r\n\0", 8);
    EXPECT_EQ(readLines(tmp.write("with-nul", withNul)),
              (Lines{std::string("a\0b", 3), std::string("\0", 1), std::string("\0", 1)}));
}

TEST(PortStream, EmptyFileAndEndOfFile) {
    tesutest::TempDir tmp;
    Stream* empty = File::open(tmp.write("empty", "").c_str(), File::READ, false);
    ASSERT_NE(empty, nullptr);
    EXPECT_TRUE(empty->geteof());
    Port::StringBase<char> line("kept?");
    EXPECT_EQ(empty->readline(line), -1);
    EXPECT_TRUE(line.IsEmpty());
    EXPECT_TRUE(File::close(empty));

    // geteof before any read looks ahead without losing a byte.
    Stream* one = File::open(tmp.write("one", "z").c_str(), File::READ, false);
    ASSERT_NE(one, nullptr);
    EXPECT_FALSE(one->geteof());
    EXPECT_FALSE(one->geteof());
    EXPECT_EQ(one->readline(&line), 1);
    EXPECT_EQ(line.str(), "z");
    EXPECT_TRUE(one->geteof());
    EXPECT_TRUE(File::close(one));

    // readline alone (no geteof) also ends with -1.
    Stream* two = File::open(tmp.write("two", "p\nq\n").c_str(), File::READ, true);
    ASSERT_NE(two, nullptr);
    EXPECT_EQ(two->readline(line), 1);
    EXPECT_EQ(two->readline(line), 1);
    EXPECT_EQ(line.str(), "q");
    EXPECT_EQ(two->readline(line), -1);
    EXPECT_TRUE(File::close(two));
}

TEST(PortStream, ReadErrorsEndReading) {
    // Reading this process's memory from address 0 fails with an input/output error.
    Stream* failing = File::open("/proc/self/mem", File::READ, true);
    if (failing == nullptr) {
        GTEST_SKIP() << "no /proc/self/mem";
    }
    EXPECT_TRUE(failing->geteof());
    Port::StringBase<char> line("kept?");
    EXPECT_EQ(failing->readline(line), -1);
    EXPECT_TRUE(line.IsEmpty());
    // The system's reason is kept (under Wine the runtime reports it as an invalid argument).
#ifdef _WIN32
    EXPECT_NE(failing->error().str(), "");
#else
    EXPECT_EQ(failing->error().str(), std::strerror(EIO));
#endif
    EXPECT_TRUE(File::close(failing));
}

TEST(PortStream, LongLinesAndLinesAcrossTheReadBuffer) {
    tesutest::TempDir tmp;

    const std::string huge(5 * 1024 * 1024 + 17, 'h');
    EXPECT_EQ(readLines(tmp.write("huge", "s\n" + huge + "\r\nafter")),
              (Lines{"s", huge, "after"}));
    EXPECT_EQ(readLines(tmp.write("huge-last", huge)), (Lines{huge}));

    // "\n", "\r\n" and a lone "\r" just before, at and just after the end of the 256 KiB read
    // buffer, so that the two bytes of a "\r\n" come in different reads.
    const std::size_t block = 256 * 1024;
    for (std::size_t length = block - 3; length <= block + 1; ++length) {
        const std::string first(length, 'a');
        for (const char* ending : {"\nnext", "\r\nnext", "\rb\nnext", "\r"}) {
            const std::string content = first + ending;
            EXPECT_EQ(readLines(tmp.write("edge", content)), expectedLines(content))
                << "length " << length << " ending " << std::string(ending).size();
        }
    }

    // A few megabytes of lines of every length up to a few thousand bytes, with every kind of
    // ending, against a plain split.
    std::mt19937 random(12345);
    std::string content;
    while (content.size() < 3 * 1024 * 1024) {
        content.append(random() % 3000, static_cast<char>('a' + random() % 26));
        switch (random() % 5) {
            case 0:
                content += "\r\n";
                break;
            case 1:
                content += '\r';
                break;
            case 2:
                content += std::string("\0", 1);
                break;
            default:
                content += '\n';
                break;
        }
    }
    EXPECT_EQ(readLines(tmp.write("random", content)), expectedLines(content));
}

// readblock lends every byte exactly once, in order, also when mixed with readline, and
// gives nothing past the end or on a stream opened for writing.
TEST(PortStream, ReadblockLendsEveryByteOnce) {
    tesutest::TempDir dir;
    std::string content = "first line\r\nsecond\n";
    for (int i = 0; content.size() < 700 * 1024; ++i) {
        content += std::string(static_cast<std::size_t>(i % 97), static_cast<char>('a' + i % 26));
        content += '\n';
    }
    const std::string path = dir.write("blocks.txt", content);
    Stream* stream = File::open(path.c_str(), File::READ, true);
    ASSERT_NE(stream, nullptr);
    Port::StringBase<char> line;
    ASSERT_EQ(stream->readline(line), 10);
    std::string seen = line.str() + "\r\n";
    const char* data = nullptr;
    for (std::size_t size = stream->readblock(data); size > 0; size = stream->readblock(data)) {
        ASSERT_NE(data, nullptr);
        seen.append(data, size);
    }
    EXPECT_EQ(data, nullptr);
    EXPECT_EQ(seen, content);
    EXPECT_TRUE(stream->geteof());
    EXPECT_EQ(stream->readblock(data), 0u);
    EXPECT_TRUE(File::close(stream));

    Stream* writer = File::open(dir.join("out.txt").c_str(), File::WRITE, true);
    ASSERT_NE(writer, nullptr);
    EXPECT_EQ(writer->readblock(data), 0u);
    EXPECT_TRUE(File::close(writer));
}

// Each refusal leaves the system's reason for it.
TEST(PortFile, OpenRefusesWhatCannotBeRead) {
    tesutest::TempDir tmp;
    const std::string file = tmp.write("f.txt", "x\n");
    auto expectRefused = [](const Port::StringBase<char>& name, int access, int code) {
        EXPECT_EQ(File::open(name, access, true), nullptr) << name.str() << ' ' << access;
        EXPECT_EQ(File::lastError().str(), std::strerror(code)) << name.str() << ' ' << access;
    };
    expectRefused(tmp.path().c_str(), File::READ, EISDIR);
    expectRefused(tmp.mkdir("sub").c_str(), File::READ, EISDIR);
    expectRefused(tmp.path().c_str(), File::WRITE, EISDIR);
    expectRefused(tmp.join("missing").c_str(), File::READ, ENOENT);
    expectRefused(tmp.join("no/such/dir/new").c_str(), File::WRITE, ENOENT);
    EXPECT_EQ(File::open("", File::READ, true), nullptr);
    for (const int access : {0, 4, -1, 100}) {
        expectRefused(file.c_str(), access, EINVAL);
    }
    // A NUL byte would hide the rest of the name from the system.
    expectRefused(Port::StringBase<char>((file + std::string("\0x", 2)).c_str(), file.size() + 2),
                  File::READ, EINVAL);
    EXPECT_FALSE(File::close(nullptr));
    EXPECT_EQ(File::lastError().str(), std::strerror(EINVAL));
#ifndef _WIN32
    // Neither a FIFO without a writer (which would block the open for good) nor an endless
    // device is read as a file; writing to a device still works.
    const std::string fifo = tmp.join("fifo");
    ASSERT_EQ(::mkfifo(fifo.c_str(), 0600), 0);
    EXPECT_EQ(File::open(fifo.c_str(), File::READ, true), nullptr);
    EXPECT_EQ(File::lastError().str(), "Not a regular file");
    EXPECT_EQ(File::open("/dev/zero", File::READ, true), nullptr);
    EXPECT_EQ(File::lastError().str(), "Not a regular file");
    Stream* devNull = File::open("/dev/null", File::WRITE, true);
    ASSERT_NE(devNull, nullptr);
    EXPECT_TRUE(devNull->write("x\n", 2));
    EXPECT_TRUE(File::close(devNull));
#endif
}

#ifndef _WIN32
// Standard input is read through a duplicate: closing the stream leaves descriptor 0 open.
TEST(PortFile, StandardInputIsReadThroughADuplicate) {
    tesutest::TempDir tmp;
    const std::string input = tmp.write("in.txt", "one\r\ntwo");
    const int saved = ::dup(0);
    ASSERT_GE(saved, 0);
    const int file = ::open(input.c_str(), O_RDONLY);
    ASSERT_GE(file, 0);
    ASSERT_EQ(::dup2(file, 0), 0);
    ::close(file);
    Stream* in = File::openStandardInput();
    ASSERT_NE(in, nullptr);
    EXPECT_EQ(in->name().str(), "-");
    Port::StringBase<char> line;
    EXPECT_EQ(in->readline(line), 3);
    EXPECT_EQ(in->readline(line), 3);
    EXPECT_EQ(line.str(), "two");
    EXPECT_TRUE(in->geteof());
    EXPECT_TRUE(File::close(in));
    EXPECT_NE(::fcntl(0, F_GETFD), -1);
    ::close(0);
    EXPECT_EQ(File::openStandardInput(), nullptr);
    EXPECT_EQ(File::lastError().str(), std::strerror(EBADF));
    ASSERT_EQ(::dup2(saved, 0), 0);
    ::close(saved);
}
#endif

TEST(PortFile, WriteAppendAndReadBack) {
    tesutest::TempDir tmp;
    const std::string path = tmp.join("out.txt");

    Stream* out = File::open(path.c_str(), File::WRITE, false);
    ASSERT_NE(out, nullptr);
    EXPECT_TRUE(out->writable());
    EXPECT_EQ(out->name().str(), path);
    EXPECT_TRUE(out->geteof());
    Port::StringBase<char> line;
    EXPECT_EQ(out->readline(line), -1);
    const std::string big(200 * 1024, 'B');
    EXPECT_TRUE(out->write("first\n", 6));
    EXPECT_TRUE(out->write(Port::StringBase<char>((big + "\n").c_str())));
    EXPECT_TRUE(out->write(std::string("n\0l\n", 4).data(), 4));
    EXPECT_TRUE(out->write(nullptr, 0));
    EXPECT_TRUE(out->flush());
    EXPECT_TRUE(File::close(out));
    EXPECT_EQ(readLines(path), (Lines{"first", big, std::string("n\0l", 3)}));

    Stream* more = File::open(path.c_str(), File::APPEND, true);
    ASSERT_NE(more, nullptr);
    EXPECT_TRUE(more->write("last"));
    EXPECT_TRUE(File::close(more));
    EXPECT_EQ(readLines(path), (Lines{"first", big, std::string("n\0l", 3), "last"}));

    // Writing again truncates; appending to a missing file creates it.
    Stream* again = File::open(path.c_str(), File::WRITE, true);
    ASSERT_NE(again, nullptr);
    EXPECT_TRUE(again->write("only\n"));
    EXPECT_TRUE(File::close(again));
    EXPECT_EQ(readLines(path), (Lines{"only"}));
    Stream* created = File::open(tmp.join("new.txt").c_str(), File::APPEND, true);
    ASSERT_NE(created, nullptr);
    EXPECT_TRUE(File::close(created));
    EXPECT_TRUE(File::isfile(tmp.join("new.txt").c_str()));

    // A stream opened for reading does not write.
    Stream* in = File::open(path.c_str(), File::READ, true);
    ASSERT_NE(in, nullptr);
    EXPECT_FALSE(in->writable());
    EXPECT_FALSE(in->write("x", 1));
    EXPECT_TRUE(File::close(in));
    EXPECT_EQ(readLines(path), (Lines{"only"}));
}

TEST(PortFile, WriteFailuresAreReported) {
    if (!fs::exists("/dev/full")) {
        GTEST_SKIP() << "no /dev/full";
    }
    // The buffered bytes fail when they are written out at close.
    Stream* full = File::open("/dev/full", File::WRITE, true);
    ASSERT_NE(full, nullptr);
    EXPECT_TRUE(full->write("buffered", 8));
    EXPECT_EQ(full->error().str(), "");
    EXPECT_FALSE(File::close(full));
    EXPECT_EQ(File::lastError().str(), std::strerror(ENOSPC));

    Stream* flushed = File::open("/dev/full", File::WRITE, true);
    ASSERT_NE(flushed, nullptr);
    EXPECT_TRUE(flushed->write("buffered", 8));
    EXPECT_FALSE(flushed->flush());
    EXPECT_EQ(flushed->error().str(), std::strerror(ENOSPC));
    EXPECT_FALSE(flushed->write("more", 4));
    EXPECT_FALSE(File::close(flushed));
}

TEST(PortFile, NamesAreJustBytes) {
    tesutest::TempDir tmp;
#if defined(_WIN32)
    // Windows holds names in UTF-16: bytes that are not UTF-8 name nothing there
    // (port_windows_test checks that they are refused).
    const char* const odd = "caf\xc3\xa9.v";
#else
    const char* const odd = "caf\xc3\xa9\xff.v";
#endif
    for (const std::string name : {"with blanks.txt", odd, "%n%s%x.txt"}) {
        const std::string path = tmp.join(name);
        Stream* out = File::open(path.c_str(), File::WRITE, true);
        ASSERT_NE(out, nullptr) << name;
        EXPECT_TRUE(out->write(name.c_str()));
        EXPECT_TRUE(File::close(out));
        EXPECT_TRUE(fs::exists(fs::path(tmp.path()) / fs::u8path(name))) << name;
        EXPECT_TRUE(File::isfile(path.c_str()));
        EXPECT_EQ(readLines(path), (Lines{name}));
    }
    // A backslash separates components here too.
    tmp.write("d/inner.txt", "in\n");
    const std::string backslashed = tmp.path() + "\\d\\inner.txt";
    EXPECT_TRUE(File::isfile(backslashed.c_str()));
    EXPECT_EQ(readLines(backslashed), (Lines{"in"}));
}

TEST(PortFile, ExistenceAndKindQueries) {
    if (const char* reason = tesutest::WhyNoSymbolicLinks()) {
        GTEST_SKIP() << reason << "; port_windows_test asks the same questions there";
    }
    tesutest::TempDir tmp;
    const std::string file = tmp.write("f.txt", "x");
    const std::string dir = tmp.mkdir("d");
    const std::string missing = tmp.join("missing");
    const std::string dirLink = tmp.join("dir-link");
    const std::string dangling = tmp.join("dangling");
    ASSERT_TRUE(tesutest::MakeSymbolicLink(dir, dirLink));
    ASSERT_TRUE(tesutest::MakeSymbolicLink(missing, dangling));

    struct Case {
        std::string name;
        bool exist, isfile, isdir, canread;
    };
    const Case cases[] = {
        {file, true, true, false, true},         {dir, true, false, true, true},
        {dir + "/", true, false, true, true},    {dirLink, true, false, true, true},
        {missing, false, false, false, false},   {dangling, false, false, false, false},
        {"", false, false, false, false},        {file + "/x", false, false, false, false},
        {"/dev/null", true, false, false, true},
    };
    for (const Case& c : cases) {
        const Port::StringBase<char> name(c.name.c_str());
        const Port::FileName fileName(name);
        EXPECT_EQ(File::exist(name), c.exist) << c.name;
        EXPECT_EQ(File::exist(fileName), c.exist) << c.name;
        EXPECT_EQ(File::isfile(name), c.isfile) << c.name;
        EXPECT_EQ(File::isfile(fileName), c.isfile) << c.name;
        EXPECT_EQ(File::isdir(name), c.isdir) << c.name;
        EXPECT_EQ(File::isdir(fileName), c.isdir) << c.name;
        EXPECT_EQ(File::canread(name), c.canread) << c.name;
        EXPECT_EQ(File::canread(fileName), c.canread) << c.name;
    }
}

TEST(PortFile, CanreadFollowsPermissions) {
    if (const char* reason = tesutest::WhyPermissionsDoNotLockOut()) {
        GTEST_SKIP() << reason;
    }
    tesutest::TempDir tmp;
    const std::string file = tmp.write("secret.txt", "x");
    const std::string dir = tmp.mkdir("closed");
    fs::permissions(file, fs::perms::none);
    fs::permissions(dir, fs::perms::none);
    EXPECT_TRUE(File::exist(file.c_str()));
    EXPECT_FALSE(File::canread(file.c_str()));
    EXPECT_EQ(File::open(file.c_str(), File::READ, true), nullptr);
    EXPECT_TRUE(File::isdir(dir.c_str()));
    EXPECT_FALSE(File::canread(dir.c_str()));
    UT_DIR listing(dir.c_str(), UT_DIR::ALL);
    EXPECT_FALSE(listing.isOpen());
}

TEST(PortFile, WorkingDirectory) {
#if defined(_WIN32)
    GTEST_SKIP() << "POSIX root and a removable working directory; "
                    "WindowsFile.WorkingDirectoryOnADrive covers Windows";
#endif
    tesutest::WorkingDirectoryRestorer restore;
    tesutest::TempDir tmp;
    const std::string target = fs::canonical(tmp.mkdir("a b")).string();

    EXPECT_TRUE(File::chdir((target + "/").c_str()));
    EXPECT_EQ(File::getcwd().str(), target);
    EXPECT_TRUE(File::chdir(".."));
    EXPECT_EQ(File::getcwd().str(), fs::canonical(tmp.path()).string());
    EXPECT_FALSE(File::chdir(tmp.join("missing").c_str()));
    EXPECT_FALSE(File::chdir(tmp.write("f", "").c_str()));
    EXPECT_FALSE(File::chdir(""));
    EXPECT_EQ(File::getcwd().str(), fs::canonical(tmp.path()).string());

    EXPECT_TRUE(File::chdir("/"));
    EXPECT_EQ(File::getcwd().str(), "/");

    // A working directory that was removed cannot be read.
    const std::string doomed = tmp.mkdir("doomed");
    ASSERT_TRUE(File::chdir(doomed.c_str()));
    fs::remove(doomed);
    EXPECT_THROW(File::getcwd(), std::runtime_error);
    EXPECT_THROW(Port::FileName("relative").GetAbsolutePath(), std::runtime_error);
    // An absolute name does not need it.
    EXPECT_EQ(Port::FileName("/x/../y").GetAbsolutePath().str(), "/y");
}

TEST(PortDirectoryListing, SortedFilteredWithoutDots) {
    if (const char* reason = tesutest::WhyNoSymbolicLinks()) {
        GTEST_SKIP() << reason << "; port_windows_test lists directories there";
    }
    tesutest::TempDir tmp;
    const std::string root = tmp.mkdir("list");
    tmp.write("list/b.txt", "");
    tmp.write("list/B.txt", "");
    tmp.write("list/\xc3\xa9.txt", "");
    tmp.write("list/_x", "");
    tmp.mkdir("list/zdir");
    tmp.mkdir("list/Adir");
    tmp.mkdir("target");
    ASSERT_TRUE(tesutest::MakeSymbolicLink(tmp.join("target"), tmp.join("list/link-dir")));
    ASSERT_TRUE(tesutest::MakeSymbolicLink(tmp.join("list/b.txt"), tmp.join("list/link-file")));
    ASSERT_TRUE(tesutest::MakeSymbolicLink(tmp.join("nowhere"), tmp.join("list/link-none")));

    auto names = [](const std::string& path, int filter) {
        UT_DIR listing(path.c_str(), filter);
        Lines result;
        for (UT_DIR_ITERATOR it = listing.begin(); it != listing.end(); ++it) {
            result.push_back(*it);
        }
        EXPECT_EQ(result.size(), listing.size());
        return result;
    };

    EXPECT_EQ(names(root, UT_DIR::ALL), (Lines{"Adir", "B.txt", "_x", "b.txt", "link-dir",
                                               "link-file", "link-none", "zdir", "\xc3\xa9.txt"}));
    EXPECT_EQ(names(root, UT_DIR::DIRECTORIES), (Lines{"Adir", "link-dir", "zdir"}));
    EXPECT_EQ(names(root + "/", UT_DIR::DIRECTORIES), (Lines{"Adir", "link-dir", "zdir"}));
    EXPECT_EQ(names(root, UT_DIR::FILES),
              (Lines{"B.txt", "_x", "b.txt", "link-file", "\xc3\xa9.txt"}));

    // Nothing to list: a directory with no entries, a missing name, a file, an unknown filter.
    const std::string emptyDir = tmp.mkdir("empty");
    UT_DIR empty(emptyDir.c_str(), UT_DIR::ALL);
    EXPECT_TRUE(empty.isOpen());
    EXPECT_EQ(empty.size(), 0u);
    EXPECT_FALSE(empty.begin() != empty.end());
    for (const std::string& path : {tmp.join("missing"), tmp.join("list/b.txt"), std::string()}) {
        UT_DIR none(path.c_str(), UT_DIR::ALL);
        EXPECT_FALSE(none.isOpen()) << path;
        EXPECT_EQ(none.size(), 0u) << path;
    }
    EXPECT_EQ(names(root, 3), Lines{});

    // The listing is a snapshot; close empties it.
    UT_DIR snapshot(root.c_str(), UT_DIR::DIRECTORIES);
    tmp.mkdir("list/later");
    EXPECT_EQ(snapshot.size(), 3u);
    snapshot.close();
    snapshot.close();
    EXPECT_EQ(snapshot.size(), 0u);
    EXPECT_FALSE(snapshot.isOpen());
}
