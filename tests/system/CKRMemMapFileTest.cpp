#include <krCoreLib/system/CKRMemMapFile.h>

#include <krCoreLib/system/CKRSystem.h>

#include "KRFilesScratch.h"
#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <thread>

namespace {

// A name no other test process uses at the same time.
CKRString UniqueName(const wchar_t* what) {
  return CKRString::Formatted(L"krFilesTest-%s-%d-%u", what, int(::getpid()), KRTestSeed());
}

std::string LoadText(const CKRString& path) {
  unsigned char* buffer = nullptr;
  std::size_t size = 0;
  if (!CKRSystem::Load(path.GetString(), buffer, size))
    return "<unreadable>";
  std::string text(reinterpret_cast<char*>(buffer), size);
  delete[] buffer;
  return text;
}

void ExpectEmpty(const CKRMemMapFile& map) {
  EXPECT_EQ(map.GetView(), nullptr);
  EXPECT_FALSE(map.IsOpen());
  EXPECT_TRUE(map.IsReadOnly());
  EXPECT_TRUE(map.GetName().IsEmpty());
  EXPECT_EQ(map.GetSize(), 0u);
}

// One byte through a pipe: how the two processes of a test take turns.
void Signal(int fd) {
  const char byte = 1;
  ASSERT_EQ(::write(fd, &byte, 1), 1);
}
bool AwaitSignal(int fd) {
  char byte = 0;
  return ::read(fd, &byte, 1) == 1;
}

}  // namespace

TEST(CKRMemMapFile, MappingNamesReplaceSeparatorsAndUseUpperCase) {
  EXPECT_EQ(CKRMemMapFile::MakeMappingName(L"/home/u\\Doc.txt"), L"_HOME_U_DOC.TXT");
  EXPECT_EQ(CKRMemMapFile::MakeMappingName(L"MyApp"), L"MYAPP");
  EXPECT_EQ(CKRMemMapFile::MakeMappingName(nullptr), L"");
}

TEST(CKRMemMapFile, WritesThroughAFileMappingReachTheFile) {
  CKRFilesScratch scratch;
  ASSERT_TRUE(scratch.IsValid());
  scratch.WriteFile("data.bin", "hello, world");
  const CKRString path = scratch.Wide("data.bin");

  CKRMemMapFile map;
  ASSERT_EQ(map.MapFile(path.GetString(), false), 1);
  EXPECT_EQ(map.GetSize(), 12u);
  EXPECT_EQ(map.GetName(), CKRMemMapFile::MakeMappingName(path.GetString()));
  EXPECT_FALSE(map.IsReadOnly());
  auto* view = static_cast<char*>(map.Open());
  ASSERT_NE(view, nullptr);
  EXPECT_TRUE(map.IsOpen());
  EXPECT_EQ(map.Open(0), view) << "opening again returns the view";
  std::memcpy(view, "HELLO", 5);
  map.Close();
  EXPECT_FALSE(map.IsOpen());
  EXPECT_EQ(map.Flush(), 1);
  EXPECT_EQ(LoadText(path), "HELLO, world");
  map.UnMap();
  ExpectEmpty(map);
  EXPECT_EQ(map.Open(), nullptr);
  EXPECT_EQ(map.Flush(), 0);

  // Unnamed, read-only.
  ASSERT_EQ(map.MapFile(path.GetString(), true, 0, false, false), 1);
  EXPECT_TRUE(map.GetName().IsEmpty());
  EXPECT_EQ(std::string(static_cast<const char*>(map.Open(0)), 12), "HELLO, world");
}

TEST(CKRMemMapFile, TerminatorFollowsTheDataButNeverReachesTheFile) {
  CKRFilesScratch scratch;
  ASSERT_TRUE(scratch.IsValid());
  // Sizes inside a page and exactly a page: the terminator then needs a
  // page of its own.
  for (const std::size_t size : {std::size_t(10), std::size_t(4096), std::size_t(8190)}) {
    for (const bool readOnly : {false, true}) {
      SCOPED_TRACE(testing::Message() << size << (readOnly ? " read-only" : " read-write"));
      const std::string content(size, 'x');
      scratch.WriteFile("text", content);
      const CKRString path = scratch.Wide("text");
      CKRMemMapFile map;
      ASSERT_EQ(map.MapFile(path.GetString(), readOnly, 0, true), 1);
      const auto* view = static_cast<const unsigned char*>(map.Open(1000));
      ASSERT_NE(view, nullptr);
      EXPECT_EQ(map.GetSize(), size);
      EXPECT_EQ(view[size - 1], 'x');
      EXPECT_EQ(view[size], 0);
      EXPECT_EQ(view[size + 1], 0);
      map.UnMap();
      EXPECT_EQ(LoadText(path), content) << "the file keeps its size";
    }
  }
}

TEST(CKRMemMapFile, BadFilesAreRefusedWithNothingHeld) {
  CKRFilesScratch scratch;
  ASSERT_TRUE(scratch.IsValid());
  scratch.WriteFile("empty", "");
  scratch.WriteFile("good", "good");
  scratch.MakeFolder("folder");
  scratch.MakePipe("pipe");
  scratch.MakeLink(scratch.Native("gone"), "dangling");
  {
    const int fd = ::open(scratch.Native("huge").c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0644);
    ASSERT_GE(fd, 0);
    ASSERT_EQ(::ftruncate(fd, off_t(1) << 32), 0);  // 4 GiB, sparse
    ::close(fd);
  }
  struct SKRCase {
    const char* m_What;
    CKRString m_Path;
  };
  const SKRCase cases[] = {
      {"missing", scratch.Wide("missing")},
      {"empty file", scratch.Wide("empty")},
      {"directory", scratch.Wide("folder")},
      {"pipe", scratch.Wide("pipe")},
      {"dangling link", scratch.Wide("dangling")},
      {"device", CKRString(L"/dev/zero")},
      {"4 GiB", scratch.Wide("huge")},
      {"empty path", CKRString()},
      {"overlong path", CKRString(L"/") + CKRString(5000, L'p')},
  };
  const int descriptors = KROpenDescriptorCount();
  CKRMemMapFile map;
  for (const SKRCase& c : cases) {
    SCOPED_TRACE(c.m_What);
    for (const bool readOnly : {true, false}) {
      // Each attempt first lets go of a good mapping.
      ASSERT_EQ(map.MapFile(scratch.Wide("good").GetString(), readOnly), 1);
      EXPECT_EQ(map.MapFile(c.m_Path.GetString(), readOnly, 0, true), 0);
      ExpectEmpty(map);
      EXPECT_EQ(map.Open(0), nullptr);
    }
  }
  EXPECT_EQ(map.MapFile(nullptr), 0);
  EXPECT_EQ(map.MapHandle(-1), 0);
  EXPECT_EQ(KROpenDescriptorCount(), descriptors) << "no descriptor is left open";
}

TEST(CKRMemMapFile, MapHandleMapsADuplicateTheCallerKeeps) {
  CKRFilesScratch scratch;
  ASSERT_TRUE(scratch.IsValid());
  scratch.WriteFile("data", "abcd");
  const int fd = ::open(scratch.Native("data").c_str(), O_RDWR | O_CLOEXEC);
  ASSERT_GE(fd, 0);
  {
    CKRMemMapFile map;
    ASSERT_EQ(map.MapHandle(fd, false), 1);
    static_cast<char*>(map.Open())[0] = 'X';
    map.Close();
  }
  EXPECT_EQ(::fcntl(fd, F_GETFD), FD_CLOEXEC) << "still open";
  char first = 0;
  EXPECT_EQ(::pread(fd, &first, 1, 0), 1);
  EXPECT_EQ(first, 'X');
  ::close(fd);

  // A descriptor opened for reading cannot give a writable mapping.
  const int readOnly = ::open(scratch.Native("data").c_str(), O_RDONLY | O_CLOEXEC);
  CKRMemMapFile map;
  EXPECT_EQ(map.MapHandle(readOnly, false), 0);
  ExpectEmpty(map);
  EXPECT_EQ(map.MapHandle(readOnly, true), 1);
  ::close(readOnly);
}

TEST(CKRMemMapFile, NamedMemoryIsSharedAndLivesWhileMapped) {
  const CKRString name = UniqueName(L"a/b\\c");
  CKRMemMapFile first, second;
  ASSERT_EQ(first.MapMemory(name.GetString(), 100), 1);
  auto* view = static_cast<unsigned char*>(first.Open());
  ASSERT_NE(view, nullptr);
  for (int i = 0; i < 100; ++i)
    EXPECT_EQ(view[i], 0) << "new memory starts as zeros";
  std::memcpy(view, "shared", 7);
  first.Close();

  // The same name, spelled with the other separator and in other case.
  CKRString other = name;
  other.Replace(L"/", L"\\");
  other.MakeLower();
  ASSERT_EQ(second.MapExistingMemory(other.GetString(), 100, true), 1);
  EXPECT_STREQ(static_cast<const char*>(second.Open(0)), "shared");
  EXPECT_EQ(second.MapExistingMemory(name.GetString(), 101), 0) << "larger than the block";
  CKRMemMapFile larger;
  EXPECT_EQ(larger.MapMemory(name.GetString(), 200), 0) << "an existing block is not grown";

  // Gone with its last user.
  first.UnMap();
  EXPECT_EQ(second.MapExistingMemory(name.GetString(), 100), 0);
  ASSERT_EQ(first.MapMemory(name.GetString(), 100), 1);
  EXPECT_EQ(static_cast<const char*>(first.Open())[0], 0) << "a fresh block";

  // A name too long for the system's namespace is shortened alike.
  const CKRString longName = UniqueName(L"long") + CKRString(1000, L'n');
  CKRMemMapFile longFirst, longSecond;
  ASSERT_EQ(longFirst.MapMemory(longName.GetString(), 8), 1);
  std::memcpy(longFirst.Open(), "long", 5);
  longFirst.Close();
  ASSERT_EQ(longSecond.MapExistingMemory(longName.GetString(), 8, true), 1);
  EXPECT_STREQ(static_cast<const char*>(longSecond.Open()), "long");

  CKRMemMapFile bad;
  EXPECT_EQ(bad.MapMemory(L"", 8), 0);
  EXPECT_EQ(bad.MapMemory(nullptr, 8), 0);
  EXPECT_EQ(bad.MapMemory(name.GetString(), 0), 0);
  EXPECT_EQ(bad.MapExistingMemory(UniqueName(L"never made").GetString(), 8), 0);
  ExpectEmpty(bad);
}

TEST(CKRMemMapFile, ReadOnlyOpenNeverWaitsForTheLock) {
  const CKRString name = UniqueName(L"lock");
  CKRMemMapFile writer, reader;
  ASSERT_EQ(writer.MapMemory(name.GetString(), 16), 1);
  ASSERT_EQ(reader.MapExistingMemory(name.GetString(), 16, true), 1);
  ASSERT_NE(writer.Open(), nullptr);

  // Another thread's writer must wait; a reader never does.
  bool otherWriterGotIt = true;
  bool otherReaderGotIt = false;
  std::thread other([&] {
    CKRMemMapFile second;
    if (second.MapExistingMemory(name.GetString(), 16) == 1)
      otherWriterGotIt = second.Open(0) != nullptr;
    otherReaderGotIt = reader.Open(0) != nullptr;
  });
  other.join();
  EXPECT_FALSE(otherWriterGotIt);
  EXPECT_TRUE(otherReaderGotIt);
  reader.Close();
  writer.Close();

  std::thread after([&] {
    CKRMemMapFile second;
    otherWriterGotIt = second.MapExistingMemory(name.GetString(), 16) == 1 && second.Open(0) != nullptr;
  });
  after.join();
  EXPECT_TRUE(otherWriterGotIt) << "released by Close";
}

TEST(CKRMemMapFile, TwoProcessesShareNamedMemoryUnderTheLock) {
  const CKRString name = UniqueName(L"processes");
  CKRMemMapFile parent;
  ASSERT_EQ(parent.MapMemory(name.GetString(), 64), 1);
  auto* text = static_cast<char*>(parent.Open());
  ASSERT_NE(text, nullptr);
  std::strcpy(text, "from the parent");

  int turns[2];
  ASSERT_EQ(::pipe(turns), 0);
  const pid_t child = KRStartChild([&] {
    CKRMemMapFile mine;
    if (mine.MapExistingMemory(name.GetString(), 64) != 1)
      return 1;
    if (mine.Open(0) != nullptr)
      return 2;  // the parent holds the lock
    Signal(turns[1]);
    auto* shared = static_cast<char*>(mine.Open(-1));
    if (shared == nullptr)
      return 3;
    if (std::strcmp(shared, "from the parent, updated") != 0)
      return 4;
    std::strcpy(shared, "from the child");
    mine.Close();
    mine.UnMap();
    return 0;
  });
  ASSERT_GT(child, 0);
  // The child found the lock taken: finish writing, then let it in.
  const bool childWaits = AwaitSignal(turns[0]);
  std::strcpy(text, "from the parent, updated");
  parent.Close();
  ::close(turns[0]);
  ::close(turns[1]);
  ASSERT_TRUE(childWaits);
  ASSERT_EQ(KRWaitChild(child), 0);
  EXPECT_STREQ(static_cast<const char*>(parent.Open(0)), "from the child");
  parent.Close();
}

TEST(CKRMemMapFile, LockOfAProcessThatDiedIsTakenOver) {
  const CKRString name = UniqueName(L"abandoned");
  CKRMemMapFile parent;
  ASSERT_EQ(parent.MapMemory(name.GetString(), 8), 1);
  // The child takes the lock and ends without releasing it.
  ASSERT_EQ(KRRunInChild([&] {
              CKRMemMapFile mine;
              return mine.MapExistingMemory(name.GetString(), 8) == 1 && mine.Open(0) != nullptr ? 0 : 1;
            }),
            0);
  EXPECT_NE(parent.Open(0), nullptr);
  parent.Close();
  EXPECT_NE(parent.Open(0), nullptr) << "and it works as before afterwards";
}

TEST(CKRMemMapFile, FileMappingsOfTwoProcessesShareTheirLock) {
  CKRFilesScratch scratch;
  ASSERT_TRUE(scratch.IsValid());
  scratch.WriteFile("shared", "0000");
  const CKRString path = scratch.Wide("shared");
  CKRMemMapFile parent;
  ASSERT_EQ(parent.MapFile(path.GetString()), 1);
  ASSERT_NE(parent.Open(), nullptr);
  EXPECT_EQ(KRRunInChild([&] {
              CKRMemMapFile mine;
              if (mine.MapFile(path.GetString()) != 1)
                return 1;
              return mine.Open(0) == nullptr ? 0 : 2;  // named by the path: the parent holds it
            }),
            0);
  std::memcpy(parent.GetView(), "1111", 4);
  parent.Close();
  EXPECT_EQ(KRRunInChild([&] {
              CKRMemMapFile mine;
              if (mine.MapFile(path.GetString()) != 1)
                return 1;
              auto* view = static_cast<char*>(mine.Open(0));
              if (view == nullptr || std::memcmp(view, "1111", 4) != 0)
                return 2;
              std::memcpy(view, "2222", 4);
              mine.Close();
              return 0;
            }),
            0);
  EXPECT_EQ(std::memcmp(parent.GetView(), "2222", 4), 0) << "one file, one memory";
}
