// formatdesc's output. Text goes to standard output because PrintContent writes there.
#include "Output.h"

#include <Tarvek/FFmpeg/Names.h>

#include <algorithm>
#include <bitset>
#include <cstdio>
#include <iomanip>
#include <iostream>
#include <string_view>
#include <unordered_set>

#include <Tarvek/Inspect/JsonDocument.h>
#include <Tarvek/Inspect/JsonLayout.h>

#include <Tarvek/CodecString/CodecString.h>
#include <boost/exception/get_error_info.hpp>
#if TARVEK_FORMATDESC_GSTREAMER
#include <Tarvek/GStreamer/Caps.h>
#endif

extern "C" {
#include <libavutil/pixdesc.h>
#include <libavutil/samplefmt.h>
}

namespace Formatdesc {
namespace {

using Tarvek::Conf::IFormatCodec;
using Tarvek::Conf::IFormatCodecAudio;
using Tarvek::Conf::IFormatCodecVideo;

// The values a reader cannot see at a glance in the property tree, when their settings are set.
struct Derived {
  std::optional<std::string> tag;
  std::optional<Pair> frameAspect;
  std::optional<Pair> frameRate;
  std::optional<std::string> pixelFormat;
  std::optional<std::string> layout;
  std::optional<std::size_t> channels;
  std::optional<std::string> sampleFormat;
};

std::string RatioText(Pair ratio, char separator) {
  return std::to_string(ratio.first) + separator + std::to_string(ratio.second);
}

// FFmpeg's name of a layout; a mask without one as libavutil lists its speakers.
std::string LayoutName(Tarvek::Conf::ChannelLayout layout) {
  return Tarvek::FFmpeg::ChannelLayoutName(layout);
}

// libavutil's name of a format, or its number when libavutil has none.
std::string FormatName(const char* name, long long number) {
  return name != nullptr ? std::string(name) : std::to_string(number);
}

void DeriveVideo(const IFormatCodecVideo& video, Derived& derived) {
  if (video.ExistsWidth() && video.ExistsHeight() && video.ExistsPixelAspectX() &&
      video.ExistsPixelAspectY()) {
    derived.frameAspect = Pair{video.GetFrameAspectX(), video.GetFrameAspectY()};
  }
  if (video.ExistsFrameRateNum() && video.ExistsFrameRateDen()) {
    derived.frameRate = Pair{video.GetFrameRateNum(), video.GetFrameRateDen()};
  }
  if (video.ExistsPixelFormat()) {
    const AVPixelFormat format = video.GetPixelFormat();
    derived.pixelFormat = FormatName(av_get_pix_fmt_name(format), format);
  }
}

void DeriveAudio(const IFormatCodecAudio& audio, Derived& derived) {
  if (audio.ExistsChannelLayout()) {
    derived.layout = LayoutName(audio.GetChannelLayout());
    derived.channels = std::bitset<32>(audio.GetChannelLayout()).count();
  }
  if (audio.ExistsSampleFormat()) {
    const AVSampleFormat format = audio.GetSampleFormat();
    derived.sampleFormat = FormatName(av_get_sample_fmt_name(format), format);
  }
}

Derived Derive(const IFormatCodec& codec) {
  Derived derived;
  if (codec.ExistsCodecTag()) {
    const std::string text = Tarvek::FFmpeg::FourccText(codec.GetCodecTag());
    if (!text.empty()) derived.tag = text;
  }
  if (const auto* video = dynamic_cast<const IFormatCodecVideo*>(&codec)) {
    DeriveVideo(*video, derived);
  }
  if (const auto* audio = dynamic_cast<const IFormatCodecAudio*>(&codec)) {
    DeriveAudio(*audio, derived);
  }
  return derived;
}

// What another media stack takes: the description's GStreamer caps and its streaming codec
// string, or why there are none.
struct Handover {
  std::string text;
  bool made = false;
};

template <class Error, class Make>
Handover Hand(Make make) {
  try {
    return {make(), true};
  } catch (const Error& error) {
    const std::string* what = boost::get_error_info<Tarvek::DescriptionInfo>(error);
    return {what ? *what : std::string("not available"), false};
  }
}

Handover CapsOf(const boost::intrusive_ptr<IFormatCodec>& codec) {
#if TARVEK_FORMATDESC_GSTREAMER
  InitGStreamer();
  return Hand<Tarvek::GStreamer::CapsError>([&] { return Tarvek::GStreamer::ToCapsString(codec); });
#else
  (void)codec;
  return {"this formatdesc was built without GStreamer", false};
#endif
}

Handover CodecStringOf(const boost::intrusive_ptr<IFormatCodec>& codec) {
  return Hand<Tarvek::CodecString::CodecStringError>(
      [&] { return Tarvek::CodecString::GetCodecString(codec); });
}

std::string HandoverText(const Handover& handover) {
  return handover.made ? handover.text : "none (" + handover.text + ")";
}

void HandoverJson(nlohmann::ordered_json& json, const std::string& key, const Handover& handover) {
  json[key] = handover.made ? nlohmann::ordered_json(handover.text) : nlohmann::ordered_json();
  if (!handover.made) json[key + "_reason"] = handover.text;
}

std::vector<std::pair<std::string, std::string>> SummaryLines(
    const Derived& derived, const std::optional<Bitrates>& bitrates) {
  std::vector<std::pair<std::string, std::string>> lines;
  if (derived.tag) lines.emplace_back("Codec tag", *derived.tag);
  if (derived.frameAspect) lines.emplace_back("Frame aspect", RatioText(*derived.frameAspect, ':'));
  if (derived.frameRate) {
    const Pair rate = *derived.frameRate;
    const double fps = rate.second == 0 ? 0.0 : double(rate.first) / double(rate.second);
    lines.emplace_back("Frame rate",
                       ReadableFrameRate(fps) + " fps (" + RatioText(rate, '/') + ")");
  }
  if (derived.pixelFormat) lines.emplace_back("Pixel format", *derived.pixelFormat);
  if (derived.layout) {
    const std::size_t count = *derived.channels;
    lines.emplace_back("Channel layout", *derived.layout + " (" + std::to_string(count) +
                                             (count == 1 ? " channel)" : " channels)"));
  }
  if (derived.sampleFormat) lines.emplace_back("Sample format", *derived.sampleFormat);
  if (bitrates) {
    lines.emplace_back("Default bitrate", DescribeBitrate(bitrates->typical));
    lines.emplace_back("Minimum bitrate", DescribeBitrate(bitrates->minimum));
    lines.emplace_back("Maximum bitrate", DescribeBitrate(bitrates->maximum));
  }
  return lines;
}

// A property tree as JSON: containers as objects (the first child of a repeated name wins, as in
// the library's look-ups), leaves as their values.
nlohmann::ordered_json TreeJson(const Tarvek::Core::Property& node) {
  switch (node.GetType()) {
    case Tarvek::PropertyTypeBool:
      return node.GetBool();
    case Tarvek::PropertyTypeInt64:
      return node.GetInt64();
    case Tarvek::PropertyTypeString:
      return node.GetString();
    default:
      break;
  }
  // An ordered object looks a key up by a scan on every insertion; the names seen are kept aside
  // and members appended to its storage directly, so that building it takes linear time.
  std::unordered_set<std::string_view> seen;
  nlohmann::ordered_json object = nlohmann::ordered_json::object();
  auto& members = *object.get_ptr<nlohmann::ordered_json::object_t*>();
  members.reserve(node.GetChildren().size());
  for (const Tarvek::Core::Property& child : node.GetChildren()) {
    if (seen.insert(child.GetName()).second) {
      members.Container::emplace_back(child.GetName(), TreeJson(child));
    }
  }
  return object;
}

nlohmann::ordered_json BitratesJson(const Bitrates& bitrates) {
  return {{"default", bitrates.typical}, {"min", bitrates.minimum}, {"max", bitrates.maximum}};
}

// Table cells joined by two spaces, each padded to its column's width: left-aligned columns
// before `firstRight`, right-aligned from it on.
void PrintTable(std::ostream& out, const std::vector<std::vector<std::string>>& rows,
                std::size_t firstRight) {
  std::vector<std::size_t> widths(rows.front().size(), 0);
  for (const auto& row : rows) {
    for (std::size_t i = 0; i < row.size(); ++i) widths[i] = std::max(widths[i], row[i].size());
  }
  for (const auto& row : rows) {
    std::string line;
    for (std::size_t i = 0; i < row.size(); ++i) {
      const std::string padding(widths[i] - row[i].size(), ' ');
      if (i > 0) line += "  ";
      line += i < firstRight ? row[i] + padding : padding + row[i];
    }
    out << line.substr(0, line.find_last_not_of(' ') + 1) << '\n';
  }
}

// `ids` after a two-space indent, wrapped before 80 columns.
void PrintWrapped(std::ostream& out, const std::vector<std::string>& ids) {
  std::string line = " ";
  for (const std::string& id : ids) {
    if (line.size() + 1 + id.size() > 80 && line.size() > 1) {
      out << line << '\n';
      line = " ";
    }
    line += ' ' + id;
  }
  out << line << '\n';
}

}  // namespace

void InitGStreamer() {
#if TARVEK_FORMATDESC_GSTREAMER
  // The tool builds and reads caps only and runs no element, so GStreamer's plugin registry is
  // left unread: that saves most of gst_init's time (unless the user asks otherwise).
  g_setenv("GST_REGISTRY_DISABLE", "yes", FALSE);
  gst_init(nullptr, nullptr);
#endif
}

std::string ReadableBitrate(long long bitsPerSecond) {
  const bool negative = bitsPerSecond < 0;
  const unsigned long long magnitude = negative
                                           ? 0ull - static_cast<unsigned long long>(bitsPerSecond)
                                           : static_cast<unsigned long long>(bitsPerSecond);
  // Hundredths of the unit, rounded; a figure that rounds to 1000.00 kb/s moves up to Mb/s.
  unsigned long long hundredths = magnitude / 10 + (magnitude % 10 >= 5 ? 1 : 0);
  const char* unit = "kb/s";
  if (hundredths >= 100000) {
    hundredths = magnitude / 10000 + (magnitude % 10000 >= 5000 ? 1 : 0);
    unit = "Mb/s";
  }
  char text[64];
  std::snprintf(text, sizeof text, "%s%llu.%02llu %s", negative ? "-" : "", hundredths / 100,
                hundredths % 100, unit);
  return text;
}

std::string DescribeBitrate(long long bitsPerSecond) {
  return ReadableBitrate(bitsPerSecond) + " (" + std::to_string(bitsPerSecond) + " b/s)";
}

std::string ReadableFrameRate(double framesPerSecond) {
  char text[64];
  std::snprintf(text, sizeof text, "%.3f", framesPerSecond);
  std::string result = text;
  result.erase(result.find_last_not_of('0') + 1);
  if (result.back() == '.') result.pop_back();
  return result;
}

void PrintDescription(IFormatCodec& codec, const std::optional<Bitrates>& bitrates,
                      const std::vector<std::pair<std::string, std::string>>& extra) {
  codec.PrintContent();
  auto lines = SummaryLines(Derive(codec), bitrates);
  // Kept outside the tree, so PrintContent does not show it.
  if (const auto data = codec.GetPrivateData()) {
    const std::size_t size = data->GetSize();
    lines.emplace_back("Private data", std::to_string(size) + (size == 1 ? " byte" : " bytes"));
  }
  const boost::intrusive_ptr<IFormatCodec> held(&codec);
  lines.emplace_back("Caps", HandoverText(CapsOf(held)));
  lines.emplace_back("Codec string", HandoverText(CodecStringOf(held)));
  lines.insert(lines.end(), extra.begin(), extra.end());
  if (lines.empty()) return;
  std::cout << "======Summary:=============\n";
  for (const auto& [label, value] : lines) {
    std::cout << std::left << std::setw(17) << label + ":" << value << '\n';
  }
}

nlohmann::ordered_json DescriptionJson(const boost::intrusive_ptr<IFormatCodec>& codec,
                                       const std::optional<Bitrates>& bitrates) {
  nlohmann::ordered_json json = Tarvek::Conf::JsonDocument::Make(codec);
  // Room for the members added below: the object's storage copies its members when it grows.
  json.get_ptr<nlohmann::ordered_json::object_t*>()->reserve(json.size() + 12);
  json["settings"] = SettingsJson(codec->GetProperty());
  const Derived derived = Derive(*codec);
  if (derived.tag) json["codec_tag_name"] = *derived.tag;
  if (derived.frameAspect) json["frame_aspect"] = RatioText(*derived.frameAspect, ':');
  if (derived.frameRate) {
    const Pair rate = *derived.frameRate;
    json["frame_rate"] = rate.second == 0 ? 0.0 : double(rate.first) / double(rate.second);
  }
  if (derived.pixelFormat) json["pix_fmt_name"] = *derived.pixelFormat;
  if (derived.layout) json["channel_layout_name"] = *derived.layout;
  if (derived.channels) json["channels"] = *derived.channels;
  if (derived.sampleFormat) json["sample_fmt_name"] = *derived.sampleFormat;
  HandoverJson(json, "caps", CapsOf(codec));
  HandoverJson(json, "codec_string", CodecStringOf(codec));
  if (bitrates) json["bitrate"] = BitratesJson(*bitrates);
  return json;
}

nlohmann::ordered_json SettingsJson(const Tarvek::Core::Property& tree) { return TreeJson(tree); }

void PrintLadder(std::ostream& out, const std::string& codecId, Pair frameRate,
                 std::optional<long long> quality, const std::vector<LadderRow>& rows) {
  out << codecId << " at " << ReadableFrameRate(double(frameRate.first) / frameRate.second)
      << " fps" << (quality ? ", quality " + std::to_string(*quality) : std::string()) << '\n';
  std::vector<std::vector<std::string>> table = {{"name", "size", "default", "minimum", "maximum"}};
  for (const LadderRow& row : rows) {
    table.push_back({row.name, RatioText(row.size, 'x'), ReadableBitrate(row.bitrates.typical),
                     ReadableBitrate(row.bitrates.minimum), ReadableBitrate(row.bitrates.maximum)});
  }
  PrintTable(out, table, 2);
}

nlohmann::ordered_json LadderJson(const std::string& codecId, Pair frameRate,
                                  std::optional<long long> quality,
                                  const std::vector<LadderRow>& rows) {
  nlohmann::ordered_json json = {
      {"codec_id", codecId},
      {"frame_rate", double(frameRate.first) / frameRate.second},
      {"quality", quality ? nlohmann::ordered_json(*quality) : nlohmann::ordered_json()},
      {"sizes", nlohmann::ordered_json::array()}};
  for (const LadderRow& row : rows) {
    json["sizes"].push_back({{"name", row.name},
                             {"width", row.size.first},
                             {"height", row.size.second},
                             {"bitrate", BitratesJson(row.bitrates)}});
  }
  return json;
}

void PrintCodecs(std::ostream& out, const std::optional<std::string>& kind) {
  if (kind) {
    const auto& ids = *kind == "video" ? Tarvek::Conf::GetPresetVideoCodecs()
                                       : Tarvek::Conf::GetPresetAudioCodecs();
    for (const std::string& id : ids) out << id << '\n';
    return;
  }
  out << "video:\n";
  PrintWrapped(out, Tarvek::Conf::GetPresetVideoCodecs());
  out << "audio:\n";
  PrintWrapped(out, Tarvek::Conf::GetPresetAudioCodecs());
}

nlohmann::ordered_json CodecsJson(const std::optional<std::string>& kind) {
  nlohmann::ordered_json json = nlohmann::ordered_json::object();
  if (!kind || *kind == "video") json["video"] = Tarvek::Conf::GetPresetVideoCodecs();
  if (!kind || *kind == "audio") json["audio"] = Tarvek::Conf::GetPresetAudioCodecs();
  return json;
}

void PrintDiff(std::ostream& out, const std::vector<Tarvek::Conf::Difference>& differences,
               const std::vector<Tarvek::Conf::Incompatibility>& reasons) {
  using Tarvek::Conf::DifferenceKind;
  out << (differences.empty() ? "Differences: none\n" : "Differences:\n");
  for (const auto& d : differences) {
    out << "  " << (d.path.empty() ? "(root)" : d.path) << ": "
        << Tarvek::Conf::DifferenceKindName(d.kind) << ": ";
    if (d.kind == DifferenceKind::OnlyInA) {
      out << d.a << '\n';
    } else if (d.kind == DifferenceKind::OnlyInB) {
      out << d.b << '\n';
    } else {
      out << d.a << " in a, " << d.b << " in b\n";
    }
  }
  out << "Compatibility: b " << (reasons.empty() ? "can" : "cannot")
      << " be used where a is expected\n";
  for (const auto& reason : reasons) out << "  " << reason.reason << '\n';
}

nlohmann::ordered_json DiffJson(const std::vector<Tarvek::Conf::Difference>& differences,
                                const std::vector<Tarvek::Conf::Incompatibility>& reasons) {
  nlohmann::ordered_json json = {{"equal", differences.empty()},
                                 {"differences", nlohmann::ordered_json::array()},
                                 {"compatible", reasons.empty()},
                                 {"reasons", nlohmann::ordered_json::array()}};
  // Each side as its JSON value where it is a setting, null where the side lacks it, the text
  // for an order or a root name.
  const auto side = [](const Tarvek::Core::Property* node, const std::string& text) {
    if (node != nullptr) return TreeJson(*node);
    return text.empty() ? nlohmann::ordered_json() : nlohmann::ordered_json(text);
  };
  for (const auto& d : differences) {
    json["differences"].push_back({{"path", d.path},
                                   {"kind", Tarvek::Conf::DifferenceKindName(d.kind)},
                                   {"a", side(d.nodeA, d.a)},
                                   {"b", side(d.nodeB, d.b)}});
  }
  for (const auto& r : reasons) {
    json["reasons"].push_back(
        {{"setting", r.setting}, {"a", r.a}, {"b", r.b}, {"reason", r.reason}});
  }
  return json;
}

void PrintFindings(std::ostream& out, const std::vector<Tarvek::Conf::Finding>& findings) {
  if (findings.empty()) out << "valid\n";
  for (const auto& finding : findings) {
    out << Tarvek::Conf::SeverityName(finding.severity) << ": "
        << (finding.setting.empty() ? std::string() : finding.setting + ": ") << finding.message
        << '\n';
  }
}

nlohmann::ordered_json FindingsJson(const std::vector<Tarvek::Conf::Finding>& findings) {
  nlohmann::ordered_json json = {{"valid", true}, {"findings", nlohmann::ordered_json::array()}};
  for (const auto& finding : findings) {
    if (finding.severity == Tarvek::Conf::Severity::Error) json["valid"] = false;
    json["findings"].push_back({{"severity", Tarvek::Conf::SeverityName(finding.severity)},
                                {"setting", finding.setting},
                                {"message", finding.message}});
  }
  return json;
}

void PrintJson(std::ostream& out, const nlohmann::ordered_json& value) {
  std::string text;
  Tarvek::Conf::JsonLayout::Write(value, text);
  out << text << '\n';
}

}  // namespace Formatdesc
