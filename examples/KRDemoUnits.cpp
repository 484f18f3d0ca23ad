// Units and engineering values: conversions by unit expressions, the unit
// classes a user chooses from, and the text forms stores write.
#include "KRDemo.h"

namespace {

void ShowConversion(double value, const wchar_t* from, const wchar_t* to) {
  double converted = value;
  if (ConvertUnitValue(converted, from, to))
    Print(CKRString::FormattedInvariant(L"   %6g %-9s = %.6g %s\n", value, from, converted, to));
  else
    Print(CKRString::FormattedInvariant(L"   %6g %-9s does not convert to %s\n", value, from, to));
}

}  // namespace

void KRDemoUnits() {
  Print(L"1. Values convert between unit expressions of equal dimensions:\n");
  ShowConversion(1.0, L"in", L"mm");
  ShowConversion(60.0, L"mph", L"km/h");
  ShowConversion(1.0, L"atm", L"Kg/m*s^2");
  ShowConversion(100.0, L"\u00b0C", L"\u00b0F");
  ShowConversion(90.0, L"\u00b0", L"r");
  ShowConversion(3.0, L"min^-1", L"Hz");
  ShowConversion(1.0, L"mph", L"m");

  Print(L"\n2. Unit classes list what a user may choose, with metric and imperial defaults:\n");
  SKRUnitHelper& units = CKRScientificData::m_UnitHelper;
  for (int unitClass : {0, 2, 3}) {
    _SKRUnit metric, imperial;
    units.GetDefaultUnit(unitClass, metric, true);
    units.GetDefaultUnit(unitClass, imperial, false);
    Print(CKRString::Formatted(L"   class %d: %-14s metric %s, imperial %s\n", unitClass,
                               units.GetUnitSet(unitClass).GetString(), metric.LongDescription.GetString(),
                               imperial.LongDescription.GetString()));
  }

  Print(L"\n3. Engineering values and their text forms:\n");
  CKRScientificData speed(88.0, L"kph");
  Print(CKRString::FormattedInvariant(L"   %g %s is %.2f %s; stored as \"%s\"\n", speed.Get(),
                                      speed.GetShortDescription().GetString(), speed.GetAs(L"mph"), L"MPH",
                                      speed.ToString().GetString()));
  speed.SetUnitAndUpdateValue(L"m/s");
  Print(CKRString::FormattedInvariant(L"   moved to m/s: %.3f %s\n", speed.Get(), speed.GetUnit().GetString()));
  CKRRangedT<double> ranged(0.0, 10.0, 2.5);
  Print(CKRString::Formatted(L"   a ranged value:  \"%s\"\n", ranged.ToString().GetString()));
  CKROptionSet options;
  options.AddOption(L"wireframe", reinterpret_cast<void*>(1), false);
  options.AddOption(L"shaded", reinterpret_cast<void*>(2), true);
  Print(CKRString::Formatted(L"   an option set:   \"%s\"\n", options.GetStringValue().GetString()));
  Print(CKRString::Formatted(L"   a colour:        \"%s\"\n", CKRColor(255, 128, 0).GetStringValue().GetString()));
  Print(CKRString::Formatted(L"   a number shown with the process-wide precision: %s\n",
                             CKRPrecision::FormatNumber(3.14159265).GetString()));
  Print(CKRString::Formatted(L"   a URL-encoded text: %s\n", CKRUrlEncode::Encode(L"flow rate/m\u00b3").GetString()));
}
