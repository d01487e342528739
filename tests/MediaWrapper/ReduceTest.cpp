// Ratio reduction: lowest terms, signs, zeros and the extremes of the 64-bit range.
#include <gtest/gtest.h>

#include <climits>
#include <utility>

#include <Tarvek/MediaWrapper/Reduce.h>

namespace {

TEST(ReduceTest, GivesLowestTermsInPlace) {
  using Ratio = std::pair<long long, long long>;
  const std::pair<Ratio, Ratio> cases[] = {
      {{16, 9}, {16, 9}},                                            // already lowest
      {{720LL * 64, 576LL * 45}, {16, 9}},                           // PAL wide
      {{1920, 1080}, {16, 9}},                                       // square-pixel HD
      {{5, 5}, {1, 1}},                                              // equal
      {{4294967291LL, 4294967279LL}, {4294967291LL, 4294967279LL}},  // large coprimes
      {{0, 12}, {0, 1}},                                             // zero numerator
      {{12, 0}, {1, 0}},                                             // zero denominator
      {{0, 0}, {0, 0}},                                              // both zero
      {{-4, 6}, {-2, 3}},                                            // the sign stays where it was
      {{-4, -6}, {-2, -3}},                                          // both negative
      {{LLONG_MIN, 2}, {LLONG_MIN / 2, 1}},                          // the minimum value
      {{LLONG_MIN, LLONG_MIN}, {-1, -1}},                            // the minimum with itself
      {{LLONG_MAX, LLONG_MAX}, {1, 1}},                              // the maximum
  };
  for (const auto& [given, expected] : cases) {
    Ratio reduced = given;
    Tarvek::Media::reduce(reduced.first, reduced.second);
    EXPECT_EQ(reduced, expected) << given.first << ":" << given.second;
  }
}

}  // namespace
