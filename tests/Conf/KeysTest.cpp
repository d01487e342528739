// The key texts and the channel layout masks. Each setting of a description lives under its key,
// so an empty key, or one shared by two settings, would make settings overwrite each other.
#include <Tarvek/Formats.h>

#include <cstdint>
#include <set>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "Support/TestSupport.h"

namespace {

using namespace Tarvek::Conf;

static_assert(std::is_same_v<std::underlying_type_t<ChannelLayout>, std::uint32_t>);

template <class... Keys>
std::vector<std::string> List(const Keys&... keys) {
  return {keys...};
}

TEST(KeysTest, EveryKeyHasItsOwnNonEmptyText) {
  using C = IFormatCodec;
  using V = IFormatCodecVideo;
  using A = IFormatCodecAudio;
  using S = IFormatCodecSubtitle;
  const std::vector<std::string> keys =
      List(IFormat::TAG_METADATA, C::TAG_NAME, C::TAG_CODEC_ID, C::TAG_FOURCC, C::TAG_BITRATE_MODE,
           C::TAG_BITRATE_MODE_VBR, C::TAG_BITRATE, C::TAG_QUALITY, C::TAG_LOSSLESS,
           C::TAG_THREAD_NUMBER, C::TAG_TWO_PASS_ENCODING, C::TAG_GLOBAL_HEADER, C::TAG_MAIN_STREAM,
           C::TAG_CODEC_OPTIONS_ENCODE, C::TAG_CODEC_OPTIONS_ANALYZE, C::TAG_LANGUAGE, V::TAG_WIDTH,
           V::TAG_HEIGHT, V::TAG_ASPECTX, V::TAG_ASPECTY, V::TAG_TIMEBASE_N, V::TAG_TIMEBASE_D,
           V::TAG_PIX_FMT, V::TAG_FORMAT_CODEC_VIDEO, A::TAG_SAMPLE_RATE, A::TAG_LAYOUT,
           A::TAG_FRAME_SIZE, A::TAG_SAMPLE_FORMAT, A::TAG_FORMAT_CODEC_AUDIO,
           S::TAG_SUBTITLE_AUTHOR, S::TAG_SUBTITLE_HEADER, S::TAG_DVB_WIDTH, S::TAG_DVB_HEIGHT,
           S::TAG_FORMAT_CODEC_SUBTITLE, IFormatFile::TAG_TITLE, TAG_OBJECT);
  std::set<std::string> seen;
  for (const std::string& key : keys) {
    EXPECT_FALSE(key.empty()) << "key #" << seen.size();
    EXPECT_TRUE(seen.insert(key).second) << "\"" << key << "\" is taken twice";
  }
}

// The speakers take the standard bits, one each, in the standard order, and the named layouts
// the standard masks, so masks exchanged with media libraries mean the same speakers.
TEST(KeysTest, ChannelLayoutsHaveTheStandardMasks) {
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
