// Ratio reduction: lowest terms, signs, zeros and the extremes of the 64-bit range.
#include <gtest/gtest.h>

#include <climits>

#include <Tarvek/MediaWrapper/Reduce.h>

namespace {

struct ReduceCase {
  const char* name;
  long long x, y;
  long long expectedX, expectedY;
};

class ReduceTest : public ::testing::TestWithParam<ReduceCase> {};

TEST_P(ReduceTest, GivesLowestTermsInPlace) {
  const ReduceCase& c = GetParam();
  long long x = c.x;
  long long y = c.y;
  Tarvek::Media::reduce(x, y);
  EXPECT_EQ(x, c.expectedX);
  EXPECT_EQ(y, c.expectedY);
}

INSTANTIATE_TEST_SUITE_P(
    Ratios, ReduceTest,
    ::testing::Values(
        ReduceCase{"AlreadyLowest", 16, 9, 16, 9},
        ReduceCase{"PalWide", 720LL * 64, 576LL * 45, 16, 9},
        ReduceCase{"SquareHd", 1920, 1080, 16, 9}, ReduceCase{"Equal", 5, 5, 1, 1},
        ReduceCase{"CoprimeLarge", 4294967291LL, 4294967279LL, 4294967291LL, 4294967279LL},
        ReduceCase{"ZeroNumerator", 0, 12, 0, 1}, ReduceCase{"ZeroDenominator", 12, 0, 1, 0},
        ReduceCase{"BothZero", 0, 0, 0, 0}, ReduceCase{"NegativeKeepsSign", -4, 6, -2, 3},
        ReduceCase{"BothNegative", -4, -6, -2, -3},
        ReduceCase{"MinimumValue", LLONG_MIN, 2, LLONG_MIN / 2, 1},
        ReduceCase{"MinimumWithItself", LLONG_MIN, LLONG_MIN, -1, -1},
        ReduceCase{"Maximum", LLONG_MAX, LLONG_MAX, 1, 1}),
    [](const ::testing::TestParamInfo<ReduceCase>& info) { return info.param.name; });

}  // namespace
