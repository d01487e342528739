// Symbol visibility of the format description library (Tarvek::Formats).
#ifndef TARVEK_CONF_FORMATS_EXPORT_H_
#define TARVEK_CONF_FORMATS_EXPORT_H_

#include <Tarvek/Core/Interfaces/Export.h>

#if defined(TARVEK_FORMATS_BUILDING)
#define TARVEK_FORMATS_API TARVEK_DECL_EXPORT
#else
#define TARVEK_FORMATS_API TARVEK_DECL_IMPORT
#endif

#endif  // TARVEK_CONF_FORMATS_EXPORT_H_
