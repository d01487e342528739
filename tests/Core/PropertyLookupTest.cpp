// Look-up by name in containers of every size: the answers of ChildExists, FindChild and
// operator[] (by text and by PropertyKey) must always be those of a plain scan for the first child
// of the name, however the children were added, copied, moved, emptied or renamed in place. Large
// containers keep an index of their children, so these cases cross its size thresholds.
#include <iterator>
#include <random>
#include <string>
#include <utility>
#include <vector>

#include <Tarvek/Formats.h>
#include "Support/TestSupport.h"

namespace {

using Tarvek::Core::ChildNotFound;
using Tarvek::Core::Property;
using Tarvek::Core::PropertyKey;
using TarvekTest::CatchAs;
using TarvekTest::ItemOf;

// Names of every length class a hash or a comparison may treat apart, with near misses: equal
// length and equal first and last bytes, or one byte apart in the middle of a long name.
const std::vector<std::string> kNames = {
    "",
    "a",
    "ab",
    "abc",
    "acc",
    "abcd",
    "abce",
    "width",
    "height",
    "bit_rate",
    "codec_id",
    "bitrate_mode",
    "encode_options",
    "analyze_options",
    "sample_aspect_num",
    "sample_aspect_den",
    "framerate_num_framerate_num_num",
    "framerate_num_framerate_den_num",
    std::string("nul\0in", 6),
    std::string("nul\0on", 6),
    "a name of more than thirty-two bytes, long enough",
    "a name of more than thirty-two bytes, long enougH",
};

// The first child named `name`, found by walking the children: what every look-up must give.
const Property* FirstByScan(const Property& node, const std::string& name) {
  for (const Property& child : node.GetChildren()) {
    if (child.GetName() == name) return &child;
  }
  return nullptr;
}

// Checks every look-up of every name in kNames (and of `extra`) on `node` against the scan.
void ExpectLookUpsAgreeWithScan(const Property& node, const std::vector<std::string>& extra = {}) {
  std::vector<std::string> names = kNames;
  names.insert(names.end(), extra.begin(), extra.end());
  names.emplace_back("absent");
  for (const std::string& name : names) {
    SCOPED_TRACE("name '" + name + "'");
    const Property* expected = FirstByScan(node, name);
    const PropertyKey key(name);
    EXPECT_EQ(node.ChildExists(name), expected != nullptr);
    EXPECT_EQ(node.ChildExists(key), expected != nullptr);
    const auto byText = node.FindChild(name);
    const auto byKey = node.FindChild(key);
    EXPECT_EQ(byText == node.GetChildren().end() ? nullptr : &*byText, expected);
    EXPECT_EQ(byKey == node.GetChildren().end() ? nullptr : &*byKey, expected);
    if (expected != nullptr) {
      EXPECT_EQ(&node[name], expected);
      EXPECT_EQ(&node[key], expected);
    }
  }
}

// A container with the first `count` names of kNames, each an int64 leaf holding its position.
Property ContainerOf(std::size_t count) {
  Property node("node");
  for (std::size_t i = 0; i < count; ++i) node.CreateChildT<long long>(kNames[i], i);
  return node;
}

TEST(PropertyLookupTest, EveryContainerSizeFindsTheFirstChildOfEachName) {
  for (std::size_t count = 0; count <= kNames.size(); ++count) {
    SCOPED_TRACE(std::to_string(count) + " children");
    ExpectLookUpsAgreeWithScan(ContainerOf(count));
  }
  // Hundreds of children, repeated names among them, added in three ways.
  Property node("many");
  std::vector<std::string> extra;
  for (int i = 0; i < 300; ++i) {
    extra.push_back("child_" + std::to_string(i % 200));
    if (i % 3 == 0) {
      node.CreateChildT<long long>(extra.back(), i);
    } else if (i % 3 == 1) {
      node.SetChildT<std::string>(extra.back(), "v");
    } else {
      node[extra.back()];
    }
  }
  for (const std::string& name : kNames) node.CreateChildT<bool>(name, true);
  ExpectLookUpsAgreeWithScan(node, extra);
  EXPECT_EQ(node["child_3"].GetInt64(), 3);  // the first of the two children named child_3
}

TEST(PropertyLookupTest, CopiesAndMovesFindTheirOwnChildren) {
  const Property source = ContainerOf(kNames.size());
  Property copy(source);
  ExpectLookUpsAgreeWithScan(copy);
  EXPECT_NE(&copy["width"], &source["width"]);

  Property assigned = ContainerOf(3);
  assigned = source;
  ExpectLookUpsAgreeWithScan(assigned);
  EXPECT_EQ(assigned.GetName(), "node");

  Property moved(std::move(copy));
  ExpectLookUpsAgreeWithScan(moved);
  Property moveAssigned("other");
  moveAssigned = std::move(moved);
  ExpectLookUpsAgreeWithScan(moveAssigned);
  EXPECT_EQ(moveAssigned["bit_rate"].GetInt64(), 9);

  // A large container copied into one of its own children, and one replaced by its child.
  Property outer = ContainerOf(kNames.size());
  outer.SetChild("inner", outer);
  ExpectLookUpsAgreeWithScan(outer["inner"]);
  outer = outer["inner"];
  ExpectLookUpsAgreeWithScan(outer);
}

TEST(PropertyLookupTest, EmptiedAndRefilledContainersFindOnlyTheNewChildren) {
  Property node = ContainerOf(kNames.size());
  node = 5LL;
  EXPECT_FALSE(node.ChildExists("width"));
  node = Property("fresh");
  for (std::size_t i = kNames.size(); i-- > 0;) node.CreateChildT<long long>(kNames[i], 100);
  ExpectLookUpsAgreeWithScan(node);

  Property root("root");
  Property& child = root.SetChild("child", ContainerOf(kNames.size()));
  root.SetChild("child");
  EXPECT_TRUE(child.GetChildren().empty());
  EXPECT_FALSE(child.ChildExists("width"));
  child.SetChildT<long long>("width", 1);
  ExpectLookUpsAgreeWithScan(child);
}

// A child is renamed in place by moving another property into it (it takes that name) or by
// moving it out (it is left unnamed). Look-ups must follow, including where the new name makes
// the renamed child the first of a name that a later child also has.
TEST(PropertyLookupTest, ChildrenRenamedInPlaceAreFoundUnderTheirNewNames) {
  Property node = ContainerOf(kNames.size());
  Property* const width = &*node.FindChild("width");
  *width = Property("height", 7LL);
  ExpectLookUpsAgreeWithScan(node);
  EXPECT_EQ(&node["height"], width);
  EXPECT_FALSE(node.ChildExists("width"));

  // Moved out of, a child is left unnamed: found under the empty name, which no child had.
  Property unnamed("node");
  for (std::size_t i = 1; i < kNames.size(); ++i) unnamed.CreateChildT<long long>(kNames[i], i);
  Property taken(std::move(*unnamed.FindChild("codec_id")));
  EXPECT_EQ(taken.GetName(), "codec_id");
  ExpectLookUpsAgreeWithScan(unnamed);
  EXPECT_FALSE(unnamed.ChildExists("codec_id"));
  EXPECT_TRUE(unnamed.ChildExists(""));

  // Appending after renames still indexes under the current names.
  node.CreateChildT<long long>("width", 8);
  ExpectLookUpsAgreeWithScan(node);
  EXPECT_EQ(node["width"].GetInt64(), 8);

  // Renaming a child of one tree leaves the look-ups of another tree right.
  const Property other = ContainerOf(kNames.size());
  *ContainerOf(kNames.size()).FindChild("abc") = Property("renamed");
  ExpectLookUpsAgreeWithScan(other);
}

TEST(PropertyLookupTest, KeysReadLikeTheirTexts) {
  const Property node = ContainerOf(kNames.size());
  const PropertyKey key("sample_aspect_den");
  EXPECT_EQ(key.GetName(), "sample_aspect_den");
  EXPECT_EQ(node[key].GetInt64(), 15);
  const PropertyKey missing("sample_aspect_dem");
  const auto error = CatchAs<ChildNotFound>([&] { (void)node[missing]; });
  ASSERT_TRUE(error);
  EXPECT_EQ(ItemOf<ChildNotFound::ChildNameInfo>(*error), "sample_aspect_dem");
  EXPECT_EQ(ItemOf<Tarvek::Core::PropertyException::PropertyNameInfo>(*error), "node");
  EXPECT_FALSE(Property("leaf", 1LL).ChildExists(key));
}

std::size_t Nodes(const Property& node) {
  std::size_t count = 1;
  for (const Property& child : node.GetChildren()) count += Nodes(child);
  return count;
}

// A long run of random edits (appends of every kind, renames by moving into and out of children,
// copies, emptying, value assignments) on a few containers that grow past the index thresholds;
// after every edit each look-up must still agree with the scan. The seed is fixed, so a failure
// repeats.
TEST(PropertyLookupTest, RandomEditsKeepLookUpsRight) {
  std::mt19937 random(20261206);
  const auto pick = [&random](std::size_t count) {
    return std::uniform_int_distribution<std::size_t>(0, count - 1)(random);
  };
  const auto name = [&] { return kNames[pick(kNames.size())]; };
  std::vector<Property> trees(3, Property("tree"));
  for (int step = 0; step < 3000; ++step) {
    Property& tree = trees[pick(trees.size())];
    Property& other = trees[pick(trees.size())];
    // Copies of trees into trees grow fast: a tree past a few hundred nodes starts again.
    if (Nodes(tree) > 300) tree = Property("tree");
    const auto child = [&](Property& node) -> Property* {
      if (node.GetChildren().empty()) return nullptr;
      auto it = node.FindChild(node.GetChildren().begin()->GetName());
      std::advance(it, static_cast<long>(pick(node.GetChildren().size())));
      return &*it;
    };
    switch (pick(9)) {
      case 0:
        tree.SetChildT<long long>(name(), step);
        break;
      case 1:
        tree.CreateChildT<std::string>(name(), "v");
        break;
      case 2:
        tree[name()];
        break;
      case 3:  // renamed in place: a child takes another property's name
        if (Property* target = child(tree)) *target = Property(name(), 1LL);
        break;
      case 4:  // renamed in place: a child moved out of is left unnamed
        if (Property* source = child(tree)) Property taken(std::move(*source));
        break;
      case 5:
        if (&tree != &other) tree = other;
        break;
      case 6:  // a child container filled or emptied in place
        if (Property* target = child(tree)) {
          if (target->GetType() == Tarvek::PropertyTypeContainer) target->SetChild(name());
        }
        break;
      case 7:
        if (pick(20) == 0) tree = true;  // now and then a tree becomes a leaf and starts again
        if (tree.GetType() != Tarvek::PropertyTypeContainer) tree = Property("tree");
        break;
      default:
        tree.SetChild(name(), other);
        break;
    }
    SCOPED_TRACE("step " + std::to_string(step));
    ExpectLookUpsAgreeWithScan(tree);
    if (::testing::Test::HasFailure()) return;
  }
}

}  // namespace
