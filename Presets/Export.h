// Symbol visibility of the presets library (Tarvek::Presets).
#ifndef TARVEK_PRESETS_EXPORT_H_
#define TARVEK_PRESETS_EXPORT_H_

#include <Tarvek/Core/Interfaces/Export.h>

#if defined(TARVEK_PRESETS_BUILDING)
#define TARVEK_PRESETS_API TARVEK_DECL_EXPORT
#else
#define TARVEK_PRESETS_API TARVEK_DECL_IMPORT
#endif

#endif  // TARVEK_PRESETS_EXPORT_H_
