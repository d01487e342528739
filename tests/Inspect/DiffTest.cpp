// Diff and ExplainCompatibility: one entry for each kind of difference, empty exactly when
// Compare or IsCompatible is true, and reasons instead of exceptions for missing settings.
#include <gtest/gtest.h>

#include <Tarvek/Formats.h>
#include <Tarvek/Inspect/Diff.h>
#include <string>
#include <vector>

namespace {

using namespace Tarvek;
using namespace Tarvek::Conf;
using Format = boost::intrusive_ptr<const IFormat>;

boost::intrusive_ptr<IFormatCodecVideo> Video(unsigned width, unsigned height, unsigned x = 1,
                                              unsigned y = 1) {
  auto video = FormatCodecVideo::Create();
  video->InitByPixelAspect(width, height, x, y);
  return video;
}

boost::intrusive_ptr<IFormatCodecAudio> Audio(int rate, ChannelLayout layout,
                                              AVSampleFormat format) {
  auto audio = FormatCodecAudio::Create();
  audio->SetSampleRate(rate);
  audio->SetChannelLayout(layout);
  audio->SetSampleFormat(format);
  return audio;
}

// A 1080p video whose encoder options are `options`.
Format WithOptions(const Core::Property& options) {
  auto video = Video(1920, 1080);
  video->SetOptionsEncode(options);
  return video;
}

// A 1080p video whose width is stored as text, as a hand-edited tree may hold it.
Format TextWidth() {
  auto video = Video(1920, 1080);
  Core::Property tree = video->GetProperty();
  tree.SetChildT<std::string>(IFormatCodecVideo::TAG_WIDTH, "1920");
  video->SetProperty(tree);
  return video;
}

// Each entry on a line of its own with every field, so that a table row pins the whole list.
std::string Lines(const std::vector<Difference>& differences) {
  std::string text;
  for (const Difference& d : differences) {
    text += d.path + " " + DifferenceKindName(d.kind) + ": " + d.a + " | " + d.b + "\n";
    // The nodes are given exactly for the kinds that compare one setting on each side.
    if (d.kind != DifferenceKind::OtherOrder && d.kind != DifferenceKind::OtherName) {
      EXPECT_EQ(d.nodeA ? ValueText(*d.nodeA) : "", d.a) << d.path;
      EXPECT_EQ(d.nodeB ? ValueText(*d.nodeB) : "", d.b) << d.path;
    }
  }
  return text;
}

std::string Lines(const std::vector<Incompatibility>& reasons) {
  std::string text;
  for (const Incompatibility& r : reasons) {
    text += r.setting + ": " + r.a + " | " + r.b + ": " + r.reason + "\n";
  }
  return text;
}

TEST(Diff, GivesOneEntryForEachKindOfDifference) {
  auto withBitrate = Video(1920, 1080);
  withBitrate->SetBitrate(8000000);
  auto audio = Audio(48000, CH_LAYOUT_STEREO, AV_SAMPLE_FMT_FLTP);
  auto english = audio->Clone();
  english->SetLanguage("eng");
  Core::Property slow("o"), fast("o"), xy("o"), yx("o"), repeatA("o"), repeatB("o");
  slow.SetChildT<std::string>("preset", "slow");
  fast.SetChildT<std::string>("preset", "fast\n");
  xy.SetChildT<long long>("x", 1);
  xy.SetChildT<long long>("y", 2);
  yx.SetChildT<long long>("y", 2);
  yx.SetChildT<long long>("x", 1);
  // Repeated names match in order; odd names are quoted.
  for (Core::Property* options : {&repeatA, &repeatB}) {
    options->CreateChildT<long long>("x", 1);
    options->CreateChildT<long long>("x", 2);
  }
  repeatB.CreateChildT<long long>("x", 3);
  repeatA.SetChild("a/b").CreateChildT<bool>("", true);
  repeatB.SetChild("a/b").CreateChildT<bool>("", false);

  const struct {
    Format a, b;
    std::string expected;
  } cases[] = {
      {withBitrate, Video(1920, 1080), "bit_rate only in a: 8000000 (int64) | \n"},
      {audio, english, "metadata/language only in b:  | \"eng\" (string)\n"},
      {Video(1920, 1080), TextWidth(), "width other type: 1920 (int64) | \"1920\" (string)\n"},
      {WithOptions(slow), WithOptions(fast),
       "encode_options/preset other value: \"slow\" (string) | \"fast\\n\" (string)\n"},
      {WithOptions(xy), WithOptions(yx),
       "encode_options other order: \"x\", \"y\" | \"y\", \"x\"\n"},
      {WithOptions(repeatA), WithOptions(repeatB),
       "encode_options/\"a/b\"/\"\" other value: true (bool) | false (bool)\n"
       "encode_options/x[2] only in b:  | 3 (int64)\n"},
      {Video(1, 1), nullptr, " only in a: container (8 children) | \n"},
      {nullptr, Video(1, 1), " only in b:  | container (8 children)\n"},
      {nullptr, nullptr, ""},
  };
  for (const auto& c : cases) EXPECT_EQ(Lines(Diff(c.a, c.b)), c.expected);

  const std::string kinds = Lines(Diff(FormatCodecVideo::Create(), FormatCodecAudio::Create()));
  EXPECT_EQ(kinds.substr(0, kinds.find('\n')), " other name: \"video_codec\" | \"audio_codec\"");
}

TEST(ExplainCompatibility, NamesEachSettingThatDiffersWithBothValues) {
  const auto noSize = FormatCodecVideo::Create();
  const struct {
    Format a, b;
    std::string expected;
  } cases[] = {
      {Video(1920, 1080), Video(1920, 720, 4, 3),
       "height: 1080 | 720: the height differs: 1080 in a, 720 in b\n"
       "sample_aspect_num: 1 | 4: the pixel aspect X differs: 1 in a, 4 in b\n"
       "sample_aspect_den: 1 | 3: the pixel aspect Y differs: 1 in a, 3 in b\n"},
      {Audio(48000, CH_LAYOUT_STEREO, AV_SAMPLE_FMT_S16),
       Audio(44100, CH_LAYOUT_5POINT1, AV_SAMPLE_FMT_FLTP),
       "sample_rate: 48000 | 44100: the sample rate differs: 48000 in a, 44100 in b\n"
       "channel_layout: 3 | 1551: the channel layout differs: 3 in a, 1551 in b\n"
       "sample_fmt: 1 | 8: the sample format differs: 1 in a, 8 in b\n"},
      // Missing and mistyped settings are reasons, not exceptions.
      {TextWidth(), noSize,
       "width: \"1920\" (string) | missing: the width holds \"1920\" (string) in a, where the test "
       "reads an integer, and is missing in b\n"
       "height: 1080 | missing: the height is missing in b\n"
       "sample_aspect_num: 1 | missing: the pixel aspect X is missing in b\n"
       "sample_aspect_den: 1 | missing: the pixel aspect Y is missing in b\n"},
      {noSize, noSize,
       "width: missing | missing: the width is missing in a and in b\n"
       "height: missing | missing: the height is missing in a and in b\n"
       "sample_aspect_num: missing | missing: the pixel aspect X is missing in a and in b\n"
       "sample_aspect_den: missing | missing: the pixel aspect Y is missing in a and in b\n"},
      {Video(1, 1), FormatCodecAudio::Create(),
       ": video | audio: b is an audio description; a video description accepts only a video "
       "description\n"},
      {Audio(1, CH_LAYOUT_MONO, AV_SAMPLE_FMT_U8), nullptr,
       ": audio | null: b is null; an audio description accepts only an audio description\n"},
      {nullptr, Video(1, 1),
       ": null | video: a is null: there is no description to test b against\n"},
  };
  for (const auto& c : cases) EXPECT_EQ(Lines(ExplainCompatibility(c.a, c.b)), c.expected);
}

// Over descriptions of every kind, equal and not, reordered and empty: Diff is empty exactly when
// Compare is true, and ExplainCompatibility exactly when IsCompatible is.
TEST(Diff, AgreesWithCompareAndIsCompatible) {
  auto reordered = Video(1920, 1080);
  const Core::Property tree = reordered->GetProperty();
  Core::Property copy(tree.GetName());
  for (auto it = tree.GetChildren().rbegin(); it != tree.GetChildren().rend(); ++it) {
    copy.CreateChildT<bool>(it->GetName(), false) = *it;
  }
  reordered->SetProperty(copy);
  const std::vector<Format> all = {Video(1920, 1080),
                                   Video(1920, 1080),
                                   Video(1280, 720),
                                   reordered,
                                   FormatCodecVideo::Create(),
                                   Audio(48000, CH_LAYOUT_STEREO, AV_SAMPLE_FMT_S16),
                                   FormatCodecAudio::Create(),
                                   FormatCodec::Create(),
                                   FormatCodecSubtitle::Create(),
                                   nullptr};
  for (const auto& a : all) {
    if (!a) continue;
    for (const auto& b : all) {
      if (b) {
        EXPECT_EQ(Diff(a, b).empty(), a->Compare(b));
      }
      bool compatible = false;
      try {
        compatible = a->IsCompatible(b);
      } catch (const Tarvek::Exception&) {
      }
      EXPECT_EQ(ExplainCompatibility(a, b).empty(), compatible);
    }
  }
}

}  // namespace
