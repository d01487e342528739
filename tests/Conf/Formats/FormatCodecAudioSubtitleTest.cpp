// The audio and subtitle descriptions: where each keeps its language, and their compatibility
// tests; subtitles clone through a non-const description only.
#include <gtest/gtest.h>

#include <type_traits>
#include <utility>

#include "Support/TestSupport.h"

namespace {

using namespace Tarvek::Conf;
using Tarvek::Core::Property;
using TarvekTest::CatchAs;

template <class T, class = void>
struct HasClone : std::false_type {};
template <class T>
struct HasClone<T, std::void_t<decltype(std::declval<T&>().Clone())>> : std::true_type {};

// Video and audio descriptions clone through const ones too (see FormatCodecTest.cpp).
static_assert(HasClone<IFormatCodecSubtitle>::value &&
              !HasClone<const IFormatCodecSubtitle>::value);

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

// The audio language is a child of the metadata, gone with it; while there is none it reads as
// empty.
TEST_F(FormatCodecAudioTest, LanguageLivesInTheMetadata) {
  EXPECT_FALSE(audio_->ExistsLanguage());
  EXPECT_EQ(audio_->GetLanguage(), "");
  audio_->SetLanguage("eng");
  audio_->SetLanguage("fra");
  EXPECT_TRUE(audio_->ExistsLanguage());
  EXPECT_EQ(audio_->GetLanguage(), "fra");
  Property expected(IFormat::TAG_METADATA);
  expected.SetChildT<std::string>(IFormatCodec::TAG_LANGUAGE, "fra");
  EXPECT_EQ(audio_->GetMetadata(), expected);
  EXPECT_FALSE(audio_->GetProperty().ChildExists(IFormatCodec::TAG_LANGUAGE));

  for (const bool newTree : {false, true}) {
    audio_->SetLanguage("eng");
    newTree ? audio_->SetProperty(Property("t")) : audio_->SetMetadata(Property("m"));
    EXPECT_FALSE(audio_->ExistsLanguage());
    EXPECT_EQ(audio_->GetLanguage(), "");
  }
}

// A language of another type is reported, not hidden; leaf metadata cannot take one.
TEST_F(FormatCodecAudioTest, LanguageInUnusableMetadataIsRefused) {
  Property metadata("m");
  metadata.SetChildT<long long>(IFormatCodec::TAG_LANGUAGE, 7);
  audio_->SetMetadata(metadata);
  EXPECT_TRUE(audio_->ExistsLanguage());
  EXPECT_TRUE(CatchAs<Tarvek::Core::WrongPropertyType>([&] { audio_->GetLanguage(); }));

  audio_->SetMetadata(Property("m", true));
  EXPECT_TRUE(CatchAs<Tarvek::Core::MethodIsNotApplicable>([&] { audio_->SetLanguage("eng"); }));
  EXPECT_TRUE(audio_->GetMetadata().GetBool());
}

TEST_F(FormatCodecAudioTest, CompatibilityComparesRateLayoutAndFormatOnly) {
  auto other = FormatCodecAudio::Create();
  SetLayout(*audio_, 48000, CH_LAYOUT_STEREO, AV_SAMPLE_FMT_FLTP);
  SetLayout(*other, 48000, CH_LAYOUT_STEREO, AV_SAMPLE_FMT_FLTP);
  other->SetFrameSize(1024);
  other->SetLanguage("eng");
  other->SetCodecID("opus");
  EXPECT_TRUE(audio_->IsCompatible(other));
  EXPECT_EQ(other->GetRefCount(), 1);

  other->SetSampleRate(44100);
  EXPECT_FALSE(audio_->IsCompatible(other));
  SetLayout(*other, 48000, CH_LAYOUT_MONO, AV_SAMPLE_FMT_FLTP);
  EXPECT_FALSE(audio_->IsCompatible(other));
  SetLayout(*other, 48000, CH_LAYOUT_STEREO, AV_SAMPLE_FMT_S16);
  EXPECT_FALSE(audio_->IsCompatible(other));
  EXPECT_FALSE(audio_->IsCompatible(nullptr));
  EXPECT_FALSE(audio_->IsCompatible(FormatCodecVideo::Create()));

  // This description's settings are read first: its missing layout is reported.
  audio_->SetProperty(Property("t"));
  audio_->SetSampleRate(48000);
  EXPECT_EQ(TarvekTest::MissingKey([&] { audio_->IsCompatible(other); }),
            IFormatCodecAudio::TAG_LAYOUT);
  EXPECT_EQ(other->GetRefCount(), 1);
}

// The subtitle language is a setting of its own at the root, untouched by new metadata. Any
// description is compatible with a subtitle one.
TEST(FormatCodecSubtitleTest, LanguageAtTheRootAndCompatibleWithAnything) {
  auto subtitle = FormatCodecSubtitle::Create();
  subtitle->SetLanguage("eng");
  EXPECT_FALSE(subtitle->GetMetadata().ChildExists(IFormatCodec::TAG_LANGUAGE));
  subtitle->SetMetadata(Property("m"));
  EXPECT_EQ(subtitle->GetLanguage(), "eng");

  EXPECT_TRUE(subtitle->IsCompatible(FormatCodecSubtitle::Create()));
  EXPECT_TRUE(subtitle->IsCompatible(FormatCodecVideo::Create()));
  EXPECT_TRUE(subtitle->IsCompatible(FormatCodecAudio::Create()));
  EXPECT_TRUE(subtitle->IsCompatible(nullptr));
}

}  // namespace
