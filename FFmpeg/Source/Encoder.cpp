// Encoder settings from descriptions.
#include <Tarvek/FFmpeg/Encoder.h>
#include <Tarvek/FFmpeg/Names.h>
#include <Tarvek/FFmpeg/Streams.h>

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavutil/channel_layout.h>
#include <libavutil/opt.h>
#include <libavutil/pixdesc.h>
#include <libavutil/samplefmt.h>
}

#include <cstring>
#include <limits>

namespace Tarvek {
namespace FFmpeg {
namespace {

using Conf::IFormatCodec;
using Conf::IFormatCodecAudio;
using Conf::IFormatCodecVideo;

// How an encoder takes a quality figure in vbr mode.
enum class Quality {
  kNone,     // no quality scale: a fixed-rate or lossless encoder
  kCrf,      // private option "crf" (x264, x265, libvpx, libaom, SVT-AV1)
  kQp,       // private option "qp" (rav1e)
  kQscale,   // global_quality in lambda units with the qscale flag (-q:v, -q:a)
  kOpusVbr,  // libopus: bitrate with "vbr on"
};

// Which encoders serve a codec, in order of preference, and how each takes a quality.
struct EncoderRow {
  AVCodecID codec;
  const char* encoder;
  Quality quality;
};

constexpr EncoderRow kEncoders[] = {
    {AV_CODEC_ID_H264, "libx264", Quality::kCrf},
    {AV_CODEC_ID_HEVC, "libx265", Quality::kCrf},
    {AV_CODEC_ID_VP9, "libvpx-vp9", Quality::kCrf},
    {AV_CODEC_ID_VP8, "libvpx", Quality::kCrf},
    {AV_CODEC_ID_AV1, "libaom-av1", Quality::kCrf},
    {AV_CODEC_ID_AV1, "libsvtav1", Quality::kCrf},
    {AV_CODEC_ID_AV1, "librav1e", Quality::kQp},
    {AV_CODEC_ID_MPEG1VIDEO, "mpeg1video", Quality::kQscale},
    {AV_CODEC_ID_MPEG2VIDEO, "mpeg2video", Quality::kQscale},
    {AV_CODEC_ID_MPEG4, "mpeg4", Quality::kQscale},
    {AV_CODEC_ID_MJPEG, "mjpeg", Quality::kQscale},
    {AV_CODEC_ID_THEORA, "libtheora", Quality::kQscale},
    {AV_CODEC_ID_PRORES, "prores_ks", Quality::kNone},
    {AV_CODEC_ID_DNXHD, "dnxhd", Quality::kNone},
    {AV_CODEC_ID_FFV1, "ffv1", Quality::kNone},
    {AV_CODEC_ID_PNG, "png", Quality::kNone},
    {AV_CODEC_ID_AAC, "aac", Quality::kQscale},
    {AV_CODEC_ID_OPUS, "libopus", Quality::kOpusVbr},
    {AV_CODEC_ID_FLAC, "flac", Quality::kNone},
    {AV_CODEC_ID_ALAC, "alac", Quality::kNone},
    {AV_CODEC_ID_AC3, "ac3", Quality::kNone},
    {AV_CODEC_ID_EAC3, "eac3", Quality::kNone},
    {AV_CODEC_ID_MP3, "libmp3lame", Quality::kQscale},
    {AV_CODEC_ID_MP2, "mp2", Quality::kNone},
    {AV_CODEC_ID_VORBIS, "libvorbis", Quality::kQscale},
    {AV_CODEC_ID_DTS, "dca", Quality::kNone},
    {AV_CODEC_ID_TRUEHD, "truehd", Quality::kNone},
};

// Encoders whose private option "profile" takes libavcodec's profile numbers.
bool TakesProfileNumber(const std::string& encoder) {
  return encoder == "prores_ks" || encoder == "dnxhd";
}

// ffmpeg's own option for a codec option where it has one: ffmpeg sets these fields itself
// from its filters and would override the codec option.
const char* CommandLineName(const std::string& key) {
  if (key == "video_size") return "-s";
  if (key == "pixel_format") return "-pix_fmt";
  if (key == "ar") return "-ar";
  if (key == "ch_layout") return "-ch_layout";
  return nullptr;
}

// The settings under construction.
class Settings {
 public:
  Settings(EncoderSettings& out, char stream) : out_(out), stream_(stream) {}

  void Set(const std::string& key, const std::string& value) {
    AVDictionary* options = out_.options.release();
    const int result = av_dict_set(&options, key.c_str(), value.c_str(), 0);
    out_.options.reset(options);
    if (result < 0) throw std::bad_alloc();
    if (key == "time_base") return;  // given on the command line as the frame rate (-r)
    if (const char* name = CommandLineName(key)) {
      Argument(name, value);
    } else {
      Argument("-" + key + ":" + stream_, value);
    }
  }
  void Set(const std::string& key, long long value) { Set(key, std::to_string(value)); }
  void Argument(const std::string& name, const std::string& value) {
    out_.arguments.push_back(name);
    out_.arguments.push_back(value);
  }
  void Note(std::string note) { out_.notes.push_back(std::move(note)); }
  // Codec flags are gathered and set once ("+qscale+global_header"), as one option.
  void AddFlag(const char* flag) { flags_ += std::string("+") + flag; }
  void Finish() {
    if (!flags_.empty()) Set("flags", flags_);
  }

 private:
  EncoderSettings& out_;
  char stream_;
  std::string flags_;
};

const EncoderRow* FindEncoder(AVCodecID codec) {
  for (const EncoderRow& row : kEncoders) {
    if (row.codec == codec && avcodec_find_encoder_by_name(row.encoder) != nullptr) return &row;
  }
  return nullptr;
}

// Whether `key` is an option of the codec context or of the encoder's private options.
bool KnowsOption(const AVCodec& encoder, const std::string& key) {
  const AVClass* contextClass = avcodec_get_class();
  if (av_opt_find(&contextClass, key.c_str(), nullptr, 0, AV_OPT_SEARCH_FAKE_OBJ) != nullptr) {
    return true;
  }
  const AVClass* privateClass = encoder.priv_class;
  return privateClass != nullptr &&
         av_opt_find(&privateClass, key.c_str(), nullptr, 0, AV_OPT_SEARCH_FAKE_OBJ) != nullptr;
}

std::string OptionValue(const Core::Property& option) {
  switch (option.GetType()) {
    case PropertyTypeBool:
      return option.GetBool() ? "1" : "0";
    case PropertyTypeInt64:
      return std::to_string(option.GetInt64());
    case PropertyTypeString:
      return option.GetString();
    default:
      return std::string();
  }
}

std::optional<long long> MetadataInteger(const IFormatCodec& description, const char* key) {
  const Core::Property& metadata = description.GetMetadata();
  const auto found = metadata.FindChild(key);
  if (found == metadata.GetChildren().end() || found->GetType() != PropertyTypeInt64) {
    return std::nullopt;
  }
  return found->GetInt64();
}

void RateControl(Settings& settings, const IFormatCodec& description, const EncoderRow* row,
                 bool video) {
  const std::string mode = description.ExistsBitrateMode() ? description.GetBitrateMode() : "";
  const Quality quality = row != nullptr ? row->quality : Quality::kNone;
  if (mode == IFormatCodec::TAG_BITRATE_MODE_VBR && description.ExistsQuality()) {
    const long long q = description.GetQuality();
    switch (quality) {
      case Quality::kCrf:
        settings.Set("crf", q);
        // libvpx-vp9 and libaom run constant quality only without a target bitrate.
        if (row->codec == AV_CODEC_ID_VP9 || row->codec == AV_CODEC_ID_AV1) settings.Set("b", 0);
        return;
      case Quality::kQp:
        settings.Set("qp", q);
        return;
      case Quality::kQscale:
        if (q < 0 || q > std::numeric_limits<int>::max() / FF_QP2LAMBDA) break;
        settings.AddFlag("qscale");
        settings.Set("global_quality", q * FF_QP2LAMBDA);
        return;
      case Quality::kOpusVbr:
        settings.Set("vbr", "on");
        break;
      case Quality::kNone:
        settings.Note("the encoder has no quality scale, so the quality is left out");
        break;
    }
  }
  if (!description.ExistsBitrate() || description.GetBitrate() <= 0) return;
  const long long bitrate = description.GetBitrate();
  settings.Set("b", bitrate);
  if (mode != "cbr") return;
  if (quality == Quality::kOpusVbr) {
    settings.Set("vbr", "off");
    return;
  }
  if (!video) return;
  settings.Set("minrate", bitrate);
  settings.Set("maxrate", bitrate);
  // The buffer is an int option: one second of the bitrate, as far as it holds.
  settings.Set("bufsize", std::min<long long>(bitrate, std::numeric_limits<int>::max()));
}

void VideoSettings(Settings& settings, EncoderSettings& out, const IFormatCodecVideo& video) {
  if (video.ExistsWidth() && video.ExistsHeight()) {
    settings.Set("video_size",
                 std::to_string(video.GetWidth()) + "x" + std::to_string(video.GetHeight()));
  }
  if (video.ExistsPixelAspectX() && video.ExistsPixelAspectY() && video.GetPixelAspectY() != 0) {
    settings.Set("sar", std::to_string(video.GetPixelAspectX()) + "/" +
                            std::to_string(video.GetPixelAspectY()));
  }
  if (video.ExistsFrameRateNum() && video.ExistsFrameRateDen()) {
    const unsigned int num = video.GetFrameRateNum();
    const unsigned int den = video.GetFrameRateDen();
    if (num > 0 && den > 0 && num <= std::numeric_limits<int>::max() &&
        den <= std::numeric_limits<int>::max()) {
      out.frameRateNum = static_cast<int>(num);
      out.frameRateDen = static_cast<int>(den);
      settings.Set("time_base", std::to_string(den) + "/" + std::to_string(num));
      settings.Argument("-r", std::to_string(num) + "/" + std::to_string(den));
    } else {
      settings.Note("the frame rate is out of libavcodec's range, so it is left out");
    }
  }
  if (video.ExistsPixelFormat()) {
    if (const char* name = av_get_pix_fmt_name(video.GetPixelFormat())) {
      settings.Set("pixel_format", name);
    } else {
      settings.Note("the pixel format is unknown to libavutil, so it is left out");
    }
  }
}

void AudioSettings(Settings& settings, EncoderSettings& out, const IFormatCodecAudio& audio) {
  if (audio.ExistsSampleRate() && audio.GetSampleRate() > 0) {
    settings.Set("ar", audio.GetSampleRate());
  }
  if (audio.ExistsChannelLayout() && audio.GetChannelLayout() != 0) {
    AVChannelLayout layout{};
    av_channel_layout_from_mask(&layout, audio.GetChannelLayout());
    char name[128] = {};
    av_channel_layout_describe(&layout, name, sizeof name);
    av_channel_layout_uninit(&layout);
    // A layout without a name is given by its mask, which libavutil reads back the same.
    const bool named = std::strchr(name, ' ') == nullptr;
    settings.Set(
        "ch_layout", named ? std::string(name) : "0x" + [&] {
          char hex[16];
          std::snprintf(hex, sizeof hex, "%x", static_cast<unsigned int>(audio.GetChannelLayout()));
          return std::string(hex);
        }());
  }
  if (audio.ExistsSampleFormat()) {
    if (const char* name = av_get_sample_fmt_name(audio.GetSampleFormat())) {
      out.sampleFormat = audio.GetSampleFormat();
      settings.Argument("-sample_fmt", name);
    } else {
      settings.Note("the sample format is unknown to libavutil, so it is left out");
    }
  }
}

}  // namespace

void DictionaryFree::operator()(AVDictionary* dictionary) const noexcept {
  av_dict_free(&dictionary);
}

EncoderSettings MakeEncoderSettings(const IFormatCodec& description) {
  EncoderSettings out;
  const int type = description.GetCodecType();
  const char stream = type == 0 ? 'v' : type == 1 ? 'a' : 's';
  Settings settings(out, stream);
  const AVCodecDescriptor* codec =
      description.ExistsCodecID() ? avcodec_descriptor_get_by_name(description.GetCodecID().c_str())
                                  : nullptr;
  if (codec == nullptr) {
    out.notes.push_back("the codec is unknown to libavcodec, so no encoder is chosen");
    return out;
  }
  const EncoderRow* row = FindEncoder(codec->id);
  const AVCodec* encoder =
      row != nullptr ? avcodec_find_encoder_by_name(row->encoder) : avcodec_find_encoder(codec->id);
  if (encoder == nullptr) {
    out.notes.push_back("the installed libavcodec has no encoder for " + std::string(codec->name));
    return out;
  }
  out.encoder = encoder->name;
  out.arguments = {std::string("-c:") + stream, out.encoder};
  if ((encoder->capabilities & AV_CODEC_CAP_EXPERIMENTAL) != 0) settings.Set("strict", "-2");

  RateControl(settings, description, row, type == 0);
  if (description.ExistsTwoPassEncoding() && description.GetTwoPassEncoding()) {
    settings.AddFlag("pass1");
  }
  if (description.ExistsThreadNumber()) settings.Set("threads", description.GetThreadNumber());
  if (description.ExistsGlobalHeader() && description.GetGlobalHeader()) {
    settings.AddFlag("global_header");
  }
  if (description.ExistsLossless() && description.GetLossless()) {
    if (out.encoder == "libx264") {
      settings.Set("qp", 0);
    } else if (out.encoder == "libx265") {
      settings.Set("x265-params", "lossless=1");
    } else if (out.encoder == "libvpx-vp9") {
      settings.Set("lossless", 1);
    } else if (!IsCompressedLossless(codec->name) && (codec->props & AV_CODEC_PROP_LOSSY) != 0) {
      out.notes.push_back("the encoder has no lossless mode, so lossless is left out");
    }
  }
  if (const auto profile = MetadataInteger(description, Keys::kProfile)) {
    if (TakesProfileNumber(out.encoder)) settings.Set("profile", *profile);
  }
  if (const auto* video = dynamic_cast<const IFormatCodecVideo*>(&description)) {
    VideoSettings(settings, out, *video);
  }
  if (const auto* audio = dynamic_cast<const IFormatCodecAudio*>(&description)) {
    AudioSettings(settings, out, *audio);
  }
  settings.Finish();
  if (description.ExistsOptionsEncode()) {
    for (const Core::Property& option : description.GetOptionsEncode().GetChildren()) {
      const std::string value = OptionValue(option);
      if (KnowsOption(*encoder, option.GetName())) {
        settings.Set(option.GetName(), value);
      } else {
        out.unconsumed.push_back(option.GetName() + "=" + value);
      }
    }
  }
  return out;
}

int OpenEncoder(const EncoderSettings& settings, AVCodecContext& context,
                std::vector<std::string>* left) {
  const AVCodec* encoder = avcodec_find_encoder_by_name(settings.encoder.c_str());
  if (encoder == nullptr || context.codec_id != encoder->id) return AVERROR_ENCODER_NOT_FOUND;
  if (settings.sampleFormat >= 0) {
    context.sample_fmt = static_cast<AVSampleFormat>(settings.sampleFormat);
  }
  if (settings.frameRateNum > 0 && settings.frameRateDen > 0) {
    context.framerate = AVRational{settings.frameRateNum, settings.frameRateDen};
  }
  AVDictionary* copy = nullptr;
  if (av_dict_copy(&copy, settings.options.get(), 0) < 0) {
    av_dict_free(&copy);
    throw std::bad_alloc();
  }
  Dictionary options(copy);
  // Private options first: where an encoder's option shares a context option's name
  // ("profile" of prores_ks and dnxhd), the encoder's is meant. Each call keeps what it did not
  // take.
  copy = options.release();
  int result = context.priv_data != nullptr ? av_opt_set_dict(context.priv_data, &copy) : 0;
  if (result >= 0) result = av_opt_set_dict(&context, &copy);
  options.reset(copy);
  if (result < 0) return result;
  if (context.time_base.num <= 0 || context.time_base.den <= 0) {
    if (context.framerate.num > 0 && context.framerate.den > 0) {
      context.time_base = av_inv_q(context.framerate);
    } else if (context.sample_rate > 0) {
      context.time_base = AVRational{1, context.sample_rate};
    }
  }
  copy = options.release();
  result = avcodec_open2(&context, encoder, &copy);
  options.reset(copy);
  if (left != nullptr) {
    const AVDictionaryEntry* entry = nullptr;
    while ((entry = av_dict_get(options.get(), "", entry, AV_DICT_IGNORE_SUFFIX)) != nullptr) {
      left->push_back(entry->key);
    }
  }
  return result;
}

}  // namespace FFmpeg
}  // namespace Tarvek
