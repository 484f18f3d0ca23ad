#include <krCoreLib/objectmodel/CKRGuid.h>

#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <random>
#include <set>
#include <string>
#include <csignal>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>
#include <vector>

namespace {

constexpr CKRGuid kSample = CKRGuid::Literal("{2B7E1516-28AE-42D2-A6AB-F7158809CF4F}");
constexpr CKRGuid kBefore = CKRGuid::Literal("{00112233-4455-6677-8899-AABBCCDDEEFF}");
// Literal values are compile-time constants, usable in any static initialiser.
static_assert(CKRGuid::Literal("3719246b-c3b0-4ae9-9723-6e998c42484a").GetGUID().Data1 == 0x3719246B);
static_assert(kSample.GetGUID().Data4[7] == 0x4F);

std::vector<CKRGuid> RandomGuids(std::size_t count) {
  std::mt19937_64 random(KRTestSeed());
  std::vector<CKRGuid> guids;
  for (std::size_t i = 0; i < count; ++i) {
    const std::uint64_t words[2] = {random(), random()};
    GUID raw;
    std::memcpy(&raw, words, sizeof raw);
    guids.emplace_back(raw);
  }
  return guids;
}

std::wstring Text(const CKRString& text) { return text.str(); }
std::wstring Text(BSTR text) {
  std::wstring copy(text, SysStringLen(text));
  SysFreeString(text);
  return copy;
}
template <class TText>
void Apply(CKRGuid& guid, void (CKRGuid::*set)(TText) noexcept, const std::wstring& text) {
  (guid.*set)(text);
}
void Apply(CKRGuid& guid, void (CKRGuid::*set)(BSTR) noexcept, const std::wstring& text) {
  BSTR copy = SysAllocStringLen(text.data(), unsigned(text.size()));
  (guid.*set)(copy);
  SysFreeString(copy);
}

// Each text form of kSample and the setter that reads it back.
struct STextForm {
  const char* name;
  std::wstring (*get)(const CKRGuid&);
  void (*set)(CKRGuid&, const std::wstring&);
  const wchar_t* sample;
};
#define KR_FORM(Get, Set, sample)                                                   \
  {#Get " " #Set, [](const CKRGuid& g) { return Text(g.Get()); },                   \
   [](CKRGuid& g, const std::wstring& t) { Apply(g, &CKRGuid::Set, t); }, sample}
const wchar_t kBraced[] = L"{2b7e1516-28ae-42d2-a6ab-f7158809cf4f}";
const wchar_t kHex[] = L"2b7e151628ae42d2a6abf7158809cf4f";
const wchar_t kXML[] = L"GUID_2b7e1516-28ae-42d2-a6ab-f7158809cf4f";
// base64url of 16 15 7e 2b ae 28 d2 42 a6 ab f7 15 88 09 cf 4f.
const wchar_t kXML64[] = L"FhV-K64o0kKmq_cViAnPTw";
const STextForm kForms[] = {
    KR_FORM(GetSTLString, SetSTLString, kBraced),
    KR_FORM(GetCString, SetCString, kBraced),
    KR_FORM(GetCStringUpperCase, SetCString, L"{2B7E1516-28AE-42D2-A6AB-F7158809CF4F}"),
    KR_FORM(GetBString, SetBString, kBraced),
    KR_FORM(GetCStringHex, SetCStringXML64, kHex),
    KR_FORM(GetBStringHex, SetCStringXML64, kHex),
    // Memory order: Data1, Data2 and Data3 least significant byte first.
    KR_FORM(GetSTLStringADOHex, SetSTLStringADOHex, L"80e00a0116157e2bae28d242a6abf7158809cf4f"),
    KR_FORM(GetCStringXML, SetCStringXML, kXML),
    KR_FORM(GetCStringXML, SetCStringXML64, kXML),
    KR_FORM(GetSTLStringXML, SetSTLStringXML, kXML),
    KR_FORM(GetBStringXML, SetBStringXML, kXML),
    KR_FORM(GetCStringXML64, SetCStringXML64, kXML64),
    KR_FORM(GetCStringXML64WS, SetCStringXML64, kXML64),
    KR_FORM(GetBStringXML64, SetBStringXML64, kXML64),
    KR_FORM(GetBStringXML64WS, SetBStringXML64, kXML64),
    KR_FORM(GetCStringXMLElement, SetCStringXMLElement, L"_FhV-K64o0kKmq_cViAnPTw"),
};
#undef KR_FORM

}  // namespace

TEST(CKRGuid, EveryTextFormRoundTripsRandomValues) {
  EXPECT_EQ(kSample.GetSTLStringSQL(), L"2b7e1516-28ae-42d2-a6ab-f7158809cf4f");
  for (const STextForm& form : kForms)
    EXPECT_EQ(form.get(kSample), form.sample) << form.name;
  for (const CKRGuid& value : RandomGuids(2000)) {
    SCOPED_TRACE(testing::Message() << value.GetCString().ToUtf8());
    for (const STextForm& form : kForms) {
      const std::wstring text = form.get(value);
      ASSERT_EQ(text.size(), std::wcslen(form.sample)) << form.name;
      CKRGuid g;
      form.set(g, text);
      EXPECT_EQ(g, value) << form.name;
    }
    EXPECT_EQ(CKRGuid(value.GetSTLString().c_str()), value);
  }
}

TEST(CKRGuid, RejectedTextsLeaveTheValueUnchanged) {
  // Braces, the XML prefix and the element's first character are not checked.
  CKRGuid lax[3];
  lax[0].SetCString(L"[2B7E1516-28AE-42D2-A6AB-F7158809CF4F)");
  lax[1].SetCStringXML(L"xxxxx2b7e1516-28ae-42d2-a6ab-f7158809cf4f");
  lax[2].SetCStringXMLElement(L"?FhV-K64o0kKmq_cViAnPTw");
  EXPECT_TRUE(lax[0] == kSample && lax[1] == kSample && lax[2] == kSample);
  EXPECT_TRUE(CKRGuid(static_cast<const wchar_t*>(nullptr)).IsNull() == 1);
  const std::wstring valid = kSample.GetSTLString();
  std::vector<std::wstring> texts = {
      L"{2b7e1516-28ae-42d2-a6ab-f7158809cf4g}",   // non-hex digit
      L"{2b7e1516+28ae-42d2-a6ab-f7158809cf4f}",   // hyphen missing
      L"{2b7e151-628ae-42d2-a6ab-f7158809cf4f}",   // hyphen misplaced
      L"{2b7e1516-28ae-42d2-a6ab-f7158809cf\u00e4f}",  // beyond ASCII
      L"{2b7e1516-28ae-42d2-a6ab-f7158809cf\uff14f}",  // a full-width digit
      std::wstring(L"{2b7e1516-28ae-42d2-a6ab-f715\0809cf4f}", 38),  // embedded NUL
  };
  // Every length from 0 to 60 made of hex digits and hyphens.
  for (std::size_t length = 0; length <= 60; ++length) {
    texts.push_back(std::wstring(length, L'a'));
    if (length != 38)
      texts.push_back(valid.substr(0, std::min(length, valid.size())) + std::wstring(length > 38 ? length - 38 : 0, L'0'));
  }
  for (const std::wstring& text : texts) {
    SCOPED_TRACE(CKRString::ToUtf8(text.data(), std::ptrdiff_t(text.size())));
    for (const STextForm& form : kForms) {
      // The base64 setters take texts of 22, 23, 32 and 41 characters as their own forms.
      if (text.size() == 23 ? std::wcslen(form.sample) == 23
                            : (text.size() == 22 || text.size() == 32) && std::strstr(form.name, "XML64") != nullptr)
        continue;
      CKRGuid g = kBefore;
      form.set(g, text);
      EXPECT_EQ(g, kBefore) << form.name;
    }
  }
  // Texts of the base64 setter's lengths that are not its forms.
  using namespace std::string_literals;
  for (const std::wstring& text : {L"FhV+K64o0kKmq/cViAnPTw"s, L"FhV-K64o0kKmq_cViAnP=w"s, L"FhV-K64o0kK\0q_cViAnPTw"s,
                                   L"FhV-K64o0kK\u00e4q_cViAnPTw"s, L"2b7e151628ae42d2a6abf7158809cfzz"s}) {
    CKRGuid g = kBefore;
    g.SetCStringXML64(CKRString(text));
    g.SetCStringXMLElement(CKRString(L"_" + text));
    EXPECT_EQ(g, kBefore) << CKRString(text).ToUtf8();
  }
}

TEST(CKRGuid, OrderIsFieldByFieldAndMatchesCanonicalText) {
  std::vector<CKRGuid> values = RandomGuids(3000);
  // Values that share long prefixes exercise every field of the comparison.
  for (int i = 0; i < 500; ++i) {
    GUID raw = values[std::size_t(i)].GetGUID();
    raw.Data4[i % 8] ^= std::uint8_t(1 << (i % 8));
    values.emplace_back(raw);
    raw.Data3 ^= std::uint16_t(i);
    values.emplace_back(raw);
  }
  values.push_back(values.back());
  for (std::size_t i = 1; i < values.size(); ++i) {
    const CKRGuid &x = values[i - 1], &y = values[i];
    const std::wstring tx = x.GetSTLStringSQL(), ty = y.GetSTLStringSQL();
    ASSERT_EQ(x < y, tx < ty) << CKRString(tx).ToUtf8() << " " << CKRString(ty).ToUtf8();
    ASSERT_EQ(x > y, tx > ty);
    ASSERT_EQ(x == y, tx == ty);
    ASSERT_EQ(x.Compare(y), tx < ty ? -1 : (tx > ty ? 1 : 0));
  }
}

TEST(CKRGuid, NewValuesAreVersion4AndDistinctAcrossThreads) {
  constexpr int kThreads = 4, kPerThread = 5000;
  std::vector<std::vector<CKRGuid>> made(kThreads);
  {
    std::vector<std::jthread> threads;
    for (int t = 0; t < kThreads; ++t)
      threads.emplace_back([&made, t] {
        for (int i = 0; i < kPerThread; ++i)
          made[std::size_t(t)].push_back(CKRGuid::CreateNewGUID());
      });
  }
  std::set<CKRGuid> all;
  for (const auto& list : made)
    for (const CKRGuid& g : list) {
      ASSERT_TRUE(g.GetGUID().Data3 >> 12 == 4 && (g.GetGUID().Data4[0] & 0xC0) == 0x80) << g.GetCString().ToUtf8();
      all.insert(g);
    }
  EXPECT_EQ(all.size(), std::size_t(kThreads * kPerThread));
}

// However the child is made (fork runs the fork handlers, _Fork and a raw
// clone run none), it never hands out what the parent hands out next.
TEST(CKRGuid, ForkedChildNeverRepeatsTheParent) {
  struct Case {
    const char* how;
    pid_t (*spawn)();
  };
  const Case cases[] = {
      {"fork", [] { return fork(); }},
      {"_Fork", [] { return _Fork(); }},
      {"clone", [] { return pid_t(syscall(SYS_clone, SIGCHLD, nullptr, nullptr, nullptr, nullptr)); }},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.how);
    // Fill this thread's pool, then make the child.
    CKRGuid::CreateNewGUID();
    int pipeEnds[2];
    ASSERT_EQ(pipe(pipeEnds), 0);
    const pid_t child = c.spawn();
    ASSERT_GE(child, 0);
    if (child == 0) {
      GUID made[64];
      for (GUID& raw : made)
        raw = CKRGuid::CreateNewGUID().GetGUID();
      _exit(write(pipeEnds[1], made, sizeof made) == sizeof made ? 0 : 1);
    }
    close(pipeEnds[1]);
    std::set<CKRGuid> parent;
    for (int i = 0; i < 64; ++i)
      parent.insert(CKRGuid::CreateNewGUID());
    int fromChild = 0;
    for (GUID raw; read(pipeEnds[0], &raw, sizeof raw) == sizeof raw; ++fromChild)
      EXPECT_EQ(parent.count(CKRGuid(raw)), 0u);
    close(pipeEnds[0]);
    int status = 0;
    waitpid(child, &status, 0);
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0);
    EXPECT_EQ(fromChild, 64);
  }
}

TEST(CKRGuid, NarrowAndWideConversions) {
  EXPECT_EQ(CKRGuid::toWideString("GUID_\xc3\xa4", 6), L"GUID_\ufffd");
  EXPECT_TRUE(CKRGuid::toWideString(nullptr, -1).IsEmpty() && CKRGuid::toWideString("abc", -7).IsEmpty());
  EXPECT_EQ(CKRGuid::toNarrowString(L"\u00b5m\0x", -1), "\xc2\xb5m");
  EXPECT_EQ(CKRGuid::toNarrowString(nullptr, 3), "");
  // A truncated multibyte sequence at the end is replaced, never overread.
  const char truncated[2] = {'x', '\xe2'};
  EXPECT_EQ(CKRGuid::toWideString(truncated, 2), L"x\ufffd");
}

// The protected base64 coder, reached through a derived class.
struct CKRGuidBase64 : CKRGuid {
  using CKRGuid::Decode64;
  using CKRGuid::Encode64;
};

TEST(CKRGuid, Base64Coder) {
  using Bytes = std::vector<unsigned char>;
  EXPECT_EQ(CKRGuidBase64::Encode64(Bytes{0xFB, 0xFF, 0xBF, 0x00}.data(), 4), "-_-_AA==");
  EXPECT_EQ(CKRGuidBase64::Encode64(nullptr, 5), "");
  // A line break after every 76 characters.
  const Bytes long_(120, 0xAB);
  const std::string encoded = CKRGuidBase64::Encode64(long_.data(), long_.size());
  EXPECT_EQ(encoded.size(), 160u + 2u * 2u);
  EXPECT_EQ(encoded.substr(76, 2), "\r\n");
  EXPECT_EQ(CKRGuidBase64::Decode64(encoded.data(), encoded.size()), long_);
  // Foreign characters are skipped, "=" stops, partial groups keep whole bytes.
  EXPECT_EQ(CKRGuidBase64::Decode64("-_ +/-_\nAB", 10), (Bytes{0xFB, 0xFF, 0xBF, 0x00}));
  EXPECT_EQ(CKRGuidBase64::Decode64("-_-_ABA=ZZZZ", 12), (Bytes{0xFB, 0xFF, 0xBF, 0x00, 0x10}));
  EXPECT_TRUE(CKRGuidBase64::Decode64(nullptr, 10).empty());
}
