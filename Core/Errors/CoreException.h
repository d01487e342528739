// Tarvek::Core::CoreException: the base of the errors of the core property library.
#ifndef TARVEK_CORE_ERRORS_COREEXCEPTION_H_
#define TARVEK_CORE_ERRORS_COREEXCEPTION_H_

#include "Exception.h"

namespace Tarvek {
namespace Core {

/// Any error of the core property library (property trees, blobs).
class TARVEK_VISIBLE_TYPE CoreException : public virtual Tarvek::Exception {
 public:
  ~CoreException() noexcept override {}
};

}  // namespace Core
}  // namespace Tarvek

#endif  // TARVEK_CORE_ERRORS_COREEXCEPTION_H_
