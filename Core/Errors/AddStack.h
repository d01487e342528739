// Tarvek::AddStack attaches the current call stack to an error being built, and
// Tarvek::ThrowWithLocation throws it with the location of the throw statement.
//
// A throw site builds and throws its error in one expression:
//   ThrowWithLocation(__LINE__, "Dir/File.cpp", "signature",
//                     AddStack(SomeError() << DescriptionInfo("...")));
#ifndef TARVEK_CORE_ERRORS_ADDSTACK_H_
#define TARVEK_CORE_ERRORS_ADDSTACK_H_

#include <boost/assert/source_location.hpp>
#include <boost/core/enable_if.hpp>
#include <boost/throw_exception.hpp>
#include <boost/type_traits/is_base_of.hpp>

#include "../Interfaces/CallStack.h"
#include "Exception.h"

namespace Tarvek {

/// Attaches Tarvek::GetCallStack() as a CallStackInfo item to `e` and returns `e`. Exists only for
/// classes derived from Tarvek::Exception. Throws what GetCallStack() throws.
template <class E>
typename boost::enable_if<boost::is_base_of<Exception, E>, const E&>::type AddStack(const E& e) {
  e << CallStackInfo(GetCallStack());
  return e;
}

/// Throws a copy of `e` that records `function`, `file` and `line` as its throw location. What
/// propagates is a boost::wrapexcept<E>, which boost::current_exception() can capture. The texts
/// must outlive the exception (string literals).
template <class E>
[[noreturn]] void ThrowWithLocation(int line, const char* file, const char* function, const E& e) {
  boost::throw_exception(
      e, boost::source_location(file, static_cast<boost::uint_least32_t>(line), function));
}

}  // namespace Tarvek

#endif  // TARVEK_CORE_ERRORS_ADDSTACK_H_
