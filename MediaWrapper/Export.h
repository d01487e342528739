// Symbol visibility of the media wrapper library (Tarvek::MediaWrapper).
#ifndef TARVEK_MEDIAWRAPPER_EXPORT_H_
#define TARVEK_MEDIAWRAPPER_EXPORT_H_

#include <Tarvek/Core/Interfaces/Export.h>

#if defined(TARVEK_MEDIA_WRAPPER_BUILDING)
#define TARVEK_MEDIA_WRAPPER_API TARVEK_DECL_EXPORT
#else
#define TARVEK_MEDIA_WRAPPER_API TARVEK_DECL_IMPORT
#endif

#endif  // TARVEK_MEDIAWRAPPER_EXPORT_H_
