#include "SKRTupleText.h"

#include "core/KRNumbers.h"

#include <charconv>
#include <string>
#include <type_traits>

namespace {

// Room for "%f" of the largest double (309 integer digits, the point and six
// decimals) and a sign.
constexpr std::size_t kNumberCapacity = 330;

template <class Real>
CKRString WriteTuple(const Real* tuple, int count) {
  std::wstring text;
  char digits[kNumberCapacity];
  for (int i = 0; i < count; ++i) {
    if (i > 0)
      text += L',';
    // Floats are written as their (exact) double value, as printf's "%f"
    // receives them.
    const auto written = std::to_chars(digits, digits + sizeof digits, static_cast<double>(tuple[i]),
                                       std::chars_format::fixed, 6);
    for (const char* c = digits; c != written.ptr; ++c)
      text += static_cast<wchar_t>(*c);
  }
  return CKRString(std::move(text));
}

template <class Real>
void ReadTuple(Real* tuple, int count, const wchar_t* text, std::size_t length) {
  if (text == nullptr || tuple == nullptr)
    return;
  std::wstring compact;
  compact.reserve(length);
  for (std::size_t i = 0; i < length; ++i)
    if (text[i] != L' ')
      compact += text[i];
  const std::size_t size = compact.size();
  const wchar_t* begin = compact.c_str();

  std::size_t position = 0;
  for (int piece = 0; piece < count && position < size; ++piece) {
    if (compact[position] == L',') {
      tuple[piece] = Real(0);  // an empty piece
      ++position;
      continue;
    }
    // The conversion stops at the first character that cannot continue a
    // number, at the latest at the next "," or at the terminating NUL of the
    // copy; what it does not read is no number (0).
    const double value = CKRString::ToDouble(begin + position);
    if constexpr (std::is_same_v<Real, float>)
      tuple[piece] = SKRNumbers::ToFloat(value);
    else
      tuple[piece] = value;
    const std::size_t comma = compact.find(L',', position);
    position = comma == std::wstring::npos ? size : comma + 1;
  }
}

}  // namespace

CKRString SKRTupleText::Write(const float* tuple, int count) { return WriteTuple(tuple, count); }
CKRString SKRTupleText::Write(const double* tuple, int count) { return WriteTuple(tuple, count); }

void SKRTupleText::Read(float* tuple, int count, const wchar_t* text, std::size_t length) {
  ReadTuple(tuple, count, text, length);
}
void SKRTupleText::Read(double* tuple, int count, const wchar_t* text, std::size_t length) {
  ReadTuple(tuple, count, text, length);
}
