// The bitrate functions: the kind check and its error, what reaches the presets look-ups, and
// that the description's reference count is the same after every call, however it ends.
#include <gtest/gtest.h>

#include <boost/exception/all.hpp>
#include <stdexcept>

#include "Conf/Formats/RecordingPresets.h"
#include "Support/TestSupport.h"

namespace {

using Tarvek::Conf::ConfException;
using Tarvek::Conf::FormatCodecAudio;
using Tarvek::Conf::FormatCodecVideo;
using Tarvek::Conf::IFormatCodec;
using Tarvek::Conf::IFormatCodecAudio;
using Tarvek::Conf::IFormatCodecVideo;
using TarvekTest::CatchAs;
using TarvekTest::ItemOf;

using Calculator = boost::int64_t (*)(const boost::intrusive_ptr<const IFormatCodec>&);

struct Function {
  const char* name;
  Calculator calculate;
  bool video;
  int throwLine;
  std::int64_t answer;  // what the recording stand-in returns for this function
};

void PrintTo(const Function& function, std::ostream* out) { *out << function.name; }

const Function kFunctions[] = {
    {"GetDefaultVideoBitrate", &Tarvek::Conf::GetDefaultVideoBitrate, true, 16,
     RecordingPresets::kDefaultVideo},
    {"GetMinVideoBitrate", &Tarvek::Conf::GetMinVideoBitrate, true, 42,
     RecordingPresets::kMinVideo},
    {"GetMaxVideoBitrate", &Tarvek::Conf::GetMaxVideoBitrate, true, 67,
     RecordingPresets::kMaxVideo},
    {"GetDefaultAudioBitrate", &Tarvek::Conf::GetDefaultAudioBitrate, false, 94,
     RecordingPresets::kDefaultAudio},
    {"GetMinAudioBitrate", &Tarvek::Conf::GetMinAudioBitrate, false, 110,
     RecordingPresets::kMinAudio},
    {"GetMaxAudioBitrate", &Tarvek::Conf::GetMaxAudioBitrate, false, 125,
     RecordingPresets::kMaxAudio},
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
  audio->SetChannelLayout(Tarvek::Conf::CH_LAYOUT_5POINT1);
  audio->SetSampleFormat(AV_SAMPLE_FMT_FLTP);
  return audio;
}

class BitrateCalculatorTest : public ::testing::TestWithParam<Function> {
 protected:
  void SetUp() override { RecordingPresets::Reset(); }

  // Calls the function under test and checks that it refused `codec` as the wrong kind.
  void ExpectIncompatible(const boost::intrusive_ptr<const IFormatCodec>& codec) {
    const Function& f = GetParam();
    const int countBefore = codec ? codec->GetRefCount() : 0;
    const auto error = CatchAs<ConfException>([&] { f.calculate(codec); });
    ASSERT_TRUE(error);
    EXPECT_EQ(ItemOf<Tarvek::DescriptionInfo>(*error),
              "Incompatible type of IFormatCodec structure");
    EXPECT_TRUE(ItemOf<Tarvek::CallStackInfo>(*error).has_value());
    EXPECT_STREQ(ItemOf<boost::throw_file>(*error).value_or(""),
                 "Conf/Formats/BitrateCalculator.cpp");
    EXPECT_EQ(ItemOf<boost::throw_line>(*error), f.throwLine);
    EXPECT_EQ(std::string(ItemOf<boost::throw_function>(*error).value_or("")),
              std::string("boost::int64_t Tarvek::Conf::") + f.name +
                  "(const boost::intrusive_ptr<const IFormatCodec> &)");
    EXPECT_TRUE(RecordingPresets::Last().function.empty()) << "the look-up must not be called";
    if (codec) {
      EXPECT_EQ(codec->GetRefCount(), countBefore);
    }
  }

  // A description of the right kind for the function under test, with every setting it reads.
  static boost::intrusive_ptr<const IFormatCodec> RightKind() {
    if (GetParam().video) return FullVideo();
    return FullAudio();
  }
};

TEST_P(BitrateCalculatorTest, RefusesAnEmptyPointer) { ExpectIncompatible(nullptr); }

TEST_P(BitrateCalculatorTest, RefusesEveryOtherKind) {
  ExpectIncompatible(Tarvek::Conf::FormatCodec::Create());
  ExpectIncompatible(Tarvek::Conf::FormatCodecSubtitle::Create());
  if (GetParam().video) {
    ExpectIncompatible(FullAudio());
  } else {
    ExpectIncompatible(FullVideo());
  }
}

TEST_P(BitrateCalculatorTest, CallsItsOwnLookUpAndReturnsItsAnswerUnchanged) {
  const auto codec = RightKind();
  EXPECT_EQ(GetParam().calculate(codec), GetParam().answer);
  EXPECT_EQ(RecordingPresets::Last().function, GetParam().name);
  EXPECT_EQ(codec->GetRefCount(), 1);
}

TEST_P(BitrateCalculatorTest, GivesTheReferenceBackWhenTheLookUpOrASettingFails) {
  const auto codec = RightKind();
  RecordingPresets::FailNextCall();
  EXPECT_THROW(GetParam().calculate(codec), std::runtime_error);
  EXPECT_EQ(codec->GetRefCount(), 1);

  Tarvek::Core::Property empty("empty");
  const_cast<IFormatCodec&>(*codec).SetProperty(empty);
  EXPECT_THROW(GetParam().calculate(codec), Tarvek::Core::ChildNotFound);
  EXPECT_EQ(codec->GetRefCount(), 1);
}

INSTANTIATE_TEST_SUITE_P(AllSix, BitrateCalculatorTest, ::testing::ValuesIn(kFunctions),
                         [](const ::testing::TestParamInfo<Function>& info) {
                           return std::string(info.param.name);
                         });

class VideoArgumentsTest : public ::testing::Test {
 protected:
  void SetUp() override { RecordingPresets::Reset(); }

  const RecordingPresets::Call& Pass() {
    Tarvek::Conf::GetDefaultVideoBitrate(video_);
    return RecordingPresets::Last();
  }

  boost::intrusive_ptr<IFormatCodecVideo> video_ = FullVideo();
};

TEST_F(VideoArgumentsTest, HandsOnTheSettingsUnchanged) {
  const auto& call = Pass();
  EXPECT_EQ(call.codecId, "h264");
  EXPECT_EQ(call.width, 1920);
  EXPECT_EQ(call.height, 1080);
  EXPECT_DOUBLE_EQ(call.frameRate, 30000.0 / 1001.0);
  EXPECT_EQ(call.quality, 23);
}

TEST_F(VideoArgumentsTest, QualityCountsOnlyInExactVbrMode) {
  const std::string vbr = IFormatCodec::TAG_BITRATE_MODE_VBR;
  std::string upper = vbr;
  for (char& c : upper) c = static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
  ASSERT_NE(upper, vbr);
  for (const std::string& mode : {std::string(), upper, vbr + " ", std::string("cbr")}) {
    video_->SetBitrateMode(mode);
    EXPECT_EQ(Pass().quality, -1) << "mode \"" << mode << '"';
  }
}

TEST_F(VideoArgumentsTest, QualityIsNotReadOutsideVbrMode) {
  Tarvek::Core::Property tree("t");
  tree.SetChildT<std::string>(IFormatCodec::TAG_CODEC_ID, "h264");
  tree.SetChildT<std::string>(IFormatCodec::TAG_BITRATE_MODE, "cbr");
  tree.SetChildT<long long>(IFormatCodecVideo::TAG_WIDTH, 1280);
  tree.SetChildT<long long>(IFormatCodecVideo::TAG_HEIGHT, 720);
  tree.SetChildT<long long>(IFormatCodecVideo::TAG_TIMEBASE_N, 60);
  tree.SetChildT<long long>(IFormatCodecVideo::TAG_TIMEBASE_D, 1);
  video_->SetProperty(tree);
  EXPECT_EQ(Pass().quality, -1);
}

TEST_F(VideoArgumentsTest, MissingBitrateModeFailsEvenForTheDefault) {
  // Every setting but the bitrate mode.
  Tarvek::Core::Property without("t");
  for (const auto& child : video_->GetProperty().GetChildren()) {
    if (child.GetName() != IFormatCodec::TAG_BITRATE_MODE) without.SetChild(child.GetName(), child);
  }
  video_->SetProperty(without);
  const auto error =
      CatchAs<Tarvek::Core::ChildNotFound>([&] { Tarvek::Conf::GetDefaultVideoBitrate(video_); });
  ASSERT_TRUE(error);
  EXPECT_EQ(ItemOf<Tarvek::Core::ChildNotFound::ChildNameInfo>(*error),
            IFormatCodec::TAG_BITRATE_MODE);
}

TEST_F(VideoArgumentsTest, OutOfRangeValuesArriveAsTheInterfaceDefines) {
  video_->SetQuality((1LL << 32) + 23);  // only the low 32 bits reach the look-up
  video_->InitByPixelAspect(4294967295u, 2147483648u, 1, 1);
  video_->SetFrameRate(25, 0);
  const auto& call = Pass();
  EXPECT_EQ(call.quality, 23);
  EXPECT_EQ(call.width, 4294967295LL);
  EXPECT_EQ(call.height, 2147483648LL);
  EXPECT_EQ(call.frameRate, 0.0);
}

TEST(AudioArgumentsTest, HandsOnTheSettingsUnchanged) {
  RecordingPresets::Reset();
  auto audio = FullAudio();
  audio->SetSampleRate(-44100);
  audio->SetBitrateMode("not read");  // the audio functions ignore mode and quality
  EXPECT_EQ(Tarvek::Conf::GetMaxAudioBitrate(audio), RecordingPresets::kMaxAudio);
  const auto& call = RecordingPresets::Last();
  EXPECT_EQ(call.codecId, "aac");
  EXPECT_EQ(call.sampleRate, -44100);
  EXPECT_EQ(call.layout, Tarvek::Conf::CH_LAYOUT_5POINT1);
  EXPECT_EQ(call.sampleFormat, AV_SAMPLE_FMT_FLTP);
}

}  // namespace
