// The key texts and the channel layout masks. Each setting of a description lives under its key,
// so an empty key, or one shared by two settings, would make settings overwrite each other.
#include <Tarvek/Formats.h>

#include <cstdint>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "Support/TestSupport.h"

namespace {

using namespace Tarvek::Conf;

// Every key with the name it is declared under, for the failure messages.
std::vector<std::pair<std::string, std::string>> AllKeys() {
  return {
      {"IFormat::TAG_METADATA", IFormat::TAG_METADATA},
      {"IFormatCodec::TAG_NAME", IFormatCodec::TAG_NAME},
      {"IFormatCodec::TAG_CODEC_ID", IFormatCodec::TAG_CODEC_ID},
      {"IFormatCodec::TAG_FOURCC", IFormatCodec::TAG_FOURCC},
      {"IFormatCodec::TAG_BITRATE_MODE", IFormatCodec::TAG_BITRATE_MODE},
      {"IFormatCodec::TAG_BITRATE_MODE_VBR", IFormatCodec::TAG_BITRATE_MODE_VBR},
      {"IFormatCodec::TAG_BITRATE", IFormatCodec::TAG_BITRATE},
      {"IFormatCodec::TAG_QUALITY", IFormatCodec::TAG_QUALITY},
      {"IFormatCodec::TAG_LOSSLESS", IFormatCodec::TAG_LOSSLESS},
      {"IFormatCodec::TAG_THREAD_NUMBER", IFormatCodec::TAG_THREAD_NUMBER},
      {"IFormatCodec::TAG_TWO_PASS_ENCODING", IFormatCodec::TAG_TWO_PASS_ENCODING},
      {"IFormatCodec::TAG_GLOBAL_HEADER", IFormatCodec::TAG_GLOBAL_HEADER},
      {"IFormatCodec::TAG_MAIN_STREAM", IFormatCodec::TAG_MAIN_STREAM},
      {"IFormatCodec::TAG_CODEC_OPTIONS_ENCODE", IFormatCodec::TAG_CODEC_OPTIONS_ENCODE},
      {"IFormatCodec::TAG_CODEC_OPTIONS_ANALYZE", IFormatCodec::TAG_CODEC_OPTIONS_ANALYZE},
      {"IFormatCodec::TAG_LANGUAGE", IFormatCodec::TAG_LANGUAGE},
      {"IFormatCodecVideo::TAG_WIDTH", IFormatCodecVideo::TAG_WIDTH},
      {"IFormatCodecVideo::TAG_HEIGHT", IFormatCodecVideo::TAG_HEIGHT},
      {"IFormatCodecVideo::TAG_ASPECTX", IFormatCodecVideo::TAG_ASPECTX},
      {"IFormatCodecVideo::TAG_ASPECTY", IFormatCodecVideo::TAG_ASPECTY},
      {"IFormatCodecVideo::TAG_TIMEBASE_N", IFormatCodecVideo::TAG_TIMEBASE_N},
      {"IFormatCodecVideo::TAG_TIMEBASE_D", IFormatCodecVideo::TAG_TIMEBASE_D},
      {"IFormatCodecVideo::TAG_PIX_FMT", IFormatCodecVideo::TAG_PIX_FMT},
      {"IFormatCodecVideo::TAG_FORMAT_CODEC_VIDEO", IFormatCodecVideo::TAG_FORMAT_CODEC_VIDEO},
      {"IFormatCodecAudio::TAG_SAMPLE_RATE", IFormatCodecAudio::TAG_SAMPLE_RATE},
      {"IFormatCodecAudio::TAG_LAYOUT", IFormatCodecAudio::TAG_LAYOUT},
      {"IFormatCodecAudio::TAG_FRAME_SIZE", IFormatCodecAudio::TAG_FRAME_SIZE},
      {"IFormatCodecAudio::TAG_SAMPLE_FORMAT", IFormatCodecAudio::TAG_SAMPLE_FORMAT},
      {"IFormatCodecAudio::TAG_FORMAT_CODEC_AUDIO", IFormatCodecAudio::TAG_FORMAT_CODEC_AUDIO},
      {"IFormatCodecSubtitle::TAG_SUBTITLE_AUTHOR", IFormatCodecSubtitle::TAG_SUBTITLE_AUTHOR},
      {"IFormatCodecSubtitle::TAG_SUBTITLE_HEADER", IFormatCodecSubtitle::TAG_SUBTITLE_HEADER},
      {"IFormatCodecSubtitle::TAG_DVB_WIDTH", IFormatCodecSubtitle::TAG_DVB_WIDTH},
      {"IFormatCodecSubtitle::TAG_DVB_HEIGHT", IFormatCodecSubtitle::TAG_DVB_HEIGHT},
      {"IFormatCodecSubtitle::TAG_FORMAT_CODEC_SUBTITLE",
       IFormatCodecSubtitle::TAG_FORMAT_CODEC_SUBTITLE},
      {"IFormatFile::TAG_TITLE", IFormatFile::TAG_TITLE},
      {"TAG_OBJECT", TAG_OBJECT},
  };
}

TEST(KeysTest, EveryKeyHasText) {
  for (const auto& [name, text] : AllKeys()) EXPECT_FALSE(text.empty()) << name;
}

TEST(KeysTest, KeysArePairwiseDistinct) {
  const auto keys = AllKeys();
  for (std::size_t i = 0; i < keys.size(); ++i) {
    for (std::size_t j = i + 1; j < keys.size(); ++j) {
      EXPECT_NE(keys[i].second, keys[j].second) << keys[i].first << " and " << keys[j].first;
    }
  }
}

// The runtime entry key is read by tools that inspect descriptions, so its text is fixed.
TEST(KeysTest, ObjectKeyIsObjectName) { EXPECT_EQ(TAG_OBJECT, "object_name"); }

TEST(ChannelLayoutTest, UnderlyingTypeIsUnsigned32Bit) {
  EXPECT_TRUE((std::is_same_v<std::underlying_type_t<ChannelLayout>, std::uint32_t>));
}

// The speakers take the standard bits, one each, in the standard order, so masks exchanged with
// media libraries mean the same speakers.
TEST(ChannelLayoutTest, SpeakersTakeStandardBits) {
  const ChannelLayout speakers[] = {
      CH_FRONT_LEFT,      CH_FRONT_RIGHT,      CH_FRONT_CENTER,         CH_LOW_FREQUENCY,
      CH_BACK_LEFT,       CH_BACK_RIGHT,       CH_FRONT_LEFT_OF_CENTER, CH_FRONT_RIGHT_OF_CENTER,
      CH_BACK_CENTER,     CH_SIDE_LEFT,        CH_SIDE_RIGHT,           CH_TOP_CENTER,
      CH_TOP_FRONT_LEFT,  CH_TOP_FRONT_CENTER, CH_TOP_FRONT_RIGHT,      CH_TOP_BACK_LEFT,
      CH_TOP_BACK_CENTER, CH_TOP_BACK_RIGHT,
  };
  std::uint32_t bit = 1;
  for (const ChannelLayout speaker : speakers) {
    EXPECT_EQ(static_cast<std::uint32_t>(speaker), bit) << "speaker #" << bit;
    bit <<= 1;
  }
}

TEST(ChannelLayoutTest, NamedLayoutsHaveStandardMasks) {
  const std::pair<ChannelLayout, std::uint32_t> layouts[] = {
      {CH_LAYOUT_MONO, 0x4},           {CH_LAYOUT_STEREO, 0x3},        {CH_LAYOUT_2POINT1, 0xB},
      {CH_LAYOUT_SURROUND, 0x7},       {CH_LAYOUT_QUAD, 0x33},         {CH_LAYOUT_5POINT0, 0x607},
      {CH_LAYOUT_5POINT1, 0x60F},      {CH_LAYOUT_5POINT1_BACK, 0x3F}, {CH_LAYOUT_7POINT1, 0x63F},
      {CH_LAYOUT_7POINT1_WIDE, 0x6CF},
  };
  for (const auto& [layout, mask] : layouts) {
    EXPECT_EQ(static_cast<std::uint32_t>(layout), mask) << std::hex << "mask 0x" << mask;
  }
}

}  // namespace
