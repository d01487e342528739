// The bitrate presets: for every codec, min <= default <= max and growth with picture size,
// frame rate, channel count and sample rate; figures against the published ones; clamped extreme
// inputs; and the errors for bad input.
#include <Tarvek/Presets/BitratePresets.h>

#include <array>
#include <cstdint>
#include <functional>
#include <limits>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "Support/TestSupport.h"

namespace {

using namespace Tarvek::Conf;  // the look-ups, their errors, ChannelLayout and CH_LAYOUT_*
using Tarvek::DescriptionInfo;
using TarvekTest::CatchAs;
using TarvekTest::ItemOf;

using Trio = std::array<std::int64_t, 3>;  // the minimum, default and maximum bitrate

Trio Video(const std::string& id, long long w, long long h, double fps, int quality) {
  return {GetMinVideoBitrate(id, w, h, fps, quality),
          GetDefaultVideoBitrate(id, w, h, fps, quality),
          GetMaxVideoBitrate(id, w, h, fps, quality)};
}

Trio Audio(const std::string& id, long long rate, ChannelLayout layout,
           AVSampleFormat format = AV_SAMPLE_FMT_S16) {
  return {GetMinAudioBitrate(id, rate, layout, format),
          GetDefaultAudioBitrate(id, rate, layout, format),
          GetMaxAudioBitrate(id, rate, layout, format)};
}

void ExpectOrdered(const Trio& t, const std::string& where) {
  EXPECT_TRUE(t[0] > 0 && t[0] <= t[1] && t[1] <= t[2])
      << where << ": " << ::testing::PrintToString(t);
}

void ExpectNotBelow(const Trio& now, const Trio& before, const std::string& where) {
  for (std::size_t i = 0; i < now.size(); ++i) {
    EXPECT_GE(now[i], before[i]) << where << " figure " << i;
  }
}

// 16:9 sizes from a macroblock to beyond 8K, in ascending order.
const std::vector<std::pair<long long, long long>> kSizes = {
    {16, 9},      {176, 99},    {640, 360},   {854, 480},   {1280, 720},
    {1920, 1080}, {2560, 1440}, {3840, 2160}, {7680, 4320}, {30720, 17280}};
const std::vector<double> kFrameRates = {0.5, 1, 12, 23.976, 25, 29.97, 50, 60, 120, 240, 1000};
const std::vector<int> kQualities = {-1, 0, 1, 4, 18, 23, 28, 31, 51, 63, 1000};

// A mask of the first `channels` speaker bits.
ChannelLayout Channels(int channels) {
  return static_cast<ChannelLayout>(channels >= 32 ? 0xFFFFFFFFu : (1u << channels) - 1u);
}

// The description of the error E that `call` throws, empty when it throws something else.
template <class E, class Call>
std::string DescriptionOf(Call call) {
  const auto error = CatchAs<E>(call);
  return error ? ItemOf<DescriptionInfo>(*error).value_or("") : "";
}

class VideoPresetTest : public ::testing::TestWithParam<std::string> {};

// Over the grid: min <= default <= max, and no figure falls as the picture grows or the frame
// rate rises; no default rises with a higher quality number (from 0 up: -1 means none).
TEST_P(VideoPresetTest, OrderedMonotonicAndClamped) {
  const std::string& id = GetParam();
  for (std::size_t s = 0; s < kSizes.size(); ++s) {
    const auto& [w, h] = kSizes[s];
    for (std::size_t r = 0; r < kFrameRates.size(); ++r) {
      const double fps = kFrameRates[r];
      for (std::size_t q = 0; q < kQualities.size(); ++q) {
        const int quality = kQualities[q];
        const std::string where = std::to_string(w) + "x" + std::to_string(h) + "@" +
                                  std::to_string(fps) + " q" + std::to_string(quality);
        const Trio trio = Video(id, w, h, fps, quality);
        ExpectOrdered(trio, where);
        if (s > 0) {
          ExpectNotBelow(trio, Video(id, kSizes[s - 1].first, kSizes[s - 1].second, fps, quality),
                         where);
        }
        if (r > 0) ExpectNotBelow(trio, Video(id, w, h, kFrameRates[r - 1], quality), where);
        if (q > 1) {
          EXPECT_LE(trio[1], Video(id, w, h, fps, kQualities[q - 1])[1]) << where;
        }
      }
    }
  }
  // A frame rate of 0 is taken as 30; pictures, rates and qualities beyond the scales count as
  // their ends, and the figures stay far from overflow.
  EXPECT_EQ(Video(id, 1920, 1080, 0.0, -1), Video(id, 1920, 1080, 30.0, -1));
  const int top = std::numeric_limits<int>::max();
  const Trio extreme = Video(id, 4294967295LL, 4294967295LL, 1e300, top);
  const Trio largest = Video(id, 65536, 65536, 240, top);
  EXPECT_EQ(extreme, largest);
  EXPECT_LT(extreme[2], 100'000'000'000'000LL);
  EXPECT_EQ(Video(id, 1280, 720, 1e-300, -1), Video(id, 1280, 720, 1.0, -1));
}

INSTANTIATE_TEST_SUITE_P(AllVideoCodecs, VideoPresetTest,
                         ::testing::ValuesIn(GetPresetVideoCodecs()),
                         [](const auto& info) { return info.param; });

class AudioPresetTest : public ::testing::TestWithParam<std::string> {};

const std::vector<long long> kSampleRates = {8000,  11025, 16000, 22050, 24000, 32000,
                                             44100, 48000, 88200, 96000, 192000};

// Over the grid: min <= default <= max, and no figure falls with more channels or a higher
// sample rate.
// The channel counts 1..32 the codec carries form one unbroken run.
TEST_P(AudioPresetTest, OrderedAndMonotonicOverTheGrid) {
  std::vector<int> carried;
  for (int n = 1; n <= 32; ++n) {
    try {
      GetDefaultAudioBitrate(GetParam(), 48000, Channels(n), AV_SAMPLE_FMT_S16);
      carried.push_back(n);
    } catch (const InvalidPresetArgumentError&) {
    }
  }
  ASSERT_FALSE(carried.empty());
  EXPECT_EQ(carried.back() - carried.front() + 1, static_cast<int>(carried.size()));
  for (std::size_t c = 0; c < carried.size(); ++c) {
    for (std::size_t r = 0; r < kSampleRates.size(); ++r) {
      const std::string where =
          std::to_string(carried[c]) + " ch @" + std::to_string(kSampleRates[r]);
      const Trio trio = Audio(GetParam(), kSampleRates[r], Channels(carried[c]));
      ExpectOrdered(trio, where);
      if (c > 0)
        ExpectNotBelow(trio, Audio(GetParam(), kSampleRates[r], Channels(carried[c - 1])), where);
      if (r > 0)
        ExpectNotBelow(trio, Audio(GetParam(), kSampleRates[r - 1], Channels(carried[c])), where);
    }
  }
}

INSTANTIATE_TEST_SUITE_P(AllAudioCodecs, AudioPresetTest,
                         ::testing::ValuesIn(GetPresetAudioCodecs()),
                         [](const auto& info) { return info.param; });

// Figures against the published ones, exact or within a range (the source in the comment).
TEST(BitratePresetsTest, FiguresMatchThePublishedOnes) {
  using LookUp = std::int64_t (*)(const std::string&, long long, long long, double, int);
  const LookUp def = &GetDefaultVideoBitrate, max = &GetMaxVideoBitrate;
  const struct {
    LookUp lookUp;
    const char* id;
    long long w, h;
    double fps;
    int q;
    std::int64_t low, high;
  } video[] = {
      {def, "h264", 1920, 1080, 30, -1, 8'000'000, 8'000'000},         // YT-UP 1080p 8
      {def, "h264", 1920, 1080, 60, -1, 12'000'000, 12'000'000},       // YT-UP 1080p60 12
      {def, "h264", 1280, 720, 60, -1, 7'500'000, 7'500'000},          // YT-UP 720p60 7.5
      {def, "h264", 2560, 1440, 30, -1, 16'000'000, 16'000'000},       // YT-UP 1440p 16
      {def, "h264", 1600, 900, 30, -1, 5'000'001, 7'999'999},          // between 720p and 1080p
      {def, "h264", 1916, 1080, 30, -1, 7'960'001, 8'000'000},         // no jump below a rung
      {def, "h264", 3840, 2160, 30, -1, 35'000'000, 45'000'000},       // YT-UP 2160p 35-45
      {def, "hevc", 1920, 1080, 30, -1, 4'500'000, 5'800'000},         // HLS HEVC 1080p rungs
      {def, "h264", 1920, 1080, 30, 29, 4'000'000, 4'000'000},         // FF-264: +6 CRF halves
      {def, "mpeg2video", 1920, 1080, 30, 4, 16'000'000, 16'000'000},  // NIST: twice H.264
      {def, "mpeg2video", 1920, 1080, 30, 8, 8'000'000, 8'000'000},    // MPL: as 1 / qscale
      {max, "h264", 1920, 1080, 30, 0, 25'000'000, 25'000'000},        // level 4 20 Mbps x 1.25
      {max, "mpeg2video", 720, 576, 25, 1, 15'000'000, 15'000'000},    // Main@ML 15 Mbps
      {def, "prores_hq", 1920, 1080, 29.97, -1, 220'000'000, 220'000'000},
      {def, "prores_proxy", 3840, 2160, 29.97, -1, 182'000'000, 182'000'000},
      {max, "prores_hq", 1920, 1080, 29.97, -1, 220'000'000, 220'000'000},
      {def, "dnxhr_hq", 3840, 2160, 25, 18, 728'268'800, 728'268'800},  // 3641344 B a frame
      {max, "dnxhd", 1920, 1080, 25, -1, 183'500'800, 183'500'800},     // CID 1238
      {def, "H264", 1920, 1080, 30, -1, 8'000'000, 8'000'000},          // any letter case
      // Lossless: half the uncompressed frame (FFV1 of 12-bit 4:2:0, PNG of RGB24).
      {def, "ffv1", 1920, 1080, 25, -1, 311'040'000, 311'040'000},
      {max, "png", 1920, 1080, 25, -1, 2'488'320'000, 2'488'320'000},
  };
  for (const auto& r : video) {
    const std::int64_t figure = r.lookUp(r.id, r.w, r.h, r.fps, r.q);
    EXPECT_TRUE(figure >= r.low && figure <= r.high)
        << r.id << " " << r.w << "x" << r.h << "@" << r.fps << " q" << r.q << ": " << figure;
  }
  const auto stereo = CH_LAYOUT_STEREO;
  const auto s16 = AV_SAMPLE_FMT_S16;
  EXPECT_EQ(GetDefaultAudioBitrate("pcm_s16le", 48000, stereo, s16), 1'536'000);
  EXPECT_EQ(GetDefaultAudioBitrate("mp2", 48000, stereo, s16), 224'000);  // FF-TGT
  EXPECT_EQ(GetDefaultAudioBitrate("dts", 48000, CH_LAYOUT_5POINT1, AV_SAMPLE_FMT_S32),
            768'000);                                                         // DVD
  EXPECT_EQ(GetMinAudioBitrate("pcm_s16le", 44100, stereo, s16), 1'411'200);  // CD
  EXPECT_EQ(GetMaxAudioBitrate("pcm_s24le", 96000, CH_LAYOUT_5POINT1, AV_SAMPLE_FMT_S32),
            96000 * 6 * 24);  // the identifier fixes 24 bits, whatever the sample format
  EXPECT_EQ(GetDefaultAudioBitrate("pcm_mulaw", 8000, CH_LAYOUT_MONO, AV_SAMPLE_FMT_NONE),
            64'000);                                               // G.711
  EXPECT_EQ(Audio("aac", 48000, stereo)[1], 128'000);              // FF-AAC: 64 kbps a channel
  EXPECT_EQ(Audio("aac", 48000, stereo)[2], 576'000);              // 6144 bits / 1024 samples
  EXPECT_LE(Audio("aac", 44100, stereo)[2], 6 * 44100 * 2);        // never above that ceiling
  EXPECT_EQ(Audio("opus", 48000, stereo)[1], 96'000);              // FF-OPUS: one coupled stream
  EXPECT_EQ(Audio("opus", 48000, CH_LAYOUT_5POINT1)[1], 320'000);  // 4 streams, 2 coupled
  EXPECT_EQ(Audio("ac3", 48000, CH_LAYOUT_5POINT1)[1], 448'000);   // FF-TGT DVD
  EXPECT_EQ(Audio("ac3", 48000, CH_LAYOUT_5POINT1_BACK)[1], 448'000);
  EXPECT_EQ(Audio("mp3", 44100, stereo)[2], 320'000);     // MPA MPEG-1 table
  EXPECT_EQ(Audio("mp3", 22050, stereo)[2], 160'000);     // MPA MPEG-2 LSF table
  EXPECT_EQ(Audio("flac", 44100, stereo)[2], 1'411'200);  // incompressible: the PCM rate
  EXPECT_GT(Audio("flac", 44100, stereo, AV_SAMPLE_FMT_S32)[1], Audio("flac", 44100, stereo)[1]);
}

// Quality moves the software codecs only: not fixed-rate and lossless codecs, nor Theora, whose
// quality scale has no published rates.
TEST(BitratePresetsTest, QualityMovesTheSoftwareCodecsOnly) {
  for (const std::string& id : GetPresetVideoCodecs()) {
    const std::int64_t fine = GetDefaultVideoBitrate(id, 1280, 720, 30, 10);
    const std::int64_t coarse = GetDefaultVideoBitrate(id, 1280, 720, 30, 40);
    const bool fixedRate = id.rfind("prores", 0) == 0 || id.rfind("dnx", 0) == 0 || id == "ffv1" ||
                           id == "png" || id == "theora";
    EXPECT_TRUE(fixedRate ? fine == coarse : fine > coarse) << id << ": " << fine << ", " << coarse;
  }
}

// Each refusal is of its own class, a ConfException, and its description names the offending
// value.
static_assert(std::is_base_of_v<ConfException, UnknownCodecError> &&
              std::is_base_of_v<ConfException, InvalidPresetArgumentError>);
TEST(BitratePresetsTest, BadArgumentsAreNamedInTheError) {
  const double nan = std::numeric_limits<double>::quiet_NaN();
  const double inf = std::numeric_limits<double>::infinity();
  const auto video = [](const char* id, long long w, long long h, double fps) {
    return [=] { GetDefaultVideoBitrate(id, w, h, fps, -1); };
  };
  const auto audio = [](const char* id, long long rate, unsigned mask, AVSampleFormat f) {
    return [=] { GetMinAudioBitrate(id, rate, static_cast<ChannelLayout>(mask), f); };
  };
  const std::pair<std::function<void()>, const char*> unknownCodecs[] = {
      {video("h266", 640, 360, 30), "h266"},
      {[] { GetMaxVideoBitrate("opus", 640, 360, 30, -1); }, "opus"},
      {audio("h264", 48000, 3, AV_SAMPLE_FMT_S16), "h264"},
  };
  for (const auto& [call, named] : unknownCodecs) {
    EXPECT_NE(DescriptionOf<UnknownCodecError>(call).find(named), std::string::npos) << named;
  }
  const std::pair<std::function<void()>, const char*> invalidArguments[] = {
      {video("h264", 0, 1080, 30), "Width 0"},
      {video("h264", 1920, -1, 30), "Height -1"},
      {video("h264", 1920, 1080, -25), "Frame rate -25"},
      {video("h264", 1920, 1080, nan), "Frame rate nan"},
      {video("h264", 1920, 1080, inf), "Frame rate inf"},
      {audio("aac", 0, 3, AV_SAMPLE_FMT_S16), "Sample rate 0"},
      {audio("pcm_s16le", 4294967296LL, 3, AV_SAMPLE_FMT_S16), "4294967296"},
      {audio("aac", 48000, 0, AV_SAMPLE_FMT_S16), "Channel layout 0x0"},
      {audio("mp3", 48000, 0x60F, AV_SAMPLE_FMT_S16), "mp3"},
      {audio("flac", 48000, 3, AV_SAMPLE_FMT_NONE), "Sample format -1"},
      {audio("alac", 48000, 3, AV_SAMPLE_FMT_FLT), "flt"},
  };
  for (const auto& [call, named] : invalidArguments) {
    const std::string description = DescriptionOf<InvalidPresetArgumentError>(call);
    EXPECT_NE(description.find(named), std::string::npos) << named << ": " << description;
  }
}

}  // namespace
