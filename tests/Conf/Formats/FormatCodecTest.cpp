// FormatCodec and what the video, audio and subtitle descriptions share with it: the defaults of
// a new description, cloning, the option sub-trees, the private data and the printed content.
// The setting accessors are checked by the description fuzz target, whose corpus holds a program
// per kind that writes and reads every setting.
#include <Tarvek/Formats.h>

#include <functional>
#include <string>
#include <tuple>
#include <vector>

#include "Support/TestSupport.h"

namespace {

using namespace Tarvek::Conf;
using Tarvek::Core::Property;
using TarvekTest::CountingBlob;

template <class Interface>
boost::intrusive_ptr<IFormatCodec> CloneAs(IFormatCodec& codec) {
  return dynamic_cast<Interface&>(codec).Clone();
}

struct Kind {
  const char* name;
  std::function<boost::intrusive_ptr<IFormatCodec>()> create;
  const std::string& rootName;
  int codecType;
  boost::intrusive_ptr<IFormatCodec> (*clone)(IFormatCodec&);  // null: no Clone
};

const std::string kNoName;

const std::vector<Kind>& Kinds() {
  static const std::vector<Kind> kinds = {
      {"codec", [] { return FormatCodec::Create(); }, kNoName, -1, nullptr},
      {"video", [] { return boost::intrusive_ptr<IFormatCodec>(FormatCodecVideo::Create()); },
       IFormatCodecVideo::TAG_FORMAT_CODEC_VIDEO, 0, &CloneAs<const IFormatCodecVideo>},
      {"audio", [] { return boost::intrusive_ptr<IFormatCodec>(FormatCodecAudio::Create()); },
       IFormatCodecAudio::TAG_FORMAT_CODEC_AUDIO, 1, &CloneAs<const IFormatCodecAudio>},
      {"subtitle", [] { return boost::intrusive_ptr<IFormatCodec>(FormatCodecSubtitle::Create()); },
       IFormatCodecSubtitle::TAG_FORMAT_CODEC_SUBTITLE, 3, &CloneAs<IFormatCodecSubtitle>},
  };
  return kinds;
}

// Named by the kind's key (the plain codec description by the empty name) in both trees, and
// converting to its own media interface only.
TEST(DescriptionKindsTest, NewDescriptionsHoldTheCodecDefaultsOnly) {
  for (const Kind& kind : Kinds()) {
    SCOPED_TRACE(kind.name);
    const auto codec = kind.create();
    EXPECT_EQ(codec->GetRefCount(), 1);
    EXPECT_EQ(codec->GetCodecType(), kind.codecType);
    EXPECT_EQ(codec->GetProperty().GetName(), kind.rootName);
    EXPECT_EQ(codec->GetInternalProperties().get<std::string>(TAG_OBJECT), kind.rootName);
    EXPECT_EQ(codec->GetInternalProperties().size(), 1u);
    EXPECT_EQ(codec->GetCodecName(), "Unknown codec");
    EXPECT_EQ(codec->GetOptionsEncode(), Property(IFormatCodec::TAG_CODEC_OPTIONS_ENCODE));
    EXPECT_EQ(codec->GetOptionsAnalyze(), Property(IFormatCodec::TAG_CODEC_OPTIONS_ANALYZE));
    EXPECT_EQ(codec->GetMetadata(), Property(IFormat::TAG_METADATA));
    EXPECT_EQ(TarvekTest::ChildNames(codec->GetProperty()),
              "metadata encode_options analyze_options codec_name ");
    EXPECT_EQ(codec->GetPrivateData(), nullptr);
    EXPECT_EQ(dynamic_cast<IFormatCodecVideo*>(codec.get()) != nullptr, kind.codecType == 0);
    EXPECT_EQ(dynamic_cast<IFormatCodecAudio*>(codec.get()) != nullptr, kind.codecType == 1);
    EXPECT_EQ(dynamic_cast<IFormatCodecSubtitle*>(codec.get()) != nullptr, kind.codecType == 3);
  }
}

// A clone has both trees but not the private data, and goes its own way; the last release
// frees description and blob.
TEST(DescriptionKindsTest, CloneCopiesTheTreesOnlyAndIsIndependent) {
  const int liveBlobs = CountingBlob::Live();
  for (const Kind& kind : Kinds()) {
    if (kind.clone == nullptr) continue;
    SCOPED_TRACE(kind.name);
    auto source = kind.create();
    source->SetCodecID("before");
    Property metadata("m");
    metadata.SetChildT<std::string>("comment", "kept");
    source->SetMetadata(metadata);
    source->GetInternalProperties().put("origin", "test");
    source->SetPrivateData(CountingBlob::Create());

    auto clone = kind.clone(*source);
    EXPECT_EQ(clone->GetRefCount(), 1);
    EXPECT_EQ(source->GetRefCount(), 1);
    EXPECT_NE(clone.get(), source.get());
    EXPECT_EQ(clone->GetCodecType(), kind.codecType);
    EXPECT_TRUE(clone->Compare(source));
    EXPECT_EQ(clone->GetInternalProperties(), source->GetInternalProperties());
    EXPECT_EQ(clone->GetPrivateData(), nullptr);
    EXPECT_NE(source->GetPrivateData(), nullptr);

    clone->SetCodecID("after");
    clone->GetInternalProperties().put("only", "clone");
    EXPECT_EQ(source->GetCodecID(), "before");
    EXPECT_EQ(source->GetInternalProperties().count("only"), 0u);
    EXPECT_FALSE(clone->Compare(source));
    source.reset();
    EXPECT_EQ(CountingBlob::Live(), liveBlobs);
  }
}

class FormatCodecTest : public ::testing::Test {
 protected:
  boost::intrusive_ptr<IFormatCodec> codec_ = FormatCodec::Create();
  const int liveBlobs_ = CountingBlob::Live().load();
};

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

// The constructor's children are not restored by SetProperty; SetOptionsEncode brings its own
// back, and the private data, outside the tree, is untouched throughout.
TEST_F(FormatCodecTest, SetPropertyWithoutOptionsRemovesThemUntilSetAgain) {
  const auto blob = CountingBlob::Create();
  codec_->SetPrivateData(blob);
  codec_->SetProperty(Property("t"));
  EXPECT_FALSE(codec_->ExistsOptionsEncode());
  EXPECT_FALSE(codec_->ExistsOptionsAnalyze());
  EXPECT_EQ(TarvekTest::MissingKey([&] { codec_->GetOptionsEncode(); }),
            IFormatCodec::TAG_CODEC_OPTIONS_ENCODE);

  codec_->SetOptionsEncode(Property("o"));
  EXPECT_EQ(TarvekTest::ChildNames(codec_->GetProperty()), "metadata encode_options ");
  EXPECT_EQ(codec_->GetPrivateData(), blob);
}

// Set copies the content under the option key (whatever the given tree's name), replacing what
// was there in place; Get is a view into the tree.
TEST_F(FormatCodecTest, OptionSettersCopyContentUnderTheirKey) {
  using Setter = void (IFormatCodec::*)(const Property&);
  using Getter = const Property& (IFormatCodec::*)() const;
  Property options("anything");
  options.SetChildT<std::string>("preset", "slow");
  for (const auto& [key, set, get] :
       {std::tuple<std::string, Setter, Getter>{IFormatCodec::TAG_CODEC_OPTIONS_ENCODE,
                                                &IFormatCodec::SetOptionsEncode,
                                                &IFormatCodec::GetOptionsEncode},
        {IFormatCodec::TAG_CODEC_OPTIONS_ANALYZE, &IFormatCodec::SetOptionsAnalyze,
         &IFormatCodec::GetOptionsAnalyze}}) {
    const Property& view = ((*codec_).*get)();
    EXPECT_EQ(&view, &codec_->GetProperty()[key]);
    for (const Property& given : {options, Property("other", true)}) {
      Property expected(key);
      expected = given;
      ((*codec_).*set)(given);
      EXPECT_EQ(view, expected);
    }
  }
  EXPECT_EQ(TarvekTest::ChildNames(codec_->GetProperty()),
            "metadata encode_options analyze_options codec_name ");
}

// The new blob is referenced before the old one is released, so handing in the held blob keeps
// it; Get hands out the held blob itself, with one more reference. The comparison ignores it.
TEST_F(FormatCodecTest, PrivateDataIsReferencedWhileHeld) {
  const auto first = CountingBlob::Create();
  const auto second = CountingBlob::Create();
  codec_->SetPrivateData(first);
  codec_->SetPrivateData(first);
  EXPECT_EQ(first->GetRefCount(), 2);
  codec_->SetPrivateData(second);
  EXPECT_EQ(first->GetRefCount(), 1);
  EXPECT_EQ(second->GetRefCount(), 2);
  const auto held = codec_->GetPrivateData();
  EXPECT_EQ(held, second);
  EXPECT_EQ(second->GetRefCount(), 3);
  EXPECT_TRUE(codec_->Compare(FormatCodec::Create()));

  codec_->SetPrivateData(CountingBlob::Create());
  EXPECT_EQ(CountingBlob::Live().load(), liveBlobs_ + 3);
  codec_->SetPrivateData(nullptr);
  EXPECT_EQ(CountingBlob::Live().load(), liveBlobs_ + 2);
  EXPECT_EQ(codec_->GetPrivateData(), nullptr);
  codec_->SetPrivateData(CountingBlob::Create());
  codec_.reset();
  EXPECT_EQ(CountingBlob::Live().load(), liveBlobs_ + 2);
}

}  // namespace
