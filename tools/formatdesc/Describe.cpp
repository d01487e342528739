// formatdesc's descriptions: built from options, read from JSON documents.
#include "Describe.h"

#include "Output.h"

#include <Tarvek/FFmpeg/Names.h>
#include <Tarvek/FFmpeg/Streams.h>
#include <Tarvek/Inspect/JsonDocument.h>

#include <boost/exception/get_error_info.hpp>
#if TARVEK_FORMATDESC_GSTREAMER
#include <Tarvek/GStreamer/Caps.h>
#endif
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <limits>
#include <map>

namespace Formatdesc {
namespace {

using Tarvek::Conf::IFormatCodec;
using Tarvek::Conf::IFormatCodecAudio;
using Tarvek::Conf::IFormatCodecSubtitle;
using Tarvek::Conf::IFormatCodecVideo;

constexpr long long kMaxInt = std::numeric_limits<int>::max();
constexpr long long kMaxUnsigned = std::numeric_limits<unsigned int>::max();

// An options sub-tree from KEY=VALUE texts, values kept as strings.
Tarvek::Core::Property OptionsTree(const std::string& option,
                                   const std::vector<std::string>& entries) {
  Tarvek::Core::Property tree("options");
  for (const std::string& entry : entries) {
    const auto [key, value] = ParseKeyValue(option, entry);
    tree.SetChildT<std::string>(key, value);
  }
  return tree;
}

// The settings every codec description shares, in the order of the options' help.
void SetCodecSettings(IFormatCodec& codec, const CodecArgs& args) {
  if (args.codecName) codec.SetCodecName(*args.codecName);
  if (args.tag) codec.SetCodecTag(ParseCodecTag("--tag", *args.tag));
  if (args.bitrateMode) {
    codec.SetBitrateMode(ParseChoice("--bitrate-mode", *args.bitrateMode,
                                     {"cbr", IFormatCodec::TAG_BITRATE_MODE_VBR}));
  }
  if (args.bitrate) codec.SetBitrate(ParseBitrate("--bitrate", *args.bitrate));
  if (args.quality) codec.SetQuality(ParseNonNegative("--quality", *args.quality, kMaxInt));
  if (args.threads) {
    codec.SetThreadNumber(
        static_cast<unsigned int>(ParseNonNegative("--threads", *args.threads, kMaxUnsigned)));
  }
  if (args.lossless) codec.SetLossless(*args.lossless);
  if (args.twoPass) codec.SetTwoPassEncoding(*args.twoPass);
  if (args.globalHeader) codec.SetGlobalHeader(*args.globalHeader);
  if (args.mainStream) codec.SetMainStream(*args.mainStream);
  if (!args.encodeOptions.empty()) {
    codec.SetOptionsEncode(OptionsTree("--encode-option", args.encodeOptions));
  }
  if (!args.analyzeOptions.empty()) {
    codec.SetOptionsAnalyze(OptionsTree("--analyze-option", args.analyzeOptions));
  }
}

// Size and pixel aspect go in together, as the interface wants; square pixels unless told.
void SetGeometry(IFormatCodecVideo& video, const VideoArgs& args) {
  if (!args.size) return;
  const Pair size = ParseSize("--size", *args.size);
  if (args.frameAspect) {
    const Pair aspect = ParseRatio("--frame-aspect", *args.frameAspect);
    video.InitByFrameAspect(size.first, size.second, aspect.first, aspect.second);
    return;
  }
  const Pair pixel =
      args.pixelAspect ? ParseRatio("--pixel-aspect", *args.pixelAspect) : Pair{1, 1};
  video.InitByPixelAspect(size.first, size.second, pixel.first, pixel.second);
}

// The whole file at `path`; a UsageError naming the option and the system's reason otherwise.
std::string ReadFile(const std::string& option, const std::string& path) {
  const std::string prefix = option.empty() ? std::string() : option + ": ";
  std::FILE* file = std::fopen(path.c_str(), "rb");
  if (file == nullptr) {
    throw UsageError(prefix + "cannot read '" + path + "': " + std::strerror(errno));
  }
  std::string text;
  char buffer[65536];
  for (std::size_t n; (n = std::fread(buffer, 1, sizeof buffer, file)) > 0;) text.append(buffer, n);
  const bool failed = std::ferror(file) != 0;
  const int error = errno;
  std::fclose(file);
  if (failed) throw UsageError(prefix + "cannot read '" + path + "': " + std::strerror(error));
  return text;
}

// The description that GStreamer caps text gives, which must be of `kind`.
boost::intrusive_ptr<IFormatCodec> FromCaps(const std::string& text,
                                            Tarvek::Conf::FormatKind kind) {
#if TARVEK_FORMATDESC_GSTREAMER
  InitGStreamer();
  boost::intrusive_ptr<IFormatCodec> description;
  try {
    description = Tarvek::GStreamer::FromCapsString(text);
  } catch (const Tarvek::GStreamer::CapsError& e) {
    const std::string* what = boost::get_error_info<Tarvek::DescriptionInfo>(e);
    throw UsageError("--from-caps: " + (what != nullptr ? *what : std::string("not caps")));
  }
  const std::optional<Tarvek::Conf::FormatKind> found = Tarvek::Conf::KindOf(description.get());
  if (found != kind)
    throw UsageError(std::string("--from-caps: the caps give ") +
                     Tarvek::Conf::KindPhrase(found.value_or(Tarvek::Conf::FormatKind::Codec)) +
                     ", not " + Tarvek::Conf::KindPhrase(kind));
  return description;
#else
  (void)text;
  (void)kind;
  throw UsageError("--from-caps: this formatdesc was built without GStreamer");
#endif
}

// The --from-json or --from-caps description as the subcommand's kind, or a new one of that
// kind.
template <class Kind, class Factory>
boost::intrusive_ptr<Kind> Start(const CodecArgs& args, Tarvek::Conf::FormatKind kind,
                                 Factory create) {
  if (args.fromJson && args.fromCaps) throw UsageError("--from-caps excludes --from-json");
  if (args.fromCaps) return boost::dynamic_pointer_cast<Kind>(FromCaps(*args.fromCaps, kind));
  if (!args.fromJson) return create();
  return boost::dynamic_pointer_cast<Kind>(RequireKind(
      LoadDescription("--from-json", *args.fromJson, args.stream), kind, *args.fromJson));
}

}  // namespace

namespace {

using Json = nlohmann::ordered_json;

// The first place where `stored` and `derived` differ, as a JSON pointer below `pointer`, with
// both values; empty when they agree.
std::string FirstDifference(const Json& stored, const Json& derived, const std::string& pointer) {
  if (stored.is_object() && derived.is_object()) {
    auto a = stored.begin();
    auto b = derived.begin();
    for (; a != stored.end() && b != derived.end(); ++a, ++b) {
      if (a.key() != b.key()) {
        return pointer + ": holds the member \"" + a.key() + "\" where the tree gives \"" +
               b.key() + "\"";
      }
      const std::string inner = FirstDifference(*a, *b, pointer + "/" + a.key());
      if (!inner.empty()) return inner;
    }
    if (a == stored.end() && b == derived.end()) return std::string();
    return pointer + (a != stored.end() ? ": has the member \"" + a.key() + "\" the tree lacks"
                                        : ": lacks the member \"" + b.key() + "\" of the tree");
  }
  if (stored == derived) return std::string();
  return pointer + ": " + stored.dump() + " disagrees with the tree's " + derived.dump();
}

// The description object a stream specifier picks out of a probe document's streams: an index
// ("2"), or the n-th stream of a kind ("v:0", "a:1", "s:0").
const Json& PickStream(const Json& streams, const std::optional<std::string>& specifier,
                       const std::string& path) {
  std::vector<const Json*> described;
  for (const Json& stream : streams) {
    if (stream.is_object() && stream.contains("description")) described.push_back(&stream);
  }
  if (!specifier) {
    if (described.size() == 1) return (*described.front())["description"];
    throw UsageError("'" + path + "' holds " + std::to_string(described.size()) +
                     " described streams; pick one with --stream (2, v:0, a:1)");
  }
  const std::size_t colon = specifier->find(':');
  const std::string kindLetter = colon == std::string::npos ? "" : specifier->substr(0, colon);
  const std::string kind = kindLetter == "v"   ? "video"
                           : kindLetter == "a" ? "audio"
                           : kindLetter == "s" ? "subtitle"
                                               : "";
  if (colon != std::string::npos && kind.empty()) {
    throw BadValue("--stream", "a stream index (2) or a kind and an index (v:0, a:1, s:0)",
                   *specifier);
  }
  const long long wanted = ParseNonNegative(
      "--stream", colon == std::string::npos ? *specifier : specifier->substr(colon + 1), 1 << 30);
  long long seen = 0;
  for (const Json& stream : streams) {
    if (!stream.is_object()) continue;
    const bool match = kind.empty()
                           ? stream.value("index", -1LL) == wanted
                           : stream.value("kind", std::string()) == kind && seen++ == wanted;
    if (!match) continue;
    if (!stream.contains("description")) {
      throw UsageError("--stream: stream " + *specifier + " of '" + path +
                       "' holds no description");
    }
    return stream["description"];
  }
  throw UsageError("--stream: '" + path + "' has no stream " + *specifier);
}

}  // namespace

boost::intrusive_ptr<IFormatCodec> LoadDescription(const std::string& option,
                                                   const std::string& path,
                                                   const std::optional<std::string>& stream) {
  const std::string text = ReadFile(option, path);
  try {
    // A probe's document holds each stream's description three levels down.
    const Json whole =
        Tarvek::Conf::JsonDocument::Parse(text, Tarvek::Conf::JsonDocument::kMaxNesting + 3);
    const bool several = whole.is_object() && whole.contains("streams") &&
                         whole["streams"].is_array() && !whole.contains("tree");
    const Json& document = several ? PickStream(whole["streams"], stream, path) : whole;
    const auto description = Tarvek::Conf::JsonDocument::Read(document);
    // The settings block is derived from the tree: an edit there must not pass unnoticed.
    if (document.is_object() && document.contains("settings")) {
      const std::string differs = FirstDifference(
          document["settings"], SettingsJson(description->GetProperty()), "/settings");
      if (!differs.empty()) {
        throw LoadError(path + ": " + differs +
                        " (the settings are derived from the tree: edit the tree)");
      }
    }
    return description;
  } catch (const Tarvek::Conf::JsonFormError& e) {
    const std::string* what = boost::get_error_info<Tarvek::DescriptionInfo>(e);
    throw LoadError(path + ": " + (what != nullptr ? *what : std::string("not a description")));
  }
}

const boost::intrusive_ptr<IFormatCodec>& RequireKind(
    const boost::intrusive_ptr<IFormatCodec>& description, Tarvek::Conf::FormatKind kind,
    const std::string& path) {
  const std::optional<Tarvek::Conf::FormatKind> found = Tarvek::Conf::KindOf(description.get());
  if (found != kind) {
    throw UsageError("--from-json: '" + path + "' holds " +
                     Tarvek::Conf::KindPhrase(found.value_or(Tarvek::Conf::FormatKind::Codec)) +
                     ", not " + Tarvek::Conf::KindPhrase(kind));
  }
  return description;
}

boost::intrusive_ptr<IFormatCodecVideo> BuildVideo(const VideoArgs& args) {
  auto video = Start<IFormatCodecVideo>(args.codec, Tarvek::Conf::FormatKind::Video,
                                        &Tarvek::Conf::FormatCodecVideo::Create);
  if (args.codec.codecId) {
    video->SetCodecID(CheckCodecId("--codec-id", *args.codec.codecId,
                                   Tarvek::Conf::GetPresetVideoCodecs(), "video"));
  }
  SetCodecSettings(*video, args.codec);
  SetGeometry(*video, args);
  if (args.frameRate) {
    const Pair rate = ParseFrameRate("--frame-rate", *args.frameRate);
    video->SetFrameRate(rate.first, rate.second);
  }
  if (args.pixelFormat) video->SetPixelFormat(ParsePixelFormat("--pix-fmt", *args.pixelFormat));
  return video;
}

boost::intrusive_ptr<IFormatCodecAudio> BuildAudio(const AudioArgs& args) {
  auto audio = Start<IFormatCodecAudio>(args.codec, Tarvek::Conf::FormatKind::Audio,
                                        &Tarvek::Conf::FormatCodecAudio::Create);
  if (args.codec.codecId) {
    audio->SetCodecID(CheckCodecId("--codec-id", *args.codec.codecId,
                                   Tarvek::Conf::GetPresetAudioCodecs(), "audio"));
  }
  SetCodecSettings(*audio, args.codec);
  if (args.sampleRate) {
    audio->SetSampleRate(
        static_cast<int>(ParsePositive("--sample-rate", *args.sampleRate, kMaxInt)));
  }
  if (args.layout) audio->SetChannelLayout(ParseChannelLayout("--layout", *args.layout));
  if (args.frameSize) {
    audio->SetFrameSize(static_cast<int>(ParsePositive("--frame-size", *args.frameSize, kMaxInt)));
  }
  if (args.sampleFormat) {
    audio->SetSampleFormat(ParseSampleFormat("--sample-fmt", *args.sampleFormat));
  }
  if (args.language) audio->SetLanguage(*args.language);
  return audio;
}

boost::intrusive_ptr<IFormatCodecSubtitle> BuildSubtitle(const SubtitleArgs& args) {
  auto subtitle = Start<IFormatCodecSubtitle>(args.codec, Tarvek::Conf::FormatKind::Subtitle,
                                              &Tarvek::Conf::FormatCodecSubtitle::Create);
  // The presets know no subtitle codecs, so any identifier is taken.
  if (args.codec.codecId) subtitle->SetCodecID(*args.codec.codecId);
  SetCodecSettings(*subtitle, args.codec);
  if (args.language) subtitle->SetLanguage(*args.language);
  if (args.title) subtitle->SetTitle(*args.title);
  if (args.author) subtitle->SetAuthor(*args.author);
  if (args.header) subtitle->SetSubtitleHeader(*args.header);
  if (args.dvbSize) {
    const Pair size = ParseSize("--dvb-size", *args.dvbSize);
    subtitle->SetDVBWidth(size.first);
    subtitle->SetDVBHeight(size.second);
  }
  return subtitle;
}

// The bitrates are those the probe judges a stream by, so that a description read back from
// probe --json gets the same: the presets' codec that a profile in the metadata reaches
// (prores with profile HQ: prores_hq) and, for audio whose channels have no speaker order, the
// usual layout for their count.
Bitrates VideoBitrates(const boost::intrusive_ptr<const IFormatCodec>& video) {
  boost::intrusive_ptr<const IFormatCodec> judged = video;
  const std::string preset = Tarvek::FFmpeg::PresetCodecID(*video);
  if (!preset.empty() && video->ExistsCodecID() && preset != video->GetCodecID()) {
    const auto copy = boost::dynamic_pointer_cast<const IFormatCodecVideo>(video)->Clone();
    copy->SetCodecID(preset);
    judged = copy;
  }
  // Braces evaluate left to right: the default is asked first and reports a missing setting.
  return Bitrates{Tarvek::Conf::GetDefaultVideoBitrate(judged),
                  Tarvek::Conf::GetMinVideoBitrate(judged),
                  Tarvek::Conf::GetMaxVideoBitrate(judged)};
}

Bitrates AudioBitrates(const boost::intrusive_ptr<const IFormatCodec>& audio) {
  if (dynamic_cast<const IFormatCodecAudio*>(audio.get()) == nullptr) {
    Tarvek::Conf::GetDefaultAudioBitrate(audio);  // the library's error for another kind
  }
  const auto& metadata = audio->GetMetadata();
  const auto channels = metadata.FindChild(Tarvek::FFmpeg::Keys::kChannels);
  const bool counted = channels != metadata.GetChildren().end() &&
                       channels->GetType() == Tarvek::PropertyTypeInt64 &&
                       channels->GetInt64() > 0 && channels->GetInt64() <= 64;
  const Tarvek::FFmpeg::PresetBitrates range =
      Tarvek::FFmpeg::PresetRange(*audio, counted ? static_cast<int>(channels->GetInt64()) : 0);
  return Bitrates{range.typical, range.minimum, range.maximum};
}

std::vector<std::string> MissingForBitrates(const IFormatCodec& codec) {
  std::vector<std::string> needed;
  if (dynamic_cast<const IFormatCodecVideo*>(&codec) != nullptr) {
    needed = {IFormatCodec::TAG_CODEC_ID,        IFormatCodec::TAG_BITRATE_MODE,
              IFormatCodecVideo::TAG_WIDTH,      IFormatCodecVideo::TAG_HEIGHT,
              IFormatCodecVideo::TAG_TIMEBASE_N, IFormatCodecVideo::TAG_TIMEBASE_D};
    if (codec.ExistsBitrateMode() && codec.GetBitrateMode() == IFormatCodec::TAG_BITRATE_MODE_VBR) {
      needed.push_back(IFormatCodec::TAG_QUALITY);
    }
  } else if (dynamic_cast<const IFormatCodecAudio*>(&codec) != nullptr) {
    needed = {IFormatCodec::TAG_CODEC_ID, IFormatCodecAudio::TAG_SAMPLE_RATE,
              IFormatCodecAudio::TAG_LAYOUT, IFormatCodecAudio::TAG_SAMPLE_FORMAT};
  }
  std::vector<std::string> missing;
  for (const std::string& key : needed) {
    if (!codec.GetProperty().ChildExists(key)) missing.push_back(key);
  }
  return missing;
}

std::string OptionForSetting(const std::string& key) {
  for (const auto kind : {Tarvek::Conf::FormatKind::Video, Tarvek::Conf::FormatKind::Audio,
                          Tarvek::Conf::FormatKind::Subtitle}) {
    for (const Tarvek::Conf::Setting& setting : Tarvek::Conf::SettingsOf(kind)) {
      if (setting.key == key) return setting.option;
    }
  }
  return std::string();
}

std::vector<LadderRow> BuildLadder(const std::string& codecId, Pair frameRate,
                                   std::optional<long long> quality) {
  static const std::vector<std::pair<std::string, Pair>> kSizes = {
      {"240p", {426, 240}},    {"360p", {640, 360}},    {"480p", {854, 480}},
      {"720p", {1280, 720}},   {"1080p", {1920, 1080}}, {"1440p", {2560, 1440}},
      {"2160p", {3840, 2160}},
  };
  std::vector<LadderRow> rows;
  for (const auto& [name, size] : kSizes) {
    auto video = Tarvek::Conf::FormatCodecVideo::Create();
    video->SetCodecID(codecId);
    video->InitByPixelAspect(size.first, size.second, 1, 1);
    video->SetFrameRate(frameRate.first, frameRate.second);
    // Without a quality, a target-bitrate mode: the bitrate functions then leave quality out.
    video->SetBitrateMode(quality ? IFormatCodec::TAG_BITRATE_MODE_VBR : std::string("cbr"));
    if (quality) video->SetQuality(*quality);
    rows.push_back(LadderRow{name, size, VideoBitrates(video)});
  }
  return rows;
}

std::string LibraryDescription(const Tarvek::Exception& e) {
  const std::string* description = boost::get_error_info<Tarvek::DescriptionInfo>(e);
  return description != nullptr ? *description : std::string("the library gave no description");
}

}  // namespace Formatdesc
