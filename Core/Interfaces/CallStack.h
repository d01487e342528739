// Tarvek::GetCallStack: a readable description of the calling thread's stack, attached to every
// error the Tarvek libraries throw.
#ifndef TARVEK_CORE_INTERFACES_CALLSTACK_H_
#define TARVEK_CORE_INTERFACES_CALLSTACK_H_

#include <string>

#include "Export.h"

namespace Tarvek {

/// Returns the call stack of the calling thread, one frame a line, innermost first, starting at
/// the caller of GetCallStack(): "N# function+0x1c in libmodule.so.0+0x1f3a". The function is
/// named where a shared library exports it, else shown as "??"; the module and the offset of the
/// call in it are there for `addr2line -f -C -e <module> <offset>`, and "<program>" stands for
/// the program itself. No debug information is read, so a call costs microseconds. Throws
/// std::bad_alloc when memory runs out.
TARVEK_CORE_API std::string GetCallStack();

}  // namespace Tarvek

#endif  // TARVEK_CORE_INTERFACES_CALLSTACK_H_
