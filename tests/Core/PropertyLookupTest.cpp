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

std::size_t Nodes(const Property& node) {
  std::size_t count = 1;
  for (const Property& child : node.GetChildren()) count += Nodes(child);
  return count;
}

// A long run of random edits (appends of every kind, renames by moving into and out of children,
// copies and moves of whole trees, emptying, value assignments) on a few containers that grow
// past the index thresholds; after every edit each look-up must still agree with the scan. The
// seed is fixed, so a failure repeats.
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
    switch (pick(10)) {
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
        if (&tree == &other) break;
        if (pick(2) == 0) {
          tree = other;
        } else {
          Property copy(other);
          tree = std::move(copy);
        }
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
      case 8:
        tree.SetChild(name(), other);
        break;
      default:  // a tree replaced by one of its own children
        if (Property* source = child(tree)) {
          if (source->GetType() == Tarvek::PropertyTypeContainer) tree = *source;
        }
        break;
    }
    SCOPED_TRACE("step " + std::to_string(step));
    ExpectLookUpsAgreeWithScan(tree);
    if (::testing::Test::HasFailure()) return;
  }
}

}  // namespace
