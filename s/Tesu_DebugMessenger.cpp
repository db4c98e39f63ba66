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
//
// Nothing allocates while it is held: a host's own operator new (a tracing allocator, say) may
// ask the registry for a logger, and would otherwise wait for the lock its own thread holds.
// Loggers, table nodes and bucket arrays are made outside it, and only linked in under it.
std::mutex loggerTableMutex;

// Deletes a logger that no caller has seen (the loser of two first requests, or one whose
// insertion failed) without a word: registry loggers never write the total-time line.
struct DiscardSilently {
    void operator()(DebugMessenger* logger) const {
        logger->SetLevel(DebugMessenger::DEBUG_OFF);
        delete logger;
    }
};
using PendingLogger = std::unique_ptr<DebugMessenger, DiscardSilently>;

// A table node holding `name` and `logger`, made through a table of its own so that the
// registry's table need only link it in.
LoggerTable::node_type MakeNode(const Port::StringBase<char>& name, DebugMessenger* logger) {
    LoggerTable scratch;
    return scratch.extract(scratch.emplace(name, logger).first);
}

// Whether `table` holds `entries` entries without growing its bucket array: the table grows
// when its entries would exceed the bucket count times the maximum load factor.
bool HoldsWithoutGrowing(const LoggerTable& table, std::size_t entries) {
    return static_cast<double>(entries) <=
           static_cast<double>(table.bucket_count()) * static_cast<double>(table.max_load_factor());
}

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
    {
        const std::lock_guard<std::mutex> lock(loggerTableMutex);
        const auto found = loggerTable->find(name);
        if (found != loggerTable->end()) {
            return found->second;
        }
    }
    // A first request: the logger and its table node are made outside the lock. Should another
    // request for the name have come in meanwhile, its logger is kept and ours discarded.
    PendingLogger logger(new DebugMessenger(rootLogger, name));
    LoggerTable::node_type node = MakeNode(name, logger.get());
    LoggerTable spare;  // a larger bucket array, when the table must grow; freed after the lock
    for (;;) {
        std::size_t entries = 0;
        {
            const std::lock_guard<std::mutex> lock(loggerTableMutex);
            const auto found = loggerTable->find(name);
            if (found != loggerTable->end()) {
                return found->second;
            }
            entries = loggerTable->size() + 1;
            if (!HoldsWithoutGrowing(*loggerTable, entries) &&
                HoldsWithoutGrowing(spare, entries)) {
                // Grow by moving the nodes into the spare buckets; nothing is copied.
                loggerTable->swap(spare);
                loggerTable->merge(spare);
            }
            if (HoldsWithoutGrowing(*loggerTable, entries)) {
                loggerTable->insert(std::move(node));
                return logger.release();
            }
        }
        spare = LoggerTable(2 * entries + 2);
        spare.max_load_factor(kMaxLoadFactor);
    }
}

std::vector<Port::StringBase<char>>* DebugMessengerFactory::GetActiveLoggers() {
    std::unique_ptr<std::vector<Port::StringBase<char>>> names(
        new std::vector<Port::StringBase<char>>());
    // Under the lock only the addresses of the names are taken, into room reserved beforehand;
    // the names themselves are copied after it. Entries are never removed or changed, and
    // growing the table moves no node, so the addresses stay good.
    std::vector<const Port::StringBase<char>*> keys;
    for (;;) {
        std::size_t entries = 0;
        {
            const std::lock_guard<std::mutex> lock(loggerTableMutex);
            entries = loggerTable->size();
            if (entries <= keys.capacity()) {
                for (const auto& entry : *loggerTable) {
                    keys.push_back(&entry.first);
                }
                break;
            }
        }
        keys.reserve(entries + entries / 2);
    }
    names->reserve(keys.size());
    for (const Port::StringBase<char>* key : keys) {
        names->push_back(*key);
    }
    return names.release();
}

}  // namespace Tesu
