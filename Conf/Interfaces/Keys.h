// The description keys with their hashes worked out once (Tarvek::Core::PropertyKey), for look-ups
// that run again and again: every description accessor reads through one of these. Each is built
// from its TAG_* text when the configuration interface library is loaded, in the same translation
// unit as the texts, so nothing depends on the order in which libraries are initialised.
#ifndef TARVEK_CONF_INTERFACES_KEYS_H_
#define TARVEK_CONF_INTERFACES_KEYS_H_

#include "../../Core/Interfaces/Property.h"
#include "Export.h"

namespace Tarvek {
namespace Conf {
namespace Keys {

/// The key IFormat::TAG_METADATA.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey Metadata;
/// The key IFormatCodec::TAG_NAME.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey CodecName;
/// The key IFormatCodec::TAG_CODEC_ID.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey CodecId;
/// The key IFormatCodec::TAG_FOURCC.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey Fourcc;
/// The key IFormatCodec::TAG_BITRATE_MODE.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey BitrateMode;
/// The key IFormatCodec::TAG_BITRATE.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey Bitrate;
/// The key IFormatCodec::TAG_QUALITY.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey Quality;
/// The key IFormatCodec::TAG_LOSSLESS.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey Lossless;
/// The key IFormatCodec::TAG_THREAD_NUMBER.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey ThreadNumber;
/// The key IFormatCodec::TAG_TWO_PASS_ENCODING.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey TwoPassEncoding;
/// The key IFormatCodec::TAG_GLOBAL_HEADER.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey GlobalHeader;
/// The key IFormatCodec::TAG_MAIN_STREAM.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey MainStream;
/// The key IFormatCodec::TAG_CODEC_OPTIONS_ENCODE.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey CodecOptionsEncode;
/// The key IFormatCodec::TAG_CODEC_OPTIONS_ANALYZE.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey CodecOptionsAnalyze;
/// The key IFormatCodec::TAG_LANGUAGE.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey Language;
/// The key IFormatFile::TAG_TITLE.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey Title;
/// The key IFormatCodecVideo::TAG_WIDTH.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey Width;
/// The key IFormatCodecVideo::TAG_HEIGHT.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey Height;
/// The key IFormatCodecVideo::TAG_ASPECTX.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey AspectX;
/// The key IFormatCodecVideo::TAG_ASPECTY.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey AspectY;
/// The key IFormatCodecVideo::TAG_TIMEBASE_N.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey TimebaseN;
/// The key IFormatCodecVideo::TAG_TIMEBASE_D.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey TimebaseD;
/// The key IFormatCodecVideo::TAG_PIX_FMT.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey PixFmt;
/// The key IFormatCodecAudio::TAG_SAMPLE_RATE.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey SampleRate;
/// The key IFormatCodecAudio::TAG_LAYOUT.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey Layout;
/// The key IFormatCodecAudio::TAG_FRAME_SIZE.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey FrameSize;
/// The key IFormatCodecAudio::TAG_SAMPLE_FORMAT.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey SampleFormat;
/// The key IFormatCodecSubtitle::TAG_SUBTITLE_AUTHOR.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey SubtitleAuthor;
/// The key IFormatCodecSubtitle::TAG_SUBTITLE_HEADER.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey SubtitleHeader;
/// The key IFormatCodecSubtitle::TAG_DVB_WIDTH.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey DvbWidth;
/// The key IFormatCodecSubtitle::TAG_DVB_HEIGHT.
extern TARVEK_CONF_INTERFACES_API const Core::PropertyKey DvbHeight;

}  // namespace Keys
}  // namespace Conf
}  // namespace Tarvek

#endif  // TARVEK_CONF_INTERFACES_KEYS_H_
