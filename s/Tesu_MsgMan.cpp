#include "Tesu_MsgMan.h"

#include <iostream>
#include <vector>

#include "Port_Init.h"
#include "Port_Msg.h"

TESU_MODULE_PORTABILITY_INIT("Tesu_MsgMan")

namespace Tesu {

namespace {

// Calls `visit` on every registered manager, in the dispatcher's order.
template <typename Visit>
void forEachRegisteredManager(Visit visit) {
    Port_MsgManList managers = Port_MsgDispatcher::getAllMsgMans();
    for (Port_MsgManListIterator it = managers.begin(); it != managers.end(); it++) {
        visit(*it);
    }
}

}  // namespace

MsgMan::MsgMan() : MsgMan(DIAG_STANDARD) {}

MsgMan::MsgMan(const DiagnosticLevel& level) : msgStream(nullptr), diagnosticLevel(level) {
    // If anything below throws, msgStream is destroyed as a member and nothing is registered.
    msgStream.addMsgStream(std::cerr);
    switch (diagnosticLevel) {
        case DIAG_SILENT:
            msgStream.disableMsgType(std::cerr, PORT_MSG_ERROR);
            msgStream.disableMsgType(std::cerr, PORT_MSG_WARNING);
            msgStream.disableMsgType(std::cerr, PORT_MSG_DETAIL);
            msgStream.disableMsgType(std::cerr, PORT_MSG_FATAL);
            msgStream.disableMsgType(std::cerr, PORT_MSG_STATUS);
            break;
        case DIAG_REDUCED:
            msgStream.enableMsgType(std::cerr, PORT_MSG_ERROR);
            msgStream.enableMsgType(std::cerr, PORT_MSG_WARNING);
            msgStream.disableMsgType(std::cerr, PORT_MSG_DETAIL);
            msgStream.enableMsgType(std::cerr, PORT_MSG_FATAL);
            msgStream.disableMsgType(std::cerr, PORT_MSG_STATUS);
            break;
        case DIAG_FULL:
            msgStream.enableMsgType(std::cerr, PORT_MSG_ERROR);
            msgStream.enableMsgType(std::cerr, PORT_MSG_WARNING);
            msgStream.enableMsgType(std::cerr, PORT_MSG_DETAIL);
            msgStream.enableMsgType(std::cerr, PORT_MSG_FATAL);
            msgStream.enableMsgType(std::cerr, PORT_MSG_STATUS);
            break;
        case DIAG_STANDARD:
        default:
            msgStream.enableMsgType(std::cerr, PORT_MSG_ERROR);
            msgStream.enableMsgType(std::cerr, PORT_MSG_WARNING);
            msgStream.disableMsgType(std::cerr, PORT_MSG_DETAIL);
            msgStream.enableMsgType(std::cerr, PORT_MSG_FATAL);
            msgStream.enableMsgType(std::cerr, PORT_MSG_STATUS);
            msgStream.enableMsgType(std::cerr, PORT_MSG_INFO);
            break;
    }
    // Deactivate the managers already registered, then register our own message stream last.
    // Should either step throw, the managers that were active before this construction turned
    // them off are activated again before the exception passes on: a failed construction
    // leaves no manager silent, and keeps silent those that an older MsgMan still silences.
    std::vector<Port_MsgMan*> wereActive;
    try {
        forEachRegisteredManager([&wereActive](Port_MsgMan* manager) {
            if (manager->isActive()) {
                wereActive.push_back(manager);
            }
            manager->deactivate();
        });
        Port_MsgDispatcher::addMsgMan(&msgStream);
    } catch (...) {
        for (Port_MsgMan* manager : wereActive) {
            try {
                manager->activate();
            } catch (...) {
                // Keep going: the first exception is the one the caller gets.
            }
        }
        throw;
    }
}

MsgMan::~MsgMan() {
    Port_MsgDispatcher::removeMsgMan(&msgStream);
    // A destructor must not throw: a manager whose activate throws is passed over, and the
    // others are activated all the same.
    try {
        forEachRegisteredManager([](Port_MsgMan* manager) {
            try {
                manager->activate();
            } catch (...) {
            }
        });
    } catch (...) {
        // Taking the list failed (out of memory): the others stay as they are.
    }
}

void MsgMan::addMsgStream(std::ostream& stream) {
    msgStream.addMsgStream(stream);
}
void MsgMan::addMsgStream(Port::Stream& stream) {
    msgStream.addMsgStream(stream);
}
void MsgMan::removeMsgStream(std::ostream& stream) {
    msgStream.removeMsgStream(stream);
}
void MsgMan::removeMsgStream(Port::Stream& stream) {
    msgStream.removeMsgStream(stream);
}

}  // namespace Tesu
