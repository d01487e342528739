// Tarvek::RefCountImpl and Tarvek::CreateBlob (shared counts: RefCountThreadsTest).
#include <cstdint>
#include <vector>

#include <Tarvek/Formats.h>
#include "Support/TestSupport.h"

namespace {

// The count starts at 0 and each call returns the new count; copies do not copy references.
TEST(RefCountTest, CounterCountsItsOwnReferencesOnly) {
  const Tarvek::RefCountImpl count;
  EXPECT_EQ(count.GetRefCountImpl(), 0);
  EXPECT_EQ(count.AddRefImpl(), 1);
  EXPECT_EQ(count.AddRefImpl(), 2);
  EXPECT_EQ(Tarvek::RefCountImpl(count).GetRefCountImpl(), 0);
  Tarvek::RefCountImpl target;
  target.AddRefImpl();
  target = count;
  EXPECT_EQ(target.GetRefCountImpl(), 1);
  EXPECT_EQ(count.ReleaseImpl(), 1);
  EXPECT_EQ(count.ReleaseImpl(), 0);
  EXPECT_EQ(count.GetRefCountImpl(), 0);
}

TEST(RefCountTest, CreateBlobCopiesTheBytes) {
  std::vector<std::uint8_t> bytes = {1, 2, 3, 4, 5};
  const boost::intrusive_ptr<Tarvek::IBlob> blob = Tarvek::CreateBlob(bytes.data(), bytes.size());
  ASSERT_TRUE(blob);
  EXPECT_EQ(blob->GetRefCount(), 1);
  bytes.assign(bytes.size(), 0xff);
  ASSERT_EQ(blob->GetSize(), 5u);
  EXPECT_EQ(std::vector<std::uint8_t>(blob->GetData(), blob->GetData() + 5),
            (std::vector<std::uint8_t>{1, 2, 3, 4, 5}));

  // No bytes: no data, whatever the pointer; null data is refused once there are bytes to copy.
  EXPECT_EQ(Tarvek::CreateBlob(nullptr, 0)->GetSize(), 0u);
  EXPECT_EQ(Tarvek::CreateBlob(bytes.data(), 0)->GetData(), nullptr);
  const auto error =
      TarvekTest::CatchAs<Tarvek::Core::CoreException>([] { Tarvek::CreateBlob(nullptr, 3); });
  ASSERT_TRUE(error);
  EXPECT_FALSE(TarvekTest::ItemOf<Tarvek::DescriptionInfo>(*error).value_or("").empty());
  EXPECT_TRUE(TarvekTest::ItemOf<Tarvek::CallStackInfo>(*error));
}

}  // namespace
