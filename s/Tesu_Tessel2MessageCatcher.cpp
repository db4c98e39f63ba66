#include "Tesu_Tessel2MessageCatcher.h"

#include "Tesu_Jni.h"

#include "Port_Init.h"
#include "Port_Msg.h"
#include "Port_String.h"
#include "Tesu_DebugMessenger.h"
#include "Tesu_Export.h"

TESU_MODULE_PORTABILITY_INIT("Tesu_Tessel2MessageCatcher")

namespace {

const char* const kApplication = "tesutil";
const char* const kSource = "../s/Tesu_Tessel2MessageCatcher";
const char* const kRevision = "$Revision: 1.10 $";

// Borrows the Java string's modified UTF-8 bytes, hands them to `use`, and gives them back.
// The release is the last step on every path, also when `use` throws: the exception is
// stopped here, because nothing may unwind into the Java VM's frames. Nothing is borrowed or
// released for a null string, and nothing is released when borrowing fails (the JVM then has
// an OutOfMemoryError pending, which the Java caller receives on return).
template <typename Use>
void withJavaText(JNIEnv* env, jstring text, Use use) noexcept {
    if (env == nullptr || text == nullptr) {
        return;
    }
    const char* bytes = env->GetStringUTFChars(text, nullptr);
    if (bytes == nullptr) {
        return;
    }
    try {
        use(bytes);
    } catch (...) {
        // The text is dropped. A Java exception would make a failed log line abort the Java
        // caller's work, which these fire-and-forget methods must not do.
    }
    env->ReleaseStringUTFChars(text, bytes);
}

}  // namespace

extern "C" {

TESU_JNI_EXPORT void TESU_JNI_CALL
Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputInfoMessageN(JNIEnv* env,
                                                                          jobject /*receiver*/,
                                                                          jstring text) {
    withJavaText(env, text, [](const char* bytes) {
        Port_MsgManData::createObject(kApplication, kSource, __LINE__, kRevision)
            .issueStatus(Port::StringBase<char>(bytes));
    });
}

TESU_JNI_EXPORT void TESU_JNI_CALL
Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputWarningMessageN(JNIEnv* env,
                                                                             jobject /*receiver*/,
                                                                             jstring text) {
    withJavaText(env, text, [](const char* bytes) {
        Port_MsgManData::createObject(kApplication, kSource, __LINE__, kRevision)
            .issueWarning(Port::StringBase<char>(bytes));
    });
}

TESU_JNI_EXPORT void TESU_JNI_CALL
Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputErrorMessageN(JNIEnv* env,
                                                                           jobject /*receiver*/,
                                                                           jstring text) {
    withJavaText(env, text, [](const char* bytes) {
        Port_MsgManData::createObject(kApplication, kSource, __LINE__, kRevision)
            .issueError(Port::StringBase<char>(bytes));
    });
}

TESU_JNI_EXPORT void TESU_JNI_CALL
Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputDebugMessageN(JNIEnv* env,
                                                                           jobject /*receiver*/,
                                                                           jstring text) {
    withJavaText(env, text, [](const char* bytes) {
        // Looked up on every call: the registry is the one place that knows the logger.
        Tesu::DebugMessenger* logger =
            Tesu::DebugMessengerFactory::GetLogger(Port::StringBase<char>("javavm"));
        logger->Normal(Port::StringBase<char>(bytes));
    });
}

}  // extern "C"
