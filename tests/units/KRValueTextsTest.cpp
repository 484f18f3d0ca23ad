// Text forms of the small engineering values: tokenizer, URL encoding,
// precision, ranged values, colours and option sets.
#include <krCoreLib/units/CKRColor.h>
#include <krCoreLib/units/CKROptionSet.h>
#include <krCoreLib/units/CKRPrecision.h>
#include <krCoreLib/units/CKRRangedT.h>
#include <krCoreLib/units/CKRTokenizer.h>

#include "KRGermanLocale.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <string>
#include <vector>

namespace {

std::vector<std::wstring> Fields(const wchar_t* text, const wchar_t* delimiters) {
  CKRTokenizer tokenizer(text, delimiters);
  std::vector<std::wstring> fields;
  for (CKRString field; tokenizer.Next(field);)
    fields.push_back(field.str());
  return fields;
}

}  // namespace

TEST(CKRTokenizer, KeepsEmptyFields) {
  EXPECT_EQ(Fields(L"1,,3", L","), (std::vector<std::wstring>{L"1", L"", L"3"}));
  EXPECT_EQ(Fields(L",a,", L","), (std::vector<std::wstring>{L"", L"a"}));  // no trailing field
  EXPECT_EQ(Fields(L"a,1#b", L"#,"), (std::vector<std::wstring>{L"a", L"1", L"b"}));
  EXPECT_TRUE(Fields(L"", L",").empty());
  CKRTokenizer tokenizer(L"x,y,z", L",");
  CKRString token;
  ASSERT_TRUE(tokenizer.Next(token));
  EXPECT_EQ(tokenizer.Tail(), L"y,z");
}

TEST(CKRUrlEncode, EscapesAllButLettersAndDigits) {
  EXPECT_EQ(CKRUrlEncode::Encode(L"a b/c"), L"a+b%2Fc");
  EXPECT_EQ(CKRUrlEncode::Encode(L"Az09_-.\t"), L"Az09%5F%2D%2E+");
  EXPECT_EQ(CKRUrlEncode::Encode(L"\u00e4\u00b0"), L"\u00e4%B0");  // up to U+00FF: its own code
  EXPECT_EQ(CKRUrlEncode::Encode(L"\u20ac\u0416"), L"%E2%82%AC%D0%96");  // beyond: UTF-8 bytes
  EXPECT_EQ(CKRUrlEncode::Encode(std::wstring(1, L'\0')), L"%00");
}

TEST(CKRPrecision, FormatsWithTheProcessWideSettings) {
  EXPECT_EQ(CKRPrecision::GetFormatString(), L"%.3f");
  EXPECT_EQ(CKRPrecision::FormatNumber(2.5), L"2.500");
  CKRPrecision::m_bRemoveTrailingZeros = true;
  CKRPrecision::m_iDecimalPlaces = 5;
  EXPECT_EQ(CKRPrecision::GetFormatString(), L"%.5g");
  EXPECT_EQ(CKRPrecision::FormatNumber(2.5), L"2.5");
  CKRPrecision::m_iDecimalPlaces = -4;  // counts as 0
  EXPECT_EQ(CKRPrecision::GetFormatString(), L"%.0g");
  CKRPrecision::m_bRemoveTrailingZeros = false;
  EXPECT_EQ(CKRPrecision::FormatNumber(2.7), L"3");
  CKRPrecision::m_iDecimalPlaces = 3;
  CKRGermanLocale german;
  EXPECT_EQ(CKRPrecision::FormatNumber(-0.125), L"-0.125");
}

TEST(CKRRangedT, IntegerTextForm) {
  CKRRangedT<int> ranged;
  EXPECT_EQ(ranged.ToString(), L"-2147483648,2147483647,0");
  ranged.FromString(L" 1,10,5 ");
  EXPECT_EQ(ranged.ToString(), L"1,10,5");
  ranged.FromString(L"2,,3,4,9");  // empty keeps; the last value field wins
  EXPECT_EQ(ranged, CKRRangedT<int>(2, 10, 9));
  ranged.FromString(L"x,99999999999,-7");  // no number reads 0; too large saturates
  EXPECT_EQ(ranged, CKRRangedT<int>(0, 2147483647, -7));
}

TEST(CKRRangedT, DoubleTextFormKeepsDoublePrecision) {
  CKRRangedT<double> ranged;
  ranged.FromString(L"0.1,1,2");
  EXPECT_EQ(ranged, CKRRangedT<double>(0.1, 1, 2));  // not rounded to 0.1f: a range reads back as written
  EXPECT_EQ(ranged.ToString(), L"0.100000,1.000000,2.000000");

  // The default range survives its own text form.
  CKRRangedT<double> defaults;
  defaults.FromString(defaults.ToString());
  EXPECT_EQ(defaults, CKRRangedT<double>());
  ranged.FromString(L"5000000.123456,0,0");
  EXPECT_EQ(ranged.GetMin(), 5000000.123456);
  ranged.FromString(L"nan,inf,-1e-50");
  EXPECT_TRUE(std::isnan(ranged.GetMin()));
  EXPECT_TRUE(std::isinf(ranged.GetMax()));
  EXPECT_EQ(ranged.GetValue(), -1e-50);

  CKRGermanLocale german;
  ranged.Set(-1.5, 0.25, 3.0);
  EXPECT_EQ(ranged.ToString(), L"-1.500000,0.250000,3.000000");
  CKRRangedT<double> back;
  back.FromString(ranged.ToString());
  EXPECT_EQ(back, ranged);
}

TEST(CKRColor, ComponentsAndTextForm) {
  const CKRColor red(255, 0, 0);
  EXPECT_EQ(red.Color(), 0x0000FFu);
  const CKRColor blue(0x00FF0000u);
  EXPECT_EQ(blue.blue(), 255);
  EXPECT_EQ(CKRColor(1, 2, 3).GetStringValue(), L"1,2,3");
  EXPECT_EQ(CKRColor(0.5f, 1.0f, 1.5f), CKRColor(127, 255, 126));  // 382 keeps its low 8 bits
  EXPECT_EQ(CKRColor(std::nanf(""), -1.0f, 1e30f), CKRColor(0, 1, 255));

  CKRColor color(9, 9, 9);
  EXPECT_EQ(color.SetValueFromString(L"10,20"), 0);
  EXPECT_EQ(color.SetValueFromString(L"1,2,"), 0);
  EXPECT_EQ(color.SetValueFromString(L""), 0);
  EXPECT_EQ(color, CKRColor(9, 9, 9));
  EXPECT_EQ(color.SetValueFromString(L"256,1,2"), 1);
  EXPECT_EQ(color, CKRColor(0, 1, 2));
  EXPECT_EQ(color.SetValueFromString(L"-1,x,7,8"), 1);
  EXPECT_EQ(color, CKRColor(255, 0, 7));
}

TEST(CKROptionSet, TextFormAndWalks) {
  CKROptionSet options;
  options.AddOption(L"a", reinterpret_cast<void*>(1), true);
  options.AddOption(L"b", reinterpret_cast<void*>(2), false);
  EXPECT_EQ(options.GetStringValue(), L"a,1,1#b,2,0");
  EXPECT_TRUE(options.GetOption(2) == nullptr && options.GetOption(-1) == nullptr);
  // Parts of fewer than three fields add nothing; only "1" selects.
  CKROptionSet read;
  EXPECT_EQ(read.SetValueFromString(L"a,1#b,2,1"), 1);
  EXPECT_EQ(read.GetStringValue(), L"b,2,1");
  read.SetValueFromString(L"x,3,yes#,4,1,extra##");
  EXPECT_EQ(read.GetStringValue(), L"x,3,0#,4,1");
  read.SetValueFromString(options.GetStringValue());
  EXPECT_TRUE(read == options);

  CKRString text;
  void* data = nullptr;
  ASSERT_TRUE(options.GetNextSelected(text, data, true));
  EXPECT_TRUE(text == L"a" && data == reinterpret_cast<void*>(1));
  EXPECT_FALSE(options.GetNextSelected(text, data, false));
  options.SelectAll(true);
  EXPECT_FALSE(read == options);  // same count, different options
  EXPECT_EQ(options.GetNextOption(true), options.GetOption(0));
  EXPECT_EQ(options.GetNextOption(false), options.GetOption(1));
  EXPECT_EQ(options.GetNextOption(false), nullptr);
  options.AddOption(L"a", reinterpret_cast<void*>(0), true);
  options.SortOptions();
  EXPECT_EQ(options.GetStringValue(), L"a,0,1#a,1,1#b,2,1");
  options.ClearOptions();
  EXPECT_TRUE(options.Size() == 0 && options.GetNextOption(false) == nullptr);
}
