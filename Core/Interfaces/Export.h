// Symbol visibility of the core property library, and the building blocks every Tarvek library's
// own export header uses.
//
// Shared libraries are built with hidden symbols and export what they mark. Types whose identity
// must be shared across library boundaries (interfaces and exception classes, for dynamic_cast and
// catch) are marked with TARVEK_VISIBLE_TYPE even when they are header-only. A static build defines
// TARVEK_STATIC for itself and its users, which leaves the marks empty.
#ifndef TARVEK_CORE_INTERFACES_EXPORT_H_
#define TARVEK_CORE_INTERFACES_EXPORT_H_

#if defined(TARVEK_STATIC)
#define TARVEK_DECL_EXPORT
#define TARVEK_DECL_IMPORT
#define TARVEK_VISIBLE_TYPE
#elif defined(_WIN32)
#define TARVEK_DECL_EXPORT __declspec(dllexport)
#define TARVEK_DECL_IMPORT __declspec(dllimport)
#define TARVEK_VISIBLE_TYPE
#else
#define TARVEK_DECL_EXPORT __attribute__((visibility("default")))
#define TARVEK_DECL_IMPORT __attribute__((visibility("default")))
#define TARVEK_VISIBLE_TYPE __attribute__((visibility("default")))
#endif

#if defined(TARVEK_CORE_BUILDING)
#define TARVEK_CORE_API TARVEK_DECL_EXPORT
#else
#define TARVEK_CORE_API TARVEK_DECL_IMPORT
#endif

#endif  // TARVEK_CORE_INTERFACES_EXPORT_H_
