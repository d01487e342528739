// Validate: every finding is triggered by one small change of a clean description, which itself
// gives none; whatever the tree holds, Validate does not throw.
#include <gtest/gtest.h>

#include <Tarvek/Formats.h>
#include <Tarvek/Inspect/JsonForm.h>
#include <Tarvek/Inspect/Validate.h>
#include <functional>
#include <string>
#include <vector>

namespace {

using namespace Tarvek;
using namespace Tarvek::Conf;

// A video and an audio description the presets take, with a bitrate inside their range.
boost::intrusive_ptr<IFormatCodec> CleanVideo() {
  auto video = FormatCodecVideo::Create();
  video->SetCodecID("h264");
  video->InitByFrameAspect(1920, 1080, 16, 9);
  video->SetFrameRate(25, 1);
  video->SetBitrateMode("cbr");
  video->SetBitrate(6000000);
  video->SetPixelFormat(AV_PIX_FMT_YUV420P);
  return video;
}

boost::intrusive_ptr<IFormatCodec> CleanAudio() {
  auto audio = FormatCodecAudio::Create();
  audio->SetCodecID("aac");
  audio->SetSampleRate(48000);
  audio->SetChannelLayout(CH_LAYOUT_STEREO);
  audio->SetSampleFormat(AV_SAMPLE_FMT_FLTP);
  audio->SetLanguage("eng");
  audio->SetBitrate(128000);
  return audio;
}

using Change = std::function<void(IFormatCodec&)>;

// The tree of `codec` with `edit` applied to a copy, set back whole, as SetProperty allows.
Change Edited(std::function<void(Core::Property&)> edit) {
  return [edit](IFormatCodec& codec) {
    Core::Property tree = codec.GetProperty();
    edit(tree);
    codec.SetProperty(tree);
  };
}

// A child of the root set to `value`.
template <class T>
Change Stored(const std::string& key, T value) {
  return Edited([key, value](Core::Property& tree) { tree.SetChildT<T>(key, value); });
}

Change Removed(const std::string& key) {
  return Edited([key](Core::Property& tree) {
    Core::Property kept(tree.GetName());
    for (const Core::Property& child : tree.GetChildren()) {
      if (child.GetName() != key) kept.CreateChildT<bool>(child.GetName(), false) = child;
    }
    tree = kept;
  });
}

// A second child `key` appended to the root, which the accessors never read.
Change Appended(const std::string& key, long long value) {
  return Edited([key, value](Core::Property& tree) { tree.CreateChildT<long long>(key, value); });
}

struct Case {
  std::function<boost::intrusive_ptr<IFormatCodec>()> clean;
  Change change;
  Severity severity;
  std::string setting;
  std::string message;  // the whole message, or its start followed by "..."
};

// Whatever the tree holds, Validate does not throw; clean descriptions give no finding.
TEST(Validate, FindsNothingInCleanDescriptionsAndNeverThrows) {
  auto subtitle = FormatCodecSubtitle::Create();
  subtitle->SetDVBWidth(720);
  for (const boost::intrusive_ptr<IFormatCodec>& codec :
       {CleanVideo(), CleanAudio(), FormatCodec::Create(),
        boost::intrusive_ptr<IFormatCodec>(subtitle)}) {
    EXPECT_TRUE(Validate(codec).empty()) << DescriptionKind(codec);
  }
  auto video = FormatCodecVideo::Create();
  Core::Property tree("any");
  for (const char* key : {"metadata", "codec_id", "width", "bitrate_mode", "pix_fmt"}) {
    tree.SetChild(key).CreateChildT<std::string>("inner", "x");
  }
  video->SetProperty(tree);
  std::vector<Finding> findings;
  ASSERT_NO_THROW(findings = Validate(video));
  // Four settings of the wrong type and the five missing ones the bitrates or the frame aspect
  // need; no look-up is tried with errors present.
  EXPECT_EQ(findings.size(), 9u);
  ASSERT_EQ(Validate(nullptr).size(), 1u);
  EXPECT_EQ(Validate(nullptr)[0].severity, Severity::Error);
}

TEST(Validate, ReportsEachFindingOnItsOwn) {
  using Video = IFormatCodecVideo;
  using Audio = IFormatCodecAudio;
  const std::string needed = " is missing; the bitrate functions need it";
  const std::vector<Case> cases = {
      {CleanVideo, Stored<std::string>(Video::TAG_WIDTH, "1920"), Severity::Error, "width",
       "width holds \"1920\" (string), but its accessors read an int64"},
      {CleanAudio, Stored<long long>(IFormat::TAG_METADATA, 5), Severity::Error, "metadata",
       "metadata holds 5 (int64), but its accessors read a container"},
      {CleanAudio, Edited([](Core::Property& tree) {
         tree.SetChild(IFormat::TAG_METADATA).SetChildT<bool>(IFormatCodec::TAG_LANGUAGE, true);
       }),
       Severity::Error, "metadata/language",
       "metadata/language holds true (bool), but its accessors read a string"},
      {CleanVideo, Stored<long long>(IFormatCodec::TAG_THREAD_NUMBER, -1), Severity::Error,
       "threads",
       "threads holds -1, beyond the range 0 to 4294967295 its accessor reads (it reads "
       "4294967295)"},
      {CleanVideo, Removed(IFormatCodec::TAG_BITRATE_MODE), Severity::Warning, "bitrate_mode",
       "bitrate_mode" + needed},
      {CleanVideo, Appended(Video::TAG_WIDTH, 1280), Severity::Error, "width",
       "width is present 2 times; the accessors read the first and the others are lost to them"},
      {CleanVideo, Stored<std::string>(IFormatCodec::TAG_BITRATE_MODE, "vbr"), Severity::Error,
       "quality", "quality" + needed + " in vbr mode"},
      {CleanAudio, Removed(Audio::TAG_SAMPLE_FORMAT), Severity::Error, "sample_fmt",
       "sample_fmt" + needed},
      {CleanVideo, Removed(Video::TAG_ASPECTY), Severity::Warning, "sample_aspect_den",
       "sample_aspect_den is missing; the frame aspect and the compatibility test need it"},
      {CleanVideo, Stored<long long>(Video::TAG_WIDTH, 0), Severity::Error, "width",
       "the width is 0"},
      {CleanVideo, Stored<long long>(Video::TAG_HEIGHT, 0), Severity::Error, "height",
       "the height is 0"},
      {CleanVideo, Stored<long long>(Video::TAG_ASPECTX, 0), Severity::Error, "sample_aspect_num",
       "the pixel aspect X (sample_aspect_num) is 0"},
      {CleanVideo, Stored<long long>(Video::TAG_TIMEBASE_D, 0), Severity::Error, "framerate_den",
       "the frame-rate denominator is 0, which leaves the frame rate unknown"},
      {CleanVideo, Stored<std::string>(IFormatCodec::TAG_CODEC_ID, "h265"), Severity::Error,
       "codec_id", "codec_id holds \"h265\" (string), which is not a video codec the presets know"},
      {CleanAudio, Stored<std::string>(IFormatCodec::TAG_CODEC_ID, "hevc"), Severity::Error,
       "codec_id",
       "codec_id holds \"hevc\" (string), a video codec; an audio description needs one of its "
       "own kind"},
      {CleanVideo, Stored<long long>(IFormatCodec::TAG_BITRATE, 1000), Severity::Warning,
       "bit_rate", "bit_rate 1000 b/s is below the presets' minimum of ..."},
      {CleanAudio, Stored<long long>(IFormatCodec::TAG_BITRATE, 100000000), Severity::Warning,
       "bit_rate", "bit_rate 100000000 b/s is above the presets' maximum of ..."},
      {CleanVideo, Stored<long long>(Video::TAG_PIX_FMT, -1), Severity::Error, "pix_fmt",
       "pix_fmt -1 is not a pixel format libavutil knows"},
      {CleanAudio, Stored<long long>(Audio::TAG_SAMPLE_FORMAT, AV_SAMPLE_FMT_NB), Severity::Error,
       "sample_fmt",
       "sample_fmt " + std::to_string(AV_SAMPLE_FMT_NB) +
           " is not a sample format libavutil knows"},
      {CleanAudio, Stored<long long>(Audio::TAG_LAYOUT, 0), Severity::Error, "channel_layout",
       "the channel layout is 0: it names no speaker"},
      {CleanAudio,
       [](IFormatCodec& codec) {
         codec.SetCodecID("mp3");
         dynamic_cast<IFormatCodecAudio&>(codec).SetChannelLayout(CH_LAYOUT_5POINT1);
       },
       Severity::Error, "", "the presets refuse this description: ..."},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.message);
    const auto codec = c.clean();
    c.change(*codec);
    std::vector<Finding> findings;
    ASSERT_NO_THROW(findings = Validate(codec));
    std::string all;
    for (const Finding& f : findings) all += f.message + "\n";
    ASSERT_EQ(findings.size(), 1u) << all;
    EXPECT_EQ(SeverityName(findings[0].severity), std::string(SeverityName(c.severity)));
    EXPECT_EQ(findings[0].setting, c.setting);
    const std::size_t dots = c.message.find("...");
    EXPECT_EQ(findings[0].message.substr(0, dots), c.message.substr(0, dots));
  }
}

}  // namespace
