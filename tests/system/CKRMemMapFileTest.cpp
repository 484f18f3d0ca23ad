#include <krCoreLib/system/CKRMemMapFile.h>

#include "KRFilesScratch.h"

namespace {

// Whether a mapping of `name` made on another thread opens at once.
bool OtherThreadOpens(const CKRString& name, std::size_t size, bool readOnly) {
  bool opened = false;
  std::thread([&] {
    CKRMemMapFile map;
    opened = map.MapExistingMemory(name.GetString(), size, readOnly) == 1 && map.Open(0) != nullptr;
  }).join();
  return opened;
}

void ExpectEmpty(CKRMemMapFile& map) {
  EXPECT_EQ(map.GetView(), nullptr);
  EXPECT_FALSE(map.IsOpen());
  EXPECT_TRUE(map.GetName().IsEmpty());
  EXPECT_EQ(map.GetSize(), 0u);
  EXPECT_EQ(map.Open(0), nullptr);
}

}  // namespace

TEST(CKRMemMapFile, FileMappingsWriteThroughKeepTheSizeAndRefuseBadFiles) {
  EXPECT_EQ(CKRMemMapFile::MakeMappingName(L"/home/u\\Doc.txt"), L"_HOME_U_DOC.TXT");
  CKRFilesScratch scratch;
  scratch.WriteFile("data.bin", "hello, world");
  const CKRString path = scratch.Wide("data.bin");
  CKRMemMapFile map;
  ASSERT_EQ(map.MapFile(path.GetString(), false), 1);
  EXPECT_EQ(map.GetSize(), 12u);
  EXPECT_EQ(map.GetName(), CKRMemMapFile::MakeMappingName(path.GetString()));
  auto* view = static_cast<char*>(map.Open());
  ASSERT_NE(view, nullptr);
  EXPECT_EQ(map.Open(0), view) << "opening again returns the view";
  std::memcpy(view, "HELLO", 5);
  map.Close();
  EXPECT_EQ(map.Flush(), 1);
  EXPECT_EQ(KRLoadText(path), "HELLO, world");
  map.UnMap();
  ExpectEmpty(map);
  EXPECT_EQ(map.Flush(), 0);

  // A descriptor the caller keeps; one opened for reading gives no writable
  // mapping.
  const int fd = ::open(scratch.Native("data.bin").c_str(), O_RDONLY | O_CLOEXEC);
  EXPECT_EQ(map.MapHandle(fd, false), 0);
  ASSERT_EQ(map.MapHandle(fd, true), 1);
  map.UnMap();
  char first = 0;
  EXPECT_EQ(::pread(fd, &first, 1, 0), 1) << "still open";
  ::close(fd);

  // A terminator follows the data but never reaches the file; at a page's
  // end it needs a page of its own.
  for (const std::size_t size : {std::size_t(10), std::size_t(4096), std::size_t(8190)}) {
    for (const bool readOnly : {false, true}) {
      SCOPED_TRACE(testing::Message() << size << (readOnly ? " read-only" : " read-write"));
      const std::string content(size, 'x');
      scratch.WriteFile("text", content);
      ASSERT_EQ(map.MapFile(scratch.Wide("text").GetString(), readOnly, 0, true), 1);
      const auto* text = static_cast<const unsigned char*>(map.Open(1000));
      ASSERT_NE(text, nullptr);
      EXPECT_EQ(map.GetSize(), size);
      EXPECT_EQ(text[size - 1], 'x');
      EXPECT_EQ(text[size] | text[size + 1], 0);
      map.UnMap();
      EXPECT_EQ(KRLoadText(scratch.Wide("text")), content) << "the file keeps its size";
    }
  }

  // Bad files are refused with nothing held.
  scratch.WriteFile("empty", "");
  scratch.MakeSparse("huge", off_t(1) << 32);
  std::vector<std::pair<const char*, CKRString>> cases = KRBadPaths(scratch);
  cases.push_back({"empty file", scratch.Wide("empty")});
  cases.push_back({"device", CKRString(L"/dev/zero")});
  cases.push_back({"4 GiB", scratch.Wide("huge")});
  const int descriptors = KROpenDescriptorCount();
  for (const auto& [what, bad] : cases) {
    SCOPED_TRACE(what);
    for (const bool readOnly : {true, false}) {
      // Each attempt first lets go of a good mapping.
      ASSERT_EQ(map.MapFile(path.GetString(), readOnly), 1);
      EXPECT_EQ(map.MapFile(bad.GetString(), readOnly, 0, true), 0);
      ExpectEmpty(map);
    }
  }
  EXPECT_EQ(map.MapFile(nullptr), 0);
  EXPECT_EQ(map.MapHandle(-1), 0);
  EXPECT_EQ(KROpenDescriptorCount(), descriptors) << "no descriptor is left open";
}

TEST(CKRMemMapFile, NamedMemoryIsSharedAcrossThreadsAndProcessesWhileMapped) {
  const CKRString name = KRUniqueName(L"a/b\\c");
  CKRMemMapFile first, second;
  ASSERT_EQ(first.MapMemory(name.GetString(), 100), 1);
  auto* view = static_cast<char*>(first.Open());
  ASSERT_NE(view, nullptr);
  EXPECT_EQ(std::string(view, 100), std::string(100, '\0')) << "new memory starts as zeros";
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

  // A mapping named like the lock of another meets no lock: it starts as
  // zeros, and writing it leaves the lock of `name` working.
  CKRMemMapFile lockLike;
  ASSERT_EQ(lockLike.MapMemory((name + L"MUTEX").GetString(), 32), 1);
  auto* bytes = static_cast<unsigned char*>(lockLike.Open());
  ASSERT_NE(bytes, nullptr);
  EXPECT_EQ(std::count(bytes, bytes + 32, 0), 32);
  std::memset(bytes, 0xFF, 32);
  lockLike.Close();
  ASSERT_NE(first.Open(0), nullptr);
  EXPECT_FALSE(OtherThreadOpens(name, 100, false)) << "the lock still excludes";
  EXPECT_TRUE(OtherThreadOpens(name, 100, true)) << "a read-only view never waits for the lock";
  first.Close();
  EXPECT_TRUE(OtherThreadOpens(name, 100, false)) << "released by Close";

  first.UnMap();   // gone with its last user
  second.UnMap();
  EXPECT_EQ(second.MapExistingMemory(name.GetString(), 100), 0);

  // A name too long for the system's namespace is shortened alike.
  const CKRString longName = KRUniqueName(L"long") + CKRString(1000, L'n');
  ASSERT_EQ(first.MapMemory(longName.GetString(), 8), 1);
  std::memcpy(first.Open(), "long", 5);
  first.Close();
  ASSERT_EQ(second.MapExistingMemory(longName.GetString(), 8, true), 1);
  EXPECT_STREQ(static_cast<const char*>(second.Open()), "long");

  // Names without an exact UTF-8 form would meet after conversion.
  CKRMemMapFile bad;
  for (const wchar_t invalid : {wchar_t(0xD800), wchar_t(0xDBFF), wchar_t(0x110000)})
    EXPECT_EQ(bad.MapMemory((KRUniqueName(L"invalid") + invalid).GetString(), 8), 0);
  EXPECT_EQ(bad.MapMemory(L"", 8), 0);
  EXPECT_EQ(bad.MapMemory(name.GetString(), 0), 0);
  EXPECT_EQ(bad.MapExistingMemory(KRUniqueName(L"never made").GetString(), 8), 0);
  ExpectEmpty(bad);

  // Two processes share named memory under the lock.
  const CKRString between = KRUniqueName(L"processes");
  CKRMemMapFile parent;
  ASSERT_EQ(parent.MapMemory(between.GetString(), 64), 1);
  auto* text = static_cast<char*>(parent.Open());
  ASSERT_NE(text, nullptr);
  std::strcpy(text, "from the parent");
  int turns[2];
  ASSERT_EQ(::pipe(turns), 0);
  const pid_t child = KRStartChild([&] {
    CKRMemMapFile mine;
    if (mine.MapExistingMemory(between.GetString(), 64) != 1)
      return 1;
    if (mine.Open(0) != nullptr || ::write(turns[1], "!", 1) != 1)
      return 2;   // the parent holds the lock
    auto* shared = static_cast<char*>(mine.Open(-1));
    if (shared == nullptr || std::strcmp(shared, "from the parent, updated") != 0)
      return 3;
    std::strcpy(shared, "from the child");
    return 0;   // ends holding the lock
  });
  ASSERT_GT(child, 0);
  // The child found the lock taken: finish writing, then let it in.
  char byte = 0;
  const bool childWaits = ::read(turns[0], &byte, 1) == 1;
  std::strcpy(text, "from the parent, updated");
  parent.Close();
  ::close(turns[0]);
  ::close(turns[1]);
  ASSERT_TRUE(childWaits);
  ASSERT_EQ(KRWaitChild(child), 0);
  // The lock of a process that died is taken over.
  EXPECT_STREQ(static_cast<const char*>(parent.Open(0)), "from the child");
  parent.Close();
  EXPECT_NE(parent.Open(0), nullptr) << "and it works as before afterwards";
}

TEST(CKRMemMapFile, MemoryNotTheUsersOwnIsRefusedAndLeftAlone) {
  if (!KRCanActAsAnotherUser())
    GTEST_SKIP() << "needs root to act as a second user";
  const CKRString name = KRUniqueName(L"planted");
  const std::vector<std::string> objects = KRSharedObjectsOf(name);   // the block and its lock
  ASSERT_EQ(objects.size(), 2u);
  CKRMemMapFile victim;
  {
    // Another user plants both, open to everyone, and keeps them in use.
    CKRPlantedObjects planted(objects);
    ASSERT_TRUE(planted.IsPlanted());
    EXPECT_EQ(victim.MapMemory(name.GetString(), 64), 0);
    EXPECT_EQ(victim.MapExistingMemory(name.GetString(), 64), 0);
    EXPECT_EQ(victim.MapExistingMemory(name.GetString(), 64, true), 0);
    for (const std::string& object : objects) {
      struct stat info {};
      EXPECT_EQ(::stat(object.c_str(), &info), 0) << object << " is left alone";
      EXPECT_EQ(info.st_uid, kKRAnotherUser);
    }
  }

  // The user's own block, opened up to others, is refused as well.
  const int fd = ::open(objects[0].c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, 0600);
  ASSERT_GE(fd, 0);
  EXPECT_EQ(::fchmod(fd, 0644) | ::ftruncate(fd, 4096) | ::flock(fd, LOCK_SH), 0);
  EXPECT_EQ(victim.MapExistingMemory(name.GetString(), 64, true) + victim.MapMemory(name.GetString(), 64), 0);
  ::close(fd);
  ::unlink(objects[0].c_str());
}
