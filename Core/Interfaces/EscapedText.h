// Tarvek::Core::AppendEscaped: a text made safe to print on one line with an unambiguous extent,
// as PrintPropertyValue prints names and string values.
#ifndef TARVEK_CORE_INTERFACES_ESCAPEDTEXT_H_
#define TARVEK_CORE_INTERFACES_ESCAPEDTEXT_H_

#include <string>

#include "Export.h"

namespace Tarvek {
namespace Core {

/// Appends `text` to `out` with double quotes and backslashes escaped by a backslash, newline,
/// carriage return and tab as \n, \r and \t, and other control bytes as \xHH; every other byte
/// (UTF-8 included) unchanged. Throws std::bad_alloc when `out` cannot grow.
TARVEK_CORE_API void AppendEscaped(std::string& out, const std::string& text);

}  // namespace Core
}  // namespace Tarvek

#endif  // TARVEK_CORE_INTERFACES_ESCAPEDTEXT_H_
