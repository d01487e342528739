// TarvekTest::CountingBlob: a blob that counts its live instances, shared by the unit tests and
// the fuzz target (so it depends on no test framework).
#ifndef TARVEK_TESTS_SUPPORT_COUNTINGBLOB_H_
#define TARVEK_TESTS_SUPPORT_COUNTINGBLOB_H_

#include <atomic>
#include <cstddef>
#include <cstdint>

#include <Tarvek/Formats.h>

namespace TarvekTest {

// A blob that counts live instances, to prove that holders release what they hold.
class CountingBlob final : public Tarvek::IBlob {
 public:
  static std::atomic<int>& Live() {
    static std::atomic<int> live{0};
    return live;
  }

  static boost::intrusive_ptr<CountingBlob> Create() {
    return boost::intrusive_ptr<CountingBlob>(new CountingBlob);
  }

  int AddRef() const override { return count_.AddRefImpl(); }
  int GetRefCount() const override { return count_.GetRefCountImpl(); }
  int Release() const override {
    const int left = count_.ReleaseImpl();
    if (left == 0) delete this;
    return left;
  }
  const std::uint8_t* GetData() const override { return bytes_; }
  std::size_t GetSize() const override { return sizeof bytes_; }

 private:
  CountingBlob() { ++Live(); }
  ~CountingBlob() override { --Live(); }

  Tarvek::RefCountImpl count_;
  std::uint8_t bytes_[4] = {1, 2, 3, 4};
};

}  // namespace TarvekTest

#endif  // TARVEK_TESTS_SUPPORT_COUNTINGBLOB_H_
