// Compiled without TESU_HAVE_JNI_H: Tesu_Jni.h declares the JNI itself here.
#include <cstddef>

#include "Tesu_Jni.h"
#include "jni_layout.h"

#if defined(_JAVASOFT_JNI_H_)
#error "this source must see the library's own declarations"
#endif

JniLayout ownJniLayout() {
    return {offsetof(JNINativeInterface_, GetStringUTFChars),
            offsetof(JNINativeInterface_, ReleaseStringUTFChars),
            offsetof(JNIEnv, functions),
            sizeof(JNIEnv),
            sizeof(jboolean),
            sizeof(jobject)};
}
