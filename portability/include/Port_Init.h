// Init objects of the layer.
//
// Each module that uses the layer holds one of each, as static objects built before its own
// statics, in the order FileInit, PathListInit, InstanceTableInit, FactoryInit, Port_MsgManInit.
// They are reference counted (as std::ios_base::Init is): the first one built in the process
// sets up the service it stands for, the last one destroyed releases it, so a module can use
// the layer from its own static constructors and destructors in any load order.
//
// The layer can record their construction and destruction (Port::InitRecorder) for tests
// that load and unload a library.
#ifndef PORT_INIT_H
#define PORT_INIT_H

#include <vector>

#include "Port_Export.h"
#include "Port_String.h"

namespace Port {

// Each init object may be given the name of the module that holds it, for the recording; the
// name must be a string literal (or otherwise outlive the object).
#define PORT_DECLARE_INIT(Name)                          \
    class PORT_API Name {                                \
      public:                                            \
        explicit Name(const char* owner = nullptr);      \
        ~Name();                                         \
        Name(const Name&) = delete;                      \
        Name& operator=(const Name&) = delete;           \
        /* Objects of this kind alive in the process. */ \
        static int liveCount();                          \
                                                         \
      private:                                           \
        const char* owner_;                              \
    }

// The file service.
PORT_DECLARE_INIT(FileInit);
// The installation roots and path lists.
PORT_DECLARE_INIT(PathListInit);

}  // namespace Port

namespace CitP {
// The instance table: the layer's process-wide tables (versions, platform values).
PORT_DECLARE_INIT(InstanceTableInit);
// The object factory: the layer's shared objects made on demand.
PORT_DECLARE_INIT(FactoryInit);
}  // namespace CitP

// The message system: the dispatcher and its list of managers.
PORT_DECLARE_INIT(Port_MsgManInit);

namespace Port {

// One recorded event.
struct InitEvent {
    StringBase<char> owner;  // the module name given to the object, or ""
    StringBase<char> what;   // "Port::FileInit", ..., or a name given to Note
    bool constructed;        // true for construction, false for destruction
};

// Records init objects (and whatever modules Note) while started. Safe from any thread. The
// recording lives as long as the process, so it may be read after a library is unloaded.
class PORT_API InitRecorder {
  public:
    // Clears the record and starts recording.
    static void Start();
    // Stops recording; the record is kept.
    static void Stop();
    static bool IsRecording();
    // A copy of the record, in order.
    static std::vector<InitEvent> Events();
    // Records an event of a module's own (for example the making of a static object).
    static void Note(const char* owner, const char* what, bool constructed);
};

#if defined(_WIN32)
// For the entry (DllMain) of a DLL built on the layer: asks Windows not to tell the DLL
// `module` (its module handle, as the entry receives it) of threads starting and ending. A
// null handle is ignored; the system's answer is not reported (the notifications cost time,
// nothing more).
PORT_API void DisableThreadNotifications(void* module);
#endif

}  // namespace Port

#endif
