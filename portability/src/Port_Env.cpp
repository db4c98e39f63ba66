// Port_Env: the platform the layer was built for, as the compiler reports it.
#include "Port_Env.h"

namespace {

#if defined(_WIN32)
constexpr const char* kSystem = "windows-";
#else
constexpr const char* kSystem = "linux-";
#endif

#if defined(__x86_64__) || defined(_M_X64) || defined(_M_AMD64)
constexpr const char* kProcessor = "x86_64";
#elif defined(__aarch64__) || defined(_M_ARM64)
constexpr const char* kProcessor = "aarch64";
#elif defined(__i386__) || defined(_M_IX86)
constexpr const char* kProcessor = "x86";
#elif defined(__arm__) || defined(_M_ARM)
constexpr const char* kProcessor = "arm";
#elif defined(__riscv) && defined(__LP64__)
constexpr const char* kProcessor = "riscv64";
#elif defined(__powerpc64__) && defined(__LITTLE_ENDIAN__)
constexpr const char* kProcessor = "ppc64le";
#elif defined(__powerpc64__)
constexpr const char* kProcessor = "ppc64";
#elif defined(__s390x__)
constexpr const char* kProcessor = "s390x";
#else
constexpr const char* kProcessor = "unknown";
#endif

}  // namespace

bool Port_Env::IsNt() {
#if defined(_WIN32)
    return true;
#else
    return false;
#endif
}

Port::StringBase<char> Port_Env::GetPlatformPath() {
    Port::StringBase<char> name(kSystem);
    name.Append(kProcessor);
    return name;
}
