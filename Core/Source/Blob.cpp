// The core property library: Tarvek::IBlob and Tarvek::CreateBlob.
#include <cstring>
#include <memory>

#include <Tarvek/Core/Errors/AddStack.h>
#include <Tarvek/Core/Errors/CoreException.h>
#include <Tarvek/Core/Interfaces/IBlob.h>
#include <Tarvek/Core/Interfaces/RefCountImpl.h>

namespace Tarvek {
namespace {

// An immutable copy of a byte range that frees itself with its last reference.
class Blob final : public IBlob {
 public:
  Blob(const void* data, std::size_t size)
      : data_(size == 0 ? nullptr : new std::uint8_t[size]), size_(size) {
    if (size != 0) std::memcpy(data_.get(), data, size);
  }

  int AddRef() const override { return count_.AddRefImpl(); }
  int GetRefCount() const override { return count_.GetRefCountImpl(); }
  int Release() const override {
    const int left = count_.ReleaseImpl();
    if (left == 0) delete this;
    return left;
  }

  const std::uint8_t* GetData() const override { return data_.get(); }
  std::size_t GetSize() const override { return size_; }

 private:
  RefCountImpl count_;
  std::unique_ptr<std::uint8_t[]> data_;
  std::size_t size_;
};

}  // namespace

boost::intrusive_ptr<IBlob> CreateBlob(const void* data, std::size_t size) {
  if (data == nullptr && size != 0) {
    ThrowWithLocation(__LINE__, __FILE__, BOOST_CURRENT_FUNCTION,
                      AddStack(Core::CoreException()
                               << DescriptionInfo("CreateBlob: null data with a non-zero size")));
  }
  return boost::intrusive_ptr<IBlob>(new Blob(data, size));
}

}  // namespace Tarvek
