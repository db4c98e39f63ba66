// A library built without a JDK must look to a JVM exactly like one built with the JDK's
// jni.h: the string calls read from the same places of the function table, and the types the
// methods take have the same sizes.
#include <gtest/gtest.h>

#include <cstddef>

#include "jni_layout.h"

namespace {

TEST(JniDeclarations, OwnDeclarationsMatchTheJdkHeader) {
    const JniLayout jdk = jdkJniLayout();
    const JniLayout own = ownJniLayout();
    const struct {
        const char* what;
        std::size_t jdk;
        std::size_t own;
    } cases[] = {
        {"offset of GetStringUTFChars", jdk.getStringUTFChars, own.getStringUTFChars},
        {"offset of ReleaseStringUTFChars", jdk.releaseStringUTFChars, own.releaseStringUTFChars},
        {"offset of JNIEnv::functions", jdk.envFunctions, own.envFunctions},
        {"size of JNIEnv", jdk.envSize, own.envSize},
        {"size of jboolean", jdk.jbooleanSize, own.jbooleanSize},
        {"size of jobject", jdk.jobjectSize, own.jobjectSize},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(c.jdk, c.own) << c.what;
    }
}

}  // namespace
