// Lines, rays and segments: the instantiations of both precision pairs
// compiled into the library.
#include <krCoreLib/geometry/CKRLineT.h>

template class CKRLineT<2, float, double>;
template class CKRLineT<3, float, double>;
template class CKRLineT<4, float, double>;
template class CKRLineT<2, double, float>;
template class CKRLineT<3, double, float>;
template class CKRLineT<4, double, float>;
template class CKRRayT<2, float, double>;
template class CKRRayT<3, float, double>;
template class CKRRayT<4, float, double>;
template class CKRRayT<2, double, float>;
template class CKRRayT<3, double, float>;
template class CKRRayT<4, double, float>;
template class CKRSegmentT<2, float, double>;
template class CKRSegmentT<3, float, double>;
template class CKRSegmentT<4, float, double>;
template class CKRSegmentT<2, double, float>;
template class CKRSegmentT<3, double, float>;
template class CKRSegmentT<4, double, float>;
template class CKRRay2T<float, double>;
template class CKRRay2T<double, float>;
template class CKRRay3T<float, double>;
template class CKRRay3T<double, float>;
template class CKRRay4T<float, double>;
template class CKRRay4T<double, float>;
