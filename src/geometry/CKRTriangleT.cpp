// The triangles of dimension 2, 3 and 4: the instantiations of both
// precision pairs compiled into the library.
#include <krCoreLib/geometry/CKRTriangleT.h>

template class CKRTriangleT<2, float, double>;
template class CKRTriangleT<3, float, double>;
template class CKRTriangleT<4, float, double>;
template class CKRTriangleT<2, double, float>;
template class CKRTriangleT<3, double, float>;
template class CKRTriangleT<4, double, float>;
