// The core property library: Tarvek::Core::Property.
#include <Tarvek/Core/Interfaces/Property.h>

#include <utility>

namespace Tarvek {

const char* PropertyTypeName(PropertyTypes type) noexcept {
  switch (type) {
    case PropertyTypeBool:
      return "bool";
    case PropertyTypeInt64:
      return "int64";
    case PropertyTypeString:
      return "string";
    case PropertyTypeContainer:
      return "container";
  }
  return "unknown";
}

namespace Core {
namespace {

// A copy of `value`, built in place from its alternative rather than by the variant's copy
// constructor: when copying a string throws, libstdc++ 12's copy constructor goes on to destroy
// a variant that holds nothing (undefined behaviour); a failed in-place construction leaves no
// variant behind to destroy.
template <class Value>
Value CopyOf(const Value& value) {
  switch (value.index()) {
    case 1:
      return Value(std::in_place_index<1>, std::get<1>(value));
    case 2:
      return Value(std::in_place_index<2>, std::get<2>(value));
    case 3:
      return Value(std::in_place_index<3>, std::get<3>(value));
    default:
      return Value();
  }
}

}  // namespace

Property::Property(const std::string& name) : name_(name) {}
Property::Property(const std::string& name, bool value) : name_(name), value_(value) {}
Property::Property(const std::string& name, long long value) : name_(name), value_(value) {}
Property::Property(const std::string& name, const std::string& value)
    : name_(name), value_(value) {}
Property::Property(const std::string& name, const char* value)
    : name_(name), value_(std::string(value)) {}

Property::Property(const Property& other)
    : name_(other.name_), value_(CopyOf(other.value_)), children_(other.children_) {}
Property::Property(Property&& other) noexcept
    : name_(std::move(other.name_)),
      value_(std::move(other.value_)),
      children_(std::move(other.children_)) {
  other.value_ = std::monostate();
}
Property::~Property() = default;

Property& Property::operator=(const Property& other) {
  if (this == &other) return *this;
  // Copy first: `other` may be a descendant of this node, which the swap below destroys.
  Value value(CopyOf(other.value_));
  Children children(other.children_);
  value_.swap(value);
  children_.swap(children);
  return *this;
}

Property& Property::operator=(Property&& other) noexcept {
  if (this == &other) return *this;
  // Detach `other`'s content before dropping ours: `other` may live inside our children.
  std::string name(std::move(other.name_));
  Value value(std::move(other.value_));
  Children children(std::move(other.children_));
  other.value_ = std::monostate();
  other.children_.clear();
  name_.swap(name);
  value_.swap(value);
  children_.swap(children);
  return *this;
}

Property& Property::operator=(bool value) {
  value_ = value;
  children_.clear();
  return *this;
}

Property& Property::operator=(long long value) {
  value_ = value;
  children_.clear();
  return *this;
}

Property& Property::operator=(const std::string& value) {
  // Build the new value first: `value` may be this node's own string, or a descendant's.
  Value replacement(value);
  value_.swap(replacement);
  children_.clear();
  return *this;
}

Property& Property::operator=(const char* value) { return *this = std::string(value); }

PropertyTypes Property::GetType() const noexcept {
  switch (value_.index()) {
    case 1:
      return PropertyTypeBool;
    case 2:
      return PropertyTypeInt64;
    case 3:
      return PropertyTypeString;
    default:
      return PropertyTypeContainer;
  }
}

bool Property::ChildExists(const std::string& key) const noexcept {
  return FindChild(key) != children_.end();
}

Property::iterator Property::FindChild(const std::string& key) noexcept {
  for (auto it = children_.begin(); it != children_.end(); ++it) {
    if (it->name_ == key) return it;
  }
  return children_.end();
}

Property::const_iterator Property::FindChild(const std::string& key) const noexcept {
  for (auto it = children_.begin(); it != children_.end(); ++it) {
    if (it->name_ == key) return it;
  }
  return children_.end();
}

const Property& Property::operator[](const std::string& key) const {
  const const_iterator found = FindChild(key);
  if (found == children_.end()) ThrowChildNotFound(key, __LINE__, BOOST_CURRENT_FUNCTION);
  return *found;
}

Property& Property::operator[](const std::string& key) {
  const iterator found = FindChild(key);
  if (found != children_.end()) return *found;
  if (GetType() != PropertyTypeContainer) {
    ThrowNotApplicable("operator[]", __LINE__, BOOST_CURRENT_FUNCTION);
  }
  return children_.emplace_back(key);
}

Property& Property::SetChild(const std::string& key) {
  if (GetType() != PropertyTypeContainer) {
    ThrowNotApplicable("SetChild", __LINE__, BOOST_CURRENT_FUNCTION);
  }
  const iterator found = FindChild(key);
  if (found == children_.end()) return children_.emplace_back(key);
  found->value_ = std::monostate();
  found->children_.clear();
  return *found;
}

Property& Property::SetChild(const std::string& key, const Property& value) {
  if (GetType() != PropertyTypeContainer) {
    ThrowNotApplicable("SetChild", __LINE__, BOOST_CURRENT_FUNCTION);
  }
  const iterator found = FindChild(key);
  if (found != children_.end()) return *found = value;
  // Append a complete copy, then rename it: `value` may be this node itself.
  Property child(value);
  child.name_ = key;
  return children_.emplace_back(std::move(child));
}

bool Property::GetBool() const {
  if (const bool* value = std::get_if<bool>(&value_)) return *value;
  ThrowWrongType(PropertyTypeBool, "GetBool", __LINE__, BOOST_CURRENT_FUNCTION);
}

long long Property::GetInt64() const {
  if (const long long* value = std::get_if<long long>(&value_)) return *value;
  ThrowWrongType(PropertyTypeInt64, "GetInt64", __LINE__, BOOST_CURRENT_FUNCTION);
}

const std::string& Property::GetString() const {
  if (const std::string* value = std::get_if<std::string>(&value_)) return *value;
  ThrowWrongType(PropertyTypeString, "GetString", __LINE__, BOOST_CURRENT_FUNCTION);
}

bool Property::operator==(const Property& other) const noexcept {
  return name_ == other.name_ && value_ == other.value_ && children_ == other.children_;
}

MethodIsNotApplicable Property::NotApplicableError(const char* method) const {
  MethodIsNotApplicable error;
  error << PropertyException::PropertyNameInfo(name_)
        << PropertyException::PropertyTypeInfo(GetType())
        << PropertyException::MethodNameInfo(method);
  return error;
}

void Property::ThrowNotApplicable(const char* method, int line, const char* function) const {
  ThrowWithLocation(line, __FILE__, function, AddStack(NotApplicableError(method)));
}

void Property::ThrowWrongType(PropertyTypes requested, const char* method, int line,
                              const char* function) const {
  const PropertyTypes actual = GetType();
  ThrowWithLocation(
      line, __FILE__, function,
      AddStack(WrongPropertyType()
               << PropertyException::PropertyNameInfo(name_)
               << PropertyException::PropertyTypeInfo(actual)
               << PropertyException::MethodNameInfo(method)
               << WrongPropertyType::RequestedTypeInfo(requested)
               << DescriptionInfo("property \"" + name_ + "\" holds " + PropertyTypeName(actual) +
                                  ", not " + PropertyTypeName(requested))));
}

void Property::ThrowChildNotFound(const std::string& key, int line, const char* function) const {
  ThrowWithLocation(
      line, __FILE__, function,
      AddStack(ChildNotFound() << PropertyException::PropertyNameInfo(name_)
                               << PropertyException::PropertyTypeInfo(GetType())
                               << PropertyException::MethodNameInfo("operator[]")
                               << ChildNotFound::ChildNameInfo(key)
                               << DescriptionInfo("property \"" + name_ + "\" has no child \"" +
                                                  key + "\"")));
}

}  // namespace Core
}  // namespace Tarvek
