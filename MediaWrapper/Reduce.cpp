// The media wrapper library: ratio reduction.
#include <Tarvek/MediaWrapper/Reduce.h>

#include <cstdint>
#include <numeric>

namespace Tarvek {
namespace Media {
namespace {

// |value| without overflow: the magnitude of LLONG_MIN is 2^63, which only unsigned can hold.
std::uint64_t Magnitude(long long value) noexcept {
  const auto bits = static_cast<std::uint64_t>(value);
  return value < 0 ? ~bits + 1 : bits;
}

// value / divisor for a divisor of |value|, computed on the magnitude so LLONG_MIN works too.
long long DivideExactly(long long value, std::uint64_t divisor) noexcept {
  const std::uint64_t quotient = Magnitude(value) / divisor;
  return value < 0 ? static_cast<long long>(~quotient + 1) : static_cast<long long>(quotient);
}

}  // namespace

void reduce(long long& x, long long& y) noexcept {
  const std::uint64_t divisor = std::gcd(Magnitude(x), Magnitude(y));
  if (divisor <= 1) return;  // already in lowest terms, or 0:0
  x = DivideExactly(x, divisor);
  y = DivideExactly(y, divisor);
}

}  // namespace Media
}  // namespace Tarvek
