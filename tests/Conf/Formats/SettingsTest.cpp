// Every setting accessor of the four descriptions, driven through its Exists, Get and Set: where a
// write lands, the storage width of its value, and reads of trees handed in through SetProperty.
// The audio language, kept inside the metadata, is tested with the audio description.
#include <Tarvek/Formats.h>

#include <array>
#include <cstddef>
#include <functional>
#include <iterator>
#include <ostream>
#include <string>
#include <type_traits>
#include <vector>

#include "Support/TestSupport.h"

namespace {

using namespace Tarvek::Conf;
using Tarvek::Core::Property;
using Tarvek::Core::WrongPropertyType;
using TarvekTest::CatchAs;

// One setting of one kind of description, with two sample values and the children they must be
// stored as.
struct Setting {
  std::string name;
  std::string key;
  std::function<boost::intrusive_ptr<IFormatCodec>()> create;
  std::function<bool(const IFormatCodec&)> exists;
  std::function<void(IFormatCodec&, std::size_t)> write;  // writes sample 0 or 1
  std::function<Property(const IFormatCodec&)> read;      // the value read, as a child
  std::array<Property, 2> stored;                         // the child each sample is stored as
  Property otherType;                                     // a child of another type
  bool narrow;  // a 32-bit value: a wider child reads as its low 32 bits
};

void PrintTo(const Setting& setting, std::ostream* out) { *out << setting.name; }

// The child `value` must be stored as: integers and enumerations widened by their own sign.
template <class Value>
Property Child(const std::string& key, Value value) {
  if constexpr (std::is_enum_v<Value>) {
    return Property(key, static_cast<long long>(value));
  } else {
    return Property(key, value);
  }
}

template <class Class, class Value, class Arg>
Setting Make(const std::string& name, const std::string& key, bool (Class::*exists)() const,
             Value (Class::*get)() const, void (Class::*set)(Arg), std::common_type_t<Value> first,
             std::common_type_t<Value> second) {
  const std::array<Value, 2> samples{first, second};
  Property otherType(key);
  if constexpr (std::is_same_v<Value, std::string>) {
    otherType = 1LL;
  } else if constexpr (std::is_same_v<Value, bool>) {
    otherType = "true";
  } else {
    otherType = true;
  }
  return {name,
          key,
          [] { return boost::intrusive_ptr<IFormatCodec>(Class::Create()); },
          [exists](const IFormatCodec& c) { return (dynamic_cast<const Class&>(c).*exists)(); },
          [set, samples](IFormatCodec& c, std::size_t i) {
            (dynamic_cast<Class&>(c).*set)(samples[i]);
          },
          [get, key](const IFormatCodec& c) {
            return Child(key, (dynamic_cast<const Class&>(c).*get)());
          },
          {Child(key, first), Child(key, second)},
          otherType,
          sizeof(Value) == 4};
}

// The samples reach past 32 bits, below zero and to the empty text where the type allows: no
// setter range-checks. Unsigned values and the channel mask must be stored zero-extended, signed
// values and the sample and pixel formats sign-extended.
std::vector<Setting> Settings() {
  using Codec = FormatCodec;
  using Video = FormatCodecVideo;
  using Audio = FormatCodecAudio;
  using Subtitle = FormatCodecSubtitle;
  const unsigned int kMax = 4294967295u;
#define TARVEK_SETTING(Kind, Name, key, first, second) \
  Make(#Kind #Name, key, &Kind::Exists##Name, &Kind::Get##Name, &Kind::Set##Name, first, second)
  return {
      TARVEK_SETTING(Codec, CodecName, Codec::TAG_NAME, "libx264", ""),
      TARVEK_SETTING(Codec, CodecID, Codec::TAG_CODEC_ID, "h264", "hevc"),
      TARVEK_SETTING(Codec, CodecTag, Codec::TAG_FOURCC, 0x31637661, -1),
      TARVEK_SETTING(Codec, BitrateMode, Codec::TAG_BITRATE_MODE, Codec::TAG_BITRATE_MODE_VBR,
                     "cbr"),
      TARVEK_SETTING(Codec, Bitrate, Codec::TAG_BITRATE, -1, 8000000000LL),
      TARVEK_SETTING(Codec, Quality, Codec::TAG_QUALITY, 23, 1LL << 40),
      TARVEK_SETTING(Codec, Lossless, Codec::TAG_LOSSLESS, true, false),
      TARVEK_SETTING(Codec, ThreadNumber, Codec::TAG_THREAD_NUMBER, kMax, 8u),
      TARVEK_SETTING(Codec, TwoPassEncoding, Codec::TAG_TWO_PASS_ENCODING, true, false),
      TARVEK_SETTING(Codec, GlobalHeader, Codec::TAG_GLOBAL_HEADER, false, true),
      TARVEK_SETTING(Codec, MainStream, Codec::TAG_MAIN_STREAM, true, false),
      TARVEK_SETTING(Video, Width, Video::TAG_WIDTH, kMax, 720u),
      TARVEK_SETTING(Video, Height, Video::TAG_HEIGHT, kMax, 576u),
      TARVEK_SETTING(Video, PixelAspectX, Video::TAG_ASPECTX, kMax, 64u),
      TARVEK_SETTING(Video, PixelAspectY, Video::TAG_ASPECTY, kMax, 45u),
      TARVEK_SETTING(Video, FrameRateNum, Video::TAG_TIMEBASE_N, kMax, 30000u),
      TARVEK_SETTING(Video, FrameRateDen, Video::TAG_TIMEBASE_D, kMax, 1001u),
      TARVEK_SETTING(Video, PixelFormat, Video::TAG_PIX_FMT, AV_PIX_FMT_NONE, AV_PIX_FMT_YUV420P),
      TARVEK_SETTING(Audio, SampleRate, Audio::TAG_SAMPLE_RATE, -1, 48000),
      TARVEK_SETTING(Audio, ChannelLayout, Audio::TAG_LAYOUT, static_cast<ChannelLayout>(kMax),
                     CH_LAYOUT_STEREO),
      TARVEK_SETTING(Audio, FrameSize, Audio::TAG_FRAME_SIZE, -1, 1024),
      TARVEK_SETTING(Audio, SampleFormat, Audio::TAG_SAMPLE_FORMAT, AV_SAMPLE_FMT_NONE,
                     AV_SAMPLE_FMT_FLTP),
      TARVEK_SETTING(Subtitle, Language, Subtitle::TAG_LANGUAGE, "eng", "fra"),
      TARVEK_SETTING(Subtitle, Title, IFormatFile::TAG_TITLE, "Director's commentary", ""),
      TARVEK_SETTING(Subtitle, Author, Subtitle::TAG_SUBTITLE_AUTHOR, "", "a"),
      TARVEK_SETTING(Subtitle, SubtitleHeader, Subtitle::TAG_SUBTITLE_HEADER,
                     "[Script Info]\nPlayResX: 1920\n", "h"),
      TARVEK_SETTING(Subtitle, DVBWidth, Subtitle::TAG_DVB_WIDTH, kMax, 720u),
      TARVEK_SETTING(Subtitle, DVBHeight, Subtitle::TAG_DVB_HEIGHT, kMax, 576u),
  };
#undef TARVEK_SETTING
}

std::ptrdiff_t PositionOf(const Property& tree, const std::string& key) {
  return std::distance(tree.GetChildren().begin(), tree.FindChild(key));
}

class SettingTest : public ::testing::TestWithParam<Setting> {
 protected:
  // Hands `codec_` its own tree with the setting's child replaced by `child`.
  void HandIn(const Property& child) {
    Property tree = codec_->GetProperty();
    tree.SetChild(GetParam().key, child);
    codec_->SetProperty(tree);
  }

  boost::intrusive_ptr<IFormatCodec> codec_ = GetParam().create();
};

// Only the codec name is set on a new description; a missing setting is reported by its key.
TEST_P(SettingTest, NewDescriptionHasNoneButTheCodecName) {
  const Setting& setting = GetParam();
  EXPECT_EQ(setting.exists(*codec_), setting.key == IFormatCodec::TAG_NAME);
  codec_->SetProperty(Property("empty"));
  EXPECT_FALSE(setting.exists(*codec_));
  EXPECT_EQ(TarvekTest::MissingKey([&] { setting.read(*codec_); }), setting.key);
}

// A write lands in the setting's own child only: appended last when new, overwritten in place
// (one child, same position) when written again.
TEST_P(SettingTest, WriteReadsBackAndOverwritesInPlace) {
  const Setting& setting = GetParam();
  const Property before = codec_->GetProperty();
  const bool existed = setting.exists(*codec_);

  setting.write(*codec_, 0);
  EXPECT_TRUE(setting.exists(*codec_));
  EXPECT_EQ(setting.read(*codec_), setting.stored[0]);
  EXPECT_EQ(codec_->GetProperty()[setting.key], setting.stored[0]);
  const std::ptrdiff_t position = PositionOf(codec_->GetProperty(), setting.key);
  if (!existed) {
    EXPECT_EQ(static_cast<std::size_t>(position) + 1, codec_->GetProperty().GetChildren().size());
  }

  setting.write(*codec_, 1);
  EXPECT_EQ(setting.read(*codec_), setting.stored[1]);
  EXPECT_EQ(codec_->GetProperty()[setting.key], setting.stored[1]);
  EXPECT_EQ(PositionOf(codec_->GetProperty(), setting.key), position);
  EXPECT_EQ(codec_->GetProperty().GetChildren().size(), before.GetChildren().size() + !existed);
  EXPECT_EQ(TarvekTest::Without(codec_->GetProperty(), setting.key),
            TarvekTest::Without(before, setting.key));
}

// A tree handed in may hold a setting as another type, which reads refuse and the next write
// retypes, or as a value wider than 32 bits, of which a 32-bit setting reads the low 32 bits.
TEST_P(SettingTest, ReadsOfHandedInTrees) {
  const Setting& setting = GetParam();
  HandIn(setting.otherType);
  EXPECT_TRUE(setting.exists(*codec_));
  EXPECT_TRUE(CatchAs<WrongPropertyType>([&] { setting.read(*codec_); }));
  setting.write(*codec_, 0);
  EXPECT_EQ(setting.read(*codec_), setting.stored[0]);

  for (std::size_t i = 0; setting.narrow && i < 2; ++i) {
    HandIn(Property(setting.key, setting.stored[i].GetInt64() + (1LL << 32)));
    EXPECT_EQ(setting.read(*codec_), setting.stored[i]);
  }
}

INSTANTIATE_TEST_SUITE_P(Accessors, SettingTest, ::testing::ValuesIn(Settings()),
                         [](const auto& info) { return info.param.name; });

}  // namespace
