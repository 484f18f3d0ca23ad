// The points of dimension 2, 3 and 4: the instantiations of both precision
// pairs compiled into the library (the text forms are CKRTupleT's).
#include <krCoreLib/math/CKRPointT.h>

#include <krCoreLib/math/CKRPoint2T.h>
#include <krCoreLib/math/CKRPoint3T.h>
#include <krCoreLib/math/CKRPoint4T.h>

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
