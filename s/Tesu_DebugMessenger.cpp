#include "Tesu_DebugMessenger.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <mutex>
#include <unordered_map>

#include "Port_Init.h"
#include "Port_Msg.h"

TESU_MODULE_PORTABILITY_INIT("Tesu_DebugMessenger")

namespace Tesu {

namespace {

// Identity of the status messages that carry the debug lines.
constexpr const char* kApplication = "tesutil";
constexpr const char* kSourcePath = "../s/Tesu_DebugMessenger";
constexpr const char* kRevision = "$Revision 0.0$";

constexpr const char* kRootName = "root";

constexpr std::size_t kRootNameLength = 4;

// The root is recognised by name, in any letter case, both for the short line prefix and
// in the registry's lookup, so the two always agree. Texts of another length never compare
// equal, so most names are settled without the comparison.
bool IsRootName(const Port::StringBase<char>& name) {
    return name.GetLength() == kRootNameLength &&
           name.Compare(kRootName, Port::COMPARE_NOCASE) == 0;
}

// Hash of a logger name: each byte, taken as a signed 8-bit value, is added to five times the
// hash so far, in unsigned 32-bit arithmetic.
struct LoggerNameHash {
    std::size_t operator()(const Port::StringBase<char>& name) const noexcept {
        std::uint32_t hash = 0;
        const char* bytes = name.GetText();
        const std::size_t length = name.GetLength();
        for (std::size_t i = 0; i < length; ++i) {
            const auto byte = static_cast<std::int32_t>(static_cast<signed char>(bytes[i]));
            hash = hash * 5u + static_cast<std::uint32_t>(byte);
        }
        return hash;
    }
};

// Keys compare exactly (StringBase's operator== is byte for byte, length included).
using LoggerTable = std::unordered_map<Port::StringBase<char>, DebugMessenger*, LoggerNameHash>;

constexpr std::size_t kInitialBuckets = 100;
constexpr float kMaxLoadFactor = 1.0f;

DebugMessenger* MakeRootLogger() {
    auto* root = new DebugMessenger();
    Port::InitRecorder::Note("Tesu_DebugMessenger", "rootLogger", true);
    return root;
}

LoggerTable* MakeLoggerTable() {
    auto* table = new LoggerTable(kInitialBuckets);
    table->max_load_factor(kMaxLoadFactor);
    Port::InitRecorder::Note("Tesu_DebugMessenger", "loggerTable", true);
    return table;
}

// The registry's state, made at load right after this module's init objects, root first.
// Neither is ever deleted: the pointers handed out stay valid until the process ends, also
// after the library is unloaded.
DebugMessenger* const rootLogger = MakeRootLogger();
LoggerTable* const loggerTable = MakeLoggerTable();

// Guards the table. Callers are expected to serialise their use of the registry, but the Java
// bridge looks "javavm" up on whatever Java thread calls it, so a first lookup on two threads at
// once must not corrupt the table. Uncontended, it costs a few nanoseconds per lookup. (A
// std::mutex has a constant initialiser and nothing to destroy at unload.)
std::mutex loggerTableMutex;

}  // namespace

// --- DebugMessenger ------------------------------------------------------------------------

DebugMessenger::DebugMessenger() : level(DEBUG_OFF), parent(nullptr), name(kRootName) {
    clock.reset();
}

DebugMessenger::DebugMessenger(DebugMessenger* parentLogger,
                               const Port::StringBase<char>& loggerName)
    : level(DEBUG_INHERIT), parent(parentLogger), name(loggerName) {
    clock.reset();
}

DebugMessenger::~DebugMessenger() {
    // The level is tested first so that a silent logger builds nothing. A failure to build or
    // issue the line must not escape a destructor; the line is then lost.
    if (!IsNormal()) {
        return;
    }
    try {
        Port::StringBase<char> text("Total debug time: ");
        text.Append(GetTimer());
        Message(DEBUG_NORMAL, text);
    } catch (...) {
    }
}

void DebugMessenger::Write(const Port::StringBase<char>& text) {
    static constexpr char kRootPrefix[] = "DEBUG - ";
    static constexpr char kNamedPrefixOpen[] = "DEBUG[";
    static constexpr char kNamedPrefixClose[] = "] - ";

    Port::StringBase<char> line;
    // One allocation for the whole line: prefix, name, text and the line feed.
    line.Reserve(sizeof(kNamedPrefixOpen) + name.GetLength() + sizeof(kNamedPrefixClose) +
                 text.GetLength());
    if (IsRootName(name)) {
        line.Append(kRootPrefix, sizeof(kRootPrefix) - 1);
    } else {
        line.Append(kNamedPrefixOpen, sizeof(kNamedPrefixOpen) - 1);
        line.Append(name);
        line.Append(kNamedPrefixClose, sizeof(kNamedPrefixClose) - 1);
    }
    line.Append(text);
    if (line.GetLastChar() != '\n') {
        line.Append(1, '\n');
    }
    // Verbatim: the line is the whole message, never a format.
    Port_MsgManData::createObject(kApplication, kSourcePath, __LINE__, kRevision).issueStatus(line);
}

Port::StringBase<char> DebugMessenger::DurationText(double seconds) {
    // asciitime's text lives in the timer until its next call: copy it at once.
    return Port::StringBase<char>(clock.asciitime(seconds, UT_TIMER::ASCII_HMS));
}

Port::StringBase<char> DebugMessenger::GetTimer() {
    return DurationText(clock.get_delta_real());
}

void DebugMessenger::SetTimer(const Port::StringBase<char>& timerName) {
    timers[timerName] = clock.get_delta_real();
}

Port::StringBase<char> DebugMessenger::GetTimer(const Port::StringBase<char>& timerName) {
    // A name never set counts from the logger's construction, and stays set from there.
    const auto entry = timers.emplace(timerName, 0.0).first;
    return DurationText(clock.get_delta_real() - entry->second);
}

void DebugMessenger::StopTimer(const Port::StringBase<char>& timerName) {
    timers.erase(timerName);
}

// --- DebugMessengerFactory -----------------------------------------------------------------

DebugMessenger* DebugMessengerFactory::GetLogger() {
    return rootLogger;
}

DebugMessenger* DebugMessengerFactory::GetLogger(const Port::StringBase<char>& name) {
    if (IsRootName(name)) {
        return rootLogger;
    }
    const std::lock_guard<std::mutex> lock(loggerTableMutex);
    const auto found = loggerTable->find(name);
    if (found != loggerTable->end()) {
        return found->second;
    }
    // Held by a unique_ptr until the table has taken it, so that a failed insertion leaks
    // nothing.
    std::unique_ptr<DebugMessenger> logger(new DebugMessenger(rootLogger, name));
    loggerTable->emplace(name, logger.get());
    return logger.release();
}

std::vector<Port::StringBase<char>>* DebugMessengerFactory::GetActiveLoggers() {
    std::unique_ptr<std::vector<Port::StringBase<char>>> names(
        new std::vector<Port::StringBase<char>>());
    const std::lock_guard<std::mutex> lock(loggerTableMutex);
    names->reserve(loggerTable->size());
    for (const auto& entry : *loggerTable) {
        names->push_back(entry.first);
    }
    return names.release();
}

}  // namespace Tesu
