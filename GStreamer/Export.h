// Symbol visibility of the GStreamer bridge (Tarvek::GStreamer): TARVEK_GSTREAMER_API marks what
// it exports; the build of the library itself defines TARVEK_GSTREAMER_BUILDING.
#ifndef TARVEK_GSTREAMER_EXPORT_H_
#define TARVEK_GSTREAMER_EXPORT_H_

#include <Tarvek/Core/Interfaces/Export.h>

#if defined(TARVEK_GSTREAMER_BUILDING)
#define TARVEK_GSTREAMER_API TARVEK_DECL_EXPORT
#else
#define TARVEK_GSTREAMER_API TARVEK_DECL_IMPORT
#endif

#endif  // TARVEK_GSTREAMER_EXPORT_H_
