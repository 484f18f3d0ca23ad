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

TEST(KRBStr, SysAllocStringCopiesUpToTheTerminator) {
  EXPECT_EQ(SysAllocString(nullptr), nullptr);
  EXPECT_EQ(SysStringLen(nullptr), 0u);
  EXPECT_EQ(SysStringByteLen(nullptr), 0u);
  SysFreeString(nullptr);
  // The empty text gives a real, empty string, not null.
  for (const std::wstring expected : {L"Gr\u00FC\u00DFe", L""}) {
    const BStrPtr text(SysAllocString((expected + L'\0' + L"hidden").c_str()));
    ASSERT_NE(text, nullptr);
    EXPECT_EQ(SysStringByteLen(text.get()), expected.size() * sizeof(wchar_t));
    EXPECT_EQ(std::wstring(text.get(), SysStringLen(text.get()) + 1), expected + L'\0');
  }
}

TEST(KRBStr, SysAllocStringLenKeepsEmbeddedNuls) {
  const wchar_t source[] = {L'a', L'\0', L'b', L'\0', L'c'};
  // Only `length` characters are read: the source need not be terminated.
  for (const unsigned int length : {5u, 1u, 0u}) {
    SCOPED_TRACE(length);
    const BStrPtr text(SysAllocStringLen(source, length));
    ASSERT_NE(text, nullptr);
    EXPECT_EQ(SysStringLen(text.get()), length);
    EXPECT_EQ(SysStringByteLen(text.get()), length * sizeof(wchar_t));
    EXPECT_EQ(std::wstring(text.get(), length + 1), std::wstring(source, length) + L'\0');
  }
  // Without text: that many NUL characters.
  const BStrPtr zeros(SysAllocStringLen(nullptr, 1000));
  ASSERT_NE(zeros, nullptr);
  EXPECT_EQ(SysStringLen(zeros.get()), 1000u);
  EXPECT_EQ(std::wstring(zeros.get(), 1001), std::wstring(1001, L'\0'));
  // The byte count is 32 bits: 2^30 four-byte characters do not fit.
  EXPECT_EQ(SysAllocStringLen(nullptr, 0x40000000u), nullptr);
  EXPECT_EQ(SysAllocStringLen(nullptr, 0xFFFFFFFFu), nullptr);
}
