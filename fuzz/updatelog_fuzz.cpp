// The cores update level: the input is the content of "IPupdate.log" in an installation root
// (written as given by the input's first byte: the root alone, with a trailing separator, or
// after a root that holds no log). Properties: the result is 3 with the report "Cores Update # "
// and everything after the first tag of the first line that holds one, or 4 with the report
// untouched; nothing is issued.
#include <sys/stat.h>

#include <cstddef>
#include <cstdint>
#include <string>

#include "FuzzSupport.h"
#include "Port_PathList.h"
#include "Port_String.h"
#include "Tesu_IPUpdateInfo.h"

namespace {

fuzzsupport::TempDirectoryRemover remover;

const char kTag[] = "cores_level=";

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string input(reinterpret_cast<const char*>(data), size);
    static const std::string root = [] {
        const std::string path = fuzzsupport::TempDirectory() + "/root";
        ::mkdir(path.c_str(), 0755);
        ::mkdir((fuzzsupport::TempDirectory() + "/empty").c_str(), 0755);
        return path;
    }();
    fuzzsupport::WriteFile(root + "/IPupdate.log", input);

    Port::PathList roots;
    const unsigned form = size > 0 ? data[0] % 3 : 0;
    if (form == 2) {
        roots.Append(Port::StringBase<char>(fuzzsupport::TempDirectory() + "/empty"));
    }
    roots.Append(Port::StringBase<char>(form == 1 ? root + "/" : root));
    Port::QuarnelPath::SetRoots(roots);

    std::string expected = "untouched";
    unsigned int expectedResult = 4;
    for (const std::string& line : fuzzsupport::ReaderLines(input)) {
        const std::size_t tag = line.find(kTag);
        if (tag != std::string::npos) {
            expected = "Cores Update # " + line.substr(tag + sizeof kTag - 1);
            expectedResult = 3;
            break;
        }
    }

    fuzzsupport::MessageCapture capture;
    Port::StringBase<char> report("untouched");
    const unsigned int result = Tesu::IPUpdateInfo::GetCoresLevel(report);
    FUZZ_CHECK(result == expectedResult);
    FUZZ_CHECK(report.str() == expected);
    FUZZ_CHECK(capture.Text().empty());
    Port::QuarnelPath::Reset();
    return 0;
}
