// Compiled with TESU_HAVE_JNI_H: Tesu_Jni.h is the JDK's jni.h here.
#include <cstddef>

#include "Tesu_Jni.h"
#include "jni_layout.h"

#if !defined(_JAVASOFT_JNI_H_)
#error "this source must see the JDK's jni.h"
#endif

JniLayout jdkJniLayout() {
    return {offsetof(JNINativeInterface_, GetStringUTFChars),
            offsetof(JNINativeInterface_, ReleaseStringUTFChars),
            offsetof(JNIEnv, functions),
            sizeof(JNIEnv),
            sizeof(jboolean),
            sizeof(jobject)};
}
