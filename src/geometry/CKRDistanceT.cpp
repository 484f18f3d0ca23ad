// The distances of dimension 2, 3 and 4: the instantiations of both
// precision pairs compiled into the library.
#include <krCoreLib/geometry/CKRDistanceT.h>

template class CKRDistanceT<2, float, double>;
template class CKRDistanceT<3, float, double>;
template class CKRDistanceT<4, float, double>;
template class CKRDistanceT<2, double, float>;
template class CKRDistanceT<3, double, float>;
template class CKRDistanceT<4, double, float>;
