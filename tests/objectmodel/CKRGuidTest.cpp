#include <krCoreLib/objectmodel/CKRGuid.h>

#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <random>
#include <set>
#include <string>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>
#include <vector>

namespace {

constexpr CKRGuid kSample = CKRGuid::Literal("{2B7E1516-28AE-42D2-A6AB-F7158809CF4F}");

std::vector<CKRGuid> RandomGuids(std::size_t count) {
  std::mt19937_64 random(KRTestSeed());
  std::vector<CKRGuid> guids;
  for (std::size_t i = 0; i < count; ++i) {
    GUID raw;
    const std::uint64_t a = random(), b = random();
    raw.Data1 = std::uint32_t(a);
    raw.Data2 = std::uint16_t(a >> 32);
    raw.Data3 = std::uint16_t(a >> 48);
    for (int k = 0; k < 8; ++k)
      raw.Data4[k] = std::uint8_t(b >> (8 * k));
    guids.emplace_back(raw);
  }
  return guids;
}

// A BSTR released at the end of the scope.
struct ScopedBSTR {
  explicit ScopedBSTR(BSTR text) : m_Text(text) {}
  ~ScopedBSTR() { SysFreeString(m_Text); }
  std::wstring Text() const { return std::wstring(m_Text, SysStringLen(m_Text)); }
  BSTR m_Text;
};

}  // namespace

TEST(CKRGuid, DefaultIsNull) {
  const CKRGuid guid;
  EXPECT_EQ(guid.IsValid(), 0);
  EXPECT_EQ(guid.IsNull(), 1);
  EXPECT_TRUE(guid == 0);
  EXPECT_FALSE(guid != 0);
  EXPECT_EQ(guid.GetCString(), L"{00000000-0000-0000-0000-000000000000}");
  EXPECT_EQ(guid.GetSTLStringADOHex(), L"80e00a01" + std::wstring(32, L'0'));

  CKRGuid copy = kSample;
  EXPECT_TRUE(copy != 0);
  copy.SetEmpty();
  EXPECT_EQ(copy, CKRGuid());
  EXPECT_EQ(CKRGuid(static_cast<const wchar_t*>(nullptr)), CKRGuid());
}

TEST(CKRGuid, PlatformStructureRoundTrip) {
  GUID raw{};
  kSample.SetGUID(raw);
  EXPECT_EQ(raw.Data1, 0x2B7E1516u);
  EXPECT_EQ(raw.Data2, 0x28AEu);
  EXPECT_EQ(raw.Data3, 0x42D2u);
  EXPECT_EQ(raw.Data4[0], 0xA6u);
  EXPECT_EQ(raw.Data4[7], 0x4Fu);
  EXPECT_TRUE(CKRGuid(raw) == raw);
  CKRGuid assigned;
  assigned = raw;
  EXPECT_EQ(assigned, kSample);
  raw.Data4[7] ^= 1;
  EXPECT_TRUE(kSample != raw);
}

TEST(CKRGuid, TextFormsOfOneValue) {
  EXPECT_EQ(kSample.GetCString(), L"{2b7e1516-28ae-42d2-a6ab-f7158809cf4f}");
  EXPECT_EQ(kSample.GetSTLString(), L"{2b7e1516-28ae-42d2-a6ab-f7158809cf4f}");
  EXPECT_EQ(kSample.GetCStringUpperCase(), L"{2B7E1516-28AE-42D2-A6AB-F7158809CF4F}");
  EXPECT_EQ(kSample.GetSTLStringSQL(), L"2b7e1516-28ae-42d2-a6ab-f7158809cf4f");
  EXPECT_EQ(kSample.GetCStringHex(), L"2b7e151628ae42d2a6abf7158809cf4f");
  // Memory order: Data1, Data2 and Data3 least significant byte first.
  EXPECT_EQ(kSample.GetSTLStringADOHex(), L"80e00a0116157e2bae28d242a6abf7158809cf4f");
  EXPECT_EQ(kSample.GetCStringXML(), L"GUID_2b7e1516-28ae-42d2-a6ab-f7158809cf4f");
  EXPECT_EQ(kSample.GetSTLStringXML(), L"GUID_2b7e1516-28ae-42d2-a6ab-f7158809cf4f");
  // base64url of 16 15 7e 2b ae 28 d2 42 a6 ab f7 15 88 09 cf 4f.
  EXPECT_EQ(kSample.GetCStringXML64(), L"FhV-K64o0kKmq_cViAnPTw");
  EXPECT_EQ(kSample.GetCStringXML64WS(), L"FhV-K64o0kKmq_cViAnPTw");
  EXPECT_EQ(kSample.GetCStringXMLElement(), L"_FhV-K64o0kKmq_cViAnPTw");

  EXPECT_EQ(ScopedBSTR(kSample.GetBString()).Text(), kSample.GetSTLString());
  EXPECT_EQ(ScopedBSTR(kSample.GetBStringHex()).Text(), kSample.GetCStringHex().str());
  EXPECT_EQ(ScopedBSTR(kSample.GetBStringXML()).Text(), kSample.GetSTLStringXML());
  EXPECT_EQ(ScopedBSTR(kSample.GetBStringXML64()).Text(), L"FhV-K64o0kKmq_cViAnPTw");
  EXPECT_EQ(ScopedBSTR(kSample.GetBStringXML64WS()).Text(), L"FhV-K64o0kKmq_cViAnPTw");
}

TEST(CKRGuid, EveryTextFormRoundTripsRandomValues) {
  for (const CKRGuid& value : RandomGuids(2000)) {
    SCOPED_TRACE(testing::Message() << value.GetCString().ToUtf8());
    const std::wstring braced = value.GetSTLString();
    ASSERT_EQ(braced.size(), 38u);
    ASSERT_EQ(value.GetCStringXMLElement().size(), 23u);
    ASSERT_EQ(value.GetCStringXMLElement()[0], L'_');

    CKRGuid g;
    g.SetSTLString(braced);
    EXPECT_EQ(g, value);
    g.SetEmpty();
    g.SetCString(value.GetCStringUpperCase());
    EXPECT_EQ(g, value);
    g.SetEmpty();
    g.SetBString(ScopedBSTR(value.GetBString()).m_Text);
    EXPECT_EQ(g, value);
    g.SetEmpty();
    g.SetSTLStringXML(value.GetSTLStringXML());
    EXPECT_EQ(g, value);
    g.SetEmpty();
    g.SetCStringXML(value.GetCStringXML());
    EXPECT_EQ(g, value);
    g.SetEmpty();
    g.SetBStringXML(ScopedBSTR(value.GetBStringXML()).m_Text);
    EXPECT_EQ(g, value);
    // SetCStringXML64 takes the XML64, hex and XML forms by their lengths.
    for (const CKRString& text : {value.GetCStringXML64(), value.GetCStringHex(), value.GetCStringXML()}) {
      g.SetEmpty();
      g.SetCStringXML64(text);
      EXPECT_EQ(g, value) << text.ToUtf8();
    }
    g.SetEmpty();
    g.SetBStringXML64(ScopedBSTR(value.GetBStringXML64()).m_Text);
    EXPECT_EQ(g, value);
    g.SetEmpty();
    g.SetCStringXMLElement(value.GetCStringXMLElement());
    EXPECT_EQ(g, value);
    g.SetEmpty();
    g.SetSTLStringADOHex(value.GetSTLStringADOHex());
    EXPECT_EQ(g, value);
    EXPECT_EQ(CKRGuid(braced.c_str()), value);
  }
}

TEST(CKRGuid, BracesAreDroppedWhateverTheyAre) {
  CKRGuid g;
  g.SetCString(L"[2B7E1516-28AE-42D2-A6AB-F7158809CF4F)");
  EXPECT_EQ(g, kSample);
  EXPECT_EQ(g.GetCString(), L"{2b7e1516-28ae-42d2-a6ab-f7158809cf4f}");
  // The XML form drops its first five characters unread.
  g.SetEmpty();
  g.SetCStringXML(L"xxxxx2b7e1516-28ae-42d2-a6ab-f7158809cf4f");
  EXPECT_EQ(g, kSample);
}

TEST(CKRGuid, RejectedTextsLeaveTheValueUnchanged) {
  const CKRGuid before = CKRGuid::Literal("{00112233-4455-6677-8899-AABBCCDDEEFF}");
  const std::wstring valid = kSample.GetSTLString();
  std::vector<std::wstring> texts = {
      L"",
      L"{}",
      L"{1234}",
      L"{2b7e1516-28ae-42d2-a6ab-f7158809cf4g}",   // non-hex digit
      L"{2b7e1516+28ae-42d2-a6ab-f7158809cf4f}",   // hyphen missing
      L"{2b7e151-628ae-42d2-a6ab-f7158809cf4f}",   // hyphen misplaced
      L"{2b7e1516-28ae-42d2-a6ab-f7158809cf4}",    // 37 characters
      L"{2b7e1516-28ae-42d2-a6ab-f7158809cf4ff}",  // 39 characters
      L"{ 2b7e1516-28ae-42d2-a6ab-f7158809cf4f}",
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
    CKRGuid g = before;
    g.SetSTLString(text);
    EXPECT_EQ(g, before);
    g.SetCString(CKRString(text));
    EXPECT_EQ(g, before);
    g.SetSTLStringXML(text);
    EXPECT_EQ(g, before);
    // 23 characters are the XML element form; those texts are valid there.
    if (text.size() != 23) {
      g.SetCStringXMLElement(CKRString(text));
      EXPECT_EQ(g, before);
    }
    g.SetSTLStringADOHex(text);
    EXPECT_EQ(g, before);
    ScopedBSTR bstr(SysAllocStringLen(text.data(), unsigned(text.size())));
    g.SetBString(bstr.m_Text);
    EXPECT_EQ(g, before);
  }
}

TEST(CKRGuid, XML64AcceptsOnlyItsThreeLengths) {
  const CKRGuid before = CKRGuid::Literal("{00112233-4455-6677-8899-AABBCCDDEEFF}");
  CKRGuid g = before;
  g.SetCStringXML64(CKRString(kSample.GetSTLStringSQL()));  // 36: ignored
  EXPECT_EQ(g, before);
  g.SetCStringXML64(L"FhV-K64o0kKmq_cViAnPTw==");  // 24: ignored
  EXPECT_EQ(g, before);
  g.SetCStringXML64(L"FhV+K64o0kKmq/cViAnPTw");  // standard alphabet: rejected
  EXPECT_EQ(g, before);
  g.SetCStringXML64(L"FhV-K64o0kKmq_cViAnP=w");
  EXPECT_EQ(g, before);
  g.SetCStringXML64(std::wstring(L"FhV-K64o0kK\0q_cViAnPTw", 22));
  EXPECT_EQ(g, before);
  g.SetCStringXML64(L"2b7e151628ae42d2a6abf7158809cfzz");  // 32, not hex
  EXPECT_EQ(g, before);
  g.SetCStringXMLElement(L"_FhV-K64o0kKmq_cViAnPT");  // 21 after the underscore
  EXPECT_EQ(g, before);
  g.SetCStringXMLElement(L"?FhV-K64o0kKmq_cViAnPTw");  // the first character is not checked
  EXPECT_EQ(g, kSample);
  for (std::size_t length = 0; length <= 60; ++length) {
    if (length == 22 || length == 32 || length == 41)
      continue;
    CKRGuid h = before;
    h.SetCStringXML64(CKRString(std::wstring(length, L'A')));
    EXPECT_EQ(h, before) << length;
  }
}

TEST(CKRGuid, OrderIsFieldByFieldAndMatchesCanonicalText) {
  const CKRGuid low = CKRGuid::Literal("{00000001-FFFF-FFFF-FFFF-FFFFFFFFFFFF}");
  const CKRGuid high = CKRGuid::Literal("{00000002-0000-0000-0000-000000000000}");
  EXPECT_TRUE(low < high);
  EXPECT_TRUE(high > low);
  const CKRGuid a = CKRGuid::Literal("{2B7E1516-28AE-42D2-A6AB-F7158809CF40}");
  const CKRGuid b = CKRGuid::Literal("{2B7E1516-28AE-42D2-A6AB-F7158809CF41}");
  EXPECT_TRUE(a < b);
  EXPECT_FALSE(b < a);
  EXPECT_FALSE(a < a);
  EXPECT_FALSE(a > a);
  // Data4 bytes compare as unsigned.
  EXPECT_TRUE(CKRGuid::Literal("{00000000-0000-0000-7F00-000000000000}") <
              CKRGuid::Literal("{00000000-0000-0000-8000-000000000000}"));

  std::vector<CKRGuid> values = RandomGuids(3000);
  // Values that share long prefixes exercise every field of the comparison.
  for (int i = 0; i < 500; ++i) {
    GUID raw = values[std::size_t(i)].GetGUID();
    raw.Data4[i % 8] ^= std::uint8_t(1 << (i % 8));
    values.emplace_back(raw);
    raw.Data3 ^= std::uint16_t(i);
    values.emplace_back(raw);
  }
  for (std::size_t i = 1; i < values.size(); ++i) {
    const CKRGuid& x = values[i - 1];
    const CKRGuid& y = values[i];
    const std::wstring tx = x.GetSTLStringSQL(), ty = y.GetSTLStringSQL();
    ASSERT_EQ(x < y, tx < ty) << CKRString(tx).ToUtf8() << " " << CKRString(ty).ToUtf8();
    ASSERT_EQ(x > y, tx > ty);
    ASSERT_EQ(x == y, tx == ty);
    ASSERT_EQ(x.Compare(y), tx < ty ? -1 : (tx > ty ? 1 : 0));
  }
}

TEST(CKRGuid, NewValuesAreVersion4AndDistinct) {
  std::set<CKRGuid> seen;
  for (int i = 0; i < 20000; ++i) {
    const CKRGuid g = CKRGuid::CreateNewGUID();
    ASSERT_EQ(g.IsValid(), 1);
    ASSERT_EQ(g.GetGUID().Data3 >> 12, 4);
    ASSERT_EQ(g.GetGUID().Data4[0] & 0xC0, 0x80);
    ASSERT_TRUE(seen.insert(g).second);
  }
}

TEST(CKRGuid, NewValuesAreDistinctAcrossThreads) {
  constexpr int kThreads = 4, kPerThread = 5000;
  std::vector<std::vector<CKRGuid>> made(kThreads);
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t)
    threads.emplace_back([&made, t] {
      for (int i = 0; i < kPerThread; ++i)
        made[std::size_t(t)].push_back(CKRGuid::CreateNewGUID());
    });
  for (std::thread& thread : threads)
    thread.join();
  std::set<CKRGuid> all;
  for (const auto& list : made)
    all.insert(list.begin(), list.end());
  EXPECT_EQ(all.size(), std::size_t(kThreads * kPerThread));
}

TEST(CKRGuid, ForkedChildNeverRepeatsTheParent) {
  // Fill this thread's pool, then fork: the child must not hand out what the
  // parent hands out next.
  CKRGuid::CreateNewGUID();
  int pipeEnds[2];
  ASSERT_EQ(pipe(pipeEnds), 0);
  const pid_t child = fork();
  ASSERT_GE(child, 0);
  if (child == 0) {
    for (int i = 0; i < 64; ++i) {
      const GUID raw = CKRGuid::CreateNewGUID().GetGUID();
      if (write(pipeEnds[1], &raw, sizeof raw) != sizeof raw)
        _exit(1);
    }
    _exit(0);
  }
  close(pipeEnds[1]);
  std::set<CKRGuid> parent;
  for (int i = 0; i < 64; ++i)
    parent.insert(CKRGuid::CreateNewGUID());
  int fromChild = 0;
  GUID raw;
  while (read(pipeEnds[0], &raw, sizeof raw) == sizeof raw) {
    ++fromChild;
    EXPECT_EQ(parent.count(CKRGuid(raw)), 0u);
  }
  close(pipeEnds[0]);
  int status = 0;
  waitpid(child, &status, 0);
  EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0);
  EXPECT_EQ(fromChild, 64);
}

TEST(CKRGuid, NarrowAndWideConversions) {
  EXPECT_EQ(CKRGuid::toWideString("GUID_\xc3\xa4", -1), L"GUID_\u00e4");
  EXPECT_EQ(CKRGuid::toWideString("abc", 2), L"ab");
  EXPECT_EQ(CKRGuid::toWideString(nullptr, -1), L"");
  EXPECT_EQ(CKRGuid::toWideString("abc", 0), L"");
  EXPECT_EQ(CKRGuid::toWideString("abc", -7), L"");
  EXPECT_EQ(CKRGuid::toNarrowString(L"\u00b5m", -1), "\xc2\xb5m");
  EXPECT_EQ(CKRGuid::toNarrowString(L"abc", 1), "a");
  EXPECT_EQ(CKRGuid::toNarrowString(nullptr, 3), "");
  // A truncated multibyte sequence at the end is replaced, never overread.
  const char truncated[2] = {'x', '\xe2'};
  EXPECT_EQ(CKRGuid::toWideString(truncated, 2), L"x\ufffd");
}

// The protected base64 coder, reached through a derived class.
class CKRGuidBase64 : public CKRGuid {
public:
  using CKRGuid::Decode64;
  using CKRGuid::Decode64WS;
  using CKRGuid::Encode64;
  using CKRGuid::Encode64WS;
};

TEST(CKRGuid, Base64Coder) {
  const unsigned char bytes[] = {0xFB, 0xFF, 0xBF, 0x00, 0x10};
  EXPECT_EQ(CKRGuidBase64::Encode64(bytes, 3), "-_-_");
  EXPECT_EQ(CKRGuidBase64::Encode64(bytes, 4), "-_-_AA==");
  EXPECT_EQ(CKRGuidBase64::Encode64(bytes, 5), "-_-_ABA=");
  EXPECT_EQ(CKRGuidBase64::Encode64WS(bytes, 5), L"-_-_ABA=");
  EXPECT_EQ(CKRGuidBase64::Encode64(nullptr, 5), "");

  // A line break after every 76 characters.
  const std::vector<unsigned char> long_(120, 0xAB);
  const std::string encoded = CKRGuidBase64::Encode64(long_.data(), long_.size());
  EXPECT_EQ(encoded.size(), 160u + 2u * 2u);
  EXPECT_EQ(encoded.substr(76, 2), "\r\n");
  EXPECT_EQ(encoded.substr(154, 2), "\r\n");
  EXPECT_EQ(CKRGuidBase64::Decode64(encoded.data(), encoded.size()), long_);

  // Foreign characters are skipped, "=" stops, partial groups keep whole bytes.
  const std::string noisy = "-_ +/-_\nAB";
  EXPECT_EQ(CKRGuidBase64::Decode64(noisy.data(), noisy.size()),
            (std::vector<unsigned char>{0xFB, 0xFF, 0xBF, 0x00}));
  EXPECT_EQ(CKRGuidBase64::Decode64("-_-_ABA=ZZZZ", 12), (std::vector<unsigned char>{0xFB, 0xFF, 0xBF, 0x00, 0x10}));
  EXPECT_EQ(CKRGuidBase64::Decode64("-_-_", 2), (std::vector<unsigned char>{0xFB}));
  EXPECT_EQ(CKRGuidBase64::Decode64("A", 1), std::vector<unsigned char>{});
  EXPECT_EQ(CKRGuidBase64::Decode64WS(L"-_-_\u00ff\u0100AA", 8), (std::vector<unsigned char>{0xFB, 0xFF, 0xBF, 0x00}));
  EXPECT_TRUE(CKRGuidBase64::Decode64(nullptr, 10).empty());
}

TEST(CKRGuid, ConstantsNeedNoStartUpCode) {
  // Literal values are compile-time constants: usable in constant
  // expressions and therefore in any static initialiser.
  static_assert(CKRGuid::Literal("3719246b-c3b0-4ae9-9723-6e998c42484a").GetGUID().Data1 == 0x3719246B);
  static_assert(CKRGuid::Literal("{3719246B-C3B0-4AE9-9723-6E998C42484A}").GetGUID().Data4[7] == 0x4A);
  EXPECT_EQ(std::hash<CKRGuid>()(kSample), std::hash<CKRGuid>()(CKRGuid(kSample.GetGUID())));
}
