// The index of a large container's children by name, private to the core property library.
//
// An open-addressing table (linear probing, at most three quarters full) of iterators to the
// children, with one control byte a slot: 0 for an empty slot, else 0x80 and the top seven bits
// of the name's hash. Only the first child of each name is entered, so a look-up gives the first
// child of a name. List iterators stay valid while other children come and go and when the list
// is swapped, so the index moves with the children it describes.
//
// The table lives in one heap block: this header, then the control bytes (so that a look-up's
// first probe reads the header's cache line), then the slots.
#ifndef TARVEK_CORE_SOURCE_CHILDINDEX_H_
#define TARVEK_CORE_SOURCE_CHILDINDEX_H_

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <new>
#include <string>
#include <type_traits>

#include <Tarvek/Core/Interfaces/Property.h>

namespace Tarvek {
namespace Core {
namespace Detail {

// Text equality without a library call, in words of eight or four bytes: a look-up that makes no
// call saves no registers.
inline bool SameName(const std::string& a, const std::string& b) noexcept {
  const std::size_t size = a.size();
  if (size != b.size()) return false;
  const char* x = a.data();
  const char* y = b.data();
  const auto same = [x, y](std::size_t at, auto word) {
    std::memcpy(&word, x + at, sizeof word);
    decltype(word) other;
    std::memcpy(&other, y + at, sizeof other);
    return word == other;
  };
  if (size >= 8) {
    for (std::size_t at = 0; at + 8 < size; at += 8) {
      if (!same(at, std::uint64_t{})) return false;
    }
    return same(size - 8, std::uint64_t{});
  }
  if (size >= 4) return same(0, std::uint32_t{}) && same(size - 4, std::uint32_t{});
  for (std::size_t at = 0; at < size; ++at) {
    if (x[at] != y[at]) return false;
  }
  return true;
}

}  // namespace Detail

class alignas(8) Property::ChildIndex {
 public:
  static_assert(std::is_trivially_copyable_v<iterator> &&
                    std::is_trivially_destructible_v<iterator>,
                "index slots are raw copies of list iterators");
  static_assert(alignof(iterator) <= 8 && 8 <= __STDCPP_DEFAULT_NEW_ALIGNMENT__,
                "index blocks come from operator new, 8-aligned: a node keeps its type in the "
                "low bits of its parent's index address");

  // An empty index with room for `names` distinct names, or null when the block cannot be had.
  static ChildIndex* Create(std::size_t names) noexcept {
    std::size_t slots = 32;
    while ((names + 1) * 4 > slots * 3) slots *= 2;
    void* const block =
        ::operator new(sizeof(ChildIndex) + slots * (sizeof(iterator) + 1), std::nothrow);
    if (block == nullptr) return nullptr;
    auto* const index = new (block) ChildIndex(static_cast<std::uint32_t>(slots - 1));
    std::memset(index->Control(), 0, slots);
    return index;
  }

  static void Destroy(ChildIndex* index) noexcept { ::operator delete(index); }

  // The first entered child named `name` (whose hash is `hash`), or `end`.
  template <class Iterator>
  Iterator Find(const std::string& name, std::uint32_t hash, Iterator end) const noexcept {
    const unsigned char tag = Tag(hash);
    const unsigned char* const control = Control();
    for (std::uint32_t i = hash & mask_;; i = (i + 1) & mask_) {
      if (control[i] == 0) return end;
      if (control[i] == tag && Detail::SameName(Slots()[i]->name_, name)) return Slots()[i];
    }
  }

  // Whether one more name fits without the table passing three quarters full.
  bool HasRoom() const noexcept {
    return (std::uint64_t{names_} + 1) * 4 <= (std::uint64_t{mask_} + 1) * 3;
  }

  // Enters `child`, whose name's hash is `hash`, unless an earlier child has its name. The table
  // has room.
  void Enter(iterator child, std::uint32_t hash) noexcept {
    const unsigned char tag = Tag(hash);
    unsigned char* const control = Control();
    for (std::uint32_t i = hash & mask_;; i = (i + 1) & mask_) {
      if (control[i] == 0) {
        control[i] = tag;
        new (Slots() + i) iterator(child);
        ++names_;
        return;
      }
      if (control[i] == tag && Detail::SameName(Slots()[i]->name_, child->name_)) return;
    }
  }

  // A child was renamed in place: the entries may name it wrongly until the index is rebuilt.
  void MarkStale() noexcept { stale_ = true; }
  bool Stale() const noexcept { return stale_; }

 private:
  explicit ChildIndex(std::uint32_t mask) noexcept : mask_(mask) {}

  static unsigned char Tag(std::uint32_t hash) noexcept {
    return static_cast<unsigned char>(0x80u | (hash >> 25));
  }
  // The slot count is a power of two, at least 32: the slots after the control bytes are aligned.
  unsigned char* Control() const noexcept {
    return reinterpret_cast<unsigned char*>(const_cast<ChildIndex*>(this) + 1);
  }
  iterator* Slots() const noexcept { return reinterpret_cast<iterator*>(Control() + mask_ + 1); }

  std::uint32_t mask_;  // slot count - 1
  std::uint32_t names_ = 0;
  bool stale_ = false;
};

}  // namespace Core
}  // namespace Tarvek

#endif  // TARVEK_CORE_SOURCE_CHILDINDEX_H_
