// Tesu::DebugMessenger, a named debug logger with a level and timers, and
// Tesu::DebugMessengerFactory, the process-wide registry of loggers.
#ifndef TESU_DEBUGMESSENGER_H
#define TESU_DEBUGMESSENGER_H

#include <cstdint>
#include <map>
#include <vector>

#include "Port_String.h"
#include "Port_Timer.h"
#include "Tesu_Export.h"

namespace Tesu {

// A debug logger. Its lines leave as status messages through the layer's dispatcher, prefixed
// "DEBUG - " for a logger named "root" (in any letter case) and "DEBUG[<name>] - " for every
// other name, and end in exactly one line feed. Texts are written verbatim, never used as
// formats.
//
// A logger either has a level of its own or inherits the effective level of its parent,
// looked up afresh on every call. The parent is not owned and must outlive the logger; every
// chain of parents should end in a logger with a level of its own (a root starts at DEBUG_OFF);
// a chain that ends without one (a null parent, or a root set to DEBUG_INHERIT) counts as
// DEBUG_OFF.
// Nothing is locked: a logger and its ancestors are used by one thread at a time.
class TESU_API DebugMessenger {
  public:
    enum DebugLevel : std::int32_t {
        DEBUG_INHERIT = 0,  // use the parent's effective level
        DEBUG_OFF = 1,
        DEBUG_NORMAL = 2,
        DEBUG_DETAILED = 3,
        DEBUG_VERBOSE = 4,
    };

    // A root: level DEBUG_OFF, no parent, name "root"; its clock starts now.
    DebugMessenger();
    // A child: level DEBUG_INHERIT, `parent` stored as given (not owned, not checked), a copy
    // of `name`; its clock starts now.
    DebugMessenger(DebugMessenger* parentLogger, const Port::StringBase<char>& loggerName);
    // Writes "Total debug time: <time>" at normal level (so only when the effective level is at
    // least DEBUG_NORMAL), then releases the timers. Nothing escapes: should building or
    // issuing that line throw, the line is lost.
    ~DebugMessenger();
    DebugMessenger(const DebugMessenger&) = delete;
    DebugMessenger& operator=(const DebugMessenger&) = delete;

    // Stores `level` as given; DEBUG_INHERIT makes the logger follow its parent again.
    void SetLevel(DebugLevel newLevel) { level = newLevel; }

    // Level tests on the effective level: IsOff tests equality, the others "at least".
    bool IsOff() const { return EffectiveLevel() == DEBUG_OFF; }
    bool IsNormal() const { return EffectiveLevel() >= DEBUG_NORMAL; }
    bool IsDetailed() const { return EffectiveLevel() >= DEBUG_DETAILED; }
    bool IsVerbose() const { return EffectiveLevel() >= DEBUG_VERBOSE; }

    // Writes one line when the effective level is at least `level`; otherwise returns at once
    // without building anything.
    void Message(DebugLevel lineLevel, const Port::StringBase<char>& text) {
        if (EffectiveLevel() >= lineLevel) {
            Write(text);
        }
    }
    void Normal(const Port::StringBase<char>& text) { Message(DEBUG_NORMAL, text); }
    void Detailed(const Port::StringBase<char>& text) { Message(DEBUG_DETAILED, text); }
    void Verbose(const Port::StringBase<char>& text) { Message(DEBUG_VERBOSE, text); }

    // The time since the logger was made, as the layer's timer writes it ("H:MM:SS.mmm").
    Port::StringBase<char> GetTimer();
    // Starts the named timer, or restarts it.
    void SetTimer(const Port::StringBase<char>& timerName);
    // The time since the named timer was set. A name never set (or stopped) is first set to
    // the logger's construction, and stays set.
    Port::StringBase<char> GetTimer(const Port::StringBase<char>& timerName);
    // Forgets the named timer; a name never set changes nothing.
    void StopTimer(const Port::StringBase<char>& timerName);

  private:
    DebugLevel EffectiveLevel() const {
        const DebugMessenger* logger = this;
        while (logger->level == DEBUG_INHERIT) {
            if (logger->parent == nullptr) {
                // A chain without a level counts as DEBUG_OFF: lines of level DEBUG_OFF (or
                // DEBUG_INHERIT) are still written, as they are at every level.
                return DEBUG_OFF;
            }
            logger = logger->parent;
        }
        return logger->level;
    }
    // Builds the prefixed line and issues it as a status message.
    void Write(const Port::StringBase<char>& text);
    Port::StringBase<char> DurationText(double seconds);

    DebugLevel level;
    DebugMessenger* parent;
    Port::StringBase<char> name;
    UT_TIMER clock;
    std::map<Port::StringBase<char>, double> timers;
};

// The registry of shared loggers: one root, made at library load, and one child of the root
// per other name, made on its first request. The registry owns them all and frees none, so
// every pointer it hands out stays valid until the process ends; callers never delete them.
// Lookups and the listing hold a lock of the registry's own, so that first requests on several
// threads (the Java bridge's, for one) are safe; the loggers handed out lock nothing, and their
// users serialise the calls that change them (levels, timers). Nothing is allocated while that
// lock is held, so a host's own operator new may itself ask the registry for a logger.
class TESU_API DebugMessengerFactory {
  public:
    DebugMessengerFactory() = delete;

    // The root logger.
    static DebugMessenger* GetLogger();
    // The root for "root" (in any letter case); otherwise the logger of exactly that name
    // (case counts), made on first request as a child of the root at DEBUG_INHERIT. Never null.
    // A first request that runs out of memory throws std::bad_alloc and enters nothing; the
    // logger it had begun is discarded without writing a line.
    static DebugMessenger* GetLogger(const Port::StringBase<char>& name);
    // A new vector with the names of every named logger made so far (never "root"), in the
    // table's own order. The caller owns the vector and deletes it.
    static std::vector<Port::StringBase<char>>* GetActiveLoggers();
};

}  // namespace Tesu

#endif
