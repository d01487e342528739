// Symbol visibility of the inspection library (Tarvek::Inspect).
#ifndef TARVEK_INSPECT_EXPORT_H_
#define TARVEK_INSPECT_EXPORT_H_

#include <Tarvek/Core/Interfaces/Export.h>

#if defined(TARVEK_INSPECT_BUILDING)
#define TARVEK_INSPECT_API TARVEK_DECL_EXPORT
#else
#define TARVEK_INSPECT_API TARVEK_DECL_IMPORT
#endif

#endif  // TARVEK_INSPECT_EXPORT_H_
