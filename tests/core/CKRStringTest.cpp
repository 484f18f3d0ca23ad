#include <krCoreLib/core/CKRString.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <string>
#include <string_view>
#include <vector>

namespace {

// The bytes in a heap block of exactly their size, without a terminator, so
// that the sanitizer build reports any read beyond the given length.
std::vector<char> ExactBytes(std::string_view bytes) {
  return std::vector<char>(bytes.begin(), bytes.end());
}

CKRString DecodeExact(std::string_view bytes) {
  const std::vector<char> buffer = ExactBytes(bytes);
  return CKRString::FromUtf8(buffer.data(), static_cast<std::ptrdiff_t>(buffer.size()));
}

bool IsSurrogate(char32_t value) {
  return value >= 0xD800 && value <= 0xDFFF;
}

std::size_t Utf8Length(char32_t value) {
  return value < 0x80 ? 1 : value < 0x800 ? 2 : value < 0x10000 ? 3 : 4;
}

const std::string kReplacementUtf8 = "\xEF\xBF\xBD";

}  // namespace

TEST(CKRString, ConstructionFromPointers) {
  EXPECT_TRUE(CKRString(static_cast<const wchar_t*>(nullptr)).IsEmpty());
  EXPECT_TRUE(CKRString(nullptr, 5).IsEmpty());

  const CKRString withNul(L"a\0b", 3);
  EXPECT_EQ(withNul.GetLength(), 3);
  EXPECT_EQ(withNul.str(), std::wstring(L"a\0b", 3));
  EXPECT_EQ(withNul.GetString()[3], L'\0');

  CKRString text(L"ab");
  text += static_cast<const wchar_t*>(nullptr);
  EXPECT_EQ(text.str(), L"ab");
  EXPECT_TRUE(CKRString() == static_cast<const wchar_t*>(nullptr));
  EXPECT_EQ((L"x" + text + L'c' + CKRString(L"d")).str(), L"xabcd");
}

TEST(CKRString, Utf8EncodesBoundaryValuesExactly) {
  struct Case {
    char32_t value;
    std::string bytes;
  };
  const Case cases[] = {
      {0x0000, std::string(1, '\0')},
      {0x0041, "A"},
      {0x007F, "\x7F"},
      {0x0080, "\xC2\x80"},
      {0x00E9, "\xC3\xA9"},
      {0x07FF, "\xDF\xBF"},
      {0x0800, "\xE0\xA0\x80"},
      {0x20AC, "\xE2\x82\xAC"},
      {0xD7FF, "\xED\x9F\xBF"},
      {0xE000, "\xEE\x80\x80"},
      {0xFFFD, "\xEF\xBF\xBD"},
      {0xFFFF, "\xEF\xBF\xBF"},
      {0x10000, "\xF0\x90\x80\x80"},
      {0x1D11E, "\xF0\x9D\x84\x9E"},
      {0x10FFFF, "\xF4\x8F\xBF\xBF"},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(testing::Message() << "U+" << std::hex << std::uint32_t(c.value));
    const wchar_t character = static_cast<wchar_t>(c.value);
    EXPECT_EQ(CKRString::ToUtf8(&character, 1), c.bytes);
    EXPECT_EQ(CKRString(1, character).ToUtf8(), c.bytes);
    EXPECT_EQ(DecodeExact(c.bytes).str(), std::wstring(1, character));
  }
}

TEST(CKRString, Utf8RoundTripsEveryScalarValue) {
  // Every scalar value on its own...
  int failures = 0;
  for (char32_t value = 0; value <= 0x10FFFF && failures < 10; ++value) {
    if (IsSurrogate(value))
      continue;
    const wchar_t character = static_cast<wchar_t>(value);
    const std::string encoded = CKRString::ToUtf8(&character, 1);
    const CKRString decoded = CKRString::FromUtf8(encoded.data(), static_cast<std::ptrdiff_t>(encoded.size()));
    if (encoded.size() != Utf8Length(value) || decoded.str() != std::wstring(1, character)) {
      ADD_FAILURE() << "U+" << std::hex << std::uint32_t(value) << " encodes to " << encoded.size()
                    << " bytes and decodes to " << decoded.GetLength() << " characters";
      ++failures;
    }
  }

  // ...and all of them in one text, the NUL included.
  std::wstring all;
  for (char32_t value = 0; value <= 0x10FFFF; ++value)
    if (!IsSurrogate(value))
      all += static_cast<wchar_t>(value);
  const std::string encoded = CKRString(all).ToUtf8();
  EXPECT_EQ(encoded.size(), 0x80u * 1 + 0x780u * 2 + (0x10000u - 0x800u - 0x800u) * 3 + 0x100000u * 4);
  const std::vector<char> buffer = ExactBytes(encoded);
  const CKRString decoded = CKRString::FromUtf8(buffer.data(), static_cast<std::ptrdiff_t>(buffer.size()));
  ASSERT_EQ(decoded.size(), all.size());
  const auto mismatch = std::mismatch(all.begin(), all.end(), decoded.str().begin());
  EXPECT_TRUE(mismatch.first == all.end())
      << "first difference at U+" << std::hex << std::uint32_t(*mismatch.first);
  EXPECT_EQ(CKRString::FromUtf8(std::string_view(encoded)).str(), all);
}

TEST(CKRString, Utf8EncodesUnencodableValuesAsReplacement) {
  const wchar_t values[] = {
      static_cast<wchar_t>(0xD800),   static_cast<wchar_t>(0xDBFF), static_cast<wchar_t>(0xDC00),
      static_cast<wchar_t>(0xDFFF),   static_cast<wchar_t>(0x110000), static_cast<wchar_t>(0x7FFFFFFF),
      static_cast<wchar_t>(-1),       std::numeric_limits<wchar_t>::min(),
  };
  for (const wchar_t value : values) {
    SCOPED_TRACE(testing::Message() << "value " << std::hex << static_cast<std::uint32_t>(value));
    EXPECT_EQ(CKRString::ToUtf8(&value, 1), kReplacementUtf8);
    const std::wstring text = std::wstring(L"a") + value + L"b";
    EXPECT_EQ(CKRString(text).ToUtf8(), "a" + kReplacementUtf8 + "b");
  }
  // A surrogate pair is two unencodable values, not one supplementary character.
  const wchar_t pair[] = {static_cast<wchar_t>(0xD834), static_cast<wchar_t>(0xDD1E)};
  EXPECT_EQ(CKRString::ToUtf8(pair, 2), kReplacementUtf8 + kReplacementUtf8);
}

TEST(CKRString, Utf8DecodesMalformedInputPerMaximalSubpart) {
  // Note the literal splits: "\x82" "A" is two bytes, "\x82A" would be one.
  struct Case {
    const char* what;
    std::string bytes;
    std::wstring expected;
  };
  const Case cases[] = {
      {"overlong 2-byte NUL", "\xC0\x80", L"\uFFFD\uFFFD"},
      {"overlong 2-byte", "\xC1\xBF", L"\uFFFD\uFFFD"},
      {"overlong 3-byte NUL", "\xE0\x80\x80", L"\uFFFD\uFFFD\uFFFD"},
      {"overlong 3-byte", "\xE0\x9F\xBF", L"\uFFFD\uFFFD\uFFFD"},
      {"overlong 4-byte", "\xF0\x80\x80\x80", L"\uFFFD\uFFFD\uFFFD\uFFFD"},
      {"overlong 4-byte top", "\xF0\x8F\xBF\xBF", L"\uFFFD\uFFFD\uFFFD\uFFFD"},
      {"high surrogate", "\xED\xA0\x80", L"\uFFFD\uFFFD\uFFFD"},
      {"low surrogate", "\xED\xBF\xBF", L"\uFFFD\uFFFD\uFFFD"},
      {"above U+10FFFF", "\xF4\x90\x80\x80", L"\uFFFD\uFFFD\uFFFD\uFFFD"},
      {"lead F5", "\xF5\x80\x80\x80", L"\uFFFD\uFFFD\uFFFD\uFFFD"},
      {"5-byte form", "\xF8\x88\x80\x80\x80", L"\uFFFD\uFFFD\uFFFD\uFFFD\uFFFD"},
      {"bytes F5..FF", "\xF5\xF6\xF7\xF8\xF9\xFA\xFB\xFC\xFD\xFE\xFF", std::wstring(11, L'\uFFFD')},
      {"lone continuation", "\x80", L"\uFFFD"},
      {"lone continuations", "a\x80\xBF" "b", L"a\uFFFD\uFFFDb"},
      {"truncated 2-byte at end", "a\xC3", L"a\uFFFD"},
      {"truncated 3-byte at end", "a\xE2\x82", L"a\uFFFD"},
      {"3-byte lead at end", "\xE2", L"\uFFFD"},
      {"truncated 4-byte at end", "a\xF0\x9F\x98", L"a\uFFFD"},
      {"4-byte lead at end", "\xF4", L"\uFFFD"},
      {"truncated 3-byte before ASCII", "\xE2\x82" "A", L"\uFFFDA"},
      {"truncated 4-byte before ASCII", "\xF0\x9F\x98" "A", L"\uFFFDA"},
      {"truncated 2-byte before valid", "\xC3\xC3\xA9", L"\uFFFD\u00E9"},
      {"truncated before NUL", std::string("\xE2\x82\0z", 4), std::wstring(L"\uFFFD\0z", 3)},
      {"mixed", "\x61\xF1\x80\x80\xE1\x80\xC2\x62\x80\x63\x80\xBF\x64",
       L"a\uFFFD\uFFFD\uFFFD" L"b\uFFFDc\uFFFD\uFFFDd"},
      {"valid U+0800", "\xE0\xA0\x80", L"\u0800"},
      {"valid U+D7FF", "\xED\x9F\xBF", L"\uD7FF"},
      {"valid U+E000", "\xEE\x80\x80", L"\uE000"},
      {"valid U+10000", "\xF0\x90\x80\x80", L"\U00010000"},
      {"valid U+10FFFF", "\xF4\x8F\xBF\xBF", L"\U0010FFFF"},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.what);
    EXPECT_EQ(DecodeExact(c.bytes).str(), c.expected);
    const std::vector<char> buffer = ExactBytes(c.bytes);
    EXPECT_EQ(CKRString::FromUtf8(std::string_view(buffer.data(), buffer.size())).str(), c.expected);
  }

  // A length that cuts a sequence short decodes only the bytes it covers.
  const std::vector<char> euro = ExactBytes("\xE2\x82\xAC");
  EXPECT_EQ(CKRString::FromUtf8(euro.data(), 2).str(), L"\uFFFD");
  EXPECT_EQ(CKRString::FromUtf8(euro.data(), 1).str(), L"\uFFFD");
  EXPECT_EQ(CKRString::FromUtf8(euro.data(), 3).str(), L"\u20AC");
}

TEST(CKRString, Utf8LengthArguments) {
  const std::vector<char> withNul = ExactBytes(std::string_view("a\0b", 3));
  EXPECT_EQ(CKRString::FromUtf8("ab\0cd", -1).str(), L"ab");
  EXPECT_EQ(CKRString::FromUtf8("abc").str(), L"abc");
  EXPECT_EQ(CKRString::FromUtf8(withNul.data(), 3).str(), std::wstring(L"a\0b", 3));
  EXPECT_EQ(CKRString::FromUtf8(std::string_view("a\0b", 3)).str(), std::wstring(L"a\0b", 3));
  EXPECT_TRUE(CKRString::FromUtf8(withNul.data(), 0).IsEmpty());
  EXPECT_TRUE(CKRString::FromUtf8(withNul.data(), -2).IsEmpty());
  EXPECT_TRUE(CKRString::FromUtf8(withNul.data(), PTRDIFF_MIN).IsEmpty());
  EXPECT_TRUE(CKRString::FromUtf8(nullptr).IsEmpty());
  EXPECT_TRUE(CKRString::FromUtf8(nullptr, 5).IsEmpty());

  EXPECT_EQ(CKRString::ToUtf8(L"ab\0cd", -1), "ab");
  EXPECT_EQ(CKRString::ToUtf8(L"a\0b", 3), std::string("a\0b", 3));
  EXPECT_EQ(CKRString(L"a\0b", 3).ToUtf8(), std::string("a\0b", 3));
  EXPECT_TRUE(CKRString::ToUtf8(L"abc", 0).empty());
  EXPECT_TRUE(CKRString::ToUtf8(L"abc", -2).empty());
  EXPECT_TRUE(CKRString::ToUtf8(L"abc", PTRDIFF_MIN).empty());
  EXPECT_TRUE(CKRString::ToUtf8(nullptr).empty());
  EXPECT_TRUE(CKRString::ToUtf8(nullptr, 5).empty());
}

TEST(CKRString, FormatDialect) {
  struct Case {
    const char* what;
    CKRString actual;
    std::wstring expected;
  };
  const std::int64_t minimum = std::numeric_limits<std::int64_t>::min();
  const Case cases[] = {
      {"%s is wide", CKRString::Formatted(L"[%s]", L"wide"), L"[wide]"},
      {"%s non-ASCII", CKRString::Formatted(L"%s", L"Gr\u00FC\u00DFe \u20AC\U0001D11E"),
       L"Gr\u00FC\u00DFe \u20AC\U0001D11E"},
      {"%hs is narrow", CKRString::Formatted(L"[%hs]", "narrow"), L"[narrow]"},
      {"%S is narrow", CKRString::Formatted(L"[%S]", "narrow"), L"[narrow]"},
      {"%ls is wide", CKRString::Formatted(L"[%ls]", L"wide"), L"[wide]"},
      {"%ws is wide", CKRString::Formatted(L"[%ws]", L"wide"), L"[wide]"},
      {"%c is wide", CKRString::Formatted(L"%c%c", L'x', L'\u20AC'), L"x\u20AC"},
      {"%C is narrow", CKRString::Formatted(L"%C", 'n'), L"n"},
      {"%hc is narrow", CKRString::Formatted(L"%hc", 'n'), L"n"},
      {"%I64d minimum", CKRString::Formatted(L"%I64d", minimum), L"-9223372036854775808"},
      {"%I64d then int", CKRString::Formatted(L"%I64d/%d", std::int64_t(1) << 40, 7), L"1099511627776/7"},
      {"%I64u", CKRString::Formatted(L"%I64u", std::numeric_limits<std::uint64_t>::max()),
       L"18446744073709551615"},
      {"%I64x", CKRString::Formatted(L"%I64x", std::uint64_t(0xFEDCBA9876543210)), L"fedcba9876543210"},
      {"%%", CKRString::Formatted(L"100%% of %d%%", 5), L"100% of 5%"},
      {"positional", CKRString::Formatted(L"%2$s %1$s", L"world", L"hello"), L"hello world"},
      {"positional narrow", CKRString::Formatted(L"%1$s=%2$hs", L"key", "value"), L"key=value"},
      {"left aligned", CKRString::Formatted(L"[%-14s]", L"CKRShape"), L"[CKRShape      ]"},
      {"right aligned narrow", CKRString::Formatted(L"[%8hs]", "ab"), L"[      ab]"},
      {"precision", CKRString::Formatted(L"[%5.2f]", 3.14159), L"[ 3.14]"},
      {"string precision", CKRString::Formatted(L"[%.3s]", L"abcdef"), L"[abc]"},
      {"star width", CKRString::Formatted(L"[%*d]", 6, 42), L"[    42]"},
      {"star left", CKRString::Formatted(L"[%-*d]", 4, 7), L"[7   ]"},
      {"flags", CKRString::Formatted(L"%05d %+d %x %#X", 42, 3, 255, 255), L"00042 +3 ff 0XFF"},
      {"library warning",
       CKRString::Formatted(L"Warning! %d instances of class %s were not released\n", 2, L"CKRShape"),
       L"Warning! 2 instances of class CKRShape were not released\n"},
      {"no conversions", CKRString::Formatted(L"plain text"), L"plain text"},
      {"empty", CKRString::Formatted(L""), L""},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.what);
    EXPECT_EQ(c.actual.str(), c.expected);
  }
}

TEST(CKRString, FormatReplacesAndAppendFormatAppends) {
  CKRString text(L"old content");
  text.Format(L"%d-%s", 1, L"one");
  EXPECT_EQ(text.str(), L"1-one");
  text.AppendFormat(L"+%hs%c", "two", L'!');
  EXPECT_EQ(text.str(), L"1-one+two!");
  text.AppendFormat(L"");
  EXPECT_EQ(text.str(), L"1-one+two!");
}

TEST(CKRString, FormatProducesLongOutputCompletely) {
  // Around and far beyond the size of the first formatting attempt.
  for (const std::size_t length : {510u, 511u, 512u, 513u, 1000u, 100000u}) {
    SCOPED_TRACE(testing::Message() << "length " << length);
    const std::wstring body(length, L'x');
    EXPECT_EQ(CKRString::Formatted(L"%s", body.c_str()).str(), body);
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
  struct Case {
    const char* what;
    CKRString actual;
    const wchar_t* expected;
  };
  const Case cases[] = {
      {"Left(3)", text.Left(3), L"abc"},
      {"Left(0)", text.Left(0), L""},
      {"Left(6)", text.Left(6), L"abcdef"},
      {"Left(100)", text.Left(100), L"abcdef"},
      {"Left(-1)", text.Left(-1), L""},
      {"Left(INT_MIN)", text.Left(INT_MIN), L""},
      {"Right(2)", text.Right(2), L"ef"},
      {"Right(0)", text.Right(0), L""},
      {"Right(100)", text.Right(100), L"abcdef"},
      {"Right(-1)", text.Right(-1), L""},
      {"Right(INT_MIN)", text.Right(INT_MIN), L""},
      {"Mid(2)", text.Mid(2), L"cdef"},
      {"Mid(2, 2)", text.Mid(2, 2), L"cd"},
      {"Mid(2, -1)", text.Mid(2, -1), L"cdef"},
      {"Mid(0, 0)", text.Mid(0, 0), L""},
      {"Mid(4, 100)", text.Mid(4, 100), L"ef"},
      {"Mid(4, INT_MAX)", text.Mid(4, INT_MAX), L"ef"},
      {"Mid(-3, 2)", text.Mid(-3, 2), L"ab"},
      {"Mid(INT_MIN)", text.Mid(INT_MIN), L"abcdef"},
      {"Mid(6)", text.Mid(6), L""},
      {"Mid(100, 5)", text.Mid(100, 5), L""},
      {"Mid(INT_MAX, INT_MAX)", text.Mid(INT_MAX, INT_MAX), L""},
      {"empty Left", CKRString().Left(3), L""},
      {"empty Right", CKRString().Right(3), L""},
      {"empty Mid", CKRString().Mid(1, 3), L""},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.what);
    EXPECT_EQ(c.actual.str(), c.expected);
  }
  EXPECT_EQ(CKRString(L"a\0b\0", 4).Right(3).str(), std::wstring(L"\0b\0", 3));
}

TEST(CKRString, GetAtOutOfRangeGivesNul) {
  const CKRString text(L"ab\0c", 4);
  EXPECT_EQ(text.GetAt(0), L'a');
  EXPECT_EQ(text.GetAt(3), L'c');
  for (const int index : {-1, 4, 5, INT_MAX, INT_MIN}) {
    SCOPED_TRACE(index);
    EXPECT_EQ(text.GetAt(index), L'\0');
  }
  EXPECT_EQ(CKRString().GetAt(0), L'\0');
}

TEST(CKRString, Find) {
  const CKRString text(L"abcabc");
  struct Case {
    const char* what;
    int actual;
    int expected;
  };
  const Case cases[] = {
      {"text", text.Find(L"bc"), 1},
      {"text from start", text.Find(L"bc", 1), 1},
      {"text after start", text.Find(L"bc", 2), 4},
      {"text too late", text.Find(L"bc", 5), -1},
      {"text at end", text.Find(L"abc", 3), 3},
      {"text missing", text.Find(L"cb"), -1},
      {"text longer than string", text.Find(L"abcabca"), -1},
      {"text start beyond end", text.Find(L"a", 100), -1},
      {"null text", text.Find(static_cast<const wchar_t*>(nullptr)), -1},
      {"character", text.Find(L'c'), 2},
      {"character after start", text.Find(L'c', 3), 5},
      {"character at end", text.Find(L'a', 6), -1},
      {"character beyond end", text.Find(L'a', 100), -1},
      {"character missing", text.Find(L'z'), -1},
      {"empty string", CKRString().Find(L'a'), -1},
      {"character after NUL", CKRString(L"a\0b", 3).Find(L'b'), 2},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.what);
    EXPECT_EQ(c.actual, c.expected);
  }
}

TEST(CKRString, ReplaceEveryOccurrence) {
  struct Case {
    const wchar_t* text;
    const wchar_t* from;
    const wchar_t* to;
    int count;
    const wchar_t* expected;
  };
  const Case cases[] = {
      {L"a-b-c", L"-", L"+", 2, L"a+b+c"},
      {L"a-b-c", L"-", L"", 2, L"abc"},
      {L"a-b-c", L"-", L"<->", 2, L"a<->b<->c"},
      {L"aaaaa", L"aa", L"b", 2, L"bba"},
      {L"ab", L"a", L"aa", 1, L"aab"},
      {L"abcabc", L"abc", L"x", 2, L"xx"},
      {L"abc", L"abc", L"", 1, L""},
      {L"abc", L"x", L"y", 0, L"abc"},
      {L"abc", L"abcd", L"y", 0, L"abc"},
      {L"", L"a", L"b", 0, L""},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(testing::Message() << "\"" << c.text << "\": \"" << c.from << "\" -> \"" << c.to << "\"");
    CKRString text(c.text);
    EXPECT_EQ(text.Replace(c.from, c.to), c.count);
    EXPECT_EQ(text.str(), c.expected);
  }
}

TEST(CKRString, TrimRemovesOuterWhitespace) {
  struct Case {
    const wchar_t* text;
    const wchar_t* expected;
  };
  const Case cases[] = {
      {L"  \t a b \r\n", L"a b"}, {L"abc", L"abc"}, {L" \t\r\n\v\f", L""},
      {L"", L""},                  {L"x ", L"x"},    {L" x", L"x"},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(testing::Message() << "\"" << c.text << "\"");
    CKRString text(c.text);
    EXPECT_EQ(text.Trim().str(), c.expected);
  }
}

TEST(CKRString, CaseMappingTouchesAsciiLettersOnly) {
  CKRString text(L"@AZ[`az{ 09_ \u00E4\u00C4\u00DF\u03B1\u0391");
  EXPECT_EQ(text.MakeUpper().str(), L"@AZ[`AZ{ 09_ \u00E4\u00C4\u00DF\u03B1\u0391");
  EXPECT_EQ(text.MakeLower().str(), L"@az[`az{ 09_ \u00E4\u00C4\u00DF\u03B1\u0391");
}

TEST(CKRString, Compare) {
  struct Case {
    const wchar_t* left;
    const wchar_t* right;
    int ordinal;
    int noCase;
  };
  const Case cases[] = {
      {L"abc", L"abc", 0, 0},
      {L"abc", L"abd", -1, -1},
      {L"abd", L"abc", 1, 1},
      {L"ab", L"abc", -1, -1},
      {L"abc", L"ab", 1, 1},
      {L"ABC", L"abc", -1, 0},
      {L"abc", L"ABD", 1, -1},
      {L"B", L"a", -1, 1},
      {L"_", L"a", -1, -1},
      {L"_", L"A", 1, -1},
      {L"\u00E4", L"\u00C4", 1, 1},
      {L"", nullptr, 0, 0},
      {L"a", nullptr, 1, 1},
      {L"", L"a", -1, -1},
  };
  auto sign = [](int value) { return (value > 0) - (value < 0); };
  for (const Case& c : cases) {
    SCOPED_TRACE(testing::Message() << "\"" << c.left << "\" vs \"" << (c.right != nullptr ? c.right : L"(null)")
                                    << "\"");
    const CKRString left(c.left);
    EXPECT_EQ(sign(left.Compare(c.right)), c.ordinal);
    EXPECT_EQ(sign(left.CompareNoCase(c.right)), c.noCase);
  }
}
