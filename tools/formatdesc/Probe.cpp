// formatdesc probe: a media file's streams as descriptions, through the library's public
// interfaces only, with a verdict on each bitrate.
#include "Probe.h"

#include "Output.h"

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavformat/avformat.h>
#include <libavutil/channel_layout.h>
#include <libavutil/log.h>
#include <libavutil/rational.h>
}

#include <boost/exception/get_error_info.hpp>
#include <cmath>
#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <iostream>
#include <limits>
#include <map>
#include <memory>

namespace Formatdesc {
namespace {

using Tarvek::Conf::IFormatCodec;
using Tarvek::Conf::IFormatCodecAudio;
using Tarvek::Conf::IFormatCodecSubtitle;
using Tarvek::Conf::IFormatCodecVideo;

// The bitrate functions read a video description's quality only in vbr mode. A file holds no
// encoder quality figure, so the range is asked for in a target-bitrate mode, on a copy: the
// description itself keeps only what the file says.
const char kTargetBitrateMode[] = "cbr";

// A setting the bitrates read, as a sentence names it.
std::string SettingPhrase(const std::string& key) {
  static const std::map<std::string, std::string> phrases = {
      {IFormatCodec::TAG_CODEC_ID, "codec"},
      {IFormatCodecVideo::TAG_WIDTH, "frame size"},
      {IFormatCodecVideo::TAG_HEIGHT, "frame size"},
      {IFormatCodecVideo::TAG_TIMEBASE_N, "frame rate"},
      {IFormatCodecVideo::TAG_TIMEBASE_D, "frame rate"},
      {IFormatCodecAudio::TAG_SAMPLE_RATE, "sample rate"},
      {IFormatCodecAudio::TAG_LAYOUT, "channel layout"},
      {IFormatCodecAudio::TAG_SAMPLE_FORMAT, "sample format"},
  };
  const auto found = phrases.find(key);
  return found == phrases.end() ? key : found->second;
}

// The value of metadata entry `key` of the stream, or null.
const char* Metadata(const AVStream& stream, const char* key) {
  const AVDictionaryEntry* entry = av_dict_get(stream.metadata, key, nullptr, 0);
  return entry != nullptr && entry->value != nullptr && entry->value[0] != '\0' ? entry->value
                                                                                : nullptr;
}

// The codec's extradata as the description's private data, when there is any.
void SetExtradata(IFormatCodec& codec, const AVCodecParameters& parameters) {
  if (parameters.extradata != nullptr && parameters.extradata_size > 0) {
    codec.SetPrivateData(Tarvek::CreateBlob(parameters.extradata,
                                            static_cast<std::size_t>(parameters.extradata_size)));
  }
}

// The settings every kind takes from the codec parameters: identifier (with libavcodec's long
// name of the codec, where a new description would say "Unknown codec"), tag and bitrate.
void SetCodec(IFormatCodec& codec, const AVCodecParameters& parameters, bool withBitrate) {
  codec.SetCodecID(avcodec_get_name(parameters.codec_id));
  const AVCodecDescriptor* descriptor = avcodec_descriptor_get(parameters.codec_id);
  if (descriptor != nullptr && descriptor->long_name != nullptr) {
    codec.SetCodecName(descriptor->long_name);
  }
  if (parameters.codec_tag != 0) codec.SetCodecTag(parameters.codec_tag);
  if (withBitrate && parameters.bit_rate > 0) codec.SetBitrate(parameters.bit_rate);
}

// The stream's pixel aspect, as libavformat guesses it: the container's when it gives one, else
// the codec's; 0:1 when neither does.
AVRational PixelAspect(const AVStream& stream) {
  for (const AVRational aspect :
       {stream.sample_aspect_ratio, stream.codecpar->sample_aspect_ratio}) {
    if (aspect.num > 0 && aspect.den > 0) {
      AVRational reduced{0, 1};
      av_reduce(&reduced.num, &reduced.den, aspect.num, aspect.den,
                std::numeric_limits<int>::max());
      return reduced;
    }
  }
  return AVRational{0, 1};
}

// `video` without its pixel aspect: the size is set only together with one, so an unknown aspect
// is stored as 1:1 and then taken out of the tree again.
void DropPixelAspect(IFormatCodecVideo& video) {
  const Tarvek::Core::Property& tree = video.GetProperty();
  Tarvek::Core::Property kept(tree.GetName());
  for (const Tarvek::Core::Property& child : tree.GetChildren()) {
    if (child.GetName() != IFormatCodecVideo::TAG_ASPECTX &&
        child.GetName() != IFormatCodecVideo::TAG_ASPECTY) {
      kept.SetChild(child.GetName(), child);
    }
  }
  video.SetProperty(kept);
}

void DescribeVideo(const AVStream& stream, StreamReport& report) {
  const AVCodecParameters& parameters = *stream.codecpar;
  if (parameters.width <= 0 || parameters.height <= 0) {
    report.damage = "the frame size is unknown (libavformat could read no picture of it)";
    return;
  }
  auto video = Tarvek::Conf::FormatCodecVideo::Create();
  SetCodec(*video, parameters, true);
  const auto width = static_cast<unsigned int>(parameters.width);
  const auto height = static_cast<unsigned int>(parameters.height);
  const AVRational aspect = PixelAspect(stream);
  if (aspect.num > 0) {
    video->InitByPixelAspect(width, height, static_cast<unsigned int>(aspect.num),
                             static_cast<unsigned int>(aspect.den));
  } else {
    video->InitByPixelAspect(width, height, 1, 1);
    DropPixelAspect(*video);
    report.notes.push_back("the pixel aspect is unknown (0:1), so it is left unset");
  }
  const AVRational rate = stream.avg_frame_rate;
  if (rate.num > 0 && rate.den > 0) {
    video->SetFrameRate(static_cast<unsigned int>(rate.num), static_cast<unsigned int>(rate.den));
  } else {
    report.notes.push_back("the average frame rate is unknown, so it is left unset");
  }
  if (parameters.format >= 0 && parameters.format < AV_PIX_FMT_NB) {
    video->SetPixelFormat(static_cast<AVPixelFormat>(parameters.format));
  } else {
    report.notes.push_back("the pixel format is unknown, so it is left unset");
  }
  SetExtradata(*video, parameters);
  report.description = video;
}

// `count` channels, or "1 channel".
std::string Channels(int count) {
  return std::to_string(count) + (count == 1 ? " channel" : " channels");
}

// The speaker mask of a layout in libavutil's native order that the library's 32-bit layout can
// hold; otherwise a note saying why the layout is left unset.
std::optional<Tarvek::Conf::ChannelLayout> SpeakerMask(const AVChannelLayout& layout,
                                                       std::vector<std::string>& notes) {
  if (layout.order != AV_CHANNEL_ORDER_NATIVE) {
    notes.push_back("the file gives " + Channels(layout.nb_channels) + " in no speaker order (" +
                    (layout.order == AV_CHANNEL_ORDER_UNSPEC ? "unspecified" : "a custom one") +
                    "), so the channel layout is left unset");
    return std::nullopt;
  }
  if (layout.u.mask > std::numeric_limits<std::uint32_t>::max()) {
    char hex[32];
    std::snprintf(hex, sizeof hex, "0x%llx", static_cast<unsigned long long>(layout.u.mask));
    notes.push_back(std::string("the speaker mask ") + hex +
                    " names speakers beyond the library's 32, so the channel layout is left unset");
    return std::nullopt;
  }
  return static_cast<Tarvek::Conf::ChannelLayout>(layout.u.mask);
}

// For an audio description without a layout, a copy with libavutil's usual layout for the
// stream's channel count, and a note saying so: the presets' figures depend on the count. The
// description itself when it has a layout, or null when there is no usual layout to take.
boost::intrusive_ptr<const IFormatCodec> WithUsualLayout(const IFormatCodecAudio& audio,
                                                         int channels,
                                                         std::vector<std::string>& notes) {
  if (audio.ExistsChannelLayout()) return &audio;
  AVChannelLayout usual{};
  av_channel_layout_default(&usual, channels);
  if (usual.order != AV_CHANNEL_ORDER_NATIVE || usual.u.mask == 0 ||
      usual.u.mask > std::numeric_limits<std::uint32_t>::max()) {
    return nullptr;
  }
  char name[64] = {};
  av_channel_layout_describe(&usual, name, sizeof name);
  auto copy = audio.Clone();
  copy->SetChannelLayout(static_cast<Tarvek::Conf::ChannelLayout>(usual.u.mask));
  notes.push_back("the range is that of " + Channels(channels) + " in the usual layout (" + name +
                  ")");
  return copy;
}

void DescribeAudio(const AVStream& stream, StreamReport& report) {
  const AVCodecParameters& parameters = *stream.codecpar;
  if (parameters.sample_rate <= 0) {
    report.damage = "the sample rate is unknown (libavformat could read no sample of it)";
    return;
  }
  if (parameters.ch_layout.nb_channels <= 0) {
    report.damage = "the channel count is unknown (libavformat could read no sample of it)";
    return;
  }
  auto audio = Tarvek::Conf::FormatCodecAudio::Create();
  SetCodec(*audio, parameters, true);
  audio->SetSampleRate(parameters.sample_rate);
  if (const auto mask = SpeakerMask(parameters.ch_layout, report.notes)) {
    audio->SetChannelLayout(*mask);
  }
  if (parameters.frame_size > 0) audio->SetFrameSize(parameters.frame_size);
  if (parameters.format >= 0 && parameters.format < AV_SAMPLE_FMT_NB) {
    audio->SetSampleFormat(static_cast<AVSampleFormat>(parameters.format));
  } else {
    report.notes.push_back("the sample format is unknown, so it is left unset");
  }
  if (const char* language = Metadata(stream, "language")) audio->SetLanguage(language);
  SetExtradata(*audio, parameters);
  report.description = audio;
}

void DescribeSubtitle(const AVStream& stream, StreamReport& report) {
  const AVCodecParameters& parameters = *stream.codecpar;
  auto subtitle = Tarvek::Conf::FormatCodecSubtitle::Create();
  SetCodec(*subtitle, parameters, false);
  if (const char* language = Metadata(stream, "language")) subtitle->SetLanguage(language);
  if (const char* title = Metadata(stream, "title")) subtitle->SetTitle(title);
  // Styled subtitles keep their header (script info and styles) as the codec's extradata: it is
  // both the header text and, like every stream's extradata, the private data.
  const bool styled =
      parameters.codec_id == AV_CODEC_ID_ASS || parameters.codec_id == AV_CODEC_ID_SSA;
  if (styled && parameters.extradata != nullptr && parameters.extradata_size > 0) {
    const char* text = reinterpret_cast<const char*>(parameters.extradata);
    const auto size = static_cast<std::size_t>(parameters.extradata_size);
    subtitle->SetSubtitleHeader(std::string(text, strnlen(text, size)));
  }
  if (parameters.codec_id == AV_CODEC_ID_DVB_SUBTITLE && parameters.width > 0 &&
      parameters.height > 0) {
    subtitle->SetDVBWidth(static_cast<unsigned int>(parameters.width));
    subtitle->SetDVBHeight(static_cast<unsigned int>(parameters.height));
  }
  SetExtradata(*subtitle, parameters);
  report.description = subtitle;
}

// The presets' range for the description and the verdict on its bitrate, or why there is none.
void Judge(StreamReport& report, const AVCodecParameters& parameters) {
  try {
    if (const auto video = boost::dynamic_pointer_cast<IFormatCodecVideo>(report.description)) {
      auto copy = video->Clone();
      copy->SetBitrateMode(kTargetBitrateMode);
      report.range = VideoBitrates(copy);
    } else if (const auto audio =
                   boost::dynamic_pointer_cast<IFormatCodecAudio>(report.description)) {
      const auto judged = WithUsualLayout(*audio, parameters.ch_layout.nb_channels, report.notes);
      report.range = AudioBitrates(judged != nullptr ? judged : audio);
    } else {
      return;
    }
  } catch (const Tarvek::Conf::UnknownCodecError&) {
    report.noVerdict = "no preset for codec " + report.description->GetCodecID();
    return;
  } catch (const Tarvek::Core::ChildNotFound& e) {
    const std::string* key = boost::get_error_info<Tarvek::Core::ChildNotFound::ChildNameInfo>(e);
    report.noVerdict = "none (the presets need the " +
                       SettingPhrase(key != nullptr ? *key : std::string("setting")) +
                       ", which the file does not give)";
    return;
  } catch (const Tarvek::Exception& e) {
    report.noVerdict = "none (the presets refuse the description: " + LibraryDescription(e) + ")";
    return;
  }
  if (!report.description->ExistsBitrate()) {
    report.noVerdict = "none (the file gives no bitrate for this stream)";
    return;
  }
  report.verdict = JudgeBitrate(report.description->GetBitrate(), *report.range);
}

// Keeps libavformat's messages off the terminal while it lives, and remembers the last error
// message so that a failure can say more than its error code.
class QuietLog {
 public:
  QuietLog() {
    LastError().clear();
    av_log_set_callback(&QuietLog::Keep);
  }
  ~QuietLog() { av_log_set_callback(&av_log_default_callback); }
  QuietLog(const QuietLog&) = delete;
  QuietLog& operator=(const QuietLog&) = delete;

  static std::string& LastError() {
    static std::string text;
    return text;
  }

 private:
  static void Keep(void*, int level, const char* format, va_list arguments) {
    if (level > AV_LOG_ERROR || format == nullptr) return;
    char line[512];
    std::vsnprintf(line, sizeof line, format, arguments);
    std::string text = line;
    text.erase(std::min(text.find('\n'), text.size()));
    text.erase(text.find_last_not_of(" .") + 1);
    if (!text.empty()) LastError() = text;
  }
};

// "Invalid data found when processing input (moov atom not found)": the error code's text and,
// when libavformat said more, its last message.
std::string Reason(int error) {
  char text[AV_ERROR_MAX_STRING_SIZE] = {};
  av_strerror(error, text, sizeof text);
  const std::string& said = QuietLog::LastError();
  return said.empty() ? std::string(text) : std::string(text) + " (" + said + ")";
}

struct InputClose {
  void operator()(AVFormatContext* context) const { avformat_close_input(&context); }
};

// "Stream 0: video (mpeg4)", and for a stream without a description, why.
std::string Heading(const StreamReport& stream) {
  std::string heading =
      "Stream " + std::to_string(stream.index) + ": " + stream.kind + " (" + stream.codec + ")";
  if (!stream.damage.empty()) return heading + ", damaged: " + stream.damage;
  if (stream.Skipped()) {
    return heading + ", skipped: formatdesc describes video, audio and subtitle streams";
  }
  return heading;
}

// What the summary adds to a probed description: the verdict, then the notes.
std::vector<std::pair<std::string, std::string>> ProbeLines(const StreamReport& stream) {
  std::vector<std::pair<std::string, std::string>> lines;
  if (stream.verdict) lines.emplace_back("Bitrate verdict", VerdictText(*stream.verdict));
  if (!stream.noVerdict.empty()) lines.emplace_back("Bitrate verdict", stream.noVerdict);
  for (const std::string& note : stream.notes) lines.emplace_back("Note", note);
  return lines;
}

nlohmann::ordered_json VerdictJson(const StreamReport& stream) {
  if (!stream.verdict) return {{"result", "none"}, {"text", stream.noVerdict}};
  const Verdict& verdict = *stream.verdict;
  return {{"result", PlacementName(verdict.placement)},
          {"text", VerdictText(verdict)},
          {"bitrate", verdict.bitrate},
          {"bound", verdict.bound},
          {"difference", verdict.difference},
          {"percent", std::round(verdict.percent * 100.0) / 100.0}};
}

nlohmann::ordered_json StreamJson(const StreamReport& stream) {
  nlohmann::ordered_json json = {{"index", stream.index},
                                 {"kind", stream.kind},
                                 {"codec", stream.codec},
                                 {"status", !stream.damage.empty() ? "damaged"
                                            : stream.Skipped()     ? "skipped"
                                                                   : "described"}};
  if (!stream.damage.empty()) json["damage"] = stream.damage;
  if (stream.description) {
    json["notes"] = stream.notes;
    json["description"] = DescriptionJson(stream.description, stream.range);
    if (stream.verdict || !stream.noVerdict.empty()) json["verdict"] = VerdictJson(stream);
  }
  return json;
}

bool Shown(const StreamReport& stream, std::optional<int> only) {
  return !only || stream.index == *only;
}

}  // namespace

const char* PlacementName(Placement placement) {
  switch (placement) {
    case Placement::Below:
      return "below";
    case Placement::Above:
      return "above";
    case Placement::Within:
      break;
  }
  return "within";
}

Verdict JudgeBitrate(long long bitrate, const Bitrates& range) {
  Verdict verdict;
  verdict.bitrate = bitrate;
  if (bitrate < range.minimum) {
    verdict.placement = Placement::Below;
    verdict.bound = range.minimum;
    verdict.difference = range.minimum - bitrate;
  } else if (bitrate > range.maximum) {
    verdict.placement = Placement::Above;
    verdict.bound = range.maximum;
    verdict.difference = bitrate - range.maximum;
  }
  if (verdict.bound > 0) {
    verdict.percent =
        100.0 * static_cast<double>(verdict.difference) / static_cast<double>(verdict.bound);
  }
  return verdict;
}

std::string VerdictText(const Verdict& verdict) {
  if (verdict.placement == Placement::Within) return "within the range";
  const bool below = verdict.placement == Placement::Below;
  char share[32];
  if (verdict.percent < 1.0) {
    std::snprintf(share, sizeof share, "less than 1%%");
  } else {
    std::snprintf(share, sizeof share, "%.0f%%", verdict.percent);
  }
  return std::string(below ? "below" : "above") + " the range by " + share + " (" +
         ReadableBitrate(verdict.difference) +
         (below ? " under the minimum of " : " over the maximum of ") +
         ReadableBitrate(verdict.bound) + ")";
}

StreamReport DescribeStream(const AVStream& stream) {
  StreamReport report;
  report.index = stream.index;
  const AVCodecParameters& parameters = *stream.codecpar;
  const char* kind = av_get_media_type_string(parameters.codec_type);
  report.kind = kind != nullptr ? kind : "unknown";
  report.codec = avcodec_get_name(parameters.codec_id);
  const AVMediaType type = parameters.codec_type;
  if (type != AVMEDIA_TYPE_VIDEO && type != AVMEDIA_TYPE_AUDIO && type != AVMEDIA_TYPE_SUBTITLE) {
    return report;
  }
  if (parameters.codec_id == AV_CODEC_ID_NONE) {
    report.damage = "libavformat does not know the stream's codec";
    return report;
  }
  try {
    if (type == AVMEDIA_TYPE_VIDEO) DescribeVideo(stream, report);
    if (type == AVMEDIA_TYPE_AUDIO) DescribeAudio(stream, report);
    if (type == AVMEDIA_TYPE_SUBTITLE) DescribeSubtitle(stream, report);
    if (report.description) Judge(report, parameters);
  } catch (const Tarvek::Exception& e) {
    // Nothing a file holds should make the library refuse; if it does, the stream is reported.
    report.description = nullptr;
    report.range.reset();
    report.verdict.reset();
    report.noVerdict.clear();
    report.damage = "the library refused its description: " + LibraryDescription(e);
  }
  return report;
}

FileReport ProbeFile(const std::string& path) {
  const QuietLog quiet;
  // The file protocol alone: a name such as "http://..." or "concat:..." is a file name here.
  AVDictionary* options = nullptr;
  av_dict_set(&options, "protocol_whitelist", "file", 0);
  AVFormatContext* opened = nullptr;
  const int result = avformat_open_input(&opened, ("file:" + path).c_str(), nullptr, &options);
  av_dict_free(&options);
  if (result == AVERROR_INVALIDDATA) {
    throw UsageError("cannot read '" + path + "' as media: " + Reason(result));
  }
  if (result < 0) throw UsageError("cannot read '" + path + "': " + Reason(result));
  const std::unique_ptr<AVFormatContext, InputClose> input(opened);
  // A format recognised only by a weak guess is most likely a file that is no media at all, such
  // as random bytes that happen to resemble a raw stream.
  if (input->probe_score <= AVPROBE_SCORE_RETRY) {
    throw UsageError("cannot read '" + path + "' as media: it resembles " + input->iformat->name +
                     " data only weakly (libavformat's score " +
                     std::to_string(input->probe_score) + " of " +
                     std::to_string(AVPROBE_SCORE_MAX) + ")");
  }
  // Without a stream's parameters the stream is reported as damaged below, so a failure here
  // only matters when nothing was found.
  const int found = avformat_find_stream_info(input.get(), nullptr);
  if (input->nb_streams == 0) {
    throw UsageError("'" + path + "' holds no media streams" +
                     (found < 0 ? ": " + Reason(found) : std::string()));
  }
  FileReport report;
  report.container =
      input->iformat->long_name != nullptr ? input->iformat->long_name : input->iformat->name;
  for (unsigned int i = 0; i < input->nb_streams; ++i) {
    report.streams.push_back(DescribeStream(*input->streams[i]));
  }
  return report;
}

void PrintProbe(const std::string& path, const FileReport& report, std::optional<int> only) {
  const std::size_t count = report.streams.size();
  std::cout << "File: " << path << " (" << report.container << "), " << count
            << (count == 1 ? " stream\n" : " streams\n");
  for (const StreamReport& stream : report.streams) {
    if (!Shown(stream, only)) continue;
    std::cout << '\n' << Heading(stream) << '\n';
    if (stream.description) PrintDescription(*stream.description, stream.range, ProbeLines(stream));
  }
}

nlohmann::ordered_json ProbeJson(const std::string& path, const FileReport& report,
                                 std::optional<int> only) {
  nlohmann::ordered_json json = {{"file", path},
                                 {"container", report.container},
                                 {"streams", nlohmann::ordered_json::array()}};
  for (const StreamReport& stream : report.streams) {
    if (Shown(stream, only)) json["streams"].push_back(StreamJson(stream));
  }
  return json;
}

}  // namespace Formatdesc
