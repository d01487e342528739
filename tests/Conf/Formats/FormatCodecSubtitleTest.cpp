// The subtitle description: settings at the root, the language among them, storage widths, a
// non-const Clone and a compatibility test that accepts everything.
#include <gtest/gtest.h>

#include <type_traits>
#include <utility>

#include "Support/TestSupport.h"

namespace {

using Tarvek::Conf::FormatCodecSubtitle;
using Tarvek::Conf::IFormatCodec;
using Tarvek::Conf::IFormatCodecAudio;
using Tarvek::Conf::IFormatCodecSubtitle;
using Tarvek::Conf::IFormatCodecVideo;
using Tarvek::Core::Property;

template <class T, class = void>
struct HasClone : std::false_type {};
template <class T>
struct HasClone<T, std::void_t<decltype(std::declval<T&>().Clone())>> : std::true_type {};

// Subtitles are cloned only through a non-const description; video and audio through either.
static_assert(HasClone<IFormatCodecSubtitle>::value);
static_assert(!HasClone<const IFormatCodecSubtitle>::value);
static_assert(HasClone<const IFormatCodecVideo>::value);
static_assert(HasClone<const IFormatCodecAudio>::value);

class FormatCodecSubtitleTest : public ::testing::Test {
 protected:
  boost::intrusive_ptr<IFormatCodecSubtitle> subtitle_ = FormatCodecSubtitle::Create();
};

TEST_F(FormatCodecSubtitleTest, NewDescriptionHoldsNoSubtitleSetting) {
  EXPECT_FALSE(subtitle_->ExistsLanguage());
  EXPECT_FALSE(subtitle_->ExistsTitle());
  EXPECT_FALSE(subtitle_->ExistsAuthor());
  EXPECT_FALSE(subtitle_->ExistsSubtitleHeader());
  EXPECT_FALSE(subtitle_->ExistsDVBWidth());
  EXPECT_FALSE(subtitle_->ExistsDVBHeight());
  // Unlike the audio language, an absent subtitle language is an error.
  EXPECT_THROW(subtitle_->GetLanguage(), Tarvek::Core::ChildNotFound);
}

TEST_F(FormatCodecSubtitleTest, LanguageLivesAtTheRootAndSurvivesNewMetadata) {
  subtitle_->SetLanguage("eng");
  EXPECT_TRUE(subtitle_->GetProperty().ChildExists(IFormatCodec::TAG_LANGUAGE));
  EXPECT_FALSE(subtitle_->GetMetadata().ChildExists(IFormatCodec::TAG_LANGUAGE));
  subtitle_->SetMetadata(Property("m"));
  EXPECT_EQ(subtitle_->GetLanguage(), "eng");
}

TEST_F(FormatCodecSubtitleTest, TextSettingsRoundTripAndEmptyTextIsAValue) {
  subtitle_->SetTitle("Director's commentary");
  subtitle_->SetAuthor("");
  subtitle_->SetSubtitleHeader("[Script Info]\nPlayResX: 1920\n");
  EXPECT_EQ(subtitle_->GetTitle(), "Director's commentary");
  EXPECT_TRUE(subtitle_->ExistsAuthor());
  EXPECT_EQ(subtitle_->GetAuthor(), "");
  EXPECT_EQ(subtitle_->GetSubtitleHeader(), "[Script Info]\nPlayResX: 1920\n");
  EXPECT_EQ(subtitle_->GetProperty()[Tarvek::Conf::IFormatFile::TAG_TITLE].GetString(),
            "Director's commentary");
}

TEST_F(FormatCodecSubtitleTest, DvbSizeIsStoredZeroExtended) {
  subtitle_->SetDVBWidth(4294967295u);
  subtitle_->SetDVBHeight(576);
  EXPECT_EQ(subtitle_->GetProperty()[IFormatCodecSubtitle::TAG_DVB_WIDTH].GetInt64(), 4294967295LL);
  EXPECT_EQ(subtitle_->GetDVBWidth(), 4294967295u);
  EXPECT_EQ(subtitle_->GetDVBHeight(), 576u);
}

TEST_F(FormatCodecSubtitleTest, IsCompatibleWithAnything) {
  auto other = FormatCodecSubtitle::Create();
  other->SetLanguage("fra");
  EXPECT_TRUE(subtitle_->IsCompatible(other));
  EXPECT_TRUE(subtitle_->IsCompatible(Tarvek::Conf::FormatCodecVideo::Create()));
  EXPECT_TRUE(subtitle_->IsCompatible(Tarvek::Conf::FormatCodecAudio::Create()));
  EXPECT_TRUE(subtitle_->IsCompatible(nullptr));
}

TEST_F(FormatCodecSubtitleTest, CloneCarriesEverySetting) {
  subtitle_->SetLanguage("eng");
  subtitle_->SetTitle("t");
  subtitle_->SetAuthor("a");
  subtitle_->SetSubtitleHeader("h");
  subtitle_->SetDVBWidth(720);
  subtitle_->SetDVBHeight(576);
  auto clone = subtitle_->Clone();
  EXPECT_EQ(clone->GetLanguage(), "eng");
  EXPECT_EQ(clone->GetDVBHeight(), 576u);
  EXPECT_TRUE(clone->Compare(subtitle_));
}

}  // namespace
