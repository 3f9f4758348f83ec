#pragma once
// Marks the library's three entry points; everything else the library defines stays hidden.

#if defined(_WIN32)
#if defined(ZEL_STATIC) && !defined(ZEL_BUILDING_LIBRARY)
#define ZEL_API
#elif defined(ZEL_BUILDING_LIBRARY)
#define ZEL_API __declspec(dllexport)
#else
#define ZEL_API __declspec(dllimport)
#endif
#else
#define ZEL_API __attribute__((visibility("default")))
#endif
