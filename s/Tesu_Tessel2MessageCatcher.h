// The native methods of the Java class com.quarnel.tesutil.tessel2.Tessel2MessageCatcher.
//
// Each borrows the Java string's modified UTF-8 bytes, hands them on verbatim (info, warning
// and error texts as status, warning and error messages; debug texts to the logger "javavm"
// at normal level) and releases the bytes. A null string, or bytes that cannot be borrowed,
// returns at once and touches nothing. No C++ exception crosses into the Java VM.
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
