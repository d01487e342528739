// Tests of formatdesc's option readers and of its readable units.
#include <gtest/gtest.h>

#include <functional>

#include "Options.h"
#include "Output.h"

namespace Formatdesc {
namespace {

using Tarvek::Conf::ChannelLayout;

// The message of the UsageError `read` throws, or "" when it throws none.
std::string UsageMessage(const std::function<void()>& read) {
  try {
    read();
  } catch (const UsageError& e) {
    return e.what();
  }
  return "";
}

void ExpectPair(Pair actual, unsigned int first, unsigned int second) {
  EXPECT_EQ(actual.first, first);
  EXPECT_EQ(actual.second, second);
}

TEST(FormatdescOptions, SizeNeedsTwoPositiveIntegers) {
  ExpectPair(ParseSize("--size", "1920x1080"), 1920, 1080);
  EXPECT_EQ(UsageMessage([] { ParseSize("--size", "19x"); }),
            "--size: expected WIDTHxHEIGHT with positive integers, got '19x'");
  for (const char* bad : {"x1080", "0x1080", "1920x0", "-1920x1080", "1920x+1080", " 1920x1080",
                          "1920x1080x3", "1920:1080", "4294967296x1", ""}) {
    EXPECT_THROW(ParseSize("--size", bad), UsageError) << bad;
  }
}

TEST(FormatdescOptions, RatioNeedsColon) {
  ExpectPair(ParseRatio("--frame-aspect", "16:9"), 16, 9);
  EXPECT_EQ(UsageMessage([] { ParseRatio("--pixel-aspect", "16/9"); }),
            "--pixel-aspect: expected W:H with positive integers, got '16/9'");
  EXPECT_THROW(ParseRatio("--frame-aspect", "16:0"), UsageError);
}

TEST(FormatdescOptions, FrameRateAsFractionIntegerOrDecimal) {
  ExpectPair(ParseFrameRate("--frame-rate", "30000/1001"), 30000, 1001);
  ExpectPair(ParseFrameRate("--frame-rate", "25"), 25, 1);
  ExpectPair(ParseFrameRate("--frame-rate", "12.5"), 25, 2);
  ExpectPair(ParseFrameRate("--frame-rate", "25.0"), 25, 1);
  ExpectPair(ParseFrameRate("--frame-rate", "0.001"), 1, 1000);
}

TEST(FormatdescOptions, FrameRateDecimalsOfNtscRatesAreTheirFractions) {
  ExpectPair(ParseFrameRate("--frame-rate", "29.97"), 30000, 1001);
  ExpectPair(ParseFrameRate("--frame-rate", "29.970"), 30000, 1001);
  ExpectPair(ParseFrameRate("--frame-rate", "23.976"), 24000, 1001);
  ExpectPair(ParseFrameRate("--frame-rate", "59.94"), 60000, 1001);
  // Close to 30000/1001 but not its rounding: taken exactly.
  ExpectPair(ParseFrameRate("--frame-rate", "29.98"), 1499, 50);
}

TEST(FormatdescOptions, FrameRateRefusesZeroNegativeAndJunk) {
  for (const char* bad :
       {"0", "0.0", "0/1", "30/0", "-25", "25.", ".5", "1.2345678", "25fps", "4294967296", ""}) {
    EXPECT_THROW(ParseFrameRate("--frame-rate", bad), UsageError) << bad;
  }
}

TEST(FormatdescOptions, CountsAreDecimalWithinRange) {
  EXPECT_EQ(ParsePositive("--sample-rate", "48000", 2147483647), 48000);
  EXPECT_EQ(ParseNonNegative("--threads", "0", 10), 0);
  EXPECT_EQ(UsageMessage([] { ParsePositive("--sample-rate", "0", 2147483647); }),
            "--sample-rate: expected a positive integer up to 2147483647, got '0'");
  for (const char* bad : {"-1", "+5", "5 ", "0x10", "11", ""}) {
    EXPECT_THROW(ParseNonNegative("--threads", bad, 10), UsageError) << bad;
  }
}

TEST(FormatdescOptions, BitrateTakesKiloMegaAndGigaSuffixes) {
  EXPECT_EQ(ParseBitrate("--bitrate", "4500000"), 4500000);
  EXPECT_EQ(ParseBitrate("--bitrate", "4500k"), 4500000);
  EXPECT_EQ(ParseBitrate("--bitrate", "4K"), 4000);
  EXPECT_EQ(ParseBitrate("--bitrate", "4.5M"), 4500000);
  EXPECT_EQ(ParseBitrate("--bitrate", "1.25G"), 1250000000);
  EXPECT_EQ(ParseBitrate("--bitrate", "1.0005k"), 1001);
  for (const char* bad : {"0", "0k", "-1", "4.5m", "4.5T", "M", "4.5.1M", "1.5e6", "0.0000001M"}) {
    EXPECT_THROW(ParseBitrate("--bitrate", bad), UsageError) << bad;
  }
}

TEST(FormatdescOptions, CodecTagPacksFourCharactersFirstLowest) {
  EXPECT_EQ(ParseCodecTag("--tag", "avc1"), 0x31637661);
  EXPECT_EQ(ParseCodecTag("--tag", "0x31637661"), 0x31637661);
  EXPECT_EQ(ParseCodecTag("--tag", "1234"), 1234);
  for (const char* bad : {"avc", "avc12", "0x100000000", ""}) {
    EXPECT_THROW(ParseCodecTag("--tag", bad), UsageError) << bad;
  }
}

TEST(FormatdescOptions, ChannelLayoutByNameOrMask) {
  // FFmpeg's names: its "5.1" has back speakers, "5.1(side)" side ones.
  EXPECT_EQ(ParseChannelLayout("--layout", "5.1"), Tarvek::Conf::CH_LAYOUT_5POINT1_BACK);
  EXPECT_EQ(ParseChannelLayout("--layout", "5.1(side)"), Tarvek::Conf::CH_LAYOUT_5POINT1);
  EXPECT_EQ(ParseChannelLayout("--layout", "Stereo"), Tarvek::Conf::CH_LAYOUT_STEREO);
  EXPECT_EQ(ParseChannelLayout("--layout", "7.1(wide-side)"), Tarvek::Conf::CH_LAYOUT_7POINT1_WIDE);
  EXPECT_EQ(ParseChannelLayout("--layout", "0x3f"), Tarvek::Conf::CH_LAYOUT_5POINT1_BACK);
  EXPECT_EQ(ParseChannelLayout("--layout", "4"), Tarvek::Conf::CH_LAYOUT_MONO);
  for (const char* bad : {"0", "0x0", "5.2", "0x100000000", ""}) {
    EXPECT_THROW(ParseChannelLayout("--layout", bad), UsageError) << bad;
  }
  for (const auto& [name, layout] : ChannelLayoutNames()) {
    EXPECT_EQ(ParseChannelLayout("--layout", name), layout) << name;
  }
}

TEST(FormatdescOptions, FormatsByLibavutilName) {
  EXPECT_EQ(ParsePixelFormat("--pix-fmt", "yuv420p"), AV_PIX_FMT_YUV420P);
  EXPECT_EQ(ParseSampleFormat("--sample-fmt", "fltp"), AV_SAMPLE_FMT_FLTP);
  EXPECT_EQ(UsageMessage([] { ParsePixelFormat("--pix-fmt", "yuv999p"); }),
            "--pix-fmt: expected a pixel format name such as yuv420p, got 'yuv999p'");
  EXPECT_THROW(ParsePixelFormat("--pix-fmt", ""), UsageError);
  EXPECT_THROW(ParseSampleFormat("--sample-fmt", "float"), UsageError);
}

TEST(FormatdescOptions, KeyValueSplitsAtFirstEquals) {
  EXPECT_EQ(ParseKeyValue("--encode-option", "x264-params=a=b"),
            std::make_pair(std::string("x264-params"), std::string("a=b")));
  EXPECT_EQ(ParseKeyValue("--encode-option", "tune=").second, "");
  EXPECT_THROW(ParseKeyValue("--encode-option", "=slow"), UsageError);
  EXPECT_THROW(ParseKeyValue("--encode-option", "slow"), UsageError);
}

TEST(FormatdescOptions, CodecIdMatchesWithoutCaseAndNamesTheKind) {
  const std::vector<std::string> known = {"aac", "h264"};
  EXPECT_EQ(CheckCodecId("--codec-id", "H264", known, "video"), "h264");
  EXPECT_EQ(UsageMessage([&] { CheckCodecId("--codec-id", "h265", known, "audio"); }),
            "--codec-id: expected an audio codec identifier (see 'formatdesc codecs'), got 'h265'");
}

TEST(FormatdescOutput, BitratesInKiloOrMegabitsRoundedToHundredths) {
  EXPECT_EQ(ReadableBitrate(4500000), "4.50 Mb/s");
  EXPECT_EQ(ReadableBitrate(128000), "128.00 kb/s");
  EXPECT_EQ(ReadableBitrate(999994), "999.99 kb/s");
  EXPECT_EQ(ReadableBitrate(999995), "1.00 Mb/s");
  EXPECT_EQ(ReadableBitrate(15990648), "15.99 Mb/s");
  EXPECT_EQ(DescribeBitrate(384000), "384.00 kb/s (384000 b/s)");
}

TEST(FormatdescOutput, FrameRateWithoutTrailingZeros) {
  EXPECT_EQ(ReadableFrameRate(30000.0 / 1001), "29.97");
  EXPECT_EQ(ReadableFrameRate(24000.0 / 1001), "23.976");
  EXPECT_EQ(ReadableFrameRate(25.0), "25");
}

}  // namespace
}  // namespace Formatdesc
