// libFuzzer target over the FFmpeg bridge: the input fills every field of a stream's codec
// parameters, the stream's own fields, a display matrix and a statistics tag, and the bridge runs
// both directions. Nothing may crash or leak; a video, audio or subtitle description must come
// back unchanged from codec parameters made from it; encoder settings are made for it.
#include <Tarvek/FFmpeg/Encoder.h>
#include <Tarvek/FFmpeg/Names.h>
#include <Tarvek/FFmpeg/Streams.h>

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavformat/avformat.h>
}

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>

namespace {

// Reads the input front to back; past its end every value is zero.
class Input {
 public:
  Input(const std::uint8_t* data, std::size_t size) : data_(data), size_(size) {}
  template <class T>
  T Take() {
    T value{};
    const std::size_t n = std::min(sizeof value, size_);
    std::memcpy(&value, data_, n);
    data_ += n;
    size_ -= n;
    return value;
  }
  std::size_t Left() const { return size_; }

 private:
  const std::uint8_t* data_;
  std::size_t size_;
};

struct FormatFree {
  void operator()(AVFormatContext* c) const { avformat_free_context(c); }
};
struct ParametersFree {
  void operator()(AVCodecParameters* p) const { avcodec_parameters_free(&p); }
};

// A byte read as a value from `first` to `last`: every named value of the enumeration and one past
// them (a value a newer libavutil may name), never one the enumeration cannot hold.
template <class Enum>
Enum TakeEnum(Input& in, Enum first, Enum last) {
  const int span = static_cast<int>(last) - static_cast<int>(first) + 1;
  return static_cast<Enum>(static_cast<int>(first) + in.Take<std::uint8_t>() % span);
}

void Fill(AVCodecParameters& p, Input& in) {
  p.codec_type = TakeEnum(in, AVMEDIA_TYPE_UNKNOWN, AVMEDIA_TYPE_NB);
  p.codec_id = static_cast<AVCodecID>(in.Take<std::uint32_t>() % 0x22000);
  p.codec_tag = in.Take<std::uint32_t>();
  p.format = in.Take<std::int32_t>();
  p.bit_rate = in.Take<std::int64_t>();
  p.bits_per_coded_sample = in.Take<std::int32_t>();
  p.bits_per_raw_sample = in.Take<std::int32_t>();
  p.profile = in.Take<std::int32_t>();
  p.level = in.Take<std::int32_t>();
  p.width = in.Take<std::int32_t>();
  p.height = in.Take<std::int32_t>();
  p.sample_aspect_ratio = {in.Take<std::int32_t>(), in.Take<std::int32_t>()};
  p.field_order = TakeEnum(in, AV_FIELD_UNKNOWN, static_cast<AVFieldOrder>(AV_FIELD_BT + 1));
  p.color_range = TakeEnum(in, AVCOL_RANGE_UNSPECIFIED, AVCOL_RANGE_NB);
  p.color_primaries = TakeEnum(in, AVCOL_PRI_RESERVED0, AVCOL_PRI_NB);
  p.color_trc = TakeEnum(in, AVCOL_TRC_RESERVED0, AVCOL_TRC_NB);
  p.color_space = TakeEnum(in, AVCOL_SPC_RGB, AVCOL_SPC_NB);
  p.chroma_location = TakeEnum(in, AVCHROMA_LOC_UNSPECIFIED, AVCHROMA_LOC_NB);
  p.video_delay = in.Take<std::int32_t>();
  p.sample_rate = in.Take<std::int32_t>();
  p.block_align = in.Take<std::int32_t>();
  p.frame_size = in.Take<std::int32_t>();
  p.initial_padding = in.Take<std::int32_t>();
  p.trailing_padding = in.Take<std::int32_t>();
  p.seek_preroll = in.Take<std::int32_t>();
  // The channel layout's order and count as given; a custom order would need a map, which the
  // fields cannot point at safely, so it is read as ambisonic.
  const auto order = in.Take<std::uint8_t>() % 4;
  p.ch_layout.order = order == AV_CHANNEL_ORDER_CUSTOM ? AV_CHANNEL_ORDER_AMBISONIC
                                                       : static_cast<AVChannelOrder>(order);
  p.ch_layout.nb_channels = in.Take<std::int32_t>();
  p.ch_layout.u.mask = in.Take<std::uint64_t>();
  const std::size_t extradata = std::min<std::size_t>(in.Take<std::uint16_t>(), in.Left());
  if (extradata > 0) {
    p.extradata = static_cast<std::uint8_t*>(av_mallocz(extradata + AV_INPUT_BUFFER_PADDING_SIZE));
    for (std::size_t i = 0; i < extradata; ++i) p.extradata[i] = in.Take<std::uint8_t>();
    p.extradata_size = static_cast<int>(extradata);
  }
}

[[noreturn]] void Broken(const char* what) {
  std::fprintf(stderr, "FFmpegFuzzer: %s\n", what);
  std::abort();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  av_log_set_level(AV_LOG_QUIET);
  Input in(data, size);
  std::unique_ptr<AVFormatContext, FormatFree> context(avformat_alloc_context());
  AVStream* stream = avformat_new_stream(context.get(), nullptr);
  if (stream == nullptr) return 0;
  const std::uint8_t sideData = in.Take<std::uint8_t>();
  stream->sample_aspect_ratio = {in.Take<std::int32_t>(), in.Take<std::int32_t>()};
  stream->avg_frame_rate = {in.Take<std::int32_t>(), in.Take<std::int32_t>()};
  stream->r_frame_rate = {in.Take<std::int32_t>(), in.Take<std::int32_t>()};
  stream->time_base = {in.Take<std::int32_t>(), in.Take<std::int32_t>()};
  stream->duration = in.Take<std::int64_t>();
  stream->disposition = in.Take<std::int32_t>();
  context->duration = in.Take<std::int64_t>();
  context->bit_rate = in.Take<std::int64_t>();
  if ((sideData & 1) != 0) {
    // A display matrix of any length up to nine entries, with any values.
    const std::size_t bytes = (sideData >> 1) % 37;
    if (auto* matrix = av_stream_new_side_data(stream, AV_PKT_DATA_DISPLAYMATRIX, bytes)) {
      for (std::size_t i = 0; i < bytes; ++i) matrix[i] = in.Take<std::uint8_t>();
    }
  }
  if ((sideData & 0x80) != 0) {
    const std::string bps = std::to_string(in.Take<std::int64_t>());
    av_dict_set(&stream->metadata, "BPS-eng", bps.c_str(), 0);
  }
  Fill(*stream->codecpar, in);

  const Tarvek::FFmpeg::StreamDescription fromStream = Tarvek::FFmpeg::DescribeStream(*context, 0);
  const Tarvek::FFmpeg::StreamDescription fromParameters =
      Tarvek::FFmpeg::DescribeCodecParameters(*stream->codecpar);
  if (!fromStream.description || !fromParameters.description) Broken("no description");
  Tarvek::FFmpeg::MakeEncoderSettings(*fromStream.description);
  Tarvek::FFmpeg::PresetCodecID(*fromStream.description);
  Tarvek::FFmpeg::UncompressedBitrate(*fromStream.description);

  std::unique_ptr<AVCodecParameters, ParametersFree> back(avcodec_parameters_alloc());
  Tarvek::FFmpeg::ToCodecParameters(*fromParameters.description, *back);
  const Tarvek::FFmpeg::StreamDescription again = Tarvek::FFmpeg::DescribeCodecParameters(*back);
  if (fromParameters.description->GetCodecType() >= 0 &&
      !fromParameters.description->Compare(again.description)) {
    fromParameters.description->PrintContent();
    again.description->PrintContent();
    Broken("the description changed on its way through codec parameters");
  }
  return 0;
}
