// The bounds of dimension 2, 3 and 4: the instantiations of both precision
// pairs compiled into the library.
#include <krCoreLib/geometry/CKRBoundT.h>

template class CKRBoundT<2, float, double>;
template class CKRBoundT<3, float, double>;
template class CKRBoundT<4, float, double>;
template class CKRBoundT<2, double, float>;
template class CKRBoundT<3, double, float>;
template class CKRBoundT<4, double, float>;
template class CKRBound2T<float, double>;
template class CKRBound2T<double, float>;
template class CKRBound3T<float, double>;
template class CKRBound3T<double, float>;
template class CKRBound4T<float, double>;
template class CKRBound4T<double, float>;
