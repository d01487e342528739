// Symbol visibility of the codec string library (Tarvek::CodecString): TARVEK_CODEC_STRING_API
// marks what it exports; the build of the library itself defines TARVEK_CODEC_STRING_BUILDING.
#ifndef TARVEK_CODECSTRING_EXPORT_H_
#define TARVEK_CODECSTRING_EXPORT_H_

#include <Tarvek/Core/Interfaces/Export.h>

#if defined(TARVEK_CODEC_STRING_BUILDING)
#define TARVEK_CODEC_STRING_API TARVEK_DECL_EXPORT
#else
#define TARVEK_CODEC_STRING_API TARVEK_DECL_IMPORT
#endif

#endif  // TARVEK_CODECSTRING_EXPORT_H_
