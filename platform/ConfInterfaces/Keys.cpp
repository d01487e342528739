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

}  // namespace Conf
}  // namespace Tarvek
