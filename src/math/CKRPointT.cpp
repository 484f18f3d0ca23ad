// The points of dimension 2, 3 and 4: their text forms, and the
// instantiations of both precision pairs compiled into the library.
#include <krCoreLib/math/CKRPointT.h>

#include <krCoreLib/math/CKRPoint2T.h>
#include <krCoreLib/math/CKRPoint3T.h>
#include <krCoreLib/math/CKRPoint4T.h>

#include "SKRTupleText.h"

#include <cwchar>

namespace {

std::size_t TextLength(const wchar_t* text) { return text != nullptr ? std::wcslen(text) : 0; }

}  // namespace

template <class Real, class Other>
CKRString CKRPoint2T<Real, Other>::ToString() const {
  return SKRTupleText::Write(this->m_Tuple, 2);
}

template <class Real, class Other>
void CKRPoint2T<Real, Other>::FromString(const wchar_t* text) {
  SKRTupleText::Read(this->m_Tuple, 2, text, TextLength(text));
}

template <class Real, class Other>
void CKRPoint2T<Real, Other>::FromString(const CKRString& text) {
  SKRTupleText::Read(this->m_Tuple, 2, text.GetString(), text.size());
}

template <class Real, class Other>
CKRString CKRPoint3T<Real, Other>::ToString() const {
  return SKRTupleText::Write(this->m_Tuple, 3);
}

template <class Real, class Other>
void CKRPoint3T<Real, Other>::FromString(const wchar_t* text) {
  SKRTupleText::Read(this->m_Tuple, 3, text, TextLength(text));
}

template <class Real, class Other>
void CKRPoint3T<Real, Other>::FromString(const CKRString& text) {
  SKRTupleText::Read(this->m_Tuple, 3, text.GetString(), text.size());
}

template <class Real, class Other>
CKRString CKRPoint4T<Real, Other>::ToString() const {
  return SKRTupleText::Write(this->m_Tuple, 4);
}

template <class Real, class Other>
void CKRPoint4T<Real, Other>::FromString(const wchar_t* text) {
  SKRTupleText::Read(this->m_Tuple, 4, text, TextLength(text));
}

template <class Real, class Other>
void CKRPoint4T<Real, Other>::FromString(const CKRString& text) {
  SKRTupleText::Read(this->m_Tuple, 4, text.GetString(), text.size());
}

template class CKRPointT<2, float, double>;
template class CKRPointT<3, float, double>;
template class CKRPointT<4, float, double>;
template class CKRPointT<2, double, float>;
template class CKRPointT<3, double, float>;
template class CKRPointT<4, double, float>;

template class CKRPoint2T<float, double>;
template class CKRPoint2T<double, float>;
template class CKRPoint3T<float, double>;
template class CKRPoint3T<double, float>;
template class CKRPoint4T<float, double>;
template class CKRPoint4T<double, float>;
