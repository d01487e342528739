// The audio description: the language inside the metadata, storage widths and the sample
// layout compatibility test.
#include <gtest/gtest.h>

#include "Support/TestSupport.h"

namespace {

using Tarvek::Conf::ChannelLayout;
using Tarvek::Conf::FormatCodecAudio;
using Tarvek::Conf::FormatCodecVideo;
using Tarvek::Conf::IFormat;
using Tarvek::Conf::IFormatCodec;
using Tarvek::Conf::IFormatCodecAudio;
using Tarvek::Core::ChildNotFound;
using Tarvek::Core::Property;
using TarvekTest::CatchAs;
using TarvekTest::ItemOf;

class FormatCodecAudioTest : public ::testing::Test {
 protected:
  static void SetLayout(IFormatCodecAudio& audio, int sampleRate, ChannelLayout layout,
                        AVSampleFormat format) {
    audio.SetSampleRate(sampleRate);
    audio.SetChannelLayout(layout);
    audio.SetSampleFormat(format);
  }

  boost::intrusive_ptr<IFormatCodecAudio> audio_ = FormatCodecAudio::Create();
};

TEST_F(FormatCodecAudioTest, NewDescriptionHoldsNoAudioSettingAndAnEmptyLanguage) {
  EXPECT_FALSE(audio_->ExistsLanguage());
  EXPECT_FALSE(audio_->ExistsSampleRate());
  EXPECT_FALSE(audio_->ExistsChannelLayout());
  EXPECT_FALSE(audio_->ExistsFrameSize());
  EXPECT_FALSE(audio_->ExistsSampleFormat());
  EXPECT_EQ(audio_->GetLanguage(), "");
  EXPECT_THROW(audio_->GetSampleRate(), ChildNotFound);
}

TEST_F(FormatCodecAudioTest, LanguageLivesInTheMetadata) {
  audio_->SetLanguage("eng");
  EXPECT_TRUE(audio_->ExistsLanguage());
  EXPECT_EQ(audio_->GetLanguage(), "eng");
  EXPECT_EQ(audio_->GetMetadata()[IFormatCodec::TAG_LANGUAGE].GetString(), "eng");
  EXPECT_FALSE(audio_->GetProperty().ChildExists(IFormatCodec::TAG_LANGUAGE));

  audio_->SetLanguage("fra");
  EXPECT_EQ(audio_->GetMetadata().GetChildren().size(), 1u);
  EXPECT_EQ(audio_->GetLanguage(), "fra");
}

TEST_F(FormatCodecAudioTest, ReplacingTheMetadataOrTheTreeDropsTheLanguage) {
  audio_->SetLanguage("eng");
  audio_->SetMetadata(Property("other"));
  EXPECT_FALSE(audio_->ExistsLanguage());
  EXPECT_EQ(audio_->GetLanguage(), "");

  audio_->SetLanguage("eng");
  audio_->SetProperty(Property("empty"));
  EXPECT_FALSE(audio_->ExistsLanguage());
  EXPECT_EQ(audio_->GetLanguage(), "");
}

TEST_F(FormatCodecAudioTest, LanguageOfAnotherTypeIsReportedNotHidden) {
  Property metadata("m");
  metadata.SetChildT<long long>(IFormatCodec::TAG_LANGUAGE, 7);
  audio_->SetMetadata(metadata);
  EXPECT_TRUE(audio_->ExistsLanguage());
  EXPECT_THROW(audio_->GetLanguage(), Tarvek::Core::WrongPropertyType);
}

TEST_F(FormatCodecAudioTest, LanguageCannotBeWrittenIntoLeafMetadata) {
  audio_->SetMetadata(Property("m", true));
  EXPECT_THROW(audio_->SetLanguage("eng"), Tarvek::Core::MethodIsNotApplicable);
  EXPECT_TRUE(audio_->GetMetadata().GetBool());
}

TEST_F(FormatCodecAudioTest, SignedSettingsSignExtendAndTheLayoutZeroExtends) {
  audio_->SetSampleRate(-1);
  audio_->SetFrameSize(-1);
  audio_->SetSampleFormat(AV_SAMPLE_FMT_NONE);
  audio_->SetChannelLayout(static_cast<ChannelLayout>(0xFFFFFFFFu));
  const Property& tree = audio_->GetProperty();
  EXPECT_EQ(tree[IFormatCodecAudio::TAG_SAMPLE_RATE].GetInt64(), -1);
  EXPECT_EQ(tree[IFormatCodecAudio::TAG_FRAME_SIZE].GetInt64(), -1);
  EXPECT_EQ(tree[IFormatCodecAudio::TAG_SAMPLE_FORMAT].GetInt64(), -1);
  EXPECT_EQ(tree[IFormatCodecAudio::TAG_LAYOUT].GetInt64(), 4294967295LL);
  EXPECT_EQ(audio_->GetSampleRate(), -1);
  EXPECT_EQ(audio_->GetFrameSize(), -1);
  EXPECT_EQ(audio_->GetSampleFormat(), AV_SAMPLE_FMT_NONE);
  EXPECT_EQ(static_cast<std::uint32_t>(audio_->GetChannelLayout()), 0xFFFFFFFFu);
}

TEST_F(FormatCodecAudioTest, CloneCarriesTheLanguage) {
  audio_->SetLanguage("deu");
  SetLayout(*audio_, 48000, Tarvek::Conf::CH_LAYOUT_5POINT1, AV_SAMPLE_FMT_FLTP);
  auto clone = audio_->Clone();
  EXPECT_EQ(clone->GetLanguage(), "deu");
  EXPECT_EQ(clone->GetChannelLayout(), Tarvek::Conf::CH_LAYOUT_5POINT1);
  EXPECT_TRUE(clone->Compare(audio_));
}

TEST_F(FormatCodecAudioTest, CompatibilityComparesRateLayoutAndFormatOnly) {
  auto other = FormatCodecAudio::Create();
  SetLayout(*audio_, 48000, Tarvek::Conf::CH_LAYOUT_STEREO, AV_SAMPLE_FMT_FLTP);
  SetLayout(*other, 48000, Tarvek::Conf::CH_LAYOUT_STEREO, AV_SAMPLE_FMT_FLTP);
  other->SetFrameSize(1024);
  other->SetLanguage("eng");
  other->SetCodecID("opus");
  EXPECT_TRUE(audio_->IsCompatible(other));

  other->SetSampleRate(44100);
  EXPECT_FALSE(audio_->IsCompatible(other));
  SetLayout(*other, 48000, Tarvek::Conf::CH_LAYOUT_MONO, AV_SAMPLE_FMT_FLTP);
  EXPECT_FALSE(audio_->IsCompatible(other));
  SetLayout(*other, 48000, Tarvek::Conf::CH_LAYOUT_STEREO, AV_SAMPLE_FMT_S16);
  EXPECT_FALSE(audio_->IsCompatible(other));

  EXPECT_FALSE(audio_->IsCompatible(nullptr));
  EXPECT_FALSE(audio_->IsCompatible(FormatCodecVideo::Create()));
}

TEST_F(FormatCodecAudioTest, CompatibilityReadsThisSideFirstAndGivesTheReferenceBack) {
  auto other = FormatCodecAudio::Create();
  SetLayout(*other, 48000, Tarvek::Conf::CH_LAYOUT_STEREO, AV_SAMPLE_FMT_FLTP);
  audio_->SetSampleRate(48000);
  // This description lacks a layout; the other one lacks nothing.
  const auto error = CatchAs<ChildNotFound>([&] { audio_->IsCompatible(other); });
  ASSERT_TRUE(error);
  EXPECT_EQ(ItemOf<ChildNotFound::ChildNameInfo>(*error), IFormatCodecAudio::TAG_LAYOUT);
  EXPECT_EQ(other->GetRefCount(), 1);
}

}  // namespace
