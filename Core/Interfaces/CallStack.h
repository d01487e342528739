// Tarvek::GetCallStack: a readable description of the calling thread's stack, attached to every
// error the Tarvek libraries throw.
#ifndef TARVEK_CORE_INTERFACES_CALLSTACK_H_
#define TARVEK_CORE_INTERFACES_CALLSTACK_H_

#include <string>

#include "Export.h"

namespace Tarvek {

/// Returns the call stack of the calling thread, one frame a line, innermost first, starting at
/// the caller of GetCallStack(). Frames show the function and, where debug information allows,
/// the source file and line. Throws std::bad_alloc when memory runs out.
TARVEK_CORE_API std::string GetCallStack();

}  // namespace Tarvek

#endif  // TARVEK_CORE_INTERFACES_CALLSTACK_H_
