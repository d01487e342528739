// Tarvek::Conf::ConfException: the error of the format description library, raised when an
// operation is handed a description of the wrong kind.
#ifndef TARVEK_CORE_ERRORS_CONFEXCEPTION_H_
#define TARVEK_CORE_ERRORS_CONFEXCEPTION_H_

#include "Exception.h"

namespace Tarvek {
namespace Conf {

/// A format description that cannot serve the operation (for example an audio description passed
/// to a video bitrate function). Carries a DescriptionInfo item and the call stack.
class TARVEK_VISIBLE_TYPE ConfException : public virtual Tarvek::Exception {
 public:
  ~ConfException() noexcept override {}
};

}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_CORE_ERRORS_CONFEXCEPTION_H_
