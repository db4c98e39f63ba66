// The JNI as the bridge and its tests use it; not installed. With TESU_HAVE_JNI_H (the build
// found a JDK) this is the JDK's jni.h. Without it, the library declares the few types and
// calls the bridge makes itself, as the JDK's jni.h declares them: a library built either way
// is the same to a JVM. The function table is the JVM's; only its two string entries are
// declared, at the indexes the JNI fixes for them (GetStringUTFChars 169,
// ReleaseStringUTFChars 170, after four reserved entries and the 165 calls in between).
#ifndef TESU_JNI_H
#define TESU_JNI_H

#include "Tesu_Tessel2MessageCatcher.h"

#if defined(TESU_HAVE_JNI_H)
#include <jni.h>
#else

#ifndef JNICALL
#define JNICALL TESU_JNI_CALL
#endif
#ifndef JNIEXPORT
#define JNIEXPORT TESU_JNI_EXPORT
#endif

typedef unsigned char jboolean;

class _jobject {};
class _jstring : public _jobject {};

struct JNINativeInterface_ {
    void* reserved0;
    void* reserved1;
    void* reserved2;
    void* reserved3;
    void* notDeclared[165];  // GetVersion (4) to GetStringUTFLength (168)
    const char*(JNICALL* GetStringUTFChars)(JNIEnv* env, jstring str, jboolean* isCopy);
    void(JNICALL* ReleaseStringUTFChars)(JNIEnv* env, jstring str, const char* chars);
    // The entries after these are not declared: the bridge reads none of them.
};

struct JNIEnv_ {
    const JNINativeInterface_* functions;

    const char* GetStringUTFChars(jstring str, jboolean* isCopy) {
        return functions->GetStringUTFChars(this, str, isCopy);
    }
    void ReleaseStringUTFChars(jstring str, const char* chars) {
        functions->ReleaseStringUTFChars(this, str, chars);
    }
};

#endif  // TESU_HAVE_JNI_H

#endif
