#include <krCoreLib/units/CKRScientificData.h>

#include "KRGermanLocale.h"

#include <gtest/gtest.h>

#include <cmath>
#include <thread>
#include <vector>

namespace {

// Restores the process-wide metric flag at the end of a test.
class CKRScientificDataTest : public testing::Test {
protected:
  void TearDown() override { CKRScientificData::m_UnitHelper.SetMetricDefaults(false); }
};

}  // namespace

TEST_F(CKRScientificDataTest, DefaultUnitFollowsThePresentation) {
  const CKRScientificData length(0, 2.0);
  EXPECT_EQ(length.GetUnit(), L"in");
  EXPECT_EQ(length.GetLongDescription(), L"inches");
  CKRScientificData::m_UnitHelper.SetMetricDefaults(true);
  EXPECT_EQ(length.GetUnit(), L"mm");
  EXPECT_EQ(CKRScientificData(42, 1.0).GetUnit(), L"");  // no such class
  EXPECT_EQ(CKRScientificData(3.0, L"m/s", L"mph").GetUnit(), L"m/s");
  CKRScientificData::m_UnitHelper.SetMetricDefaults(false);
  const CKRScientificData imperial(3.0, L"m/s", L"mph");
  EXPECT_EQ(imperial.GetUnit(), L"mph");
  EXPECT_EQ(imperial.GetUnitClass(), 2);
  EXPECT_EQ(CKRScientificData(1.0, L"furlong").GetUnitClass(), -1);
}

TEST_F(CKRScientificDataTest, ConversionsBetweenUnits) {
  CKRScientificData value(25.4, L"mm");
  EXPECT_DOUBLE_EQ(value.GetAs(L"in"), 1.0);
  EXPECT_EQ(value.GetAs(L"psi"), 25.4);  // incompatible: unchanged
  value.SetUnitAndUpdateValue(L"psi");  // another class: nothing changes
  EXPECT_EQ(value.GetUnit(), L"mm");
  value.SetUnitAndUpdateValue(L"in");
  EXPECT_EQ(value.GetUnit(), L"in");
  EXPECT_DOUBLE_EQ(value.Get(), 1.0);
  value.SetAs(2.54, L"cm");
  EXPECT_DOUBLE_EQ(value.GetValue(), 1.0);
  value.Set(3.0, L"");  // an empty unit is not taken
  EXPECT_EQ(value.GetUnit(), L"in");
  value.Reset();
  EXPECT_EQ(value.Get(), 0.0);
  EXPECT_EQ(value.GetUnit(), L"");  // emptied, not the class default
}

TEST_F(CKRScientificDataTest, ComparisonsConvertTheOtherValue) {
  const CKRScientificData millimetres(1000.0, L"mm");
  const CKRScientificData metre(1.0, L"m");
  EXPECT_TRUE(millimetres == metre && metre == millimetres);
  EXPECT_FALSE(millimetres < metre || metre < millimetres);
  EXPECT_TRUE(CKRScientificData(1.0, L"ft") < metre);
  // A class-default unit compares in its resolved unit.
  const CKRScientificData inches(0, 12.0);
  EXPECT_TRUE(inches < CKRScientificData(1.01, L"ft"));
  EXPECT_TRUE(inches > CKRScientificData(0.99, L"ft"));
  EXPECT_EQ(static_cast<float>(CKRScientificData(0, 0.1)), 0.1f);
  EXPECT_TRUE(std::isinf(static_cast<float>(CKRScientificData(0, 1e300))));
}

TEST_F(CKRScientificDataTest, TextFormReadsFieldByField) {
  EXPECT_EQ(CKRScientificData().ToString(), L"-1.797693e+308,1.797693e+308,0.000000e+00,0,#");
  // Read one after the other into one value: an empty or missing field
  // leaves its value, a field without a number reads 0, later fields are
  // ignored, and the unit is emptied first.
  const std::pair<const wchar_t*, const wchar_t*> rows[] = {
      {L"1,2,3,4,mm", L"1.000000e+00,2.000000e+00,3.000000e+00,4,mm"},
      {L"  5,,7  ", L"5.000000e+00,2.000000e+00,7.000000e+00,4,"},
      {L"a,1e3x,-2.5e-3,11,h,extra,fields", L"0.000000e+00,1.000000e+03,-2.500000e-03,11,h"},
      {L"", L"0.000000e+00,1.000000e+03,-2.500000e-03,11,"},
  };
  CKRScientificData value;
  for (const auto& [text, expected] : rows) {
    SCOPED_TRACE(CKRString(text).ToUtf8());
    value.FromString(text);
    EXPECT_EQ(value.ToString(), expected);
  }
}

TEST_F(CKRScientificDataTest, TextFormIgnoresTheProcessLocale) {
  CKRGermanLocale german;
  if (!german.IsAvailable())
    GTEST_SKIP() << "no de_DE.UTF-8 locale on this machine";
  ASSERT_EQ(CKRString::Formatted(L"%.1f", 1.5), L"1,5");  // the locale is in force
  CKRScientificData value(1, 1.5, -0.25, 2.5);
  const CKRString text = value.ToString();
  EXPECT_EQ(text, L"-2.500000e-01,2.500000e+00,1.500000e+00,1,#");
  CKRScientificData back;
  back.FromString(text);
  EXPECT_EQ(back.ToString(), text);
}

TEST_F(CKRScientificDataTest, TextFormsFromSeveralThreadsAtOnce) {
  std::vector<int> failures(4, 0);
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t)
    threads.emplace_back([t, &failures] {
      for (int i = 0; i < 2000; ++i) {
        CKRScientificData value;
        value.FromString(CKRString::Formatted(L"%d,%d,%d,%d,mm", -i, i, i * t, t));
        failures[std::size_t(t)] += value.Get() != double(i * t) || value.GetUnitClass() != t;
      }
    });
  for (std::thread& thread : threads)
    thread.join();
  EXPECT_EQ(failures, std::vector<int>(4, 0));
}
