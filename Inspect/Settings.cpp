#include "Settings.h"

#include "../Conf/Interfaces/IFormatCodec.h"
#include "../Conf/Interfaces/IFormatCodecAudio.h"
#include "../Conf/Interfaces/IFormatCodecSubtitle.h"
#include "../Conf/Interfaces/IFormatCodecVideo.h"
#include "../Conf/Interfaces/IFormatFile.h"

namespace Tarvek {
namespace Conf {
namespace {

using Codec = IFormatCodec;
using Video = IFormatCodecVideo;
using Audio = IFormatCodecAudio;
using Subtitle = IFormatCodecSubtitle;

std::vector<Setting> CodecSettings() {
  return {
      {"", IFormat::TAG_METADATA, PropertyTypeContainer, ValueRange::Int64, ""},
      {"", Codec::TAG_NAME, PropertyTypeString, ValueRange::Int64, "--codec-name"},
      {"", Codec::TAG_CODEC_ID, PropertyTypeString, ValueRange::Int64, "--codec-id"},
      {"", Codec::TAG_FOURCC, PropertyTypeInt64, ValueRange::Int64, "--tag"},
      {"", Codec::TAG_BITRATE_MODE, PropertyTypeString, ValueRange::Int64, "--bitrate-mode"},
      {"", Codec::TAG_BITRATE, PropertyTypeInt64, ValueRange::Int64, "--bitrate"},
      {"", Codec::TAG_QUALITY, PropertyTypeInt64, ValueRange::Int64, "--quality"},
      {"", Codec::TAG_LOSSLESS, PropertyTypeBool, ValueRange::Int64, "--lossless"},
      {"", Codec::TAG_THREAD_NUMBER, PropertyTypeInt64, ValueRange::Unsigned32, "--threads"},
      {"", Codec::TAG_TWO_PASS_ENCODING, PropertyTypeBool, ValueRange::Int64, "--two-pass"},
      {"", Codec::TAG_GLOBAL_HEADER, PropertyTypeBool, ValueRange::Int64, "--global-header"},
      {"", Codec::TAG_MAIN_STREAM, PropertyTypeBool, ValueRange::Int64, "--main-stream"},
      {"", Codec::TAG_CODEC_OPTIONS_ENCODE, PropertyTypeContainer, ValueRange::Int64,
       "--encode-option"},
      {"", Codec::TAG_CODEC_OPTIONS_ANALYZE, PropertyTypeContainer, ValueRange::Int64,
       "--analyze-option"},
  };
}

std::vector<Setting> With(std::vector<Setting> own) {
  std::vector<Setting> all = CodecSettings();
  all.insert(all.end(), own.begin(), own.end());
  return all;
}

}  // namespace

std::optional<FormatKind> KindOf(const IFormat* description) noexcept {
  if (dynamic_cast<const IFormatCodecVideo*>(description) != nullptr) return FormatKind::Video;
  if (dynamic_cast<const IFormatCodecAudio*>(description) != nullptr) return FormatKind::Audio;
  if (dynamic_cast<const IFormatCodecSubtitle*>(description) != nullptr) {
    return FormatKind::Subtitle;
  }
  if (dynamic_cast<const IFormatCodec*>(description) != nullptr) return FormatKind::Codec;
  return std::nullopt;
}

const char* KindName(FormatKind kind) noexcept {
  switch (kind) {
    case FormatKind::Video:
      return "video";
    case FormatKind::Audio:
      return "audio";
    case FormatKind::Subtitle:
      return "subtitle";
    case FormatKind::Codec:
      break;
  }
  return "codec";
}

std::optional<FormatKind> KindFromName(const std::string& name) noexcept {
  for (const FormatKind kind :
       {FormatKind::Codec, FormatKind::Video, FormatKind::Audio, FormatKind::Subtitle}) {
    if (name == KindName(kind)) return kind;
  }
  return std::nullopt;
}

const char* KindPhrase(FormatKind kind) noexcept {
  switch (kind) {
    case FormatKind::Video:
      return "a video description";
    case FormatKind::Audio:
      return "an audio description";
    case FormatKind::Subtitle:
      return "a subtitle description";
    case FormatKind::Codec:
      break;
  }
  return "a generic codec description";
}

const std::vector<Setting>& SettingsOf(FormatKind kind) {
  static const std::vector<Setting> codec = CodecSettings();
  static const std::vector<Setting> video = With({
      {"", Video::TAG_WIDTH, PropertyTypeInt64, ValueRange::Unsigned32, "--size"},
      {"", Video::TAG_HEIGHT, PropertyTypeInt64, ValueRange::Unsigned32, "--size"},
      {"", Video::TAG_ASPECTX, PropertyTypeInt64, ValueRange::Unsigned32, "--size"},
      {"", Video::TAG_ASPECTY, PropertyTypeInt64, ValueRange::Unsigned32, "--size"},
      {"", Video::TAG_TIMEBASE_N, PropertyTypeInt64, ValueRange::Unsigned32, "--frame-rate"},
      {"", Video::TAG_TIMEBASE_D, PropertyTypeInt64, ValueRange::Unsigned32, "--frame-rate"},
      {"", Video::TAG_PIX_FMT, PropertyTypeInt64, ValueRange::Signed32, "--pix-fmt"},
  });
  static const std::vector<Setting> audio = With({
      {IFormat::TAG_METADATA, Codec::TAG_LANGUAGE, PropertyTypeString, ValueRange::Int64,
       "--language"},
      {"", Audio::TAG_SAMPLE_RATE, PropertyTypeInt64, ValueRange::Signed32, "--sample-rate"},
      {"", Audio::TAG_LAYOUT, PropertyTypeInt64, ValueRange::Unsigned32, "--layout"},
      {"", Audio::TAG_FRAME_SIZE, PropertyTypeInt64, ValueRange::Signed32, "--frame-size"},
      {"", Audio::TAG_SAMPLE_FORMAT, PropertyTypeInt64, ValueRange::Signed32, "--sample-fmt"},
  });
  static const std::vector<Setting> subtitle = With({
      {"", Codec::TAG_LANGUAGE, PropertyTypeString, ValueRange::Int64, "--language"},
      {"", IFormatFile::TAG_TITLE, PropertyTypeString, ValueRange::Int64, "--title"},
      {"", Subtitle::TAG_SUBTITLE_AUTHOR, PropertyTypeString, ValueRange::Int64, "--author"},
      {"", Subtitle::TAG_SUBTITLE_HEADER, PropertyTypeString, ValueRange::Int64, "--header"},
      {"", Subtitle::TAG_DVB_WIDTH, PropertyTypeInt64, ValueRange::Unsigned32, "--dvb-size"},
      {"", Subtitle::TAG_DVB_HEIGHT, PropertyTypeInt64, ValueRange::Unsigned32, "--dvb-size"},
  });
  switch (kind) {
    case FormatKind::Video:
      return video;
    case FormatKind::Audio:
      return audio;
    case FormatKind::Subtitle:
      return subtitle;
    case FormatKind::Codec:
      break;
  }
  return codec;
}

}  // namespace Conf
}  // namespace Tarvek
