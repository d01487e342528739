// Tarvek::Core::Property: a named tree of typed values, the store behind every format description,
// and the typed child helpers SetChildT / CreateChildT that every description setter writes with.
//
// A node has a name, a type (Tarvek::PropertyTypes), a value and an ordered list of children.
// Leaves hold a bool, a 64-bit integer or a string; containers hold no value and are the only
// nodes with children. Names need not be unique among siblings: look-ups take the first match.
//
//   Tarvek::Core::Property tree("settings");
//   tree.SetChildT<long long>("width", 1920);
//   tree.SetChildT<std::string>("codec_id", "h264");
//   const Tarvek::Core::Property& view = tree;
//   long long width = view["width"].GetInt64();
//
// Reading. The const operator[] never changes the tree: a missing child throws ChildNotFound,
// and a typed getter on a node of another type throws WrongPropertyType. Test with ChildExists
// first where absence is normal. Large containers keep an index of their children by a hash of
// the name, so a look-up costs a few nanoseconds whatever the number of children.
// Writing. SetChildT overwrites the first child of a name in place or appends one; CreateChildT
// always appends. SetChild does the same for whole sub-trees. The non-const operator[] appends
// an empty container child when the name is missing, so use it only to write.
// Assignment. Assigning a Property copies type, value and children but keeps the target's name,
// so a sub-tree can be replaced under its key; moving takes the name too. Assigning a plain value
// turns the node into a leaf and drops its children. Moving a property into a child, or out of
// one, renames that child in place; look-ups find it under its new name straight away.
// Errors. Adding a child to a leaf throws MethodIsNotApplicable, and nothing changes. Every error
// derives from Tarvek::Core::PropertyException; boost::diagnostic_information() prints its items,
// the call stack and the throw location.
// Threads. A tree is a plain value: any number of threads may read one that nobody writes (a
// look-up writes nothing, not even to a cache); writers need a lock of the caller's.
#ifndef TARVEK_CORE_INTERFACES_PROPERTY_H_
#define TARVEK_CORE_INTERFACES_PROPERTY_H_

#include <cstdint>
#include <iosfwd>
#include <list>
#include <string>
#include <type_traits>

#include "../Errors/AddStack.h"
#include "../Errors/PropertyException.h"
#include "Export.h"
#include "PropertyTypes.h"

namespace Tarvek {
namespace Core {
class PropertyKey;

/// A named node of a tree of typed values. Copies are deep; children are kept by value in a
/// std::list, so a reference to a child stays valid while siblings are added or removed.
/// Not synchronised: share a tree between threads only for reading.
class TARVEK_CORE_API Property {
 public:
  /// The children, in the order they were added, and iterators over them.
  using Children = std::list<Property>;
  using iterator = Children::iterator;
  using const_iterator = Children::const_iterator;

  /// An empty container named `name`.
  explicit Property(const std::string& name);
  /// A leaf holding `value`.
  Property(const std::string& name, bool value);
  Property(const std::string& name, long long value);
  Property(const std::string& name, const std::string& value);
  /// A string leaf (without this, a string literal would silently become a bool).
  Property(const std::string& name, const char* value);
  /// An int64 leaf from any other integer type (int, unsigned, long ...), widened to long long.
  template <class Integer,
            std::enable_if_t<std::is_integral_v<Integer> && !std::is_same_v<Integer, bool> &&
                                 !std::is_same_v<Integer, long long>,
                             int> = 0>
  Property(const std::string& name, Integer value)
      : Property(name, static_cast<long long>(value)) {}

  /// Deep copy: name, type, value and all children.
  Property(const Property& other);
  /// Takes `other`'s name, type, value and children; `other` is left an unnamed empty container.
  Property(Property&& other) noexcept;
  /// Frees the value and the children.
  virtual ~Property();

  /// Takes `other`'s type, value and children and KEEPS this node's name, so a subtree can be
  /// replaced in place and stays reachable under its key. Safe when `other` is this node or one
  /// of its descendants; on failure this node is unchanged.
  Property& operator=(const Property& other);
  /// Takes `other`'s name, type, value and children; `other` is left an empty container.
  Property& operator=(Property&& other) noexcept;
  /// Makes this node a leaf holding `value`: type and value replaced, children dropped, name kept.
  Property& operator=(bool value);
  Property& operator=(long long value);
  Property& operator=(const std::string& value);
  Property& operator=(const char* value);
  template <class Integer,
            std::enable_if_t<std::is_integral_v<Integer> && !std::is_same_v<Integer, bool> &&
                                 !std::is_same_v<Integer, long long>,
                             int> = 0>
  Property& operator=(Integer value) {
    return *this = static_cast<long long>(value);
  }

  /// The node's name.
  const std::string& GetName() const noexcept { return name_; }
  /// The node's type.
  PropertyTypes GetType() const noexcept { return static_cast<PropertyTypes>(link_ & kTypeBits); }
  /// The children, in the order they were added.
  const Children& GetChildren() const noexcept { return children_; }

  /// Whether a direct child is named `key`.
  bool ChildExists(const std::string& key) const noexcept;
  /// The first direct child named `key`, or GetChildren().end().
  iterator FindChild(const std::string& key) noexcept;
  const_iterator FindChild(const std::string& key) const noexcept;

  /// The first direct child named `key`; never creates one. Throws ChildNotFound when there is
  /// none.
  const Property& operator[](const std::string& key) const;
  /// The same three look-ups by a PropertyKey, for names looked up again and again.
  inline bool ChildExists(const PropertyKey& key) const noexcept;
  inline const_iterator FindChild(const PropertyKey& key) const noexcept;
  inline const Property& operator[](const PropertyKey& key) const;
  /// The first direct child named `key`, appending an empty container child when there is none.
  /// Throws MethodIsNotApplicable when this node is not a container and has no such child.
  Property& operator[](const std::string& key);

  /// Makes child `key` an empty container: appends one, or empties the existing child in place.
  /// Returns it. Throws MethodIsNotApplicable when this node is not a container.
  Property& SetChild(const std::string& key);
  /// Makes child `key` hold `value`'s type, value and children (appending it when missing); the
  /// child keeps the name `key`. Returns it. Throws MethodIsNotApplicable when this node is not a
  /// container.
  Property& SetChild(const std::string& key, const Property& value);

  /// The value of a bool leaf. Throws WrongPropertyType for any other type.
  bool GetBool() const;
  /// The value of an int64 leaf. Throws WrongPropertyType for any other type.
  long long GetInt64() const;
  /// A string leaf's value, by reference (valid until the node changes); throws as GetInt64.
  const std::string& GetString() const;

  /// Deep equality: same name, type and value, and pairwise equal children in the same order.
  bool operator==(const Property& other) const noexcept;
  bool operator!=(const Property& other) const noexcept { return !(*this == other); }

  /// Sets child `name` to `value` of type T (bool, long long or std::string): assigns to the first
  /// child of that name, keeping its place, or appends a new child at the end. Returns the child.
  /// Throws MethodIsNotApplicable naming "SetChildT" when this node is not a container; nothing
  /// changes then.
  template <class T>
  Property& SetChildT(const std::string& name, const T& value);

  /// Appends a child `name` holding `value` of type T (bool, long long or std::string), even when
  /// a child of that name exists already. Returns the new child. Throws MethodIsNotApplicable
  /// naming "CreateChildT" when this node is not a container; nothing changes then.
  template <class T>
  Property& CreateChildT(const std::string& name, const T& value);

 private:
  struct Internals;  // helpers with access to the members, in the library
  class ChildIndex;  // a large container's index of its children by name, in the library
  // A leaf's value or a container's index (null when it has none); the type tells which lives.
  union Storage {
    Storage() noexcept : index(nullptr) {}
    ~Storage() {}
    bool flag;
    long long integer;
    std::string text;
    ChildIndex* index;
  };

  Property& AdoptLast() noexcept;  // indexes the child just appended and returns it
  // The first child named like `key` in a container with an index; a walk of the children while
  // the index waits to be rebuilt after a child was renamed in place.
  const_iterator FindIndexed(const PropertyKey& key) const noexcept;
  // The refusal of the child helpers, with the items naming this node and `method` attached.
  MethodIsNotApplicable NotApplicableError(const char* method) const;
  [[noreturn]] void ThrowNotApplicable(const char* method, int line, const char* function) const;
  [[noreturn]] void ThrowWrongType(PropertyTypes requested, const char* method, const char* file,
                                   int line, const char* function) const;
  [[noreturn]] void ThrowChildNotFound(const std::string& key, const char* file, int line,
                                       const char* function) const;

  std::string name_;
  Storage storage_;
  // One word for two things, to keep nodes small: the type (a PropertyTypes value) in the low
  // three bits, and the address of the parent's index, when the parent has one, in the others (an
  // index is 8-aligned). A child renamed in place marks that index stale, so no look-up answers
  // wrongly and nothing outside the tree is written.
  std::uintptr_t link_;
  static constexpr std::uintptr_t kTypeBits = 7;  // the bits of link_ that hold the type
  Children children_;
};

namespace Detail {

/// Throw-location texts of the typed child helpers, the same on every compiler and machine.
template <class T>
struct ChildTSignature;  // defined only for the three value types a property can hold

template <>
struct ChildTSignature<bool> {
  static constexpr const char* kSet =
      "Tarvek::Core::Property &Tarvek::Core::Property::SetChildT(const std::string &, const bool "
      "&)";
  static constexpr const char* kCreate =
      "Tarvek::Core::Property &Tarvek::Core::Property::CreateChildT(const std::string &, const "
      "bool &)";
};

template <>
struct ChildTSignature<long long> {
  static constexpr const char* kSet =
      "Tarvek::Core::Property &Tarvek::Core::Property::SetChildT(const std::string &, const long "
      "long &)";
  static constexpr const char* kCreate =
      "Tarvek::Core::Property &Tarvek::Core::Property::CreateChildT(const std::string &, const "
      "long long &)";
};

template <>
struct ChildTSignature<std::string> {
  static constexpr const char* kSet =
      "Tarvek::Core::Property &Tarvek::Core::Property::SetChildT(const std::string &, const "
      "std::basic_string<char> &)";
  static constexpr const char* kCreate =
      "Tarvek::Core::Property &Tarvek::Core::Property::CreateChildT(const std::string &, const "
      "std::basic_string<char> &)";
};

/// The file recorded as the throw location of the typed child helpers.
constexpr const char* kPropertyHeader = "Core/Interfaces/Property.h";

}  // namespace Detail

// The typed child helpers record the lines of their throw statements: keep those where they are.
// CreateChildT constructs the child in place at the end of the list: nothing is looked up, so a
// name that is present already gets a second child after the others; if construction fails, the
// list is left as it was. It serves SetChildT and callers that build lists of repeated names.
template <class T>
Property& Property::CreateChildT(const std::string& name, const T& value) {
  if (GetType() != PropertyTypeContainer) {
    ThrowWithLocation(__LINE__, Detail::kPropertyHeader, Detail::ChildTSignature<T>::kCreate,
                      AddStack(NotApplicableError("CreateChildT")));
  }
  children_.emplace_back(name, value);
  return AdoptLast();
}

// SetChildT checks the type itself rather than leaving it to CreateChildT, so that a refusal
// always names the helper the caller called. An existing child keeps its place among its
// siblings, and references to it stay valid; it is retyped by assignment when it held another
// type (a string written over an int64 leaf makes a string leaf). Only a missing child is
// appended, as the last one. With several children of the name, the first is the one set.
// Either way the returned reference is to the child that now holds the value, valid until the
// child itself is removed. Like CreateChildT, a refusal leaves the node exactly as it was.
template <class T>
Property& Property::SetChildT(const std::string& name, const T& value) {
  if (GetType() != PropertyTypeContainer) {
    ThrowWithLocation(__LINE__, Detail::kPropertyHeader, Detail::ChildTSignature<T>::kSet,
                      AddStack(NotApplicableError("SetChildT")));
  }
  const iterator found = FindChild(name);
  if (found != children_.end()) {
    *found = value;
    return *found;
  }
  return CreateChildT<T>(name, value);
}

// The typed getters are inline: a read is a type test and a load.
inline bool Property::GetBool() const {
  if (GetType() == PropertyTypeBool) return storage_.flag;
  ThrowWrongType(PropertyTypeBool, "GetBool", Detail::kPropertyHeader, __LINE__,
                 BOOST_CURRENT_FUNCTION);
}

inline long long Property::GetInt64() const {
  if (GetType() == PropertyTypeInt64) return storage_.integer;
  ThrowWrongType(PropertyTypeInt64, "GetInt64", Detail::kPropertyHeader, __LINE__,
                 BOOST_CURRENT_FUNCTION);
}

inline const std::string& Property::GetString() const {
  if (GetType() == PropertyTypeString) return storage_.text;
  ThrowWrongType(PropertyTypeString, "GetString", Detail::kPropertyHeader, __LINE__,
                 BOOST_CURRENT_FUNCTION);
}

/// A child name with its hash worked out once, for names looked up again and again, such as the
/// keys of the format descriptions. A look-up by a key gives the same answer as one by its text.
/// Throws std::bad_alloc when the name cannot be copied.
class TARVEK_CORE_API PropertyKey {
 public:
  explicit PropertyKey(const std::string& name);
  /// The name.
  const std::string& GetName() const noexcept { return name_; }

 private:
  friend class Property;
  std::string name_;
  std::uint32_t hash_;
};

// Look-ups by key are inline where a container has no index: a walk that compares the names. A
// container with an index answers in one call into the library.
inline Property::const_iterator Property::FindChild(const PropertyKey& key) const noexcept {
  if (GetType() == PropertyTypeContainer && storage_.index != nullptr) return FindIndexed(key);
  for (const_iterator it = children_.begin(); it != children_.end(); ++it) {
    if (it->name_ == key.name_) return it;
  }
  return children_.end();
}

inline bool Property::ChildExists(const PropertyKey& key) const noexcept {
  return FindChild(key) != children_.end();
}

inline const Property& Property::operator[](const PropertyKey& key) const {
  const const_iterator found = FindChild(key);
  if (found == children_.end()) {
    ThrowChildNotFound(key.name_, Detail::kPropertyHeader, __LINE__, BOOST_CURRENT_FUNCTION);
  }
  return *found;
}

/// Prints `property` to `out` for a person to read: one line a node, "name (type)" for
/// containers and "name (type): value" for leaves, indented by two spaces a level starting at
/// `indent` levels. Strings are quoted, with quotes, backslashes and control bytes escaped;
/// an empty name shows as "<unnamed>". Without `showTypes` the "(type)" parts are left out;
/// without `recursive` only the node itself is printed.
TARVEK_CORE_API void PrintPropertyValue(const Property& property, int indent, std::ostream& out,
                                        bool showTypes, bool recursive);

}  // namespace Core
}  // namespace Tarvek

#endif  // TARVEK_CORE_INTERFACES_PROPERTY_H_
