// Symbol visibility of the FFmpeg bridge library (Tarvek::FFmpeg).
#ifndef TARVEK_FFMPEG_EXPORT_H_
#define TARVEK_FFMPEG_EXPORT_H_

#include <Tarvek/Core/Interfaces/Export.h>

#if defined(TARVEK_FFMPEG_BUILDING)
#define TARVEK_FFMPEG_API TARVEK_DECL_EXPORT
#else
#define TARVEK_FFMPEG_API TARVEK_DECL_IMPORT
#endif

#endif  // TARVEK_FFMPEG_EXPORT_H_
