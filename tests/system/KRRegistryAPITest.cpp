// The registry store: typed values round trip, names fold case, listings
// keep their order, and the store survives other processes, threads, a
// killed writer and damaged files. Every test gets a fresh store in its own
// scratch folder through KR_REGISTRY_DIR.
#include <krCoreLib/platform/KRRegistryAPI.h>

#include "KRFilesScratch.h"

#include <sqlite3.h>

#include <chrono>
#include <csignal>
#include <optional>

namespace {

class CKRRegistryScratch : public ::testing::Test {
protected:
  // The store makes its folder itself.
  void SetUp() override { ::setenv("KR_REGISTRY_DIR", Path("").c_str(), 1); }
  void TearDown() override { ::unsetenv("KR_REGISTRY_DIR"); }

  HKEY Create(const wchar_t* path, std::uint32_t options = KRREG_OPTION_NON_VOLATILE) {
    HKEY key = nullptr;
    EXPECT_EQ(KRRegCreateKeyEx(HKEY_CURRENT_USER, path, options, KRKEY_ALL_ACCESS, &key, nullptr), KRERROR_SUCCESS);
    return key;
  }
  std::string Path(const std::string& name) const { return m_Scratch.Native(name.empty() ? "reg" : "reg/" + name); }

  CKRFilesScratch m_Scratch;
};

long Put(HKEY key, const wchar_t* name, std::uint32_t type, const std::string& bytes) {
  return KRRegSetValueEx(key, name, type, reinterpret_cast<const std::uint8_t*>(bytes.data()),
                         std::uint32_t(bytes.size()));
}

// The value's bytes (and type), sized first; nullopt when it cannot be read.
std::optional<std::string> Get(HKEY key, const wchar_t* name, std::uint32_t* type = nullptr) {
  std::uint32_t size = 0;
  if (KRRegQueryValueEx(key, name, nullptr, nullptr, &size) != KRERROR_SUCCESS)
    return std::nullopt;
  std::string bytes(size, '\0');
  if (KRRegQueryValueEx(key, name, type, reinterpret_cast<std::uint8_t*>(bytes.data()), &size) != KRERROR_SUCCESS)
    return std::nullopt;
  return bytes;
}

std::vector<std::wstring> SubKeys(HKEY key) {
  std::vector<std::wstring> names;
  wchar_t name[256];
  for (std::uint32_t length = 256; KRRegEnumKeyEx(key, std::uint32_t(names.size()), name, &length) == 0; length = 256)
    names.emplace_back(name, length);
  return names;
}

std::vector<std::wstring> ValueNames(HKEY key) {
  std::vector<std::wstring> names;
  wchar_t name[256];
  for (std::uint32_t length = 256;
       KRRegEnumValue(key, std::uint32_t(names.size()), name, &length, nullptr, nullptr, nullptr) == 0; length = 256)
    names.emplace_back(name, length);
  return names;
}

std::wstring Numbered(const char* prefix, int i) {
  std::string text = prefix + std::to_string(i);
  return std::wstring(text.begin(), text.end());
}

// Helpers run in a second process (exec'd, so that it opens the store on
// its own). They read their instructions from the environment.
int EnvNumber(const char* name) {
  const char* text = std::getenv(name);
  return text != nullptr ? std::atoi(text) : 0;
}

}  // namespace

TEST_F(CKRRegistryScratch, ValuesRoundTripEveryType) {
  HKEY key = Create(L"Software\\Types");
  const std::string big(std::size_t(1) << 20, 'x');  // the largest value allowed
  const struct {
    const wchar_t* name;
    std::uint32_t type;
    std::string bytes;
  } cases[] = {{L"", KRREG_SZ, std::string("d\0e\0f\0\0\0", 8)},
               {L"none", KRREG_NONE, ""},
               {L"sz", KRREG_SZ, std::string("a\0\0\0", 4)},
               {L"expand", KRREG_EXPAND_SZ, std::string("%\0P\0%\0\0\0", 8)},
               {L"binary", KRREG_BINARY, std::string("\0\1\2\xff", 4)},
               {L"dword", KRREG_DWORD, std::string("\x10\0\0\0", 4)},
               {L"multi", KRREG_MULTI_SZ, std::string("a\0\0\0b\0\0\0\0\0", 10)},
               {L"qword", 11, std::string(8, '\x7f')},
               {L"odd type", 0xFFFFFFFFu, "xyz"},
               {L"largest", KRREG_BINARY, big}};
  for (const auto& item : cases) {
    SCOPED_TRACE(std::string(item.name, item.name + std::wcslen(item.name)));
    ASSERT_EQ(Put(key, item.name, item.type, item.bytes), KRERROR_SUCCESS);
    std::uint32_t type = 0;
    EXPECT_EQ(Get(key, item.name, &type), item.bytes);
    EXPECT_EQ(type, item.type);
  }
  EXPECT_EQ(Get(key, nullptr), cases[0].bytes) << "null names the default value";
  EXPECT_EQ(Put(key, L"too big", KRREG_BINARY, big + 'y'), KRERROR_INVALID_PARAMETER);
  EXPECT_EQ(KRRegSetValueEx(key, L"no data", KRREG_BINARY, nullptr, 4), KRERROR_INVALID_PARAMETER);

  // A short buffer: MORE_DATA, the size, and nothing copied.
  std::uint8_t buffer[3] = {9, 9, 9};
  std::uint32_t size = 2;
  EXPECT_EQ(KRRegQueryValueEx(key, L"binary", nullptr, buffer, &size), KRERROR_MORE_DATA);
  EXPECT_EQ(size, 4u);
  EXPECT_EQ(buffer[0], 9);
  EXPECT_EQ(KRRegQueryValueEx(key, L"missing", nullptr, nullptr, &size), KRERROR_FILE_NOT_FOUND);

  std::uint32_t subKeys = 9, values = 0, longestName = 0, largest = 0;
  EXPECT_EQ(KRRegQueryInfoKey(key, &subKeys, nullptr, &values, &longestName, &largest), KRERROR_SUCCESS);
  EXPECT_EQ(subKeys, 0u);
  EXPECT_EQ(values, std::size(cases));
  EXPECT_EQ(longestName, 8u);
  EXPECT_EQ(largest, big.size());
  EXPECT_EQ(KRRegDeleteValue(key, L"SZ"), KRERROR_SUCCESS);
  EXPECT_EQ(KRRegDeleteValue(key, L"sz"), KRERROR_FILE_NOT_FOUND);
  EXPECT_EQ(KRRegCloseKey(key), KRERROR_SUCCESS);
}

TEST_F(CKRRegistryScratch, NamesFoldCaseAndKeepIt) {
  HKEY key = Create(L"Software\\Alpha\\Beta");
  HKEY same = nullptr;
  std::uint32_t disposition = 0;
  ASSERT_EQ(KRRegCreateKeyEx(HKEY_CURRENT_USER, L"SOFTWARE\\alpha\\BETA", 0, KRKEY_ALL_ACCESS, &same, &disposition),
            KRERROR_SUCCESS);
  EXPECT_EQ(disposition, KRREG_OPENED_EXISTING_KEY);
  HKEY software = Create(L"software");
  EXPECT_EQ(SubKeys(software), std::vector<std::wstring>{L"Alpha"});

  ASSERT_EQ(Put(key, L"Width", KRREG_DWORD, "1234"), 0);
  ASSERT_EQ(Put(same, L"WIDTH", KRREG_DWORD, "5678"), 0);
  ASSERT_EQ(Put(key, L"\u00c4rger", KRREG_SZ, "1"), 0);
  ASSERT_EQ(Put(key, L"\u00e4RGER", KRREG_SZ, "2"), 0);
  EXPECT_EQ(Get(key, L"width"), "5678");
  EXPECT_EQ(Get(key, L"\u00e4rger"), "2");
  EXPECT_EQ(ValueNames(key), (std::vector<std::wstring>{L"Width", L"\u00c4rger"}));

  // Key names: 254 characters are allowed, 255 refused; empty parts too.
  const std::wstring longest(254, L'k');
  HKEY deep = nullptr;
  EXPECT_EQ(KRRegCreateKeyEx(key, longest.c_str(), 0, KRKEY_ALL_ACCESS, &deep, nullptr), KRERROR_SUCCESS);
  EXPECT_EQ(KRRegCloseKey(deep), 0);
  for (const std::wstring& bad : {longest + L"k", std::wstring(L"a\\\\b"), std::wstring(L"a\\")}) {
    EXPECT_EQ(KRRegCreateKeyEx(key, bad.c_str(), 0, KRKEY_ALL_ACCESS, &deep, nullptr), KRERROR_INVALID_PARAMETER);
    EXPECT_EQ(deep, nullptr);
    EXPECT_EQ(KRRegOpenKeyEx(key, bad.c_str(), 0, KRKEY_READ, &deep), KRERROR_INVALID_PARAMETER);
  }
  for (HKEY open : {key, same, software})
    EXPECT_EQ(KRRegCloseKey(open), 0);
}

TEST_F(CKRRegistryScratch, ListingsKeepTheirOrder) {
  HKEY key = Create(L"Software\\Order");
  for (const wchar_t* name : {L"b", L"A", L"c", L"B2", L"a1"})
    EXPECT_EQ(KRRegCloseKey(Create((std::wstring(L"Software\\Order\\") + name).c_str())), 0);
  EXPECT_EQ(SubKeys(key), (std::vector<std::wstring>{L"A", L"a1", L"b", L"B2", L"c"}));

  for (const wchar_t* name : {L"z", L"a", L"m"})
    ASSERT_EQ(Put(key, name, KRREG_SZ, "v"), 0);
  ASSERT_EQ(Put(key, L"A", KRREG_SZ, "w"), 0);  // replaced: keeps its place
  EXPECT_EQ(ValueNames(key), (std::vector<std::wstring>{L"z", L"a", L"m"}));
  ASSERT_EQ(KRRegDeleteValue(key, L"a"), 0);
  ASSERT_EQ(Put(key, L"a", KRREG_SZ, "x"), 0);  // deleted and written again: last
  EXPECT_EQ(ValueNames(key), (std::vector<std::wstring>{L"z", L"m", L"a"}));

  // Random access and short buffers, after and before a sequential walk.
  wchar_t name[4];
  std::uint32_t length = 4;
  EXPECT_EQ(KRRegEnumKeyEx(key, 3, name, &length), 0);
  EXPECT_EQ(std::wstring(name, length), L"B2");
  length = 2;
  EXPECT_EQ(KRRegEnumKeyEx(key, 3, name, &length), KRERROR_MORE_DATA);
  EXPECT_EQ(length, 2u);
  length = 4;
  EXPECT_EQ(KRRegEnumKeyEx(key, 5, name, &length), KRERROR_NO_MORE_ITEMS);
  std::uint8_t data[1];
  std::uint32_t size = 0;
  std::uint32_t type = 0;
  length = 4;
  EXPECT_EQ(KRRegEnumValue(key, 2, name, &length, &type, data, &size), KRERROR_MORE_DATA);
  EXPECT_EQ(std::wstring(name, length), L"a");
  EXPECT_EQ(size, 1u);
  size = 1;
  length = 4;
  EXPECT_EQ(KRRegEnumValue(key, 2, name, &length, &type, data, &size), 0);
  EXPECT_EQ(data[0], 'x');
  length = 4;
  EXPECT_EQ(KRRegEnumValue(key, 0, name, &length, &type, nullptr, nullptr), 0);
  EXPECT_EQ(std::wstring(name, length), L"z");
  length = 4;
  EXPECT_EQ(KRRegEnumValue(key, 3, name, &length, nullptr, nullptr, nullptr), KRERROR_NO_MORE_ITEMS);
  EXPECT_EQ(KRRegCloseKey(key), 0);
}

TEST_F(CKRRegistryScratch, HandlesAndSubtrees) {
  HKEY top = Create(L"Software\\Top");
  HKEY leaf = Create(L"Software\\Top\\Middle\\Leaf");
  ASSERT_EQ(Put(leaf, L"v", KRREG_SZ, "x"), 0);
  HKEY reader = nullptr;
  ASSERT_EQ(KRRegOpenKeyEx(HKEY_CURRENT_USER, L"Software\\Top", 0, KRKEY_READ, &reader), 0);
  EXPECT_EQ(Put(reader, L"v", KRREG_SZ, "x"), KRERROR_ACCESS_DENIED);
  EXPECT_EQ(KRRegDeleteValue(reader, L"v"), KRERROR_ACCESS_DENIED);
  HKEY gone = nullptr;
  EXPECT_EQ(KRRegOpenKeyEx(top, L"Middle\\Missing", 0, KRKEY_READ, &gone), KRERROR_FILE_NOT_FOUND);

  EXPECT_EQ(KRRegDeleteKey(top, L"Middle"), 0);
  EXPECT_EQ(KRRegOpenKeyEx(top, L"Middle\\Leaf", 0, KRKEY_READ, &gone), KRERROR_FILE_NOT_FOUND);
  EXPECT_EQ(Get(leaf, L"v"), std::nullopt);
  EXPECT_EQ(Put(leaf, L"v", KRREG_SZ, "x"), KRERROR_INVALID_HANDLE);
  EXPECT_EQ(KRRegCloseKey(leaf), 0);
  EXPECT_EQ(KRRegCloseKey(leaf), KRERROR_INVALID_HANDLE);
  int notAKey = 0;
  EXPECT_EQ(KRRegCloseKey(reinterpret_cast<HKEY>(&notAKey)), KRERROR_INVALID_HANDLE);
  EXPECT_EQ(Put(reinterpret_cast<HKEY>(&notAKey), L"v", KRREG_SZ, ""), KRERROR_INVALID_HANDLE);
  EXPECT_EQ(KRRegDeleteKey(top, L"Middle"), KRERROR_FILE_NOT_FOUND);

  // A recreated key of the same name is a different key.
  HKEY again = Create(L"Software\\Top\\Middle\\Leaf");
  EXPECT_EQ(Get(again, L"v"), std::nullopt);
  HKEY other = nullptr;
  EXPECT_EQ(KRRegCreateKeyEx(again, L"x", KRREG_OPTION_VOLATILE, KRKEY_ALL_ACCESS, &other, nullptr), 0);
  HKEY below = nullptr;
  EXPECT_EQ(KRRegCreateKeyEx(other, L"y", KRREG_OPTION_NON_VOLATILE, KRKEY_ALL_ACCESS, &below, nullptr),
            KRERROR_CHILD_MUST_BE_VOLATILE);
  for (HKEY open : {top, reader, again, other})
    EXPECT_EQ(KRRegCloseKey(open), 0);

  // Files (with their logs) and folder are the owner's alone.
  struct stat info {};
  for (const char* name : {"registry.db", "registry.db-wal", "registry.db-shm", "krCoreLib-volatile-registry.db"}) {
    ASSERT_EQ(::stat(Path(name).c_str(), &info), 0) << name;
    EXPECT_EQ(info.st_mode & 0777, 0600u) << name;
  }
  ASSERT_EQ(::stat(Path("").c_str(), &info), 0);
  EXPECT_EQ(info.st_mode & 0777, 0700u);
}

TEST(KRRegistryAPI, DISABLED_WriteInChild) {
  // KR_CHILD_MODE 1: create a volatile key with a value; 2: write values
  // KR_CHILD_COUNT values named "<KR_CHILD_PREFIX><i>"; 3: write large values
  // until killed.
  const int mode = EnvNumber("KR_CHILD_MODE");
  HKEY key = nullptr;
  ASSERT_EQ(KRRegCreateKeyEx(HKEY_CURRENT_USER, L"Software\\Shared", mode == 1 ? KRREG_OPTION_VOLATILE : 0,
                             KRKEY_ALL_ACCESS, &key, nullptr),
            0);
  const std::string prefix = std::getenv("KR_CHILD_PREFIX") != nullptr ? std::getenv("KR_CHILD_PREFIX") : "";
  const std::string big(64 * 1024, 'b');
  for (int i = 0; mode == 3 || i < (mode == 1 ? 1 : EnvNumber("KR_CHILD_COUNT")); ++i) {
    const std::wstring name = Numbered(prefix.c_str(), i);
    ASSERT_EQ(Put(key, name.c_str(), KRREG_BINARY, mode == 3 ? big + std::to_string(i) : std::to_string(i)), 0);
  }
  KRRegCloseKey(key);
}

namespace {

pid_t StartHelper(int mode, const char* prefix, int count) {
  ::setenv("KR_CHILD_MODE", std::to_string(mode).c_str(), 1);
  ::setenv("KR_CHILD_PREFIX", prefix, 1);
  ::setenv("KR_CHILD_COUNT", std::to_string(count).c_str(), 1);
  return KRStartChild([] {
    const char* arguments[] = {"/proc/self/exe", "--gtest_also_run_disabled_tests",
                               "--gtest_filter=KRRegistryAPI.DISABLED_WriteInChild", nullptr};
    const int null = ::open("/dev/null", O_WRONLY | O_CLOEXEC);
    ::dup2(null, 1);
    ::execv(arguments[0], const_cast<char* const*>(arguments));
    return 99;
  });
}

}  // namespace

TEST_F(CKRRegistryScratch, VolatileKeysAreSharedAndClearedWithTheirStore) {
  ASSERT_EQ(KRWaitChild(StartHelper(1, "vol", 1)), 0);
  HKEY key = nullptr;
  ASSERT_EQ(KRRegOpenKeyEx(HKEY_CURRENT_USER, L"Software\\Shared", 0, KRKEY_READ, &key), 0);
  EXPECT_EQ(Get(key, L"vol0"), "0");
  // A restart clears the runtime folder.
  for (const char* suffix : {"", "-wal", "-shm"})
    ::unlink(Path((std::string("krCoreLib-volatile-registry.db") + suffix).c_str()).c_str());
  EXPECT_EQ(Get(key, L"vol0"), std::nullopt);
  EXPECT_EQ(KRRegQueryInfoKey(key, nullptr, nullptr, nullptr, nullptr, nullptr), KRERROR_INVALID_HANDLE);
  HKEY gone = nullptr;
  EXPECT_EQ(KRRegOpenKeyEx(HKEY_CURRENT_USER, L"Software\\Shared", 0, KRKEY_READ, &gone), KRERROR_FILE_NOT_FOUND);
  HKEY software = Create(L"Software");
  EXPECT_EQ(SubKeys(software), std::vector<std::wstring>());
  EXPECT_EQ(KRRegCloseKey(key), 0);
  EXPECT_EQ(KRRegCloseKey(software), 0);
}

TEST_F(CKRRegistryScratch, ConcurrentWritersLoseNothing) {
  constexpr int kCount = 150;
  const pid_t first = StartHelper(2, "p", kCount);
  const pid_t second = StartHelper(2, "q", kCount);
  std::vector<std::thread> threads;
  for (const char* prefix : {"s", "t"}) {
    threads.emplace_back([&, prefix] {
      HKEY key = Create(L"Software\\Shared");
      for (int i = 0; i < kCount; ++i)
        EXPECT_EQ(Put(key, Numbered(prefix, i).c_str(), KRREG_BINARY, std::to_string(i)), 0);
      KRRegCloseKey(key);
    });
  }
  for (std::thread& thread : threads)
    thread.join();
  EXPECT_EQ(KRWaitChild(first), 0);
  EXPECT_EQ(KRWaitChild(second), 0);
  HKEY key = Create(L"Software\\Shared");
  std::uint32_t values = 0;
  EXPECT_EQ(KRRegQueryInfoKey(key, nullptr, nullptr, &values, nullptr, nullptr), 0);
  EXPECT_EQ(values, 4u * kCount);
  for (const char* prefix : {"p", "q", "s", "t"})
    for (int i = 0; i < kCount; ++i)
      ASSERT_EQ(Get(key, Numbered(prefix, i).c_str()), std::to_string(i)) << prefix << i;
  EXPECT_EQ(KRRegCloseKey(key), 0);
}

TEST_F(CKRRegistryScratch, ForkedChildUsesAConnectionOfItsOwn) {
  HKEY key = Create(L"Software\\Forked");
  ASSERT_EQ(Put(key, L"parent", KRREG_BINARY, "p"), 0);
  const pid_t child = ::fork();
  ASSERT_GE(child, 0);
  if (child == 0) {
    // The inherited handle belongs to the parent's connection; a new one
    // reads what the parent wrote and writes for it.
    HKEY own = nullptr;
    const bool good = KRRegQueryInfoKey(key, nullptr, nullptr, nullptr, nullptr, nullptr) == KRERROR_INVALID_HANDLE &&
                      KRRegOpenKeyEx(HKEY_CURRENT_USER, L"Software\\Forked", 0, KRKEY_ALL_ACCESS, &own) == 0 &&
                      Get(own, L"parent") == "p" && Put(own, L"child", KRREG_BINARY, "c") == 0;
    ::_exit(good ? 0 : 1);
  }
  EXPECT_EQ(KRWaitChild(child), 0);
  EXPECT_EQ(Get(key, L"child"), "c");
  ASSERT_EQ(Put(key, L"after", KRREG_BINARY, "a"), 0);
  EXPECT_EQ(Get(key, L"after"), "a");
  EXPECT_EQ(KRRegCloseKey(key), 0);
}

TEST_F(CKRRegistryScratch, KilledWriterLeavesEveryCommittedValue) {
  const pid_t child = StartHelper(3, "k", 0);
  HKEY key = nullptr;
  // Wait until a few values are in, then kill the writer in mid-write.
  for (int tries = 0; tries < 2000; ++tries, ::usleep(5000)) {
    if (key == nullptr && KRRegOpenKeyEx(HKEY_CURRENT_USER, L"Software\\Shared", 0, KRKEY_READ, &key) != 0)
      key = nullptr;
    if (key != nullptr && Get(key, L"k20"))
      break;
  }
  ASSERT_NE(key, nullptr);
  ::kill(child, SIGKILL);
  EXPECT_EQ(KRWaitChild(child), -1);
  // The values form an unbroken run from k0, each whole.
  std::uint32_t values = 0;
  ASSERT_EQ(KRRegQueryInfoKey(key, nullptr, nullptr, &values, nullptr, nullptr), 0);
  EXPECT_GE(values, 21u);
  for (std::uint32_t i = 0; i < values; ++i)
    ASSERT_EQ(Get(key, Numbered("k", int(i)).c_str()), std::string(64 * 1024, 'b') + std::to_string(i));
  EXPECT_EQ(Put(key, L"after", KRREG_SZ, ""), KRERROR_ACCESS_DENIED) << "read-only handle";
  HKEY writer = Create(L"Software\\Shared");
  EXPECT_EQ(Put(writer, L"after", KRREG_SZ, "ok"), 0);
  EXPECT_EQ(KRRegCloseKey(writer), 0);
  EXPECT_EQ(KRRegCloseKey(key), 0);
}

TEST_F(CKRRegistryScratch, DamagedOrExposedStoreGivesErrors) {
  ASSERT_EQ(::mkdir(Path("").c_str(), 0700), 0);
  m_Scratch.WriteFile("reg/registry.db", std::string(8192, 'G'));
  ::chmod(Path("registry.db").c_str(), 0600);
  HKEY key = nullptr;
  EXPECT_EQ(KRRegCreateKeyEx(HKEY_CURRENT_USER, L"Software", 0, KRKEY_ALL_ACCESS, &key, nullptr),
            KRERROR_ACCESS_DENIED);
  EXPECT_EQ(key, nullptr);
  std::uint32_t size = 0;
  EXPECT_EQ(KRRegQueryValueEx(HKEY_CURRENT_USER, L"v", nullptr, nullptr, &size), KRERROR_ACCESS_DENIED);

  // Repaired (removed), the store works again; opened up to others, it is
  // refused.
  ::unlink(Path("registry.db").c_str());
  key = Create(L"Software");
  ASSERT_NE(key, nullptr);
  EXPECT_EQ(KRRegCloseKey(key), 0);
  ::chmod(Path("registry.db").c_str(), 0644);
  ::setenv("KR_REGISTRY_DIR", Path("elsewhere").c_str(), 1);
  key = Create(L"Software");
  EXPECT_EQ(KRRegCloseKey(key), 0);
  ::setenv("KR_REGISTRY_DIR", Path("").c_str(), 1);
  EXPECT_EQ(KRRegCreateKeyEx(HKEY_CURRENT_USER, L"Software", 0, KRKEY_ALL_ACCESS, &key, nullptr),
            KRERROR_ACCESS_DENIED);
  ::chmod(Path("elsewhere").c_str(), 0755);
  ::setenv("KR_REGISTRY_DIR", Path("elsewhere").c_str(), 1);
  EXPECT_EQ(KRRegQueryValueEx(HKEY_CURRENT_USER, L"v", nullptr, nullptr, &size), KRERROR_ACCESS_DENIED);
}

TEST_F(CKRRegistryScratch, WriterLockedOutGivesUpButReadsGoOn) {
  HKEY key = Create(L"Software\\Locked");
  ASSERT_EQ(Put(key, L"v", KRREG_SZ, "before"), 0);
  // Another writer holds the store's write lock past the bounded wait.
  sqlite3* other = nullptr;
  ASSERT_EQ(sqlite3_open(Path("registry.db").c_str(), &other), SQLITE_OK);
  ASSERT_EQ(sqlite3_exec(other, "BEGIN IMMEDIATE", nullptr, nullptr, nullptr), SQLITE_OK);
  const auto start = std::chrono::steady_clock::now();
  EXPECT_EQ(Put(key, L"v", KRREG_SZ, "during"), KRERROR_ACCESS_DENIED);
  EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(60)) << "bounded, not a hang";
  EXPECT_EQ(Get(key, L"v"), "before");
  sqlite3_exec(other, "ROLLBACK", nullptr, nullptr, nullptr);
  sqlite3_close(other);
  EXPECT_EQ(Put(key, L"v", KRREG_SZ, "after"), 0);
  EXPECT_EQ(Get(key, L"v"), "after");
  EXPECT_EQ(KRRegCloseKey(key), 0);
}
