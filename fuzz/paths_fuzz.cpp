// Path texts: the input is a base text and a path text, worked on from a directory that holds
// a small tree (directories, a file, a link to a directory, a link to itself). Properties:
// - Port::FileName gives its text back, a head that ends in a separator, a native text of the
//   same length without "\", and an absolute form that is normalised ("/" first, no "//",
//   "/./" or "/../", no "/" last unless it is the root, no "." or ".." last) and idempotent;
// - the five path operations of Tesu::Utilities agree with each other: a separator is added
//   at most once and only a "/"; the absolute path is the normalised form with a separator
//   added at most; the directory ends in a separator and begins the absolute path; the
//   relative path is either the absolute path or "./" and what follows the base directory.
#include <fcntl.h>
#include <fuzzer/FuzzedDataProvider.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstddef>
#include <cstdint>
#include <string>

#include "FuzzSupport.h"
#include "Port_FileName.h"
#include "Port_String.h"
#include "Tesu_Utilities.h"

namespace {

using Text = Port::StringBase<char>;
using Tesu::Utilities;

fuzzsupport::TempDirectoryRemover remover;

bool StartsWith(const std::string& s, const std::string& prefix) {
    return s.compare(0, prefix.size(), prefix) == 0;
}

bool EndsWith(const std::string& s, const std::string& suffix) {
    return s.size() >= suffix.size() &&
           s.compare(s.size() - suffix.size(), suffix.size(), suffix) == 0;
}

bool IsNormalised(const std::string& path) {
    return StartsWith(path, "/") && path.find("//") == std::string::npos &&
           path.find("/./") == std::string::npos && path.find("/../") == std::string::npos &&
           path.find('\\') == std::string::npos && !EndsWith(path, "/.") &&
           !EndsWith(path, "/..") && (path == "/" || !EndsWith(path, "/"));
}

// The text without a final separator, unless it is the root.
std::string Unterminated(const std::string& path) {
    return path.size() > 1 && EndsWith(path, "/") ? path.substr(0, path.size() - 1) : path;
}

void CheckFileName(const std::string& text) {
    const Port::FileName name{Text(text)};
    FUZZ_CHECK(name.GetText().str() == text);
    const std::string head = name.GetHead().str();
    FUZZ_CHECK(head.empty() || Port::FileName::IsSeparator(head.back()));
    FUZZ_CHECK(head + name.GetTail().str() == text);
    const std::string native = name.MakeNative().str();
    FUZZ_CHECK(native.size() == text.size() && native.find('\\') == std::string::npos);
    const std::string absolute = name.GetAbsolutePath(false).str();
    FUZZ_CHECK(IsNormalised(absolute));
    FUZZ_CHECK(Port::FileName(Text(absolute)).GetAbsolutePath(false).str() == absolute);
    const std::string absoluteHead = name.GetHead(false, true).str();
    FUZZ_CHECK(EndsWith(absoluteHead, "/") && StartsWith(absolute, absoluteHead));
}

void CheckUtilities(const std::string& base, const std::string& text) {
    const Text path(text);
    const bool terminated = Utilities::IsTerminatedWithPathSeparator(path);
    FUZZ_CHECK(terminated == (!text.empty() && Port::FileName::IsSeparator(text.back())));

    const std::string withSeparator = Utilities::TerminateWithPathSeparator(path).str();
    FUZZ_CHECK(withSeparator == text ||
               (!text.empty() && !terminated && withSeparator == text + "/"));

    const std::string absolute = Utilities::GetAbsolutePath(path).str();
    const std::string directory = Utilities::GetAbsoluteDirectory(path).str();
    const std::string relative = Utilities::MakeRelativePath(Text(base), path).str();
    if (text.empty()) {
        FUZZ_CHECK(absolute.empty() && directory.empty() && relative.empty());
        return;
    }
    const std::string normalised = Port::FileName(Text(text)).GetAbsolutePath(false).str();
    FUZZ_CHECK(Unterminated(absolute) == normalised);
    FUZZ_CHECK(absolute == normalised || absolute == normalised + "/");
    FUZZ_CHECK(Unterminated(Utilities::GetAbsolutePath(Text(absolute)).str()) == normalised);

    // A directory is its own; anything else gives the head of its absolute path.
    FUZZ_CHECK(EndsWith(directory, "/") && IsNormalised(Unterminated(directory)));
    FUZZ_CHECK(directory ==
               (EndsWith(absolute, "/") ? absolute : absolute.substr(0, absolute.rfind('/') + 1)));

    const std::string baseDirectory = Utilities::GetAbsoluteDirectory(Text(base)).str();
    if (relative != absolute) {
        FUZZ_CHECK(StartsWith(relative, "./") && !baseDirectory.empty());
        FUZZ_CHECK(baseDirectory + relative.substr(2) == absolute);
    } else {
        FUZZ_CHECK(baseDirectory.empty() || !StartsWith(absolute, baseDirectory));
    }
}

// A small tree to meet existing names; each input is worked on from inside it.
const std::string& Tree() {
    static const std::string root = [] {
        const std::string path = fuzzsupport::TempDirectory() + "/tree";
        ::mkdir(path.c_str(), 0755);
        ::mkdir((path + "/a").c_str(), 0755);
        ::mkdir((path + "/a/b").c_str(), 0755);
        fuzzsupport::WriteFile(path + "/a/f", "");
        fuzzsupport::WriteFile(path + "/f", "");
        ::symlink("a", (path + "/l").c_str());
        ::symlink("loop", (path + "/loop").c_str());
        return path;
    }();
    return root;
}

// Enters the tree for its lifetime, then goes back, so that libFuzzer's own relative names
// (corpus, artifacts) keep their meaning.
class InTree {
  public:
    InTree() : back_(::open(".", O_RDONLY | O_DIRECTORY | O_CLOEXEC)) {
        FUZZ_CHECK(back_ >= 0 && ::chdir(Tree().c_str()) == 0);
    }
    ~InTree() {
        FUZZ_CHECK(::fchdir(back_) == 0);
        ::close(back_);
    }
    InTree(const InTree&) = delete;
    InTree& operator=(const InTree&) = delete;

  private:
    int back_;
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const InTree inTree;
    FuzzedDataProvider in(data, size);
    const std::string base = in.ConsumeRandomLengthString(256);
    const std::string text = in.ConsumeRemainingBytesAsString();
    CheckFileName(text);
    CheckUtilities(base, text);
    return 0;
}
