// The GStreamer bridge against GStreamer itself: every row's caps are accepted by the parser or
// decoder that GStreamer's registry has for them, raw caps read as GStreamer's own video and
// audio info read them, descriptions survive caps and their text, and bad caps are refused with
// the field named.
#include <Tarvek/Formats.h>
#include <Tarvek/GStreamer/Caps.h>
#include <gst/audio/audio.h>
#include <gst/video/video.h>
#include <gtest/gtest.h>

#include <boost/exception/get_error_info.hpp>
#include <map>
#include <memory>
#include <sstream>
#include <string>
#include <tuple>

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavutil/pixdesc.h>
}

namespace {

using namespace Tarvek;
using Conf::IFormatCodec;
using Conf::IFormatCodecAudio;
using Conf::IFormatCodecVideo;

struct CapsDeleter {
  void operator()(GstCaps* caps) const { gst_caps_unref(caps); }
};
using Caps = std::unique_ptr<GstCaps, CapsDeleter>;

class GStreamerCapsTest : public ::testing::Test {
 protected:
  static void SetUpTestSuite() { gst_init(nullptr, nullptr); }
};

const std::uint8_t kAvcC[] = {0x01, 0x64, 0x00, 0x28, 0xFF, 0xE1, 0x00, 0x04, 0x67,
                              0x64, 0x00, 0x28, 0x01, 0x00, 0x02, 0x68, 0xEE};
const std::uint8_t kAacLc[] = {0x11, 0x90};
const std::uint8_t kHeAac[] = {0x2B, 0x11, 0x88};
const std::uint8_t kHeAacV2[] = {0xEB, 0x09, 0x88};

// A description of `row`'s codec with every setting the caps carry.
boost::intrusive_ptr<IFormatCodec> Describe(const GStreamer::CapsMapping& row) {
  boost::intrusive_ptr<IFormatCodec> description;
  if (row.codecType == 0) {
    auto video = Conf::FormatCodecVideo::Create();
    video->InitByPixelAspect(1280, 720, 4, 3);
    video->SetFrameRate(30000, 1001);
    video->SetPixelFormat(AV_PIX_FMT_YUV420P);
    description = video;
  } else if (row.codecType == 1) {
    auto audio = Conf::FormatCodecAudio::Create();
    audio->SetSampleRate(48000);
    // G.711 carries at most two channels.
    const bool g711 = std::string(row.codecId).find("law") != std::string::npos;
    audio->SetChannelLayout(g711 ? Conf::CH_LAYOUT_STEREO : Conf::CH_LAYOUT_5POINT1);
    description = audio;
  } else {
    description = Conf::FormatCodecSubtitle::Create();
  }
  description->SetCodecID(row.codecId);
  const std::string id = row.codecId;
  if (id == "h264") description->SetPrivateData(CreateBlob(kAvcC, sizeof kAvcC));
  if (id == "aac") description->SetPrivateData(CreateBlob(kAacLc, sizeof kAacLc));
  if (id == "aac_he") description->SetPrivateData(CreateBlob(kHeAac, sizeof kHeAac));
  if (id == "aac_he_v2") description->SetPrivateData(CreateBlob(kHeAacV2, sizeof kHeAacV2));
  return description;
}

// The element of GStreamer's registry that parses or decodes each codec, as "prefix=element" by
// codec identifier prefix; for PGS subtitles, which GStreamer does not decode, the demuxer that
// gives them.
constexpr const char* kElements =
    "h264=h264parse hevc=h265parse vp9=vp9parse av1=av1parse mpeg2video=mpegvideoparse "
    "mpeg4=mpeg4videoparse prores=avdec_prores dnx=avdec_dnxhd aac=aacparse mp3=mpegaudioparse "
    "ac3=ac3parse eac3=ac3parse alac=avdec_alac flac=flacparse opus=opusparse "
    "vorbis=vorbisparse pcm_alaw=alawdec pcm_mulaw=mulawdec ass=assrender ssa=assrender "
    "subrip=subparse webvtt=subparse dvd_subtitle=dvdsubdec dvb_subtitle=dvbsuboverlay "
    "hdmv_pgs_subtitle=matroskademux text=webvttenc";

std::string ElementFor(const std::string& codecId) {
  std::istringstream pairs(kElements);
  for (std::string pair; pairs >> pair;) {
    const std::size_t equals = pair.find('=');
    if (codecId.rfind(pair.substr(0, equals), 0) == 0) return pair.substr(equals + 1);
  }
  return "";
}

// Whether a pad template of `element` in `direction` can take `caps`.
bool PadAccepts(GstElementFactory* factory, GstPadDirection direction, const GstCaps* caps) {
  for (const GList* item = gst_element_factory_get_static_pad_templates(factory); item;
       item = item->next) {
    auto* templ = static_cast<GstStaticPadTemplate*>(item->data);
    if (templ->direction != direction) continue;
    Caps sink(gst_static_pad_template_get_caps(templ));
    if (gst_caps_can_intersect(sink.get(), caps)) return true;
  }
  return false;
}

// Raw video of every libavutil pixel format the bridge maps reads in GStreamer with the same
// size, rate, aspect, bit depth and plane count, and reads back as the same pixel format.
TEST_F(GStreamerCapsTest, RawVideoAgreesWithVideoInfo) {
  int mapped = 0;
  for (const AVPixFmtDescriptor* format = av_pix_fmt_desc_next(nullptr); format;
       format = av_pix_fmt_desc_next(format)) {
    auto video = Conf::FormatCodecVideo::Create();
    video->SetCodecID("rawvideo");
    video->InitByPixelAspect(640, 480, 16, 15);
    video->SetFrameRate(25, 1);
    const AVPixelFormat id = av_pix_fmt_desc_get_id(format);
    video->SetPixelFormat(id);
    GstCaps* made = nullptr;
    try {
      made = GStreamer::ToCaps(video);
    } catch (const GStreamer::CapsError&) {
      continue;
    }
    Caps caps(made);
    ++mapped;
    GstVideoInfo info;
    ASSERT_TRUE(gst_video_info_from_caps(&info, caps.get())) << format->name;
    EXPECT_EQ(GST_VIDEO_INFO_WIDTH(&info), 640);
    EXPECT_EQ(GST_VIDEO_INFO_FPS_N(&info), 25);
    EXPECT_EQ(GST_VIDEO_INFO_PAR_N(&info), 16);
    EXPECT_EQ(GST_VIDEO_INFO_COMP_DEPTH(&info, 0), format->comp[0].depth) << format->name;
    // GStreamer counts a palette as a plane of its own.
    const int palette = (format->flags & AV_PIX_FMT_FLAG_PAL) != 0 ? 1 : 0;
    EXPECT_EQ(static_cast<int>(GST_VIDEO_INFO_N_PLANES(&info)),
              av_pix_fmt_count_planes(id) + palette)
        << format->name;
    auto back = boost::dynamic_pointer_cast<IFormatCodecVideo>(GStreamer::FromCaps(caps.get()));
    EXPECT_EQ(back->GetPixelFormat(), av_get_pix_fmt(format->name)) << format->name;
  }
  EXPECT_GE(mapped, 50);
}

std::string Bytes(const boost::intrusive_ptr<IBlob>& blob) {
  return blob ? std::string(blob->GetData(), blob->GetData() + blob->GetSize()) : "<none>";
}

// Every row's caps are fixed and taken by its element (raw audio read by GStreamer's audio info),
// and go to text, to caps and back with every mapped setting equal; rows whose caps another row
// already gives read back as that row's codec.
TEST_F(GStreamerCapsTest, EveryRowRoundTripsAndIsAcceptedByGStreamer) {
  std::size_t count = 0;
  const GStreamer::CapsMapping* rows = GStreamer::GetCapsMappings(count);
  std::map<std::string, std::string> firstWithCaps;
  std::string missing;
  for (std::size_t i = 0; i < count; ++i) {
    const std::string id = rows[i].codecId;
    if (id == "rawvideo") continue;
    const auto description = Describe(rows[i]);
    const std::string text = GStreamer::ToCapsString(description);
    const auto back = GStreamer::FromCapsString(text);
    EXPECT_EQ(back->GetCodecID(), firstWithCaps.emplace(text, id).first->second) << text;
    EXPECT_EQ(back->GetCodecType(), description->GetCodecType());
    EXPECT_EQ(GStreamer::ToCapsString(back), text);
    if (auto video = boost::dynamic_pointer_cast<IFormatCodecVideo>(back)) {
      EXPECT_EQ(std::make_tuple(video->GetWidth(), video->GetHeight(), video->GetPixelAspectX(),
                                video->GetPixelAspectY(), video->GetFrameRateNum(),
                                video->GetFrameRateDen()),
                std::make_tuple(1280u, 720u, 4u, 3u, 30000u, 1001u));
    }
    if (auto audio = boost::dynamic_pointer_cast<IFormatCodecAudio>(back)) {
      EXPECT_EQ(audio->GetSampleRate(), 48000);
      EXPECT_EQ(audio->GetChannelLayout(),
                boost::dynamic_pointer_cast<IFormatCodecAudio>(description)->GetChannelLayout());
    }
    EXPECT_EQ(Bytes(back->GetPrivateData()), Bytes(description->GetPrivateData())) << text;
    EXPECT_EQ(back->GetMetadata().GetChildren().size(), 0u) << text;

    Caps caps(GStreamer::ToCaps(description));
    EXPECT_TRUE(gst_caps_is_fixed(caps.get())) << id;
    if (std::string(rows[i].mediaType) == "audio/x-raw") {
      // PCM reads in GStreamer with its rate, channels and libavcodec's sample size.
      GstAudioInfo info;
      ASSERT_TRUE(gst_audio_info_from_caps(&info, caps.get())) << id;
      EXPECT_EQ(GST_AUDIO_INFO_RATE(&info), 48000);
      EXPECT_EQ(GST_AUDIO_INFO_CHANNELS(&info), 6);
      const AVCodecDescriptor* codec = avcodec_descriptor_get_by_name(id.c_str());
      ASSERT_NE(codec, nullptr) << id;
      EXPECT_EQ(GST_AUDIO_INFO_WIDTH(&info), av_get_bits_per_sample(codec->id)) << id;
      EXPECT_EQ(GST_AUDIO_INFO_LAYOUT(&info) == GST_AUDIO_LAYOUT_NON_INTERLEAVED,
                id.find("planar") != std::string::npos);
      continue;
    }
    const std::string element = ElementFor(id);
    ASSERT_FALSE(element.empty()) << id;
    GstElementFactory* factory = gst_element_factory_find(element.c_str());
    if (!factory) {
      missing += " " + element;
      continue;
    }
    const bool demuxer = element == "matroskademux";
    EXPECT_TRUE(PadAccepts(factory, demuxer ? GST_PAD_SRC : GST_PAD_SINK, caps.get()))
        << element << " refuses " << text;
    gst_object_unref(factory);
  }
  if (!missing.empty()) GTEST_SKIP() << "elements not installed:" << missing;
}

std::string FieldOfError(const std::function<void()>& call) {
  try {
    call();
  } catch (const GStreamer::CapsError& error) {
    const std::string* field = boost::get_error_info<GStreamer::CapsError::FieldInfo>(error);
    return field ? *field : "(no field)";
  }
  return "(accepted)";
}

// Fields without a place in the interfaces are kept, typed, under the metadata; caps that do not
// parse, are not fixed or hold a bad field are refused with the field named.
TEST_F(GStreamerCapsTest, OtherFieldsAreKeptBadOnesNamed) {
  const auto kept = GStreamer::FromCapsString(
      "video/x-vp9, profile=(string)2, level=(int)41, interlaced=(boolean)true, "
      "colorimetry=(string)bt2020");
  const Core::Property& metadata = kept->GetMetadata();
  EXPECT_EQ(metadata["profile"].GetString(), "2");
  EXPECT_EQ(metadata["level"].GetInt64(), 41);
  EXPECT_TRUE(metadata["interlaced"].GetBool());
  EXPECT_EQ(metadata["colorimetry"].GetString(), "bt2020");
  const struct {
    const char* caps;
    const char* field;
  } kBad[] = {
      {"video/x-h264, width=(int)", ""},
      {"video/x-h264; video/x-h265", ""},
      {"ANY", ""},
      {"EMPTY", ""},
      {"image/x-unknown", ""},
      {"video/x-h264, width=(int)[ 1, 100 ]", "width"},
      {"video/x-h264, framerate=(fraction){ 25/1, 30/1 }", "framerate"},
      {"video/x-h264, width=(string)wide, height=(int)5", "width"},
      {"video/x-h264, width=(int)-4, height=(int)5", "width"},
      {"video/x-h264, stream-format=(string)avc", "codec_data"},
      {"video/x-h264, stream-format=(string)avc, codec_data=(buffer)0164", "codec_data"},
      {"video/x-h264, stream-format=(string)avc, codec_data=(buffer)01640028ffe10040676400",
       "codec_data"},
      {"video/x-h265, stream-format=(string)hvc1, codec_data=(buffer)02", "codec_data"},
      {"audio/mpeg, mpegversion=(int)4, stream-format=(string)raw, codec_data=(buffer)f8",
       "codec_data"},
      {"video/x-h264, codec_data=(string)0164", "codec_data"},
      {"audio/mpeg, mpegversion=(int)3", "mpegversion"},
      {"audio/mpeg, mpegversion=(string)4", "mpegversion"},
      {"audio/mpeg", "mpegversion"},
      {"audio/mpeg, mpegversion=(int)1, layer=(int)1", "layer"},
      {"video/mpeg, mpegversion=(int)2, systemstream=(boolean)true", "systemstream"},
      {"audio/x-raw, format=(string)S16LE, layout=(string)interleaved, rate=(int)0", "rate"},
      {"audio/x-raw, format=(string)S16LE, layout=(string)interleaved, channels=(int)3, "
       "channel-mask=(bitmask)0x3",
       "channel-mask"},
      {"audio/x-raw, format=(string)S16LE, layout=(string)interleaved, channels=(int)2, "
       "channel-mask=(bitmask)0x8000000000000003",
       "channel-mask"},
      {"audio/x-raw, format=(string)S64LE, layout=(string)interleaved", "format"},
      {"video/x-raw, format=(string)NOPE", "format"},
      {"video/x-raw, width=(int)4", "format"},
  };
  for (const auto& bad : kBad)
    EXPECT_EQ(FieldOfError([&] { GStreamer::FromCapsString(bad.caps); }), bad.field) << bad.caps;

  auto generic = Conf::FormatCodec::Create();
  generic->SetCodecID("h264");
  EXPECT_EQ(FieldOfError([&] { GStreamer::ToCaps(generic); }), "");
  auto audio = Conf::FormatCodecAudio::Create();
  EXPECT_EQ(FieldOfError([&] { GStreamer::ToCaps(audio); }), "codec_id");
  audio->SetCodecID("pcm_s64le");
  EXPECT_EQ(FieldOfError([&] { GStreamer::ToCaps(audio); }), "codec_id");
  auto video = Conf::FormatCodecVideo::Create();
  video->SetCodecID("rawvideo");
  EXPECT_EQ(FieldOfError([&] { GStreamer::ToCaps(video); }), "pix_fmt");
  video->SetCodecID("h264");
  video->InitByPixelAspect(0x80000000u, 4, 1, 1);
  EXPECT_EQ(FieldOfError([&] { GStreamer::ToCaps(video); }), "width");
}

}  // namespace
