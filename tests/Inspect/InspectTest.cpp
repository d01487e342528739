// The inspection library: Diff and ExplainCompatibility give one entry for each kind of
// difference and agree with Compare and IsCompatible; Validate reports each finding of a small
// change to a clean description and never throws; the JSON form refuses bad text saying where and
// what. The JSON form's round trips are checked by its fuzz target, over a corpus that holds a
// description of every kind with every odd value.
#include <Tarvek/Formats.h>
#include <Tarvek/Inspect/Diff.h>
#include <Tarvek/Inspect/JsonForm.h>
#include <Tarvek/Inspect/Validate.h>

#include <functional>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "Support/TestSupport.h"

namespace {

using namespace Tarvek;
using namespace Tarvek::Conf;
using Format = boost::intrusive_ptr<const IFormat>;
using Change = std::function<void(IFormatCodec&)>;
using Json = nlohmann::ordered_json;

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
  return Edited([key](Core::Property& tree) { tree = TarvekTest::Without(tree, key); });
}

// `codec` after `change`.
template <class Codec>
Codec With(Codec codec, const Change& change) {
  change(*codec);
  return codec;
}

// A 1080p video whose encoder options are `options`.
Format WithOptions(const Core::Property& options) {
  auto video = Video(1920, 1080);
  video->SetOptionsEncode(options);
  return video;
}

// A 1080p video whose width is stored as text, as a hand-edited tree may hold it.
Format TextWidth() {
  return With(Video(1920, 1080), Stored<std::string>(IFormatCodecVideo::TAG_WIDTH, "1920"));
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

// A video and an audio description the presets take, with a bitrate inside their range.
boost::intrusive_ptr<IFormatCodec> CleanVideo() {
  auto video = Video(1920, 1080);
  video->SetCodecID("h264");
  video->SetFrameRate(25, 1);
  video->SetBitrateMode("cbr");
  video->SetBitrate(6000000);
  video->SetPixelFormat(AV_PIX_FMT_YUV420P);
  return video;
}

boost::intrusive_ptr<IFormatCodec> CleanAudio() {
  auto audio = Audio(48000, CH_LAYOUT_STEREO, AV_SAMPLE_FMT_FLTP);
  audio->SetCodecID("aac");
  audio->SetLanguage("eng");
  audio->SetBitrate(128000);
  return audio;
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
      {CleanVideo,
       Edited([](Core::Property& tree) { tree.CreateChildT<long long>("width", 1280); }),
       Severity::Error, "width",
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

// A chain of containers `levels` deep, itself included.
Core::Property Chain(int levels) {
  Core::Property node("d");
  for (int i = 1; i < levels; ++i) {
    Core::Property parent("d");
    parent.SetChild("d", node);
    node = std::move(parent);
  }
  return node;
}

// A document of a small video, and the index of its child `name` in the tree.
Json SmallVideo() {
  auto video = FormatCodecVideo::Create();
  video->InitByPixelAspect(1920, 1080, 1, 1);
  video->SetLossless(true);
  video->SetPrivateData(CreateBlob("abc", 3));
  return Json::parse(ToJson(video));
}

std::size_t IndexOf(const Json& document, const std::string& name) {
  const Json& children = document["tree"]["children"];
  for (std::size_t i = 0; i < children.size(); ++i) {
    if (children[i]["name"] == name) return i;
  }
  ADD_FAILURE() << "no child " << name;
  return 0;
}

// A bad text: `text`, or when `edit` is given, the small video's document with `edit` applied.
struct BadText {
  std::string text;
  std::function<void(Json&)> edit;
  std::string message;  // the whole DescriptionInfo, or its start followed by "..."
};

// The child `name` of the small video's tree, to edit.
Json& Child(Json& document, const std::string& name) {
  return document["tree"]["children"][IndexOf(document, name)];
}

// Each bad text is refused with a message that says where and what; the JSON pointer is the
// message's start up to ": " ("" for the whole document; the parser's own errors carry none).
// ToJson refuses null and trees deeper than the form holds.
TEST(JsonForm, RejectsEveryKindOfBadTextSayingWhereAndWhat) {
  const std::string width = "/tree/children/" + std::to_string(IndexOf(SmallVideo(), "width"));
  const std::string lossless =
      "/tree/children/" + std::to_string(IndexOf(SmallVideo(), "lossless"));
  std::string twice = SmallVideo().dump();
  const std::string name = "\"name\":\"width\"";
  twice.replace(twice.find(name), name.size(), name + "," + name);
  const std::vector<BadText> cases = {
      {"{\"format\": tru}", nullptr,
       "malformed JSON at line 1, column 15: syntax error while parsing value - invalid literal; "
       "last read: '\"format\": tru}'"},
      {"[1]", nullptr, "the document: expected an object (a description), found an array"},
      {"", [](Json& d) { d["format"] = "other"; },
       "/format: expected \"tarvek-description\", found \"other\""},
      {"", [](Json& d) { d["version"] = 2; },
       "/version: version 2 is not known; this library reads version 1"},
      {"", [](Json& d) { d["version"] = "1"; }, "/version: expected an integer, found a string"},
      {"", [](Json& d) { d["kind"] = "image"; },
       "/kind: unknown kind \"image\"; expected \"codec\", \"video\", \"audio\" or \"subtitle\""},
      {"", [](Json& d) { d["object_name"] = "audio_codec"; },
       "/object_name: a video description is named \"video_codec\", found \"audio_codec\""},
      {"", [](Json& d) { d.erase("tree"); }, "the document: missing member \"tree\""},
      {"",
       [](Json& d) {
         d["tree"] = {{"type", "int64"}, {"value", 1}};
       },
       "/tree/type: the root of the tree must be a container, found \"int64\""},
      {"", [](Json& d) { Child(d, "width")["value"] = "1920"; },
       width + "/value: expected an integer, found a string"},
      {"", [](Json& d) { Child(d, "width")["value"] = 1.5; },
       width + "/value: expected an integer, found the number 1.5"},
      {"", [](Json& d) { Child(d, "width")["value"] = 9223372036854775808u; },
       width + "/value: expected an integer in the 64-bit signed range, found 9223372036854775808"},
      {"", [](Json& d) { Child(d, "lossless")["value"] = 1; },
       lossless + "/value: expected true or false, found the number 1"},
      {"", [](Json& d) { Child(d, "width")["type"] = "float"; },
       width + "/type: unknown type \"float\"; expected \"bool\", \"int64\", \"string\" or "
               "\"container\""},
      {"", [](Json& d) { Child(d, "width")["unit"] = "px"; },
       width + "/unit: unknown member \"unit\" here"},
      {"", [](Json& d) { Child(d, "width").erase("type"); }, width + ": missing member \"type\""},
      {"", [](Json& d) { Child(d, "width")["name_base64"] = "eA=="; },
       width + ": both \"name\" and \"name_base64\" given; give one"},
      {"", [](Json& d) { d["tree"]["children"][0] = Json::array(); },
       "/tree/children/0: expected an object (a node of the tree), found an array"},
      {"", [](Json& d) { d["tree"]["children"].erase(IndexOf(d, "metadata")); },
       "/tree/children: no child named \"metadata\", which every description has"},
      {"", [](Json& d) { d["internal"]["children"] = 3; },
       "/internal/children: expected an array, found the number 3"},
      {"", [](Json& d) { d["private_data"] = "YW!j"; },
       "/private_data: invalid base64: character 3, '!', is not in the base64 alphabet"},
      {"", [](Json& d) { d["private_data"] = "YWJ"; },
       "/private_data: invalid base64: its length, 3, is not a multiple of 4"},
      {"", [](Json& d) { d["private_data"] = "YWK="; },
       "/private_data: invalid base64: stray bits before the padding"},
      {"", [](Json& d) { d["private_data"] = 5; },
       "/private_data: expected a base64 string or null, found the number 5"},
      {twice, nullptr, width + "/name: the member \"name\" appears twice in one object"},
      {std::string(200, '[') + std::string(200, ']'), nullptr,
       "JSON nested deeper than 129 levels at line 1, column 130; a description's tree holds at "
       "most 64 levels"},
      {"",
       [](Json& d) {
         Json node = {{"name", "d"}, {"type", "container"}, {"children", Json::array()}};
         for (int i = 0; i < kJsonFormMaxDepth - 1; ++i) {
           node = {{"name", "d"}, {"type", "container"}, {"children", {node}}};
         }
         d["tree"]["children"].push_back(node);
       },
       "JSON nested deeper than 129 levels at line 1, column ..."},
  };
  for (const BadText& bad : cases) {
    SCOPED_TRACE(bad.message);
    std::string text = bad.text;
    if (bad.edit) {
      Json document = SmallVideo();
      bad.edit(document);
      text = document.dump();
    }
    try {
      FromJson(text);
      ADD_FAILURE() << "accepted";
    } catch (const JsonFormError& e) {
      const std::string* message = boost::get_error_info<DescriptionInfo>(e);
      ASSERT_NE(message, nullptr);
      const std::size_t dots = bad.message.rfind("...");
      const bool start = dots != std::string::npos && dots + 3 == bad.message.size();
      EXPECT_EQ(start ? message->substr(0, dots) : *message, bad.message.substr(0, dots));
      const std::string* pointer = boost::get_error_info<JsonFormError::JsonPointerInfo>(e);
      const bool whole = bad.message.rfind("the document:", 0) == 0;
      if (whole || bad.message[0] == '/') {
        ASSERT_NE(pointer, nullptr);
        EXPECT_EQ(*pointer, whole ? "" : bad.message.substr(0, bad.message.find(": ")));
      }
    }
  }
  EXPECT_THROW(ToJson(nullptr), JsonFormError);
  auto tooDeep = FormatCodec::Create();
  tooDeep->SetOptionsEncode(Chain(kJsonFormMaxDepth));
  EXPECT_THROW(ToJson(tooDeep), JsonFormError);
}

}  // namespace
