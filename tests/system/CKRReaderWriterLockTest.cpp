#include <krCoreLib/system/CKRReaderWriterLock.h>

#include "KRThreadTestSupport.h"
#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <latch>
#include <mutex>
#include <random>
#include <string>
#include <thread>
#include <vector>

using krtest::CActor;
using krtest::WaitUntil;

namespace {

// The order in which helper threads got the lock.
class CLog {
public:
  void Add(const std::string& entry) {
    std::lock_guard<std::mutex> lock(m_Mutex);
    m_Entries += entry;
  }
  std::string Get() {
    std::lock_guard<std::mutex> lock(m_Mutex);
    return m_Entries;
  }

private:
  std::mutex m_Mutex;
  std::string m_Entries;
};

// A writer waits for a reader; readers arriving behind a waiting writer wait
// too, and a second writer still goes before them.
template <class TLock>
void CheckWriterPreference() {
  TLock lock;
  CLog log;
  CActor firstReader, firstWriter, secondReader, secondWriter;
  ASSERT_TRUE(firstReader.Do([&] { lock.AcquireReaderLock(); }));

  auto writer = [&](const char* name) {
    return [&lock, &log, name] {
      lock.AcquireWriterLock();
      log.Add(name);
      lock.ReleaseWriterLock();
    };
  };
  const auto firstWritten = firstWriter.Post(writer("W"));
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWriterCount() == 1; }));
  const auto secondRead = secondReader.Post([&] {
    lock.AcquireReaderLock();
    log.Add("R");
    lock.ReleaseReaderLock();
  });
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWaitingReaderCount() == 1; }));
  const auto secondWritten = secondWriter.Post(writer("W"));
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWriterCount() == 2; }));
  // The first reader still reads, so nobody can have gone on.
  EXPECT_EQ(log.Get(), "");
  EXPECT_EQ(lock.GetReaderCount(), 1);

  ASSERT_TRUE(firstReader.Do([&] { lock.ReleaseReaderLock(); }));
  EXPECT_TRUE(firstWritten->Wait());
  EXPECT_TRUE(secondWritten->Wait());
  EXPECT_TRUE(secondRead->Wait());
  EXPECT_EQ(log.Get(), "WWR");
  EXPECT_EQ(lock.GetReaderCount(), 0);
  EXPECT_EQ(lock.GetWriterCount(), 0);
  EXPECT_EQ(lock.GetWaitingReaderCount(), 0);
}

// Releasing what the thread does not hold changes nothing and is reported.
template <class TLock>
void CheckUnheldReleasesAreIgnored() {
  krtest::CDebugRecorder recorder;
  TLock lock;
  CActor reader, writer, lateReader;
  ASSERT_TRUE(reader.Do([&] { lock.AcquireReaderLock(); }));
  // This thread holds nothing.
  lock.ReleaseReaderLock();
  lock.ReleaseWriterLock();
  EXPECT_EQ(lock.GetReaderCount(), 1);
  EXPECT_EQ(lock.GetWriterCount(), 0);
  ASSERT_EQ(recorder.Texts().size(), 2u);
  EXPECT_NE(recorder.Texts()[0].find(L"ReleaseReaderLock"), std::wstring::npos);
  EXPECT_NE(recorder.Texts()[1].find(L"ReleaseWriterLock"), std::wstring::npos);

  // Had the count dropped, this writer would get in while the reader reads.
  std::atomic<bool> written{false};
  const auto writing = writer.Post([&] {
    lock.AcquireWriterLock();
    written = true;
  });
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWriterCount() == 1; }));
  lock.ReleaseReaderLock();
  EXPECT_FALSE(written.load());
  ASSERT_TRUE(reader.Do([&] { lock.ReleaseReaderLock(); }));
  ASSERT_TRUE(writing->Wait());

  // A thread that does not hold the write lock cannot release it for the
  // writer.
  ASSERT_TRUE(reader.Do([&] { lock.ReleaseWriterLock(); }));
  std::atomic<bool> read{false};
  const auto reading = lateReader.Post([&] {
    lock.AcquireReaderLock();
    read = true;
    lock.ReleaseReaderLock();
  });
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWaitingReaderCount() == 1; }));
  EXPECT_FALSE(read.load());
  ASSERT_TRUE(writer.Do([&] { lock.ReleaseWriterLock(); }));
  ASSERT_TRUE(reading->Wait());
  EXPECT_EQ(recorder.Texts().size(), 4u);
  EXPECT_EQ(lock.GetReaderCount(), 0);
  EXPECT_EQ(lock.GetWriterCount(), 0);
}

// Killing a thread that waits for the lock leaves the lock as if it had
// never asked: the next thread gets the lock as soon as it is free.
template <class TLock>
void CheckKilledWaitersLeaveTheLockConsistent() {
  TLock lock;
  CActor holder;
  ASSERT_TRUE(holder.Do([&] { lock.AcquireReaderLock(); }));
  krtest::CFunctionThread writer([&](krtest::CFunctionThread&) -> unsigned long {
    lock.AcquireWriterLock();
    return 1;
  });
  writer.Start();
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWriterCount() == 1; }));
  writer.Kill(7);
  EXPECT_EQ(writer.GetExitCode(), 7u);
  EXPECT_EQ(lock.GetWriterCount(), 0);
  EXPECT_EQ(lock.GetReaderCount(), 1);
  // New readers are not held up by the writer that is gone.
  CActor another;
  ASSERT_TRUE(another.Do([&] {
    lock.AcquireReaderLock();
    lock.ReleaseReaderLock();
  }));
  ASSERT_TRUE(holder.Do([&] {
    lock.ReleaseReaderLock();
    lock.AcquireWriterLock();
  }));

  krtest::CFunctionThread reader([&](krtest::CFunctionThread&) -> unsigned long {
    lock.AcquireReaderLock();
    return 1;
  });
  reader.Start();
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWaitingReaderCount() == 1; }));
  reader.Kill(8);
  EXPECT_EQ(lock.GetWaitingReaderCount(), 0);
  ASSERT_TRUE(holder.Do([&] { lock.ReleaseWriterLock(); }));
  ASSERT_TRUE(another.Do([&] {
    lock.AcquireWriterLock();
    lock.ReleaseWriterLock();
  }));
  EXPECT_EQ(lock.GetReaderCount(), 0);
  EXPECT_EQ(lock.GetWriterCount(), 0);
}

// Two fields a writer changes one after the other: a reader that ever sees
// them differ has seen a torn update.
struct SPair {
  long long m_First = 0;
  long long m_Second = 0;
};

struct SStressResult {
  std::atomic<int> m_Torn{0};
  std::atomic<int> m_Overlaps{0};
  std::atomic<int> m_ReadersInside{0};
  std::atomic<int> m_WritersInside{0};
};

// Checks exclusion on entry into a read or write section.
void EnterRead(SStressResult& result) {
  result.m_ReadersInside.fetch_add(1);
  if (result.m_WritersInside.load() != 0)
    result.m_Overlaps.fetch_add(1);
}
void LeaveRead(SStressResult& result) {
  result.m_ReadersInside.fetch_sub(1);
}
void EnterWrite(SStressResult& result) {
  if (result.m_WritersInside.fetch_add(1) != 0 || result.m_ReadersInside.load() != 0)
    result.m_Overlaps.fetch_add(1);
}
void LeaveWrite(SStressResult& result) {
  result.m_WritersInside.fetch_sub(1);
}

void ReadPair(const SPair& pair, SStressResult& result) {
  if (pair.m_First != pair.m_Second)
    result.m_Torn.fetch_add(1);
}

void WritePair(SPair& pair, long long value) {
  pair.m_First = value;
  pair.m_Second = value;
}

}  // namespace

TEST(CReaderWriterLockNonReentrance, PrefersWriters) {
  CheckWriterPreference<CReaderWriterLockNonReentrance>();
}

TEST(CKRReaderWriterLock, PrefersWriters) {
  CheckWriterPreference<CKRReaderWriterLock>();
}

TEST(CReaderWriterLockNonReentrance, IgnoresReleasesByThreadsThatHoldNothing) {
  CheckUnheldReleasesAreIgnored<CReaderWriterLockNonReentrance>();
}

TEST(CKRReaderWriterLock, IgnoresReleasesByThreadsThatHoldNothing) {
  CheckUnheldReleasesAreIgnored<CKRReaderWriterLock>();
  // A writer's own read holds are counted apart from its write holds.
  krtest::CDebugRecorder recorder;
  CKRReaderWriterLock lock;
  lock.AcquireWriterLock();
  lock.ReleaseReaderLock();
  EXPECT_EQ(recorder.Texts().size(), 1u);
  EXPECT_EQ(lock.GetWriterCount(), 1);
  lock.ReleaseWriterLock();
  EXPECT_EQ(lock.GetWriterCount(), 0);
}

TEST(CReaderWriterLockNonReentrance, KilledWaitersLeaveTheLockConsistent) {
  CheckKilledWaitersLeaveTheLockConsistent<CReaderWriterLockNonReentrance>();
}

TEST(CKRReaderWriterLock, KilledWaitersLeaveTheLockConsistent) {
  CheckKilledWaitersLeaveTheLockConsistent<CKRReaderWriterLock>();

  // Killed while upgrading: its read access was given up, so only the
  // other reader is left.
  CKRReaderWriterLock lock;
  CActor other;
  ASSERT_TRUE(other.Do([&] { lock.AcquireReaderLock(); }));
  krtest::CFunctionThread upgrader([&](krtest::CFunctionThread&) -> unsigned long {
    lock.AcquireReaderLock();
    lock.AcquireWriterLock();
    return 1;
  });
  upgrader.Start();
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWriterCount() == 1; }));
  upgrader.Kill(2);
  EXPECT_EQ(lock.GetWriterCount(), 0);
  EXPECT_EQ(lock.GetReaderCount(), 1);
  ASSERT_TRUE(other.Do([&] {
    lock.ReleaseReaderLock();
    lock.AcquireWriterLock();
    lock.ReleaseWriterLock();
  }));
}

TEST(CKRReaderWriterLock, ARecursiveReaderDoesNotWaitForAWaitingWriter) {
  CKRReaderWriterLock lock;
  CActor reader, writer;
  ASSERT_TRUE(reader.Do([&] { lock.AcquireReaderLock(); }));
  std::atomic<bool> written{false};
  const auto writing = writer.Post([&] {
    lock.AcquireWriterLock();
    written = true;
    lock.ReleaseWriterLock();
  });
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWriterCount() == 1; }));
  // The non-reentrant lock would wait here for the writer, which waits for
  // this reader.
  ASSERT_TRUE(reader.Do([&] { lock.AcquireReaderLock(); }));
  EXPECT_EQ(lock.GetReaderCount(), 1);
  ASSERT_TRUE(reader.Do([&] { lock.ReleaseReaderLock(); }));
  EXPECT_FALSE(written.load());
  ASSERT_TRUE(reader.Do([&] { lock.ReleaseReaderLock(); }));
  EXPECT_TRUE(writing->Wait());
  EXPECT_TRUE(written.load());
}

TEST(CKRReaderWriterLock, UpgradesAfterOtherReadersLeaveAndDowngradesToReading) {
  CKRReaderWriterLock lock;
  CActor upgrader, otherReader, lateReader, lateWriter;
  ASSERT_TRUE(upgrader.Do([&] { lock.AcquireReaderLock(); }));
  ASSERT_TRUE(otherReader.Do([&] { lock.AcquireReaderLock(); }));
  EXPECT_EQ(lock.GetReaderCount(), 2);

  std::atomic<bool> writing{false};
  const auto upgraded = upgrader.Post([&] {
    lock.AcquireWriterLock();
    writing = true;
  });
  // The upgrader gave up its read access and waits as a writer.
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWriterCount() == 1; }));
  EXPECT_EQ(lock.GetReaderCount(), 1);
  EXPECT_FALSE(writing.load());
  ASSERT_TRUE(otherReader.Do([&] { lock.ReleaseReaderLock(); }));
  ASSERT_TRUE(upgraded->Wait());
  EXPECT_EQ(lock.GetReaderCount(), 0);

  // Writers may nest and read.
  ASSERT_TRUE(upgrader.Do([&] {
    lock.AcquireWriterLock();
    lock.AcquireReaderLock();
    lock.ReleaseWriterLock();
    lock.ReleaseReaderLock();
  }));
  EXPECT_EQ(lock.GetWriterCount(), 1);

  std::atomic<bool> lateRead{false};
  const auto reading = lateReader.Post([&] {
    lock.AcquireReaderLock();
    lateRead = true;
  });
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWaitingReaderCount() == 1; }));
  // Downgrade: the upgrader still reads, and the waiting reader joins it.
  ASSERT_TRUE(upgrader.Do([&] { lock.ReleaseWriterLock(); }));
  ASSERT_TRUE(reading->Wait());
  EXPECT_EQ(lock.GetReaderCount(), 2);
  EXPECT_EQ(lock.GetWriterCount(), 0);

  std::atomic<bool> lateWritten{false};
  const auto lateWriting = lateWriter.Post([&] {
    lock.AcquireWriterLock();
    lateWritten = true;
    lock.ReleaseWriterLock();
  });
  ASSERT_TRUE(WaitUntil([&] { return lock.GetWriterCount() == 1; }));
  ASSERT_TRUE(upgrader.Do([&] { lock.ReleaseReaderLock(); }));
  EXPECT_FALSE(lateWritten.load()) << "the late reader still reads";
  ASSERT_TRUE(lateReader.Do([&] { lock.ReleaseReaderLock(); }));
  ASSERT_TRUE(lateWriting->Wait());
  EXPECT_EQ(lock.GetReaderCount(), 0);
  EXPECT_EQ(lock.GetWriterCount(), 0);
}

TEST(CReaderWriterLockNonReentrance, ReadersAndWritersNeverSeeATornUpdate) {
  constexpr int kRounds = 20000;
  CReaderWriterLockNonReentrance lock;
  SPair pair;
  SStressResult result;
  std::vector<std::thread> threads;
  std::latch together(4);
  for (int t = 0; t < 4; ++t) {
    const bool writes = (t % 2) == 0;
    threads.emplace_back([&, t, writes] {
      std::mt19937 random(KRTestSeed() + static_cast<unsigned>(t));
      together.arrive_and_wait();
      for (int i = 0; i < kRounds; ++i) {
        // Writers also read now and then, readers mostly read.
        if (writes && random() % 4 != 0) {
          lock.AcquireWriterLock();
          EnterWrite(result);
          WritePair(pair, static_cast<long long>(t) * kRounds + i);
          LeaveWrite(result);
          lock.ReleaseWriterLock();
        } else {
          lock.AcquireReaderLock();
          EnterRead(result);
          ReadPair(pair, result);
          LeaveRead(result);
          lock.ReleaseReaderLock();
        }
      }
    });
  }
  for (std::thread& thread : threads)
    thread.join();
  EXPECT_EQ(result.m_Torn.load(), 0);
  EXPECT_EQ(result.m_Overlaps.load(), 0);
  EXPECT_EQ(lock.GetReaderCount(), 0);
  EXPECT_EQ(lock.GetWriterCount(), 0);
}

TEST(CKRReaderWriterLock, ReadersAndWritersNeverSeeATornUpdate) {
  constexpr int kRounds = 20000;
  CKRReaderWriterLock lock;
  SPair pair;
  SStressResult result;
  std::vector<std::thread> threads;
  std::latch together(4);
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&, t] {
      std::mt19937 random(KRTestSeed() + 100u + static_cast<unsigned>(t));
      together.arrive_and_wait();
      for (int i = 0; i < kRounds; ++i) {
        const long long value = static_cast<long long>(t) * kRounds + i;
        switch (random() % 5) {
          case 0:   // nested reads
            lock.AcquireReaderLock();
            lock.AcquireReaderLock();
            EnterRead(result);
            ReadPair(pair, result);
            LeaveRead(result);
            lock.ReleaseReaderLock();
            lock.ReleaseReaderLock();
            break;
          case 1:   // read, upgrade, write, downgrade, read
            lock.AcquireReaderLock();
            EnterRead(result);
            ReadPair(pair, result);
            LeaveRead(result);
            lock.AcquireWriterLock();
            EnterWrite(result);
            WritePair(pair, value);
            LeaveWrite(result);
            lock.ReleaseWriterLock();
            EnterRead(result);
            ReadPair(pair, result);
            LeaveRead(result);
            lock.ReleaseReaderLock();
            break;
          case 2:   // nested writes with a read inside, released out of order
            lock.AcquireWriterLock();
            lock.AcquireWriterLock();
            lock.AcquireReaderLock();
            EnterWrite(result);
            WritePair(pair, value);
            LeaveWrite(result);
            lock.ReleaseWriterLock();
            lock.ReleaseReaderLock();
            lock.ReleaseWriterLock();
            break;
          default:
            lock.AcquireReaderLock();
            EnterRead(result);
            ReadPair(pair, result);
            LeaveRead(result);
            lock.ReleaseReaderLock();
            break;
        }
      }
    });
  }
  for (std::thread& thread : threads)
    thread.join();
  EXPECT_EQ(result.m_Torn.load(), 0);
  EXPECT_EQ(result.m_Overlaps.load(), 0);
  EXPECT_EQ(lock.GetReaderCount(), 0);
  EXPECT_EQ(lock.GetWriterCount(), 0);
}

TEST(CKRReaderWriterLock, AThreadMayHoldManyLocksAtOnce) {
  // More locks than a thread's record keeps without allocating, taken in
  // every mode and released in random order.
  constexpr int kLocks = 40;
  std::vector<CKRReaderWriterLock> recursive(kLocks);
  std::vector<CReaderWriterLockNonReentrance> plain(kLocks);
  std::vector<int> order;
  for (int i = 0; i < kLocks; ++i) {
    recursive[i].AcquireReaderLock();
    if (i % 3 == 0)
      recursive[i].AcquireWriterLock();   // upgrade
    if (i % 2 == 0)
      plain[i].AcquireWriterLock();
    else
      plain[i].AcquireReaderLock();
    order.push_back(i);
  }
  std::mt19937 random(KRTestSeed());
  std::shuffle(order.begin(), order.end(), random);
  krtest::CDebugRecorder recorder;
  for (int i : order) {
    SCOPED_TRACE(i);
    EXPECT_EQ(recursive[i].GetWriterCount(), i % 3 == 0 ? 1 : 0);
    if (i % 3 == 0)
      recursive[i].ReleaseWriterLock();
    EXPECT_EQ(recursive[i].GetReaderCount(), 1);
    recursive[i].ReleaseReaderLock();
    if (i % 2 == 0)
      plain[i].ReleaseWriterLock();
    else
      plain[i].ReleaseReaderLock();
    EXPECT_EQ(recursive[i].GetReaderCount() + recursive[i].GetWriterCount(), 0);
    EXPECT_EQ(plain[i].GetReaderCount() + plain[i].GetWriterCount(), 0);
  }
  EXPECT_TRUE(recorder.Texts().empty());
  // Everything was given back: one more release is refused.
  recursive[0].ReleaseReaderLock();
  plain[1].ReleaseReaderLock();
  EXPECT_EQ(recorder.Texts().size(), 2u);
}
