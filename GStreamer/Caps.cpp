#include <Tarvek/GStreamer/Caps.h>

#include <gst/audio/audio.h>
#include <gst/video/video.h>

#include <Tarvek/CodecString/Records.h>
#include <Tarvek/Conf/Formats/FormatCodecAudio.h>
#include <Tarvek/Conf/Formats/FormatCodecSubtitle.h>
#include <Tarvek/Conf/Formats/FormatCodecVideo.h>
#include <Tarvek/Conf/Interfaces/IFormatCodecAudio.h>
#include <Tarvek/Conf/Interfaces/IFormatCodecVideo.h>
#include <Tarvek/Core/Errors/AddStack.h>

#include <boost/current_function.hpp>
#include <boost/exception/get_error_info.hpp>
#include <climits>
#include <cstring>
#include <memory>
#include <vector>

extern "C" {
#include <libavutil/channel_layout.h>
#include <libavutil/pixdesc.h>
#include <libavutil/samplefmt.h>
}

namespace Tarvek {
namespace GStreamer {
namespace {

using Conf::IFormatCodec;
using Conf::IFormatCodecAudio;
using Conf::IFormatCodecVideo;

[[noreturn]] void Fail(const std::string& field, const std::string& what) {
  ThrowWithLocation(
      __LINE__, __FILE__, BOOST_CURRENT_FUNCTION,
      AddStack(CapsError() << DescriptionInfo(field.empty() ? what : field + ": " + what)
                           << CapsError::FieldInfo(field)));
}

struct CapsDeleter {
  void operator()(GstCaps* caps) const { gst_caps_unref(caps); }
};
using CapsPtr = std::unique_ptr<GstCaps, CapsDeleter>;

struct TextDeleter {
  void operator()(gchar* text) const { g_free(text); }
};
using Text = std::unique_ptr<gchar, TextDeleter>;

// ----- Pixel formats and channel positions ----------------------------------------------------

// libavutil's pixel format names beside GStreamer's names of the same memory layout. Both sides
// are resolved through their library's own look-up, so a name either does not know is skipped.
struct PixelFormatName {
  const char* libav;
  const char* gst;
};
constexpr PixelFormatName kPixelFormats[] = {
    {"yuv420p", "I420"},
    {"nv12", "NV12"},
    {"nv21", "NV21"},
    {"yuv422p", "Y42B"},
    {"yuv444p", "Y444"},
    {"yuv411p", "Y41B"},
    {"yuv410p", "YUV9"},
    {"yuyv422", "YUY2"},
    {"uyvy422", "UYVY"},
    {"yvyu422", "YVYU"},
    {"nv16", "NV16"},
    {"nv24", "NV24"},
    {"gray", "GRAY8"},
    {"gray16le", "GRAY16_LE"},
    {"gray16be", "GRAY16_BE"},
    {"rgb24", "RGB"},
    {"bgr24", "BGR"},
    {"rgba", "RGBA"},
    {"bgra", "BGRA"},
    {"argb", "ARGB"},
    {"abgr", "ABGR"},
    {"rgb0", "RGBx"},
    {"bgr0", "BGRx"},
    {"0rgb", "xRGB"},
    {"0bgr", "xBGR"},
    {"rgb565", "RGB16"},
    {"bgr565", "BGR16"},
    {"rgb555", "RGB15"},
    {"bgr555", "BGR15"},
    {"pal8", "RGB8P"},
    {"yuva420p", "A420"},
    {"yuv420p10le", "I420_10LE"},
    {"yuv420p10be", "I420_10BE"},
    {"yuv420p12le", "I420_12LE"},
    {"yuv420p12be", "I420_12BE"},
    {"yuv422p10le", "I422_10LE"},
    {"yuv422p10be", "I422_10BE"},
    {"yuv422p12le", "I422_12LE"},
    {"yuv422p12be", "I422_12BE"},
    {"yuv444p10le", "Y444_10LE"},
    {"yuv444p10be", "Y444_10BE"},
    {"yuv444p12le", "Y444_12LE"},
    {"yuv444p12be", "Y444_12BE"},
    {"yuv444p16le", "Y444_16LE"},
    {"yuv444p16be", "Y444_16BE"},
    {"p010le", "P010_10LE"},
    {"p010be", "P010_10BE"},
    {"p016le", "P016_LE"},
    {"p016be", "P016_BE"},
    {"gbrp", "GBR"},
    {"gbrp10le", "GBR_10LE"},
    {"gbrp10be", "GBR_10BE"},
    {"gbrp12le", "GBR_12LE"},
    {"gbrp12be", "GBR_12BE"},
    {"gbrap", "GBRA"},
    {"gbrap10le", "GBRA_10LE"},
    {"gbrap12le", "GBRA_12LE"},
    {"yuva420p10le", "A420_10LE"},
    {"yuva422p10le", "A422_10LE"},
    {"yuva444p10le", "A444_10LE"},
    {"vuya", "VUYA"},
    {"y210le", "Y210"},
};

const char* GstPixelFormat(AVPixelFormat format) {
  const AVPixFmtDescriptor* descriptor = av_pix_fmt_desc_get(format);
  if (!descriptor) return nullptr;
  const AVPixelFormat native = av_get_pix_fmt(descriptor->name);
  for (const PixelFormatName& name : kPixelFormats)
    if (av_get_pix_fmt(name.libav) == native) {
      const GstVideoFormat gst = gst_video_format_from_string(name.gst);
      return gst == GST_VIDEO_FORMAT_UNKNOWN ? nullptr : gst_video_format_to_string(gst);
    }
  return nullptr;
}

AVPixelFormat LibavPixelFormat(const char* gstName) {
  const GstVideoFormat gst = gst_video_format_from_string(gstName);
  if (gst == GST_VIDEO_FORMAT_UNKNOWN) return AV_PIX_FMT_NONE;
  const char* canonical = gst_video_format_to_string(gst);
  for (const PixelFormatName& name : kPixelFormats)
    if (std::strcmp(name.gst, canonical) == 0) return av_get_pix_fmt(name.libav);
  return AV_PIX_FMT_NONE;
}

// The speaker of each bit of a channel layout mask, in bit order, as GStreamer names it.
constexpr GstAudioChannelPosition kPositions[] = {
    GST_AUDIO_CHANNEL_POSITION_FRONT_LEFT,
    GST_AUDIO_CHANNEL_POSITION_FRONT_RIGHT,
    GST_AUDIO_CHANNEL_POSITION_FRONT_CENTER,
    GST_AUDIO_CHANNEL_POSITION_LFE1,
    GST_AUDIO_CHANNEL_POSITION_REAR_LEFT,
    GST_AUDIO_CHANNEL_POSITION_REAR_RIGHT,
    GST_AUDIO_CHANNEL_POSITION_FRONT_LEFT_OF_CENTER,
    GST_AUDIO_CHANNEL_POSITION_FRONT_RIGHT_OF_CENTER,
    GST_AUDIO_CHANNEL_POSITION_REAR_CENTER,
    GST_AUDIO_CHANNEL_POSITION_SIDE_LEFT,
    GST_AUDIO_CHANNEL_POSITION_SIDE_RIGHT,
    GST_AUDIO_CHANNEL_POSITION_TOP_CENTER,
    GST_AUDIO_CHANNEL_POSITION_TOP_FRONT_LEFT,
    GST_AUDIO_CHANNEL_POSITION_TOP_FRONT_CENTER,
    GST_AUDIO_CHANNEL_POSITION_TOP_FRONT_RIGHT,
    GST_AUDIO_CHANNEL_POSITION_TOP_REAR_LEFT,
    GST_AUDIO_CHANNEL_POSITION_TOP_REAR_CENTER,
    GST_AUDIO_CHANNEL_POSITION_TOP_REAR_RIGHT,
};
constexpr unsigned kPositionCount = sizeof(kPositions) / sizeof(kPositions[0]);

int SpeakerCount(std::uint32_t layout) {
  int count = 0;
  for (; layout; layout &= layout - 1) ++count;
  return count;
}

guint64 ToChannelMask(std::uint32_t layout) {
  guint64 mask = 0;
  for (unsigned bit = 0; bit < 32; ++bit) {
    if (!(layout >> bit & 1u)) continue;
    if (bit >= kPositionCount)
      Fail(Conf::IFormatCodecAudio::TAG_LAYOUT,
           "speaker bit " + std::to_string(bit) + " has no GStreamer channel position");
    mask |= guint64{1} << kPositions[bit];
  }
  return mask;
}

std::uint32_t FromChannelMask(guint64 mask) {
  std::uint32_t layout = 0;
  guint64 known = 0;
  for (unsigned bit = 0; bit < kPositionCount; ++bit) {
    const guint64 position = guint64{1} << kPositions[bit];
    known |= position;
    if (mask & position) layout |= 1u << bit;
  }
  if (mask & ~known) Fail("channel-mask", "positions beyond the channel layout's speakers");
  return layout;
}

// ----- Reading caps fields --------------------------------------------------------------------

const char* TypeName(const GValue* value) {
  const GType type = G_VALUE_TYPE(value);
  if (type == G_TYPE_INT) return "an integer";
  if (type == G_TYPE_STRING) return "a string";
  if (type == G_TYPE_BOOLEAN) return "a boolean";
  if (type == GST_TYPE_FRACTION) return "a fraction";
  if (type == GST_TYPE_BUFFER) return "a buffer";
  if (type == GST_TYPE_BITMASK) return "a bitmask";
  return g_type_name(type);
}

const GValue* Field(const GstStructure* s, const char* name, GType type, const char* expected) {
  const GValue* value = gst_structure_get_value(s, name);
  if (value && G_VALUE_TYPE(value) != type)
    Fail(name, std::string("expected ") + expected + ", found " + TypeName(value));
  return value;
}

int PositiveInt(const GstStructure* s, const char* name) {
  const int value = g_value_get_int(Field(s, name, G_TYPE_INT, "an integer"));
  if (value <= 0) Fail(name, "expected a positive integer, found " + std::to_string(value));
  return value;
}

bool Matches(const GstStructure* s, const CapsField& field) {
  switch (field.type) {
    case CapsFieldType::kNone:
      return true;
    case CapsFieldType::kString: {
      const GValue* value = Field(s, field.name, G_TYPE_STRING, "a string");
      return value && std::strcmp(g_value_get_string(value), field.text) == 0;
    }
    case CapsFieldType::kInt: {
      const GValue* value = Field(s, field.name, G_TYPE_INT, "an integer");
      return value && g_value_get_int(value) == field.number;
    }
    case CapsFieldType::kBoolean: {
      const GValue* value = Field(s, field.name, G_TYPE_BOOLEAN, "a boolean");
      // A system stream flag left out means an elementary stream, as GStreamer's parsers read it.
      return value ? (g_value_get_boolean(value) != FALSE) == (field.number != 0)
                   : field.number == 0;
    }
  }
  return false;
}

// The row of `s`'s media type whose fields `s` holds, the one with the most fields first.
const CapsMapping& FindRow(const GstStructure* s) {
  const char* mediaType = gst_structure_get_name(s);
  std::size_t count = 0;
  const CapsMapping* rows = GetCapsMappings(count);
  const CapsMapping* best = nullptr;
  int bestFields = -1;
  const CapsMapping* ofType = nullptr;
  for (std::size_t i = 0; i < count; ++i) {
    const CapsMapping& row = rows[i];
    if (std::strcmp(row.mediaType, mediaType) != 0) continue;
    if (!ofType) ofType = &row;
    if (!Matches(s, row.fields[0]) || !Matches(s, row.fields[1])) continue;
    const int fields = (row.fields[0].name ? 1 : 0) + (row.fields[1].name ? 1 : 0);
    if (fields > bestFields) {
      best = &row;
      bestFields = fields;
    }
  }
  if (best) return *best;
  if (!ofType) Fail("", std::string("media type '") + mediaType + "' is not known");
  // Name the field that tells the codecs apart: the second when some row has the first.
  const char* field = ofType->fields[0].name;
  for (std::size_t i = 0; i < count; ++i)
    if (std::strcmp(rows[i].mediaType, mediaType) == 0 && rows[i].fields[1].name &&
        Matches(s, rows[i].fields[0]))
      field = rows[i].fields[1].name;
  const GValue* value = gst_structure_get_value(s, field);
  if (!value) Fail(field, std::string("missing; ") + mediaType + " needs it to name the codec");
  Text text(gst_value_serialize(value));
  Fail(field, std::string("no codec of ") + mediaType + " has the value " + text.get());
}

// The private data's record, checked against what the codec and stream-format declare.
void CheckRecord(const std::string& codecId, const std::uint8_t* data, std::size_t size,
                 const std::string& field) {
  try {
    if (codecId == "h264")
      CodecString::ParseAvcConfig(data, size);
    else if (codecId == "hevc")
      CodecString::ParseHevcConfig(data, size);
    else if (codecId == "av1")
      CodecString::ParseAv1Config(data, size);
    else if (codecId.compare(0, 3, "aac") == 0)
      CodecString::ParseAacConfig(data, size);
  } catch (const CodecString::CodecStringError& error) {
    const std::string* what = boost::get_error_info<DescriptionInfo>(error);
    Fail(field, what ? *what : "not a valid configuration record");
  }
}

bool HasRecord(const std::string& codecId) {
  return codecId == "h264" || codecId == "hevc" || codecId == "av1" ||
         codecId.compare(0, 3, "aac") == 0;
}

// ----- Writing caps fields --------------------------------------------------------------------

// Values go into the structure by quark, taken rather than copied: no argument list is parsed on
// the way. The quarks of the fields ToCaps writes are looked up once.
struct FieldQuarks {
  GQuark width = g_quark_from_static_string("width");
  GQuark height = g_quark_from_static_string("height");
  GQuark framerate = g_quark_from_static_string("framerate");
  GQuark pixelAspectRatio = g_quark_from_static_string("pixel-aspect-ratio");
  GQuark format = g_quark_from_static_string("format");
  GQuark rate = g_quark_from_static_string("rate");
  GQuark channels = g_quark_from_static_string("channels");
  GQuark channelMask = g_quark_from_static_string("channel-mask");
  GQuark streamFormat = g_quark_from_static_string("stream-format");
  GQuark alignment = g_quark_from_static_string("alignment");
  GQuark codecData = g_quark_from_static_string("codec_data");
};

const FieldQuarks& Quarks() {
  static const FieldQuarks quarks;
  return quarks;
}

void TakeValue(GstStructure* s, GQuark name, GValue& value) {
  gst_structure_id_take_value(s, name, &value);
}

void TakeValue(GstStructure* s, const char* name, GValue& value) {
  gst_structure_id_take_value(s, g_quark_from_static_string(name), &value);
}

template <class Name>
void SetInt(GstStructure* s, Name name, int number) {
  GValue value = G_VALUE_INIT;
  g_value_init(&value, G_TYPE_INT);
  g_value_set_int(&value, number);
  TakeValue(s, name, value);
}

void SetBoolean(GstStructure* s, const char* name, bool flag) {
  GValue value = G_VALUE_INIT;
  g_value_init(&value, G_TYPE_BOOLEAN);
  g_value_set_boolean(&value, flag ? TRUE : FALSE);
  TakeValue(s, name, value);
}

// `text` lives as long as the program: the table's texts and GStreamer's format names.
template <class Name>
void SetStaticString(GstStructure* s, Name name, const char* text) {
  GValue value = G_VALUE_INIT;
  g_value_init(&value, G_TYPE_STRING);
  g_value_set_static_string(&value, text);
  TakeValue(s, name, value);
}

template <class Name>
void SetFraction(GstStructure* s, Name name, int numerator, int denominator) {
  GValue value = G_VALUE_INIT;
  g_value_init(&value, GST_TYPE_FRACTION);
  gst_value_set_fraction(&value, numerator, denominator);
  TakeValue(s, name, value);
}

int CapsInt(const std::string& setting, long long value) {
  if (value < 0 || value > INT_MAX)
    Fail(setting, std::to_string(value) + " is outside GStreamer's integer range");
  return static_cast<int>(value);
}

void SetField(GstStructure* s, const CapsField& field) {
  switch (field.type) {
    case CapsFieldType::kNone:
      break;
    case CapsFieldType::kString:
      SetStaticString(s, field.name, field.text);
      break;
    case CapsFieldType::kInt:
      SetInt(s, field.name, field.number);
      break;
    case CapsFieldType::kBoolean:
      SetBoolean(s, field.name, field.number != 0);
      break;
  }
}

void SetVideo(GstStructure* s, IFormatCodecVideo& video, const CapsMapping& row) {
  if (std::strcmp(row.mediaType, "video/x-raw") == 0) {
    if (!video.ExistsPixelFormat())
      Fail(IFormatCodecVideo::TAG_PIX_FMT, "raw video needs the pixel format");
    const char* format = GstPixelFormat(video.GetPixelFormat());
    if (!format)
      Fail(IFormatCodecVideo::TAG_PIX_FMT,
           "pixel format " + std::to_string(video.GetPixelFormat()) + " has no GStreamer format");
    SetStaticString(s, Quarks().format, format);
  }
  if (video.ExistsWidth())
    SetInt(s, Quarks().width, CapsInt(IFormatCodecVideo::TAG_WIDTH, video.GetWidth()));
  if (video.ExistsHeight())
    SetInt(s, Quarks().height, CapsInt(IFormatCodecVideo::TAG_HEIGHT, video.GetHeight()));
  if (video.ExistsFrameRateNum() && video.ExistsFrameRateDen()) {
    const int den = CapsInt(IFormatCodecVideo::TAG_TIMEBASE_D, video.GetFrameRateDen());
    if (den == 0) Fail(IFormatCodecVideo::TAG_TIMEBASE_D, "a frame rate denominator of 0");
    SetFraction(s, Quarks().framerate,
                CapsInt(IFormatCodecVideo::TAG_TIMEBASE_N, video.GetFrameRateNum()), den);
  }
  if (video.ExistsPixelAspectX() && video.ExistsPixelAspectY()) {
    const int x = CapsInt(IFormatCodecVideo::TAG_ASPECTX, video.GetPixelAspectX());
    const int y = CapsInt(IFormatCodecVideo::TAG_ASPECTY, video.GetPixelAspectY());
    if (x == 0 || y == 0)
      Fail(x == 0 ? IFormatCodecVideo::TAG_ASPECTX : IFormatCodecVideo::TAG_ASPECTY,
           "a pixel aspect of 0");
    SetFraction(s, Quarks().pixelAspectRatio, x, y);
  }
}

void SetAudio(GstStructure* s, IFormatCodecAudio& audio) {
  if (audio.ExistsSampleRate()) {
    const int rate = audio.GetSampleRate();
    if (rate <= 0)
      Fail(IFormatCodecAudio::TAG_SAMPLE_RATE,
           "expected a positive rate, found " + std::to_string(rate));
    SetInt(s, Quarks().rate, rate);
  }
  if (audio.ExistsChannelLayout()) {
    const std::uint32_t layout = audio.GetChannelLayout();
    const guint64 mask = ToChannelMask(layout);
    const int channels = SpeakerCount(layout);
    if (channels == 0) Fail(IFormatCodecAudio::TAG_LAYOUT, "a layout without speakers");
    SetInt(s, Quarks().channels, channels);
    // One channel at the front centre is GStreamer's mono, which has no position; a single
    // channel anywhere else keeps its position, or it would read back as mono.
    if (channels > 1 || layout != Conf::CH_LAYOUT_MONO) {
      GValue value = G_VALUE_INIT;
      g_value_init(&value, GST_TYPE_BITMASK);
      gst_value_set_bitmask(&value, mask);
      TakeValue(s, Quarks().channelMask, value);
    }
  }
}

void SetPrivateData(GstStructure* s, IFormatCodec& description, const CapsMapping& row) {
  const boost::intrusive_ptr<IBlob> blob = description.GetPrivateData();
  const bool present = blob && blob->GetSize() > 0;
  const bool byteStream = present && CodecString::IsByteStream(blob->GetData(), blob->GetSize());
  const bool packaged = present && !byteStream;
  if (row.packagedFormat || row.bareFormat)
    SetStaticString(s, Quarks().streamFormat,
                    packaged && row.packagedFormat ? row.packagedFormat : row.bareFormat);
  if (row.alignment) SetStaticString(s, Quarks().alignment, row.alignment);
  // An Annex B byte stream carries its parameter sets in band.
  if (!present || (byteStream && row.bareFormat)) return;
  if (HasRecord(row.codecId))
    CheckRecord(row.codecId, blob->GetData(), blob->GetSize(), "private data");
  GValue value = G_VALUE_INIT;
  g_value_init(&value, GST_TYPE_BUFFER);
  gst_value_take_buffer(&value, gst_buffer_new_memdup(blob->GetData(), blob->GetSize()));
  TakeValue(s, Quarks().codecData, value);
}

// ----- Reading caps into a description --------------------------------------------------------

void ReadVideo(const GstStructure* s, IFormatCodecVideo& video, bool raw,
               std::vector<const char*>& used) {
  if (raw) {
    const GValue* format = Field(s, "format", G_TYPE_STRING, "a string");
    if (!format) Fail("format", "missing; raw video needs its pixel format");
    const AVPixelFormat pixelFormat = LibavPixelFormat(g_value_get_string(format));
    if (pixelFormat == AV_PIX_FMT_NONE)
      Fail("format",
           std::string("'") + g_value_get_string(format) + "' has no libavutil pixel format");
    video.SetPixelFormat(pixelFormat);
    used.push_back("format");
  }
  const bool sized = gst_structure_has_field(s, "width") && gst_structure_has_field(s, "height");
  if (sized) {
    const int width = PositiveInt(s, "width");
    const int height = PositiveInt(s, "height");
    int x = 1;
    int y = 1;
    if (const GValue* par = Field(s, "pixel-aspect-ratio", GST_TYPE_FRACTION, "a fraction")) {
      x = gst_value_get_fraction_numerator(par);
      y = gst_value_get_fraction_denominator(par);
      if (x <= 0) Fail("pixel-aspect-ratio", "expected a positive fraction");
      used.push_back("pixel-aspect-ratio");
    }
    video.InitByPixelAspect(static_cast<unsigned>(width), static_cast<unsigned>(height),
                            static_cast<unsigned>(x), static_cast<unsigned>(y));
    used.push_back("width");
    used.push_back("height");
  }
  if (const GValue* rate = Field(s, "framerate", GST_TYPE_FRACTION, "a fraction")) {
    const int num = gst_value_get_fraction_numerator(rate);
    if (num < 0) Fail("framerate", "expected a non-negative fraction");
    video.SetFrameRate(static_cast<unsigned>(num),
                       static_cast<unsigned>(gst_value_get_fraction_denominator(rate)));
    used.push_back("framerate");
  }
}

AVSampleFormat LibavSampleFormat(const GstAudioFormatInfo& info, bool planar) {
  const bool isFloat = GST_AUDIO_FORMAT_INFO_IS_FLOAT(&info);
  const int width = GST_AUDIO_FORMAT_INFO_WIDTH(&info);
  AVSampleFormat packed = AV_SAMPLE_FMT_NONE;
  if (isFloat)
    packed = width == 32 ? AV_SAMPLE_FMT_FLT : AV_SAMPLE_FMT_DBL;
  else if (width == 8)
    packed = AV_SAMPLE_FMT_U8;
  else if (width == 16)
    packed = AV_SAMPLE_FMT_S16;
  else if (width <= 32)
    packed = AV_SAMPLE_FMT_S32;
  return planar ? av_get_planar_sample_fmt(packed) : packed;
}

void ReadAudio(const GstStructure* s, IFormatCodecAudio& audio, const CapsMapping& row,
               std::vector<const char*>& used) {
  if (gst_structure_has_field(s, "rate")) {
    audio.SetSampleRate(PositiveInt(s, "rate"));
    used.push_back("rate");
  }
  if (gst_structure_has_field(s, "channels")) {
    const int channels = PositiveInt(s, "channels");
    std::uint32_t layout = 0;
    const GValue* mask = Field(s, "channel-mask", GST_TYPE_BITMASK, "a bitmask");
    if (mask && gst_value_get_bitmask(mask) != 0) {
      layout = FromChannelMask(gst_value_get_bitmask(mask));
      if (SpeakerCount(layout) != channels)
        Fail("channel-mask", "names " + std::to_string(SpeakerCount(layout)) + " positions for " +
                                 std::to_string(channels) + " channels");
    } else {
      AVChannelLayout usual;
      av_channel_layout_default(&usual, channels);
      if (usual.order == AV_CHANNEL_ORDER_NATIVE) layout = static_cast<std::uint32_t>(usual.u.mask);
      av_channel_layout_uninit(&usual);
      if (!layout) Fail("channels", std::to_string(channels) + " channels have no usual layout");
    }
    if (mask) used.push_back("channel-mask");
    audio.SetChannelLayout(static_cast<Conf::ChannelLayout>(layout));
    used.push_back("channels");
  }
  if (std::strcmp(row.mediaType, "audio/x-raw") == 0) {
    const GstAudioFormat format = gst_audio_format_from_string(row.fields[0].text);
    if (format == GST_AUDIO_FORMAT_UNKNOWN)
      Fail("format", std::string(row.fields[0].text) + " is not known to this GStreamer");
    const GstAudioFormatInfo* info = gst_audio_format_get_info(format);
    audio.SetSampleFormat(
        LibavSampleFormat(*info, std::strcmp(row.fields[1].text, "non-interleaved") == 0));
  }
}

void ReadPrivateData(const GstStructure* s, IFormatCodec& description, const CapsMapping& row,
                     std::string& codecId, std::vector<const char*>& used) {
  const GValue* format = Field(s, "stream-format", G_TYPE_STRING, "a string");
  const char* streamFormat = format ? g_value_get_string(format) : nullptr;
  const bool packaged =
      streamFormat && row.packagedFormat && std::strcmp(streamFormat, row.packagedFormat) == 0;
  if (packaged ||
      (streamFormat && row.bareFormat && std::strcmp(streamFormat, row.bareFormat) == 0))
    used.push_back("stream-format");
  const GValue* alignment = Field(s, "alignment", G_TYPE_STRING, "a string");
  if (alignment && row.alignment && std::strcmp(g_value_get_string(alignment), row.alignment) == 0)
    used.push_back("alignment");
  const GValue* data = Field(s, "codec_data", GST_TYPE_BUFFER, "a buffer");
  const bool needsRecord = packaged && std::strcmp(row.packagedFormat, row.bareFormat) != 0;
  if (!data) {
    if (needsRecord)
      Fail("codec_data", std::string("missing; stream-format ") + streamFormat + " needs it");
    return;
  }
  GstBuffer* buffer = gst_value_get_buffer(data);
  GstMapInfo map;
  if (!buffer || !gst_buffer_map(buffer, &map, GST_MAP_READ))
    Fail("codec_data", "the buffer cannot be read");
  struct Unmap {
    GstBuffer* buffer;
    GstMapInfo* map;
    ~Unmap() { gst_buffer_unmap(buffer, map); }
  } unmap{buffer, &map};
  const bool annexB = CodecString::IsByteStream(map.data, map.size);
  if (HasRecord(codecId) && (needsRecord || !annexB || !row.bareFormat))
    CheckRecord(codecId, map.data, map.size, "codec_data");
  if (codecId.compare(0, 3, "aac") == 0) {
    const int type = CodecString::ParseAacConfig(map.data, map.size).objectType;
    codecId = type == 5 ? "aac_he" : type == 29 ? "aac_he_v2" : "aac";
  }
  description.SetPrivateData(CreateBlob(map.data, map.size));
  used.push_back("codec_data");
}

// Every field that has no place in the interfaces, as a typed child of the metadata.
void KeepUnmapped(const GstStructure* s, IFormatCodec& description,
                  const std::vector<const char*>& used) {
  Core::Property metadata = description.GetMetadata();
  bool added = false;
  const int fields = gst_structure_n_fields(s);
  for (int i = 0; i < fields; ++i) {
    const char* name = gst_structure_nth_field_name(s, static_cast<guint>(i));
    bool mapped = false;
    for (const char* known : used) mapped = mapped || std::strcmp(known, name) == 0;
    if (mapped) continue;
    const GValue* value = gst_structure_get_value(s, name);
    const GType type = G_VALUE_TYPE(value);
    if (type == G_TYPE_INT)
      metadata.SetChildT<long long>(name, g_value_get_int(value));
    else if (type == G_TYPE_UINT)
      metadata.SetChildT<long long>(name, g_value_get_uint(value));
    else if (type == G_TYPE_INT64)
      metadata.SetChildT<long long>(name, g_value_get_int64(value));
    else if (type == G_TYPE_BOOLEAN)
      metadata.SetChildT<bool>(name, g_value_get_boolean(value) != FALSE);
    else if (type == G_TYPE_STRING)
      metadata.SetChildT<std::string>(name, g_value_get_string(value));
    else {
      Text text(gst_value_serialize(value));
      metadata.SetChildT<std::string>(name, text ? text.get() : "");
    }
    added = true;
  }
  if (added) description.SetMetadata(metadata);
}

}  // namespace

GstCaps* ToCaps(const boost::intrusive_ptr<IFormatCodec>& description) {
  if (!description) Fail("", "no description");
  const int codecType = description->GetCodecType();
  if (codecType != 0 && codecType != 1 && codecType != 3)
    Fail("",
         "a generic codec description has no media type: use a video, audio or subtitle "
         "description");
  if (!description->ExistsCodecID())
    Fail(IFormatCodec::TAG_CODEC_ID, "missing; the media type follows from it");
  const std::string codecId = description->GetCodecID();
  const CapsMapping* row = FindCapsMapping(codecId, codecType);
  if (!row) Fail(IFormatCodec::TAG_CODEC_ID, "'" + codecId + "' has no GStreamer media type");
  GstStructure* s = gst_structure_new_id_empty(g_quark_from_static_string(row->mediaType));
  CapsPtr caps(gst_caps_new_full(s, nullptr));
  SetField(s, row->fields[0]);
  SetField(s, row->fields[1]);
  if (codecType == 0)
    SetVideo(s, dynamic_cast<IFormatCodecVideo&>(*description), *row);
  else if (codecType == 1)
    SetAudio(s, dynamic_cast<IFormatCodecAudio&>(*description));
  SetPrivateData(s, *description, *row);
  return caps.release();
}

std::string ToCapsString(const boost::intrusive_ptr<IFormatCodec>& description) {
  const CapsPtr caps(ToCaps(description));
  const Text text(gst_caps_to_string(caps.get()));
  return text.get();
}

boost::intrusive_ptr<IFormatCodec> FromCaps(const GstCaps* caps) {
  if (!caps) Fail("", "no caps");
  if (gst_caps_is_any(caps)) Fail("", "ANY caps describe no stream");
  const guint size = gst_caps_get_size(caps);
  if (size != 1)
    Fail("", "caps with " + std::to_string(size) + " structures; a description needs one");
  const GstStructure* s = gst_caps_get_structure(caps, 0);
  const int fields = gst_structure_n_fields(s);
  for (int i = 0; i < fields; ++i) {
    const char* name = gst_structure_nth_field_name(s, static_cast<guint>(i));
    const GValue* value = gst_structure_get_value(s, name);
    if (!gst_value_is_fixed(value)) {
      const Text text(gst_value_serialize(value));
      Fail(name, std::string("not fixed: ") + (text ? text.get() : "a range or list"));
    }
  }
  const CapsMapping& row = FindRow(s);
  std::vector<const char*> used;
  for (const CapsField& field : row.fields)
    if (field.name) used.push_back(field.name);
  boost::intrusive_ptr<IFormatCodec> description;
  if (row.codecType == 0) {
    auto video = Conf::FormatCodecVideo::Create();
    ReadVideo(s, *video, std::strcmp(row.mediaType, "video/x-raw") == 0, used);
    description = video;
  } else if (row.codecType == 1) {
    auto audio = Conf::FormatCodecAudio::Create();
    ReadAudio(s, *audio, row, used);
    description = audio;
  } else {
    description = Conf::FormatCodecSubtitle::Create();
  }
  std::string codecId = row.codecId;
  ReadPrivateData(s, *description, row, codecId, used);
  description->SetCodecID(codecId);
  KeepUnmapped(s, *description, used);
  return description;
}

boost::intrusive_ptr<IFormatCodec> FromCapsString(const std::string& text) {
  const CapsPtr caps(gst_caps_from_string(text.c_str()));
  if (!caps) Fail("", "'" + text + "' is not a caps string");
  return FromCaps(caps.get());
}

}  // namespace GStreamer
}  // namespace Tarvek
