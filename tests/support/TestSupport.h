// Fixtures shared by the tests: message capture, temporary directories, and guards that
// put process-wide state (logger levels, working directory, installation roots, version
// values) back as it was.
#ifndef TESU_TEST_SUPPORT_H
#define TESU_TEST_SUPPORT_H

#include <sstream>
#include <string>

#include "Port_PathList.h"
#include "Port_String.h"
#include "Tesu_MsgMan.h"

namespace tesutest {

// Captures every message dispatched while it lives, through a Tesu::MsgMan that keeps
// std::cerr silent and writes to an added string stream (every message type on).
class MessageCapture {
  public:
    MessageCapture();
    ~MessageCapture();
    MessageCapture(const MessageCapture&) = delete;
    MessageCapture& operator=(const MessageCapture&) = delete;

    // Everything written so far.
    std::string text() const { return stream_.str(); }
    // Forgets what was written so far.
    void clear() { stream_.str(std::string()); }

  private:
    std::ostringstream stream_;
    Tesu::MsgMan manager_;
};

// A fresh directory under the system's temporary directory, removed with all its content
// at destruction.
class TempDir {
  public:
    TempDir();
    ~TempDir();
    TempDir(const TempDir&) = delete;
    TempDir& operator=(const TempDir&) = delete;

    // Absolute path of the directory, without trailing separator.
    const std::string& path() const { return path_; }
    // path() + "/" + relative.
    std::string join(const std::string& relative) const;
    // Writes `content` (bytes as given) to the relative name, making parent directories.
    // Returns the absolute path.
    std::string write(const std::string& relative, const std::string& content) const;
    // Makes the relative directory (and its parents). Returns the absolute path.
    std::string mkdir(const std::string& relative) const;

  private:
    std::string path_;
};

// Sets the root logger to DEBUG_OFF and every named logger to DEBUG_INHERIT now and again at
// destruction, so that each test starts from the library's initial levels.
class LoggerLevelsReset {
  public:
    LoggerLevelsReset();
    ~LoggerLevelsReset();
    static void resetAll();
};

// Restores the working directory at destruction.
class WorkingDirectoryRestorer {
  public:
    WorkingDirectoryRestorer();
    ~WorkingDirectoryRestorer();

  private:
    std::string saved_;
};

// Sets the installation roots for its lifetime, then lets the layer read them afresh.
class RootsGuard {
  public:
    explicit RootsGuard(const Port::PathList& roots);
    ~RootsGuard();
};

// Sets a version value for its lifetime, then restores the compiled-in table.
class VersionGuard {
  public:
    VersionGuard(const char* key, const char* value);
    ~VersionGuard();
};

}  // namespace tesutest

#endif
