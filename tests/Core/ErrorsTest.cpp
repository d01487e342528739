// The error classes: catching through every base, the items the library attaches, how they
// render, capture with boost::current_exception, and the call stack text. The items and throw
// locations of each throw site are tested with the code that throws.
#include <boost/exception/diagnostic_information.hpp>
#include <boost/exception_ptr.hpp>
#include <exception>
#include <functional>
#include <regex>
#include <sstream>
#include <string>

#include <Tarvek/Formats.h>
#include "Support/TestSupport.h"

namespace {

using Tarvek::Core::MethodIsNotApplicable;
using Tarvek::Core::Property;
using Tarvek::Core::PropertyException;
using TarvekTest::CatchAs;
using TarvekTest::ItemOf;

std::exception_ptr Thrown(const std::function<void()>& call) {
  try {
    call();
  } catch (...) {
    return std::current_exception();
  }
  return nullptr;
}

// The refusal of SetChildT on a string leaf named "label".
std::exception_ptr Refusal() {
  return Thrown([] { Property("label", "value").SetChildT<long long>("child", 1); });
}

// The refusal of a video bitrate function handed no description.
std::exception_ptr ConfError() {
  return Thrown([] { Tarvek::Conf::GetDefaultVideoBitrate(nullptr); });
}

// The address of the complete object that `error` is caught as through Base; null when Base does
// not catch it.
template <class Base>
const void* CaughtAs(const std::exception_ptr& error) {
  try {
    std::rethrow_exception(error);
  } catch (const Base& e) {
    return dynamic_cast<const void*>(&e);
  } catch (...) {
  }
  return nullptr;
}

// Each error is one object whichever base catches it; a ConfException is no core error.
TEST(ErrorsTest, ErrorsAreCaughtAsOneObjectThroughTheirBases) {
  for (const bool core : {true, false}) {
    const std::exception_ptr error = core ? Refusal() : ConfError();
    const void* object = core ? CaughtAs<MethodIsNotApplicable>(error)
                              : CaughtAs<Tarvek::Conf::ConfException>(error);
    ASSERT_NE(object, nullptr);
    EXPECT_EQ(CaughtAs<PropertyException>(error), core ? object : nullptr);
    EXPECT_EQ(CaughtAs<Tarvek::Core::CoreException>(error), core ? object : nullptr);
    EXPECT_EQ(CaughtAs<Tarvek::Exception>(error), object);
    EXPECT_EQ(CaughtAs<boost::exception>(error), object);
    EXPECT_EQ(CaughtAs<std::exception>(error), object);
  }
}

// The diagnostic line of the PropertyTypeInfo item, or the whole text when there is none.
std::string PropertyTypeLine(const boost::exception& error) {
  const std::string text = boost::diagnostic_information(error);
  const auto start = text.find("[Tarvek::Core::PropertyException::TagPropertyType");
  if (start == std::string::npos) return text;
  return text.substr(start, text.find('\n', start) - start);
}

// The property type renders as decimal digits; what() leaves out the description and the node's
// name; boost::current_exception captures the error whole.
TEST(ErrorsTest, RenderingAndCapture) {
  const auto refused = CatchAs<MethodIsNotApplicable>([] { std::rethrow_exception(Refusal()); });
  ASSERT_TRUE(refused);
  EXPECT_EQ(PropertyTypeLine(*refused), "[Tarvek::Core::PropertyException::TagPropertyType*] = 3");
  const Property root("root");
  const auto missing = CatchAs<Tarvek::Core::ChildNotFound>([&] { (void)root["x"]; });
  ASSERT_TRUE(missing);
  EXPECT_EQ(PropertyTypeLine(*missing), "[Tarvek::Core::PropertyException::TagPropertyType*] = 6");

  const auto wrong =
      CatchAs<Tarvek::Core::WrongPropertyType>([] { (void)Property("zebra_node", 1).GetString(); });
  ASSERT_TRUE(wrong);
  const std::string what = wrong->what();
  EXPECT_EQ(what.find(ItemOf<Tarvek::DescriptionInfo>(*wrong).value_or("?")), std::string::npos);
  EXPECT_EQ(what.find("zebra_node"), std::string::npos) << what;

  boost::exception_ptr captured;
  try {
    Property("label", true).CreateChildT<bool>("child", false);
  } catch (...) {
    captured = boost::current_exception();
  }
  const auto error = CatchAs<MethodIsNotApplicable>([&] { boost::rethrow_exception(captured); });
  ASSERT_TRUE(error);
  EXPECT_EQ(ItemOf<PropertyException::MethodNameInfo>(*error), "CreateChildT");
}

// One line a frame, "N# symbol+0x.. in module+0x..", the symbol "??" where none is looked up;
// the library function the error came through is named where a shared library exports it, and
// linked into the program it shows as a frame of the program.
TEST(ErrorsTest, CallStackNamesModulesOffsetsAndExportedFunctions) {
  const auto error = CatchAs<Tarvek::Conf::ConfException>(
      [] { Tarvek::Conf::GetDefaultVideoBitrate(Tarvek::Conf::FormatCodecAudio::Create()); });
  ASSERT_TRUE(error);
  const std::string stack = ItemOf<Tarvek::CallStackInfo>(*error).value_or("");
  const char* const caller =
      TARVEK_TEST_SHARED_LIBS ? " Tarvek::Conf::GetDefaultVideoBitrate(" : "?? in <program>+0x";
  EXPECT_NE(stack.find(caller), std::string::npos) << stack;
  const std::regex frame(R"( ?\d+# (\?\?|\S.*\+0x[0-9a-f]+) in [^ /]+\+0x[0-9a-f]+)");
  std::istringstream lines(stack);
  int count = 0;
  for (std::string line; std::getline(lines, line); ++count) {
    EXPECT_TRUE(std::regex_match(line, frame)) << line;
  }
  EXPECT_GE(count, 3) << stack;
}

}  // namespace
