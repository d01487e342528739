// Codec parameters and libavformat streams to descriptions, and descriptions to codec
// parameters.
#include <Tarvek/FFmpeg/Names.h>
#include <Tarvek/FFmpeg/Streams.h>

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavformat/avformat.h>
#include <libavutil/channel_layout.h>
#include <libavutil/display.h>
#include <libavutil/imgutils.h>
#include <libavutil/pixdesc.h>
#include <libavutil/samplefmt.h>
}

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <memory>

#include "Options.h"

namespace Tarvek {
namespace FFmpeg {
namespace {

using Conf::IFormatCodec;
using Conf::IFormatCodecAudio;
using Conf::IFormatCodecSubtitle;
using Conf::IFormatCodecVideo;
using Detail::Channels;

// Extradata beyond this is no codec header: it is left out rather than copied.
constexpr int kMaxPrivateData = 16 << 20;

// A description under construction: the description, a copy of its metadata child that the
// values without setters go into (written back once, at the end), and the notes.
class Builder {
 public:
  explicit Builder(boost::intrusive_ptr<IFormatCodec> description)
      : description_(std::move(description)), metadata_(description_->GetMetadata()) {}

  IFormatCodec& Codec() { return *description_; }
  template <class T>
  T* As() {
    return dynamic_cast<T*>(description_.get());
  }
  void Note(std::string note) { notes_.push_back(std::move(note)); }
  void SetInteger(const char* key, long long value) { metadata_.SetChildT<long long>(key, value); }
  void SetText(const char* key, const std::string& value) {
    metadata_.SetChildT<std::string>(key, value);
  }
  bool Has(const char* key) const { return metadata_.ChildExists(key); }

  StreamDescription Finish() {
    description_->SetMetadata(metadata_);
    return StreamDescription{std::move(description_), std::move(notes_)};
  }

 private:
  boost::intrusive_ptr<IFormatCodec> description_;
  Core::Property metadata_;
  std::vector<std::string> notes_;
};

boost::intrusive_ptr<IFormatCodec> CreateFor(AVMediaType type) {
  switch (type) {
    case AVMEDIA_TYPE_VIDEO:
      return Conf::FormatCodecVideo::Create();
    case AVMEDIA_TYPE_AUDIO:
      return Conf::FormatCodecAudio::Create();
    case AVMEDIA_TYPE_SUBTITLE:
      return Conf::FormatCodecSubtitle::Create();
    default:
      return Conf::FormatCodec::Create();
  }
}

AVMediaType KindOf(const AVCodecParameters& parameters) {
  if (parameters.codec_type != AVMEDIA_TYPE_UNKNOWN) return parameters.codec_type;
  return avcodec_get_type(parameters.codec_id);
}

// A frame or display size libavutil accepts: positive, and its pixel count within its limits.
bool ValidSize(int width, int height) {
  return width > 0 && height > 0 &&
         av_image_check_size(static_cast<unsigned int>(width), static_cast<unsigned int>(height), 0,
                             nullptr) == 0;
}

std::string Size(int width, int height) {
  return std::to_string(width) + "x" + std::to_string(height);
}

// A libavutil name for an enumeration value: set when it has one, a note when it has none.
void SetNamed(Builder& builder, const char* key, int value, int unspecified, const char* name) {
  if (value == unspecified) return;
  if (name == nullptr) {
    builder.Note("the " + std::string(key) + " value " + std::to_string(value) +
                 " is unknown to libavutil, so it is left unset");
    return;
  }
  builder.SetText(key, name);
}

void DescribeCommon(Builder& builder, const AVCodecParameters& parameters) {
  IFormatCodec& codec = builder.Codec();
  const AVCodecDescriptor* descriptor = avcodec_descriptor_get(parameters.codec_id);
  if (descriptor == nullptr || parameters.codec_id == AV_CODEC_ID_NONE) {
    builder.Note("the codec (libavcodec identifier " + std::to_string(parameters.codec_id) +
                 ") is unknown, so the codec identifier is left unset");
  } else {
    codec.SetCodecID(descriptor->name);
    if (descriptor->long_name != nullptr) codec.SetCodecName(descriptor->long_name);
  }
  if (parameters.codec_tag != 0) codec.SetCodecTag(static_cast<long long>(parameters.codec_tag));
  if (parameters.bit_rate > 0) {
    codec.SetBitrate(parameters.bit_rate);
    builder.SetText(Keys::kBitrateSource, BitrateSourceName(BitrateSource::kStream));
  } else if (parameters.bit_rate < 0) {
    builder.Note("the bitrate " + std::to_string(parameters.bit_rate) +
                 " is negative, so it is left unset");
  }
  if (parameters.extradata != nullptr && parameters.extradata_size > 0) {
    if (parameters.extradata_size > kMaxPrivateData) {
      builder.Note("the codec's extradata of " + std::to_string(parameters.extradata_size) +
                   " bytes is larger than any codec header, so the private data is left unset");
    } else {
      codec.SetPrivateData(
          CreateBlob(parameters.extradata, static_cast<std::size_t>(parameters.extradata_size)));
    }
  } else if (parameters.extradata_size < 0) {
    builder.Note("the extradata size is negative, so the private data is left unset");
  }
  if (parameters.profile != FF_PROFILE_UNKNOWN)
    builder.SetInteger(Keys::kProfile, parameters.profile);
  if (parameters.level != FF_LEVEL_UNKNOWN) builder.SetInteger(Keys::kLevel, parameters.level);
  if (parameters.bits_per_raw_sample > 0) {
    builder.SetInteger(Keys::kBitsPerRawSample, parameters.bits_per_raw_sample);
  }
}

// `alone`: the codec parameters are all there is; a container may still give the pixel aspect.
void DescribeVideo(Builder& builder, const AVCodecParameters& parameters, bool alone) {
  auto* video = builder.As<Conf::FormatCodecVideo>();
  if (ValidSize(parameters.width, parameters.height)) {
    video->SetWidth(static_cast<unsigned int>(parameters.width));
    video->SetHeight(static_cast<unsigned int>(parameters.height));
  } else {
    builder.Note("the frame size " + Size(parameters.width, parameters.height) +
                 " is unknown or invalid, so it is left unset");
  }
  const AVRational aspect = parameters.sample_aspect_ratio;
  if (aspect.num > 0 && aspect.den > 0) {
    AVRational reduced{1, 1};
    av_reduce(&reduced.num, &reduced.den, aspect.num, aspect.den, std::numeric_limits<int>::max());
    video->SetPixelAspectX(static_cast<unsigned int>(reduced.num));
    video->SetPixelAspectY(static_cast<unsigned int>(reduced.den));
  } else if (alone) {
    builder.Note("the pixel aspect is unknown (0:1), so it is left unset");
  }
  if (av_pix_fmt_desc_get(static_cast<AVPixelFormat>(parameters.format)) != nullptr) {
    video->SetPixelFormat(static_cast<AVPixelFormat>(parameters.format));
  } else {
    builder.Note(parameters.format == AV_PIX_FMT_NONE
                     ? std::string("the pixel format is unknown, so it is left unset")
                     : "the pixel format " + std::to_string(parameters.format) +
                           " is unknown to libavutil, so it is left unset");
  }
  if (parameters.field_order != AV_FIELD_UNKNOWN) {
    SetNamed(builder, Keys::kFieldOrder, parameters.field_order, AV_FIELD_UNKNOWN,
             Detail::OptionConstantName(Keys::kFieldOrder, parameters.field_order));
  }
  SetNamed(builder, Keys::kColorPrimaries, parameters.color_primaries, AVCOL_PRI_UNSPECIFIED,
           av_color_primaries_name(parameters.color_primaries));
  SetNamed(builder, Keys::kColorTransfer, parameters.color_trc, AVCOL_TRC_UNSPECIFIED,
           av_color_transfer_name(parameters.color_trc));
  SetNamed(builder, Keys::kColorSpace, parameters.color_space, AVCOL_SPC_UNSPECIFIED,
           av_color_space_name(parameters.color_space));
  SetNamed(builder, Keys::kColorRange, parameters.color_range, AVCOL_RANGE_UNSPECIFIED,
           av_color_range_name(parameters.color_range));
  SetNamed(builder, Keys::kChromaLocation, parameters.chroma_location, AVCHROMA_LOC_UNSPECIFIED,
           av_chroma_location_name(parameters.chroma_location));
}

void DescribeAudio(Builder& builder, const AVCodecParameters& parameters) {
  auto* audio = builder.As<IFormatCodecAudio>();
  if (parameters.sample_rate > 0) {
    audio->SetSampleRate(parameters.sample_rate);
  } else {
    builder.Note("the sample rate " + std::to_string(parameters.sample_rate) +
                 " is unknown or invalid, so it is left unset");
  }
  const AVChannelLayout& layout = parameters.ch_layout;
  if (layout.nb_channels <= 0 || av_channel_layout_check(&layout) == 0) {
    builder.Note("the channel layout (" + Channels(layout.nb_channels) +
                 ") is unknown or invalid, so it is left unset");
  } else if (layout.order != AV_CHANNEL_ORDER_NATIVE) {
    builder.SetInteger(Keys::kChannels, layout.nb_channels);
    builder.Note("the file gives " + Channels(layout.nb_channels) + " in no speaker order (" +
                 (layout.order == AV_CHANNEL_ORDER_UNSPEC ? "unspecified" : "a custom one") +
                 "), so the channel layout is left unset");
  } else if (layout.u.mask > std::numeric_limits<std::uint32_t>::max()) {
    char hex[32];
    std::snprintf(hex, sizeof hex, "0x%llx", static_cast<unsigned long long>(layout.u.mask));
    builder.SetInteger(Keys::kChannels, layout.nb_channels);
    builder.Note(std::string("the speaker mask ") + hex +
                 " names speakers beyond the library's 32, so the channel layout is left unset");
  } else {
    audio->SetChannelLayout(static_cast<Conf::ChannelLayout>(layout.u.mask));
  }
  if (parameters.frame_size > 0) audio->SetFrameSize(parameters.frame_size);
  if (av_get_sample_fmt_name(static_cast<AVSampleFormat>(parameters.format)) != nullptr) {
    audio->SetSampleFormat(static_cast<AVSampleFormat>(parameters.format));
  } else {
    builder.Note(parameters.format == AV_SAMPLE_FMT_NONE
                     ? std::string("the sample format is unknown, so it is left unset")
                     : "the sample format " + std::to_string(parameters.format) +
                           " is unknown to libavutil, so it is left unset");
  }
}

void DescribeSubtitle(Builder& builder, const AVCodecParameters& parameters) {
  auto* subtitle = builder.As<IFormatCodecSubtitle>();
  // Styled subtitles keep their header (script info and styles) as the codec's extradata.
  const bool styled =
      parameters.codec_id == AV_CODEC_ID_ASS || parameters.codec_id == AV_CODEC_ID_SSA;
  if (styled && parameters.extradata != nullptr && parameters.extradata_size > 0 &&
      parameters.extradata_size <= kMaxPrivateData) {
    const char* text = reinterpret_cast<const char*>(parameters.extradata);
    const auto size = static_cast<std::size_t>(parameters.extradata_size);
    subtitle->SetSubtitleHeader(std::string(text, strnlen(text, size)));
  }
  if (parameters.codec_id == AV_CODEC_ID_DVB_SUBTITLE &&
      (parameters.width != 0 || parameters.height != 0)) {
    if (ValidSize(parameters.width, parameters.height)) {
      subtitle->SetDVBWidth(static_cast<unsigned int>(parameters.width));
      subtitle->SetDVBHeight(static_cast<unsigned int>(parameters.height));
    } else {
      builder.Note("the display size " + Size(parameters.width, parameters.height) +
                   " is invalid, so it is left unset");
    }
  }
}

Builder Describe(const AVCodecParameters& parameters, bool alone) {
  const AVMediaType kind = KindOf(parameters);
  Builder builder(CreateFor(kind));
  DescribeCommon(builder, parameters);
  if (kind == AVMEDIA_TYPE_VIDEO) DescribeVideo(builder, parameters, alone);
  if (kind == AVMEDIA_TYPE_AUDIO) DescribeAudio(builder, parameters);
  if (kind == AVMEDIA_TYPE_SUBTITLE) DescribeSubtitle(builder, parameters);
  return builder;
}

const char* Tag(const AVDictionary* metadata, const char* key, int flags = 0) {
  const AVDictionaryEntry* entry = av_dict_get(metadata, key, nullptr, flags);
  return entry != nullptr && entry->value != nullptr && entry->value[0] != '\0' ? entry->value
                                                                                : nullptr;
}

bool ValidRate(AVRational rate) { return rate.num > 0 && rate.den > 0; }

// The rotation of the stream's display matrix in whole degrees, when the matrix is a rotation.
void DescribeRotation(Builder& builder, const AVStream& stream) {
  std::size_t size = 0;
  const std::uint8_t* data = av_stream_get_side_data(&stream, AV_PKT_DATA_DISPLAYMATRIX, &size);
  if (data == nullptr) return;
  if (size < 9 * sizeof(std::int32_t)) {
    builder.Note("the display matrix is truncated, so the rotation is left unset");
    return;
  }
  std::int32_t matrix[9];
  std::memcpy(matrix, data, sizeof matrix);
  const double angle = av_display_rotation_get(matrix);
  std::int32_t rotation[9];
  bool isRotation = std::isfinite(angle);
  if (isRotation) {
    // libavutil reads angles counter-clockwise and sets them clockwise.
    av_display_rotation_set(rotation, -angle);
    // The linear part must be the pure rotation (16.16 fixed point, a little rounding allowed),
    // with no projection; the translation is free.
    for (const int i : {0, 1, 3, 4}) {
      isRotation = isRotation && std::llabs(static_cast<long long>(matrix[i]) - rotation[i]) < 64;
    }
    isRotation = isRotation && matrix[2] == 0 && matrix[5] == 0 && matrix[8] == (1 << 30);
  }
  if (!isRotation) {
    builder.Note("the display matrix is not a rotation, so the rotation is left unset");
    return;
  }
  builder.SetInteger(Keys::kRotation, std::llround(angle));
}

void DescribeDisposition(Builder& builder, int disposition) {
  std::string names;
  for (int bit = 0; bit < 31; ++bit) {
    if ((disposition & (1 << bit)) == 0) continue;
    const char* name = av_disposition_to_string(1 << bit);
    if (name == nullptr) continue;
    if (!names.empty()) names += '+';
    names += name;
  }
  if (!names.empty()) builder.SetText(Keys::kDisposition, names);
}

// The bitrate of the container's statistics tag (Matroska's "BPS", often with a language
// suffix), when it is a positive integer.
long long StatisticsBitrate(const AVStream& stream) {
  const char* text = Tag(stream.metadata, "BPS", AV_DICT_IGNORE_SUFFIX);
  if (text == nullptr) return 0;
  char* end = nullptr;
  const long long value = std::strtoll(text, &end, 10);
  return end != text && *end == '\0' && value > 0 && value < std::numeric_limits<long long>::max()
             ? value
             : 0;
}

void DescribeContainer(Builder& builder, const AVFormatContext& context, const AVStream& stream) {
  IFormatCodec& codec = builder.Codec();
  if (auto* video = builder.As<Conf::FormatCodecVideo>()) {
    const AVRational aspect = av_guess_sample_aspect_ratio(const_cast<AVFormatContext*>(&context),
                                                           const_cast<AVStream*>(&stream), nullptr);
    if (ValidRate(aspect)) {
      AVRational reduced{1, 1};
      av_reduce(&reduced.num, &reduced.den, aspect.num, aspect.den,
                std::numeric_limits<int>::max());
      video->SetPixelAspectX(static_cast<unsigned int>(reduced.num));
      video->SetPixelAspectY(static_cast<unsigned int>(reduced.den));
    } else {
      builder.Note("the pixel aspect is unknown (0:1), so it is left unset");
    }
    if (ValidRate(stream.avg_frame_rate)) {
      video->SetFrameRate(static_cast<unsigned int>(stream.avg_frame_rate.num),
                          static_cast<unsigned int>(stream.avg_frame_rate.den));
    } else if (ValidRate(stream.r_frame_rate)) {
      video->SetFrameRate(static_cast<unsigned int>(stream.r_frame_rate.num),
                          static_cast<unsigned int>(stream.r_frame_rate.den));
      builder.Note(
          "the average frame rate is unknown, so the frame rate is the stream's base "
          "rate (r_frame_rate)");
    } else {
      builder.Note("the frame rate is unknown, so it is left unset");
    }
    DescribeRotation(builder, stream);
    if (const char* language = Tag(stream.metadata, "language")) {
      builder.SetText(Keys::kLanguage, language);
    }
  }
  // An audio description keeps its language in the metadata child (IFormatCodecAudio).
  if (builder.As<IFormatCodecAudio>() != nullptr) {
    if (const char* language = Tag(stream.metadata, "language")) {
      builder.SetText(IFormatCodec::TAG_LANGUAGE.c_str(), language);
    }
  }
  if (auto* subtitle = builder.As<IFormatCodecSubtitle>()) {
    if (const char* language = Tag(stream.metadata, "language")) subtitle->SetLanguage(language);
    if (const char* title = Tag(stream.metadata, "title")) subtitle->SetTitle(title);
  } else if (const char* title = Tag(stream.metadata, "title")) {
    builder.SetText(Keys::kTitle, title);
  }
  DescribeDisposition(builder, stream.disposition);
  if (stream.duration > 0 && stream.duration != AV_NOPTS_VALUE && ValidRate(stream.time_base)) {
    builder.SetInteger(Keys::kDuration, av_rescale_q(stream.duration, stream.time_base,
                                                     AVRational{1, AV_TIME_BASE}));
  } else if (context.duration > 0 && context.duration != AV_NOPTS_VALUE) {
    builder.SetInteger(Keys::kDuration, context.duration);
  }
  const AVMediaType kind = KindOf(*stream.codecpar);
  if (codec.ExistsBitrate() || (kind != AVMEDIA_TYPE_VIDEO && kind != AVMEDIA_TYPE_AUDIO)) {
    return;
  }
  if (const long long tagged = StatisticsBitrate(stream)) {
    codec.SetBitrate(tagged);
    builder.SetText(Keys::kBitrateSource, BitrateSourceName(BitrateSource::kStatisticsTag));
  } else if (context.nb_streams == 1 && context.bit_rate > 0) {
    codec.SetBitrate(context.bit_rate);
    builder.SetText(Keys::kBitrateSource, BitrateSourceName(BitrateSource::kContainer));
  }
}

// The integer metadata child `key`, when it is an integer within `int`.
std::optional<int> MetadataInt(const Core::Property& metadata, const char* key) {
  const auto found = metadata.FindChild(key);
  if (found == metadata.GetChildren().end() || found->GetType() != PropertyTypeInt64) {
    return std::nullopt;
  }
  const long long value = found->GetInt64();
  if (value < std::numeric_limits<int>::min() || value > std::numeric_limits<int>::max()) {
    return std::nullopt;
  }
  return static_cast<int>(value);
}

const std::string* MetadataText(const Core::Property& metadata, const char* key) {
  const auto found = metadata.FindChild(key);
  if (found == metadata.GetChildren().end() || found->GetType() != PropertyTypeString) {
    return nullptr;
  }
  return &found->GetString();
}

// An enumeration value from its libavutil name, or a note.
template <class Enum>
void ReadNamed(const Core::Property& metadata, const char* key, int (*fromName)(const char*),
               Enum& field, std::vector<std::string>& notes) {
  const std::string* name = MetadataText(metadata, key);
  if (name == nullptr) return;
  const int value = fromName(name->c_str());
  if (value < 0) {
    notes.push_back("the " + std::string(key) + " \"" + *name +
                    "\" is unknown to libavutil, so it is left out");
    return;
  }
  field = static_cast<Enum>(value);
}

bool FitsInt(long long value) { return value > 0 && value <= std::numeric_limits<int>::max(); }

}  // namespace

StreamDescription DescribeCodecParameters(const AVCodecParameters& parameters) {
  return Describe(parameters, true).Finish();
}

StreamDescription DescribeStream(const AVFormatContext& context, unsigned int index) {
  if (index >= context.nb_streams || context.streams[index] == nullptr ||
      context.streams[index]->codecpar == nullptr) {
    Builder builder(Conf::FormatCodec::Create());
    builder.Note("the file has no stream " + std::to_string(index));
    return builder.Finish();
  }
  const AVStream& stream = *context.streams[index];
  Builder builder = Describe(*stream.codecpar, false);
  DescribeContainer(builder, context, stream);
  return builder.Finish();
}

std::vector<long long> MeasureBitrates(AVFormatContext& context,
                                       const std::function<void(double)>& progress) {
  struct Span {
    long long bytes = 0;
    std::int64_t first = AV_NOPTS_VALUE;
    std::int64_t last = AV_NOPTS_VALUE;
  };
  std::vector<Span> spans(context.nb_streams);
  AVPacket* packet = av_packet_alloc();
  if (packet == nullptr) throw std::bad_alloc();
  const std::unique_ptr<AVPacket*, void (*)(AVPacket**)> owned(&packet, av_packet_free);
  const std::int64_t size = context.pb != nullptr ? avio_size(context.pb) : -1;
  long long count = 0;
  while (av_read_frame(&context, packet) >= 0) {
    const auto index = static_cast<std::size_t>(packet->stream_index);
    if (index < spans.size()) {
      Span& span = spans[index];
      span.bytes += packet->size;
      const std::int64_t start = packet->pts != AV_NOPTS_VALUE ? packet->pts : packet->dts;
      if (start != AV_NOPTS_VALUE) {
        const std::int64_t end = start + std::max<std::int64_t>(packet->duration, 0);
        if (span.first == AV_NOPTS_VALUE || start < span.first) span.first = start;
        if (span.last == AV_NOPTS_VALUE || end > span.last) span.last = end;
      }
    }
    av_packet_unref(packet);
    if (progress && size > 0 && ++count % 256 == 0) {
      progress(static_cast<double>(avio_tell(context.pb)) / static_cast<double>(size));
    }
  }
  if (progress) progress(1.0);
  std::vector<long long> bitrates(spans.size(), 0);
  for (std::size_t i = 0; i < spans.size(); ++i) {
    const Span& span = spans[i];
    const AVRational base = context.streams[i]->time_base;
    if (span.first == AV_NOPTS_VALUE || span.last <= span.first || !ValidRate(base)) continue;
    const double seconds = static_cast<double>(span.last - span.first) * av_q2d(base);
    const double bitrate = static_cast<double>(span.bytes) * 8.0 / seconds;
    if (seconds > 0.0 && bitrate >= 1.0 && bitrate < 9.0e18) bitrates[i] = std::llround(bitrate);
  }
  return bitrates;
}

bool SetMeasuredBitrate(IFormatCodec& description, long long bitrate) {
  if (description.ExistsBitrate() || bitrate <= 0) return false;
  description.SetBitrate(bitrate);
  Core::Property metadata = description.GetMetadata();
  metadata.SetChildT<std::string>(Keys::kBitrateSource, BitrateSourceName(BitrateSource::kPackets));
  description.SetMetadata(metadata);
  return true;
}

std::vector<std::string> ToCodecParameters(const IFormatCodec& description,
                                           AVCodecParameters& parameters) {
  std::vector<std::string> notes;
  const Core::Property& metadata = description.GetMetadata();
  switch (description.GetCodecType()) {
    case 0:
      parameters.codec_type = AVMEDIA_TYPE_VIDEO;
      break;
    case 1:
      parameters.codec_type = AVMEDIA_TYPE_AUDIO;
      break;
    case 3:
      parameters.codec_type = AVMEDIA_TYPE_SUBTITLE;
      break;
    default:
      break;
  }
  if (description.ExistsCodecID()) {
    const AVCodecDescriptor* codec =
        avcodec_descriptor_get_by_name(description.GetCodecID().c_str());
    if (codec == nullptr) {
      notes.push_back("the codec \"" + description.GetCodecID() +
                      "\" is unknown to libavcodec, so it is left out");
    } else {
      parameters.codec_id = codec->id;
      if (description.GetCodecType() < 0) parameters.codec_type = codec->type;
    }
  }
  if (description.ExistsCodecTag()) {
    const long long tag = description.GetCodecTag();
    if (tag >= 0 && tag <= std::numeric_limits<std::uint32_t>::max()) {
      parameters.codec_tag = static_cast<std::uint32_t>(tag);
    } else {
      notes.push_back("the codec tag " + std::to_string(tag) +
                      " needs more than 32 bits, so it is left out");
    }
  }
  if (description.ExistsBitrate()) parameters.bit_rate = description.GetBitrate();
  // Reading the private data changes nothing; the accessor is not const on the interface.
  if (const auto data = const_cast<IFormatCodec&>(description).GetPrivateData()) {
    if (data->GetSize() > static_cast<std::size_t>(kMaxPrivateData)) {
      notes.push_back("the private data is larger than any codec header, so it is left out");
    } else {
      auto* copy =
          static_cast<std::uint8_t*>(av_mallocz(data->GetSize() + AV_INPUT_BUFFER_PADDING_SIZE));
      if (copy == nullptr) throw std::bad_alloc();
      if (data->GetSize() > 0) std::memcpy(copy, data->GetData(), data->GetSize());
      av_freep(&parameters.extradata);
      parameters.extradata = copy;
      parameters.extradata_size = static_cast<int>(data->GetSize());
    }
  }
  if (const auto profile = MetadataInt(metadata, Keys::kProfile)) parameters.profile = *profile;
  if (const auto level = MetadataInt(metadata, Keys::kLevel)) parameters.level = *level;
  if (const auto bits = MetadataInt(metadata, Keys::kBitsPerRawSample)) {
    parameters.bits_per_raw_sample = *bits;
  }
  if (const auto* video = dynamic_cast<const IFormatCodecVideo*>(&description)) {
    if (video->ExistsWidth() && video->ExistsHeight()) {
      const unsigned int width = video->GetWidth();
      const unsigned int height = video->GetHeight();
      if (FitsInt(width) && FitsInt(height)) {
        parameters.width = static_cast<int>(width);
        parameters.height = static_cast<int>(height);
      } else {
        notes.push_back("the frame size is too large for codec parameters, so it is left out");
      }
    }
    if (video->ExistsPixelAspectX() && video->ExistsPixelAspectY()) {
      av_reduce(&parameters.sample_aspect_ratio.num, &parameters.sample_aspect_ratio.den,
                video->GetPixelAspectX(), video->GetPixelAspectY(),
                std::numeric_limits<int>::max());
    }
    if (video->ExistsPixelFormat()) parameters.format = video->GetPixelFormat();
    if (const std::string* order = MetadataText(metadata, Keys::kFieldOrder)) {
      if (const auto value = Detail::OptionConstantValue(Keys::kFieldOrder, *order)) {
        parameters.field_order = static_cast<AVFieldOrder>(*value);
      } else {
        notes.push_back("the field order \"" + *order + "\" is unknown, so it is left out");
      }
    }
    ReadNamed(metadata, Keys::kColorPrimaries, av_color_primaries_from_name,
              parameters.color_primaries, notes);
    ReadNamed(metadata, Keys::kColorTransfer, av_color_transfer_from_name, parameters.color_trc,
              notes);
    ReadNamed(metadata, Keys::kColorSpace, av_color_space_from_name, parameters.color_space, notes);
    ReadNamed(metadata, Keys::kColorRange, av_color_range_from_name, parameters.color_range, notes);
    ReadNamed(metadata, Keys::kChromaLocation, av_chroma_location_from_name,
              parameters.chroma_location, notes);
  }
  if (const auto* audio = dynamic_cast<const IFormatCodecAudio*>(&description)) {
    if (audio->ExistsSampleRate()) parameters.sample_rate = audio->GetSampleRate();
    if (audio->ExistsChannelLayout()) {
      av_channel_layout_uninit(&parameters.ch_layout);
      av_channel_layout_from_mask(&parameters.ch_layout, audio->GetChannelLayout());
    } else if (const auto channels = MetadataInt(metadata, Keys::kChannels);
               channels && *channels > 0) {
      av_channel_layout_uninit(&parameters.ch_layout);
      parameters.ch_layout.order = AV_CHANNEL_ORDER_UNSPEC;
      parameters.ch_layout.nb_channels = *channels;
    }
    if (audio->ExistsFrameSize()) parameters.frame_size = audio->GetFrameSize();
    if (audio->ExistsSampleFormat()) parameters.format = audio->GetSampleFormat();
  }
  if (const auto* subtitle = dynamic_cast<const IFormatCodecSubtitle*>(&description)) {
    if (subtitle->ExistsDVBWidth() && subtitle->ExistsDVBHeight()) {
      const unsigned int width = subtitle->GetDVBWidth();
      const unsigned int height = subtitle->GetDVBHeight();
      if (FitsInt(width) && FitsInt(height)) {
        parameters.width = static_cast<int>(width);
        parameters.height = static_cast<int>(height);
      }
    }
  }
  return notes;
}

}  // namespace FFmpeg
}  // namespace Tarvek
