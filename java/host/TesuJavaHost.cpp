// A small native host for the Java demo and the Java test: it plays the part that the tool's
// native modules play in the product, making a message manager that writes the process's
// messages to std::cerr and setting the root logger's level. Not part of libTesu_Utilities.
#include <jni.h>

#include <mutex>

#include "Port_String.h"
#include "Tesu_DebugMessenger.h"
#include "Tesu_MsgMan.h"

namespace {

std::mutex hostMutex;
// Made on the first start() and never destroyed: it stays registered while the JVM runs,
// including during its shutdown, when Java threads may still send texts.
Tesu::MsgMan* manager = nullptr;
jint managerLevel = 0;

}  // namespace

extern "C" JNIEXPORT void JNICALL Java_com_quarnel_tesutil_tessel2_demo_NativeHost_start(
    JNIEnv* /*env*/, jclass /*cls*/, jint diagLevel, jint debugLevel) {
    try {
        std::lock_guard<std::mutex> lock(hostMutex);
        if (manager == nullptr || managerLevel != diagLevel) {
            // A new level replaces the manager: the new one is registered before the old one
            // goes, so no message falls between them.
            const auto level = static_cast<Tesu::MsgMan::DiagnosticLevel>(diagLevel);
            Tesu::MsgMan* previous = manager;
            manager = new Tesu::MsgMan(level);
            managerLevel = diagLevel;
            delete previous;
        }
        const auto debug = debugLevel < Tesu::DebugMessenger::DEBUG_OFF
                               ? Tesu::DebugMessenger::DEBUG_OFF
                               : static_cast<Tesu::DebugMessenger::DebugLevel>(debugLevel);
        Tesu::DebugMessengerFactory::GetLogger()->SetLevel(debug);
    } catch (...) {
        // Nothing may unwind into the JVM; without a manager the texts are simply not shown.
    }
}
