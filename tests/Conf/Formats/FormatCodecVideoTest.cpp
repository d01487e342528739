// The video description: derived frame aspect and frame rate, the order in which they read their
// settings, and the geometry compatibility test.
#include <gtest/gtest.h>

#include <cmath>

#include "Support/TestSupport.h"

namespace {

using Tarvek::Conf::FormatCodecVideo;
using Tarvek::Conf::IFormatCodecVideo;
using TarvekTest::MissingKey;

class FormatCodecVideoTest : public ::testing::Test {
 protected:
  boost::intrusive_ptr<IFormatCodecVideo> video_ = FormatCodecVideo::Create();
};

// Numerator over denominator, read in that order, the denominator first: when it is 0 the rate
// is 0 and the numerator is not read at all.
TEST_F(FormatCodecVideoTest, FrameRateIsNumeratorOverDenominator) {
  EXPECT_EQ(MissingKey([&] { video_->GetFrameRate(); }), IFormatCodecVideo::TAG_TIMEBASE_D);
  video_->SetFrameRateDen(0);
  EXPECT_EQ(video_->GetFrameRate(), 0.0);
  video_->SetFrameRateDen(1);
  EXPECT_EQ(MissingKey([&] { video_->GetFrameRate(); }), IFormatCodecVideo::TAG_TIMEBASE_N);
  video_->SetFrameRate(30000, 1001);
  EXPECT_DOUBLE_EQ(video_->GetFrameRate(), 30000.0 / 1001.0);
  video_->SetFrameRate(4294967295u, 2);
  EXPECT_DOUBLE_EQ(video_->GetFrameRate(), 4294967295.0 / 2);
}

TEST_F(FormatCodecVideoTest, FrameAspectReadsAspectXWidthAspectYHeightInThatOrder) {
  EXPECT_EQ(MissingKey([&] { video_->GetFrameAspectX(); }), IFormatCodecVideo::TAG_ASPECTX);
  auto& concrete = dynamic_cast<FormatCodecVideo&>(*video_);
  concrete.SetPixelAspectX(1);
  EXPECT_EQ(MissingKey([&] { video_->GetFrameAspectY(); }), IFormatCodecVideo::TAG_WIDTH);
  concrete.SetWidth(1);
  EXPECT_EQ(MissingKey([&] { video_->GetFrameAspect(); }), IFormatCodecVideo::TAG_ASPECTY);
  concrete.SetPixelAspectY(1);
  EXPECT_EQ(MissingKey([&] { video_->GetFrameAspectX(); }), IFormatCodecVideo::TAG_HEIGHT);
}

TEST_F(FormatCodecVideoTest, FrameAspectDividesInDoublePrecision) {
  video_->InitByPixelAspect(0, 1080, 1, 1);  // 0:1080 reduces to 0:1
  EXPECT_EQ(video_->GetFrameAspect(), 0.0);
  video_->InitByPixelAspect(1920, 0, 1, 1);  // x:0 reduces to 1:0
  EXPECT_TRUE(std::isinf(video_->GetFrameAspect()));
  video_->InitByPixelAspect(0, 0, 1, 1);
  EXPECT_TRUE(std::isnan(video_->GetFrameAspect()));
}

// Products above 32 bits are reduced exactly, and a reduced term beyond 32 bits keeps its low
// 32 bits.
TEST_F(FormatCodecVideoTest, FrameAspectOfLargeProductsIsExact) {
  struct Case {
    unsigned int width, height, pixelX, pixelY, frameX, frameY;
  };
  const Case cases[] = {
      {65536, 65536, 65536, 32768, 2, 1},  // 2^32 : 2^31
      {4294967295u, 4294967295u, 4294967295u, 4294967295u, 1, 1},
      // (2^32-1)(2^32-2) : 2 reduces to (2^32-1)(2^31-1) : 1.
      {4294967295u, 1, 4294967294u, 2, 2147483649u, 1},
  };
  for (const Case& c : cases) {
    video_->InitByPixelAspect(c.width, c.height, c.pixelX, c.pixelY);
    EXPECT_EQ(video_->GetFrameAspectX(), c.frameX) << c.width << "x" << c.height;
    EXPECT_EQ(video_->GetFrameAspectY(), c.frameY) << c.width << "x" << c.height;
  }
  video_->InitByFrameAspect(65536, 65536, 65536, 32768);  // 2^32 : 2^31
  EXPECT_EQ(video_->GetPixelAspectX(), 2u);
  EXPECT_EQ(video_->GetPixelAspectY(), 1u);
}

// InitByFrameAspect stores the pixel aspect that gives the frame aspect back.
TEST_F(FormatCodecVideoTest, FrameAspectRoundTripsOverCommonSizes) {
  struct Case {
    unsigned int width, height, frameX, frameY, pixelX, pixelY;
  };
  const Case cases[] = {
      {720, 576, 16, 9, 64, 45}, {720, 576, 4, 3, 16, 15},  {720, 480, 4, 3, 8, 9},
      {720, 480, 16, 9, 32, 27}, {1920, 1080, 16, 9, 1, 1}, {3840, 2160, 16, 9, 1, 1},
      {1440, 1080, 16, 9, 4, 3},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(std::to_string(c.width) + "x" + std::to_string(c.height) + " " +
                 std::to_string(c.frameX) + ":" + std::to_string(c.frameY));
    video_->InitByFrameAspect(c.width, c.height, c.frameX, c.frameY);
    EXPECT_EQ(video_->GetWidth(), c.width);
    EXPECT_EQ(video_->GetHeight(), c.height);
    EXPECT_EQ(video_->GetPixelAspectX(), c.pixelX);
    EXPECT_EQ(video_->GetPixelAspectY(), c.pixelY);
    EXPECT_EQ(video_->GetFrameAspectX(), c.frameX);
    EXPECT_EQ(video_->GetFrameAspectY(), c.frameY);
    EXPECT_DOUBLE_EQ(video_->GetFrameAspect(), static_cast<double>(c.frameX) / c.frameY);
  }
}

// Width, height and pixel aspect decide; codec, frame rate and pixel format do not. Null and
// other kinds are incompatible.
TEST_F(FormatCodecVideoTest, CompatibilityComparesTheGeometryOnly) {
  auto other = FormatCodecVideo::Create();
  const unsigned int geometry[4] = {720, 576, 64, 45};
  video_->InitByPixelAspect(geometry[0], geometry[1], geometry[2], geometry[3]);
  other->InitByPixelAspect(geometry[0], geometry[1], geometry[2], geometry[3]);
  other->SetCodecID("mpeg2video");
  other->SetFrameRate(25, 1);
  other->SetPixelFormat(AV_PIX_FMT_YUV422P);
  EXPECT_TRUE(video_->IsCompatible(other));
  EXPECT_EQ(other->GetRefCount(), 1);
  EXPECT_TRUE(other->IsCompatible(video_));
  EXPECT_TRUE(video_->IsCompatible(video_->Clone()));

  for (int changed = 0; changed < 4; ++changed) {
    unsigned int g[4] = {geometry[0], geometry[1], geometry[2], geometry[3]};
    g[changed] += 1;
    other->InitByPixelAspect(g[0], g[1], g[2], g[3]);
    EXPECT_FALSE(video_->IsCompatible(other)) << "setting " << changed;
  }
  EXPECT_FALSE(video_->IsCompatible(nullptr));
  EXPECT_FALSE(video_->IsCompatible(Tarvek::Conf::FormatCodecAudio::Create()));
  EXPECT_FALSE(video_->IsCompatible(Tarvek::Conf::FormatCodecSubtitle::Create()));
  EXPECT_FALSE(video_->IsCompatible(Tarvek::Conf::FormatCodec::Create()));

  // A missing setting on either side throws, and the other description gets its reference back.
  auto bare = FormatCodecVideo::Create();
  EXPECT_EQ(MissingKey([&] { video_->IsCompatible(bare); }), IFormatCodecVideo::TAG_WIDTH);
  EXPECT_EQ(bare->GetRefCount(), 1);
  EXPECT_EQ(MissingKey([&] { bare->IsCompatible(video_); }), IFormatCodecVideo::TAG_WIDTH);
  EXPECT_EQ(video_->GetRefCount(), 1);
}

}  // namespace
