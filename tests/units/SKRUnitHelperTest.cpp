#include <krCoreLib/units/SKRUnitHelper.h>

#include <gtest/gtest.h>

namespace {

// The key of the unit a lookup copied out, or "<none>".
CKRString UnitOf(bool found, const _SKRUnit& unit) {
  return found ? unit.Unit : CKRString(L"<none>");
}

}  // namespace

// Lookups take whole, case-sensitive keys; unknown classes, keys and indexes
// give the empty answers.
TEST(SKRUnitHelper, LookupsByKeyAndIndex) {
  SKRUnitHelper helper;
  EXPECT_EQ(helper.GetUnitCount(12), 0);
  EXPECT_EQ(helper.GetUnitSet(99), L"");
  EXPECT_EQ(helper.GetShortDescription(2, L"MPH"), L"");  // keys, not descriptions
  _SKRUnit unit;
  EXPECT_EQ(UnitOf(helper.GetUnit(8, 2u, unit), unit), L"pixelx");
  EXPECT_FALSE(helper.GetUnit(8, 3u, unit));
  // The lowest class holding a key answers ("mm" is a screen length too).
  for (const auto& [key, unitClass] : {std::pair{L"mm", 0}, {L"pixelx", 8}, {L"MM", -1}})
    EXPECT_EQ(helper.GetUnitClass(key), unitClass) << CKRString(key).ToUtf8();
}

TEST(SKRUnitHelper, NeighboursWrapAround) {
  const SKRUnitHelper helper;
  _SKRUnit unit;
  EXPECT_EQ(UnitOf(helper.GetNextUnit(11, L"h", unit, false), unit), L"min");
  EXPECT_EQ(UnitOf(helper.GetNextUnit(11, L"min", unit, true), unit), L"h");
  EXPECT_EQ(UnitOf(helper.GetNextUnit(0, L"cm", unit, true), unit), L"m");
  EXPECT_FALSE(helper.GetNextUnit(5, L"centipoise", unit, false));  // one unit only
  EXPECT_FALSE(helper.GetNextUnit(11, L"d", unit, false));
  EXPECT_FALSE(helper.GetNextUnit(42, L"h", unit, false));
}

TEST(SKRUnitHelper, DefaultUnitsFollowThePresentation) {
  SKRUnitHelper helper;
  _SKRUnit unit;
  EXPECT_EQ(UnitOf(helper.GetDefaultUnit(0, unit), unit), L"in");
  helper.SetMetricDefaults(true);
  EXPECT_EQ(UnitOf(helper.GetDefaultUnit(0, unit), unit), L"mm");
  EXPECT_EQ(UnitOf(helper.GetDefaultUnit(5, unit), unit), L"centipoise");
  EXPECT_EQ(UnitOf(helper.GetDefaultUnit(0, unit, false), unit), L"in");
  EXPECT_EQ(helper.GetDefaultUnit(0), L"in");  // the text form ignores the flag
  // Without the asked default the first unit answers.
  helper.AddUnit(20, L"a", L"m", L"metres", 0);
  helper.AddUnit(20, L"b", L"ft", L"feet", 1);
  EXPECT_EQ(UnitOf(helper.GetDefaultUnit(20, unit, true), unit), L"m");
  EXPECT_EQ(helper.GetDefaultUnit(20), L"ft");
  helper.ClearUnits(20);
  EXPECT_FALSE(helper.GetDefaultUnit(20, unit, true));
  EXPECT_EQ(helper.GetDefaultUnit(20), L"");
}

TEST(SKRUnitHelper, AddUnitReplacesOnlyTheDefaultsOfAKnownKey) {
  SKRUnitHelper helper;
  EXPECT_EQ(helper.GetUnitSet(0), L"cm,in,ft,mm,m");  // cached now
  EXPECT_EQ(helper.AddUnit(0, L"X", L"cm", L"Y", 2), 5);
  _SKRUnit unit;
  ASSERT_TRUE(helper.GetUnit(0, L"cm", unit));
  EXPECT_EQ(unit.ShortDescription, L"cm");
  EXPECT_EQ(unit.LongDescription, L"centimeters");
  EXPECT_EQ(unit.Defaults, 2);
  EXPECT_EQ(helper.AddUnit(0, L"yd", L"yd", L"yards", 0), 6);
  EXPECT_EQ(helper.GetUnitSet(0), L"cm,in,ft,mm,m,yd");  // the cache follows changes

  const SKRUnitHelper copy = helper;
  helper.ClearUnits(0);
  EXPECT_EQ(helper.GetUnitSet(0), L"");
  EXPECT_EQ(helper.GetUnitClass(L"cm"), -1);
  EXPECT_EQ(copy.GetUnitCount(0), 6);  // copies are independent
  EXPECT_EQ(helper.AddUnit(0, L"m", L"m", L"meters", 2), 1);
  // An empty first key keeps its separator.
  helper.ClearUnits(1);
  helper.AddUnit(1, L"", L"", L"none", 0);
  helper.AddUnit(1, L"x", L"x", L"ex", 0);
  EXPECT_EQ(helper.GetUnitSet(1), L",x");
}
