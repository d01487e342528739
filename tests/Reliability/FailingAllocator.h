// A counting replacement of the global operator new for the allocation-failure tests: it counts
// the blocks in use and, when armed with n, makes the n-th allocation from then on throw
// std::bad_alloc. Not thread-safe: the tests that link it run on one thread.
#ifndef TARVEK_TESTS_RELIABILITY_FAILINGALLOCATOR_H_
#define TARVEK_TESTS_RELIABILITY_FAILINGALLOCATOR_H_

#include <cstddef>

namespace TarvekTest {

/// Makes the n-th allocation from now on fail (n >= 1).
void FailAllocation(std::size_t n);
/// Stops failing allocations; returns whether the armed allocation was reached.
bool StopFailing();
/// The number of blocks allocated through operator new and not yet freed.
std::size_t BlocksInUse();

}  // namespace TarvekTest

#endif  // TARVEK_TESTS_RELIABILITY_FAILINGALLOCATOR_H_
