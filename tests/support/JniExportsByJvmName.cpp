// On 32-bit Windows the library exports its JNI methods only under the names a JVM looks up
// ("_name@12", and the plain name), which no import library links to. For test programs that
// call the methods directly, these definitions forward each call to the export a 32-bit JVM
// finds first. Built for 32-bit Windows only; elsewhere programs link to the functions.
#if defined(_WIN32) && defined(__i386__)

#include <windows.h>

#include "Tesu_Jni.h"
#include "Tesu_Tessel2MessageCatcher.h"

namespace {

using Method = void(JNICALL*)(JNIEnv*, jobject, jstring);

Method Find(const char* name) {
    const HMODULE library = ::GetModuleHandleA("libTesu_Utilities.dll");
    return reinterpret_cast<Method>(reinterpret_cast<void*>(::GetProcAddress(library, name)));
}

}  // namespace

extern "C" {

JNIEXPORT void JNICALL Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputInfoMessageN(
    JNIEnv* env, jobject receiver, jstring text) {
    static const Method method =
        Find("_Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputInfoMessageN@12");
    method(env, receiver, text);
}

JNIEXPORT void JNICALL Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputWarningMessageN(
    JNIEnv* env, jobject receiver, jstring text) {
    static const Method method =
        Find("_Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputWarningMessageN@12");
    method(env, receiver, text);
}

JNIEXPORT void JNICALL Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputErrorMessageN(
    JNIEnv* env, jobject receiver, jstring text) {
    static const Method method =
        Find("_Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputErrorMessageN@12");
    method(env, receiver, text);
}

JNIEXPORT void JNICALL Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputDebugMessageN(
    JNIEnv* env, jobject receiver, jstring text) {
    static const Method method =
        Find("_Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputDebugMessageN@12");
    method(env, receiver, text);
}

}  // extern "C"

#endif
