// The replacement operators, in a translation unit of their own so that no caller sees their
// bodies (a free() inlined next to a new-expression reads to the compiler as a mismatch).
#include "FailingAllocator.h"

#include <cstdlib>
#include <new>

namespace {

struct State {
  std::size_t inUse = 0;
  std::size_t countdown = 0;  // while non-zero, the allocation that brings it to 0 fails
  bool reached = false;
};

State& Allocations() {
  static State state;
  return state;
}

}  // namespace

namespace TarvekTest {

void FailAllocation(std::size_t n) {
  Allocations().reached = false;
  Allocations().countdown = n;
}

bool StopFailing() {
  Allocations().countdown = 0;
  return Allocations().reached;
}

std::size_t BlocksInUse() { return Allocations().inUse; }

}  // namespace TarvekTest

void* operator new(std::size_t size) {
  State& state = Allocations();
  if (state.countdown != 0 && --state.countdown == 0) {
    state.reached = true;
    throw std::bad_alloc();
  }
  void* block = std::malloc(size == 0 ? 1 : size);
  if (block == nullptr) throw std::bad_alloc();
  ++state.inUse;
  return block;
}

void operator delete(void* block) noexcept {
  if (block == nullptr) return;
  --Allocations().inUse;
  std::free(block);
}

void* operator new[](std::size_t size) { return operator new(size); }
void operator delete[](void* block) noexcept { operator delete(block); }
void operator delete(void* block, std::size_t) noexcept { operator delete(block); }
void operator delete[](void* block, std::size_t) noexcept { operator delete(block); }

void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
  try {
    return operator new(size);
  } catch (const std::bad_alloc&) {
    return nullptr;
  }
}
void* operator new[](std::size_t size, const std::nothrow_t&) noexcept {
  return operator new(size, std::nothrow);
}
void operator delete(void* block, const std::nothrow_t&) noexcept { operator delete(block); }
void operator delete[](void* block, const std::nothrow_t&) noexcept { operator delete(block); }
