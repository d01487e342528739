// formatdesc probe: a media file's streams as the FFmpeg bridge describes them, with a verdict on
// each bitrate.
#include "Probe.h"

#include "Output.h"

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavformat/avformat.h>
#include <libavutil/channel_layout.h>
#include <libavutil/log.h>
}

#include <Tarvek/FFmpeg/Names.h>
#include <Tarvek/FFmpeg/Streams.h>

#include <sys/stat.h>
#include <unistd.h>
#include <boost/exception/get_error_info.hpp>
#include <cmath>
#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <iostream>
#include <limits>
#include <map>
#include <memory>
#include <mutex>

namespace Formatdesc {
namespace {

using Tarvek::Conf::IFormatCodec;
using Tarvek::Conf::IFormatCodecAudio;
using Tarvek::Conf::IFormatCodecSubtitle;
using Tarvek::Conf::IFormatCodecVideo;
namespace Bridge = Tarvek::FFmpeg;

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

// `count` channels, or "1 channel".
std::string Channels(int count) {
  return std::to_string(count) + (count == 1 ? " channel" : " channels");
}

// Why a stream the probe describes cannot be described; empty when it can.
std::string Damage(const AVCodecParameters& parameters) {
  if (parameters.codec_id == AV_CODEC_ID_NONE)
    return "libavformat does not know the stream's codec";
  if (parameters.codec_type == AVMEDIA_TYPE_VIDEO &&
      (parameters.width <= 0 || parameters.height <= 0)) {
    return "the frame size is unknown (libavformat could read no picture of it)";
  }
  if (parameters.codec_type == AVMEDIA_TYPE_AUDIO) {
    if (parameters.sample_rate <= 0) {
      return "the sample rate is unknown (libavformat could read no sample of it)";
    }
    if (parameters.ch_layout.nb_channels <= 0) {
      return "the channel count is unknown (libavformat could read no sample of it)";
    }
  }
  return std::string();
}

// For an audio description without a layout, the note that the range is that of libavutil's
// usual layout for the stream's channel count, which the range functions take.
void NoteUsualLayout(const IFormatCodecAudio& audio, int channels,
                     std::vector<std::string>& notes) {
  if (audio.ExistsChannelLayout() || channels <= 0) return;
  AVChannelLayout usual{};
  av_channel_layout_default(&usual, channels);
  if (usual.order == AV_CHANNEL_ORDER_NATIVE && usual.u.mask != 0 &&
      usual.u.mask <= std::numeric_limits<std::uint32_t>::max()) {
    notes.push_back("the range is that of " + Channels(channels) + " in the usual layout (" +
                    Bridge::ChannelLayoutName(usual.u.mask) + ")");
  }
}

// The presets' range for the description and the verdict on its bitrate, or why there is none.
// Compressed lossless codecs get their compression instead of a verdict.
void Judge(StreamReport& report, const AVCodecParameters& parameters) {
  const IFormatCodec& codec = *report.description;
  const bool lossless = Bridge::IsCompressedLossless(codec.GetCodecID());
  if (lossless && codec.ExistsBitrate()) {
    if (const long long uncompressed = Bridge::UncompressedBitrate(codec)) {
      report.uncompressed = uncompressed;
    }
  }
  const int channels = parameters.ch_layout.nb_channels;
  try {
    if (dynamic_cast<const IFormatCodecVideo*>(&codec) == nullptr &&
        dynamic_cast<const IFormatCodecAudio*>(&codec) == nullptr) {
      return;
    }
    const Bridge::PresetBitrates range = Bridge::PresetRange(codec, channels);
    report.range = Bitrates{range.typical, range.minimum, range.maximum};
    if (const auto* audio = dynamic_cast<const IFormatCodecAudio*>(&codec)) {
      NoteUsualLayout(*audio, channels, report.notes);
    }
  } catch (const Tarvek::Conf::UnknownCodecError&) {
    if (!report.uncompressed) {
      report.noVerdict = "no preset for codec " + Bridge::PresetCodecID(codec);
      report.noVerdictResult = "no_preset";
    }
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
  if (!codec.ExistsBitrate()) {
    report.noVerdict = "none (the file gives no bitrate for this stream)";
    report.noVerdictResult = "no_bitrate";
    return;
  }
  if (lossless) {
    if (!report.uncompressed) {
      report.noVerdict = "none (a lossless codec; the uncompressed rate is unknown)";
    }
    return;
  }
  report.verdict = JudgeBitrate(codec.GetBitrate(), *report.range);
}

// Keeps libavformat's messages off the terminal while any instance lives, and remembers the last
// error message of the thread that logged it, so that a failure can say more than its error code.
// Files probed on several threads at once each keep their own message; the callback is installed
// by the first instance and restored by the last.
class QuietLog {
 public:
  QuietLog() {
    LastError().clear();
    const std::lock_guard<std::mutex> lock(Mutex());
    if (Users()++ == 0) av_log_set_callback(&QuietLog::Keep);
  }
  ~QuietLog() {
    const std::lock_guard<std::mutex> lock(Mutex());
    if (--Users() == 0) av_log_set_callback(&av_log_default_callback);
  }
  QuietLog(const QuietLog&) = delete;
  QuietLog& operator=(const QuietLog&) = delete;

  static std::string& LastError() {
    thread_local std::string text;
    return text;
  }

 private:
  static std::mutex& Mutex() {
    static std::mutex mutex;
    return mutex;
  }
  static int& Users() {
    static int users = 0;
    return users;
  }
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

// "a FIFO": what a file that is not a regular one is, for a message.
std::string FileKind(mode_t mode) {
  if (S_ISDIR(mode)) return "a folder";
  if (S_ISFIFO(mode)) return "a FIFO";
  if (S_ISCHR(mode)) return "a character device";
  if (S_ISBLK(mode)) return "a block device";
  if (S_ISSOCK(mode)) return "a socket";
  return "not a regular file";
}

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

// "lossless, compressed to 58% of the uncompressed 1.41 Mb/s (1.72:1)".
std::string LosslessText(long long bitrate, long long uncompressed) {
  char text[96];
  std::snprintf(text, sizeof text, "lossless, compressed to %.0f%% of the uncompressed ",
                100.0 * static_cast<double>(bitrate) / static_cast<double>(uncompressed));
  char ratio[32];
  std::snprintf(ratio, sizeof ratio, " (%.2f:1)",
                static_cast<double>(uncompressed) / static_cast<double>(bitrate));
  return text + ReadableBitrate(uncompressed) + ratio;
}

// Where the bitrate came from, as a sentence names it.
std::string SourcePhrase(const std::string& source) {
  if (source == "statistics_tag") return "the container's statistics tag (BPS)";
  if (source == "container") return "the container's total (the file's only stream)";
  if (source == "packets") return "measured from the packets";
  return "the stream";
}

// The displayed aspect of a picture turned by a quarter: the frame aspect the other way round.
std::optional<std::string> DisplayedAspect(const IFormatCodec& codec) {
  const auto* video = dynamic_cast<const IFormatCodecVideo*>(&codec);
  const Tarvek::Core::Property& metadata = codec.GetMetadata();
  const auto rotation = metadata.FindChild(Bridge::Keys::kRotation);
  if (video == nullptr || rotation == metadata.GetChildren().end() ||
      rotation->GetType() != Tarvek::PropertyTypeInt64 || !video->ExistsWidth() ||
      !video->ExistsHeight() || !video->ExistsPixelAspectX() || !video->ExistsPixelAspectY()) {
    return std::nullopt;
  }
  const long long degrees = rotation->GetInt64();
  if (degrees % 180 == 0 || degrees % 90 != 0) return std::nullopt;
  return std::to_string(video->GetFrameAspectY()) + ":" + std::to_string(video->GetFrameAspectX()) +
         " (turned by " + std::to_string(degrees) + " degrees)";
}

// libavcodec's name of the description's profile, when it has one.
std::optional<std::string> ProfileName(const IFormatCodec& codec) {
  const Tarvek::Core::Property& metadata = codec.GetMetadata();
  const auto profile = metadata.FindChild(Bridge::Keys::kProfile);
  const AVCodecDescriptor* descriptor =
      codec.ExistsCodecID() ? avcodec_descriptor_get_by_name(codec.GetCodecID().c_str()) : nullptr;
  if (descriptor == nullptr || profile == metadata.GetChildren().end() ||
      profile->GetType() != Tarvek::PropertyTypeInt64) {
    return std::nullopt;
  }
  const char* name = avcodec_profile_name(descriptor->id, static_cast<int>(profile->GetInt64()));
  if (name == nullptr) return std::nullopt;
  return std::string(name);
}

// What the summary adds to a probed description: profile, displayed aspect, the verdict and
// where the bitrate came from, then the notes.
std::vector<std::pair<std::string, std::string>> ProbeLines(const StreamReport& stream) {
  std::vector<std::pair<std::string, std::string>> lines;
  if (const auto profile = ProfileName(*stream.description))
    lines.emplace_back("Profile", *profile);
  if (const auto displayed = DisplayedAspect(*stream.description)) {
    lines.emplace_back("Displayed aspect", *displayed);
  }
  if (stream.verdict) lines.emplace_back("Bitrate verdict", VerdictText(*stream.verdict));
  if (stream.uncompressed) {
    lines.emplace_back("Bitrate verdict",
                       LosslessText(stream.description->GetBitrate(), *stream.uncompressed));
  }
  if (!stream.noVerdict.empty()) lines.emplace_back("Bitrate verdict", stream.noVerdict);
  if (!stream.bitrateSource.empty()) {
    lines.emplace_back("Bitrate source", SourcePhrase(stream.bitrateSource));
  }
  for (const std::string& note : stream.notes) lines.emplace_back("Note", note);
  return lines;
}

nlohmann::ordered_json VerdictJson(const StreamReport& stream) {
  nlohmann::ordered_json json;
  if (stream.uncompressed) {
    const long long bitrate = stream.description->GetBitrate();
    json = {{"result", "lossless"},
            {"text", LosslessText(bitrate, *stream.uncompressed)},
            {"bitrate", bitrate},
            {"uncompressed", *stream.uncompressed},
            {"ratio", std::round(static_cast<double>(*stream.uncompressed) /
                                 static_cast<double>(bitrate) * 100.0) /
                          100.0}};
  } else if (!stream.verdict) {
    json = {{"result", stream.noVerdictResult}, {"text", stream.noVerdict}};
  } else {
    // Within the range no bound is passed: the distances do not apply.
    const Verdict& verdict = *stream.verdict;
    const bool within = verdict.placement == Placement::Within;
    const auto distance = [within](auto value) {
      return within ? nlohmann::ordered_json() : nlohmann::ordered_json(value);
    };
    json = {{"result", PlacementName(verdict.placement)},
            {"text", VerdictText(verdict)},
            {"bitrate", verdict.bitrate},
            {"bound", distance(verdict.bound)},
            {"difference", distance(verdict.difference)},
            {"percent", distance(std::round(verdict.percent * 100.0) / 100.0)}};
  }
  if (!stream.bitrateSource.empty()) json["bitrate_source"] = stream.bitrateSource;
  return json;
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
    if (stream.verdict || stream.uncompressed || !stream.noVerdict.empty()) {
      json["verdict"] = VerdictJson(stream);
    }
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

StreamReport DescribeStream(const AVFormatContext& context, unsigned int index,
                            long long measured) {
  StreamReport report;
  const AVStream& stream = *context.streams[index];
  report.index = stream.index;
  const AVCodecParameters& parameters = *stream.codecpar;
  const char* kind = av_get_media_type_string(parameters.codec_type);
  report.kind = kind != nullptr ? kind : "unknown";
  report.codec = avcodec_get_name(parameters.codec_id);
  const AVMediaType type = parameters.codec_type;
  if (type != AVMEDIA_TYPE_VIDEO && type != AVMEDIA_TYPE_AUDIO && type != AVMEDIA_TYPE_SUBTITLE) {
    return report;
  }
  report.damage = Damage(parameters);
  if (!report.damage.empty()) return report;
  try {
    Bridge::StreamDescription described = Bridge::DescribeStream(context, index);
    report.description = std::move(described.description);
    report.notes = std::move(described.notes);
    if (type != AVMEDIA_TYPE_SUBTITLE &&
        Bridge::SetMeasuredBitrate(*report.description, measured)) {
      report.notes.push_back("the bitrate is measured from the stream's packets");
    }
    report.bitrateSource = Bridge::BitrateSourceName(Bridge::GetBitrateSource(*report.description));
    Judge(report, parameters);
  } catch (const Tarvek::Exception& e) {
    // Nothing a file holds should make the library refuse; if it does, the stream is reported.
    report.description = nullptr;
    report.range.reset();
    report.verdict.reset();
    report.uncompressed.reset();
    report.noVerdict.clear();
    report.damage = "the library refused its description: " + LibraryDescription(e);
  }
  return report;
}

std::string OtherFileKind(const std::string& path) {
  struct stat status {};
  if (stat(path.c_str(), &status) != 0 || S_ISREG(status.st_mode)) return std::string();
  return FileKind(status.st_mode);
}

FileReport ProbeFile(const std::string& path, bool measure, bool progress) {
  // Only a regular file is opened: opening a FIFO or a device could wait forever. A name that
  // cannot be looked up is left to libavformat, whose message says why.
  const std::string other = OtherFileKind(path);
  if (!other.empty()) {
    throw UsageError("cannot read '" + path + "': " + other + ", not a regular file");
  }
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
  std::vector<long long> measured(input->nb_streams, 0);
  if (measure) {
    // A bar on a terminal only; a file read in a blink shows none.
    const bool bar = progress && isatty(STDERR_FILENO) != 0;
    int shown = -1;
    measured = Bridge::MeasureBitrates(*input, [&](double share) {
      const int percent = static_cast<int>(share * 100.0);
      if (!bar || percent == shown) return;
      shown = percent;
      const int filled = percent / 5;
      std::cerr << "\rMeasuring [" << std::string(static_cast<std::size_t>(filled), '#')
                << std::string(static_cast<std::size_t>(20 - filled), ' ') << "] " << percent << "%"
                << std::flush;
    });
    if (bar && shown >= 0) std::cerr << "\r" << std::string(40, ' ') << "\r" << std::flush;
  }
  FileReport report;
  report.container =
      input->iformat->long_name != nullptr ? input->iformat->long_name : input->iformat->name;
  for (unsigned int i = 0; i < input->nb_streams; ++i) {
    report.streams.push_back(DescribeStream(*input, i, measured[i]));
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
