/* Machine-dependent JNI definitions for Windows, used with the JDK's own jni.h when the
 * library is built for Windows on a machine whose JDK ships only its native platform's
 * version of this header. The values are those of the JNI on Windows: the calling convention
 * is stdcall (on 64-bit Windows the compiler treats it as the one convention there is), jint
 * is 32 bits (long is 32 bits on Windows), jlong 64.
 *
 * TESU_JNI_EXPORTS_BY_DEF: the 32-bit library names its JNI functions in a module-definition
 * file instead (MinGW's dllexport would give them a name no JVM looks up), so the functions
 * themselves are not marked for export. */
#ifndef TESU_JNI_WINDOWS_JNI_MD_H
#define TESU_JNI_WINDOWS_JNI_MD_H

#if defined(TESU_JNI_EXPORTS_BY_DEF)
#define JNIEXPORT
#else
#define JNIEXPORT __declspec(dllexport)
#endif
#define JNIIMPORT __declspec(dllimport)
#define JNICALL __stdcall

typedef long jint;
typedef long long jlong;
typedef signed char jbyte;

#endif
