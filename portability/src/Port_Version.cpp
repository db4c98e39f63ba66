// Port::Version: the table of version values, guarded by a mutex.
#include "Port_Version.h"

#include <map>
#include <mutex>
#include <string>
#include <utility>

#ifndef PORT_PROJECT_VERSION
#error "PORT_PROJECT_VERSION must name the project's version"
#endif

namespace Port {

namespace {

struct VersionTable {
    std::mutex mutex;
    std::map<std::string, StringBase<char>> values;
};

void fillCompiledIn(std::map<std::string, StringBase<char>>& values) {
    values.clear();
    values.emplace("version", StringBase<char>(PORT_PROJECT_VERSION));
}

// Allocated on first use and never freed, so that static constructors and destructors of
// other libraries may read and write it at any time.
VersionTable& table() {
    static VersionTable* const instance = [] {
        auto* t = new VersionTable;
        fillCompiledIn(t->values);
        return t;
    }();
    return *instance;
}

}  // namespace

StringBase<char> Version::getValue(const char* key) {
    if (key == nullptr) {
        return StringBase<char>();
    }
    VersionTable& t = table();
    std::lock_guard<std::mutex> lock(t.mutex);
    const auto found = t.values.find(key);
    return found == t.values.end() ? StringBase<char>() : found->second;
}

void Version::setValue(const char* key, const StringBase<char>& value) {
    if (key == nullptr) {
        return;
    }
    VersionTable& t = table();
    std::lock_guard<std::mutex> lock(t.mutex);
    t.values[key] = value;
}

void Version::resetValues() {
    VersionTable& t = table();
    std::lock_guard<std::mutex> lock(t.mutex);
    fillCompiledIn(t.values);
}

bool Version::splitVersion(const StringBase<char>& version, StringBase<char>& major,
                           StringBase<char>& minor, StringBase<char>& rest) {
    const std::string& text = version.str();
    const std::size_t firstDot = text.find('.');
    if (firstDot == std::string::npos) {
        return false;
    }
    // Built apart first: `version` may be one of the outputs.
    StringBase<char> newMajor(text.substr(0, firstDot));
    StringBase<char> newMinor;
    StringBase<char> newRest;
    const std::size_t secondDot = text.find('.', firstDot + 1);
    if (secondDot == std::string::npos) {
        newMinor = StringBase<char>(text.substr(firstDot + 1));
    } else {
        newMinor = StringBase<char>(text.substr(firstDot + 1, secondDot - firstDot - 1));
        newRest = StringBase<char>(text.substr(secondDot + 1));
    }
    major = std::move(newMajor);
    minor = std::move(newMinor);
    rest = std::move(newRest);
    return true;
}

}  // namespace Port
