// Tarvek::PropertyTypes: the type tag of a Tarvek::Core::Property node.
#ifndef TARVEK_CORE_INTERFACES_PROPERTYTYPES_H_
#define TARVEK_CORE_INTERFACES_PROPERTYTYPES_H_

#include "Export.h"

namespace Tarvek {

/// What a property node holds. Unscoped on purpose: an error-info item of this type renders as
/// its decimal value. The values are part of the binary interface; 0, 4 and 5 are unused.
enum PropertyTypes {
  PropertyTypeBool = 1,       ///< a bool leaf
  PropertyTypeInt64 = 2,      ///< a 64-bit signed integer leaf
  PropertyTypeString = 3,     ///< a string leaf (any bytes, NULs included)
  PropertyTypeContainer = 6,  ///< no value; the only type that holds children
};

/// Returns a short lower-case name of the type ("bool", "int64", "string", "container"), or
/// "unknown" for a value that is not an enumerator. Deliberately not an operator<<, so error-info
/// items of this type keep rendering as numbers.
TARVEK_CORE_API const char* PropertyTypeName(PropertyTypes type) noexcept;

}  // namespace Tarvek

#endif  // TARVEK_CORE_INTERFACES_PROPERTYTYPES_H_
