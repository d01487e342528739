// The core property library: call-stack capture for error reports.
#include <boost/stacktrace.hpp>

#include <Tarvek/Core/Interfaces/CallStack.h>

namespace Tarvek {

std::string GetCallStack() {
  // Skip this function's own frame; the caller is the first frame a reader cares about.
  return boost::stacktrace::to_string(boost::stacktrace::stacktrace(1, 128));
}

}  // namespace Tarvek
