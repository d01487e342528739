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
#include <sstream>
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

// One encoder's test: a description (video when width is not 0; mode "cbr", "vbr" or "") and
// what the opened encoder must report.
struct EncoderCase {
  const char* codecId;
  const char* mode;
  long long bitrateOrQuality;
  int width, height, format, sampleRate;
  ChannelLayout layout;
  int profile;
};

constexpr int kNone = FF_PROFILE_UNKNOWN;
const ChannelLayout kStereo = Conf::CH_LAYOUT_STEREO;
const auto kSide51 = static_cast<ChannelLayout>(AV_CH_LAYOUT_5POINT1);

const EncoderCase kEncoderCases[] = {
    {"h264", "cbr", 2000000, 320, 240, AV_PIX_FMT_YUV420P, 0, kStereo, kNone},
    {"hevc", "vbr", 28, 320, 240, AV_PIX_FMT_YUV420P, 0, kStereo, kNone},
    {"vp9", "vbr", 31, 320, 240, AV_PIX_FMT_YUV420P, 0, kStereo, kNone},
    {"vp8", "cbr", 1000000, 320, 240, AV_PIX_FMT_YUV420P, 0, kStereo, kNone},
    {"av1", "vbr", 35, 64, 64, AV_PIX_FMT_YUV420P, 0, kStereo, kNone},
    {"mpeg1video", "cbr", 1500000, 352, 240, AV_PIX_FMT_YUV420P, 0, kStereo, kNone},
    {"mpeg2video", "vbr", 4, 720, 576, AV_PIX_FMT_YUV420P, 0, kStereo, kNone},
    {"mpeg4", "cbr", 1000000, 352, 288, AV_PIX_FMT_YUV420P, 0, kStereo, kNone},
    {"mjpeg", "vbr", 3, 320, 240, AV_PIX_FMT_YUVJ420P, 0, kStereo, kNone},
    {"theora", "vbr", 6, 320, 240, AV_PIX_FMT_YUV420P, 0, kStereo, kNone},
    {"prores", "", 0, 320, 240, AV_PIX_FMT_YUV422P10LE, 0, kStereo, FF_PROFILE_PRORES_HQ},
    {"dnxhd", "", 0, 1280, 720, AV_PIX_FMT_YUV422P, 0, kStereo, FF_PROFILE_DNXHR_SQ},
    {"ffv1", "", 0, 320, 240, AV_PIX_FMT_YUV420P, 0, kStereo, kNone},
    {"png", "", 0, 320, 240, AV_PIX_FMT_RGB24, 0, kStereo, kNone},
    {"aac", "cbr", 128000, 0, 0, AV_SAMPLE_FMT_FLTP, 48000, kStereo, kNone},
    {"opus", "vbr", 0, 0, 0, AV_SAMPLE_FMT_S16, 48000, kStereo, kNone},
    {"flac", "", 0, 0, 0, AV_SAMPLE_FMT_S16, 44100, kSide51, kNone},
    {"alac", "", 0, 0, 0, AV_SAMPLE_FMT_S16P, 44100, kStereo, kNone},
    {"ac3", "cbr", 448000, 0, 0, AV_SAMPLE_FMT_FLTP, 48000, kSide51, kNone},
    {"eac3", "cbr", 192000, 0, 0, AV_SAMPLE_FMT_FLTP, 48000, kSide51, kNone},
    {"mp3", "vbr", 4, 0, 0, AV_SAMPLE_FMT_S16P, 44100, kStereo, kNone},
    {"mp2", "cbr", 224000, 0, 0, AV_SAMPLE_FMT_S16, 48000, kStereo, kNone},
    {"vorbis", "vbr", 3, 0, 0, AV_SAMPLE_FMT_FLTP, 44100, kStereo, kNone},
    {"dts", "cbr", 768000, 0, 0, AV_SAMPLE_FMT_S32, 48000, kSide51, kNone},
    {"truehd", "", 0, 0, 0, AV_SAMPLE_FMT_S16, 48000, kStereo, kNone},
    {"pcm_s24le", "", 0, 0, 0, AV_SAMPLE_FMT_S32, 96000, kStereo, kNone},
};

boost::intrusive_ptr<Conf::IFormatCodec> Describe(const EncoderCase& c) {
  boost::intrusive_ptr<Conf::IFormatCodec> description;
  if (c.width != 0) {
    auto video = Conf::FormatCodecVideo::Create();
    video->InitByPixelAspect(static_cast<unsigned>(c.width), static_cast<unsigned>(c.height), 1, 1);
    video->SetFrameRate(25, 1);
    video->SetPixelFormat(static_cast<AVPixelFormat>(c.format));
    description = video;
  } else {
    auto audio = Conf::FormatCodecAudio::Create();
    audio->SetSampleRate(c.sampleRate);
    audio->SetChannelLayout(c.layout);
    audio->SetSampleFormat(static_cast<AVSampleFormat>(c.format));
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
  Core::Property metadata = description->GetMetadata();
  if (c.profile != kNone) metadata.SetChildT<long long>(FFmpeg::Keys::kProfile, c.profile);
  description->SetMetadata(metadata);
  Core::Property options("options");
  options.SetChildT<std::string>("threads", "1");
  options.SetChildT<std::string>("no_such_option", "7");
  description->SetOptionsEncode(options);
  return description;
}

// The fields of codec parameters that a description carries, as one text to compare.
std::string Fields(const AVCodecParameters& p) {
  std::ostringstream out;
  out << "type " << p.codec_type << " id " << p.codec_id << " tag " << p.codec_tag << " bitrate "
      << p.bit_rate << " format " << p.format << " size " << p.width << "x" << p.height << " sar "
      << p.sample_aspect_ratio.num << ":" << p.sample_aspect_ratio.den << " profile " << p.profile
      << " level " << p.level << " raw bits " << p.bits_per_raw_sample << " field order "
      << p.field_order << " range " << p.color_range << " space " << p.color_space << " chroma "
      << p.chroma_location << " rate " << p.sample_rate << " frame size " << p.frame_size
      << " layout " << p.ch_layout.order << "/" << p.ch_layout.nb_channels << "/"
      << p.ch_layout.u.mask << " extradata " << p.extradata_size;
  return out.str();
}

class EncoderTest : public ::testing::TestWithParam<EncoderCase> {};

// The oracle is the encoder: it opens, uses every option, and reports the settings back; its
// codec parameters then survive description and back unchanged.
TEST_P(EncoderTest, OpensWithTheSettingsAndRoundTrips) {
  const EncoderCase& c = GetParam();
  const auto description = Describe(c);
  const FFmpeg::EncoderSettings settings = FFmpeg::MakeEncoderSettings(*description);
  if (settings.encoder.empty()) GTEST_SKIP() << "no encoder for " << c.codecId << " compiled in";
  SCOPED_TRACE(settings.encoder);
  EXPECT_EQ(settings.unconsumed, std::vector<std::string>{"no_such_option=7"});
  EXPECT_EQ(settings.arguments.at(1), settings.encoder);
  const AVCodec* encoder = avcodec_find_encoder_by_name(settings.encoder.c_str());
  std::unique_ptr<AVCodecContext, ContextFree> context(avcodec_alloc_context3(encoder));
  std::vector<std::string> left;
  ASSERT_EQ(FFmpeg::OpenEncoder(settings, *context, &left), 0);
  EXPECT_TRUE(left.empty()) << " left " << left.front();
  EXPECT_EQ(context->thread_count, 1);
  EXPECT_NE(context->flags & AV_CODEC_FLAG_GLOBAL_HEADER, 0);
  const std::string mode = c.mode;
  if (mode == "cbr") {  // video encoders also cap the rate
    EXPECT_EQ(context->bit_rate, c.bitrateOrQuality);
    EXPECT_EQ(c.width != 0 ? context->rc_max_rate : c.bitrateOrQuality, c.bitrateOrQuality);
  } else if (mode == "vbr" && (context->flags & AV_CODEC_FLAG_QSCALE) != 0) {
    EXPECT_EQ(context->global_quality, c.bitrateOrQuality * FF_QP2LAMBDA);
  } else if (mode == "vbr" && c.width != 0) {
    double crf = -1;
    const char* name = settings.encoder == "librav1e" ? "qp" : "crf";
    ASSERT_GE(av_opt_get_double(context->priv_data, name, 0, &crf), 0);
    EXPECT_EQ(crf, static_cast<double>(c.bitrateOrQuality));
  }
  int64_t profile = kNone;
  if (c.profile != kNone) {
    ASSERT_GE(av_opt_get_int(context->priv_data, "profile", 0, &profile), 0);
  }
  EXPECT_EQ(profile, c.profile);
  Parameters parameters(avcodec_parameters_alloc());
  ASSERT_GE(avcodec_parameters_from_context(parameters.get(), context.get()), 0);
  EXPECT_EQ(parameters->format, c.format);
  EXPECT_EQ(c.width != 0 ? parameters->width : parameters->sample_rate,
            c.width != 0 ? c.width : c.sampleRate);
  if (c.width == 0) {
    EXPECT_EQ(parameters->ch_layout.u.mask, static_cast<uint64_t>(c.layout));
  }
  Parameters back(avcodec_parameters_alloc());
  const auto described = FFmpeg::DescribeCodecParameters(*parameters).description;
  EXPECT_TRUE(FFmpeg::ToCodecParameters(*described, *back).empty());
  EXPECT_EQ(Fields(*back), Fields(*parameters));
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

// A stream of 1080p H.264 at 25 fps, or of stereo AAC at 48 kHz, with nothing unknown.
AVStream& NewStream(AVFormatContext& context, bool audio) {
  AVStream* stream = avformat_new_stream(&context, nullptr);
  AVCodecParameters& p = *stream->codecpar;
  p.codec_type = audio ? AVMEDIA_TYPE_AUDIO : AVMEDIA_TYPE_VIDEO;
  p.codec_id = audio ? AV_CODEC_ID_AAC : AV_CODEC_ID_H264;
  if (audio) {
    p.format = AV_SAMPLE_FMT_FLTP;
    p.sample_rate = 48000;
    av_channel_layout_default(&p.ch_layout, 2);
  } else {
    p.width = 1920;
    p.height = 1080;
    p.format = AV_PIX_FMT_YUV420P;
    stream->avg_frame_rate = {25, 1};
    stream->sample_aspect_ratio = {1, 1};
  }
  return *stream;
}

// Out-of-range values leave their settings unset with one note each, and the description still
// goes back into codec parameters.
TEST(FFmpegStreamsTest, BadInputGivesNotesNotSettings) {
  const struct {
    bool audio;
    void (*spoil)(AVStream&);
    const char* unsetKey;  // a setting that must stay unset; "" for the private data
  } cases[] = {
      {false, [](AVStream& s) { s.codecpar->width = -5; }, "width"},
      {false, [](AVStream& s) { s.codecpar->width = s.codecpar->height = INT_MAX; }, "width"},
      {false,
       [](AVStream& s) {
         s.codecpar->sample_aspect_ratio = s.sample_aspect_ratio = {0, 1};
       },
       "sample_aspect_num"},
      {false,
       [](AVStream& s) {
         s.avg_frame_rate = s.r_frame_rate = {0, 0};
       },
       "framerate_num"},
      {false, [](AVStream& s) { s.codecpar->codec_id = static_cast<AVCodecID>(0x3f000); },
       "codec_id"},
      {false, [](AVStream& s) { s.codecpar->format = 100000; }, "pix_fmt"},
      {false,
       [](AVStream& s) {  // a shearing display matrix
         auto* m = reinterpret_cast<int32_t*>(
             av_stream_new_side_data(&s, AV_PKT_DATA_DISPLAYMATRIX, 9 * sizeof(int32_t)));
         av_display_rotation_set(m, 90);
         m[1] += 1 << 15;
       },
       "rotation"},
      {false,
       [](AVStream& s) {
         s.codecpar->extradata_size = 17 << 20;
         s.codecpar->extradata = static_cast<uint8_t*>(av_mallocz(17 << 20));
       },
       ""},
      {true, [](AVStream& s) { s.codecpar->sample_rate = 0; }, "sample_rate"},
      {true,
       [](AVStream& s) {
         s.codecpar->ch_layout = AVChannelLayout{AV_CHANNEL_ORDER_NATIVE, INT_MIN, {3}, nullptr};
       },
       "channel_layout"},
      {true,
       [](AVStream& s) {
         av_channel_layout_uninit(&s.codecpar->ch_layout);
         av_channel_layout_default(&s.codecpar->ch_layout, 3);
         s.codecpar->ch_layout.order = AV_CHANNEL_ORDER_UNSPEC;
       },
       "channel_layout"},
      {true,  // two channels, three speakers in the mask
       [](AVStream& s) {
         s.codecpar->ch_layout = AVChannelLayout{AV_CHANNEL_ORDER_NATIVE, 2, {7}, nullptr};
       },
       "channel_layout"},
  };
  for (const auto& bad : cases) {
    std::unique_ptr<AVFormatContext, FormatFree> context(avformat_alloc_context());
    bad.spoil(NewStream(*context, bad.audio));
    const FFmpeg::StreamDescription described = FFmpeg::DescribeStream(*context, 0);
    SCOPED_TRACE(described.notes.empty() ? bad.unsetKey : described.notes.front());
    EXPECT_EQ(described.notes.size(), 1u);
    if (bad.unsetKey[0] != '\0') {
      EXPECT_FALSE(described.description->GetProperty().ChildExists(bad.unsetKey) ||
                   described.description->GetMetadata().ChildExists(bad.unsetKey));
    } else {
      EXPECT_FALSE(described.description->GetPrivateData());
    }
    Parameters back(avcodec_parameters_alloc());
    FFmpeg::ToCodecParameters(*described.description, *back);
  }
}

// Values libavcodec names by its option constants are stored under those names.
TEST(FFmpegStreamsTest, OptionConstantsGiveTheirNames) {
  const char* const names[] = {"progressive", "tt", "bb", "tb", "bt"};
  for (int order = AV_FIELD_PROGRESSIVE; order <= AV_FIELD_BT; ++order) {
    std::unique_ptr<AVFormatContext, FormatFree> context(avformat_alloc_context());
    NewStream(*context, false).codecpar->field_order = static_cast<AVFieldOrder>(order);
    const FFmpeg::StreamDescription described = FFmpeg::DescribeStream(*context, 0);
    EXPECT_EQ(described.description->GetMetadata()["field_order"].GetString(),
              names[order - AV_FIELD_PROGRESSIVE]);
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
