// Property::SetChildT and Property::CreateChildT: set-or-append order, reference stability, and
// the refusal on leaves with its items and its pinned throw location.
#include <functional>
#include <string>

#include <Tarvek/Formats.h>
#include "Support/TestSupport.h"

namespace {

using Tarvek::Core::MethodIsNotApplicable;
using Tarvek::Core::Property;
using Tarvek::Core::PropertyException;
using TarvekTest::CatchAs;
using TarvekTest::ItemOf;

std::string ChildNames(const Property& node) {
  std::string names;
  for (const Property& child : node.GetChildren()) names += child.GetName() + " ";
  return names;
}

TEST(PropertyChildTTest, SetChildTAppendsMissingChildOfTheValueType) {
  Property root("root");
  Property& flag = root.SetChildT<bool>("flag", true);
  Property& count = root.SetChildT<long long>("count", 42);
  Property& text = root.SetChildT<std::string>("text", "v");
  EXPECT_EQ(&text, &root.GetChildren().back());
  EXPECT_EQ(flag.GetType(), Tarvek::PropertyTypeBool);
  EXPECT_TRUE(flag.GetBool());
  EXPECT_EQ(count.GetType(), Tarvek::PropertyTypeInt64);
  EXPECT_EQ(count.GetInt64(), 42);
  EXPECT_EQ(text.GetString(), "v");
  EXPECT_EQ(ChildNames(root), "flag count text ");
}

TEST(PropertyChildTTest, SetChildTOverwritesInPlace) {
  Property root("root");
  Property& first = root.SetChildT<long long>("first", 1);
  root.SetChildT<long long>("second", 2);
  root.SetChildT<long long>("third", 3);

  Property& again = root.SetChildT<long long>("first", 10);
  EXPECT_EQ(&again, &first);
  EXPECT_EQ(first.GetInt64(), 10);
  EXPECT_EQ(ChildNames(root), "first second third ");

  // The reference stays valid while more children are appended.
  for (int i = 0; i < 50; ++i) root.SetChildT<long long>("more" + std::to_string(i), i);
  EXPECT_EQ(&root.SetChildT<long long>("first", 11), &first);
  EXPECT_EQ(first.GetName(), "first");
  EXPECT_EQ(first.GetInt64(), 11);
  EXPECT_EQ(root.GetChildren().size(), 53u);
}

TEST(PropertyChildTTest, SetChildTRetypesExistingChild) {
  Property root("root");
  root.SetChildT<long long>("v", 7);
  Property& box = root.SetChild("box");
  box.SetChildT<bool>("inner", true);

  EXPECT_EQ(root.SetChildT<std::string>("v", "seven").GetType(), Tarvek::PropertyTypeString);
  EXPECT_EQ(&root.SetChildT<bool>("box", false), &box);
  EXPECT_EQ(box, Property("box", false));  // container turned leaf, children dropped
  EXPECT_EQ(ChildNames(root), "v box ");
}

TEST(PropertyChildTTest, CreateChildTAlwaysAppends) {
  Property root("root");
  Property& one = root.CreateChildT<std::string>("item", "one");
  Property& two = root.CreateChildT<std::string>("item", "two");
  EXPECT_NE(&one, &two);
  EXPECT_EQ(&two, &root.GetChildren().back());
  EXPECT_EQ(one.GetString(), "one");
  EXPECT_EQ(two.GetString(), "two");
  EXPECT_EQ(ChildNames(root), "item item ");

  // SetChildT then sets the first of the two only.
  EXPECT_EQ(&root.SetChildT<std::string>("item", "new"), &one);
  EXPECT_EQ(one.GetString(), "new");
  EXPECT_EQ(two.GetString(), "two");
}

TEST(PropertyChildTTest, EmptyNameIsAccepted) {
  Property root("root");
  Property& set = root.SetChildT<long long>("", 1);
  EXPECT_EQ(&root.SetChildT<long long>("", 2), &set);
  EXPECT_EQ(set.GetInt64(), 2);
  EXPECT_TRUE(root.ChildExists(""));
  root.CreateChildT<bool>("", true);
  EXPECT_EQ(root.GetChildren().size(), 2u);
  EXPECT_EQ(root.GetChildren().back().GetName(), "");
}

// One way for a helper to be refused, with where the refusal must be recorded.
struct Refusal {
  const char* method;
  int line;
  const char* function;
  std::function<void(Property&)> call;
};

TEST(PropertyChildTTest, RefusalOnLeavesNamesNodeMethodAndLocation) {
  const Refusal refusals[] = {
      {"SetChildT", 257,
       "Tarvek::Core::Property &Tarvek::Core::Property::SetChildT(const std::string &, const bool "
       "&)",
       [](Property& p) { p.SetChildT<bool>("c", true); }},
      {"SetChildT", 257,
       "Tarvek::Core::Property &Tarvek::Core::Property::SetChildT(const std::string &, const long "
       "long &)",
       [](Property& p) { p.SetChildT<long long>("c", 1); }},
      {"SetChildT", 257,
       "Tarvek::Core::Property &Tarvek::Core::Property::SetChildT(const std::string &, const "
       "std::basic_string<char> &)",
       [](Property& p) { p.SetChildT<std::string>("c", "x"); }},
      {"CreateChildT", 240,
       "Tarvek::Core::Property &Tarvek::Core::Property::CreateChildT(const std::string &, const "
       "bool &)",
       [](Property& p) { p.CreateChildT<bool>("c", true); }},
      {"CreateChildT", 240,
       "Tarvek::Core::Property &Tarvek::Core::Property::CreateChildT(const std::string &, const "
       "long long &)",
       [](Property& p) { p.CreateChildT<long long>("c", 1); }},
      {"CreateChildT", 240,
       "Tarvek::Core::Property &Tarvek::Core::Property::CreateChildT(const std::string &, const "
       "std::basic_string<char> &)",
       [](Property& p) { p.CreateChildT<std::string>("c", "x"); }},
  };
  const Property leaves[] = {Property("flag", false), Property("count", 3),
                             Property("text", "value")};

  for (const Property& leaf : leaves) {
    for (const Refusal& refusal : refusals) {
      SCOPED_TRACE(leaf.GetName() + " / " + refusal.function);
      Property node = leaf;
      const auto error = CatchAs<MethodIsNotApplicable>([&] { refusal.call(node); });
      ASSERT_TRUE(error);
      EXPECT_EQ(node, leaf);
      EXPECT_EQ(ItemOf<PropertyException::PropertyNameInfo>(*error), leaf.GetName());
      EXPECT_EQ(ItemOf<PropertyException::PropertyTypeInfo>(*error), leaf.GetType());
      EXPECT_EQ(ItemOf<PropertyException::MethodNameInfo>(*error), refusal.method);
      EXPECT_TRUE(ItemOf<Tarvek::CallStackInfo>(*error));

      const char* const* file = boost::get_error_info<boost::throw_file>(*error);
      const int* line = boost::get_error_info<boost::throw_line>(*error);
      const char* const* function = boost::get_error_info<boost::throw_function>(*error);
      ASSERT_TRUE(file && line && function);
      EXPECT_STREQ(*file, "Core/Interfaces/Property.h");
      EXPECT_EQ(*line, refusal.line);
      EXPECT_STREQ(*function, refusal.function);
    }
  }
}

}  // namespace
