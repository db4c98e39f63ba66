// Export macro of the portability layer (libPortability).
#ifndef PORT_EXPORT_H
#define PORT_EXPORT_H

#if defined(_WIN32)
#if defined(PORT_BUILDING_LIBRARY)
#define PORT_API __declspec(dllexport)
#else
#define PORT_API __declspec(dllimport)
#endif
#else
#define PORT_API __attribute__((visibility("default")))
#endif

// printf-style checking of format strings. Index counts the implicit `this` of members.
#if defined(__GNUC__) || defined(__clang__)
#if defined(__MINGW32__)
#define PORT_PRINTF(fmtIndex, firstArg) __attribute__((format(gnu_printf, fmtIndex, firstArg)))
#else
#define PORT_PRINTF(fmtIndex, firstArg) __attribute__((format(printf, fmtIndex, firstArg)))
#endif
#else
#define PORT_PRINTF(fmtIndex, firstArg)
#endif

#endif
