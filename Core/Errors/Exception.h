// Tarvek::Exception, the root of every error the Tarvek libraries throw, and the error-info items
// that any of them may carry.
//
// Errors carry no message of their own: what went wrong travels as Boost.Exception error-info
// items. Read one with boost::get_error_info<Tarvek::DescriptionInfo>(e), or print all of them,
// with the throw location, through boost::diagnostic_information(e). what() never contains them.
#ifndef TARVEK_CORE_ERRORS_EXCEPTION_H_
#define TARVEK_CORE_ERRORS_EXCEPTION_H_

#include <boost/exception/error_info.hpp>
#include <boost/exception/exception.hpp>
#include <boost/exception/info.hpp>
#include <exception>
#include <string>

#include "../Interfaces/Export.h"

namespace Tarvek {

/// Tag of the call stack captured where the error was built (text of Tarvek::GetCallStack()).
struct TagCallStack;
/// Tag of a fixed sentence describing the error, chosen by the throw site.
struct TagDescription;

/// The call stack item; present on every error thrown by the Tarvek libraries.
using CallStackInfo = boost::error_info<TagCallStack, std::string>;
/// The description item.
using DescriptionInfo = boost::error_info<TagDescription, std::string>;

/// Root of all Tarvek errors. Catch it to handle any of them.
class TARVEK_VISIBLE_TYPE Exception : public virtual std::exception,
                                      public virtual boost::exception {
 public:
  ~Exception() noexcept override {}
};

}  // namespace Tarvek

#endif  // TARVEK_CORE_ERRORS_EXCEPTION_H_
