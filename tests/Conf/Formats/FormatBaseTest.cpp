// FormatBase: construction, reference counting, the property tree with its metadata child,
// comparison, compatibility and the printed content.
#include <Tarvek/Formats.h>

#include <string>

#include "Support/TestSupport.h"

namespace {

using Tarvek::Conf::FormatBase;
using Tarvek::Conf::IFormat;
using Tarvek::Core::Property;

// A description that records its destruction, to see when Release frees the whole object.
class TrackedFormat : public FormatBase {
 public:
  TrackedFormat(const std::string& name, bool* destroyed)
      : FormatBase(name), destroyed_(destroyed) {}
  ~TrackedFormat() override { *destroyed_ = true; }

 private:
  bool* destroyed_;
};

// A description named "desc" whose metadata holds a language, and a tree to replace it with.
class FormatBaseTest : public ::testing::Test {
 protected:
  FormatBaseTest() {
    Property metadata("ignored");
    metadata.SetChildT<std::string>("language", "eng");
    format_->SetMetadata(metadata);
    replacement_.SetChildT<long long>("width", 720);
    replacement_.SetChildT<bool>("interlaced", false);
  }

  // `tree` as the description's tree: renamed "desc".
  static Property AsDesc(const Property& tree) {
    Property renamed("desc");
    renamed = tree;
    return renamed;
  }

  boost::intrusive_ptr<FormatBase> format_{new FormatBase("desc")};
  Property replacement_{"other"};
};

// The runtime entry key is read by tools that inspect descriptions, so its text is fixed.
TEST_F(FormatBaseTest, NewBaseHasNamedRootEmptyMetadataAndObjectEntry) {
  const FormatBase base("stream");
  Property expected("stream");
  expected.SetChild(IFormat::TAG_METADATA);
  EXPECT_EQ(base.GetProperty(), expected);
  EXPECT_EQ(&base.GetMetadata(), &base.GetProperty().GetChildren().front());
  const auto& internal = base.GetInternalProperties();
  ASSERT_EQ(internal.size(), 1u);
  EXPECT_EQ(internal.begin()->first, "object_name");
  EXPECT_EQ(internal.begin()->second.data(), "stream");
  EXPECT_TRUE(internal.begin()->second.empty());
}

// The count starts at 0 for the first intrusive_ptr to take; the Release that reaches 0 frees
// the whole object, derived part included, and no earlier one does.
TEST_F(FormatBaseTest, OnlyTheLastReleaseFreesTheObject) {
  bool destroyed = false;
  const auto* raw = new TrackedFormat("x", &destroyed);
  EXPECT_EQ(raw->GetRefCount(), 0);
  boost::intrusive_ptr<const IFormat> held(raw);
  EXPECT_EQ(raw->AddRef(), 2);
  EXPECT_EQ(raw->Release(), 1);
  EXPECT_FALSE(destroyed);
  EXPECT_EQ(held.detach()->Release(), 0);
  EXPECT_TRUE(destroyed);
}

// SetProperty keeps the root's name and the tree's own metadata, or adds an empty one.
TEST_F(FormatBaseTest, SetPropertyKeepsOrAddsTheMetadata) {
  format_->SetProperty(replacement_);
  Property expected = AsDesc(replacement_);
  expected.SetChild(IFormat::TAG_METADATA);
  EXPECT_EQ(format_->GetProperty(), expected);
  EXPECT_EQ(format_->GetInternalProperties().size(), 1u);

  Property metadata(IFormat::TAG_METADATA);
  metadata.SetChildT<std::string>("title", "Intro");
  replacement_.SetChild(IFormat::TAG_METADATA, metadata);
  replacement_.SetChildT<long long>("height", 576);
  format_->SetProperty(replacement_);
  EXPECT_EQ(format_->GetProperty(), AsDesc(replacement_));
  EXPECT_EQ(format_->GetMetadata(), metadata);
}

// Passing a reference into the description's own tree must copy before it replaces.
TEST_F(FormatBaseTest, SetPropertyAcceptsItsOwnTree) {
  const Property before = format_->GetProperty();
  format_->SetProperty(format_->GetProperty());
  EXPECT_EQ(format_->GetProperty(), before);

  format_->SetProperty(format_->GetMetadata());
  Property expected("desc");
  expected.SetChildT<std::string>("language", "eng");
  expected.SetChild(IFormat::TAG_METADATA);
  EXPECT_EQ(format_->GetProperty(), expected);
}

// A leaf cannot take the metadata child, so the description refuses it and stays as it was.
TEST_F(FormatBaseTest, SetPropertyWithLeafThrowsAndChangesNothing) {
  const Property before = format_->GetProperty();
  EXPECT_TRUE(TarvekTest::CatchAs<Tarvek::Core::MethodIsNotApplicable>(
      [&] { format_->SetProperty(Property("x", true)); }));
  EXPECT_EQ(format_->GetProperty(), before);
}

// The tree alone counts, child order and root name included; never equal to an absent one.
TEST_F(FormatBaseTest, CompareLooksAtTheWholeTreeOnly) {
  boost::intrusive_ptr<FormatBase> other(new FormatBase("desc"));
  EXPECT_FALSE(format_->Compare(other));
  other->SetMetadata(format_->GetMetadata());
  other->GetInternalProperties().put("session", "42");
  EXPECT_TRUE(format_->Compare(other));
  EXPECT_TRUE(other->Compare(format_));
  EXPECT_FALSE(format_->Compare(nullptr));

  Property swapped("t");
  swapped.SetChildT<bool>("interlaced", false);
  swapped.SetChildT<long long>("width", 720);
  format_->SetProperty(replacement_);
  other->SetProperty(swapped);
  EXPECT_FALSE(format_->Compare(other));
  boost::intrusive_ptr<FormatBase> renamed(new FormatBase("renamed"));
  renamed->SetProperty(replacement_);
  EXPECT_FALSE(format_->Compare(renamed));
}

TEST_F(FormatBaseTest, IsCompatibleAcceptsAnything) {
  EXPECT_TRUE(format_->IsCompatible(new FormatBase("other")));
  EXPECT_TRUE(format_->IsCompatible(Tarvek::Conf::FormatCodec::Create()));
  EXPECT_TRUE(format_->IsCompatible(nullptr));
}

// Runtime entries print in insertion order, top level only: an entry under "a.b" shows as the
// empty "a" and nothing of "b". The fixture's SetMetadata replaced the empty metadata, under its
// key.
TEST_F(FormatBaseTest, PrintContentShowsTopLevelEntriesInOrder) {
  auto& internal = format_->GetInternalProperties();
  internal.put("zeta", "1");
  internal.put("a.b", "hidden");
  internal.put("alpha", "two words");
  TarvekTest::CaptureStdout capture;
  format_->PrintContent();
  EXPECT_EQ(capture.Text(),
            "======External props:=====\n"
            "desc (container)\n"
            "  metadata (container)\n"
            "    language (string): \"eng\"\n"
            "======Runtime props:=======\n"
            "object_name: desc\n"
            "zeta: 1\n"
            "a: \n"
            "alpha: two words\n");
}

}  // namespace
