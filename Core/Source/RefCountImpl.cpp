// The core property library: reference counting.
#include <Tarvek/Core/Interfaces/IRefCountable.h>
#include <Tarvek/Core/Interfaces/RefCountImpl.h>

namespace Tarvek {

RefCountImpl::RefCountImpl() noexcept : count_(0) {}
RefCountImpl::RefCountImpl(const RefCountImpl&) noexcept : count_(0) {}
RefCountImpl& RefCountImpl::operator=(const RefCountImpl&) noexcept { return *this; }
RefCountImpl::~RefCountImpl() = default;

int RefCountImpl::AddRefImpl() const noexcept {
  // A new reference is always made from an existing one, so no ordering is needed here.
  return count_.fetch_add(1, std::memory_order_relaxed) + 1;
}

int RefCountImpl::ReleaseImpl() const noexcept {
  // Release our writes to the object; the holder that reaches zero acquires everyone's before
  // it destroys the object. One acq_rel decrement rather than a release decrement and an
  // acquire fence: the same guarantee, in a form ThreadSanitizer can check (it does not model
  // standalone fences).
  return count_.fetch_sub(1, std::memory_order_acq_rel) - 1;
}

int RefCountImpl::GetRefCountImpl() const noexcept {
  return count_.load(std::memory_order_acquire);
}

void intrusive_ptr_add_ref(const IRefCountable* object) { object->AddRef(); }

void intrusive_ptr_release(const IRefCountable* object) { object->Release(); }

}  // namespace Tarvek
