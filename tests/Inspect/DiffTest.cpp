// Diff and ExplainCompatibility: one entry for each kind of difference, empty exactly when
// Compare or IsCompatible is true, and reasons instead of exceptions for missing settings.
#include <gtest/gtest.h>

#include <Tarvek/Formats.h>
#include <Tarvek/Inspect/Diff.h>
#include <functional>
#include <string>
#include <vector>

namespace {

using namespace Tarvek;
using namespace Tarvek::Conf;

boost::intrusive_ptr<IFormatCodecVideo> Video(unsigned int width, unsigned int height) {
  auto video = FormatCodecVideo::Create();
  video->InitByPixelAspect(width, height, 1, 1);
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

// The encoder options of a new video set to `options`.
boost::intrusive_ptr<IFormatCodecVideo> WithOptions(const Core::Property& options) {
  auto video = Video(1920, 1080);
  video->SetOptionsEncode(options);
  return video;
}

// `codec` after `edit` of a copy of its tree.
template <class P>
P Edited(P codec, const std::function<void(Core::Property&)>& edit) {
  Core::Property tree = codec->GetProperty();
  edit(tree);
  codec->SetProperty(tree);
  return codec;
}

void ExpectOne(const std::vector<Difference>& differences, const std::string& path,
               DifferenceKind kind, const std::string& a, const std::string& b) {
  ASSERT_EQ(differences.size(), 1u);
  EXPECT_EQ(differences[0].path, path);
  EXPECT_EQ(DifferenceKindName(differences[0].kind), std::string(DifferenceKindName(kind)));
  EXPECT_EQ(differences[0].a, a);
  EXPECT_EQ(differences[0].b, b);
}

TEST(Diff, GivesOneEntryForEachKindOfDifference) {
  auto withBitrate = Video(1920, 1080);
  withBitrate->SetBitrate(8000000);
  ExpectOne(Diff(withBitrate, Video(1920, 1080)), "bit_rate", DifferenceKind::OnlyInA,
            "8000000 (int64)", "");

  auto audio = Audio(48000, CH_LAYOUT_STEREO, AV_SAMPLE_FMT_FLTP);
  auto english = audio->Clone();
  english->SetLanguage("eng");
  ExpectOne(Diff(audio, english), "metadata/language", DifferenceKind::OnlyInB, "",
            "\"eng\" (string)");

  auto asText = Edited(Video(1920, 1080), [](Core::Property& tree) {
    tree.SetChildT<std::string>(IFormatCodecVideo::TAG_WIDTH, "1920");
  });
  ExpectOne(Diff(Video(1920, 1080), asText), "width", DifferenceKind::OtherType, "1920 (int64)",
            "\"1920\" (string)");

  Core::Property slow("o"), fast("o");
  slow.SetChildT<std::string>("preset", "slow");
  fast.SetChildT<std::string>("preset", "fast\n");
  ExpectOne(Diff(WithOptions(slow), WithOptions(fast)), "encode_options/preset",
            DifferenceKind::OtherValue, "\"slow\" (string)", "\"fast\\n\" (string)");

  Core::Property xy("o"), yx("o");
  xy.SetChildT<long long>("x", 1);
  xy.SetChildT<long long>("y", 2);
  yx.SetChildT<long long>("y", 2);
  yx.SetChildT<long long>("x", 1);
  ExpectOne(Diff(WithOptions(xy), WithOptions(yx)), "encode_options", DifferenceKind::OtherOrder,
            "\"x\", \"y\"", "\"y\", \"x\"");

  const auto kinds = Diff(FormatCodecVideo::Create(), FormatCodecAudio::Create());
  ASSERT_FALSE(kinds.empty());
  EXPECT_EQ(kinds[0].path, "");
  EXPECT_EQ(kinds[0].kind, DifferenceKind::OtherName);
  EXPECT_EQ(kinds[0].a, "\"video_codec\"");
  EXPECT_EQ(kinds[0].b, "\"audio_codec\"");
}

TEST(Diff, MatchesRepeatedNamesInOrderAndQuotesOddNames) {
  Core::Property a("o"), b("o");
  for (Core::Property* options : {&a, &b}) {
    options->CreateChildT<long long>("x", 1);
    options->CreateChildT<long long>("x", 2);
  }
  b.CreateChildT<long long>("x", 3);
  a.SetChild("a/b").CreateChildT<bool>("", true);
  b.SetChild("a/b").CreateChildT<bool>("", false);
  const auto differences = Diff(WithOptions(a), WithOptions(b));
  ASSERT_EQ(differences.size(), 2u);
  EXPECT_EQ(differences[0].path, "encode_options/\"a/b\"/\"\"");
  EXPECT_EQ(differences[0].kind, DifferenceKind::OtherValue);
  EXPECT_EQ(differences[1].path, "encode_options/x[2]");
  EXPECT_EQ(differences[1].kind, DifferenceKind::OnlyInB);
  EXPECT_EQ(differences[1].b, "3 (int64)");
}

TEST(Diff, IsEmptyExactlyWhenCompareIsTrue) {
  auto reordered = Edited(Video(1920, 1080), [](Core::Property& tree) {
    Core::Property copy(tree.GetName());
    for (auto it = tree.GetChildren().rbegin(); it != tree.GetChildren().rend(); ++it) {
      copy.CreateChildT<bool>(it->GetName(), false) = *it;
    }
    tree = copy;
  });
  const std::vector<boost::intrusive_ptr<const IFormat>> all = {
      Video(1920, 1080),
      Video(1920, 1080),
      Video(1280, 720),
      reordered,
      FormatCodec::Create(),
      FormatCodecSubtitle::Create(),
      Audio(48000, CH_LAYOUT_STEREO, AV_SAMPLE_FMT_S16)};
  for (const auto& a : all) {
    for (const auto& b : all) EXPECT_EQ(Diff(a, b).empty(), a->Compare(b));
  }
  EXPECT_EQ(Diff(all[0], nullptr).size(), 1u);
  EXPECT_EQ(Diff(nullptr, all[0])[0].kind, DifferenceKind::OnlyInB);
  EXPECT_TRUE(Diff(nullptr, nullptr).empty());
}

TEST(ExplainCompatibility, NamesEachVideoSettingThatDiffersWithBothValues) {
  auto anamorphic = FormatCodecVideo::Create();
  anamorphic->InitByPixelAspect(1920, 720, 4, 3);
  const auto reasons = ExplainCompatibility(Video(1920, 1080), anamorphic);
  ASSERT_EQ(reasons.size(), 3u);
  EXPECT_EQ(reasons[0].setting, "height");
  EXPECT_EQ(reasons[0].a, "1080");
  EXPECT_EQ(reasons[0].b, "720");
  EXPECT_EQ(reasons[0].reason, "the height differs: 1080 in a, 720 in b");
  EXPECT_EQ(reasons[1].setting, "sample_aspect_num");
  EXPECT_EQ(reasons[2].reason, "the pixel aspect Y differs: 1 in a, 3 in b");
}

TEST(ExplainCompatibility, NamesEachAudioSettingThatDiffers) {
  const auto reasons = ExplainCompatibility(Audio(48000, CH_LAYOUT_STEREO, AV_SAMPLE_FMT_S16),
                                            Audio(44100, CH_LAYOUT_5POINT1, AV_SAMPLE_FMT_FLTP));
  ASSERT_EQ(reasons.size(), 3u);
  EXPECT_EQ(reasons[0].reason, "the sample rate differs: 48000 in a, 44100 in b");
  EXPECT_EQ(reasons[1].reason, "the channel layout differs: 3 in a, 1551 in b");
  EXPECT_EQ(reasons[2].setting, "sample_fmt");
}

TEST(ExplainCompatibility, GivesMissingAndMistypedSettingsAsReasons) {
  auto noSize = FormatCodecVideo::Create();
  auto textWidth = Edited(Video(1920, 1080), [](Core::Property& tree) {
    tree.SetChildT<std::string>(IFormatCodecVideo::TAG_WIDTH, "1920");
  });
  std::vector<Incompatibility> reasons;
  ASSERT_NO_THROW(reasons = ExplainCompatibility(textWidth, noSize));
  ASSERT_EQ(reasons.size(), 4u);
  EXPECT_EQ(reasons[0].reason,
            "the width holds \"1920\" (string) in a, where the test reads an integer, and is "
            "missing in b");
  EXPECT_EQ(reasons[0].b, "missing");
  EXPECT_EQ(reasons[1].reason, "the height is missing in b");
  EXPECT_EQ(ExplainCompatibility(noSize, noSize)[0].reason, "the width is missing in a and in b");
}

TEST(ExplainCompatibility, SaysWhenTheKindOrThePointerIsWrong) {
  const auto audio = ExplainCompatibility(Video(1, 1), FormatCodecAudio::Create());
  ASSERT_EQ(audio.size(), 1u);
  EXPECT_EQ(audio[0].b, "audio");
  EXPECT_EQ(audio[0].reason,
            "b is an audio description; a video description accepts only a video description");
  EXPECT_EQ(ExplainCompatibility(Audio(1, CH_LAYOUT_MONO, AV_SAMPLE_FMT_U8), nullptr)[0].b, "null");
  EXPECT_EQ(ExplainCompatibility(nullptr, Video(1, 1)).size(), 1u);
}

TEST(ExplainCompatibility, IsEmptyExactlyWhenIsCompatibleIsTrue) {
  const std::vector<boost::intrusive_ptr<const IFormat>> all = {
      Video(1920, 1080),
      Video(1280, 720),
      FormatCodecVideo::Create(),
      Audio(48000, CH_LAYOUT_STEREO, AV_SAMPLE_FMT_S16),
      FormatCodecAudio::Create(),
      FormatCodec::Create(),
      FormatCodecSubtitle::Create(),
      nullptr};
  for (const auto& a : all) {
    if (!a) continue;
    for (const auto& b : all) {
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
