// What the video, audio and subtitle descriptions share: naming, defaults, cloning and
// self-destruction, checked once for every kind.
#include <gtest/gtest.h>

#include "Support/TestSupport.h"

namespace {

using Tarvek::Conf::FormatCodecAudio;
using Tarvek::Conf::FormatCodecSubtitle;
using Tarvek::Conf::FormatCodecVideo;
using Tarvek::Conf::IFormat;
using Tarvek::Conf::IFormatCodecAudio;
using Tarvek::Conf::IFormatCodecSubtitle;
using Tarvek::Conf::IFormatCodecVideo;
using TarvekTest::CountingBlob;

struct VideoKind {
  using Class = FormatCodecVideo;
  static const std::string& Name() { return IFormatCodecVideo::TAG_FORMAT_CODEC_VIDEO; }
  static constexpr int kCodecType = 0;
};
struct AudioKind {
  using Class = FormatCodecAudio;
  static const std::string& Name() { return IFormatCodecAudio::TAG_FORMAT_CODEC_AUDIO; }
  static constexpr int kCodecType = 1;
};
struct SubtitleKind {
  using Class = FormatCodecSubtitle;
  static const std::string& Name() { return IFormatCodecSubtitle::TAG_FORMAT_CODEC_SUBTITLE; }
  static constexpr int kCodecType = 3;
};

template <class Kind>
class DescriptionKindsTest : public ::testing::Test {};

using Kinds = ::testing::Types<VideoKind, AudioKind, SubtitleKind>;
TYPED_TEST_SUITE(DescriptionKindsTest, Kinds);

TYPED_TEST(DescriptionKindsTest, StartsNamedByItsKeyWithTheCodecDefaults) {
  auto description = TypeParam::Class::Create();
  EXPECT_EQ(description->GetRefCount(), 1);
  EXPECT_EQ(description->GetCodecType(), TypeParam::kCodecType);
  EXPECT_EQ(description->GetProperty().GetName(), TypeParam::Name());
  EXPECT_EQ(
      description->GetInternalProperties().template get<std::string>(Tarvek::Conf::TAG_OBJECT),
      TypeParam::Name());
  EXPECT_EQ(description->GetCodecName(), "Unknown codec");
  EXPECT_TRUE(description->ExistsOptionsEncode());
  EXPECT_TRUE(description->ExistsOptionsAnalyze());
  EXPECT_TRUE(description->GetMetadata().GetChildren().empty());
  // Metadata, the two option sub-trees and the codec name: nothing of the kind's own.
  EXPECT_EQ(description->GetProperty().GetChildren().size(), 4u);
}

TYPED_TEST(DescriptionKindsTest, CloneCopiesBothTreesButNotThePrivateData) {
  auto source = TypeParam::Class::Create();
  source->SetCodecID("codec");
  source->SetBitrate(128000);
  Tarvek::Core::Property metadata("m");
  metadata.SetChildT<std::string>("comment", "kept");
  source->SetMetadata(metadata);
  source->GetInternalProperties().put("origin", "test");
  source->SetPrivateData(CountingBlob::Create());

  auto clone = source->Clone();
  EXPECT_EQ(clone->GetRefCount(), 1);
  EXPECT_EQ(source->GetRefCount(), 1);
  EXPECT_NE(clone.get(), source.get());
  EXPECT_TRUE(clone->Compare(source));
  EXPECT_EQ(clone->GetInternalProperties(), source->GetInternalProperties());
  EXPECT_EQ(clone->GetPrivateData(), nullptr);
  EXPECT_NE(source->GetPrivateData(), nullptr);
}

TYPED_TEST(DescriptionKindsTest, CloneIsIndependentOfItsSource) {
  auto source = TypeParam::Class::Create();
  source->SetCodecID("before");
  auto clone = source->Clone();
  clone->SetCodecID("after");
  clone->GetInternalProperties().put("only", "clone");
  EXPECT_EQ(source->GetCodecID(), "before");
  EXPECT_EQ(source->GetInternalProperties().count("only"), 0u);
  EXPECT_FALSE(clone->Compare(source));
}

TYPED_TEST(DescriptionKindsTest, LastReleaseDestroysTheDescriptionAndItsBlob) {
  const int liveBefore = CountingBlob::Live();
  {
    auto description = TypeParam::Class::Create();
    description->SetPrivateData(CountingBlob::Create());
    boost::intrusive_ptr<const IFormat> second(description);
    EXPECT_EQ(description->GetRefCount(), 2);
    EXPECT_EQ(CountingBlob::Live(), liveBefore + 1);
  }
  EXPECT_EQ(CountingBlob::Live(), liveBefore);
}

TYPED_TEST(DescriptionKindsTest, ReachedAsIFormatConvertsToItsOwnKindOnly) {
  boost::intrusive_ptr<const IFormat> description(TypeParam::Class::Create());
  const IFormat* raw = description.get();
  EXPECT_EQ(dynamic_cast<const IFormatCodecVideo*>(raw) != nullptr, TypeParam::kCodecType == 0);
  EXPECT_EQ(dynamic_cast<const IFormatCodecAudio*>(raw) != nullptr, TypeParam::kCodecType == 1);
  EXPECT_EQ(dynamic_cast<const IFormatCodecSubtitle*>(raw) != nullptr, TypeParam::kCodecType == 3);
}

}  // namespace
