#include <Tarvek/CodecString/CodecString.h>

#include <Tarvek/Conf/Interfaces/IFormatCodecAudio.h>
#include <Tarvek/Conf/Interfaces/IFormatCodecVideo.h>
#include <Tarvek/Core/Errors/AddStack.h>

#include <boost/current_function.hpp>
#include <cstdio>
#include <cstring>

extern "C" {
#include <libavutil/pixdesc.h>
}

namespace Tarvek {
namespace CodecString {
namespace {

using Conf::IFormatCodec;
using Conf::IFormatCodecAudio;
using Conf::IFormatCodecVideo;

[[noreturn]] void Fail(const std::string& what) {
  ThrowWithLocation(__LINE__, __FILE__, BOOST_CURRENT_FUNCTION,
                    AddStack(CodecStringError() << DescriptionInfo(what)));
}

std::string Format(const char* format, unsigned a, unsigned b = 0, unsigned c = 0, unsigned d = 0) {
  char text[64];
  std::snprintf(text, sizeof text, format, a, b, c, d);
  return text;
}

constexpr long long FourCC(const char (&code)[5]) {
  return static_cast<long long>(
      static_cast<std::uint32_t>(code[0]) | static_cast<std::uint32_t>(code[1]) << 8 |
      static_cast<std::uint32_t>(code[2]) << 16 | static_cast<std::uint32_t>(code[3]) << 24);
}

// The sample entry a stream is packaged under: `alternative` when the codec tag names it.
const char* SampleEntry(IFormatCodec& description, const char (&usual)[5],
                        const char (&alternative)[5]) {
  return description.ExistsCodecTag() && description.GetCodecTag() == FourCC(alternative)
             ? alternative
             : usual;
}

struct Data {
  const std::uint8_t* bytes = nullptr;
  std::size_t size = 0;
};

Data PrivateData(const boost::intrusive_ptr<IBlob>& blob) {
  return blob ? Data{blob->GetData(), blob->GetSize()} : Data{};
}

[[noreturn]] void Missing(const std::string& codec, const std::string& what) {
  Fail(codec + ": the codec string needs " + what);
}

std::string H264(IFormatCodec& description, Data data) {
  if (!data.size) Missing("h264", "the avcC record or a sequence parameter set (no private data)");
  const AvcConfig config = IsByteStream(data.bytes, data.size)
                               ? ParseAvcByteStream(data.bytes, data.size)
                               : ParseAvcConfig(data.bytes, data.size);
  return std::string(SampleEntry(description, "avc1", "avc3")) +
         Format(".%02x%02x%02x", config.profile, config.compatibility, config.level);
}

std::string Hevc(IFormatCodec& description, Data data) {
  if (!data.size) Missing("hevc", "the hvcC record or a sequence parameter set (no private data)");
  const HevcConfig config = IsByteStream(data.bytes, data.size)
                                ? ParseHevcByteStream(data.bytes, data.size)
                                : ParseHevcConfig(data.bytes, data.size);
  std::string text = SampleEntry(description, "hvc1", "hev1");
  text += '.';
  if (config.profileSpace) text += static_cast<char>('A' + config.profileSpace - 1);
  std::uint32_t reversed = 0;
  for (int bit = 0; bit < 32; ++bit)
    reversed |= ((config.compatibilityFlags >> bit) & 1u) << (31 - bit);
  text += Format("%u.%X.%c%u", config.profile, reversed, config.highTier ? 'H' : 'L', config.level);
  std::size_t last = 6;
  while (last > 0 && config.constraintFlags[last - 1] == 0) --last;
  for (std::size_t i = 0; i < last; ++i) text += Format(".%X", config.constraintFlags[i]);
  return text;
}

// Level of a VP9 stream from its picture size and luma sample rate, as the VP9 level
// definitions bound them; the lowest level that admits both.
unsigned Vp9Level(long long pictureSize, double sampleRate) {
  struct Level {
    unsigned level;
    double maxSampleRate;
    long long maxPictureSize;
  };
  static constexpr Level kLevels[] = {
      {10, 829440, 36864},          {11, 2764800, 73728},        {20, 4608000, 122880},
      {21, 9216000, 245760},        {30, 20736000, 552960},      {31, 36864000, 983040},
      {40, 83558400, 2228224},      {41, 160432128, 2228224},    {50, 311951360, 8912896},
      {51, 588251136, 8912896},     {52, 1176502272, 8912896},   {60, 1176502272, 35651584},
      {61, 2353004544.0, 35651584}, {62, 4706009088.0, 35651584}};
  for (const Level& level : kLevels)
    if (pictureSize <= level.maxPictureSize && sampleRate <= level.maxSampleRate)
      return level.level;
  Fail("vp9: the picture size and frame rate exceed level 6.2");
}

std::string Vp9(IFormatCodec& description, Data data) {
  if (data.size && !IsByteStream(data.bytes, data.size)) {
    const Vp9Config config = ParseVp9Config(data.bytes, data.size);
    return Format("vp09.%02u.%02u.%02u", config.profile, config.level, config.bitDepth);
  }
  auto* video = dynamic_cast<IFormatCodecVideo*>(&description);
  if (!video || !video->ExistsPixelFormat())
    Missing("vp9", "a vpcC record in the private data, or the pixel format (pix_fmt)");
  const AVPixFmtDescriptor* format = av_pix_fmt_desc_get(video->GetPixelFormat());
  if (!format || format->nb_components < 3 || (format->flags & AV_PIX_FMT_FLAG_RGB) != 0)
    Fail("vp9: pixel format (pix_fmt) " + std::to_string(video->GetPixelFormat()) +
         " is not a YUV format VP9 can carry");
  const unsigned depth = static_cast<unsigned>(format->comp[0].depth);
  if (depth != 8 && depth != 10 && depth != 12)
    Fail("vp9: pixel format (pix_fmt) " + std::string(format->name) +
         " has a bit depth other than 8, 10 or 12");
  const bool subsampled420 = format->log2_chroma_w == 1 && format->log2_chroma_h == 1;
  const unsigned profile = (depth > 8 ? 2u : 0u) + (subsampled420 ? 0u : 1u);
  if (!video->ExistsWidth() || !video->ExistsHeight())
    Missing("vp9", "a vpcC record in the private data, or the size (width, height)");
  const long long pictureSize =
      static_cast<long long>(video->GetWidth()) * static_cast<long long>(video->GetHeight());
  const double sampleRate = video->ExistsFrameRateNum() && video->ExistsFrameRateDen()
                                ? static_cast<double>(pictureSize) * video->GetFrameRate()
                                : 0.0;
  return Format("vp09.%02u.%02u.%02u", profile, Vp9Level(pictureSize, sampleRate), depth);
}

std::string Av1(Data data) {
  if (!data.size) Missing("av1", "the av1C record (no private data)");
  const Av1Config config = ParseAv1Config(data.bytes, data.size);
  return Format("av01.%u.%02u%c.%02u", config.profile, config.level, config.highTier ? 'H' : 'M',
                config.bitDepth);
}

std::string Aac(const std::string& codecId, Data data) {
  if (data.size)
    return Format("mp4a.40.%u",
                  static_cast<unsigned>(ParseAacConfig(data.bytes, data.size).objectType));
  return codecId == "aac_he" ? "mp4a.40.5" : codecId == "aac_he_v2" ? "mp4a.40.29" : "mp4a.40.2";
}

std::string Mp3(IFormatCodec& description) {
  auto* audio = dynamic_cast<IFormatCodecAudio*>(&description);
  // MPEG-2's lower sampling frequencies (below 32 kHz) have an object type of their own.
  const bool lowRate = audio && audio->ExistsSampleRate() && audio->GetSampleRate() < 32000;
  return lowRate ? "mp4a.69" : "mp4a.6B";
}

// MPEG-4 Visual: the profile_and_level_indication after the visual object sequence start code.
std::string Mpeg4(Data data) {
  for (std::size_t i = 0; data.bytes && i + 4 < data.size; ++i)
    if (data.bytes[i] == 0 && data.bytes[i + 1] == 0 && data.bytes[i + 2] == 1 &&
        data.bytes[i + 3] == 0xB0)
      return Format("mp4v.20.%u", data.bytes[i + 4]);
  return "mp4v.20";
}

// Codecs whose string is fixed by the codec identifier alone.
struct Fixed {
  const char* codecId;
  const char* text;
};
constexpr Fixed kFixed[] = {
    {"ac3", "ac-3"},           {"alac", "alac"},      {"dnxhd", "AVdn"},
    {"dnxhr_444", "AVdh"},     {"dnxhr_hq", "AVdh"},  {"dnxhr_hqx", "AVdh"},
    {"dnxhr_lb", "AVdh"},      {"dnxhr_sq", "AVdh"},  {"eac3", "ec-3"},
    {"flac", "fLaC"},          {"mov_text", "tx3g"},  {"mpeg2video", "mp4v.61"},
    {"opus", "opus"},          {"prores", "apcn"},    {"prores_4444", "ap4h"},
    {"prores_4444xq", "ap4x"}, {"prores_hq", "apch"}, {"prores_lt", "apcs"},
    {"prores_proxy", "apco"},  {"vorbis", "vorbis"},  {"webvtt", "wvtt"},
};

}  // namespace

std::string GetCodecString(const boost::intrusive_ptr<IFormatCodec>& description) {
  if (!description) Fail("no description");
  if (!description->ExistsCodecID()) Fail("the codec string needs the codec identifier (codec_id)");
  const std::string codecId = description->GetCodecID();
  const boost::intrusive_ptr<IBlob> blob = description->GetPrivateData();
  const Data data = PrivateData(blob);
  if (codecId == "h264") return H264(*description, data);
  if (codecId == "hevc") return Hevc(*description, data);
  if (codecId == "vp9") return Vp9(*description, data);
  if (codecId == "av1") return Av1(data);
  if (codecId == "aac" || codecId == "aac_he" || codecId == "aac_he_v2") return Aac(codecId, data);
  if (codecId == "mp3") return Mp3(*description);
  if (codecId == "mpeg4") return Mpeg4(data);
  for (const Fixed& fixed : kFixed)
    if (codecId == fixed.codecId) return fixed.text;
  Fail("codec " + codecId + " has no streaming codec string");
}

}  // namespace CodecString
}  // namespace Tarvek
