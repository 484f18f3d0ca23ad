#include <krCoreLib/units/KRUnitConversion.h>

#include <krCoreLib/units/SKRUnitHelper.h>

#include "KRTestSeed.h"

#include <gtest/gtest.h>

#include <cmath>
#include <random>
#include <string>
#include <vector>

namespace {

UnitFactor Evaluated(std::wstring_view text) {
  UnitFactor value;
  EXPECT_TRUE(SKRUnitTable::Evaluate(text, value)) << CKRString(text).ToUtf8();
  return value;
}

// Exponents as a vector, for readable failures.
std::vector<int> Exponents(const UnitFactor& value) {
  return std::vector<int>(std::begin(value.m_Exponents), std::end(value.m_Exponents));
}

std::vector<int> Dimension(int index, int exponent = 1) {
  std::vector<int> exponents(UnitFactor::KR_DIMENSIONS, 0);
  exponents[std::size_t(index)] = exponent;
  return exponents;
}

double Converted(double value, const wchar_t* from, const wchar_t* to) {
  EXPECT_TRUE(ConvertUnitValue(value, from, to)) << CKRString(from).ToUtf8() << " -> " << CKRString(to).ToUtf8();
  return value;
}

}  // namespace

// The rows are ordered for the lookup; each is found, also as the leading
// word of a longer expression, and evaluates (through its definition).
TEST(SKRUnitTable, RowsAreStrictlyOrderedAndEachIsFound) {
  ASSERT_EQ(SKRUnitTable::GetRowCount(), 129);
  for (int row = 0; row < 129; ++row) {
    const std::wstring name = SKRUnitTable::GetRowName(row);
    SCOPED_TRACE(CKRString(name).ToUtf8());
    if (row > 0) {
      EXPECT_LT(std::wstring(SKRUnitTable::GetRowName(row - 1)), name);
    }
    std::size_t length = 0;
    EXPECT_EQ(SKRUnitTable::FindRow(name, &length), row);
    EXPECT_EQ(length, name.size());
    EXPECT_EQ(SKRUnitTable::FindRow(name + L"^2/s", &length), row);
    EXPECT_EQ(length, name.size());
    if (SKRUnitTable::GetRowBase(row) < 0) {
      double one = 1.0;
      EXPECT_TRUE(ConvertUnitValue(one, name, SKRUnitTable::GetRowDefinition(row)));
    }
  }
  EXPECT_EQ(SKRUnitTable::GetRowName(129), std::wstring());
  EXPECT_EQ(SKRUnitTable::GetRowName(-1), std::wstring());
  EXPECT_EQ(SKRUnitTable::GetRowFactor(200), 0.0);
}

TEST(SKRUnitTable, TermsPrefixesAndPowers) {
  struct SKRCase {
    const wchar_t* m_pText;
    double m_Factor;
    std::vector<int> m_Exponents;
  };
  const std::vector<SKRCase> cases = {
      {L"Kg", 1000.0, Dimension(UnitFactor::KR_MASS)},
      {L"kph", 0.2777777777777778, [] { auto e = Dimension(4); e[7] = -1; return e; }()},  // a row, not k*ph
      {L"mm", 1e-3, Dimension(UnitFactor::KR_LENGTH)},  // milli-metre: there is no row "mm"
      {L"cm^2", 1e-4, Dimension(UnitFactor::KR_LENGTH, 2)},
      {L"\u00b5m", 1e-6, Dimension(UnitFactor::KR_LENGTH)},
      {L"um", 1e-6, Dimension(UnitFactor::KR_LENGTH)},
      {L"\u00b5", 1e-6, Dimension(UnitFactor::KR_LENGTH)},  // the micron row
      {L"\u00c5", 1e-10, Dimension(UnitFactor::KR_LENGTH)},
      {L"m^-1", 1.0, Dimension(UnitFactor::KR_LENGTH, -1)},
      {L"m ^ +3", 1.0, Dimension(UnitFactor::KR_LENGTH, 3)},
      {L"m ^ + 3", 1.0, Dimension(UnitFactor::KR_LENGTH, 1)},  // no blank after the sign
      {L"m^0", 1.0, Dimension(UnitFactor::KR_LENGTH, 0)},
      {L"km^-2", 1e-6, Dimension(UnitFactor::KR_LENGTH, -2)},
      {L"1", 1.0, Dimension(0, 0)},
      {L"  Kg / m * s^2", 1000.0, [] { auto e = Dimension(3); e[4] = -1; e[7] = -2; return e; }()},
  };
  for (const SKRCase& c : cases) {
    SCOPED_TRACE(CKRString(c.m_pText).ToUtf8());
    const UnitFactor value = Evaluated(c.m_pText);
    EXPECT_NEAR(value.m_Factor, c.m_Factor, 1e-12 * c.m_Factor);
    EXPECT_EQ(Exponents(value), c.m_Exponents);
  }
}

TEST(SKRUnitTable, MalformedTextsFailOrParseTheirLeadingExpression) {
  // Texts that are no unit at all.
  for (const std::wstring& text :
       {std::wstring(), std::wstring(L"   "), std::wstring(L"^"), std::wstring(L"m2"), std::wstring(L"xyz"),
        std::wstring(L"*m"), std::wstring(L"/s"), std::wstring(L"k"), std::wstring(L"\u00c6"),
        std::wstring(L"\u00ff\u00ff"), std::wstring(L"\u0416"), std::wstring(L"\U0001D400m"),
        std::wstring(1, L'\0') + L"m", std::wstring(L"\u00e4m")}) {
    SCOPED_TRACE(CKRString(text).ToUtf8());
    UnitFactor value;
    value.m_Factor = 42.0;
    EXPECT_FALSE(SKRUnitTable::Evaluate(text, value));
    EXPECT_EQ(value.m_Factor, 42.0);  // untouched
  }
  // Texts whose leading expression parses; the rest is ignored.
  struct SKRPartial {
    std::wstring m_Text;
    std::wstring m_SameAs;
  };
  const std::vector<SKRPartial> partial = {
      {L"m^", L"m"},          {L"m^-", L"m"},     {L"m^^2", L"m"},       {L"m*", L"m"},
      {L"m**s", L"m"},        {L"m//s", L"m"},    {L"m/s/s", L"m/s"},    {L"m/", L"m"},
      {L"m*xyz", L"m"},       {L"m s", L"m"},     {L"m)", L"m"},         {std::wstring(L"m\0/s", 4), L"m"},
      {L"m^2abc", L"m^2"},    {L"10", L"1"},
  };
  for (const SKRPartial& p : partial) {
    SCOPED_TRACE(CKRString(p.m_Text).ToUtf8());
    const UnitFactor value = Evaluated(p.m_Text);
    const UnitFactor expected = Evaluated(p.m_SameAs);
    EXPECT_EQ(value.m_Factor, expected.m_Factor);
    EXPECT_EQ(Exponents(value), Exponents(expected));
  }
}

TEST(SKRUnitTable, HugeExponentsStayBoundedAndEnd) {
  // 70000 does not fit 16 bits: the digits accumulate to 7000.
  UnitFactor value = Evaluated(L"km^70000");
  EXPECT_EQ(value.m_Exponents[UnitFactor::KR_LENGTH], 7000);
  EXPECT_TRUE(std::isinf(value.m_Factor));
  value = Evaluated(L"mm^-65535");
  EXPECT_EQ(value.m_Exponents[UnitFactor::KR_LENGTH], std::int16_t(-65535));
  // A very long digit run and a very long product end.
  Evaluated(L"m^" + std::wstring(70000, L'9'));
  std::wstring product = L"m";
  for (int i = 0; i < 20000; ++i)
    product += L"*s";
  value = Evaluated(product);
  EXPECT_EQ(value.m_Exponents[UnitFactor::KR_TIME], 20000);
}

TEST(ConvertUnitValue, ConvertsCompatibleUnits) {
  EXPECT_DOUBLE_EQ(Converted(1.0, L"in", L"mm"), 25.4);
  EXPECT_DOUBLE_EQ(Converted(100.0, L"\u00b0C", L"\u00b0F"), 180.0);  // a scale only: no offset
  EXPECT_DOUBLE_EQ(Converted(1.0, L"Pa", L"P"), 10.0);  // "Pa" is defined over Kg/m*s, as "P" is
  EXPECT_DOUBLE_EQ(Converted(1.0, L"km/h", L"kph"), 1.0);

  double value = 7.0;
  for (const wchar_t* from : {L"", L"   "}) {
    EXPECT_TRUE(ConvertUnitValue(value, from, L"m"));
    EXPECT_TRUE(ConvertUnitValue(value, L"m", from));
  }
  EXPECT_TRUE(ConvertUnitValue(value, L" ft", L"ft"));
  EXPECT_TRUE(ConvertUnitValue(value, L"garbage", L"garbage"));  // equal texts are not evaluated
  EXPECT_EQ(value, 7.0);
}

TEST(ConvertUnitValue, RefusesIncompatibleOrUnknownUnits) {
  double value = 3.0;
  EXPECT_FALSE(ConvertUnitValue(value, L"mph", L"m"));
  EXPECT_FALSE(ConvertUnitValue(value, L"\u00b0", L"1"));  // angles are a dimension
  EXPECT_FALSE(ConvertUnitValue(value, L"r", L"sr"));
  EXPECT_FALSE(ConvertUnitValue(value, L"psi", L"Pa"));  // mass per area, not a pressure
  EXPECT_FALSE(ConvertUnitValue(value, L"m", L"m2"));
  EXPECT_FALSE(ConvertUnitValue(value, L"xyz", L"m"));
  EXPECT_EQ(value, 3.0);
}

TEST(ConvertUnitValue, RegisteredUnitsAreValidAndConvertBothWays) {
  std::mt19937 random(KRTestSeed());
  std::uniform_real_distribution<double> magnitude(-1e6, 1e6);
  const SKRUnitHelper helper;
  for (int unitClass = 0; unitClass < 12; ++unitClass) {
    for (int i = 0; i < helper.GetUnitCount(unitClass); ++i) {
      _SKRUnit from;
      ASSERT_TRUE(helper.GetUnit(unitClass, unsigned(i), from));
      SCOPED_TRACE(from.Unit.ToUtf8());
      UnitFactor value;
      EXPECT_TRUE(SKRUnitTable::Evaluate(from.Unit, value));
      for (int j = 0; j < helper.GetUnitCount(unitClass); ++j) {
        _SKRUnit to;
        helper.GetUnit(unitClass, unsigned(j), to);
        // Classes 8 and 9 mix lengths with device pixels: all are lengths.
        const double original = magnitude(random);
        double there = original;
        ASSERT_TRUE(ConvertUnitValue(there, from.Unit, to.Unit)) << to.Unit.ToUtf8();
        double back = there;
        ASSERT_TRUE(ConvertUnitValue(back, to.Unit, from.Unit));
        EXPECT_NEAR(back, original, 1e-12 * std::fabs(original));
      }
    }
  }
}

TEST(SKRUnitTable, SetConstantChangesOneRowForTheProcess) {
  const int row = SKRUnitTable::FindRow(L"pixelx");
  ASSERT_GE(row, 0);
  const double original = SKRUnitTable::GetRowFactor(row);
  EXPECT_TRUE(SKRUnitTable::SetConstant(L"pixelx", 0.0254 / 96));
  EXPECT_DOUBLE_EQ(Converted(96.0, L"pixelx", L"in"), 1.0);
  EXPECT_NEAR(Converted(600.0, L"pixely", L"in"), 1.0, 1e-8);  // pixely keeps its own factor
  // Rows defined over a changed row follow it ("Pica" is 1/72 "in").
  const double inch = SKRUnitTable::GetRowFactor(SKRUnitTable::FindRow(L"in"));
  EXPECT_DOUBLE_EQ(Converted(72.0, L"Pica", L"mm"), 25.4);
  SKRUnitTable::SetConstant(L"in", 2 * inch);
  EXPECT_DOUBLE_EQ(Converted(72.0, L"Pica", L"mm"), 50.8);
  SKRUnitTable::SetConstant(L"in", inch);
  EXPECT_DOUBLE_EQ(Converted(72.0, L"Pica", L"mm"), 25.4);
  SKRUnitHelper().SetConstant(L"pixelx", original);
  EXPECT_EQ(SKRUnitTable::GetRowFactor(row), original);
  EXPECT_FALSE(SKRUnitTable::SetConstant(L"nosuchunit", 2.0));
  EXPECT_FALSE(SKRUnitTable::SetConstant(L"", 2.0));
}
