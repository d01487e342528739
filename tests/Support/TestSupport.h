// Shared helpers of the unit tests: catching an expected error to inspect its items and throw
// location, listing children, capturing standard output, and a blob that counts its live
// instances.
#ifndef TARVEK_TESTS_SUPPORT_TESTSUPPORT_H_
#define TARVEK_TESTS_SUPPORT_TESTSUPPORT_H_

#include <gtest/gtest.h>

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <iostream>
#include <optional>
#include <sstream>
#include <string>
#include <vector>

#include <Tarvek/Formats.h>

#include <boost/exception/get_error_info.hpp>
#include "CountingBlob.h"

namespace Tarvek {
namespace Core {

// Lets GoogleTest show a failed comparison of two trees as the printed trees instead of their
// bytes (found by argument-dependent lookup).
inline void PrintTo(const Property& property, std::ostream* out) {
  *out << '\n';
  PrintPropertyValue(property, 1, *out, true, true);
}

}  // namespace Core
}  // namespace Tarvek

namespace TarvekTest {

// Runs `call` and returns the error of type E it throws; fails the test (and returns nothing)
// when it throws nothing or something else.
template <class E>
std::optional<E> CatchAs(const std::function<void()>& call) {
  try {
    call();
  } catch (const E& e) {
    return e;
  } catch (...) {
    ADD_FAILURE() << "threw an error of another type";
    return std::nullopt;
  }
  ADD_FAILURE() << "threw nothing";
  return std::nullopt;
}

// Returns the value of error-info item Info on `e`, or nothing when the item is absent.
template <class Info, class E>
std::optional<typename Info::value_type> ItemOf(const E& e) {
  if (const auto* value = boost::get_error_info<Info>(e)) return *value;
  return std::nullopt;
}

// Checks that `e` records file:line in `function` as its throw location.
template <class E>
void ExpectThrownAt(const E& e, const char* file, int line, const std::string& function) {
  EXPECT_STREQ(ItemOf<boost::throw_file>(e).value_or(""), file);
  EXPECT_EQ(ItemOf<boost::throw_line>(e), line);
  EXPECT_EQ(ItemOf<boost::throw_function>(e).value_or(""), function);
}

// The child name that the ChildNotFound thrown by `call` reports, or a text saying what went
// wrong instead.
inline std::string MissingKey(const std::function<void()>& call) {
  const auto error = CatchAs<Tarvek::Core::ChildNotFound>(call);
  if (!error) return "<no error>";
  return ItemOf<Tarvek::Core::ChildNotFound::ChildNameInfo>(*error).value_or("<no item>");
}

// The names of the direct children, space-separated, to check presence and order at once.
inline std::string ChildNames(const Tarvek::Core::Property& node) {
  std::string names;
  for (const auto& child : node.GetChildren()) names += child.GetName() + " ";
  return names;
}

// `tree` without its children named `key`.
inline Tarvek::Core::Property Without(const Tarvek::Core::Property& tree, const std::string& key) {
  Tarvek::Core::Property rest(tree.GetName());
  for (const auto& child : tree.GetChildren()) {
    if (child.GetName() != key) rest.CreateChildT<bool>(child.GetName(), false) = child;
  }
  return rest;
}

// Redirects std::cout into a string for its lifetime.
class CaptureStdout {
 public:
  CaptureStdout() : previous_(std::cout.rdbuf(buffer_.rdbuf())) {}
  ~CaptureStdout() { std::cout.rdbuf(previous_); }
  CaptureStdout(const CaptureStdout&) = delete;
  CaptureStdout& operator=(const CaptureStdout&) = delete;

  std::string Text() const { return buffer_.str(); }

 private:
  std::ostringstream buffer_;
  std::streambuf* previous_;
};

}  // namespace TarvekTest

#endif  // TARVEK_TESTS_SUPPORT_TESTSUPPORT_H_
