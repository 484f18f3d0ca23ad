// The vectors of dimension 2, 3 and 4: the operations that are not inline,
// and the instantiations of both precision pairs compiled into the library.
#include <krCoreLib/math/CKRVectorT.h>

#include <krCoreLib/math/CKRPointT.h>
#include <krCoreLib/math/CKRVector2T.h>
#include <krCoreLib/math/CKRVector3T.h>
#include <krCoreLib/math/CKRVector4T.h>

// ---- CKRVector2T ----

// The direction of each vector is found with ACos of its normalised x (and
// 2 pi minus that below the x axis); v is turned by minus this vector's
// direction, so that the angle of the turned v is the angle between them.
template <class Real, class Other>
Real CKRVector2T<Real, Other>::AngleBetween(const CKRVector2T& v) const {
  const auto direction = [](Real x, Real y, Real length) {
    const Real a = Math::ACos(x / length);
    return y < Real(0) ? Math::TWO_PI - a : a;
  };
  const Real length = this->Length();
  const Real otherLength = v.Length();
  if (!(length > Real(0)) || !(otherLength > Real(0)))
    return Real(0);
  const Real a = direction(X(), Y(), length);
  const Real cosine = Math::Cos(a);
  const Real sine = Math::Sin(a);
  const Real x = v.X() * cosine + v.Y() * sine;
  const Real y = v.Y() * cosine - v.X() * sine;
  const Real angle = direction(x, y, otherLength);
  return angle >= Math::TWO_PI ? Real(0) : angle;
}

template <class Real, class Other>
void CKRVector2T<Real, Other>::Orthonormalize(CKRVector2T& u, CKRVector2T& v) {
  u.Normalize();
  v -= u * u.Dot(v);
  v.Normalize();
}

template <class Real, class Other>
void CKRVector2T<Real, Other>::GenerateOrthonormalBasis(CKRVector2T& u, CKRVector2T& v, bool vIsUnit) {
  if (!vIsUnit)
    v.Normalize();
  u = v.Perp();
}

template <class Real, class Other>
void CKRVector2T<Real, Other>::ComputeExtremes(int n, const CKRVector2T* points, CKRVector2T& min,
                                               CKRVector2T& max) {
  if (points == nullptr || n < 1)
    return;
  min = points[0];
  max = points[0];
  for (int i = 1; i < n; ++i)
    for (int j = 0; j < 2; ++j) {
      if (points[i][j] < min[j])
        min[j] = points[i][j];
      else if (points[i][j] > max[j])
        max[j] = points[i][j];
    }
}

// ---- CKRVector3T ----

template <class Real, class Other>
void CKRVector3T<Real, Other>::Orthonormalize(CKRVector3T& u, CKRVector3T& v, CKRVector3T& w) {
  u.Normalize();
  v -= u * u.Dot(v);
  v.Normalize();
  w -= u * u.Dot(w) + v * v.Dot(w);
  w.Normalize();
}

template <class Real, class Other>
void CKRVector3T<Real, Other>::Orthonormalize(CKRVector3T* vectors) {
  if (vectors != nullptr)
    Orthonormalize(vectors[0], vectors[1], vectors[2]);
}

// u is w turned by a right angle within the coordinate plane that holds w's
// larger of x and y and its z, which keeps the division well away from 0.
template <class Real, class Other>
void CKRVector3T<Real, Other>::GenerateOrthonormalBasis(CKRVector3T& u, CKRVector3T& v, CKRVector3T& w,
                                                        bool wIsUnit) {
  if (!wIsUnit)
    w.Normalize();
  if (Math::FAbs(w.X()) >= Math::FAbs(w.Y())) {
    const Real length = Math::Sqrt(w.X() * w.X() + w.Z() * w.Z());
    const Real inverse = length > Real(0) ? Real(1) / length : Real(0);
    u.Set(-w.Z() * inverse, Real(0), w.X() * inverse);
  } else {
    const Real length = Math::Sqrt(w.Y() * w.Y() + w.Z() * w.Z());
    const Real inverse = length > Real(0) ? Real(1) / length : Real(0);
    u.Set(Real(0), w.Z() * inverse, -w.Y() * inverse);
  }
  v = w.Cross(u);
}

template class CKRVectorT<2, float, double>;
template class CKRVectorT<3, float, double>;
template class CKRVectorT<4, float, double>;
template class CKRVectorT<2, double, float>;
template class CKRVectorT<3, double, float>;
template class CKRVectorT<4, double, float>;

template class CKRVector2T<float, double>;
template class CKRVector2T<double, float>;
template class CKRVector3T<float, double>;
template class CKRVector3T<double, float>;
template class CKRVector4T<float, double>;
template class CKRVector4T<double, float>;
