// The polylines of dimension 2, 3 and 4: the instantiations of both
// precision pairs compiled into the library.
#include <krCoreLib/geometry/CKRPolyLineT.h>

template class CKRPolyLineT<2, float, double>;
template class CKRPolyLineT<3, float, double>;
template class CKRPolyLineT<4, float, double>;
template class CKRPolyLineT<2, double, float>;
template class CKRPolyLineT<3, double, float>;
template class CKRPolyLineT<4, double, float>;
template class CKRPolyLine3T<float, double>;
template class CKRPolyLine3T<double, float>;
template class CKRPolyLine4T<float, double>;
template class CKRPolyLine4T<double, float>;
