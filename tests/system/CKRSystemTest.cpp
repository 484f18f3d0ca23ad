#include <krCoreLib/system/CKRSystem.h>

#include "KRFilesScratch.h"

namespace {

using Bytes = std::vector<unsigned char>;

struct SKRByteOrderCase {
  const char* m_Name;
  std::size_t m_Size;
  bool m_Swapped;
  std::size_t (*m_ReadMemory)(const void*, std::size_t, void*) noexcept;
  std::size_t (*m_WriteMemory)(void*, std::size_t, const void*) noexcept;
  std::size_t (*m_ReadFile)(std::FILE*, std::size_t, void*) noexcept;
  std::size_t (*m_WriteFile)(std::FILE*, std::size_t, const void*) noexcept;
};

#define KR_BYTE_ORDER_CASE(name, size, swapped) \
  {#name, size, swapped, &CKRSystem::Read##name, &CKRSystem::Write##name, &CKRSystem::Read##name, &CKRSystem::Write##name}
const SKRByteOrderCase kByteOrderCases[] = {
    KR_BYTE_ORDER_CASE(1, 1, false),  KR_BYTE_ORDER_CASE(2le, 2, false), KR_BYTE_ORDER_CASE(4le, 4, false),
    KR_BYTE_ORDER_CASE(8le, 8, false), KR_BYTE_ORDER_CASE(2be, 2, true),  KR_BYTE_ORDER_CASE(4be, 4, true),
    KR_BYTE_ORDER_CASE(8be, 8, true),
};
#undef KR_BYTE_ORDER_CASE

}  // namespace

TEST(CKRSystem, ReadsAndWritesKeepOrSwapTheBytesOfWholeItems) {
  unsigned char items[] = {1, 2, 3, 4, 5, 6, 7, 8};
  CKRSystem::SwapBytes(4, 2, items);
  CKRSystem::SwapBytes(4, -1, items);
  CKRSystem::SwapBytes(4, nullptr);
  EXPECT_EQ(Bytes(items, items + 8), (Bytes{4, 3, 2, 1, 8, 7, 6, 5}));
  unsigned char copy[8] = {};
  CKRSystem::EndianCopy(2, 4, items, copy);
  EXPECT_EQ(Bytes(copy, copy + 8), (Bytes{3, 4, 1, 2, 7, 8, 5, 6}));

  CKRFilesScratch scratch;
  std::mt19937 random(KRTestSeed());
  for (const SKRByteOrderCase& c : kByteOrderCases) {
    SCOPED_TRACE(c.m_Name);
    const std::size_t count = 1 + random() % 3000;   // beyond one internal chunk
    Bytes source(count * c.m_Size);
    for (unsigned char& byte : source)
      byte = static_cast<unsigned char>(random());
    Bytes expected(source);
    for (std::size_t i = 0; c.m_Swapped && i < expected.size(); i += c.m_Size)
      std::reverse(expected.begin() + std::ptrdiff_t(i), expected.begin() + std::ptrdiff_t(i + c.m_Size));

    Bytes read(source.size()), written(source.size());
    EXPECT_EQ(c.m_ReadMemory(source.data(), count, read.data()), source.size());
    EXPECT_EQ(read, expected);
    EXPECT_EQ(c.m_WriteMemory(written.data(), count, source.data()), source.size());
    EXPECT_EQ(written, expected);
    EXPECT_EQ(c.m_ReadMemory(nullptr, count, read.data()) + c.m_WriteMemory(nullptr, count, source.data()), 0u);

    const CKRString path = scratch.Wide(std::string("items") + c.m_Name);
    std::FILE* file = CKRSystem::Fopen(path.GetString(), L"wb");
    ASSERT_NE(file, nullptr);
    EXPECT_EQ(c.m_WriteFile(file, count, source.data()), source.size());
    EXPECT_EQ(CKRSystem::Write1(file, 1, source.data()), 1u) << "a file that ends inside an item";
    EXPECT_EQ(CKRSystem::Fclose(file), 0);
    const std::string onDisk = KRLoadText(path);
    EXPECT_EQ(Bytes(onDisk.begin(), onDisk.end() - 1), expected);

    // Reading one item more than the file holds gives the whole items only.
    file = CKRSystem::Fopen(path.GetString(), L"rb");
    ASSERT_NE(file, nullptr);
    Bytes back((count + 1) * c.m_Size);
    EXPECT_EQ(c.m_ReadFile(file, count + 1, back.data()), source.size() + (c.m_Size == 1 ? 1 : 0));
    back.resize(source.size());
    EXPECT_EQ(back, source);
    EXPECT_EQ(CKRSystem::Fclose(file), 0);
    EXPECT_EQ(c.m_ReadFile(nullptr, 1, read.data()), 0u);
  }
}

TEST(CKRSystem, SaveLoadAppendAndFormattedFilesRoundTrip) {
  CKRFilesScratch scratch;
  const CKRString path = scratch.Wide("data.bin");
  const std::string first = std::string("first\0part", 10);
  ASSERT_TRUE(CKRSystem::Save(path.GetString(), first.data(), first.size()));
  ASSERT_TRUE(CKRSystem::Append(path.GetString(), "+more", 5));
  EXPECT_EQ(KRLoadText(path), first + "+more");
  // Save replaces; Append follows a valid link and creates a missing file.
  ASSERT_TRUE(CKRSystem::Save(path.GetString(), "x", 1));
  scratch.MakeLink(scratch.Native("data.bin"), "link.bin");
  ASSERT_TRUE(CKRSystem::Append(scratch.Wide("link.bin").GetString(), "y", 1));
  ASSERT_TRUE(CKRSystem::Append(scratch.Wide("new.bin").GetString(), "z", 1));
  EXPECT_EQ(KRLoadText(path), "xy");
  EXPECT_EQ(KRLoadText(scratch.Wide("new.bin")), "z");

  scratch.WriteFile("empty", "");
  unsigned char* buffer = nullptr;
  std::size_t size = 1;
  ASSERT_TRUE(CKRSystem::Load(scratch.Wide("empty").GetString(), buffer, size));
  EXPECT_NE(buffer, nullptr) << "an empty, valid buffer";
  EXPECT_EQ(size, 0u);
  delete[] buffer;

  const CKRString nothing = scratch.Wide("nothing.bin");
  EXPECT_FALSE(CKRSystem::Save(nothing.GetString(), "abc", 0));
  EXPECT_FALSE(CKRSystem::Save(nothing.GetString(), nullptr, 3));
  EXPECT_FALSE(CKRSystem::Append(nothing.GetString(), "abc", 0));
  EXPECT_NE(::access(scratch.Native("nothing.bin").c_str(), F_OK), 0);

  // Formatted text is written as UTF-8.
  std::FILE* file = CKRSystem::Fopen(path.GetString(), L"w");
  ASSERT_NE(file, nullptr);
  EXPECT_EQ(CKRSystem::Fprintf(file, L"%s=%d\n", L"\u00e9t\u00e9", 7), 8) << "bytes";
  EXPECT_EQ(CKRSystem::Fclose(file), 0);
  EXPECT_EQ(KRLoadText(path), "\xC3\xA9t\xC3\xA9=7\n");
  EXPECT_EQ(CKRSystem::Fopen(path.GetString(), L"q"), nullptr) << "unknown mode";
  EXPECT_EQ(CKRSystem::Fclose(nullptr), -1);
  scratch.MakePipe("pipe");
  EXPECT_EQ(CKRSystem::Fopen(scratch.Wide("pipe").GetString(), L"wb"), nullptr) << "never waits for a reader";
}

TEST(CKRSystem, BadPathsFailWithoutPartialResults) {
  CKRFilesScratch scratch;
  scratch.MakeSparse("huge", off_t(CKRSystem::kMaxLoadSize) + 1);
  scratch.WriteFile("locked", "secret");
  ::chmod(scratch.Native("locked").c_str(), 0);
  std::vector<std::pair<const char*, CKRString>> paths = KRBadPaths(scratch);
  paths.push_back({"device", CKRString(L"/dev/null")});
  paths.push_back({"huge", scratch.Wide("huge")});
  if (!KRCanActAsAnotherUser())
    paths.push_back({"no permission", scratch.Wide("locked")});

  const int descriptors = KROpenDescriptorCount();
  for (const auto& [what, path] : paths) {
    SCOPED_TRACE(what);
    unsigned char* buffer = reinterpret_cast<unsigned char*>(&scratch);   // must be reset
    std::size_t size = 99;
    EXPECT_FALSE(CKRSystem::Load(path.GetString(), buffer, size));
    EXPECT_EQ(buffer, nullptr);
    EXPECT_EQ(size, 0u);
    if (std::string(what) != "huge") {
      EXPECT_FALSE(CKRSystem::Save(path.GetString(), "data", 4));
      EXPECT_FALSE(CKRSystem::Append(path.GetString(), "data", 4));
    }
  }
  unsigned char* buffer = nullptr;
  std::size_t size = 0;
  EXPECT_FALSE(CKRSystem::Load(nullptr, buffer, size));
  EXPECT_FALSE(CKRSystem::Save(nullptr, "data", 4));
  EXPECT_EQ(KROpenDescriptorCount(), descriptors) << "no descriptor is left open";
  EXPECT_NE(::access(scratch.Native("bad-gone").c_str(), F_OK), 0) << "nothing made through the link";
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
    ASSERT_NEAR(now * 1000.0, std::round(now * 1000.0), 1e-6) << "whole milliseconds";
    previous = now;
  }
}

TEST(CKRSystem, BoundedCopiesNeverOverrunOrCut) {
  const CKRString directory(600, L'd'), fits(423, L'n'), tooLong(424, L'n');   // a limit of 1023 characters
  EXPECT_EQ(CKRString(CKRSystem::GetPath(directory.GetString(), fits.GetString())), directory + fits);
  EXPECT_EQ(CKRSystem::GetPath(directory.GetString(), tooLong.GetString()), nullptr);

  unsigned char target[4] = {9, 9, 9, 9};
  const unsigned char source[5] = {1, 2, 3, 4, 5};
  EXPECT_EQ(CKRSystem::Memcpy(target, 4, source, 5), nullptr);
  EXPECT_EQ(target[0], 9) << "nothing copied";
  EXPECT_EQ(CKRSystem::Memcpy(target, 4, source, 4), target);

  // Text that does not fit leaves the target empty, never cut.
  wchar_t text[6];
  EXPECT_EQ(CKRSystem::Strcpy(text, 6, L"ab"), text);
  EXPECT_EQ(CKRSystem::Strcat(text, 6, L"cde"), text);
  EXPECT_STREQ(text, L"abcde");
  EXPECT_EQ(CKRSystem::Strcat(text, 6, L"f"), nullptr);
  EXPECT_STREQ(text, L"");
  wchar_t unterminated[3] = {L'x', L'y', L'z'};
  EXPECT_EQ(CKRSystem::Strcat(unterminated, 3, L""), nullptr);
  EXPECT_EQ(CKRSystem::Sprintf(text, 6, L"%s-%d", L"ab", 42), 5);
  EXPECT_STREQ(text, L"ab-42");
  EXPECT_EQ(CKRSystem::Sprintf(text, 6, L"%s-%d", L"ab", 420), -1);
  EXPECT_STREQ(text, L"");
}
