// Tarvek::RefCountImpl: the thread-safe counter that implementations of IRefCountable embed.
#ifndef TARVEK_CORE_INTERFACES_REFCOUNTIMPL_H_
#define TARVEK_CORE_INTERFACES_REFCOUNTIMPL_H_

#include <atomic>

#include "Export.h"

namespace Tarvek {

/// An atomic reference count that starts at 0. Copying an object does not copy its references,
/// so a copied counter starts at 0 as well and assignment leaves the target's count alone.
/// The owner decides what to do when ReleaseImpl() returns 0 (normally: delete itself).
class TARVEK_CORE_API RefCountImpl {
 public:
  RefCountImpl() noexcept;
  RefCountImpl(const RefCountImpl&) noexcept;
  RefCountImpl& operator=(const RefCountImpl&) noexcept;
  ~RefCountImpl();

  /// Increments; returns the new count.
  int AddRefImpl() const noexcept;
  /// Decrements; returns the count left. The decrement that returns 0 happens after every
  /// earlier write of other holders is visible, so the caller may then destroy the object.
  int ReleaseImpl() const noexcept;
  /// Returns the current count.
  int GetRefCountImpl() const noexcept;

 private:
  mutable std::atomic<int> count_;
};

}  // namespace Tarvek

#endif  // TARVEK_CORE_INTERFACES_REFCOUNTIMPL_H_
