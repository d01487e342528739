// Tarvek::Core::Property: construction, copying and assignment (aliasing included), look-up,
// SetChild, the typed child helpers SetChildT / CreateChildT with their pinned refusals, typed
// getters, equality and PrintPropertyValue.
#include <functional>
#include <iterator>
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
  const Property container("c");
  EXPECT_EQ(container.GetName(), "c");
  EXPECT_EQ(container.GetType(), Tarvek::PropertyTypeContainer);
  EXPECT_TRUE(container.GetChildren().empty());
  EXPECT_TRUE(Property("b", true).GetBool());
  EXPECT_EQ(Property("i", 5000000000LL).GetInt64(), 5000000000LL);
  // A string literal must become a string, not a bool through pointer conversion.
  EXPECT_EQ(Property("s", "literal").GetString(), "literal");
  EXPECT_EQ(Property("s", std::string("a\0b", 3)).GetString().size(), 3u);
  // Other integer types widen to int64, keeping sign or magnitude.
  EXPECT_EQ(Property("i", -7).GetInt64(), -7);
  EXPECT_EQ(Property("u", 4000000000u).GetInt64(), 4000000000LL);
  // The tag values are part of the binary interface and show as numbers in error reports.
  EXPECT_EQ((std::vector<int>{Tarvek::PropertyTypeBool, Tarvek::PropertyTypeInt64,
                              Tarvek::PropertyTypeString, Tarvek::PropertyTypeContainer}),
            (std::vector<int>{1, 2, 3, 6}));
  EXPECT_STREQ(Tarvek::PropertyTypeName(static_cast<Tarvek::PropertyTypes>(4)), "unknown");
}

// Copies are deep; copy-assignment keeps the target's name and takes type, value and children.
TEST(PropertyTest, CopiesAreDeepAndAssignmentKeepsTheTargetName) {
  const Property source = SampleTree();
  Property copy(source);
  EXPECT_EQ(copy, source);
  Property target("target");
  target.SetChildT<bool>("old", true);
  target = source;
  EXPECT_EQ(target.GetName(), "target");
  EXPECT_EQ(ChildNames(target), "a b s ");
  EXPECT_EQ(target["a"], source["a"]);
  copy["a"]["y"].SetChildT<long long>("z", 99);
  target["a"]["y"].SetChildT<long long>("z", 98);
  EXPECT_EQ(source, SampleTree());

  Property leaf("leaf", 1);
  leaf = source;
  EXPECT_EQ(leaf.GetType(), Tarvek::PropertyTypeContainer);
  EXPECT_EQ(leaf.GetName(), "leaf");
}

TEST(PropertyTest, CopyAssignmentFromItselfOrADescendant) {
  Property root = SampleTree();
  const Property& self = root;
  root = self;
  EXPECT_EQ(root, SampleTree());

  // The source lives inside the children that the assignment replaces.
  Property expected("root");
  expected.SetChildT<long long>("x", 1);
  expected.SetChild("y").SetChildT<long long>("z", 2);
  root = root["a"];
  EXPECT_EQ(root, expected);

  root = root["y"]["z"];  // a grandchild leaf
  EXPECT_EQ(root, Property("root", 2));
}

TEST(PropertyTest, MoveAssignmentTakesTheName) {
  Property target("target");
  Property leaf("leaf", 5);
  target = std::move(leaf);
  EXPECT_EQ(target, Property("leaf", 5));
  EXPECT_EQ(leaf.GetType(), Tarvek::PropertyTypeContainer);  // left an empty container

  Property root = SampleTree();
  root = std::move(root["a"]);  // from a descendant
  EXPECT_EQ(root.GetName(), "a");
  EXPECT_EQ(ChildNames(root), "x y ");
  EXPECT_EQ(root["y"]["z"].GetInt64(), 2);
}

TEST(PropertyTest, ValueAssignmentMakesALeafAndDropsChildren) {
  Property node = SampleTree();
  node = 5;
  EXPECT_EQ(node, Property("root", 5LL));
  node = true;
  EXPECT_EQ(node, Property("root", true));
  node = SampleTree();
  node = "text";
  EXPECT_EQ(node, Property("root", "text"));

  // The assigned string may belong to the node itself or to one of its children.
  node = node.GetString();
  EXPECT_EQ(node.GetString(), "text");
  node = SampleTree();
  node = node["s"].GetString();
  EXPECT_EQ(node, Property("root", "text"));
}

// Look-ups find the first direct child of a name.
TEST(PropertyTest, LookUpFindsTheFirstDirectChild) {
  Property root("root");
  root.CreateChildT<long long>("d", 1);
  root.CreateChildT<long long>("d", 2);
  root.SetChild("box").SetChildT<bool>("inner", true);
  const Property& view = root;
  EXPECT_EQ(root.FindChild("d"), root.GetChildren().begin());
  EXPECT_EQ(view["d"].GetInt64(), 1);
  EXPECT_TRUE(view.ChildExists("box"));
  EXPECT_FALSE(view.ChildExists("inner"));  // grandchildren do not count
  EXPECT_EQ(view.FindChild("inner"), view.GetChildren().end());

  // The const operator[] never creates: it throws, naming node and child, for containers and
  // leaves alike.
  const auto error = CatchAs<ChildNotFound>([&] { (void)view["missing"]; });
  ASSERT_TRUE(error);
  EXPECT_EQ(ItemOf<PropertyException::PropertyNameInfo>(*error), "root");
  EXPECT_EQ(ItemOf<ChildNotFound::ChildNameInfo>(*error), "missing");
  EXPECT_TRUE(ItemOf<Tarvek::CallStackInfo>(*error));
  const std::string description = ItemOf<Tarvek::DescriptionInfo>(*error).value_or("");
  EXPECT_NE(description.find("\"root\" has no child \"missing\""), std::string::npos)
      << description;
  EXPECT_EQ(ChildNames(root), "d d box ");
  const Property leaf("leaf", 1);
  EXPECT_TRUE(CatchAs<ChildNotFound>([&] { (void)leaf["x"]; }));

  // The non-const operator[] appends an empty container for a missing name.
  EXPECT_EQ(&root["box"], &*std::next(root.GetChildren().begin(), 2));
  Property& added = root["new"];
  EXPECT_EQ(&added, &root.GetChildren().back());
  EXPECT_EQ(added, Property("new"));
  EXPECT_EQ(ChildNames(root), "d d box new ");
}

TEST(PropertyTest, SetChildEmptiesOrAppendsInPlace) {
  Property root = SampleTree();
  const Property* a = &root["a"];
  const Property* b = &root["b"];
  EXPECT_EQ(&root.SetChild("a"), a);
  EXPECT_EQ(*a, Property("a"));
  EXPECT_EQ(&root.SetChild("b"), b);  // a leaf becomes an empty container
  EXPECT_EQ(*b, Property("b"));
  root.SetChild("c");
  EXPECT_EQ(ChildNames(root), "a b s c ");

  // With a value: the child keeps its key and its position.
  EXPECT_EQ(&root.SetChild("a", Property("other", "v")), a);
  EXPECT_EQ(*a, Property("a", "v"));
  EXPECT_EQ(root.SetChild("d", Property("other", 4)), Property("d", 4));
  EXPECT_EQ(ChildNames(root), "a b s c d ");
}

TEST(PropertyTest, SetChildWithTheNodeItself) {
  Property root("root");
  root.SetChildT<long long>("a", 1);
  root.SetChildT<long long>("b", 2);
  const Property before = root;

  // Appended: the child is a copy of the node as it was before the call.
  root.SetChild("c", root);
  Property expected = before;
  expected.SetChild("c", before);
  EXPECT_EQ(root, expected);

  // Replaced in place: child "a" takes the node's content, including the old "a".
  root = before;
  root.SetChild("a", root);
  EXPECT_EQ(ChildNames(root), "a b ");
  EXPECT_EQ(ChildNames(root["a"]), "a b ");
  EXPECT_EQ(root["a"]["a"].GetInt64(), 1);
}

TEST(PropertyTest, SetChildTSetsTheFirstChildInPlaceOrAppends) {
  Property root("root");
  Property& first = root.SetChildT<long long>("first", 1);
  EXPECT_EQ(root.SetChildT<bool>("flag", true), Property("flag", true));
  const Property& text = root.SetChildT<std::string>("text", "v");
  EXPECT_EQ(&text, &root.GetChildren().back());

  EXPECT_EQ(&root.SetChildT<long long>("first", 10), &first);
  EXPECT_EQ(first, Property("first", 10));
  EXPECT_EQ(ChildNames(root), "first flag text ");
  // The reference stays valid while more children are appended.
  for (int i = 0; i < 50; ++i) root.SetChildT<long long>("more" + std::to_string(i), i);
  EXPECT_EQ(&root.SetChildT<long long>("first", 11), &first);
  EXPECT_EQ(first, Property("first", 11));
  EXPECT_EQ(root.GetChildren().size(), 53u);

  // Another type retypes the child; a container turns leaf and drops its children.
  Property& box = root.SetChild("box");
  box.SetChildT<bool>("inner", true);
  EXPECT_EQ(root.SetChildT<std::string>("first", "one"), Property("first", "one"));
  EXPECT_EQ(&root.SetChildT<bool>("box", false), &box);
  EXPECT_EQ(box, Property("box", false));
}

// CreateChildT appends even when the name is taken; SetChildT then sets the first only.
TEST(PropertyTest, CreateChildTAlwaysAppends) {
  Property root("root");
  Property& one = root.CreateChildT<std::string>("item", "one");
  Property& two = root.CreateChildT<std::string>("item", "two");
  EXPECT_EQ(&two, &root.GetChildren().back());
  EXPECT_EQ(ChildNames(root), "item item ");
  EXPECT_EQ(&root.SetChildT<std::string>("item", "new"), &one);
  EXPECT_EQ(one.GetString(), "new");
  EXPECT_EQ(two.GetString(), "two");
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

TEST(PropertyTest, EqualityIsDeepOrderedAndNamed) {
  EXPECT_EQ(SampleTree(), SampleTree());
  const Property tree = SampleTree();
  Property renamed("other");
  renamed = tree;  // copy-assignment keeps the name "other"
  EXPECT_NE(renamed, SampleTree());

  Property deep = SampleTree();
  deep["a"]["y"].SetChildT<long long>("z", 3);
  EXPECT_NE(deep, SampleTree());

  Property first("p"), second("p");
  first.SetChildT<long long>("x", 1);
  first.SetChildT<long long>("y", 2);
  second.SetChildT<long long>("y", 2);
  second.SetChildT<long long>("x", 1);
  EXPECT_NE(first, second);

  EXPECT_NE(Property("p", true), Property("p", 1));  // same "value", other type
  EXPECT_NE(Property("p"), Property("p", ""));
  EXPECT_FALSE(Property("p", 1) != Property("p", 1));
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
