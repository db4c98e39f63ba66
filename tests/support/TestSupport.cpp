#include "TestSupport.h"

#include <atomic>
#include <chrono>
#include <filesystem>
#include <fstream>
#include <memory>
#include <stdexcept>
#include <vector>

#include "Port_Version.h"
#include "Tesu_DebugMessenger.h"

namespace fs = std::filesystem;

namespace tesutest {

namespace {
Tesu::MsgMan::DiagnosticLevel silentLevel() {
    return Tesu::MsgMan::DIAG_SILENT;
}
}  // namespace

MessageCapture::MessageCapture() : manager_(silentLevel()) {
    manager_.addMsgStream(stream_);
}

MessageCapture::~MessageCapture() {
    manager_.removeMsgStream(stream_);
}

TempDir::TempDir() {
    static std::atomic<unsigned> counter{0};
    const auto stamp = std::chrono::steady_clock::now().time_since_epoch().count();
    for (int attempt = 0; attempt < 100; ++attempt) {
        fs::path candidate =
            fs::temp_directory_path() /
            ("tesu-test-" + std::to_string(stamp) + "-" + std::to_string(counter.fetch_add(1)));
        std::error_code ec;
        if (fs::create_directory(candidate, ec)) {
            path_ = candidate.string();
            return;
        }
    }
    throw std::runtime_error("cannot make a temporary directory");
}

TempDir::~TempDir() {
    std::error_code ec;
    // Give back permissions a test may have taken away, so that everything can be removed.
    for (auto it = fs::recursive_directory_iterator(path_, ec);
         !ec && it != fs::recursive_directory_iterator(); it.increment(ec)) {
        fs::permissions(it->path(), fs::perms::owner_all, fs::perm_options::add, ec);
    }
    fs::remove_all(path_, ec);
}

std::string TempDir::join(const std::string& relative) const {
    return path_ + "/" + relative;
}

std::string TempDir::write(const std::string& relative, const std::string& content) const {
    // Names are UTF-8, also where the system's own narrow encoding is another (Windows).
    const fs::path target = fs::u8path(path_) / fs::u8path(relative);
    fs::create_directories(target.parent_path());
    std::ofstream out(target, std::ios::binary | std::ios::trunc);
    out.write(content.data(), static_cast<std::streamsize>(content.size()));
    if (!out) {
        throw std::runtime_error("cannot write " + target.string());
    }
    return target.string();
}

std::string TempDir::mkdir(const std::string& relative) const {
    const fs::path target = fs::u8path(path_) / fs::u8path(relative);
    fs::create_directories(target);
    return target.string();
}

LoggerLevelsReset::LoggerLevelsReset() {
    resetAll();
}
LoggerLevelsReset::~LoggerLevelsReset() {
    resetAll();
}

void LoggerLevelsReset::resetAll() {
    Tesu::DebugMessengerFactory::GetLogger()->SetLevel(Tesu::DebugMessenger::DEBUG_OFF);
    std::unique_ptr<std::vector<Port::StringBase<char>>> names(
        Tesu::DebugMessengerFactory::GetActiveLoggers());
    for (const auto& name : *names) {
        Tesu::DebugMessengerFactory::GetLogger(name)->SetLevel(Tesu::DebugMessenger::DEBUG_INHERIT);
    }
}

WorkingDirectoryRestorer::WorkingDirectoryRestorer() : saved_(fs::current_path().string()) {}
WorkingDirectoryRestorer::~WorkingDirectoryRestorer() {
    std::error_code ec;
    fs::current_path(saved_, ec);
}

RootsGuard::RootsGuard(const Port::PathList& roots) {
    Port::QuarnelPath::SetRoots(roots);
}
RootsGuard::~RootsGuard() {
    Port::QuarnelPath::Reset();
}

VersionGuard::VersionGuard(const char* key, const char* value) {
    Port::Version::setValue(key, value);
}
VersionGuard::~VersionGuard() {
    Port::Version::resetValues();
}

}  // namespace tesutest
