// Tarvek::RefCountImpl, the intrusive_ptr hooks and Tarvek::CreateBlob.
#include <cstdint>
#include <thread>
#include <vector>

#include <Tarvek/Formats.h>
#include "Support/TestSupport.h"

namespace {

using TarvekTest::CountingBlob;

TEST(RefCountTest, CounterStartsAtZeroAndReturnsNewCounts) {
  const Tarvek::RefCountImpl count;
  EXPECT_EQ(count.GetRefCountImpl(), 0);
  EXPECT_EQ(count.AddRefImpl(), 1);
  EXPECT_EQ(count.AddRefImpl(), 2);
  EXPECT_EQ(count.GetRefCountImpl(), 2);
  EXPECT_EQ(count.ReleaseImpl(), 1);
  EXPECT_EQ(count.ReleaseImpl(), 0);
  EXPECT_EQ(count.GetRefCountImpl(), 0);
}

TEST(RefCountTest, CopiesDoNotCopyReferences) {
  const Tarvek::RefCountImpl source;
  source.AddRefImpl();
  source.AddRefImpl();
  const Tarvek::RefCountImpl copy(source);
  EXPECT_EQ(copy.GetRefCountImpl(), 0);

  Tarvek::RefCountImpl target;
  for (int i = 0; i < 3; ++i) target.AddRefImpl();
  target = source;
  EXPECT_EQ(target.GetRefCountImpl(), 3);
  EXPECT_EQ(source.GetRefCountImpl(), 2);
}

TEST(RefCountTest, IntrusivePtrFreesExactlyAtZero) {
  const int live = CountingBlob::Live();
  boost::intrusive_ptr<CountingBlob> first = CountingBlob::Create();
  EXPECT_EQ(first->GetRefCount(), 1);
  EXPECT_EQ(CountingBlob::Live(), live + 1);

  boost::intrusive_ptr<Tarvek::IBlob> second = first;
  EXPECT_EQ(first->GetRefCount(), 2);
  first.reset();
  EXPECT_EQ(CountingBlob::Live(), live + 1);
  EXPECT_EQ(second->GetRefCount(), 1);

  // The hooks only count; freeing is Release()'s job at zero.
  Tarvek::intrusive_ptr_add_ref(second.get());
  EXPECT_EQ(second->GetRefCount(), 2);
  Tarvek::intrusive_ptr_release(second.get());
  EXPECT_EQ(second->GetRefCount(), 1);
  EXPECT_EQ(CountingBlob::Live(), live + 1);

  second.reset();
  EXPECT_EQ(CountingBlob::Live(), live);
}

TEST(RefCountTest, CreateBlobCopiesTheBytes) {
  std::vector<std::uint8_t> bytes = {1, 2, 3, 4, 5};
  const boost::intrusive_ptr<Tarvek::IBlob> blob = Tarvek::CreateBlob(bytes.data(), bytes.size());
  ASSERT_TRUE(blob);
  EXPECT_EQ(blob->GetRefCount(), 1);
  EXPECT_NE(blob->GetData(), bytes.data());
  bytes.assign(bytes.size(), 0xff);
  ASSERT_EQ(blob->GetSize(), 5u);
  EXPECT_EQ(std::vector<std::uint8_t>(blob->GetData(), blob->GetData() + 5),
            (std::vector<std::uint8_t>{1, 2, 3, 4, 5}));
}

TEST(RefCountTest, CreateBlobOfNoBytes) {
  const auto empty = Tarvek::CreateBlob(nullptr, 0);
  ASSERT_TRUE(empty);
  EXPECT_EQ(empty->GetData(), nullptr);
  EXPECT_EQ(empty->GetSize(), 0u);
  const std::uint8_t byte = 7;
  EXPECT_EQ(Tarvek::CreateBlob(&byte, 0)->GetData(), nullptr);

  // Null data is refused once there are bytes to copy.
  const auto error =
      TarvekTest::CatchAs<Tarvek::Core::CoreException>([] { Tarvek::CreateBlob(nullptr, 3); });
  ASSERT_TRUE(error);
  EXPECT_FALSE(TarvekTest::ItemOf<Tarvek::DescriptionInfo>(*error).value_or("").empty());
  EXPECT_TRUE(TarvekTest::ItemOf<Tarvek::CallStackInfo>(*error));
}

TEST(RefCountTest, ConcurrentCopiesKeepTheCount) {
  const int live = CountingBlob::Live();
  boost::intrusive_ptr<CountingBlob> shared = CountingBlob::Create();
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&shared] {
      for (int i = 0; i < 10000; ++i) {
        boost::intrusive_ptr<CountingBlob> copy = shared;
        boost::intrusive_ptr<Tarvek::IBlob> another = copy;
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(shared->GetRefCount(), 1);
  EXPECT_EQ(CountingBlob::Live(), live + 1);
  shared.reset();
  EXPECT_EQ(CountingBlob::Live(), live);
}

}  // namespace
