// Tarvek::Core::Property: values, copies and assignments (aliasing included), look-up (indexed
// containers among them), the set-or-append order of SetChild / SetChildT / CreateChildT, the
// pinned refusals and errors, equality and PrintPropertyValue.
#include <functional>
#include <iterator>
#include <random>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

#include <Tarvek/Formats.h>
#include "Support/TestSupport.h"

namespace {

using Tarvek::Core::ChildNotFound;
using Tarvek::Core::MethodIsNotApplicable;
using Tarvek::Core::Property;
using Tarvek::Core::PropertyException;
using Tarvek::Core::PropertyKey;
using Tarvek::Core::WrongPropertyType;
using TarvekTest::CatchAs;
using TarvekTest::ChildNames;
using TarvekTest::ItemOf;

// root { a { x: 1, y { z: 2 } }, b: 3, s: "text" }
Property SampleTree() {
  Property root("root");
  Property& a = root.SetChild("a");
  a.SetChildT<long long>("x", 1);
  a.SetChild("y").SetChildT<long long>("z", 2);
  root.SetChildT<long long>("b", 3);
  root.SetChildT<std::string>("s", "text");
  return root;
}

TEST(PropertyTest, ConstructorsMakeTheTypeOfTheirValue) {
  EXPECT_EQ(Property("c").GetType(), Tarvek::PropertyTypeContainer);
  EXPECT_TRUE(Property("c").GetChildren().empty());
  EXPECT_TRUE(Property("b", true).GetBool());
  EXPECT_EQ(Property("i", 5000000000LL).GetInt64(), 5000000000LL);
  // A string literal must become a string, not a bool through pointer conversion.
  EXPECT_EQ(Property("s", "literal").GetString(), "literal");
  EXPECT_EQ(Property("s", std::string("a\0b", 3)).GetString().size(), 3u);
  EXPECT_EQ(Property("i", -7).GetInt64(), -7);
  EXPECT_EQ(Property("u", 4000000000u).GetInt64(), 4000000000LL);
  // The tag values are part of the binary interface and show as numbers in error reports.
  EXPECT_EQ((std::vector<int>{Tarvek::PropertyTypeBool, Tarvek::PropertyTypeInt64,
                              Tarvek::PropertyTypeString, Tarvek::PropertyTypeContainer}),
            (std::vector<int>{1, 2, 3, 6}));
  EXPECT_STREQ(Tarvek::PropertyTypeName(static_cast<Tarvek::PropertyTypes>(4)), "unknown");
  // Equality counts the type, not only the "value", and the children's order.
  Property first("p"), second("p");
  first.SetChildT<long long>("x", 1);
  first.SetChildT<long long>("y", 2);
  second.SetChildT<long long>("y", 2);
  second.SetChildT<long long>("x", 1);
  EXPECT_NE(first, second);
  EXPECT_NE(Property("p", true), Property("p", 1));
  EXPECT_NE(Property("p"), Property("p", ""));
  EXPECT_FALSE(Property("p", 1) != Property("p", 1));
}

// Copies are deep; copy-assignment keeps the target's name, move-assignment takes the source's;
// a source inside the target (itself, a child, a grandchild, its own string) is read first.
TEST(PropertyTest, AssignmentsKeepNamesAndSurviveAliasing) {
  const Property source = SampleTree();
  Property copy(source);
  Property target("target", 1);
  target = source;
  EXPECT_EQ(target.GetName(), "target");
  EXPECT_EQ(ChildNames(target), "a b s ");
  copy["a"]["y"].SetChildT<long long>("z", 99);
  target["a"]["y"].SetChildT<long long>("z", 98);
  EXPECT_EQ(source, SampleTree());

  Property root = SampleTree();
  root = static_cast<const Property&>(root);
  EXPECT_EQ(root, SampleTree());
  Property expected("root");
  expected.SetChildT<long long>("x", 1);
  expected.SetChild("y").SetChildT<long long>("z", 2);
  root = root["a"];
  EXPECT_EQ(root, expected);
  root = root["y"]["z"];
  EXPECT_EQ(root, Property("root", 2));

  Property leaf("leaf", 5);
  target = std::move(leaf);
  EXPECT_EQ(target, Property("leaf", 5));
  EXPECT_EQ(leaf.GetType(), Tarvek::PropertyTypeContainer);  // left an empty container
  root = SampleTree();
  root = std::move(root["a"]);
  EXPECT_EQ(root.GetName(), "a");
  EXPECT_EQ(root["y"]["z"].GetInt64(), 2);

  // A value makes a leaf and drops the children.
  Property node = SampleTree();
  node = true;
  EXPECT_EQ(node, Property("root", true));
  node = SampleTree();
  node = 7LL;
  EXPECT_EQ(node, Property("root", 7LL));
  node = "literal";
  EXPECT_EQ(node, Property("root", "literal"));
  node = SampleTree();
  node = node["s"].GetString();
  EXPECT_EQ(node, Property("root", "text"));
  node = node.GetString();
  EXPECT_EQ(node, Property("root", "text"));
}

// Look-ups find the first direct child of a name; the const operator[] throws, naming node and
// child; the other one appends an empty container.
TEST(PropertyTest, LookUpFindsTheFirstDirectChild) {
  Property root("root");
  root.CreateChildT<long long>("d", 1);
  root.CreateChildT<long long>("d", 2);
  root.SetChild("box").SetChildT<bool>("inner", true);
  const Property& view = root;
  EXPECT_EQ(root.FindChild("d"), root.GetChildren().begin());
  EXPECT_EQ(view["d"].GetInt64(), 1);
  EXPECT_FALSE(view.ChildExists("inner"));  // grandchildren do not count

  const auto error = CatchAs<ChildNotFound>([&] { (void)view["missing"]; });
  ASSERT_TRUE(error);
  EXPECT_EQ(ItemOf<PropertyException::PropertyNameInfo>(*error), "root");
  EXPECT_EQ(ItemOf<ChildNotFound::ChildNameInfo>(*error), "missing");
  EXPECT_TRUE(ItemOf<Tarvek::CallStackInfo>(*error));
  const std::string description = ItemOf<Tarvek::DescriptionInfo>(*error).value_or("");
  EXPECT_NE(description.find("\"root\" has no child \"missing\""), std::string::npos)
      << description;
  const Property leaf("leaf", 1);
  EXPECT_TRUE(CatchAs<ChildNotFound>([&] { (void)leaf["x"]; }));

  EXPECT_EQ(&root["box"], &*std::next(root.GetChildren().begin(), 2));
  Property& added = root["new"];
  EXPECT_EQ(&added, &root.GetChildren().back());
  EXPECT_EQ(added, Property("new"));
  EXPECT_EQ(ChildNames(root), "d d box new ");
}

std::size_t Nodes(const Property& node) {
  std::size_t count = 1;
  for (const Property& child : node.GetChildren()) count += Nodes(child);
  return count;
}

// Containers of eight children or more keep an index by name: random edits (appends, renames in
// place by moves, copies, moves, emptying, retyping) must leave every look-up, by text and by
// PropertyKey, answering as a scan for the first child of the name. The seed is fixed.
TEST(PropertyTest, IndexedLookUpsAgreeWithAScanAfterEdits) {
  const std::vector<std::string> names = {"",
                                          "a",
                                          "ab",
                                          "abc",
                                          "acc",
                                          "abcd",
                                          "abce",
                                          "width",
                                          "height",
                                          std::string("nul\0in", 6),
                                          std::string("nul\0on", 6),
                                          "a name of more than thirty-two bytes, long enough",
                                          "a name of more than thirty-two bytes, long enougH"};
  std::mt19937 random(20261206);
  const auto pick = [&](std::size_t n) {
    return std::uniform_int_distribution<std::size_t>(0, n - 1)(random);
  };
  const auto name = [&] { return names[pick(names.size())]; };
  std::vector<Property> trees(3, Property("tree"));
  for (int step = 0; step < 3000; ++step) {
    Property& tree = trees[pick(trees.size())];
    const Property& other = trees[pick(trees.size())];
    if (Nodes(tree) > 300) tree = Property("tree");
    const auto& children = tree.GetChildren();
    const long at = children.empty() ? 0 : static_cast<long>(pick(children.size()));
    Property* child = nullptr;  // non-const: the first child is the first of its name
    if (!children.empty()) child = &*std::next(tree.FindChild(children.begin()->GetName()), at);
    const bool box = child != nullptr && child->GetType() == Tarvek::PropertyTypeContainer;
    const std::size_t edit = pick(10);
    if (edit == 0) tree.SetChildT<long long>(name(), step);
    if (edit == 1) tree.CreateChildT<std::string>(name(), "v");
    if (edit == 2) tree[name()];
    if (edit == 3 && child != nullptr) *child = Property(name(), 1LL);     // renamed in place
    if (edit == 4 && child != nullptr) Property taken(std::move(*child));  // left unnamed
    if (edit == 5 && &tree != &other) tree = other;
    if (edit == 6 && &tree != &other) tree = Property(other);
    if (edit == 7 && box) child->SetChild(name());
    if (edit == 8) tree.SetChild(name(), other);
    if (edit == 9 && box) tree = *child;
    if (edit == 9 && !box && pick(20) == 0) {
      tree = true;  // a tree turned leaf drops its index, and starts again
      tree = Property("tree");
    }
    for (const std::string& each : names) {
      const Property* first = nullptr;
      for (const Property& c : children) first = first || c.GetName() != each ? first : &c;
      const auto byText = tree.FindChild(each);
      const auto byKey = tree.FindChild(PropertyKey(each));
      ASSERT_EQ(byText == children.end() ? nullptr : &*byText, first) << "step " << step;
      ASSERT_EQ(byKey == children.end() ? nullptr : &*byKey, first) << "step " << step;
      ASSERT_EQ(tree.ChildExists(PropertyKey(each)), first != nullptr) << "step " << step;
      if (first != nullptr) {
        ASSERT_EQ(&std::as_const(tree)[PropertyKey(each)], first) << "step " << step;
      }
    }
  }
}

// SetChild empties or replaces the first child of the name in place (keeping its key), or
// appends; the node itself may be the value.
TEST(PropertyTest, SetChildEmptiesOrAppendsInPlace) {
  Property root = SampleTree();
  const Property* a = &root["a"];
  EXPECT_EQ(&root.SetChild("a"), a);
  EXPECT_EQ(*a, Property("a"));
  EXPECT_EQ(&root.SetChild("b"), &root["b"]);  // a leaf becomes an empty container
  EXPECT_EQ(root["b"], Property("b"));
  EXPECT_EQ(&root.SetChild("a", Property("other", "v")), a);
  EXPECT_EQ(*a, Property("a", "v"));
  EXPECT_EQ(root.SetChild("d", Property("other", 4)), Property("d", 4));
  EXPECT_EQ(ChildNames(root), "a b s d ");

  Property node("root");
  node.SetChildT<long long>("a", 1);
  const Property before = node;
  node.SetChild("c", node);  // appended: a copy of the node as it was before the call
  Property expected = before;
  expected.SetChild("c", before);
  EXPECT_EQ(node, expected);
  node = before;
  node.SetChild("a", node);  // replaced in place: "a" takes the node's content, old "a" included
  EXPECT_EQ(ChildNames(node), "a ");
  EXPECT_EQ(node["a"]["a"].GetInt64(), 1);
}

// SetChildT sets the first child of the name in place (retyping it) or appends; CreateChildT
// always appends. References stay valid as children are appended.
TEST(PropertyTest, SetChildTSetsTheFirstInPlaceAndCreateChildTAppends) {
  Property root("root");
  Property& first = root.SetChildT<long long>("first", 1);
  Property& one = root.CreateChildT<std::string>("item", "one");
  Property& two = root.CreateChildT<std::string>("item", "two");
  EXPECT_EQ(&two, &root.GetChildren().back());
  for (int i = 0; i < 50; ++i) root.SetChildT<long long>("more" + std::to_string(i), i);
  EXPECT_EQ(&root.SetChildT<long long>("first", 11), &first);
  EXPECT_EQ(first, Property("first", 11));
  EXPECT_EQ(&root.SetChildT<std::string>("item", "new"), &one);
  EXPECT_EQ(one.GetString() + two.GetString(), "newtwo");
  EXPECT_EQ(root.GetChildren().size(), 53u);
  EXPECT_EQ(root.SetChildT<std::string>("first", "one"), Property("first", "one"));
  Property& box = root.SetChild("box");
  box.SetChildT<bool>("inner", true);
  EXPECT_EQ(&root.SetChildT<bool>("box", false), &box);
  EXPECT_EQ(box, Property("box", false));
}

// Adding a child to a leaf is refused, the leaf unchanged, with items naming node and method.
// The typed helpers record their throw statements in Property.h; the others in the library.
TEST(PropertyTest, LeavesRefuseChildren) {
  struct Refusal {
    const char* method;
    int line;  // 0: not pinned
    const char* valueType;
    std::function<void(Property&)> call;
  };
  const Refusal refusals[] = {
      {"SetChildT", 257, "bool", [](Property& p) { p.SetChildT<bool>("c", true); }},
      {"SetChildT", 257, "long long", [](Property& p) { p.SetChildT<long long>("c", 1); }},
      {"SetChildT", 257, "std::basic_string<char>",
       [](Property& p) { p.SetChildT<std::string>("c", "x"); }},
      {"CreateChildT", 240, "bool", [](Property& p) { p.CreateChildT<bool>("c", true); }},
      {"CreateChildT", 240, "long long", [](Property& p) { p.CreateChildT<long long>("c", 1); }},
      {"CreateChildT", 240, "std::basic_string<char>",
       [](Property& p) { p.CreateChildT<std::string>("c", "x"); }},
      {"operator[]", 0, "", [](Property& p) { (void)p["c"]; }},
      {"SetChild", 0, "", [](Property& p) { p.SetChild("c"); }},
      {"SetChild", 0, "", [](Property& p) { p.SetChild("c", Property("c")); }},
  };
  for (const Property& leaf : {Property("flag", false), Property("count", 3), Property("t", "v")}) {
    for (const Refusal& refusal : refusals) {
      SCOPED_TRACE(leaf.GetName() + " / " + refusal.method + " " + refusal.valueType);
      Property node = leaf;
      const auto error = CatchAs<MethodIsNotApplicable>([&] { refusal.call(node); });
      ASSERT_TRUE(error);
      EXPECT_EQ(node, leaf);
      EXPECT_EQ(ItemOf<PropertyException::PropertyNameInfo>(*error), leaf.GetName());
      EXPECT_EQ(ItemOf<PropertyException::PropertyTypeInfo>(*error), leaf.GetType());
      EXPECT_EQ(ItemOf<PropertyException::MethodNameInfo>(*error), refusal.method);
      EXPECT_FALSE(ItemOf<Tarvek::CallStackInfo>(*error).value_or("").empty());
      EXPECT_FALSE(ItemOf<Tarvek::DescriptionInfo>(*error));
      if (refusal.line == 0) continue;
      TarvekTest::ExpectThrownAt(*error, "Core/Interfaces/Property.h", refusal.line,
                                 std::string("Tarvek::Core::Property &Tarvek::Core::Property::") +
                                     refusal.method + "(const std::string &, const " +
                                     refusal.valueType + " &)");
    }
  }
}

TEST(PropertyTest, TypedGettersThrowWrongPropertyType) {
  struct Getter {
    Tarvek::PropertyTypes type;
    const char* name;
    void (*call)(const Property&);
  };
  const Getter getters[] = {
      {Tarvek::PropertyTypeBool, "GetBool", [](const Property& p) { (void)p.GetBool(); }},
      {Tarvek::PropertyTypeInt64, "GetInt64", [](const Property& p) { (void)p.GetInt64(); }},
      {Tarvek::PropertyTypeString, "GetString", [](const Property& p) { (void)p.GetString(); }},
  };
  for (const Property& node :
       {Property("n", true), Property("n", 1), Property("n", "s"), Property("n")}) {
    for (const Getter& getter : getters) {
      if (node.GetType() == getter.type) continue;
      SCOPED_TRACE(std::string(getter.name) + " on " + Tarvek::PropertyTypeName(node.GetType()));
      const auto error = CatchAs<WrongPropertyType>([&] { getter.call(node); });
      ASSERT_TRUE(error);
      EXPECT_EQ(ItemOf<PropertyException::PropertyTypeInfo>(*error), node.GetType());
      EXPECT_EQ(ItemOf<WrongPropertyType::RequestedTypeInfo>(*error), getter.type);
      EXPECT_EQ(ItemOf<PropertyException::PropertyNameInfo>(*error), "n");
      EXPECT_EQ(ItemOf<PropertyException::MethodNameInfo>(*error), getter.name);
      EXPECT_TRUE(ItemOf<Tarvek::DescriptionInfo>(*error));
      EXPECT_TRUE(ItemOf<Tarvek::CallStackInfo>(*error));
    }
  }
}

std::string Print(const Property& node, int indent, bool showTypes, bool recursive) {
  std::ostringstream out;
  Tarvek::Core::PrintPropertyValue(node, indent, out, showTypes, recursive);
  return out.str();
}

// Every leaf type, bytes that must be escaped, UTF-8, an unnamed node, and the flags.
TEST(PropertyTest, PrintsIndentedTreeWithEscapes) {
  Property root("root");
  root.SetChildT<bool>("flag", true);
  root.SetChildT<long long>("count", -3);
  root.SetChildT<std::string>("text", std::string("q\"b\\n\nt\tr\r\x01\x7f\0", 13));
  root.SetChild("").SetChildT<std::string>("na\"me", "\xc3\xa9");
  EXPECT_EQ(Print(root, 1, true, true),
            "  root (container)\n"
            "    flag (bool): true\n"
            "    count (int64): -3\n"
            "    text (string): \"q\\\"b\\\\n\\nt\\tr\\r\\x01\\x7f\\x00\"\n"
            "    <unnamed> (container)\n"
            "      na\\\"me (string): \"\xc3\xa9\"\n");
  EXPECT_EQ(Print(root, 0, false, true),
            "root\n"
            "  flag: true\n"
            "  count: -3\n"
            "  text: \"q\\\"b\\\\n\\nt\\tr\\r\\x01\\x7f\\x00\"\n"
            "  <unnamed>\n"
            "    na\\\"me: \"\xc3\xa9\"\n");
  EXPECT_EQ(Print(root, 2, true, false), "    root (container)\n");
  EXPECT_EQ(Print(Property("f", false), 0, false, false), "f: false\n");
  EXPECT_EQ(Print(Property("e", ""), 0, true, true), "e (string): \"\"\n");
}

}  // namespace
