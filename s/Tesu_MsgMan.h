// Tesu::MsgMan: has every message dispatched in the process written to std::cerr, filtered
// by a diagnostic level, and to further streams, for as long as the object lives.
#ifndef TESU_MSGMAN_H
#define TESU_MSGMAN_H

#include <cstdint>
#include <iosfwd>

#include "Port_Msg.h"
#include "Tesu_Export.h"

namespace Port {
class Stream;
}

namespace Tesu {

// Construction adds std::cerr to its message stream with the switches of the diagnostic
// level, calls deactivate() on every manager already registered, then registers its message
// stream; destruction unregisters it and calls activate() on every manager still registered.
// If construction fails (an exception from the layer or from a manager's deactivate), the
// exception passes to the caller, nothing is registered, and the managers that were active
// before it deactivated them are activated again (one silenced by an older MsgMan stays so).
// Destruction throws nothing: should a manager's activate throw, the exception is dropped and
// the remaining managers are activated all the same.
// The level governs std::cerr only; a stream added later gets the message stream's defaults
// (every type on). The object belongs to whoever made it; it is neither copied nor moved.
class TESU_API MsgMan {
  public:
    // Switches set on std::cerr. A type code a level does not name keeps the message
    // stream's setting for a new stream (on): so info messages (8) reach std::cerr at every
    // level, and so does any code other than 0, 1, 2, 4, 7 and 8.
    enum DiagnosticLevel : std::int32_t {
        DIAG_SILENT = 0,    // no errors, warnings, details, fatal or status (0, 1, 2, 4, 7 off)
        DIAG_REDUCED = 1,   // errors, warnings, fatal errors (0, 1, 4 on; 2, 7 off)
        DIAG_STANDARD = 2,  // and status and info messages (0, 1, 4, 7, 8 on; 2 off)
        DIAG_FULL = 3,      // and details and status (0, 1, 2, 4, 7 on)
    };

    // Level DIAG_STANDARD.
    MsgMan();
    // The referenced level, read once; any value other than 0, 1 and 3 acts as DIAG_STANDARD.
    // Not explicit: `Tesu::MsgMan manager = Tesu::MsgMan::DIAG_FULL;` makes a manager too.
    MsgMan(const DiagnosticLevel& level);  // NOLINT(google-explicit-constructor)
    ~MsgMan();
    MsgMan(const MsgMan&) = delete;
    MsgMan& operator=(const MsgMan&) = delete;

    // Forward to the message stream: a stream added twice, or removed without having been
    // added, is the message stream's business. The streams stay the caller's; remove one
    // before destroying it.
    void addMsgStream(std::ostream& stream);
    void addMsgStream(Port::Stream& stream);
    void removeMsgStream(std::ostream& stream);
    void removeMsgStream(Port::Stream& stream);

  private:
    Port_MsgStream msgStream;
    DiagnosticLevel diagnosticLevel;
};

}  // namespace Tesu

#endif
