// Symbol visibility for the Tarvek libraries.
//
// Every library is built with hidden symbols by default and marks what it exports. Types whose
// identity must be shared across library boundaries (interfaces and exception classes, for
// dynamic_cast and catch) are marked with TARVEK_VISIBLE_TYPE even when they are header-only.
#ifndef TARVEK_CORE_INTERFACES_EXPORT_H_
#define TARVEK_CORE_INTERFACES_EXPORT_H_

#if defined(_WIN32)
#define TARVEK_DECL_EXPORT __declspec(dllexport)
#define TARVEK_DECL_IMPORT __declspec(dllimport)
#define TARVEK_VISIBLE_TYPE
#else
#define TARVEK_DECL_EXPORT __attribute__((visibility("default")))
#define TARVEK_DECL_IMPORT __attribute__((visibility("default")))
#define TARVEK_VISIBLE_TYPE __attribute__((visibility("default")))
#endif

// Core property library (Tarvek::Core).
#if defined(TARVEK_CORE_BUILDING)
#define TARVEK_CORE_API TARVEK_DECL_EXPORT
#else
#define TARVEK_CORE_API TARVEK_DECL_IMPORT
#endif

// Configuration interface library: key texts (Tarvek::ConfInterfaces).
#if defined(TARVEK_CONF_INTERFACES_BUILDING)
#define TARVEK_CONF_INTERFACES_API TARVEK_DECL_EXPORT
#else
#define TARVEK_CONF_INTERFACES_API TARVEK_DECL_IMPORT
#endif

// Media wrapper library: rational arithmetic (Tarvek::MediaWrapper).
#if defined(TARVEK_MEDIA_WRAPPER_BUILDING)
#define TARVEK_MEDIA_WRAPPER_API TARVEK_DECL_EXPORT
#else
#define TARVEK_MEDIA_WRAPPER_API TARVEK_DECL_IMPORT
#endif

// Presets library: bitrate look-ups by codec (Tarvek::Presets).
#if defined(TARVEK_PRESETS_BUILDING)
#define TARVEK_PRESETS_API TARVEK_DECL_EXPORT
#else
#define TARVEK_PRESETS_API TARVEK_DECL_IMPORT
#endif

// Format description library (Tarvek::Formats).
#if defined(TARVEK_FORMATS_BUILDING)
#define TARVEK_FORMATS_API TARVEK_DECL_EXPORT
#else
#define TARVEK_FORMATS_API TARVEK_DECL_IMPORT
#endif

// Inspection library: differences, validation and the JSON form of descriptions
// (Tarvek::Inspect).
#if defined(TARVEK_INSPECT_BUILDING)
#define TARVEK_INSPECT_API TARVEK_DECL_EXPORT
#else
#define TARVEK_INSPECT_API TARVEK_DECL_IMPORT
#endif

#endif  // TARVEK_CORE_INTERFACES_EXPORT_H_
