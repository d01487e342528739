// The bitrate functions: the kind check and its error, what reaches the presets look-ups, and
// the description's reference count after every call, however it ends. The six look-ups are
// defined here, as a stand-in for the presets library that records what it is handed.
#include <gtest/gtest.h>

#include <cstdint>
#include <stdexcept>
#include <string>
#include <tuple>
#include <utility>

#include "Support/TestSupport.h"

namespace {

using namespace Tarvek::Conf;
using TarvekTest::CatchAs;
using TarvekTest::ItemOf;

// The last call to any of the six look-ups.
struct Call {
  std::string function;  // e.g. "GetMinVideoBitrate"; empty when nothing was called
  std::string codecId;
  long long width = 0, height = 0;
  double frameRate = 0.0;
  int quality = 0;
  long long sampleRate = 0;
  ChannelLayout layout{};
  AVSampleFormat sampleFormat = AV_SAMPLE_FMT_NONE;
};

// A call's fields side by side, for comparison and printing.
auto Fields(const Call& c) {
  return std::tie(c.function, c.codecId, c.width, c.height, c.frameRate, c.quality, c.sampleRate,
                  c.layout, c.sampleFormat);
}

Call last;
bool failNext = false;  // makes the next look-up throw std::runtime_error

std::int64_t Record(Call call, std::int64_t answer) {
  last = std::move(call);
  if (std::exchange(failNext, false)) throw std::runtime_error("presets failure");
  return answer;
}

}  // namespace

// The stand-in: a distinct answer per look-up, so a test sees which one answered.
namespace Tarvek {
namespace Conf {

#define TARVEK_VIDEO_LOOK_UP(Name, answer)                                                \
  std::int64_t Name(const std::string& id, long long w, long long h, double fps, int q) { \
    return Record({#Name, id, w, h, fps, q}, answer);                                     \
  }
#define TARVEK_AUDIO_LOOK_UP(Name, answer)                                       \
  std::int64_t Name(const std::string& id, long long rate, ChannelLayout layout, \
                    AVSampleFormat format) {                                     \
    return Record({#Name, id, 0, 0, 0.0, 0, rate, layout, format}, answer);      \
  }
TARVEK_VIDEO_LOOK_UP(GetDefaultVideoBitrate, 1001)
TARVEK_VIDEO_LOOK_UP(GetMinVideoBitrate, 1002)
TARVEK_VIDEO_LOOK_UP(GetMaxVideoBitrate, 1003)
TARVEK_AUDIO_LOOK_UP(GetDefaultAudioBitrate, 2001)
TARVEK_AUDIO_LOOK_UP(GetMinAudioBitrate, 2002)
TARVEK_AUDIO_LOOK_UP(GetMaxAudioBitrate, 2003)
#undef TARVEK_VIDEO_LOOK_UP
#undef TARVEK_AUDIO_LOOK_UP

}  // namespace Conf
}  // namespace Tarvek

namespace {

using Calculator = boost::int64_t (*)(const boost::intrusive_ptr<const IFormatCodec>&);

struct Function {
  const char* name;
  Calculator calculate;
  bool video;
  int throwLine;
  std::int64_t answer;  // what the stand-in returns for this function
};

void PrintTo(const Function& function, std::ostream* out) { *out << function.name; }

const Function kFunctions[] = {
    {"GetDefaultVideoBitrate", &GetDefaultVideoBitrate, true, 16, 1001},
    {"GetMinVideoBitrate", &GetMinVideoBitrate, true, 42, 1002},
    {"GetMaxVideoBitrate", &GetMaxVideoBitrate, true, 67, 1003},
    {"GetDefaultAudioBitrate", &GetDefaultAudioBitrate, false, 94, 2001},
    {"GetMinAudioBitrate", &GetMinAudioBitrate, false, 110, 2002},
    {"GetMaxAudioBitrate", &GetMaxAudioBitrate, false, 125, 2003},
};

boost::intrusive_ptr<IFormatCodecVideo> FullVideo() {
  auto video = FormatCodecVideo::Create();
  video->SetCodecID("h264");
  video->SetBitrateMode(IFormatCodec::TAG_BITRATE_MODE_VBR);
  video->SetQuality(23);
  video->InitByPixelAspect(1920, 1080, 1, 1);
  video->SetFrameRate(30000, 1001);
  return video;
}

boost::intrusive_ptr<IFormatCodecAudio> FullAudio() {
  auto audio = FormatCodecAudio::Create();
  audio->SetCodecID("aac");
  audio->SetSampleRate(48000);
  audio->SetChannelLayout(CH_LAYOUT_5POINT1);
  audio->SetSampleFormat(AV_SAMPLE_FMT_FLTP);
  return audio;
}

class BitrateCalculatorTest : public ::testing::TestWithParam<Function> {
 protected:
  void SetUp() override { last = Call{}; }
};

// Null and every other kind are refused at the function's own throw site, before any look-up,
// and the description gets its reference back.
TEST_P(BitrateCalculatorTest, RefusesEveryOtherKind) {
  const Function& f = GetParam();
  const boost::intrusive_ptr<const IFormatCodec> wrongKinds[] = {
      nullptr, FormatCodec::Create(), FormatCodecSubtitle::Create(),
      f.video ? boost::intrusive_ptr<const IFormatCodec>(FullAudio()) : FullVideo()};
  for (const auto& codec : wrongKinds) {
    const auto error = CatchAs<ConfException>([&] { f.calculate(codec); });
    ASSERT_TRUE(error);
    EXPECT_EQ(ItemOf<Tarvek::DescriptionInfo>(*error),
              "Incompatible type of IFormatCodec structure");
    EXPECT_TRUE(ItemOf<Tarvek::CallStackInfo>(*error));
    TarvekTest::ExpectThrownAt(*error, "Conf/Formats/BitrateCalculator.cpp", f.throwLine,
                               std::string("boost::int64_t Tarvek::Conf::") + f.name +
                                   "(const boost::intrusive_ptr<const IFormatCodec> &)");
    EXPECT_TRUE(last.function.empty()) << "the look-up must not be called";
    if (codec) {
      EXPECT_EQ(codec->GetRefCount(), 1);
    }
  }
}

// The settings reach the function's own look-up unchanged, and its answer comes back.
TEST_P(BitrateCalculatorTest, CallsItsOwnLookUpAndGivesTheReferenceBackHoweverItEnds) {
  const Function& f = GetParam();
  const boost::intrusive_ptr<IFormatCodec> codec =
      f.video ? boost::intrusive_ptr<IFormatCodec>(FullVideo()) : FullAudio();
  EXPECT_EQ(f.calculate(codec), f.answer);
  const Call expected =
      f.video ? Call{f.name, "h264", 1920, 1080, 30000.0 / 1001.0, 23}
              : Call{f.name, "aac", 0, 0, 0.0, 0, 48000, CH_LAYOUT_5POINT1, AV_SAMPLE_FMT_FLTP};
  EXPECT_EQ(Fields(last), Fields(expected));
  EXPECT_EQ(codec->GetRefCount(), 1);

  failNext = true;
  EXPECT_THROW(f.calculate(codec), std::runtime_error);
  EXPECT_EQ(codec->GetRefCount(), 1);

  codec->SetProperty(Tarvek::Core::Property("empty"));
  EXPECT_THROW(f.calculate(codec), Tarvek::Core::ChildNotFound);
  EXPECT_EQ(codec->GetRefCount(), 1);
}

INSTANTIATE_TEST_SUITE_P(AllSix, BitrateCalculatorTest, ::testing::ValuesIn(kFunctions),
                         [](const auto& info) { return std::string(info.param.name); });

// Width and height arrive zero-extended, the quality as its low 32 bits, a frame rate of
// denominator 0 as 0, and the sample rate sign-extended. Only the exact, case-sensitive VBR mode
// passes the quality on; in any other mode it is not even read, so it may be absent. The mode
// itself must be there, even for the default.
TEST(ArgumentsTest, ValuesArriveAsTheInterfaceDefines) {
  const auto video = FullVideo();
  video->SetQuality((1LL << 32) + 23);
  video->InitByPixelAspect(4294967295u, 2147483648u, 1, 1);
  video->SetFrameRate(25, 0);
  EXPECT_EQ(GetDefaultVideoBitrate(video), 1001);
  EXPECT_EQ(Fields(last),
            Fields(Call{"GetDefaultVideoBitrate", "h264", 4294967295LL, 2147483648LL, 0.0, 23}));
  for (const std::string mode : {"", "VBR", "vbr ", "cbr"}) {
    video->SetBitrateMode(mode);
    GetDefaultVideoBitrate(video);
    EXPECT_EQ(last.quality, -1) << "mode \"" << mode << '"';
  }
  video->SetProperty(TarvekTest::Without(video->GetProperty(), IFormatCodec::TAG_QUALITY));
  last.quality = 0;
  GetDefaultVideoBitrate(video);
  EXPECT_EQ(last.quality, -1);
  video->SetProperty(TarvekTest::Without(video->GetProperty(), IFormatCodec::TAG_BITRATE_MODE));
  EXPECT_EQ(TarvekTest::MissingKey([&] { GetDefaultVideoBitrate(video); }),
            IFormatCodec::TAG_BITRATE_MODE);

  // FullAudio has neither bitrate mode nor quality: the audio functions read none.
  const auto audio = FullAudio();
  audio->SetSampleRate(-44100);
  EXPECT_EQ(GetMaxAudioBitrate(audio), 2003);
  EXPECT_EQ(last.sampleRate, -44100);
}

}  // namespace
