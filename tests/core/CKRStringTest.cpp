#include <krCoreLib/core/CKRString.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <clocale>
#include <cstdint>
#include <limits>
#include <string>
#include <string_view>
#include <vector>

namespace {

// Decodes from a heap block of exactly the given bytes, without a terminator,
// so that the sanitizer build reports any read beyond the given length.
CKRString DecodeExact(std::string_view bytes) {
  const std::vector<char> buffer(bytes.begin(), bytes.end());
  return CKRString::FromUtf8(buffer.data(), static_cast<std::ptrdiff_t>(buffer.size()));
}

const std::string kReplacementUtf8 = "\xEF\xBF\xBD";

}  // namespace

TEST(CKRString, ConstructionFromPointers) {
  EXPECT_TRUE(CKRString(static_cast<const wchar_t*>(nullptr)).IsEmpty() && CKRString(nullptr, 5).IsEmpty());
  const CKRString withNul(L"a\0b", 3);
  EXPECT_EQ(withNul.str(), std::wstring(L"a\0b", 3));
  EXPECT_EQ(withNul.GetString()[3], L'\0');
  EXPECT_TRUE(CKRString() == static_cast<const wchar_t*>(nullptr));
  EXPECT_EQ((L"x" + (CKRString(L"ab") += static_cast<const wchar_t*>(nullptr)) + L'c' + CKRString(L"d")).str(), L"xabcd");
}

// Every scalar value, the NUL included, encodes to the number of bytes its
// range takes and decodes back.
TEST(CKRString, Utf8RoundTripsEveryScalarValue) {
  std::wstring all;
  for (char32_t value = 0; value <= 0x10FFFF; ++value)
    if (value < 0xD800 || value > 0xDFFF)
      all += static_cast<wchar_t>(value);
  const std::string encoded = CKRString(all).ToUtf8();
  EXPECT_EQ(encoded.size(), 0x80u * 1 + 0x780u * 2 + (0x10000u - 0x800u - 0x800u) * 3 + 0x100000u * 4);
  const CKRString decoded = DecodeExact(encoded);
  ASSERT_EQ(decoded.size(), all.size());
  const auto mismatch = std::mismatch(all.begin(), all.end(), decoded.str().begin());
  EXPECT_TRUE(mismatch.first == all.end()) << "first difference at U+" << std::hex << std::uint32_t(*mismatch.first);
}

TEST(CKRString, Utf8EncodesUnencodableValuesAsReplacement) {
  for (const wchar_t value : {wchar_t(0xD800), wchar_t(0xDFFF), wchar_t(0x110000), wchar_t(-1),
                              std::numeric_limits<wchar_t>::min()}) {
    SCOPED_TRACE(testing::Message() << "value " << std::hex << static_cast<std::uint32_t>(value));
    EXPECT_EQ(CKRString(std::wstring(L"a") + value + L"b").ToUtf8(), "a" + kReplacementUtf8 + "b");
  }
  // A surrogate pair is two unencodable values, not one supplementary character.
  const wchar_t pair[] = {wchar_t(0xD834), wchar_t(0xDD1E)};
  EXPECT_EQ(CKRString::ToUtf8(pair, 2), kReplacementUtf8 + kReplacementUtf8);
}

TEST(CKRString, Utf8DecodesMalformedInputPerMaximalSubpart) {
  // Note the literal splits: "\x82" "A" is two bytes, "\x82A" would be one.
  const std::pair<std::string, std::wstring> cases[] = {
      {"\xC0\x80", L"\uFFFD\uFFFD"},                           // overlong 2-byte NUL
      {"\xE0\x9F\xBF", L"\uFFFD\uFFFD\uFFFD"},                 // overlong 3-byte
      {"\xF0\x8F\xBF\xBF", L"\uFFFD\uFFFD\uFFFD\uFFFD"},       // overlong 4-byte
      {"\xED\xA0\x80", L"\uFFFD\uFFFD\uFFFD"},                 // surrogate
      {"\xF4\x90\x80\x80", L"\uFFFD\uFFFD\uFFFD\uFFFD"},       // above U+10FFFF
      {"\xF8\x88\x80\x80\x80", std::wstring(5, L'\uFFFD')},    // 5-byte form
      {"\xF5\xF6\xF7\xF8\xF9\xFA\xFB\xFC\xFD\xFE\xFF", std::wstring(11, L'\uFFFD')},
      {"a\x80\xBF" "b", L"a\uFFFD\uFFFDb"},                     // lone continuations
      {"a\xC3", L"a\uFFFD"},                                   // truncated at the end
      {"a\xE2\x82", L"a\uFFFD"},
      {"a\xF0\x9F\x98", L"a\uFFFD"},
      {"\xF0\x9F\x98" "A", L"\uFFFDA"},                         // truncated before ASCII
      {"\xC3\xC3\xA9", L"\uFFFD\u00E9"},                       // truncated before valid
      {std::string("\xE2\x82\0z", 4), std::wstring(L"\uFFFD\0z", 3)},
      {"\x61\xF1\x80\x80\xE1\x80\xC2\x62\x80\x63\x80\xBF\x64", L"a\uFFFD\uFFFD\uFFFD" L"b\uFFFDc\uFFFD\uFFFDd"},
  };
  for (const auto& [bytes, expected] : cases) {
    SCOPED_TRACE(testing::PrintToString(bytes));
    EXPECT_EQ(DecodeExact(bytes).str(), expected);
  }
  // A length that cuts a sequence short decodes only the bytes it covers.
  EXPECT_EQ(DecodeExact("\xE2\x82").str(), L"\uFFFD");
  EXPECT_EQ(CKRString::FromUtf8("\xE2\x82\xAC", 1).str(), L"\uFFFD");
}

TEST(CKRString, Utf8LengthArguments) {
  EXPECT_EQ(CKRString::FromUtf8("ab\0cd", -1).str(), L"ab");
  EXPECT_EQ(CKRString::FromUtf8(std::string_view("a\0b", 3)).str(), std::wstring(L"a\0b", 3));
  for (const std::ptrdiff_t length : {std::ptrdiff_t(0), std::ptrdiff_t(-2), PTRDIFF_MIN}) {
    SCOPED_TRACE(length);
    EXPECT_TRUE(CKRString::FromUtf8("abc", length).IsEmpty());
    EXPECT_TRUE(CKRString::ToUtf8(L"abc", length).empty());
  }
  EXPECT_TRUE(CKRString::FromUtf8(nullptr, 5).IsEmpty() && CKRString::ToUtf8(nullptr, 5).empty());
  EXPECT_EQ(CKRString::ToUtf8(L"ab\0cd", -1), "ab");
  EXPECT_EQ(CKRString(L"a\0b", 3).ToUtf8(), std::string("a\0b", 3));
}

TEST(CKRString, FormatDialect) {
  const std::pair<CKRString, std::wstring> cases[] = {
      {CKRString::Formatted(L"[%s|%ls|%ws]", L"wide", L"l", L"w"), L"[wide|l|w]"},
      {CKRString::Formatted(L"%s", L"Gr\u00FC\u00DFe \u20AC\U0001D11E"), L"Gr\u00FC\u00DFe \u20AC\U0001D11E"},
      {CKRString::Formatted(L"[%hs|%S]", "narrow", "too"), L"[narrow|too]"},
      {CKRString::Formatted(L"%c%c%C%hc", L'x', L'\u20AC', 'n', 'h'), L"x\u20ACnh"},
      {CKRString::Formatted(L"%I64d/%d", std::numeric_limits<std::int64_t>::min(), 7), L"-9223372036854775808/7"},
      {CKRString::Formatted(L"%I64u %I64x", std::numeric_limits<std::uint64_t>::max(), std::uint64_t(0xFEDCBA9876543210)),
       L"18446744073709551615 fedcba9876543210"},
      {CKRString::Formatted(L"%2$s %1$hs %3$d%%", "world", L"hello", 5), L"hello world 5%"},
      {CKRString::Formatted(L"[%-6s|%4hs|%.3s]", L"ab", "cd", L"efghi"), L"[ab    |  cd|efg]"},
      {CKRString::Formatted(L"[%*d|%5.2f|%05d %+d %#X]", 4, 42, 3.14159, 42, 3, 255), L"[  42| 3.14|00042 +3 0XFF]"},
      {CKRString::Formatted(L""), L""},
  };
  for (const auto& [actual, expected] : cases) {
    SCOPED_TRACE(testing::PrintToString(expected));
    EXPECT_EQ(actual.str(), expected);
  }
  CKRString text(L"old content");
  text.Format(L"%d-%s", 1, L"one");
  text.AppendFormat(L"+%hs", "two");
  EXPECT_EQ(text.str(), L"1-one+two");
}

// Narrow text is UTF-8 whatever the locale: in "C", as in a program that
// never called setlocale, and in a German locale whose numbers stay German.
TEST(CKRString, FormatReadsNarrowTextAsUtf8InEveryLocale) {
  const std::string saved = std::setlocale(LC_ALL, nullptr);
  for (const char* locale : {"C", "de_DE.UTF-8"}) {
    if (std::setlocale(LC_ALL, locale) == nullptr) {
      ADD_FAILURE() << "locale " << locale << " is missing (the set-up script generates it)";
      continue;
    }
    SCOPED_TRACE(locale);
    EXPECT_EQ(CKRString::Formatted(L"%hs|%S|%C", "\xC2\xB5m", "Gr\xC3\xBC\xC3\x9F\xE2\x82\xAC", 'x').str(),
              L"\u00B5m|Gr\u00FC\u00DF\u20AC|x");
    // Only the character type changes for the call.
    const bool german = std::string(locale) != "C";
    EXPECT_EQ(CKRString::Formatted(L"%.1f %hs", 1.5, "\xC3\xA4").str(), german ? L"1,5 \u00E4" : L"1.5 \u00E4");
    // Ill-formed narrow text ends the output there.
    EXPECT_EQ(CKRString::Formatted(L"a%hsb", "\xFF").str().substr(0, 1), L"a");
  }
  std::setlocale(LC_ALL, saved.c_str());
}

TEST(CKRString, FormatProducesLongOutputCompletely) {
  // Around and far beyond the size of the first formatting attempt.
  for (const std::size_t length : {511u, 512u, 513u, 100000u}) {
    SCOPED_TRACE(testing::Message() << "length " << length);
    const std::wstring body(length, L'x');
    // Arguments after the long one still line up.
    EXPECT_EQ(CKRString::Formatted(L"%s|%d|%hs|%I64d", body.c_str(), 42, "n", std::int64_t(-5)).str(),
              body + L"|42|n|-5");
    EXPECT_EQ(CKRString::Formatted(body.c_str()).str(), body);
    CKRString appended(L"head:");
    appended.AppendFormat(L"%s", body.c_str());
    EXPECT_EQ(appended.str(), L"head:" + body);
  }
  EXPECT_EQ(CKRString::Formatted(L"%600d", 7).str(), std::wstring(599, L' ') + L"7");
  const std::wstring wide(700, L'\u20AC');
  EXPECT_EQ(CKRString::Formatted(L"%2$s%1$hs", "!", wide.c_str()).str(), wide + L"!");
}

TEST(CKRString, SubstringsClampTheirArguments) {
  const CKRString text(L"abcdef");
  const std::pair<CKRString, const wchar_t*> cases[] = {
      {text.Left(3), L"abc"},           {text.Left(100), L"abcdef"},    {text.Left(-1), L""},
      {text.Left(INT_MIN), L""},        {text.Right(2), L"ef"},         {text.Right(100), L"abcdef"},
      {text.Right(INT_MIN), L""},       {text.Mid(2), L"cdef"},         {text.Mid(2, 2), L"cd"},
      {text.Mid(2, -1), L"cdef"},       {text.Mid(4, INT_MAX), L"ef"},  {text.Mid(-3, 2), L"ab"},
      {text.Mid(INT_MIN), L"abcdef"},   {text.Mid(6), L""},             {text.Mid(INT_MAX, INT_MAX), L""},
      {CKRString().Mid(1, 3), L""},     {CKRString().Right(3), L""},
  };
  for (const auto& [actual, expected] : cases) {
    SCOPED_TRACE(testing::PrintToString(std::wstring(expected)));
    EXPECT_EQ(actual.str(), expected);
  }
  EXPECT_EQ(CKRString(L"a\0b\0", 4).Right(3).str(), std::wstring(L"\0b\0", 3));
  EXPECT_EQ(CKRString(L"ab\0c", 4).GetAt(3), L'c');
  for (const int index : {-1, 4, INT_MAX, INT_MIN})
    EXPECT_EQ(CKRString(L"ab\0c", 4).GetAt(index), L'\0') << index;
}

TEST(CKRString, Find) {
  const CKRString text(L"abcabc");
  const std::pair<int, int> cases[] = {
      {text.Find(L"bc", 2), 4},    {text.Find(L"bc", 5), -1},  {text.Find(L"abc", 3), 3},   {text.Find(L"abcabca"), -1},
      {text.Find(L"a", 100), -1},  {text.Find(static_cast<const wchar_t*>(nullptr)), -1},   {text.Find(L'c', 3), 5},
      {text.Find(L'a', 6), -1},    {text.Find(L'a', 100), -1}, {CKRString(L"a\0b", 3).Find(L'b'), 2},
  };
  for (std::size_t i = 0; i < std::size(cases); ++i)
    EXPECT_EQ(cases[i].first, cases[i].second) << "case " << i;
}

TEST(CKRString, ReplaceTrimAndCaseMapping) {
  struct Case {
    const wchar_t *text, *from, *to;
    int count;
    const wchar_t* expected;
  };
  const Case cases[] = {
      {L"a-b-c", L"-", L"<->", 2, L"a<->b<->c"}, {L"a-b-c", L"-", L"", 2, L"abc"}, {L"aaaaa", L"aa", L"b", 2, L"bba"},
      {L"ab", L"a", L"aa", 1, L"aab"},           {L"abc", L"abc", L"", 1, L""},    {L"abc", L"abcd", L"y", 0, L"abc"},
      {L"", L"a", L"b", 0, L""},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(testing::Message() << "\"" << c.text << "\": \"" << c.from << "\" -> \"" << c.to << "\"");
    CKRString text(c.text);
    EXPECT_EQ(text.Replace(c.from, c.to), c.count);
    EXPECT_EQ(text.str(), c.expected);
  }
  for (const auto& [text, expected] : {std::pair{L"  \t a b \r\n", L"a b"}, {L" \t\r\n\v\f", L""}, {L"x", L"x"}})
    EXPECT_EQ(CKRString(text).Trim().str(), expected);
  CKRString text(L"@AZ[`az{ 09_ \u00E4\u00C4\u00DF\u03B1\u0391");
  EXPECT_EQ(text.MakeUpper().str(), L"@AZ[`AZ{ 09_ \u00E4\u00C4\u00DF\u03B1\u0391");
  EXPECT_EQ(text.MakeLower().str(), L"@az[`az{ 09_ \u00E4\u00C4\u00DF\u03B1\u0391");
}

TEST(CKRString, Compare) {
  struct Case {
    const wchar_t *left, *right;
    int ordinal, noCase;
  };
  const Case cases[] = {
      {L"abc", L"abd", -1, -1}, {L"abc", L"ab", 1, 1}, {L"ABC", L"abc", -1, 0}, {L"B", L"a", -1, 1}, {L"_", L"a", -1, -1},
      {L"_", L"A", 1, -1}, {L"\u00E4", L"\u00C4", 1, 1}, {L"", nullptr, 0, 0}, {L"a", nullptr, 1, 1}, {L"", L"a", -1, -1},
  };
  auto sign = [](int value) { return (value > 0) - (value < 0); };
  for (const Case& c : cases) {
    SCOPED_TRACE(testing::Message() << "\"" << c.left << "\" vs \"" << (c.right != nullptr ? c.right : L"(null)") << "\"");
    EXPECT_EQ(sign(CKRString(c.left).Compare(c.right)), c.ordinal);
    EXPECT_EQ(sign(CKRString(c.left).CompareNoCase(c.right)), c.noCase);
  }
}
