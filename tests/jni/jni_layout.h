// Where one set of JNI declarations puts what the bridge uses: byte offsets in the function
// table and in JNIEnv, and type sizes. jni_layout_jdk.cpp measures the JDK's jni.h,
// jni_layout_own.cpp the library's own declarations.
#ifndef TESU_JNI_LAYOUT_H
#define TESU_JNI_LAYOUT_H

#include <cstddef>

struct JniLayout {
    std::size_t getStringUTFChars;
    std::size_t releaseStringUTFChars;
    std::size_t envFunctions;
    std::size_t envSize;
    std::size_t jbooleanSize;
    std::size_t jobjectSize;
};

JniLayout jdkJniLayout();
JniLayout ownJniLayout();

#endif
