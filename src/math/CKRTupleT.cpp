// The shared base of points and vectors: the text form, and the
// instantiations of both precision pairs compiled into the library.
#include <krCoreLib/math/CKRTupleT.h>

#include <krCoreLib/math/CKRPointT.h>
#include <krCoreLib/math/CKRVectorT.h>

#include "SKRTupleText.h"

#include <cwchar>

template <class Derived, class Real, class Other, int N>
CKRString CKRTupleT<Derived, Real, Other, N>::ToString() const {
  return SKRTupleText::Write(m_Tuple, N);
}

template <class Derived, class Real, class Other, int N>
void CKRTupleT<Derived, Real, Other, N>::FromString(const wchar_t* text) {
  SKRTupleText::Read(m_Tuple, N, text, text != nullptr ? std::wcslen(text) : 0);
}

template <class Derived, class Real, class Other, int N>
void CKRTupleT<Derived, Real, Other, N>::FromString(const CKRString& text) {
  SKRTupleText::Read(m_Tuple, N, text.GetString(), text.size());
}

template class CKRTupleT<CKRPointT<2, float, double>, float, double, 2>;
template class CKRTupleT<CKRPointT<3, float, double>, float, double, 3>;
template class CKRTupleT<CKRPointT<4, float, double>, float, double, 4>;
template class CKRTupleT<CKRPointT<2, double, float>, double, float, 2>;
template class CKRTupleT<CKRPointT<3, double, float>, double, float, 3>;
template class CKRTupleT<CKRPointT<4, double, float>, double, float, 4>;

template class CKRTupleT<CKRVectorT<2, float, double>, float, double, 2>;
template class CKRTupleT<CKRVectorT<3, float, double>, float, double, 3>;
template class CKRTupleT<CKRVectorT<4, float, double>, float, double, 4>;
template class CKRTupleT<CKRVectorT<2, double, float>, double, float, 2>;
template class CKRTupleT<CKRVectorT<3, double, float>, double, float, 3>;
template class CKRTupleT<CKRVectorT<4, double, float>, double, float, 4>;
