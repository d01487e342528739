// The FFmpeg bridge against the real libraries: every encoder opens with the settings made from
// a description and reports them back, and its codec parameters survive the round trip through
// a description; layout names agree with libavutil's; bad codec parameters give notes.
#include <gtest/gtest.h>

#include <Tarvek/FFmpeg/Encoder.h>
#include <Tarvek/FFmpeg/Names.h>
#include <Tarvek/FFmpeg/Streams.h>

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavformat/avformat.h>
#include <libavutil/channel_layout.h>
#include <libavutil/display.h>
#include <libavutil/opt.h>
}

#include <climits>
#include <memory>
#include <string>
#include <vector>

// libx265 keeps one block of its own for the life of the process (1168 bytes, allocated when the
// first encoder opens and never freed); the leak checker is told so, and nothing else is hidden.
extern "C" __attribute__((visibility("default"))) const char* __lsan_default_suppressions() {
  return "leak:libx265.so\n";
}

namespace {

using namespace Tarvek;
using Conf::ChannelLayout;

struct ParametersFree {
  void operator()(AVCodecParameters* p) const { avcodec_parameters_free(&p); }
};
using Parameters = std::unique_ptr<AVCodecParameters, ParametersFree>;
struct ContextFree {
  void operator()(AVCodecContext* c) const { avcodec_free_context(&c); }
};

// One encoder's test: a description and what the opened encoder must report.
struct EncoderCase {
  const char* codecId;
  const char* mode;  // "cbr", "vbr" or ""
  long long bitrateOrQuality;
  int width;  // video when non-zero
  int height;
  AVPixelFormat pixelFormat;
  int sampleRate;  // audio when non-zero
  ChannelLayout layout;
  AVSampleFormat sampleFormat;
  int profile;  // FF_PROFILE_UNKNOWN for none
};

constexpr AVSampleFormat kNoAudio = AV_SAMPLE_FMT_NONE;
constexpr AVPixelFormat kNoVideo = AV_PIX_FMT_NONE;
const ChannelLayout kStereo = Conf::CH_LAYOUT_STEREO;
const auto kSide51 = static_cast<ChannelLayout>(AV_CH_LAYOUT_5POINT1);

const EncoderCase kEncoderCases[] = {
    {"h264", "cbr", 2000000, 320, 240, AV_PIX_FMT_YUV420P, 0, kStereo, kNoAudio, -99},
    {"hevc", "vbr", 28, 320, 240, AV_PIX_FMT_YUV420P, 0, kStereo, kNoAudio, -99},
    {"vp9", "vbr", 31, 320, 240, AV_PIX_FMT_YUV420P, 0, kStereo, kNoAudio, -99},
    {"vp8", "cbr", 1000000, 320, 240, AV_PIX_FMT_YUV420P, 0, kStereo, kNoAudio, -99},
    {"av1", "vbr", 35, 64, 64, AV_PIX_FMT_YUV420P, 0, kStereo, kNoAudio, -99},
    {"mpeg1video", "cbr", 1500000, 352, 240, AV_PIX_FMT_YUV420P, 0, kStereo, kNoAudio, -99},
    {"mpeg2video", "vbr", 4, 720, 576, AV_PIX_FMT_YUV420P, 0, kStereo, kNoAudio, -99},
    {"mpeg4", "cbr", 1000000, 352, 288, AV_PIX_FMT_YUV420P, 0, kStereo, kNoAudio, -99},
    {"mjpeg", "vbr", 3, 320, 240, AV_PIX_FMT_YUVJ420P, 0, kStereo, kNoAudio, -99},
    {"theora", "vbr", 6, 320, 240, AV_PIX_FMT_YUV420P, 0, kStereo, kNoAudio, -99},
    {"prores", "", 0, 320, 240, AV_PIX_FMT_YUV422P10LE, 0, kStereo, kNoAudio, FF_PROFILE_PRORES_HQ},
    {"dnxhd", "", 0, 1280, 720, AV_PIX_FMT_YUV422P, 0, kStereo, kNoAudio, FF_PROFILE_DNXHR_SQ},
    {"ffv1", "", 0, 320, 240, AV_PIX_FMT_YUV420P, 0, kStereo, kNoAudio, -99},
    {"png", "", 0, 320, 240, AV_PIX_FMT_RGB24, 0, kStereo, kNoAudio, -99},
    {"aac", "cbr", 128000, 0, 0, kNoVideo, 48000, kStereo, AV_SAMPLE_FMT_FLTP, -99},
    {"opus", "vbr", 0, 0, 0, kNoVideo, 48000, kStereo, AV_SAMPLE_FMT_S16, -99},
    {"flac", "", 0, 0, 0, kNoVideo, 44100, kSide51, AV_SAMPLE_FMT_S16, -99},
    {"alac", "", 0, 0, 0, kNoVideo, 44100, kStereo, AV_SAMPLE_FMT_S16P, -99},
    {"ac3", "cbr", 448000, 0, 0, kNoVideo, 48000, kSide51, AV_SAMPLE_FMT_FLTP, -99},
    {"eac3", "cbr", 192000, 0, 0, kNoVideo, 48000, kSide51, AV_SAMPLE_FMT_FLTP, -99},
    {"mp3", "vbr", 4, 0, 0, kNoVideo, 44100, kStereo, AV_SAMPLE_FMT_S16P, -99},
    {"mp2", "cbr", 224000, 0, 0, kNoVideo, 48000, kStereo, AV_SAMPLE_FMT_S16, -99},
    {"vorbis", "vbr", 3, 0, 0, kNoVideo, 44100, kStereo, AV_SAMPLE_FMT_FLTP, -99},
    {"dts", "cbr", 768000, 0, 0, kNoVideo, 48000, kSide51, AV_SAMPLE_FMT_S32, -99},
    {"truehd", "", 0, 0, 0, kNoVideo, 48000, kStereo, AV_SAMPLE_FMT_S16, -99},
    {"pcm_s24le", "", 0, 0, 0, kNoVideo, 96000, kStereo, AV_SAMPLE_FMT_S32, -99},
};

boost::intrusive_ptr<Conf::IFormatCodec> Describe(const EncoderCase& c) {
  boost::intrusive_ptr<Conf::IFormatCodec> description;
  if (c.width != 0) {
    auto video = Conf::FormatCodecVideo::Create();
    video->InitByPixelAspect(static_cast<unsigned>(c.width), static_cast<unsigned>(c.height), 1, 1);
    video->SetFrameRate(25, 1);
    video->SetPixelFormat(c.pixelFormat);
    description = video;
  } else {
    auto audio = Conf::FormatCodecAudio::Create();
    audio->SetSampleRate(c.sampleRate);
    audio->SetChannelLayout(c.layout);
    audio->SetSampleFormat(c.sampleFormat);
    description = audio;
  }
  description->SetCodecID(c.codecId);
  description->SetThreadNumber(1);
  description->SetGlobalHeader(true);
  if (c.mode[0] != '\0') description->SetBitrateMode(c.mode);
  if (std::string(c.mode) == "vbr") {
    description->SetQuality(c.bitrateOrQuality);
  } else if (c.bitrateOrQuality > 0) {
    description->SetBitrate(c.bitrateOrQuality);
  }
  if (c.profile != FF_PROFILE_UNKNOWN) {
    Core::Property metadata = description->GetMetadata();
    metadata.SetChildT<long long>(FFmpeg::Keys::kProfile, c.profile);
    description->SetMetadata(metadata);
  }
  Core::Property options("options");
  options.SetChildT<std::string>("threads", "1");
  options.SetChildT<std::string>("no_such_option", "7");
  description->SetOptionsEncode(options);
  return description;
}

class EncoderTest : public ::testing::TestWithParam<EncoderCase> {};

// The oracle is the encoder: it opens, uses every option, and reports the settings back; its
// codec parameters then survive description and back unchanged.
TEST_P(EncoderTest, OpensWithTheSettingsAndRoundTrips) {
  const EncoderCase& c = GetParam();
  const auto description = Describe(c);
  const FFmpeg::EncoderSettings settings = FFmpeg::MakeEncoderSettings(*description);
  if (settings.encoder.empty()) GTEST_SKIP() << "no encoder for " << c.codecId << " compiled in";
  EXPECT_EQ(settings.unconsumed, std::vector<std::string>{"no_such_option=7"});
  EXPECT_EQ(settings.arguments.at(1), settings.encoder);
  const AVCodec* encoder = avcodec_find_encoder_by_name(settings.encoder.c_str());
  std::unique_ptr<AVCodecContext, ContextFree> context(avcodec_alloc_context3(encoder));
  std::vector<std::string> left;
  ASSERT_EQ(FFmpeg::OpenEncoder(settings, *context, &left), 0) << settings.encoder;
  EXPECT_TRUE(left.empty()) << settings.encoder << " left " << left.front();
  EXPECT_EQ(context->thread_count, 1);
  EXPECT_NE(context->flags & AV_CODEC_FLAG_GLOBAL_HEADER, 0) << settings.encoder;
  const std::string mode = c.mode;
  if (mode == "cbr") {
    EXPECT_EQ(context->bit_rate, c.bitrateOrQuality) << settings.encoder;
    if (c.width != 0) {
      EXPECT_EQ(context->rc_max_rate, c.bitrateOrQuality) << settings.encoder;
    }
  }
  if (mode == "vbr" && (context->flags & AV_CODEC_FLAG_QSCALE) != 0) {
    EXPECT_EQ(context->global_quality, c.bitrateOrQuality * FF_QP2LAMBDA) << settings.encoder;
  } else if (mode == "vbr" && c.width != 0) {
    double crf = -1;
    const char* name = settings.encoder == "librav1e" ? "qp" : "crf";
    ASSERT_GE(av_opt_get_double(context->priv_data, name, 0, &crf), 0) << settings.encoder;
    EXPECT_EQ(crf, static_cast<double>(c.bitrateOrQuality)) << settings.encoder;
  }
  if (c.profile != FF_PROFILE_UNKNOWN) {
    int64_t profile = -1;
    ASSERT_GE(av_opt_get_int(context->priv_data, "profile", 0, &profile), 0);
    EXPECT_EQ(profile, c.profile);
  }
  Parameters parameters(avcodec_parameters_alloc());
  ASSERT_GE(avcodec_parameters_from_context(parameters.get(), context.get()), 0);
  if (c.width != 0) {
    EXPECT_EQ(parameters->width, c.width);
    EXPECT_EQ(parameters->format, c.pixelFormat);
  } else {
    EXPECT_EQ(parameters->sample_rate, c.sampleRate);
    EXPECT_EQ(parameters->ch_layout.u.mask, static_cast<uint64_t>(c.layout));
    EXPECT_EQ(parameters->format, c.sampleFormat);
  }
  const FFmpeg::StreamDescription described = FFmpeg::DescribeCodecParameters(*parameters);
  Parameters back(avcodec_parameters_alloc());
  EXPECT_TRUE(FFmpeg::ToCodecParameters(*described.description, *back).empty());
  for (const auto& [name, a, b] : std::vector<std::tuple<const char*, int64_t, int64_t>>{
           {"codec_type", parameters->codec_type, back->codec_type},
           {"codec_id", parameters->codec_id, back->codec_id},
           {"codec_tag", parameters->codec_tag, back->codec_tag},
           {"bit_rate", parameters->bit_rate, back->bit_rate},
           {"format", parameters->format, back->format},
           {"width", parameters->width, back->width},
           {"height", parameters->height, back->height},
           {"sar", av_cmp_q(parameters->sample_aspect_ratio, back->sample_aspect_ratio), 0},
           {"profile", parameters->profile, back->profile},
           {"level", parameters->level, back->level},
           {"bits_per_raw_sample", parameters->bits_per_raw_sample, back->bits_per_raw_sample},
           {"field_order", parameters->field_order, back->field_order},
           {"color_range", parameters->color_range, back->color_range},
           {"color_space", parameters->color_space, back->color_space},
           {"chroma_location", parameters->chroma_location, back->chroma_location},
           {"sample_rate", parameters->sample_rate, back->sample_rate},
           {"frame_size", parameters->frame_size, back->frame_size},
           {"layout", av_channel_layout_compare(&parameters->ch_layout, &back->ch_layout), 0},
           {"extradata_size", parameters->extradata_size, back->extradata_size}}) {
    EXPECT_EQ(a, b) << settings.encoder << ": " << name;
  }
}

INSTANTIATE_TEST_SUITE_P(Encoders, EncoderTest, ::testing::ValuesIn(kEncoderCases),
                         [](const auto& info) {
                           std::string name = info.param.codecId;
                           for (char& ch : name) ch = std::isalnum(ch) ? ch : '_';
                           return name;
                         });

// Every standard layout of libavutil is named and read back as libavutil does it.
TEST(FFmpegNamesTest, LayoutsAgreeWithLibavutil) {
  void* opaque = nullptr;
  int count = 0;
  while (const AVChannelLayout* layout = av_channel_layout_standard(&opaque)) {
    char name[128] = {};
    av_channel_layout_describe(layout, name, sizeof name);
    EXPECT_EQ(FFmpeg::ChannelLayoutName(layout->u.mask), name);
    const auto parsed = FFmpeg::ParseChannelLayout(name);
    if (layout->u.mask <= UINT32_MAX) {
      ++count;
      ASSERT_TRUE(parsed) << name;
      EXPECT_EQ(static_cast<uint64_t>(*parsed), layout->u.mask) << name;
    } else {
      EXPECT_FALSE(parsed) << name;
    }
  }
  EXPECT_GT(count, 20);
  EXPECT_EQ(FFmpeg::ParseChannelLayout("0x3f"), static_cast<ChannelLayout>(0x3f));
  EXPECT_EQ(FFmpeg::ParseChannelLayout("FL+FR+LFE"), static_cast<ChannelLayout>(0xb));
  for (const char* refused : {"", "5.2", "0x0", "2000c"}) {
    EXPECT_FALSE(FFmpeg::ParseChannelLayout(refused)) << refused;
  }
  EXPECT_EQ(FFmpeg::FourccText(0x31637661), "avc1");
  EXPECT_EQ(FFmpeg::FourccText(-1), "");
}

// Profiles reach their presets; lossless codecs are told apart from lossy and PCM ones.
TEST(FFmpegNamesTest, PresetsAndLosslessRatios) {
  auto audio = Conf::FormatCodecAudio::Create();
  const auto withProfile = [&](const char* id, long long profile) {
    audio->SetCodecID(id);
    Core::Property metadata("metadata");
    metadata.SetChildT<long long>(FFmpeg::Keys::kProfile, profile);
    audio->SetMetadata(metadata);
    return FFmpeg::PresetCodecID(*audio);
  };
  EXPECT_EQ(withProfile("prores", FF_PROFILE_PRORES_4444), "prores_4444");
  EXPECT_EQ(withProfile("prores", FF_PROFILE_PRORES_STANDARD), "prores");
  EXPECT_EQ(withProfile("dnxhd", FF_PROFILE_DNXHR_HQ), "dnxhr_hq");
  EXPECT_EQ(withProfile("aac", FF_PROFILE_AAC_HE_V2), "aac_he_v2");
  EXPECT_EQ(withProfile("aac", FF_PROFILE_AAC_LOW), "aac");
  for (const char* lossless : {"flac", "alac", "ffv1", "png"}) {
    EXPECT_TRUE(FFmpeg::IsCompressedLossless(lossless)) << lossless;
  }
  for (const char* other : {"pcm_s16le", "aac", "h264", "prores", "nonsense"}) {
    EXPECT_FALSE(FFmpeg::IsCompressedLossless(other)) << other;
  }
  // 24-bit FLAC rides in 32-bit samples: uncompressed and preset figures follow the 24 bits.
  withProfile("flac", FF_PROFILE_UNKNOWN);
  audio->SetSampleRate(48000);
  audio->SetChannelLayout(kStereo);
  audio->SetSampleFormat(AV_SAMPLE_FMT_S32);
  const FFmpeg::PresetBitrates at32 = FFmpeg::PresetRange(*audio);
  Core::Property metadata("metadata");
  metadata.SetChildT<long long>(FFmpeg::Keys::kBitsPerRawSample, 24);
  audio->SetMetadata(metadata);
  EXPECT_EQ(FFmpeg::UncompressedBitrate(*audio), 48000 * 2 * 24);
  EXPECT_EQ(FFmpeg::PresetRange(*audio).maximum, at32.maximum / 32 * 24);
}

struct FormatFree {
  void operator()(AVFormatContext* c) const { avformat_free_context(c); }
};

// Out-of-range values leave their settings unset with a note, and the description still goes
// back into codec parameters.
TEST(FFmpegStreamsTest, BadInputGivesNotesNotSettings) {
  struct BadCase {
    const char* what;
    void (*spoil)(AVStream&);
    const char* unsetKey;  // a setting that must stay unset
  };
  const BadCase cases[] = {
      {"negative size", [](AVStream& s) { s.codecpar->width = -5; }, "width"},
      {"huge size", [](AVStream& s) { s.codecpar->width = s.codecpar->height = INT_MAX; }, "width"},
      {"sample aspect 0:1",
       [](AVStream& s) {
         s.codecpar->sample_aspect_ratio = s.sample_aspect_ratio = {0, 1};
       },
       "sample_aspect_num"},
      {"frame rate 0/0",
       [](AVStream& s) {
         s.avg_frame_rate = s.r_frame_rate = {0, 0};
       },
       "framerate_num"},
      {"unknown codec", [](AVStream& s) { s.codecpar->codec_id = static_cast<AVCodecID>(0x3f000); },
       "codec_id"},
      {"unknown pixel format", [](AVStream& s) { s.codecpar->format = 100000; }, "pix_fmt"},
      {"shearing display matrix",
       [](AVStream& s) {
         auto* m = reinterpret_cast<int32_t*>(
             av_stream_new_side_data(&s, AV_PKT_DATA_DISPLAYMATRIX, 9 * sizeof(int32_t)));
         av_display_rotation_set(m, 90);
         m[1] += 1 << 15;
       },
       "rotation"},
      {"huge extradata",
       [](AVStream& s) {
         s.codecpar->extradata_size = 17 << 20;
         s.codecpar->extradata = static_cast<uint8_t*>(av_mallocz(17 << 20));
       },
       ""},
      {"sample rate 0",
       [](AVStream& s) {
         s.codecpar->codec_type = AVMEDIA_TYPE_AUDIO;
         s.codecpar->codec_id = AV_CODEC_ID_AAC;
         s.codecpar->sample_rate = 0;
         av_channel_layout_default(&s.codecpar->ch_layout, 2);
       },
       "sample_rate"},
      {"2^31 channels",
       [](AVStream& s) {
         s.codecpar->codec_type = AVMEDIA_TYPE_AUDIO;
         s.codecpar->sample_rate = 48000;
         s.codecpar->ch_layout = AVChannelLayout{AV_CHANNEL_ORDER_NATIVE, INT_MIN, {3}, nullptr};
       },
       "channel_layout"},
      {"unordered channels",
       [](AVStream& s) {
         s.codecpar->codec_type = AVMEDIA_TYPE_AUDIO;
         s.codecpar->sample_rate = 48000;
         av_channel_layout_default(&s.codecpar->ch_layout, 3);
         s.codecpar->ch_layout.order = AV_CHANNEL_ORDER_UNSPEC;
       },
       "channel_layout"},
  };
  for (const BadCase& bad : cases) {
    std::unique_ptr<AVFormatContext, FormatFree> context(avformat_alloc_context());
    AVStream* stream = avformat_new_stream(context.get(), nullptr);
    stream->codecpar->codec_type = AVMEDIA_TYPE_VIDEO;
    stream->codecpar->codec_id = AV_CODEC_ID_H264;
    stream->codecpar->width = 1920;
    stream->codecpar->height = 1080;
    stream->codecpar->format = AV_PIX_FMT_YUV420P;
    stream->avg_frame_rate = {25, 1};
    stream->sample_aspect_ratio = {1, 1};
    bad.spoil(*stream);
    const FFmpeg::StreamDescription described = FFmpeg::DescribeStream(*context, 0);
    EXPECT_EQ(described.notes.size(), 1u) << bad.what;
    const Core::Property& tree = described.description->GetProperty();
    if (bad.unsetKey[0] != '\0') {
      EXPECT_FALSE(tree.ChildExists(bad.unsetKey) ||
                   described.description->GetMetadata().ChildExists(bad.unsetKey))
          << bad.what;
    } else {
      EXPECT_FALSE(described.description->GetPrivateData()) << bad.what;
    }
    Parameters back(avcodec_parameters_alloc());
    FFmpeg::ToCodecParameters(*described.description, *back);
  }
}

// A rotated picture, the r_frame_rate fallback and the container's bitrate for a lone stream.
TEST(FFmpegStreamsTest, ContainerView) {
  std::unique_ptr<AVFormatContext, FormatFree> context(avformat_alloc_context());
  AVStream* stream = avformat_new_stream(context.get(), nullptr);
  stream->codecpar->codec_type = AVMEDIA_TYPE_VIDEO;
  stream->codecpar->codec_id = AV_CODEC_ID_HEVC;
  stream->codecpar->width = 1920;
  stream->codecpar->height = 1080;
  stream->codecpar->format = AV_PIX_FMT_YUV420P10LE;
  stream->r_frame_rate = {30, 1};
  stream->disposition = AV_DISPOSITION_DEFAULT | AV_DISPOSITION_FORCED;
  av_dict_set(&stream->metadata, "title", "Phone", 0);
  context->bit_rate = 9000000;
  av_display_rotation_set(reinterpret_cast<int32_t*>(av_stream_new_side_data(
                              stream, AV_PKT_DATA_DISPLAYMATRIX, 9 * sizeof(int32_t))),
                          -90);
  const FFmpeg::StreamDescription described = FFmpeg::DescribeStream(*context, 0);
  const auto video = boost::dynamic_pointer_cast<Conf::IFormatCodecVideo>(described.description);
  ASSERT_TRUE(video);
  EXPECT_EQ(video->GetFrameRateNum(), 30u);
  EXPECT_EQ(video->GetBitrate(), 9000000);
  EXPECT_EQ(FFmpeg::GetBitrateSource(*video), FFmpeg::BitrateSource::kContainer);
  const Core::Property& metadata = video->GetMetadata();
  EXPECT_EQ(metadata[FFmpeg::Keys::kRotation].GetInt64(), 90);  // counter-clockwise
  EXPECT_EQ(metadata[FFmpeg::Keys::kDisposition].GetString(), "default+forced");
  EXPECT_EQ(metadata[FFmpeg::Keys::kTitle].GetString(), "Phone");
  EXPECT_EQ(described.notes.size(), 2u);  // no pixel aspect, no average frame rate

  // A second stream: the container's total is not this stream's alone; the language sits in
  // the metadata beside the values without setters.
  AVStream* audio = avformat_new_stream(context.get(), nullptr);
  audio->codecpar->codec_type = AVMEDIA_TYPE_AUDIO;
  audio->codecpar->codec_id = AV_CODEC_ID_FLAC;
  audio->codecpar->bit_rate = 800000;
  av_dict_set(&audio->metadata, "language", "eng", 0);
  const auto described2 = FFmpeg::DescribeStream(*context, 1);
  const auto flac = boost::dynamic_pointer_cast<Conf::IFormatCodecAudio>(described2.description);
  EXPECT_EQ(flac->GetLanguage(), "eng");
  EXPECT_EQ(FFmpeg::GetBitrateSource(*flac), FFmpeg::BitrateSource::kStream);
  EXPECT_FALSE(FFmpeg::DescribeStream(*context, 0).description->ExistsBitrate());
}

}  // namespace
