// Symbol visibility of the configuration interface library (Tarvek::ConfInterfaces).
#ifndef TARVEK_CONF_INTERFACES_EXPORT_H_
#define TARVEK_CONF_INTERFACES_EXPORT_H_

#include <Tarvek/Core/Interfaces/Export.h>

#if defined(TARVEK_CONF_INTERFACES_BUILDING)
#define TARVEK_CONF_INTERFACES_API TARVEK_DECL_EXPORT
#else
#define TARVEK_CONF_INTERFACES_API TARVEK_DECL_IMPORT
#endif

#endif  // TARVEK_CONF_INTERFACES_EXPORT_H_
