// The mapping rules between FFmpeg's names and values and the descriptions.
#include <Tarvek/FFmpeg/Names.h>
#include <Tarvek/FFmpeg/Streams.h>

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavutil/avutil.h>
#include <libavutil/channel_layout.h>
#include <libavutil/pixdesc.h>
#include <libavutil/samplefmt.h>
}

#include <bitset>
#include <cmath>
#include <cstring>
#include <limits>

namespace Tarvek {
namespace FFmpeg {
namespace {

// The presets' rows for particular profiles of a codec.
struct ProfilePreset {
  AVCodecID codec;
  int profile;
  const char* preset;
};

constexpr ProfilePreset kProfilePresets[] = {
    {AV_CODEC_ID_PRORES, FF_PROFILE_PRORES_PROXY, "prores_proxy"},
    {AV_CODEC_ID_PRORES, FF_PROFILE_PRORES_LT, "prores_lt"},
    {AV_CODEC_ID_PRORES, FF_PROFILE_PRORES_STANDARD, "prores"},
    {AV_CODEC_ID_PRORES, FF_PROFILE_PRORES_HQ, "prores_hq"},
    {AV_CODEC_ID_PRORES, FF_PROFILE_PRORES_4444, "prores_4444"},
    {AV_CODEC_ID_PRORES, FF_PROFILE_PRORES_XQ, "prores_4444xq"},
    {AV_CODEC_ID_DNXHD, FF_PROFILE_DNXHD, "dnxhd"},
    {AV_CODEC_ID_DNXHD, FF_PROFILE_DNXHR_LB, "dnxhr_lb"},
    {AV_CODEC_ID_DNXHD, FF_PROFILE_DNXHR_SQ, "dnxhr_sq"},
    {AV_CODEC_ID_DNXHD, FF_PROFILE_DNXHR_HQ, "dnxhr_hq"},
    {AV_CODEC_ID_DNXHD, FF_PROFILE_DNXHR_HQX, "dnxhr_hqx"},
    {AV_CODEC_ID_DNXHD, FF_PROFILE_DNXHR_444, "dnxhr_444"},
    {AV_CODEC_ID_AAC, FF_PROFILE_AAC_HE, "aac_he"},
    {AV_CODEC_ID_AAC, FF_PROFILE_AAC_HE_V2, "aac_he_v2"},
};

// The integer metadata child `key` of `description`, if it has one.
std::optional<long long> MetadataInteger(const Conf::IFormatCodec& description, const char* key) {
  const Core::Property& metadata = description.GetMetadata();
  const auto found = metadata.FindChild(key);
  if (found == metadata.GetChildren().end() || found->GetType() != PropertyTypeInt64) {
    return std::nullopt;
  }
  return found->GetInt64();
}

// PCM codecs occupy libavcodec's first block of audio identifiers, up to the first ADPCM one.
bool IsPcm(AVCodecID id) { return id >= AV_CODEC_ID_FIRST_AUDIO && id < AV_CODEC_ID_ADPCM_IMA_QT; }

// The bits per sample of an audio description: the raw sample size when the metadata gives
// one, else the sample format's.
int SampleBits(const Conf::IFormatCodecAudio& audio) {
  if (const auto raw = MetadataInteger(audio, Keys::kBitsPerRawSample)) {
    if (*raw > 0 && *raw <= 64) return static_cast<int>(*raw);
  }
  if (!audio.ExistsSampleFormat()) return 0;
  return 8 * av_get_bytes_per_sample(audio.GetSampleFormat());
}

}  // namespace

std::string ChannelLayoutName(std::uint64_t mask) {
  if (mask == 0) return std::string();
  AVChannelLayout layout{};
  if (av_channel_layout_from_mask(&layout, mask) < 0) return std::string();
  char name[128] = {};
  av_channel_layout_describe(&layout, name, sizeof name);
  av_channel_layout_uninit(&layout);
  return name;
}

std::optional<Conf::ChannelLayout> ParseChannelLayout(const std::string& text) {
  if (text.empty() || text.find('\0') != std::string::npos) return std::nullopt;
  AVChannelLayout layout{};
  if (av_channel_layout_from_string(&layout, text.c_str()) < 0) return std::nullopt;
  std::optional<Conf::ChannelLayout> mask;
  if (layout.order == AV_CHANNEL_ORDER_NATIVE && layout.u.mask != 0 &&
      layout.u.mask <= std::numeric_limits<std::uint32_t>::max()) {
    mask = static_cast<Conf::ChannelLayout>(layout.u.mask);
  }
  av_channel_layout_uninit(&layout);
  return mask;
}

std::string FourccText(long long tag) {
  if (tag <= 0 || tag > std::numeric_limits<std::uint32_t>::max()) return std::string();
  char text[AV_FOURCC_MAX_STRING_SIZE] = {};
  return av_fourcc_make_string(text, static_cast<std::uint32_t>(tag));
}

std::string PresetCodecID(const Conf::IFormatCodec& description) {
  if (!description.ExistsCodecID()) return std::string();
  std::string id = description.GetCodecID();
  const auto profile = MetadataInteger(description, Keys::kProfile);
  const AVCodecDescriptor* codec = avcodec_descriptor_get_by_name(id.c_str());
  if (!profile || codec == nullptr) return id;
  for (const ProfilePreset& row : kProfilePresets) {
    if (row.codec == codec->id && row.profile == *profile) return row.preset;
  }
  return id;
}

bool IsCompressedLossless(const std::string& codecId) noexcept {
  const AVCodecDescriptor* codec = avcodec_descriptor_get_by_name(codecId.c_str());
  return codec != nullptr && (codec->props & AV_CODEC_PROP_LOSSLESS) != 0 &&
         (codec->props & AV_CODEC_PROP_LOSSY) == 0 && !IsPcm(codec->id);
}

long long UncompressedBitrate(const Conf::IFormatCodec& description) noexcept {
  double bitrate = 0.0;
  if (const auto* audio = dynamic_cast<const Conf::IFormatCodecAudio*>(&description)) {
    if (!audio->ExistsSampleRate() || !audio->ExistsChannelLayout()) return 0;
    const auto channels = std::bitset<32>(audio->GetChannelLayout()).count();
    bitrate = static_cast<double>(audio->GetSampleRate()) * static_cast<double>(channels) *
              SampleBits(*audio);
  } else if (const auto* video = dynamic_cast<const Conf::IFormatCodecVideo*>(&description)) {
    if (!video->ExistsWidth() || !video->ExistsHeight() || !video->ExistsFrameRateNum() ||
        !video->ExistsFrameRateDen() || !video->ExistsPixelFormat()) {
      return 0;
    }
    const AVPixFmtDescriptor* format = av_pix_fmt_desc_get(video->GetPixelFormat());
    if (format == nullptr) return 0;
    bitrate = static_cast<double>(video->GetWidth()) * video->GetHeight() * video->GetFrameRate() *
              av_get_bits_per_pixel(format);
  }
  if (!(bitrate > 0.0) || bitrate >= 9.0e18) return 0;
  return std::llround(bitrate);
}

PresetBitrates PresetRange(const Conf::IFormatCodec& description, int channels) {
  const std::string preset = PresetCodecID(description);
  PresetBitrates range;
  if (const auto* video = dynamic_cast<const Conf::IFormatCodecVideo*>(&description)) {
    const boost::intrusive_ptr<Conf::IFormatCodecVideo> copy = video->Clone();
    copy->SetCodecID(preset);
    copy->SetBitrateMode("cbr");
    range.minimum = Conf::GetMinVideoBitrate(copy);
    range.typical = Conf::GetDefaultVideoBitrate(copy);
    range.maximum = Conf::GetMaxVideoBitrate(copy);
    return range;
  }
  const auto* audio = dynamic_cast<const Conf::IFormatCodecAudio*>(&description);
  if (audio == nullptr) {
    Conf::GetDefaultVideoBitrate(&description);  // throws ConfException for this kind
    return range;
  }
  const boost::intrusive_ptr<Conf::IFormatCodecAudio> copy = audio->Clone();
  copy->SetCodecID(preset);
  if (!copy->ExistsChannelLayout() && channels > 0) {
    AVChannelLayout usual{};
    av_channel_layout_default(&usual, channels);
    if (usual.order == AV_CHANNEL_ORDER_NATIVE && usual.u.mask != 0 &&
        usual.u.mask <= std::numeric_limits<std::uint32_t>::max()) {
      copy->SetChannelLayout(static_cast<Conf::ChannelLayout>(usual.u.mask));
    }
  }
  range.minimum = Conf::GetMinAudioBitrate(copy);
  range.typical = Conf::GetDefaultAudioBitrate(copy);
  range.maximum = Conf::GetMaxAudioBitrate(copy);
  // The presets size a lossless stream by its sample format; 24-bit samples ride in 32-bit ones.
  const int formatBits =
      copy->ExistsSampleFormat() ? 8 * av_get_bytes_per_sample(copy->GetSampleFormat()) : 0;
  const int rawBits = SampleBits(*copy);
  if (IsCompressedLossless(preset) && formatBits > 0 && rawBits > 0 && rawBits < formatBits) {
    for (long long* bound : {&range.minimum, &range.typical, &range.maximum}) {
      *bound = static_cast<long long>(static_cast<double>(*bound) * rawBits / formatBits);
    }
  }
  return range;
}

const char* BitrateSourceName(BitrateSource source) noexcept {
  switch (source) {
    case BitrateSource::kStream:
      return "stream";
    case BitrateSource::kStatisticsTag:
      return "statistics_tag";
    case BitrateSource::kContainer:
      return "container";
    case BitrateSource::kPackets:
      return "packets";
    case BitrateSource::kNone:
      break;
  }
  return "";
}

BitrateSource GetBitrateSource(const Conf::IFormatCodec& description) noexcept {
  const Core::Property& metadata = description.GetMetadata();
  const auto found = metadata.FindChild(Keys::kBitrateSource);
  if (found == metadata.GetChildren().end() || found->GetType() != PropertyTypeString) {
    return BitrateSource::kNone;
  }
  for (const BitrateSource source : {BitrateSource::kStream, BitrateSource::kStatisticsTag,
                                     BitrateSource::kContainer, BitrateSource::kPackets}) {
    if (found->GetString() == BitrateSourceName(source)) return source;
  }
  return BitrateSource::kNone;
}

}  // namespace FFmpeg
}  // namespace Tarvek
