#include <krCoreLib/platform/KRBStr.h>

#include <gtest/gtest.h>

#include <memory>
#include <string>

namespace {

struct SBStrFree {
  void operator()(wchar_t* text) const noexcept { SysFreeString(text); }
};
using BStrPtr = std::unique_ptr<wchar_t, SBStrFree>;

}  // namespace

TEST(KRBStr, NullIsTheEmptyString) {
  EXPECT_EQ(SysAllocString(nullptr), nullptr);
  EXPECT_EQ(SysStringLen(nullptr), 0u);
  EXPECT_EQ(SysStringByteLen(nullptr), 0u);
  SysFreeString(nullptr);
}

TEST(KRBStr, SysAllocStringCopiesUpToTheTerminator) {
  const BStrPtr text(SysAllocString(L"Gr\u00FC\u00DFe\0hidden"));
  ASSERT_NE(text, nullptr);
  EXPECT_EQ(SysStringLen(text.get()), 5u);
  EXPECT_EQ(SysStringByteLen(text.get()), 5u * sizeof(wchar_t));
  EXPECT_EQ(std::wstring(text.get()), L"Gr\u00FC\u00DFe");

  // The empty text gives a real, empty string, not null.
  const BStrPtr empty(SysAllocString(L""));
  ASSERT_NE(empty, nullptr);
  EXPECT_EQ(SysStringLen(empty.get()), 0u);
  EXPECT_EQ(SysStringByteLen(empty.get()), 0u);
  EXPECT_EQ(empty.get()[0], L'\0');
}

TEST(KRBStr, SysAllocStringLenKeepsEmbeddedNuls) {
  const wchar_t source[] = {L'a', L'\0', L'b', L'\0', L'c'};
  const BStrPtr text(SysAllocStringLen(source, 5));
  ASSERT_NE(text, nullptr);
  EXPECT_EQ(SysStringLen(text.get()), 5u);
  EXPECT_EQ(SysStringByteLen(text.get()), 5u * sizeof(wchar_t));
  EXPECT_EQ(std::wstring(text.get(), 5), std::wstring(source, 5));
  EXPECT_EQ(text.get()[5], L'\0');

  // Only `length` characters are read: the source need not be terminated.
  const BStrPtr prefix(SysAllocStringLen(source, 1));
  ASSERT_NE(prefix, nullptr);
  EXPECT_EQ(SysStringLen(prefix.get()), 1u);
  EXPECT_EQ(std::wstring(prefix.get()), L"a");

  const BStrPtr none(SysAllocStringLen(source, 0));
  ASSERT_NE(none, nullptr);
  EXPECT_EQ(SysStringLen(none.get()), 0u);
  EXPECT_EQ(none.get()[0], L'\0');
}

TEST(KRBStr, SysAllocStringLenWithoutTextGivesZeroCharacters) {
  for (const unsigned int length : {0u, 1u, 7u, 1000u}) {
    SCOPED_TRACE(length);
    const BStrPtr text(SysAllocStringLen(nullptr, length));
    ASSERT_NE(text, nullptr);
    EXPECT_EQ(SysStringLen(text.get()), length);
    EXPECT_EQ(SysStringByteLen(text.get()), length * sizeof(wchar_t));
    EXPECT_EQ(std::wstring(text.get(), length + 1), std::wstring(length + 1, L'\0'));
  }
}

TEST(KRBStr, SysAllocStringLenRejectsLengthsBeyondTheByteCount) {
  // The byte count is 32 bits: 2^30 four-byte characters do not fit.
  EXPECT_EQ(SysAllocStringLen(nullptr, 0x40000000u), nullptr);
  EXPECT_EQ(SysAllocStringLen(nullptr, 0xFFFFFFFFu), nullptr);
}
