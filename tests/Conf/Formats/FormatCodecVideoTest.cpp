// The video description: storage widths, derived frame aspect and frame rate, reading order,
// and the geometry compatibility test.
#include <gtest/gtest.h>

#include <cmath>

#include "Support/TestSupport.h"

namespace {

using Tarvek::Conf::FormatCodecAudio;
using Tarvek::Conf::FormatCodecSubtitle;
using Tarvek::Conf::FormatCodecVideo;
using Tarvek::Conf::IFormatCodecVideo;
using Tarvek::Core::ChildNotFound;
using Tarvek::Core::Property;
using TarvekTest::CatchAs;
using TarvekTest::ItemOf;

class FormatCodecVideoTest : public ::testing::Test {
 protected:
  // The key that a read of `call` reports missing.
  static std::string MissingKey(const std::function<void()>& call) {
    const auto error = CatchAs<ChildNotFound>(call);
    if (!error) return "<no error>";
    return ItemOf<ChildNotFound::ChildNameInfo>(*error).value_or("<no item>");
  }

  long long Stored(const std::string& key) const { return video_->GetProperty()[key].GetInt64(); }

  boost::intrusive_ptr<IFormatCodecVideo> video_ = FormatCodecVideo::Create();
};

TEST_F(FormatCodecVideoTest, NewDescriptionHoldsNoVideoSetting) {
  EXPECT_FALSE(video_->ExistsWidth());
  EXPECT_FALSE(video_->ExistsHeight());
  EXPECT_FALSE(video_->ExistsPixelAspectX());
  EXPECT_FALSE(video_->ExistsPixelAspectY());
  EXPECT_FALSE(video_->ExistsFrameRateNum());
  EXPECT_FALSE(video_->ExistsFrameRateDen());
  EXPECT_FALSE(video_->ExistsPixelFormat());
  EXPECT_EQ(MissingKey([&] { video_->GetWidth(); }), IFormatCodecVideo::TAG_WIDTH);
}

TEST_F(FormatCodecVideoTest, StoresUnsignedZeroExtendedAndFormatsSignExtended) {
  video_->InitByPixelAspect(4294967295u, 4294967295u, 4294967295u, 4294967295u);
  video_->SetFrameRate(4294967295u, 4294967295u);
  video_->SetPixelFormat(AV_PIX_FMT_NONE);
  for (const std::string* key :
       {&IFormatCodecVideo::TAG_WIDTH, &IFormatCodecVideo::TAG_HEIGHT,
        &IFormatCodecVideo::TAG_ASPECTX, &IFormatCodecVideo::TAG_ASPECTY,
        &IFormatCodecVideo::TAG_TIMEBASE_N, &IFormatCodecVideo::TAG_TIMEBASE_D}) {
    EXPECT_EQ(Stored(*key), 4294967295LL) << *key;
  }
  EXPECT_EQ(video_->GetWidth(), 4294967295u);
  EXPECT_EQ(video_->GetFrameRateDen(), 4294967295u);
  EXPECT_EQ(Stored(IFormatCodecVideo::TAG_PIX_FMT), -1);
  EXPECT_EQ(video_->GetPixelFormat(), AV_PIX_FMT_NONE);
}

TEST_F(FormatCodecVideoTest, OutOfRangeTreeValuesReadAsTheirLow32Bits) {
  Property tree("any");
  tree.SetChildT<long long>(IFormatCodecVideo::TAG_WIDTH, (1LL << 32) + 7);
  tree.SetChildT<long long>(IFormatCodecVideo::TAG_PIX_FMT, (1LL << 32) + 3);
  video_->SetProperty(tree);
  EXPECT_EQ(video_->GetWidth(), 7u);
  EXPECT_EQ(video_->GetPixelFormat(), static_cast<AVPixelFormat>(3));
}

TEST_F(FormatCodecVideoTest, FrameRateIsNumeratorOverDenominator) {
  video_->SetFrameRate(25, 2);
  EXPECT_DOUBLE_EQ(video_->GetFrameRate(), 12.5);
  video_->SetFrameRate(30000, 1001);
  EXPECT_DOUBLE_EQ(video_->GetFrameRate(), 30000.0 / 1001.0);
}

TEST_F(FormatCodecVideoTest, ZeroDenominatorGivesZeroWithoutReadingTheNumerator) {
  video_->SetFrameRateDen(0);
  EXPECT_EQ(video_->GetFrameRate(), 0.0);
}

TEST_F(FormatCodecVideoTest, FrameRateReadsTheDenominatorFirst) {
  EXPECT_EQ(MissingKey([&] { video_->GetFrameRate(); }), IFormatCodecVideo::TAG_TIMEBASE_D);
  video_->SetFrameRateDen(1);
  EXPECT_EQ(MissingKey([&] { video_->GetFrameRate(); }), IFormatCodecVideo::TAG_TIMEBASE_N);
}

TEST_F(FormatCodecVideoTest, FrameAspectReadsAspectXWidthAspectYHeightInThatOrder) {
  EXPECT_EQ(MissingKey([&] { video_->GetFrameAspectX(); }), IFormatCodecVideo::TAG_ASPECTX);
  auto* concrete = dynamic_cast<FormatCodecVideo*>(video_.get());
  ASSERT_NE(concrete, nullptr);
  concrete->SetPixelAspectX(1);
  EXPECT_EQ(MissingKey([&] { video_->GetFrameAspectY(); }), IFormatCodecVideo::TAG_WIDTH);
  concrete->SetWidth(1);
  EXPECT_EQ(MissingKey([&] { video_->GetFrameAspect(); }), IFormatCodecVideo::TAG_ASPECTY);
  concrete->SetPixelAspectY(1);
  EXPECT_EQ(MissingKey([&] { video_->GetFrameAspectX(); }), IFormatCodecVideo::TAG_HEIGHT);
}

TEST_F(FormatCodecVideoTest, FrameAspectDividesInDoublePrecision) {
  video_->InitByPixelAspect(1920, 1080, 1, 1);
  EXPECT_DOUBLE_EQ(video_->GetFrameAspect(), 16.0 / 9.0);
  video_->InitByPixelAspect(0, 1080, 1, 1);  // 0:1080 reduces to 0:1
  EXPECT_EQ(video_->GetFrameAspect(), 0.0);
  video_->InitByPixelAspect(1920, 0, 1, 1);  // x:0 reduces to 1:0
  EXPECT_TRUE(std::isinf(video_->GetFrameAspect()));
  video_->InitByPixelAspect(0, 0, 1, 1);
  EXPECT_TRUE(std::isnan(video_->GetFrameAspect()));
}

// Products above 32 bits used to wrap before reduction; they are now reduced exactly.
TEST_F(FormatCodecVideoTest, FrameAspectOfLargeProductsIsExact) {
  video_->InitByPixelAspect(65536, 65536, 65536, 32768);  // 2^32 : 2^31
  EXPECT_EQ(video_->GetFrameAspectX(), 2u);
  EXPECT_EQ(video_->GetFrameAspectY(), 1u);

  video_->InitByPixelAspect(4294967295u, 4294967295u, 4294967295u, 4294967295u);
  EXPECT_EQ(video_->GetFrameAspectX(), 1u);
  EXPECT_EQ(video_->GetFrameAspectY(), 1u);

  // (2^32-1)(2^32-2) : 2 reduces to (2^32-1)(2^31-1) : 1, which keeps its low 32 bits.
  video_->InitByPixelAspect(4294967295u, 1, 4294967294u, 2);
  EXPECT_EQ(video_->GetFrameAspectX(), 2147483649u);
  EXPECT_EQ(video_->GetFrameAspectY(), 1u);
}

TEST_F(FormatCodecVideoTest, InitByFrameAspectOfLargeProductsIsExact) {
  video_->InitByFrameAspect(65536, 65536, 65536, 32768);  // 2^32 : 2^31
  EXPECT_EQ(video_->GetPixelAspectX(), 2u);
  EXPECT_EQ(video_->GetPixelAspectY(), 1u);
}

struct AspectCase {
  const char* name;
  unsigned int width, height, frameX, frameY;
  unsigned int pixelX, pixelY;
};

class FrameAspectRoundTrip : public FormatCodecVideoTest,
                             public ::testing::WithParamInterface<AspectCase> {};

TEST_P(FrameAspectRoundTrip, StoresThePixelAspectAndReadsTheFrameAspectBack) {
  const AspectCase& c = GetParam();
  video_->InitByFrameAspect(c.width, c.height, c.frameX, c.frameY);
  EXPECT_EQ(video_->GetWidth(), c.width);
  EXPECT_EQ(video_->GetHeight(), c.height);
  EXPECT_EQ(video_->GetPixelAspectX(), c.pixelX);
  EXPECT_EQ(video_->GetPixelAspectY(), c.pixelY);
  EXPECT_EQ(video_->GetFrameAspectX(), c.frameX);
  EXPECT_EQ(video_->GetFrameAspectY(), c.frameY);
  EXPECT_DOUBLE_EQ(video_->GetFrameAspect(),
                   static_cast<double>(c.frameX) / static_cast<double>(c.frameY));
}

INSTANTIATE_TEST_SUITE_P(CommonSizes, FrameAspectRoundTrip,
                         ::testing::Values(AspectCase{"Pal169", 720, 576, 16, 9, 64, 45},
                                           AspectCase{"Pal43", 720, 576, 4, 3, 16, 15},
                                           AspectCase{"Ntsc43", 720, 480, 4, 3, 8, 9},
                                           AspectCase{"Ntsc169", 720, 480, 16, 9, 32, 27},
                                           AspectCase{"FullHd", 1920, 1080, 16, 9, 1, 1},
                                           AspectCase{"Uhd", 3840, 2160, 16, 9, 1, 1},
                                           AspectCase{"Anamorphic", 1440, 1080, 16, 9, 4, 3}),
                         [](const ::testing::TestParamInfo<AspectCase>& info) {
                           return info.param.name;
                         });

class FormatCodecVideoCompatibilityTest : public FormatCodecVideoTest {
 protected:
  void SetUp() override {
    video_->InitByPixelAspect(720, 576, 64, 45);
    other_->InitByPixelAspect(720, 576, 64, 45);
  }

  boost::intrusive_ptr<IFormatCodecVideo> other_ = FormatCodecVideo::Create();
};

TEST_F(FormatCodecVideoCompatibilityTest, SameGeometryIsCompatibleWhateverElseDiffers) {
  other_->SetCodecID("mpeg2video");
  other_->SetFrameRate(25, 1);
  other_->SetPixelFormat(AV_PIX_FMT_YUV422P);
  EXPECT_TRUE(video_->IsCompatible(other_));
  EXPECT_TRUE(other_->IsCompatible(video_));
  EXPECT_TRUE(video_->IsCompatible(video_->Clone()));
}

TEST_F(FormatCodecVideoCompatibilityTest, AnyGeometryDifferenceIsIncompatible) {
  const unsigned int base[4] = {720, 576, 64, 45};
  for (int changed = 0; changed < 4; ++changed) {
    unsigned int g[4] = {base[0], base[1], base[2], base[3]};
    g[changed] += 1;
    other_->InitByPixelAspect(g[0], g[1], g[2], g[3]);
    EXPECT_FALSE(video_->IsCompatible(other_)) << "setting " << changed;
  }
}

TEST_F(FormatCodecVideoCompatibilityTest, NullAndOtherKindsAreIncompatible) {
  EXPECT_FALSE(video_->IsCompatible(nullptr));
  EXPECT_FALSE(video_->IsCompatible(FormatCodecAudio::Create()));
  EXPECT_FALSE(video_->IsCompatible(FormatCodecSubtitle::Create()));
  EXPECT_FALSE(video_->IsCompatible(Tarvek::Conf::FormatCodec::Create()));
}

TEST_F(FormatCodecVideoCompatibilityTest, MissingSettingThrowsAndGivesTheReferenceBack) {
  auto bare = FormatCodecVideo::Create();
  EXPECT_EQ(MissingKey([&] { video_->IsCompatible(bare); }), IFormatCodecVideo::TAG_WIDTH);
  EXPECT_EQ(bare->GetRefCount(), 1);
  EXPECT_EQ(MissingKey([&] { bare->IsCompatible(video_); }), IFormatCodecVideo::TAG_WIDTH);
  EXPECT_EQ(video_->GetRefCount(), 1);
  EXPECT_TRUE(video_->IsCompatible(other_));
  EXPECT_EQ(other_->GetRefCount(), 1);
}

}  // namespace
