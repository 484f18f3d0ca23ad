#include <krCoreLib/system/CKRReaderWriterLock.h>

#include "KRThreadTestSupport.h"

using namespace krtest;

namespace {

template <class TLock>
void ExpectFree(TLock& lock) {
  EXPECT_EQ(lock.GetReaderCount(), 0);
  EXPECT_EQ(lock.GetWriterCount(), 0);
  EXPECT_EQ(lock.GetWaitingReaderCount(), 0);
}

}  // namespace

// Both locks: what they share is tested on each.
template <class TLock>
class CKRReaderWriterLockTest : public testing::Test {};
using KRLockTypes = testing::Types<CReaderWriterLockNonReentrance, CKRReaderWriterLock>;
TYPED_TEST_SUITE(CKRReaderWriterLockTest, KRLockTypes);

// A writer waits for a reader; readers arriving behind a waiting writer wait
// too, and a second writer still goes before them.
TYPED_TEST(CKRReaderWriterLockTest, PrefersWritersAndIgnoresReleasesOfWhatIsNotHeld) {
  TypeParam lock;
  CRecords<char> log;
  auto logged = [&](bool write) {
    return [&, write] {
      write ? lock.AcquireWriterLock() : lock.AcquireReaderLock();
      log.Add(write ? 'W' : 'R');
      write ? lock.ReleaseWriterLock() : lock.ReleaseReaderLock();
    };
  };
  CActor firstReader, firstWriter, secondReader, secondWriter;
  ASSERT_TRUE(firstReader.Do([&] { lock.AcquireReaderLock(); }));
  const auto firstWritten = firstWriter.Post(logged(true));
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWriterCount() == 1; }));
  const auto secondRead = secondReader.Post(logged(false));
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWaitingReaderCount() == 1; }));
  const auto secondWritten = secondWriter.Post(logged(true));
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWriterCount() == 2; }));

  ASSERT_TRUE(firstReader.Do([&] { lock.ReleaseReaderLock(); }));
  EXPECT_TRUE(firstWritten->Wait() && secondWritten->Wait() && secondRead->Wait());
  EXPECT_EQ(log.WaitFor(), (std::vector<char>{'W', 'W', 'R'}));
  ExpectFree(lock);

  // Releasing what the thread does not hold changes nothing and is reported.
  CDebugRecorder recorder;
  ASSERT_TRUE(firstReader.Do([&] { lock.AcquireReaderLock(); }));
  lock.ReleaseReaderLock();
  lock.ReleaseWriterLock();
  EXPECT_EQ(lock.GetReaderCount(), 1);
  EXPECT_EQ(lock.GetWriterCount(), 0);
  EXPECT_EQ(recorder.Texts().size(), 2u) << "each reported";

  // Had the count dropped, this writer would get in while the reader reads.
  std::atomic<bool> written{false};
  const auto writing = firstWriter.Post([&] {
    lock.AcquireWriterLock();
    written = true;
  });
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWriterCount() == 1; }));
  lock.ReleaseReaderLock();
  EXPECT_FALSE(written.load());
  ASSERT_TRUE(firstReader.Do([&] { lock.ReleaseReaderLock(); }));
  ASSERT_TRUE(writing->Wait());

  ASSERT_TRUE(firstReader.Do([&] { lock.ReleaseWriterLock(); }));   // nor another thread's write lock
  EXPECT_EQ(lock.GetWriterCount(), 1);
  ASSERT_TRUE(firstWriter.Do([&] { lock.ReleaseWriterLock(); }));
  EXPECT_EQ(recorder.Texts().size(), 4u);
  ExpectFree(lock);
}

// A thread killed while it waits for the lock leaves it as if it had never
// asked.
TYPED_TEST(CKRReaderWriterLockTest, KilledWaitersLeaveTheLockConsistent) {
  TypeParam lock;
  // A thread that asks for the lock, killed once `waits` shows it waiting.
  auto killWaiter = [&](bool write, auto waits) {
    CFunctionThread waiter([&](CFunctionThread&) -> unsigned long {
      write ? lock.AcquireWriterLock() : lock.AcquireReaderLock();
      return 1;
    });
    waiter.Start();
    ASSERT_TRUE(WaitUntil(waits));
    waiter.Kill(7);
  };
  CActor holder, another;
  ASSERT_TRUE(holder.Do([&] { lock.AcquireReaderLock(); }));
  killWaiter(true, [&] { return lock.GetWriterCount() == 1; });
  EXPECT_EQ(lock.GetWriterCount(), 0);
  EXPECT_EQ(lock.GetReaderCount(), 1);
  // New readers are not held up by the writer that is gone.
  ASSERT_TRUE(another.Do([&] {
    lock.AcquireReaderLock();
    lock.ReleaseReaderLock();
  }));
  ASSERT_TRUE(holder.Do([&] {
    lock.ReleaseReaderLock();
    lock.AcquireWriterLock();
  }));

  killWaiter(false, [&] { return lock.GetWaitingReaderCount() == 1; });
  EXPECT_EQ(lock.GetWaitingReaderCount(), 0);
  ASSERT_TRUE(holder.Do([&] { lock.ReleaseWriterLock(); }));
  ASSERT_TRUE(another.Do([&] {
    lock.AcquireWriterLock();
    lock.ReleaseWriterLock();
  }));
  ExpectFree(lock);
}

// Four threads write a pair of fields under the write lock and check it under
// the read lock: plain reads and writes, and for the reentrant lock nested
// reads, an upgrade with downgrade, and nested writes with a read inside.
TYPED_TEST(CKRReaderWriterLockTest, ReadersAndWritersNeverSeeATornUpdate) {
  constexpr int kRounds = 20000;
  const unsigned modes = std::is_same_v<TypeParam, CKRReaderWriterLock> ? 5 : 2;
  TypeParam lock;
  long long first = 0, second = 0;
  std::atomic<int> faults{0}, readers{0}, writers{0};
  auto read = [&] {
    ++readers;
    faults += writers.load() != 0 || first != second;
    --readers;
  };
  auto write = [&](long long value) {
    faults += writers++ != 0 || readers.load() != 0;
    first = second = value;
    --writers;
  };
  std::latch together(4);
  std::vector<std::thread> threads;
  for (unsigned t = 0; t < 4; ++t) {
    threads.emplace_back([&, t] {
      std::mt19937 random(KRTestSeed() + t);
      together.arrive_and_wait();
      for (long long i = 0; i < kRounds; ++i) {
        const long long value = t * kRounds + i;
        const unsigned mode = random() % modes;
        if (mode == 0 || mode == 4) {
          lock.AcquireWriterLock();
          if (mode == 4) {   // nested, with a read inside, released out of order
            lock.AcquireWriterLock();
            lock.AcquireReaderLock();
            lock.ReleaseWriterLock();
          }
          write(value);
          lock.ReleaseWriterLock();
          if (mode == 4)
            lock.ReleaseReaderLock();
        } else {
          lock.AcquireReaderLock();
          if (mode == 2)
            lock.AcquireReaderLock();
          read();
          if (mode == 3) {   // upgrade and downgrade
            lock.AcquireWriterLock();
            write(value);
            lock.ReleaseWriterLock();
            read();
          }
          if (mode == 2)
            lock.ReleaseReaderLock();
          lock.ReleaseReaderLock();
        }
      }
    });
  }
  for (std::thread& thread : threads)
    thread.join();
  EXPECT_EQ(faults.load(), 0) << "a torn update or an overlap";
  ExpectFree(lock);
}

// A recursive reader does not wait for a waiting writer; a reader upgrades
// once the other readers left, and downgrades back to reading.
TEST(CKRReaderWriterLock, ReentersReadingUpgradesAndDowngrades) {
  CKRReaderWriterLock lock;
  CActor upgrader, otherReader, lateReader;
  ASSERT_TRUE(upgrader.Do([&] { lock.AcquireReaderLock(); }));
  std::atomic<bool> written{false};
  const auto writing = lateReader.Post([&] {
    lock.AcquireWriterLock();
    written = true;
    lock.ReleaseWriterLock();
  });
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWriterCount() == 1; }));
  // A non-reentrant lock would deadlock here.
  ASSERT_TRUE(upgrader.Do([&] { lock.AcquireReaderLock(); }));
  EXPECT_EQ(lock.GetReaderCount(), 1);
  ASSERT_TRUE(upgrader.Do([&] { lock.ReleaseReaderLock(); }));
  EXPECT_FALSE(written.load());
  ASSERT_TRUE(upgrader.Do([&] { lock.ReleaseReaderLock(); }));
  EXPECT_TRUE(writing->Wait());

  ASSERT_TRUE(upgrader.Do([&] { lock.AcquireReaderLock(); }));
  ASSERT_TRUE(otherReader.Do([&] { lock.AcquireReaderLock(); }));
  const auto upgraded = upgrader.Post([&] { lock.AcquireWriterLock(); });
  // The upgrader gave up its read access and waits as a writer.
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWriterCount() == 1 && lock.GetReaderCount() == 1; }));
  ASSERT_TRUE(otherReader.Do([&] { lock.ReleaseReaderLock(); }));
  ASSERT_TRUE(upgraded->Wait());
  EXPECT_EQ(lock.GetReaderCount(), 0);
  ASSERT_TRUE(upgrader.Do([&] {   // writers may nest and read
    lock.AcquireWriterLock();
    lock.AcquireReaderLock();
    lock.ReleaseWriterLock();
    lock.ReleaseReaderLock();
  }));
  EXPECT_EQ(lock.GetWriterCount(), 1);

  const auto reading = lateReader.Post([&] { lock.AcquireReaderLock(); });
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWaitingReaderCount() == 1; }));
  // Downgrade: the upgrader still reads, and the waiting reader joins it.
  ASSERT_TRUE(upgrader.Do([&] { lock.ReleaseWriterLock(); }));
  ASSERT_TRUE(reading->Wait());
  EXPECT_EQ(lock.GetReaderCount(), 2);
  EXPECT_EQ(lock.GetWriterCount(), 0);

  ASSERT_TRUE(upgrader.Do([&] { lock.ReleaseReaderLock(); }));
  ASSERT_TRUE(lateReader.Do([&] { lock.ReleaseReaderLock(); }));
  ExpectFree(lock);
}

TEST(CKRReaderWriterLock, AThreadMayHoldManyLocksAtOnce) {
  // More locks than a thread's record keeps without allocating, released in
  // random order.
  std::vector<CKRReaderWriterLock> locks(40);
  std::vector<int> order(40);
  std::iota(order.begin(), order.end(), 0);
  for (int i : order) {
    locks[i].AcquireReaderLock();
    if (i % 3 == 0)
      locks[i].AcquireWriterLock();
  }
  std::mt19937 random(KRTestSeed());
  std::shuffle(order.begin(), order.end(), random);
  CDebugRecorder recorder;
  for (int i : order) {
    if (i % 3 == 0)
      locks[i].ReleaseWriterLock();
    locks[i].ReleaseReaderLock();
    EXPECT_EQ(locks[i].GetReaderCount() + locks[i].GetWriterCount(), 0) << i;
  }
  EXPECT_TRUE(recorder.Texts().empty());
  locks[0].ReleaseReaderLock();   // everything was given back
  EXPECT_EQ(recorder.Texts().size(), 1u);
}
