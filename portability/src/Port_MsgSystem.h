// Internal hooks of the message system for the init objects (not part of the layer's
// interface; the symbols are hidden).
#ifndef PORT_MSG_SYSTEM_H
#define PORT_MSG_SYSTEM_H

namespace PortMsgSystem {

// Makes the dispatcher's storage (a no-op once it exists).
void setUp();
// Forgets every registered manager. The storage itself stays, so that later registrations,
// removals and messages remain safe.
void release();

}  // namespace PortMsgSystem

#endif
