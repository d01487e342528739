// Tarvek::IRefCountable: the reference-counting interface of every shared Tarvek object, and the
// hooks that let boost::intrusive_ptr hold such objects.
#ifndef TARVEK_CORE_INTERFACES_IREFCOUNTABLE_H_
#define TARVEK_CORE_INTERFACES_IREFCOUNTABLE_H_

#include "Export.h"

namespace Tarvek {

/// An object that owns itself and is freed by the Release() that drops its count to zero.
/// Hold such objects through boost::intrusive_ptr rather than calling these directly.
class TARVEK_VISIBLE_TYPE IRefCountable {
 public:
  virtual ~IRefCountable() {}

  /// Adds one reference; returns the count after the increment.
  virtual int AddRef() const = 0;
  /// Returns the current count (a snapshot when other threads hold references too).
  virtual int GetRefCount() const = 0;
  /// Drops one reference; returns the count left. At 0 the object has destroyed itself.
  virtual int Release() const = 0;
};

/// boost::intrusive_ptr hook: calls AddRef(). Frees nothing itself.
TARVEK_CORE_API void intrusive_ptr_add_ref(const IRefCountable* object);
/// boost::intrusive_ptr hook: calls Release(), which frees the object at a count of zero.
TARVEK_CORE_API void intrusive_ptr_release(const IRefCountable* object);

}  // namespace Tarvek

#endif  // TARVEK_CORE_INTERFACES_IREFCOUNTABLE_H_
