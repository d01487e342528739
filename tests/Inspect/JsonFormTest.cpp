// The JSON form: exact round trips of every kind of description, and the refusal of bad text
// with a message that says where and what.
#include <gtest/gtest.h>

#include <Tarvek/Formats.h>
#include <Tarvek/Inspect/Diff.h>
#include <Tarvek/Inspect/JsonForm.h>
#include <boost/exception/get_error_info.hpp>
#include <functional>
#include <limits>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

namespace {

using namespace Tarvek;
using namespace Tarvek::Conf;
using Json = nlohmann::ordered_json;

constexpr long long kMin = std::numeric_limits<long long>::min();
constexpr long long kMax = std::numeric_limits<long long>::max();
const std::string kNotUtf8("\xc3\x28\xff", 3);

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

// Every shared setting at an extreme, repeated names of every type, odd names and texts, a tree
// as deep as the form holds, runtime entries of every shape and private data of every byte.
void FillEverything(IFormatCodec& codec) {
  codec.SetCodecName("H.264 / \"AVC\"\n");
  codec.SetCodecID("h264");
  codec.SetCodecTag(kMin);
  codec.SetBitrateMode("vbr");
  codec.SetBitrate(kMax);
  codec.SetQuality(-1);
  codec.SetLossless(true);
  codec.SetThreadNumber(4294967295u);
  codec.SetTwoPassEncoding(false);
  codec.SetGlobalHeader(true);
  codec.SetMainStream(false);
  Core::Property options("options");
  options.CreateChildT<std::string>("x", "1");
  options.CreateChildT<long long>("x", 1);
  options.CreateChildT<bool>("x", false);
  options.SetChild("x[1]").CreateChildT<std::string>("", std::string("nul\0byte", 8));
  codec.SetOptionsEncode(options);
  codec.SetOptionsAnalyze(Chain(kJsonFormMaxDepth - 1));  // the options child is its top

  Core::Property tree = codec.GetProperty();
  tree.CreateChildT<std::string>("a/b~c\\\"", kNotUtf8);
  tree.CreateChildT<long long>(kNotUtf8, kMax);
  tree.CreateChildT<std::string>("", "");
  codec.SetProperty(tree);

  boost::property_tree::ptree& entries = codec.GetInternalProperties();
  entries.data() = "root text";
  entries.put("runtime.nested.key", "v");
  entries.add("dup", "1");
  entries.add("dup", "2");
  entries.push_back({kNotUtf8, boost::property_tree::ptree(kNotUtf8)});

  std::string bytes;
  for (int i = 0; i < 256; ++i) bytes += static_cast<char>(i);
  codec.SetPrivateData(CreateBlob(bytes.data(), bytes.size()));
}

std::vector<boost::intrusive_ptr<IFormatCodec>> EveryKind() {
  auto video = FormatCodecVideo::Create();
  video->InitByFrameAspect(720, 576, 16, 9);
  video->SetFrameRate(30000, 1001);
  video->SetPixelFormat(AV_PIX_FMT_YUV420P10LE);
  auto audio = FormatCodecAudio::Create();
  audio->SetLanguage("eng");
  audio->SetSampleRate(-48000);
  audio->SetChannelLayout(static_cast<ChannelLayout>(0xffffffffu));
  audio->SetFrameSize(1024);
  audio->SetSampleFormat(AV_SAMPLE_FMT_FLTP);
  auto subtitle = FormatCodecSubtitle::Create();
  subtitle->SetLanguage("fra");
  subtitle->SetTitle("Titre \xc3\xa9t\xc3\xa9");
  subtitle->SetAuthor("A. Smithee");
  subtitle->SetSubtitleHeader("[Script Info]\r\nScriptType: v4.00+\r\n");
  subtitle->SetDVBWidth(720);
  subtitle->SetDVBHeight(576);
  std::vector<boost::intrusive_ptr<IFormatCodec>> all = {FormatCodec::Create(), video, audio,
                                                         subtitle};
  for (const auto& codec : all) FillEverything(*codec);
  // No private data and empty private data are told apart.
  all[0]->SetPrivateData(nullptr);
  all[1]->SetPrivateData(CreateBlob(nullptr, 0));
  return all;
}

std::string Bytes(const boost::intrusive_ptr<IBlob>& blob) {
  if (!blob) return "<none>";
  return std::string(reinterpret_cast<const char*>(blob->GetData()), blob->GetSize());
}

TEST(JsonForm, RoundTripIsExactForEveryKind) {
  for (const auto& original : EveryKind()) {
    SCOPED_TRACE(DescriptionKind(original));
    const std::string text = ToJson(original);
    const auto back = FromJson(text);
    ASSERT_TRUE(back);
    EXPECT_STREQ(DescriptionKind(back), DescriptionKind(original));
    EXPECT_TRUE(back->Compare(original));
    EXPECT_TRUE(Diff(original, back).empty());
    EXPECT_TRUE(back->GetInternalProperties() == original->GetInternalProperties());
    EXPECT_EQ(Bytes(back->GetPrivateData()), Bytes(original->GetPrivateData()));
    EXPECT_EQ(ToJson(back), text);
  }
  EXPECT_THROW(ToJson(nullptr), JsonFormError);
  auto tooDeep = FormatCodec::Create();
  tooDeep->SetOptionsEncode(Chain(kJsonFormMaxDepth));
  EXPECT_THROW(ToJson(tooDeep), JsonFormError);
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
}

}  // namespace
