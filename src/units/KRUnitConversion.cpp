#include <krCoreLib/units/KRUnitConversion.h>

#include "units/KRUnitRows.h"

#include <array>
#include <cwchar>
#include <cstdlib>

namespace {

// Definitions in the table nest at most three deep ("Pica" -> "in" -> "m");
// the bound makes the recursion end whatever a row says.
constexpr int kMaxDefinitionDepth = 8;

// Base unit names, by dimension index.
constexpr const wchar_t* kBaseNames[UnitFactor::KR_DIMENSIONS] = {L"A", L"K", L"cd", L"g", L"m",
                                                                  L"mol", L"r", L"s", L"sr"};

bool IsDigit(wchar_t c) {
  return c >= L'0' && c <= L'9';
}

// White space; ASCII answered inline, as nearly every unit text is ASCII.
bool IsSpace(wchar_t c) {
  if (c < 0x80)
    return c == L' ' || (c >= L'\t' && c <= L'\r');
  return CKRString::IsSpace(c);
}

// Characters of a unit name: letters, digits, "_" and the three signs the
// table uses ("°" U+00B0, "µ" U+00B5, "Å" U+00C5).
bool IsNameChar(wchar_t c) {
  if (c < 0x80)
    return IsDigit(c) || (c >= L'a' && c <= L'z') || (c >= L'A' && c <= L'Z') || c == L'_';
  return c == 0xB0 || c == 0xB5 || c == 0xC5 || CKRString::IsAlpha(c);
}

// The one-letter decimal prefixes.
bool PrefixFactor(wchar_t c, double& factor) {
  switch (c) {
  case L'Y': factor = 1e24; return true;
  case L'Z': factor = 1e21; return true;
  case L'E': factor = 1e18; return true;
  case L'P': factor = 1e15; return true;
  case L'T': factor = 1e12; return true;
  case L'G': factor = 1e9; return true;
  case L'M': factor = 1e6; return true;
  case L'K': case L'k': factor = 1e3; return true;
  case L'H': case L'h': factor = 1e2; return true;
  case L'D': factor = 1e1; return true;
  case L'd': factor = 1e-1; return true;
  case L'c': factor = 1e-2; return true;
  case L'm': factor = 1e-3; return true;
  case L'u': case 0xB5: factor = 1e-6; return true;
  case L'n': factor = 1e-9; return true;
  case L'p': factor = 1e-12; return true;
  case L'f': factor = 1e-15; return true;
  case L'a': factor = 1e-18; return true;
  case L'z': factor = 1e-21; return true;
  case L'y': factor = 1e-24; return true;
  default: return false;
  }
}

// A position in a text that ends at `m_End` or at its first NUL.
struct SKRUnitCursor {
  const wchar_t* m_p;
  const wchar_t* m_End;

  explicit SKRUnitCursor(std::wstring_view text) : m_p(text.data()), m_End(text.data() + text.size()) {
    if (!text.empty())
      if (const wchar_t* nul = std::wmemchr(m_p, L'\0', text.size()))
        m_End = nul;
  }
  wchar_t Peek() const { return m_p < m_End ? *m_p : L'\0'; }
  void SkipSpace() {
    while (m_p < m_End && IsSpace(*m_p))
      ++m_p;
  }
};

// The rows whose names start with one character: [m_First, m_End). Names
// start with ASCII letters or one of the three Latin-1 signs.
struct SKRRowRange {
  unsigned char m_First = 0;
  unsigned char m_End = 0;
};

const SKRRowRange* RowRanges() {
  static const auto s_Ranges = [] {
    std::array<SKRRowRange, 256> ranges{};
    for (int row = kUnitRowCount - 1; row >= 0; --row) {
      SKRRowRange& range = ranges[static_cast<unsigned char>(g_UnitRows[row].m_pName[0])];
      if (range.m_End == 0)
        range.m_End = static_cast<unsigned char>(row + 1);
      range.m_First = static_cast<unsigned char>(row);
    }
    return ranges;
  }();
  return s_Ranges.data();
}

// The row whose name is the whole leading word of the text, or -1. The
// names are sorted, so the word is looked up by binary search among the
// rows that share its first character: the same answer as a search of the
// whole table, in fewer comparisons.
int FindRowIn(const wchar_t* text, const wchar_t* end, std::size_t& length) {
  std::size_t word = 0;
  while (text + word < end && IsNameChar(text[word]))
    ++word;
  if (word == 0 || static_cast<std::uint32_t>(text[0]) > 0xFF)
    return -1;
  const SKRRowRange range = RowRanges()[static_cast<std::uint32_t>(text[0])];
  const std::wstring_view key(text, word);
  int lower = range.m_First, upper = int(range.m_End) - 1;
  while (lower <= upper) {
    const int middle = (lower + upper) / 2;
    const int order = key.compare(g_UnitRows[middle].m_pName);
    if (order < 0) {
      upper = middle - 1;
    } else if (order > 0) {
      lower = middle + 1;
    } else {
      length = word;
      return middle;
    }
  }
  return -1;
}

void Multiply(UnitFactor& value, const UnitFactor& by, int sign) {
  value.m_Factor = sign > 0 ? value.m_Factor * by.m_Factor : value.m_Factor / by.m_Factor;
  // Exponents are 16-bit quantities and wrap as such.
  for (int i = 0; i < UnitFactor::KR_DIMENSIONS; ++i)
    value.m_Exponents[i] = std::int16_t(value.m_Exponents[i] + sign * by.m_Exponents[i]);
}

void Raise(UnitFactor& value, int power) {
  for (std::int16_t& exponent : value.m_Exponents)
    exponent = std::int16_t(exponent * power);
  // Repeated squaring: at most 16 steps for a 16-bit power.
  double base = value.m_Factor, result = 1.0;
  for (unsigned k = unsigned(std::abs(power)); k != 0; k >>= 1, base *= base)
    if (k & 1u)
      result *= base;
  value.m_Factor = power < 0 ? 1.0 / result : result;
}

bool ParseExpression(SKRUnitCursor& cursor, UnitFactor& value, int depth);

// Row values are memoised per thread: a row defined by an expression would
// otherwise be parsed again at every use. SetConstant advances the table
// generation, which makes every memo stale; a memo is stamped with the
// generation read before its value was computed, so a change made during
// the computation is seen at the next use.
struct SKRRowMemo {
  unsigned m_Generation;  // 0: never computed
  UnitFactor m_Value;
};

constinit std::atomic<unsigned> g_TableGeneration{1};
thread_local SKRRowMemo t_RowMemos[kUnitRowCount];

bool ComputeRowValue(int row, UnitFactor& value, int depth) {
  const SKRUnitRow& entry = g_UnitRows[row];
  if (entry.m_Base >= 0) {
    value = UnitFactor();
    value.m_Exponents[entry.m_Base] = 1;
    return true;
  }
  if (depth >= kMaxDefinitionDepth)
    return false;
  SKRUnitCursor definition{std::wstring_view(entry.m_pDefinition)};
  if (!ParseExpression(definition, value, depth + 1))
    return false;
  value.m_Factor *= entry.m_Factor.load(std::memory_order_relaxed);
  return true;
}

bool RowValue(int row, UnitFactor& value, int depth) {
  SKRRowMemo& memo = t_RowMemos[row];
  const unsigned generation = g_TableGeneration.load(std::memory_order_acquire);
  if (memo.m_Generation == generation) {
    value = memo.m_Value;
    return true;
  }
  if (!ComputeRowValue(row, value, depth))
    return false;
  memo.m_Value = value;
  memo.m_Generation = generation;
  return true;
}

// Term: "1", a row name, or a prefix letter followed by a row name.
bool ParseTerm(SKRUnitCursor& cursor, UnitFactor& value, int depth) {
  cursor.SkipSpace();
  if (cursor.Peek() == L'1') {
    ++cursor.m_p;
    value = UnitFactor();
    cursor.SkipSpace();
    return true;
  }
  std::size_t length = 0;
  double prefix = 1.0;
  const wchar_t* name = cursor.m_p;
  int row = FindRowIn(name, cursor.m_End, length);
  if (row < 0) {
    if (!PrefixFactor(cursor.Peek(), prefix))
      return false;
    ++name;
    row = FindRowIn(name, cursor.m_End, length);
    if (row < 0)
      return false;
  }
  if (!RowValue(row, value, depth))
    return false;
  value.m_Factor *= prefix;
  cursor.m_p = name + length;
  return true;
}

// Power: a term, optionally "^" and a signed integer.
bool ParsePower(SKRUnitCursor& cursor, UnitFactor& value, int depth) {
  if (!ParseTerm(cursor, value, depth))
    return false;
  cursor.SkipSpace();
  if (cursor.Peek() != L'^')
    return true;
  const wchar_t* caret = cursor.m_p++;
  cursor.SkipSpace();
  const bool negative = cursor.Peek() == L'-';
  if (negative || cursor.Peek() == L'+')
    ++cursor.m_p;
  if (!IsDigit(cursor.Peek())) {
    cursor.m_p = caret;  // "^" without digits is left unread
    return true;
  }
  // The digits accumulate as an unsigned 16-bit number, keeping the value
  // reached before the first digit that would wrap it.
  unsigned power = 0;
  bool full = false;
  for (; IsDigit(cursor.Peek()); ++cursor.m_p) {
    const unsigned next = power * 10 + unsigned(cursor.Peek() - L'0');
    if (next > 0xFFFFu)
      full = true;
    if (!full)
      power = next;
  }
  Raise(value, negative ? -int(power) : int(power));
  return true;
}

// Product: powers joined by "*"; a "*" not followed by a power ends it.
bool ParseProduct(SKRUnitCursor& cursor, UnitFactor& value, int depth) {
  if (!ParsePower(cursor, value, depth))
    return false;
  for (;;) {
    const SKRUnitCursor before = cursor;
    cursor.SkipSpace();
    if (cursor.Peek() != L'*')
      return true;
    ++cursor.m_p;
    UnitFactor next;
    if (!ParsePower(cursor, next, depth)) {
      cursor = before;
      return true;
    }
    Multiply(value, next, +1);
  }
}

// Expression: a product, optionally "/" and one more product.
bool ParseExpression(SKRUnitCursor& cursor, UnitFactor& value, int depth) {
  if (!ParseProduct(cursor, value, depth))
    return false;
  const SKRUnitCursor before = cursor;
  cursor.SkipSpace();
  if (cursor.Peek() == L'/') {
    ++cursor.m_p;
    UnitFactor denominator;
    if (ParseProduct(cursor, denominator, depth))
      Multiply(value, denominator, -1);
    else
      cursor = before;
  }
  return true;
}

bool ValidRow(int row) {
  return row >= 0 && row < kUnitRowCount;
}

}  // namespace

bool UnitFactor::HasSameDimensions(const UnitFactor& other) const noexcept {
  for (int i = 0; i < KR_DIMENSIONS; ++i)
    if (m_Exponents[i] != other.m_Exponents[i])
      return false;
  return true;
}

int SKRUnitTable::GetRowCount() noexcept {
  return kUnitRowCount;
}

const wchar_t* SKRUnitTable::GetRowName(int row) noexcept {
  return ValidRow(row) ? g_UnitRows[row].m_pName : L"";
}

double SKRUnitTable::GetRowFactor(int row) noexcept {
  return ValidRow(row) ? g_UnitRows[row].m_Factor.load(std::memory_order_relaxed) : 0.0;
}

const wchar_t* SKRUnitTable::GetRowDefinition(int row) noexcept {
  if (!ValidRow(row))
    return L"";
  const SKRUnitRow& entry = g_UnitRows[row];
  return entry.m_Base >= 0 ? kBaseNames[entry.m_Base] : entry.m_pDefinition;
}

int SKRUnitTable::GetRowBase(int row) noexcept {
  return ValidRow(row) ? g_UnitRows[row].m_Base : -1;
}

int SKRUnitTable::FindRow(std::wstring_view text, std::size_t* length) noexcept {
  const SKRUnitCursor cursor(text);
  std::size_t found = 0;
  const int row = FindRowIn(cursor.m_p, cursor.m_End, found);
  if (row >= 0 && length != nullptr)
    *length = found;
  return row;
}

bool SKRUnitTable::Evaluate(std::wstring_view text, UnitFactor& value) noexcept {
  SKRUnitCursor cursor(text);
  UnitFactor result;
  if (!ParseExpression(cursor, result, 0))
    return false;
  value = result;
  return true;
}

bool SKRUnitTable::SetConstant(std::wstring_view name, double factor) noexcept {
  const int row = FindRow(name);
  if (row < 0)
    return false;
  g_UnitRows[row].m_Factor.store(factor, std::memory_order_relaxed);
  g_TableGeneration.fetch_add(1, std::memory_order_release);
  return true;
}

bool ConvertUnitValue(double& value, std::wstring_view fromUnit, std::wstring_view toUnit) noexcept {
  SKRUnitCursor from(fromUnit), to(toUnit);
  from.SkipSpace();
  to.SkipSpace();
  const std::wstring_view fromText(from.m_p, std::size_t(from.m_End - from.m_p));
  const std::wstring_view toText(to.m_p, std::size_t(to.m_End - to.m_p));
  if (fromText.empty() || toText.empty() || fromText == toText)
    return true;
  UnitFactor fromValue, toValue;
  if (!SKRUnitTable::Evaluate(fromText, fromValue) || !SKRUnitTable::Evaluate(toText, toValue))
    return false;
  if (!fromValue.HasSameDimensions(toValue))
    return false;
  value = value * fromValue.m_Factor / toValue.m_Factor;
  return true;
}
