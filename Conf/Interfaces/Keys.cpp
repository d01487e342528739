// The configuration interface library: the texts of the description keys.
//
// Keys follow the option and field names media developers already know from the common encoding
// tools, so a printed description reads familiar. They must stay pairwise distinct.
#include <Tarvek/Conf/Interfaces/IFormat.h>
#include <Tarvek/Conf/Interfaces/IFormatCodec.h>
#include <Tarvek/Conf/Interfaces/IFormatCodecAudio.h>
#include <Tarvek/Conf/Interfaces/IFormatCodecSubtitle.h>
#include <Tarvek/Conf/Interfaces/IFormatCodecVideo.h>
#include <Tarvek/Conf/Interfaces/IFormatFile.h>
#include <Tarvek/Conf/Interfaces/Keys.h>

namespace Tarvek {
namespace Conf {

const std::string IFormat::TAG_METADATA = "metadata";

const std::string IFormatCodec::TAG_NAME = "codec_name";
const std::string IFormatCodec::TAG_CODEC_ID = "codec_id";
const std::string IFormatCodec::TAG_FOURCC = "codec_tag";
const std::string IFormatCodec::TAG_BITRATE_MODE = "bitrate_mode";
const std::string IFormatCodec::TAG_BITRATE_MODE_VBR = "vbr";
const std::string IFormatCodec::TAG_BITRATE = "bit_rate";
const std::string IFormatCodec::TAG_QUALITY = "quality";
const std::string IFormatCodec::TAG_LOSSLESS = "lossless";
const std::string IFormatCodec::TAG_THREAD_NUMBER = "threads";
const std::string IFormatCodec::TAG_TWO_PASS_ENCODING = "two_pass";
const std::string IFormatCodec::TAG_GLOBAL_HEADER = "global_header";
const std::string IFormatCodec::TAG_MAIN_STREAM = "main_stream";
const std::string IFormatCodec::TAG_CODEC_OPTIONS_ENCODE = "encode_options";
const std::string IFormatCodec::TAG_CODEC_OPTIONS_ANALYZE = "analyze_options";
const std::string IFormatCodec::TAG_LANGUAGE = "language";

const std::string IFormatCodecVideo::TAG_WIDTH = "width";
const std::string IFormatCodecVideo::TAG_HEIGHT = "height";
const std::string IFormatCodecVideo::TAG_ASPECTX = "sample_aspect_num";
const std::string IFormatCodecVideo::TAG_ASPECTY = "sample_aspect_den";
const std::string IFormatCodecVideo::TAG_TIMEBASE_N = "framerate_num";
const std::string IFormatCodecVideo::TAG_TIMEBASE_D = "framerate_den";
const std::string IFormatCodecVideo::TAG_PIX_FMT = "pix_fmt";
const std::string IFormatCodecVideo::TAG_FORMAT_CODEC_VIDEO = "video_codec";

const std::string IFormatCodecAudio::TAG_SAMPLE_RATE = "sample_rate";
const std::string IFormatCodecAudio::TAG_LAYOUT = "channel_layout";
const std::string IFormatCodecAudio::TAG_FRAME_SIZE = "frame_size";
const std::string IFormatCodecAudio::TAG_SAMPLE_FORMAT = "sample_fmt";
const std::string IFormatCodecAudio::TAG_FORMAT_CODEC_AUDIO = "audio_codec";

const std::string IFormatCodecSubtitle::TAG_SUBTITLE_AUTHOR = "author";
const std::string IFormatCodecSubtitle::TAG_SUBTITLE_HEADER = "subtitle_header";
const std::string IFormatCodecSubtitle::TAG_DVB_WIDTH = "dvb_width";
const std::string IFormatCodecSubtitle::TAG_DVB_HEIGHT = "dvb_height";
const std::string IFormatCodecSubtitle::TAG_FORMAT_CODEC_SUBTITLE = "subtitle_codec";

const std::string IFormatFile::TAG_TITLE = "title";

// Defined after the texts they are built from: within one translation unit, initialisation
// follows the order of definition.
namespace Keys {
const Core::PropertyKey Metadata(IFormat::TAG_METADATA);
const Core::PropertyKey CodecName(IFormatCodec::TAG_NAME);
const Core::PropertyKey CodecId(IFormatCodec::TAG_CODEC_ID);
const Core::PropertyKey Fourcc(IFormatCodec::TAG_FOURCC);
const Core::PropertyKey BitrateMode(IFormatCodec::TAG_BITRATE_MODE);
const Core::PropertyKey Bitrate(IFormatCodec::TAG_BITRATE);
const Core::PropertyKey Quality(IFormatCodec::TAG_QUALITY);
const Core::PropertyKey Lossless(IFormatCodec::TAG_LOSSLESS);
const Core::PropertyKey ThreadNumber(IFormatCodec::TAG_THREAD_NUMBER);
const Core::PropertyKey TwoPassEncoding(IFormatCodec::TAG_TWO_PASS_ENCODING);
const Core::PropertyKey GlobalHeader(IFormatCodec::TAG_GLOBAL_HEADER);
const Core::PropertyKey MainStream(IFormatCodec::TAG_MAIN_STREAM);
const Core::PropertyKey CodecOptionsEncode(IFormatCodec::TAG_CODEC_OPTIONS_ENCODE);
const Core::PropertyKey CodecOptionsAnalyze(IFormatCodec::TAG_CODEC_OPTIONS_ANALYZE);
const Core::PropertyKey Language(IFormatCodec::TAG_LANGUAGE);
const Core::PropertyKey Title(IFormatFile::TAG_TITLE);
const Core::PropertyKey Width(IFormatCodecVideo::TAG_WIDTH);
const Core::PropertyKey Height(IFormatCodecVideo::TAG_HEIGHT);
const Core::PropertyKey AspectX(IFormatCodecVideo::TAG_ASPECTX);
const Core::PropertyKey AspectY(IFormatCodecVideo::TAG_ASPECTY);
const Core::PropertyKey TimebaseN(IFormatCodecVideo::TAG_TIMEBASE_N);
const Core::PropertyKey TimebaseD(IFormatCodecVideo::TAG_TIMEBASE_D);
const Core::PropertyKey PixFmt(IFormatCodecVideo::TAG_PIX_FMT);
const Core::PropertyKey SampleRate(IFormatCodecAudio::TAG_SAMPLE_RATE);
const Core::PropertyKey Layout(IFormatCodecAudio::TAG_LAYOUT);
const Core::PropertyKey FrameSize(IFormatCodecAudio::TAG_FRAME_SIZE);
const Core::PropertyKey SampleFormat(IFormatCodecAudio::TAG_SAMPLE_FORMAT);
const Core::PropertyKey SubtitleAuthor(IFormatCodecSubtitle::TAG_SUBTITLE_AUTHOR);
const Core::PropertyKey SubtitleHeader(IFormatCodecSubtitle::TAG_SUBTITLE_HEADER);
const Core::PropertyKey DvbWidth(IFormatCodecSubtitle::TAG_DVB_WIDTH);
const Core::PropertyKey DvbHeight(IFormatCodecSubtitle::TAG_DVB_HEIGHT);
}  // namespace Keys

}  // namespace Conf
}  // namespace Tarvek
