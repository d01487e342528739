// Tarvek::Core::Property: construction, copying and assignment (aliasing included), look-up,
// SetChild, typed getters, equality and PrintPropertyValue.
#include <iterator>
#include <ostream>
#include <sstream>
#include <string>
#include <utility>

#include <Tarvek/Formats.h>
#include "Support/TestSupport.h"

namespace {

using Tarvek::Core::ChildNotFound;
using Tarvek::Core::MethodIsNotApplicable;
using Tarvek::Core::Property;
using Tarvek::Core::PropertyException;
using Tarvek::Core::WrongPropertyType;
using TarvekTest::CatchAs;
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

// The names of the direct children, space-separated, to check presence and order at once.
std::string ChildNames(const Property& node) {
  std::string names;
  for (const Property& child : node.GetChildren()) names += child.GetName() + " ";
  return names;
}

TEST(PropertyTest, ConstructorsMakeTheTypeOfTheirValue) {
  const Property container("c");
  EXPECT_EQ(container.GetName(), "c");
  EXPECT_EQ(container.GetType(), Tarvek::PropertyTypeContainer);
  EXPECT_TRUE(container.GetChildren().empty());
  EXPECT_TRUE(Property("b", true).GetBool());
  EXPECT_EQ(Property("i", 5000000000LL).GetInt64(), 5000000000LL);

  // A string literal must become a string, not a bool through pointer conversion.
  const Property literal("s", "literal");
  EXPECT_EQ(literal.GetType(), Tarvek::PropertyTypeString);
  EXPECT_EQ(literal.GetString(), "literal");
  EXPECT_EQ(Property("s", std::string("a\0b", 3)).GetString().size(), 3u);

  // Other integer types widen to int64, keeping sign or magnitude.
  EXPECT_EQ(Property("i", -7).GetType(), Tarvek::PropertyTypeInt64);
  EXPECT_EQ(Property("i", -7).GetInt64(), -7);
  EXPECT_EQ(Property("u", 4000000000u).GetInt64(), 4000000000LL);
}

// The tag values are part of the binary interface and show as numbers in error reports.
TEST(PropertyTest, TypeTagsKeepTheirValuesAndNames) {
  EXPECT_EQ(Tarvek::PropertyTypeBool, 1);
  EXPECT_EQ(Tarvek::PropertyTypeInt64, 2);
  EXPECT_EQ(Tarvek::PropertyTypeString, 3);
  EXPECT_EQ(Tarvek::PropertyTypeContainer, 6);
  EXPECT_STREQ(Tarvek::PropertyTypeName(Tarvek::PropertyTypeInt64), "int64");
  EXPECT_STREQ(Tarvek::PropertyTypeName(static_cast<Tarvek::PropertyTypes>(4)), "unknown");
}

TEST(PropertyTest, CopyIsDeep) {
  const Property original = SampleTree();
  Property copy(original);
  EXPECT_EQ(copy, original);
  copy["a"]["y"].SetChildT<long long>("z", 99);
  EXPECT_EQ(original["a"]["y"]["z"].GetInt64(), 2);
}

TEST(PropertyTest, CopyAssignmentKeepsTargetNameAndTakesTheRest) {
  Property target("target");
  target.SetChildT<bool>("old", true);
  const Property source = SampleTree();
  target = source;
  EXPECT_EQ(target.GetName(), "target");
  EXPECT_EQ(ChildNames(target), "a b s ");
  EXPECT_EQ(target["a"], source["a"]);

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
  target = SampleTree();
  EXPECT_EQ(target, SampleTree());
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

TEST(PropertyTest, FindChildReturnsFirstDirectMatch) {
  Property root("root");
  root.CreateChildT<long long>("d", 1);
  root.CreateChildT<long long>("d", 2);
  root.SetChild("box").SetChildT<bool>("inner", true);
  const Property& view = root;
  EXPECT_EQ(root.FindChild("d"), root.GetChildren().begin());
  EXPECT_EQ(view.FindChild("d")->GetInt64(), 1);
  EXPECT_EQ(view["d"].GetInt64(), 1);
  EXPECT_TRUE(view.ChildExists("box"));
  EXPECT_FALSE(view.ChildExists("inner"));  // grandchildren do not count
  EXPECT_EQ(view.FindChild("inner"), view.GetChildren().end());
  EXPECT_EQ(root.FindChild("missing"), root.GetChildren().end());
}

TEST(PropertyTest, ConstIndexThrowsChildNotFound) {
  const Property root = SampleTree();
  const auto error = CatchAs<ChildNotFound>([&] { (void)root["missing"]; });
  ASSERT_TRUE(error);
  EXPECT_EQ(ItemOf<PropertyException::PropertyNameInfo>(*error), "root");
  EXPECT_EQ(ItemOf<ChildNotFound::ChildNameInfo>(*error), "missing");
  const auto description = ItemOf<Tarvek::DescriptionInfo>(*error);
  ASSERT_TRUE(description);
  EXPECT_NE(description->find("root"), std::string::npos) << *description;
  EXPECT_NE(description->find("missing"), std::string::npos) << *description;
  EXPECT_TRUE(ItemOf<Tarvek::CallStackInfo>(*error));
  EXPECT_EQ(ChildNames(root), "a b s ");  // nothing was created

  // A leaf has no children, so the same error.
  const Property leaf("leaf", 1);
  EXPECT_TRUE(CatchAs<ChildNotFound>([&] { (void)leaf["x"]; }));
}

TEST(PropertyTest, NonConstIndexAppendsEmptyContainer) {
  Property root = SampleTree();
  Property& existing = root["b"];
  EXPECT_EQ(&existing, &*std::next(root.GetChildren().begin()));
  Property& added = root["new"];
  EXPECT_EQ(&added, &root.GetChildren().back());
  EXPECT_EQ(added, Property("new"));
  EXPECT_EQ(ChildNames(root), "a b s new ");

  Property leaf("leaf", "v");
  const auto error = CatchAs<MethodIsNotApplicable>([&] { (void)leaf["x"]; });
  ASSERT_TRUE(error);
  EXPECT_EQ(ItemOf<PropertyException::PropertyNameInfo>(*error), "leaf");
  EXPECT_EQ(ItemOf<PropertyException::PropertyTypeInfo>(*error), Tarvek::PropertyTypeString);
  EXPECT_EQ(ItemOf<PropertyException::MethodNameInfo>(*error), "operator[]");
  EXPECT_EQ(leaf, Property("leaf", "v"));
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

  Property leaf("leaf", false);
  const auto error = CatchAs<MethodIsNotApplicable>([&] { leaf.SetChild("x"); });
  ASSERT_TRUE(error);
  EXPECT_EQ(ItemOf<PropertyException::MethodNameInfo>(*error), "SetChild");
  EXPECT_TRUE(CatchAs<MethodIsNotApplicable>([&] { leaf.SetChild("x", Property("x")); }));
  EXPECT_EQ(leaf, Property("leaf", false));
}

TEST(PropertyTest, SetChildWithValueKeepsKeyAndPosition) {
  Property root = SampleTree();
  const Property* a = &root["a"];
  EXPECT_EQ(&root.SetChild("a", Property("other", "v")), a);
  EXPECT_EQ(*a, Property("a", "v"));
  root.SetChild("d", Property("other", 4));
  EXPECT_EQ(ChildNames(root), "a b s d ");
  EXPECT_EQ(root["d"].GetInt64(), 4);
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
  EXPECT_EQ(ChildNames(root["c"]), "a b ");

  // Replaced in place: child "a" takes the node's content, including the old "a".
  root = before;
  root.SetChild("a", root);
  EXPECT_EQ(ChildNames(root), "a b ");
  EXPECT_EQ(ChildNames(root["a"]), "a b ");
  EXPECT_EQ(root["a"]["a"].GetInt64(), 1);
}

TEST(PropertyTest, TypedGettersThrowWrongPropertyType) {
  const Property nodes[] = {Property("n", true), Property("n", 1), Property("n", "s"),
                            Property("n")};
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
  for (const Property& node : nodes) {
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
  EXPECT_NE(renamed, tree);

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

// A tree with every leaf type, bytes that must be escaped, UTF-8, and an unnamed node.
Property PrintSample() {
  Property root("root");
  root.SetChildT<bool>("flag", true);
  root.SetChildT<long long>("count", -3);
  root.SetChildT<std::string>("text", std::string("q\"b\\n\nt\tr\r\x01\x7f\0", 13));
  root.SetChild("").SetChildT<std::string>("na\"me", "\xc3\xa9");
  return root;
}

std::string Print(const Property& node, int indent, bool showTypes, bool recursive) {
  std::ostringstream out;
  Tarvek::Core::PrintPropertyValue(node, indent, out, showTypes, recursive);
  return out.str();
}

TEST(PropertyTest, PrintsIndentedTreeWithEscapes) {
  EXPECT_EQ(Print(PrintSample(), 1, true, true),
            "  root (container)\n"
            "    flag (bool): true\n"
            "    count (int64): -3\n"
            "    text (string): \"q\\\"b\\\\n\\nt\\tr\\r\\x01\\x7f\\x00\"\n"
            "    <unnamed> (container)\n"
            "      na\\\"me (string): \"\xc3\xa9\"\n");
}

TEST(PropertyTest, PrintFlagsDropTypesAndChildren) {
  EXPECT_EQ(Print(PrintSample(), 0, false, true),
            "root\n"
            "  flag: true\n"
            "  count: -3\n"
            "  text: \"q\\\"b\\\\n\\nt\\tr\\r\\x01\\x7f\\x00\"\n"
            "  <unnamed>\n"
            "    na\\\"me: \"\xc3\xa9\"\n");
  EXPECT_EQ(Print(PrintSample(), 2, true, false), "    root (container)\n");
  EXPECT_EQ(Print(Property("f", false), 0, false, false), "f: false\n");
  EXPECT_EQ(Print(Property("e", ""), 0, true, true), "e (string): \"\"\n");
}

}  // namespace
