// The core property library: Tarvek::Core::Property.
#include <Tarvek/Core/Interfaces/Property.h>

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <utility>

#include "ChildIndex.h"

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

std::uint64_t Load64(const char* p) noexcept {
  std::uint64_t word;
  std::memcpy(&word, p, sizeof word);
  return word;
}
std::uint64_t Load32(const char* p) noexcept {
  std::uint32_t word;
  std::memcpy(&word, p, sizeof word);
  return word;
}
std::uint64_t Rotate(std::uint64_t x, int bits) noexcept {
  return (x << bits) | (x >> (64 - bits));
}

// Folds the words of a long name that lie between its first and last eight bytes into `a`.
std::uint64_t FoldMiddle(const char* data, std::size_t size, std::uint64_t a) noexcept {
  for (std::size_t i = 8; i + 8 < size; i += 8) {
    a = Rotate(a * 0xD6E8FEB86659FD93ull, 31) ^ Load64(data + i);
  }
  return a;
}

// A hash for short texts (names are mostly under 16 bytes): two words that cover the text,
// overlapping when it is shorter than 16 bytes, multiplied and mixed. Longer names fold their
// leading words in first. Kept nowhere lasting, so it need not agree between machines.
std::uint32_t Hash(const std::string& name) noexcept {
  constexpr std::uint64_t k0 = 0x9E3779B97F4A7C15ull;
  constexpr std::uint64_t k1 = 0xC2B2AE3D27D4EB4Full;
  const char* const data = name.data();
  const std::size_t size = name.size();
  std::uint64_t a;
  std::uint64_t b;
  if (size >= 8) {
    a = Load64(data);
    b = Load64(data + size - 8);
    if (size > 16) a = FoldMiddle(data, size, a);
  } else if (size >= 4) {
    a = Load32(data);
    b = Load32(data + size - 4);
  } else {
    // One to three bytes: the first, the middle and the last (0 for the empty name).
    const auto byte = [data](std::size_t i) {
      return std::uint64_t{static_cast<unsigned char>(data[i])};
    };
    a = size == 0 ? 0 : byte(0);
    b = size == 0 ? 0 : byte(size - 1) << 8 | byte(size / 2);
  }
  std::uint64_t h = ((a ^ size) * k0) ^ (b * k1);
  // Mixed down as well as up: names that differ only in their last bytes (x_num, x_den) must
  // differ in the low bits too, which choose the index slot.
  h ^= h >> 32;
  h *= k0;
  h ^= h >> 29;
  return static_cast<std::uint32_t>(h);
}

}  // namespace

// Look-up by name. A container with kIndexThreshold children or more keeps an index of them by a
// hash of their names (ChildIndex.h); a smaller one is scanned, comparing lengths first.
//
// Renames. An index finds a child under the name it had when it was entered. A node that is a
// child can be renamed in place only by moving into it or out of it. Every child of an indexed
// container points to that index (in link_), and a renamed child marks it stale: look-ups in
// that container then scan until the next append rebuilds the index. Renaming children in place is
// rare, so this costs nothing in practice; no look-up ever gives a wrong answer, and look-ups write
// nothing, so trees shared for reading stay safe to read from any number of threads.
// Invariant: a child's parent index is null or its parent's current index. Only BuildIndex
// replaces an index while the children live on, and it updates them all.
//
// The index is a cache: when its block cannot be allocated there is none, and look-ups scan.
// Building it never throws.
struct Property::Internals {
  static constexpr std::size_t kIndexThreshold = 8;

  static ChildIndex* ParentIndex(const Property& node) noexcept {
    return reinterpret_cast<ChildIndex*>(node.link_ & ~kTypeBits);
  }
  static void SetParentIndex(Property& node, ChildIndex* index) noexcept {
    node.link_ = reinterpret_cast<std::uintptr_t>(index) | (node.link_ & kTypeBits);
  }
  static void SetType(Property& node, PropertyTypes type) noexcept {
    node.link_ = (node.link_ & ~kTypeBits) | static_cast<std::uintptr_t>(type);
  }

  static bool Usable(const Property& node) noexcept {
    return node.GetType() == PropertyTypeContainer && node.storage_.index != nullptr &&
           !node.storage_.index->Stale();
  }

  // The first child of `self` named `key`, or the end of its children.
  template <class Self>
  static auto Find(Self& self, const std::string& key) noexcept -> decltype(self.children_.end()) {
    if (Usable(self)) return self.storage_.index->Find(key, Hash(key), self.children_.end());
    return Scan(self, key);
  }

  // The first child of `self` named `key` by walking the children, or their end.
  template <class Self>
  static auto Scan(Self& self, const std::string& key) noexcept -> decltype(self.children_.end()) {
    for (auto it = self.children_.begin(); it != self.children_.end(); ++it) {
      if (Detail::SameName(it->name_, key)) return it;
    }
    return self.children_.end();
  }

  // (Re)builds the index of a container from its children, or leaves it without one when it has
  // too few children or the block cannot be had; either way every child points to what is left.
  static void BuildIndex(Property& node) noexcept {
    const std::size_t count = node.children_.size();
    ChildIndex* const index = count >= kIndexThreshold && count <= (std::size_t{1} << 28)
                                  ? ChildIndex::Create(count)
                                  : nullptr;
    const bool had = node.storage_.index != nullptr;
    ChildIndex::Destroy(node.storage_.index);
    node.storage_.index = index;
    if (index == nullptr && !had) return;  // no child points to an index
    for (auto it = node.children_.begin(); it != node.children_.end(); ++it) {
      if (index != nullptr) index->Enter(it, Hash(it->name_));
      SetParentIndex(*it, index);
    }
  }

  // Tells the parent's index, if any, that `node` has a new name.
  static void NoteRename(const Property& node) noexcept {
    ChildIndex* const parent = ParentIndex(node);
    if (parent != nullptr) parent->MarkStale();
  }

  // Frees what the storage holds (a string or an index); the node is then a container without an
  // index, its children untouched: they must be dropped next (Clear, or the destructor).
  static void Release(Property& node) noexcept {
    if (node.GetType() == PropertyTypeString) {
      node.storage_.text.~basic_string();
    } else if (node.GetType() == PropertyTypeContainer) {
      ChildIndex::Destroy(node.storage_.index);
    }
    SetType(node, PropertyTypeContainer);
    node.storage_.index = nullptr;
  }

  // Empties `node`: no value, no children, no index; its name and place stay.
  static void Clear(Property& node) noexcept {
    Release(node);
    node.children_.clear();
  }

  // Puts a string into the storage of `node`, which holds nothing. The string is built by the
  // caller: a string constructor that throws may already have written into its storage, and the
  // storage must keep meaning "no index" until the string is complete.
  static void PlaceText(Property& node, std::string&& text) noexcept {
    new (&node.storage_.text) std::string(std::move(text));
  }

  // Copies `from`'s value into `to`, which holds nothing. A container copies no index: `to`
  // builds its own over its own children. On failure `to` still holds nothing.
  static void CopyValue(Property& to, const Property& from) {
    switch (from.GetType()) {
      case PropertyTypeBool:
        to.storage_.flag = from.storage_.flag;
        break;
      case PropertyTypeInt64:
        to.storage_.integer = from.storage_.integer;
        break;
      case PropertyTypeString:
        PlaceText(to, std::string(from.storage_.text));
        break;
      default:
        return;
    }
    SetType(to, from.GetType());
  }

  // Moves `from`'s value or index into `to`, which holds nothing; `from` then holds nothing.
  static void MoveValue(Property& to, Property& from) noexcept {
    switch (from.GetType()) {
      case PropertyTypeBool:
        to.storage_.flag = from.storage_.flag;
        break;
      case PropertyTypeInt64:
        to.storage_.integer = from.storage_.integer;
        break;
      case PropertyTypeString:
        new (&to.storage_.text) std::string(std::move(from.storage_.text));
        from.storage_.text.~basic_string();
        break;
      default:
        to.storage_.index = from.storage_.index;
        break;
    }
    SetType(to, from.GetType());
    SetType(from, PropertyTypeContainer);
    from.storage_.index = nullptr;
  }

  // Exchanges value (or index) and children; names and places stay.
  static void SwapContent(Property& a, Property& b) noexcept {
    Property held{std::string()};
    MoveValue(held, a);
    MoveValue(a, b);
    MoveValue(b, held);
    a.children_.swap(b.children_);
  }

  static void Rename(Property& node, const std::string& name) { node.name_ = name; }
};

Property::Property(const std::string& name) : name_(name), link_(PropertyTypeContainer) {}

Property::Property(const std::string& name, bool value) : Property(name) {
  storage_.flag = value;
  Internals::SetType(*this, PropertyTypeBool);
}

Property::Property(const std::string& name, long long value) : Property(name) {
  storage_.integer = value;
  Internals::SetType(*this, PropertyTypeInt64);
}

Property::Property(const std::string& name, const std::string& value) : Property(name) {
  Internals::PlaceText(*this, std::string(value));
  Internals::SetType(*this, PropertyTypeString);
}

Property::Property(const std::string& name, const char* value)
    : Property(name, std::string(value)) {}

// The value is copied last, in the body: if it throws, the members built so far are destroyed and
// the storage holds nothing that would need freeing.
Property::Property(const Property& other)
    : name_(other.name_), link_(PropertyTypeContainer), children_(other.children_) {
  Internals::CopyValue(*this, other);
  if (GetType() == PropertyTypeContainer) Internals::BuildIndex(*this);
}

Property::Property(Property&& other) noexcept
    : name_(std::move(other.name_)), link_(PropertyTypeContainer) {
  // Swapped, not moved: a swap keeps iterators to the elements valid, so the index stays good.
  children_.swap(other.children_);
  Internals::MoveValue(*this, other);
  other.name_.clear();
  if (!name_.empty()) Internals::NoteRename(other);
}

Property::~Property() { Internals::Release(*this); }

Property& Property::operator=(const Property& other) {
  if (this == &other) return *this;
  // Copy first: `other` may be a descendant of this node, which the exchange below destroys.
  Property copy{std::string()};
  copy.children_ = other.children_;
  Internals::CopyValue(copy, other);
  Internals::SwapContent(*this, copy);
  if (GetType() == PropertyTypeContainer) Internals::BuildIndex(*this);
  return *this;
}

Property& Property::operator=(Property&& other) noexcept {
  if (this == &other) return *this;
  // Detach `other`'s content before dropping ours: `other` may live inside our children.
  Property taken(std::move(other));
  if (taken.name_ != name_) Internals::NoteRename(*this);
  name_.swap(taken.name_);
  Internals::SwapContent(*this, taken);
  return *this;
}

Property& Property::operator=(bool value) {
  Internals::Clear(*this);
  storage_.flag = value;
  Internals::SetType(*this, PropertyTypeBool);
  return *this;
}

Property& Property::operator=(long long value) {
  Internals::Clear(*this);
  storage_.integer = value;
  Internals::SetType(*this, PropertyTypeInt64);
  return *this;
}

Property& Property::operator=(const std::string& value) {
  // A string leaf reuses its buffer; assignment leaves it as it was if it throws.
  if (GetType() == PropertyTypeString) {
    storage_.text = value;
    return *this;
  }
  // Copy first: `value` may be a descendant's string, which Clear destroys.
  std::string copy(value);
  Internals::Clear(*this);
  Internals::PlaceText(*this, std::move(copy));
  Internals::SetType(*this, PropertyTypeString);
  return *this;
}

Property& Property::operator=(const char* value) { return *this = std::string(value); }

bool Property::ChildExists(const std::string& key) const noexcept {
  return Internals::Find(*this, key) != children_.end();
}

Property::iterator Property::FindChild(const std::string& key) noexcept {
  return Internals::Find(*this, key);
}

Property::const_iterator Property::FindChild(const std::string& key) const noexcept {
  return Internals::Find(*this, key);
}

const Property& Property::operator[](const std::string& key) const {
  const const_iterator found = Internals::Find(*this, key);
  if (found == children_.end()) {
    ThrowChildNotFound(key, __FILE__, __LINE__, BOOST_CURRENT_FUNCTION);
  }
  return *found;
}

// Called by the inline look-ups for containers with an index only, so kept lean: the probe, and
// the walk only while the index is stale.
Property::const_iterator Property::FindIndexed(const PropertyKey& key) const noexcept {
  const ChildIndex* const index = storage_.index;
  if (index->Stale()) return Internals::Scan(*this, key.name_);
  return index->Find(key.name_, key.hash_, children_.end());
}

PropertyKey::PropertyKey(const std::string& name) : name_(name), hash_(Hash(name)) {}

Property& Property::operator[](const std::string& key) {
  const iterator found = Internals::Find(*this, key);
  if (found != children_.end()) return *found;
  if (GetType() != PropertyTypeContainer) {
    ThrowNotApplicable("operator[]", __LINE__, BOOST_CURRENT_FUNCTION);
  }
  children_.emplace_back(key);
  return AdoptLast();
}

Property& Property::SetChild(const std::string& key) {
  if (GetType() != PropertyTypeContainer) {
    ThrowNotApplicable("SetChild", __LINE__, BOOST_CURRENT_FUNCTION);
  }
  const iterator found = Internals::Find(*this, key);
  if (found == children_.end()) {
    children_.emplace_back(key);
    return AdoptLast();
  }
  Internals::Clear(*found);
  return *found;
}

Property& Property::SetChild(const std::string& key, const Property& value) {
  if (GetType() != PropertyTypeContainer) {
    ThrowNotApplicable("SetChild", __LINE__, BOOST_CURRENT_FUNCTION);
  }
  const iterator found = Internals::Find(*this, key);
  if (found != children_.end()) return *found = value;
  // Append a complete copy, then rename it: `value` may be this node itself.
  Property child(value);
  Internals::Rename(child, key);
  children_.emplace_back(std::move(child));
  return AdoptLast();
}

Property& Property::AdoptLast() noexcept {
  const iterator last = std::prev(children_.end());
  if (Internals::Usable(*this) && storage_.index->HasRoom()) {
    storage_.index->Enter(last, Hash(last->name_));
    Internals::SetParentIndex(*last, storage_.index);
  } else if (children_.size() >= Internals::kIndexThreshold) {
    Internals::BuildIndex(*this);
  }
  return *last;
}

bool Property::operator==(const Property& other) const noexcept {
  if (GetType() != other.GetType() || name_ != other.name_) return false;
  switch (GetType()) {
    case PropertyTypeBool:
      return storage_.flag == other.storage_.flag;
    case PropertyTypeInt64:
      return storage_.integer == other.storage_.integer;
    case PropertyTypeString:
      return storage_.text == other.storage_.text;
    default:
      return children_ == other.children_;
  }
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

void Property::ThrowWrongType(PropertyTypes requested, const char* method, const char* file,
                              int line, const char* function) const {
  const PropertyTypes actual = GetType();
  ThrowWithLocation(
      line, file, function,
      AddStack(WrongPropertyType()
               << PropertyException::PropertyNameInfo(name_)
               << PropertyException::PropertyTypeInfo(actual)
               << PropertyException::MethodNameInfo(method)
               << WrongPropertyType::RequestedTypeInfo(requested)
               << DescriptionInfo("property \"" + name_ + "\" holds " + PropertyTypeName(actual) +
                                  ", not " + PropertyTypeName(requested))));
}

void Property::ThrowChildNotFound(const std::string& key, const char* file, int line,
                                  const char* function) const {
  ThrowWithLocation(
      line, file, function,
      AddStack(ChildNotFound() << PropertyException::PropertyNameInfo(name_)
                               << PropertyException::PropertyTypeInfo(GetType())
                               << PropertyException::MethodNameInfo("operator[]")
                               << ChildNotFound::ChildNameInfo(key)
                               << DescriptionInfo("property \"" + name_ + "\" has no child \"" +
                                                  key + "\"")));
}

}  // namespace Core
}  // namespace Tarvek
