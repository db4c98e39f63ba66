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

// The JNI types the declarations use, declared here as the JDK's jni.h declares them, so that
// this header needs no jni.h and a source may include both, in either order (in C, including
// jni.h after this header needs C11, which allows a typedef to be repeated).
#ifdef __cplusplus
class _jobject;
class _jstring;
struct JNIEnv_;
typedef _jobject* jobject;
typedef _jstring* jstring;
typedef JNIEnv_ JNIEnv;
#elif !defined(_JAVASOFT_JNI_H_)
struct _jobject;
typedef struct _jobject* jobject;
typedef jobject jstring;
struct JNINativeInterface_;
typedef const struct JNINativeInterface_* JNIEnv;
#endif

// JNI's calling convention (stdcall on Windows) and the export mark of the four functions.
// The 32-bit DLL exports them through its module-definition file instead, under the names a
// JVM looks up (TESU_JNI_EXPORTS_BY_DEF), so they carry no mark there.
#if defined(_WIN32)
#define TESU_JNI_CALL __stdcall
#if defined(TESU_BUILDING_LIBRARY) && !defined(TESU_JNI_EXPORTS_BY_DEF)
#define TESU_JNI_EXPORT __declspec(dllexport)
#else
#define TESU_JNI_EXPORT
#endif
#else
#define TESU_JNI_CALL
#define TESU_JNI_EXPORT __attribute__((visibility("default")))
#endif

#ifdef __cplusplus
extern "C" {
#endif

TESU_JNI_EXPORT void TESU_JNI_CALL
Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputInfoMessageN(JNIEnv* env,
                                                                          jobject receiver,
                                                                          jstring text);
TESU_JNI_EXPORT void TESU_JNI_CALL
Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputWarningMessageN(JNIEnv* env,
                                                                             jobject receiver,
                                                                             jstring text);
TESU_JNI_EXPORT void TESU_JNI_CALL
Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputErrorMessageN(JNIEnv* env,
                                                                           jobject receiver,
                                                                           jstring text);
TESU_JNI_EXPORT void TESU_JNI_CALL
Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputDebugMessageN(JNIEnv* env,
                                                                           jobject receiver,
                                                                           jstring text);

#ifdef __cplusplus
}
#endif

#endif
