#include <krCoreLib/system/CKRSystem.h>

#include "KRFilesScratch.h"
#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <random>
#include <string>
#include <thread>
#include <vector>

namespace {

using Bytes = std::vector<unsigned char>;

// The bytes of every item reversed: what a big-endian read or write makes.
Bytes SwappedItems(const Bytes& bytes, std::size_t size) {
  Bytes result(bytes);
  for (std::size_t i = 0; i + size <= result.size(); i += size)
    std::reverse(result.begin() + std::ptrdiff_t(i), result.begin() + std::ptrdiff_t(i + size));
  return result;
}

using MemoryRead = std::size_t (*)(const void*, std::size_t, void*) noexcept;
using MemoryWrite = std::size_t (*)(void*, std::size_t, const void*) noexcept;
using FileRead = std::size_t (*)(std::FILE*, std::size_t, void*) noexcept;
using FileWrite = std::size_t (*)(std::FILE*, std::size_t, const void*) noexcept;

struct SKRByteOrderCase {
  const char* m_Name;
  std::size_t m_Size;
  bool m_Swapped;
  MemoryRead m_ReadMemory;
  MemoryWrite m_WriteMemory;
  FileRead m_ReadFile;
  FileWrite m_WriteFile;
};

const SKRByteOrderCase kByteOrderCases[] = {
    {"1", 1, false, &CKRSystem::Read1, &CKRSystem::Write1, &CKRSystem::Read1, &CKRSystem::Write1},
    {"2le", 2, false, &CKRSystem::Read2le, &CKRSystem::Write2le, &CKRSystem::Read2le, &CKRSystem::Write2le},
    {"4le", 4, false, &CKRSystem::Read4le, &CKRSystem::Write4le, &CKRSystem::Read4le, &CKRSystem::Write4le},
    {"8le", 8, false, &CKRSystem::Read8le, &CKRSystem::Write8le, &CKRSystem::Read8le, &CKRSystem::Write8le},
    {"2be", 2, true, &CKRSystem::Read2be, &CKRSystem::Write2be, &CKRSystem::Read2be, &CKRSystem::Write2be},
    {"4be", 4, true, &CKRSystem::Read4be, &CKRSystem::Write4be, &CKRSystem::Read4be, &CKRSystem::Write4be},
    {"8be", 8, true, &CKRSystem::Read8be, &CKRSystem::Write8be, &CKRSystem::Read8be, &CKRSystem::Write8be},
};

}  // namespace

TEST(CKRSystem, SwapBytesReversesEachItem) {
  unsigned char item[] = {1, 2, 3};
  CKRSystem::SwapBytes(3, item);
  EXPECT_EQ(Bytes(item, item + 3), (Bytes{3, 2, 1}));

  unsigned char items[] = {1, 2, 3, 4, 5, 6, 7, 8};
  CKRSystem::SwapBytes(4, 2, items);
  EXPECT_EQ(Bytes(items, items + 8), (Bytes{4, 3, 2, 1, 8, 7, 6, 5}));
  for (const int count : {0, -1}) {
    CKRSystem::SwapBytes(4, count, items);
    EXPECT_EQ(Bytes(items, items + 8), (Bytes{4, 3, 2, 1, 8, 7, 6, 5})) << count;
  }
  CKRSystem::SwapBytes(1, 8, items);
  CKRSystem::SwapBytes(4, nullptr);
  EXPECT_EQ(items[0], 4);

  const unsigned char source[] = {1, 2, 3, 4, 5, 6};
  unsigned char copy[6] = {};
  CKRSystem::EndianCopy(2, 3, source, copy);
  EXPECT_EQ(Bytes(copy, copy + 6), (Bytes{2, 1, 4, 3, 6, 5}));
  EXPECT_EQ(Bytes(source, source + 6), (Bytes{1, 2, 3, 4, 5, 6}));
  CKRSystem::EndianCopy(4, source, copy);
  EXPECT_EQ(Bytes(copy, copy + 4), (Bytes{4, 3, 2, 1}));
}

TEST(CKRSystem, MemoryReadsAndWritesKeepOrSwapTheBytes) {
  // The example every reader of big-endian data relies on.
  const unsigned char bigEndian[] = {0x01, 0x02, 0x03, 0x04};
  std::uint32_t value = 0;
  EXPECT_EQ(CKRSystem::Read4be(static_cast<const void*>(bigEndian), 1, &value), 4u);
  unsigned char inMemory[4];
  std::memcpy(inMemory, &value, 4);
  EXPECT_EQ(Bytes(inMemory, inMemory + 4), (Bytes{0x04, 0x03, 0x02, 0x01}));
  EXPECT_EQ(value, 0x01020304u);

  std::mt19937 random(KRTestSeed());
  for (const SKRByteOrderCase& c : kByteOrderCases) {
    SCOPED_TRACE(c.m_Name);
    const std::size_t count = 1 + random() % 40;
    Bytes source(count * c.m_Size);
    for (unsigned char& byte : source)
      byte = static_cast<unsigned char>(random());
    const Bytes expected = c.m_Swapped ? SwappedItems(source, c.m_Size) : source;

    Bytes read(source.size());
    EXPECT_EQ(c.m_ReadMemory(source.data(), count, read.data()), source.size());
    EXPECT_EQ(read, expected);

    const Bytes before = source;
    Bytes written(source.size());
    EXPECT_EQ(c.m_WriteMemory(written.data(), count, source.data()), source.size());
    EXPECT_EQ(written, expected);
    EXPECT_EQ(source, before) << "the source of a write is left as it was";

    EXPECT_EQ(c.m_ReadMemory(nullptr, count, read.data()), 0u);
    EXPECT_EQ(c.m_WriteMemory(nullptr, count, source.data()), 0u);
    EXPECT_EQ(c.m_ReadMemory(source.data(), 0, read.data()), 0u);
  }
}

TEST(CKRSystem, FileReadsAndWritesCountWholeItems) {
  CKRFilesScratch scratch;
  ASSERT_TRUE(scratch.IsValid());
  std::mt19937 random(KRTestSeed() + 1);
  for (const SKRByteOrderCase& c : kByteOrderCases) {
    SCOPED_TRACE(c.m_Name);
    const CKRString path = scratch.Wide(std::string("items") + c.m_Name);
    const std::size_t count = 1 + random() % 3000;  // beyond one internal chunk
    Bytes source(count * c.m_Size);
    for (unsigned char& byte : source)
      byte = static_cast<unsigned char>(random());

    std::FILE* file = CKRSystem::Fopen(path.GetString(), L"wb");
    ASSERT_NE(file, nullptr);
    EXPECT_EQ(c.m_WriteFile(file, count, source.data()), source.size());
    // One byte more: a file that ends inside an item.
    EXPECT_EQ(CKRSystem::Write1(file, 1, source.data()), 1u);
    EXPECT_EQ(CKRSystem::Fclose(file), 0);

    unsigned char* stored = nullptr;
    std::size_t storedSize = 0;
    ASSERT_TRUE(CKRSystem::Load(path.GetString(), stored, storedSize));
    const Bytes onDisk(stored, stored + storedSize);
    delete[] stored;
    EXPECT_EQ(Bytes(onDisk.begin(), onDisk.end() - 1), c.m_Swapped ? SwappedItems(source, c.m_Size) : source);

    // Reading one item more than the file holds gives the whole items only.
    file = CKRSystem::Fopen(path.GetString(), L"rb");
    ASSERT_NE(file, nullptr);
    Bytes read((count + 1) * c.m_Size, 0xEE);
    const std::size_t expectedBytes = c.m_Size == 1 ? source.size() + 1 : source.size();
    EXPECT_EQ(c.m_ReadFile(file, count + 1, read.data()), expectedBytes);
    read.resize(source.size());
    EXPECT_EQ(read, source) << "read back into this machine's order";
    EXPECT_EQ(CKRSystem::Fclose(file), 0);

    EXPECT_EQ(c.m_ReadFile(nullptr, 1, read.data()), 0u);
    EXPECT_EQ(c.m_WriteFile(nullptr, 1, read.data()), 0u);
  }
}

TEST(CKRSystem, SaveLoadAndAppendRoundTrip) {
  CKRFilesScratch scratch;
  ASSERT_TRUE(scratch.IsValid());
  const CKRString path = scratch.Wide("data.bin");
  const std::string first = std::string("first\0part", 10);
  ASSERT_TRUE(CKRSystem::Save(path.GetString(), first.data(), first.size()));
  ASSERT_TRUE(CKRSystem::Append(path.GetString(), "+more", 5));

  unsigned char* buffer = nullptr;
  std::size_t size = 0;
  ASSERT_TRUE(CKRSystem::Load(path.GetString(), buffer, size));
  EXPECT_EQ(std::string(reinterpret_cast<char*>(buffer), size), first + "+more");
  delete[] buffer;

  // Save replaces what was there.
  ASSERT_TRUE(CKRSystem::Save(path.GetString(), "x", 1));
  ASSERT_TRUE(CKRSystem::Load(path.GetString(), buffer, size));
  EXPECT_EQ(size, 1u);
  delete[] buffer;

  // Append creates a missing file; a valid link is followed.
  scratch.MakeLink(scratch.Native("data.bin"), "link.bin");
  ASSERT_TRUE(CKRSystem::Append(scratch.Wide("link.bin").GetString(), "y", 1));
  ASSERT_TRUE(CKRSystem::Append(scratch.Wide("new.bin").GetString(), "z", 1));
  ASSERT_TRUE(CKRSystem::Load(path.GetString(), buffer, size));
  EXPECT_EQ(std::string(reinterpret_cast<char*>(buffer), size), "xy");
  delete[] buffer;

  // An empty file loads as an empty, valid buffer.
  scratch.WriteFile("empty", "");
  buffer = nullptr;
  ASSERT_TRUE(CKRSystem::Load(scratch.Wide("empty").GetString(), buffer, size));
  EXPECT_NE(buffer, nullptr);
  EXPECT_EQ(size, 0u);
  delete[] buffer;

  // Nothing to write: false, and no file appears.
  const CKRString nothing = scratch.Wide("nothing.bin");
  EXPECT_FALSE(CKRSystem::Save(nothing.GetString(), "abc", 0));
  EXPECT_FALSE(CKRSystem::Save(nothing.GetString(), nullptr, 3));
  EXPECT_FALSE(CKRSystem::Append(nothing.GetString(), "abc", 0));
  EXPECT_NE(::access(scratch.Native("nothing.bin").c_str(), F_OK), 0);
}

TEST(CKRSystem, BadPathsFailWithoutPartialResults) {
  CKRFilesScratch scratch;
  ASSERT_TRUE(scratch.IsValid());
  scratch.MakeFolder("folder");
  scratch.MakePipe("pipe");
  scratch.MakeLink(scratch.Native("missing-target"), "dangling");
  // A sparse file beyond the load limit: refused before anything is read.
  {
    const int fd = ::open(scratch.Native("huge").c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0644);
    ASSERT_GE(fd, 0);
    ASSERT_EQ(::ftruncate(fd, off_t(CKRSystem::kMaxLoadSize) + 1), 0);
    ::close(fd);
  }
  scratch.WriteFile("locked", "secret");
  ::chmod(scratch.Native("locked").c_str(), 0);

  const CKRString overlong = scratch.Wide() + L"/" + CKRString(5000, L'a');
  const wchar_t invalid[] = {L'/', L't', L'm', L'p', L'/', wchar_t(0xD800), L'\0'};
  struct SKRBadPath {
    const char* m_What;
    CKRString m_Path;
    bool m_Writable;  // Save to it would succeed if it were not refused
  };
  std::vector<SKRBadPath> paths = {
      {"empty", CKRString(), false},
      {"overlong", overlong, false},
      {"lone surrogate", CKRString(invalid), false},
      {"missing folder", scratch.Wide("no/such/file"), false},
      {"directory", scratch.Wide("folder"), true},
      {"pipe without a writer", scratch.Wide("pipe"), true},
      {"dangling link", scratch.Wide("dangling"), true},
      {"device", CKRString(L"/dev/null"), true},
      {"huge", scratch.Wide("huge"), false},
  };
  if (KRPermissionsApply())
    paths.push_back({"no permission", scratch.Wide("locked"), true});

  const int descriptors = KROpenDescriptorCount();
  for (const SKRBadPath& bad : paths) {
    SCOPED_TRACE(bad.m_What);
    unsigned char* buffer = reinterpret_cast<unsigned char*>(&scratch);  // must be reset
    std::size_t size = 99;
    EXPECT_FALSE(CKRSystem::Load(bad.m_Path.GetString(), buffer, size));
    EXPECT_EQ(buffer, nullptr);
    EXPECT_EQ(size, 0u);
    if (std::string(bad.m_What) != "huge") {
      EXPECT_FALSE(CKRSystem::Save(bad.m_Path.GetString(), "data", 4));
      EXPECT_FALSE(CKRSystem::Append(bad.m_Path.GetString(), "data", 4));
    }
  }
  unsigned char* buffer = nullptr;
  std::size_t size = 0;
  EXPECT_FALSE(CKRSystem::Load(nullptr, buffer, size));
  EXPECT_FALSE(CKRSystem::Save(nullptr, "data", 4));
  EXPECT_EQ(KROpenDescriptorCount(), descriptors) << "no descriptor is left open";
  // No file was created through the dangling link.
  EXPECT_NE(::access(scratch.Native("missing-target").c_str(), F_OK), 0);
}

// Run by GetTimeStartsAtZeroAndCountsMilliseconds in a fresh process.
TEST(CKRSystem, DISABLED_FirstTimeIsZero) {
  EXPECT_EQ(CKRSystem::GetTime(), 0.0);
}

TEST(CKRSystem, GetTimeStartsAtZeroAndCountsMilliseconds) {
  EXPECT_EQ(KRRunTestProgram("/proc/self/exe", "CKRSystem.DISABLED_FirstTimeIsZero"), 0);

  double previous = CKRSystem::GetTime();
  for (int i = 0; i < 1000; ++i) {
    const double now = CKRSystem::GetTime();
    ASSERT_GE(now, previous);
    const double milliseconds = now * 1000.0;
    ASSERT_NEAR(milliseconds, std::round(milliseconds), 1e-6) << "whole milliseconds";
    previous = now;
  }
}

TEST(CKRSystem, GetPathKeepsTheLimitAndAResultPerThread) {
  const CKRString directory(600, L'd');
  const CKRString fits(1023 - 600, L'n');
  const wchar_t* path = CKRSystem::GetPath(directory.GetString(), fits.GetString());
  ASSERT_NE(path, nullptr);
  EXPECT_EQ(CKRString(path), directory + fits);
  const CKRString tooLong(1024 - 600, L'n');
  EXPECT_EQ(CKRSystem::GetPath(directory.GetString(), tooLong.GetString()), nullptr) << "1024 characters";
  EXPECT_STREQ(CKRSystem::GetPath(nullptr, L"name"), L"name");
  EXPECT_STREQ(CKRSystem::GetPath(L"/dir/", nullptr), L"/dir/");

  // The same thread's next call overwrites; another thread's does not.
  const wchar_t* mine = CKRSystem::GetPath(L"/mine/", L"a");
  const wchar_t* again = CKRSystem::GetPath(L"/mine/", L"b");
  EXPECT_EQ(mine, again);
  EXPECT_STREQ(mine, L"/mine/b");
  std::thread other([] {
    for (int i = 0; i < 100; ++i)
      CKRSystem::GetPath(L"/other/", L"c");
  });
  other.join();
  EXPECT_STREQ(mine, L"/mine/b");
}

TEST(CKRSystem, BoundedCopiesNeverOverrunOrCut) {
  unsigned char target[4] = {9, 9, 9, 9};
  const unsigned char source[5] = {1, 2, 3, 4, 5};
  EXPECT_EQ(CKRSystem::Memcpy(target, 4, source, 4), target);
  EXPECT_EQ(Bytes(target, target + 4), (Bytes{1, 2, 3, 4}));
  EXPECT_EQ(CKRSystem::Memcpy(target, 4, source + 1, 5), nullptr);
  EXPECT_EQ(target[0], 1) << "nothing copied";
  EXPECT_EQ(CKRSystem::Memcpy(nullptr, 4, source, 1), nullptr);
  EXPECT_EQ(CKRSystem::Memcpy(target, 4, source, 0), target);

  wchar_t text[6];
  EXPECT_EQ(CKRSystem::Strcpy(text, 6, L"hello"), text);
  EXPECT_STREQ(text, L"hello");
  EXPECT_EQ(CKRSystem::Strcpy(text, 6, L"hello!"), nullptr);
  EXPECT_STREQ(text, L"") << "left empty, never cut";
  EXPECT_EQ(CKRSystem::Strcpy(text, 6, L"ab"), text);
  EXPECT_EQ(CKRSystem::Strcat(text, 6, L"cde"), text);
  EXPECT_STREQ(text, L"abcde");
  EXPECT_EQ(CKRSystem::Strcat(text, 6, L"f"), nullptr);
  EXPECT_STREQ(text, L"");
  EXPECT_EQ(CKRSystem::Strncpy(text, 6, L"abcdefgh", 3), text);
  EXPECT_STREQ(text, L"abc");
  EXPECT_EQ(CKRSystem::Strncpy(text, 6, L"abcdefgh", 6), nullptr);
  EXPECT_EQ(CKRSystem::Strcpy(nullptr, 6, L"a"), nullptr);
  EXPECT_EQ(CKRSystem::Strcpy(text, 6, nullptr), nullptr);
  wchar_t unterminated[3] = {L'x', L'y', L'z'};
  EXPECT_EQ(CKRSystem::Strcat(unterminated, 3, L""), nullptr);
  EXPECT_EQ(unterminated[0], L'\0');

  EXPECT_EQ(CKRSystem::Sprintf(text, 6, L"%s-%d", L"ab", 42), 5);
  EXPECT_STREQ(text, L"ab-42");
  EXPECT_EQ(CKRSystem::Sprintf(text, 6, L"%s-%d", L"ab", 420), -1);
  EXPECT_STREQ(text, L"");

  wchar_t list[] = L"a, b,,c";
  wchar_t* context = nullptr;
  std::vector<CKRString> tokens;
  for (wchar_t* token = CKRSystem::Strtok(list, L", ", &context); token != nullptr;
       token = CKRSystem::Strtok(nullptr, L", ", &context))
    tokens.emplace_back(token);
  EXPECT_EQ(tokens, (std::vector<CKRString>{L"a", L"b", L"c"}));
  wchar_t* none = nullptr;
  EXPECT_EQ(CKRSystem::Strtok(nullptr, L",", &none), nullptr);
  EXPECT_EQ(CKRSystem::Strtok(list, L",", nullptr), nullptr);
}

TEST(CKRSystem, FormattedFilesAreUtf8) {
  CKRFilesScratch scratch;
  ASSERT_TRUE(scratch.IsValid());
  const CKRString path = scratch.Wide("text.txt");
  std::FILE* file = CKRSystem::Fopen(path.GetString(), L"w");
  ASSERT_NE(file, nullptr);
  EXPECT_EQ(CKRSystem::Fprintf(file, L"%s=%d\n", L"\u00e9t\u00e9", 7), 8) << "bytes";
  EXPECT_EQ(CKRSystem::Fclose(file), 0);
  unsigned char* buffer = nullptr;
  std::size_t size = 0;
  ASSERT_TRUE(CKRSystem::Load(path.GetString(), buffer, size));
  EXPECT_EQ(std::string(reinterpret_cast<char*>(buffer), size), "\xC3\xA9t\xC3\xA9=7\n");
  delete[] buffer;

  EXPECT_EQ(CKRSystem::Fopen(path.GetString(), L"q"), nullptr) << "unknown mode";
  EXPECT_EQ(CKRSystem::Fopen(scratch.Wide("missing").GetString(), L"rb"), nullptr);
  EXPECT_EQ(CKRSystem::Fprintf(nullptr, L"x"), -1);
  EXPECT_EQ(CKRSystem::Fclose(nullptr), -1);
  // Opening a pipe for writing never waits for a reader.
  scratch.MakePipe("pipe");
  EXPECT_EQ(CKRSystem::Fopen(scratch.Wide("pipe").GetString(), L"wb"), nullptr);
}

TEST(CKRSystem, ColoursPackRedLowest) {
  static_assert(CKRSystem::MakeRGB(0x12, 0x34, 0x56) == 0x00563412u);
  static_assert(CKRSystem::MakeRGBA(0x12, 0x34, 0x56, 0x78) == 0x78563412u);
  static_assert(!CKRSystem::IsBigEndian());
  EXPECT_EQ(CKRSystem::MakeRGBA(255, 255, 255, 255), 0xFFFFFFFFu);
}
