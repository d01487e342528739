// Tarvek::IBlob: a reference-counted, immutable block of bytes, such as a codec's private data,
// and Tarvek::CreateBlob, which makes one.
#ifndef TARVEK_CORE_INTERFACES_IBLOB_H_
#define TARVEK_CORE_INTERFACES_IBLOB_H_

#include <boost/intrusive_ptr.hpp>
#include <cstddef>
#include <cstdint>

#include "Export.h"
#include "IRefCountable.h"

namespace Tarvek {

/// An opaque block of bytes shared by reference. Its content never changes after creation, so
/// any number of threads may read it while they hold references.
class TARVEK_VISIBLE_TYPE IBlob : public virtual IRefCountable {
 public:
  ~IBlob() override {}

  /// The first byte; null when the blob is empty.
  virtual const std::uint8_t* GetData() const = 0;
  /// The number of bytes.
  virtual std::size_t GetSize() const = 0;
};

/// Returns a new blob holding a copy of `size` bytes at `data`, as its only reference.
/// `data` may be null only when `size` is 0. Throws Tarvek::Core::CoreException for a null
/// `data` with a non-zero `size`, std::bad_alloc when memory runs out.
TARVEK_CORE_API boost::intrusive_ptr<IBlob> CreateBlob(const void* data, std::size_t size);

}  // namespace Tarvek

#endif  // TARVEK_CORE_INTERFACES_IBLOB_H_
