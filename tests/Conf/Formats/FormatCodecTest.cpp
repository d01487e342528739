// FormatCodec: the defaults of a new description, the eleven setting accessors over the tree,
// the option sub-trees, the private data and the printed content.
#include <Tarvek/Formats.h>

#include <algorithm>
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

using Tarvek::Conf::FormatCodec;
using Tarvek::Conf::IFormat;
using Tarvek::Conf::IFormatCodec;
using Tarvek::Core::ChildNotFound;
using Tarvek::Core::Property;
using Tarvek::Core::WrongPropertyType;
using TarvekTest::CatchAs;
using TarvekTest::CountingBlob;
using TarvekTest::ItemOf;

// One setting, driven through its Exists, Get and Set, with two sample values.
struct Setting {
  std::string name;
  std::string key;
  std::function<bool(const IFormatCodec&)> exists;
  std::function<void(IFormatCodec&, std::size_t)> write;  // writes sample 0 or 1
  std::function<Property(const IFormatCodec&)> read;      // the value read, as a child
  std::function<Property(std::size_t)> stored;            // the child a sample is stored as
  Property otherType;                                     // a child of another type
};

void PrintTo(const Setting& setting, std::ostream* out) { *out << setting.name; }

template <class T>
struct Identity {
  using type = T;
};

template <class Value, class Arg>
Setting MakeSetting(const char* name, const std::string& key, bool (IFormatCodec::*exists)() const,
                    Value (IFormatCodec::*get)() const, void (IFormatCodec::*set)(Arg),
                    typename Identity<Value>::type first, typename Identity<Value>::type second) {
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
          [exists](const IFormatCodec& codec) { return (codec.*exists)(); },
          [set, samples](IFormatCodec& codec, std::size_t i) { (codec.*set)(samples[i]); },
          [get, key](const IFormatCodec& codec) { return Property(key, (codec.*get)()); },
          [key, samples](std::size_t i) { return Property(key, samples[i]); },
          otherType};
}

// The samples reach past 32 bits and below zero where the type allows: no setter range-checks,
// and the thread number must be stored zero-extended.
std::vector<Setting> Settings() {
  using C = IFormatCodec;
  return {
      MakeSetting("CodecName", C::TAG_NAME, &C::ExistsCodecName, &C::GetCodecName, &C::SetCodecName,
                  "libx264", ""),
      MakeSetting("CodecID", C::TAG_CODEC_ID, &C::ExistsCodecID, &C::GetCodecID, &C::SetCodecID,
                  "h264", "hevc"),
      MakeSetting("CodecTag", C::TAG_FOURCC, &C::ExistsCodecTag, &C::GetCodecTag, &C::SetCodecTag,
                  0x31637661, -1),
      MakeSetting("BitrateMode", C::TAG_BITRATE_MODE, &C::ExistsBitrateMode, &C::GetBitrateMode,
                  &C::SetBitrateMode, C::TAG_BITRATE_MODE_VBR, "cbr"),
      MakeSetting("Bitrate", C::TAG_BITRATE, &C::ExistsBitrate, &C::GetBitrate, &C::SetBitrate, -1,
                  8000000000LL),
      MakeSetting("Quality", C::TAG_QUALITY, &C::ExistsQuality, &C::GetQuality, &C::SetQuality, 23,
                  1LL << 40),
      MakeSetting("Lossless", C::TAG_LOSSLESS, &C::ExistsLossless, &C::GetLossless, &C::SetLossless,
                  true, false),
      MakeSetting("ThreadNumber", C::TAG_THREAD_NUMBER, &C::ExistsThreadNumber, &C::GetThreadNumber,
                  &C::SetThreadNumber, 4294967295u, 8u),
      MakeSetting("TwoPassEncoding", C::TAG_TWO_PASS_ENCODING, &C::ExistsTwoPassEncoding,
                  &C::GetTwoPassEncoding, &C::SetTwoPassEncoding, true, false),
      MakeSetting("GlobalHeader", C::TAG_GLOBAL_HEADER, &C::ExistsGlobalHeader, &C::GetGlobalHeader,
                  &C::SetGlobalHeader, false, true),
      MakeSetting("MainStream", C::TAG_MAIN_STREAM, &C::ExistsMainStream, &C::GetMainStream,
                  &C::SetMainStream, true, false),
  };
}

std::size_t CountOf(const Property& tree, const std::string& key) {
  return static_cast<std::size_t>(
      std::count_if(tree.GetChildren().begin(), tree.GetChildren().end(),
                    [&](const Property& child) { return child.GetName() == key; }));
}

std::ptrdiff_t PositionOf(const Property& tree, const std::string& key) {
  return std::distance(tree.GetChildren().begin(), tree.FindChild(key));
}

std::vector<Property> ChildrenBesides(const Property& tree, const std::string& key) {
  std::vector<Property> others;
  for (const Property& child : tree.GetChildren()) {
    if (child.GetName() != key) others.push_back(child);
  }
  return others;
}

class FormatCodecSettingTest : public ::testing::TestWithParam<Setting> {
 protected:
  boost::intrusive_ptr<IFormatCodec> codec_ = FormatCodec::Create();
};

// A write lands in the setting's own child only: appended last when new, overwritten in place
// (one child, same position) when written again.
TEST_P(FormatCodecSettingTest, WriteReadsBackAndOverwritesInPlace) {
  const Setting& setting = GetParam();
  const Property before = codec_->GetProperty();
  const bool existed = setting.exists(*codec_);

  setting.write(*codec_, 0);
  EXPECT_TRUE(setting.exists(*codec_));
  EXPECT_EQ(setting.read(*codec_), setting.stored(0));
  EXPECT_EQ(codec_->GetProperty()[setting.key], setting.stored(0));
  const std::ptrdiff_t position = PositionOf(codec_->GetProperty(), setting.key);
  if (!existed) {
    EXPECT_EQ(static_cast<std::size_t>(position) + 1, codec_->GetProperty().GetChildren().size());
  }

  setting.write(*codec_, 1);
  EXPECT_EQ(setting.read(*codec_), setting.stored(1));
  EXPECT_EQ(CountOf(codec_->GetProperty(), setting.key), 1u);
  EXPECT_EQ(PositionOf(codec_->GetProperty(), setting.key), position);
  EXPECT_EQ(ChildrenBesides(codec_->GetProperty(), setting.key),
            ChildrenBesides(before, setting.key));
}

TEST_P(FormatCodecSettingTest, ReadOfMissingSettingThrowsChildNotFound) {
  const Setting& setting = GetParam();
  codec_->SetProperty(Property("empty"));
  EXPECT_FALSE(setting.exists(*codec_));
  const auto error = CatchAs<ChildNotFound>([&] { setting.read(*codec_); });
  ASSERT_TRUE(error);
  EXPECT_EQ(ItemOf<ChildNotFound::ChildNameInfo>(*error), setting.key);
}

// A tree handed in through SetProperty may hold a setting as another type: reads refuse it and
// the next write retypes the child.
TEST_P(FormatCodecSettingTest, ReadOfOtherTypeThrowsWrongPropertyType) {
  const Setting& setting = GetParam();
  Property tree = codec_->GetProperty();
  tree.SetChild(setting.key, setting.otherType);
  codec_->SetProperty(tree);
  EXPECT_TRUE(setting.exists(*codec_));
  EXPECT_TRUE(CatchAs<WrongPropertyType>([&] { setting.read(*codec_); }));

  setting.write(*codec_, 0);
  EXPECT_EQ(setting.read(*codec_), setting.stored(0));
}

INSTANTIATE_TEST_SUITE_P(Accessors, FormatCodecSettingTest, ::testing::ValuesIn(Settings()),
                         [](const auto& info) { return info.param.name; });

class FormatCodecTest : public ::testing::Test {
 protected:
  boost::intrusive_ptr<IFormatCodec> codec_ = FormatCodec::Create();
  const int liveBlobs_ = CountingBlob::Live().load();
};

TEST_F(FormatCodecTest, NewDescriptionHasDefaults) {
  EXPECT_EQ(codec_->GetRefCount(), 1);
  EXPECT_EQ(codec_->GetCodecType(), -1);
  EXPECT_EQ(codec_->GetCodecName(), "Unknown codec");
  for (const Setting& setting : Settings()) {
    EXPECT_EQ(setting.exists(*codec_), setting.key == IFormatCodec::TAG_NAME) << setting.name;
  }
  ASSERT_TRUE(codec_->ExistsOptionsEncode());
  ASSERT_TRUE(codec_->ExistsOptionsAnalyze());
  EXPECT_EQ(codec_->GetOptionsEncode(), Property(IFormatCodec::TAG_CODEC_OPTIONS_ENCODE));
  EXPECT_EQ(codec_->GetOptionsAnalyze(), Property(IFormatCodec::TAG_CODEC_OPTIONS_ANALYZE));
  EXPECT_EQ(codec_->GetPrivateData().get(), nullptr);
  EXPECT_EQ(codec_->GetProperty().GetName(), "");
  EXPECT_EQ(codec_->GetInternalProperties().get<std::string>(Tarvek::Conf::TAG_OBJECT), "");
}

// The layout is read by people diagnosing streams and by tools that diff it, so it is fixed to
// the byte, the empty object name included.
TEST_F(FormatCodecTest, PrintContentOfNewDescriptionIsExact) {
  TarvekTest::CaptureStdout capture;
  codec_->PrintContent();
  EXPECT_EQ(capture.Text(),
            "======External props:=====\n"
            "<unnamed> (container)\n"
            "  metadata (container)\n"
            "  encode_options (container)\n"
            "  analyze_options (container)\n"
            "  codec_name (string): \"Unknown codec\"\n"
            "======Runtime props:=======\n"
            "object_name: \n");
}

// Counts from 2^31 up stay positive in the 64-bit child; a wider child reads as its low 32 bits.
TEST_F(FormatCodecTest, ThreadNumberIsZeroExtendedAndReadsLow32Bits) {
  codec_->SetThreadNumber(4294967295u);
  EXPECT_EQ(codec_->GetProperty()[IFormatCodec::TAG_THREAD_NUMBER].GetInt64(), 4294967295LL);
  EXPECT_EQ(codec_->GetThreadNumber(), 4294967295u);

  Property tree = codec_->GetProperty();
  tree.SetChildT<long long>(IFormatCodec::TAG_THREAD_NUMBER, (1LL << 32) + 5);
  codec_->SetProperty(tree);
  EXPECT_EQ(codec_->GetThreadNumber(), 5u);
}

// The constructor's children are not restored by SetProperty; SetOptionsEncode brings its own
// back, and the private data, outside the tree, is untouched throughout.
TEST_F(FormatCodecTest, SetPropertyWithoutOptionsRemovesThemUntilSetAgain) {
  const auto blob = CountingBlob::Create();
  codec_->SetPrivateData(blob);
  Property tree("t");
  tree.SetChildT<std::string>(IFormatCodec::TAG_CODEC_ID, "vp9");
  codec_->SetProperty(tree);
  EXPECT_FALSE(codec_->ExistsOptionsEncode());
  EXPECT_FALSE(codec_->ExistsOptionsAnalyze());
  EXPECT_FALSE(codec_->ExistsCodecName());
  EXPECT_EQ(codec_->GetCodecID(), "vp9");
  EXPECT_EQ(codec_->GetPrivateData().get(), blob.get());
  const auto error = CatchAs<ChildNotFound>([&] { codec_->GetOptionsEncode(); });
  ASSERT_TRUE(error);
  EXPECT_EQ(ItemOf<ChildNotFound::ChildNameInfo>(*error), IFormatCodec::TAG_CODEC_OPTIONS_ENCODE);

  Property options("o");
  options.SetChildT<long long>("crf", 18);
  codec_->SetOptionsEncode(options);
  ASSERT_TRUE(codec_->ExistsOptionsEncode());
  EXPECT_FALSE(codec_->ExistsOptionsAnalyze());
  EXPECT_EQ(codec_->GetOptionsEncode().GetName(), IFormatCodec::TAG_CODEC_OPTIONS_ENCODE);
  EXPECT_EQ(codec_->GetOptionsEncode()["crf"].GetInt64(), 18);
  EXPECT_EQ(codec_->GetPrivateData().get(), blob.get());
}

// Set copies the content under the option key (whatever the given tree's name), replacing what
// was there; Get is a view into the tree, not a copy.
TEST_F(FormatCodecTest, OptionSettersCopyContentUnderTheirKey) {
  struct Options {
    const std::string& key;
    void (IFormatCodec::*set)(const Property&);
    const Property& (IFormatCodec::*get)() const;
  };
  const Options kinds[] = {
      {IFormatCodec::TAG_CODEC_OPTIONS_ENCODE, &IFormatCodec::SetOptionsEncode,
       &IFormatCodec::GetOptionsEncode},
      {IFormatCodec::TAG_CODEC_OPTIONS_ANALYZE, &IFormatCodec::SetOptionsAnalyze,
       &IFormatCodec::GetOptionsAnalyze},
  };
  for (const Options& kind : kinds) {
    SCOPED_TRACE(kind.key);
    Property options("anything");
    options.SetChildT<std::string>("preset", "slow");
    options.SetChildT<long long>("crf", 20);
    ((*codec_).*kind.set)(options);
    const Property& view = ((*codec_).*kind.get)();
    EXPECT_EQ(&view, &codec_->GetProperty()[kind.key]);
    Property expected(kind.key);
    expected = options;
    EXPECT_EQ(view, expected);

    options.SetChildT<std::string>("preset", "fast");
    EXPECT_EQ(view["preset"].GetString(), "slow");

    Property replacement("r");
    replacement.SetChildT<bool>("fast_start", true);
    ((*codec_).*kind.set)(replacement);
    expected = replacement;
    EXPECT_EQ(((*codec_).*kind.get)(), expected);
  }
  // Both were overwritten in place: metadata, the two options and the codec name remain.
  EXPECT_EQ(codec_->GetProperty().GetChildren().size(), 4u);
}

// The new blob is referenced before the old one is released, so handing in the held blob keeps
// it; Get hands out the held blob itself, with one more reference.
TEST_F(FormatCodecTest, SetPrivateDataReferencesTheNewBlobAndReleasesTheOld) {
  const auto first = CountingBlob::Create();
  const auto second = CountingBlob::Create();
  codec_->SetPrivateData(first);
  codec_->SetPrivateData(first);
  EXPECT_EQ(first->GetRefCount(), 2);
  codec_->SetPrivateData(second);
  EXPECT_EQ(first->GetRefCount(), 1);
  EXPECT_EQ(second->GetRefCount(), 2);
  const auto held = codec_->GetPrivateData();
  EXPECT_EQ(held.get(), second.get());
  EXPECT_EQ(second->GetRefCount(), 3);
}

TEST_F(FormatCodecTest, BlobLivesWhileTheDescriptionHoldsIt) {
  codec_->SetPrivateData(CountingBlob::Create());
  EXPECT_EQ(CountingBlob::Live().load(), liveBlobs_ + 1);
  codec_->SetPrivateData(nullptr);
  EXPECT_EQ(CountingBlob::Live().load(), liveBlobs_);
  EXPECT_EQ(codec_->GetPrivateData().get(), nullptr);

  codec_->SetPrivateData(CountingBlob::Create());
  codec_.reset();
  EXPECT_EQ(CountingBlob::Live().load(), liveBlobs_);
}

TEST_F(FormatCodecTest, CompareIgnoresPrivateData) {
  const auto other = FormatCodec::Create();
  codec_->SetPrivateData(CountingBlob::Create());
  EXPECT_TRUE(codec_->Compare(other));
  other->SetPrivateData(CountingBlob::Create());
  EXPECT_TRUE(codec_->Compare(other));
  other->SetCodecID("h264");
  EXPECT_FALSE(codec_->Compare(other));
}

TEST_F(FormatCodecTest, IsNoneOfTheMediaKinds) {
  const boost::intrusive_ptr<IFormat> asFormat = codec_;
  EXPECT_EQ(dynamic_cast<IFormatCodec*>(asFormat.get()), codec_.get());
  EXPECT_EQ(dynamic_cast<Tarvek::Conf::IFormatCodecVideo*>(asFormat.get()), nullptr);
  EXPECT_EQ(dynamic_cast<Tarvek::Conf::IFormatCodecAudio*>(asFormat.get()), nullptr);
  EXPECT_EQ(dynamic_cast<Tarvek::Conf::IFormatCodecSubtitle*>(asFormat.get()), nullptr);
}

}  // namespace
