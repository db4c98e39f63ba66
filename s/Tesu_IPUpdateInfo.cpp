#include "Tesu_IPUpdateInfo.h"

#include "Port_File.h"
#include "Port_FileName.h"
#include "Port_Init.h"
#include "Port_Msg.h"
#include "Port_PathList.h"
#include "Port_String.h"

TESU_MODULE_PORTABILITY_INIT("Tesu_IPUpdateInfo")

namespace Tesu {

const Port::StringBase<char> IPUpdateInfo::CORES_LEVEL_TAG("cores_level=");

namespace {

// The update log's name, directly in an installation root.
constexpr const char* kLogName = "IPupdate.log";
// The text that the level follows in the report.
constexpr const char* kReportPrefix = "Cores Update # ";

// Results of the three operations.
constexpr unsigned int kLogFound = 0;
constexpr unsigned int kNoLog = 1;
constexpr unsigned int kLogNotOpened = 2;
constexpr unsigned int kTagFound = 3;
constexpr unsigned int kTagAbsent = 4;

}  // namespace

unsigned int IPUpdateInfo::GetCoresLevel(Port::StringBase<char>& report) {
    Port::StringBase<char> location;
    const unsigned int found = GetIPUpdateLogLocation(location);
    if (found != kLogFound) {
        return found;
    }

    Port::Stream* stream = Port::File::open(location, Port::File::READ, true);
    if (stream == nullptr) {
        Port_MsgManData::createObject("tesutil", "../s/Tesu_IPUpdateInfo", __LINE__,
                                      "$Revision: 1.8 $")
            .issueError("Couldn't open %s for reading.\n", location.GetText());
        return kLogNotOpened;
    }

    unsigned int result = kTagAbsent;
    Port::StringBase<char> line;
    Port::StringBase<char> level;
    try {
        if (!stream->geteof()) {
            do {
                stream->readline(&line);
                result = ReadCoreLevelFromLine(line, level);
            } while (result != kTagFound && !stream->geteof());
        }
    } catch (...) {
        // An exception of the layer passes on, but not with the log left open.
        Port::File::close(stream);
        throw;
    }
    if (result == kTagFound) {
        report.Assign(kReportPrefix);
        report.Append(level);
    }
    // A failed close changes nothing that was read, so it is not reported.
    Port::File::close(stream);
    return result;
}

unsigned int IPUpdateInfo::GetIPUpdateLogLocation(Port::StringBase<char>& location) {
    const Port::PathList& roots = Port::QuarnelPath::GetInstance();
    for (Port::PathListIterator root = roots.begin(); root != roots.end(); root++) {
        // The separator is appended even when the root already ends in one.
        location.Assign(*root, false);
        location.Append(1, Port::FileName::GetPathSeparator());
        location.Append(kLogName);
        if (Port::File::canread(location)) {
            return kLogFound;
        }
    }
    return kNoLog;
}

unsigned int IPUpdateInfo::ReadCoreLevelFromLine(Port::StringBase<char>& line,
                                                 Port::StringBase<char>& level) {
    const std::size_t tag = line.GetIndexOfString(CORES_LEVEL_TAG, Port::COMPARE_EXACT);
    if (tag == Port::NPOS) {
        return kTagAbsent;
    }
    // Everything after the tag to the end of the line, unchanged; empty when the tag ends it.
    level.Assign(line.Extract(Port_Range{tag + CORES_LEVEL_TAG.GetLength(), line.GetLength()}),
                 false);
    return kTagFound;
}

}  // namespace Tesu
