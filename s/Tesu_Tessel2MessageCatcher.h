// The native methods of the Java class com.quarnel.tesutil.tessel2.Tessel2MessageCatcher.
//
// Each borrows the Java string's modified UTF-8 bytes (GetStringUTFChars with a null copy
// flag), hands them on verbatim (info, warning and error texts as status, warning and error
// messages of application "tesutil"; debug texts to the registry's logger "javavm" at normal
// level, which writes them only when its effective level allows), and releases the bytes as
// its last step, on every path. The texts are never used as formats.
//
// Failures: nothing is reported back to Java. A null string returns at once without touching
// the JNI, the message system or the logger. When GetStringUTFChars returns null (the JVM then
// has an OutOfMemoryError pending) the method returns at once, releases nothing, and leaves
// that exception for the Java caller. No C++ exception crosses into the Java VM: one thrown by
// the message system or the logger is caught after the issue attempt, the text is dropped, the
// bytes are still released, and no Java exception is raised (a failed log line must not abort
// the Java caller's work).
//
// Each call runs on the calling Java thread; the bridge keeps no state.
#ifndef TESU_TESSEL2MESSAGECATCHER_H
#define TESU_TESSEL2MESSAGECATCHER_H

#include <jni.h>

#ifdef __cplusplus
extern "C" {
#endif

JNIEXPORT void JNICALL Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputInfoMessageN(
    JNIEnv* env, jobject receiver, jstring text);
JNIEXPORT void JNICALL Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputWarningMessageN(
    JNIEnv* env, jobject receiver, jstring text);
JNIEXPORT void JNICALL Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputErrorMessageN(
    JNIEnv* env, jobject receiver, jstring text);
JNIEXPORT void JNICALL Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputDebugMessageN(
    JNIEnv* env, jobject receiver, jstring text);

#ifdef __cplusplus
}
#endif

#endif
