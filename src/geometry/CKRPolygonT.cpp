// Polygons: normals, planarity, and the instantiations of both precision
// pairs.
#include <krCoreLib/geometry/CKRPolygonT.h>

#include <array>
#include <cmath>

template <int N, class Real, class Other>
CKRPolygonT<N, Real, Other>::CKRPolygonT(unsigned n)
    : m_pSource(std::make_shared<Source>(n)), m_Sequence(m_pSource.get()) {}

// Newell's normal: each edge (i, j) adds (yi - yj)(zi + zj),
// (zi - zj)(xi + xj), (xi - xj)(yi + yj); exact for planar polygons and a
// least-squares fit for slightly warped ones.
template <int N, class Real, class Other>
typename CKRPolygonT<N, Real, Other>::Vector CKRPolygonT<N, Real, Other>::GetNormal() const {
  Vector normal = Vector::ZERO();
  const unsigned n = GetLength();
  if constexpr (N >= 3) {
    if (n < 3)
      return normal;
    for (unsigned i = 0; i < n; ++i) {
      const Point a = (*this)[i];
      const Point b = (*this)[(i + 1) % n];
      normal[0] += (a[1] - b[1]) * (a[2] + b[2]);
      normal[1] += (a[2] - b[2]) * (a[0] + b[0]);
      normal[2] += (a[0] - b[0]) * (a[1] + b[1]);
    }
    normal.Normalize();
  }
  return normal;
}

template <int N, class Real, class Other>
bool CKRPolygonT<N, Real, Other>::IsPlanar(int decimals) const {
  const unsigned n = GetLength();
  if (n < 3)
    return false;
  if constexpr (N == 2) {
    return true;
  } else {
    // x, y, z in double, whatever Real is.
    const auto at = [&](unsigned i) {
      const Point p = (*this)[i];
      return std::array<double, 3>{double(p[0]), double(p[1]), double(p[2])};
    };
    const auto minus = [](const std::array<double, 3>& a, const std::array<double, 3>& b) {
      return std::array<double, 3>{a[0] - b[0], a[1] - b[1], a[2] - b[2]};
    };
    const auto dot = [](const std::array<double, 3>& a, const std::array<double, 3>& b) {
      return a[0] * b[0] + a[1] * b[1] + a[2] * b[2];
    };
    const auto origin = at(0);
    // The first vertex away from the first, then the first off the line
    // through both; the plane's normal is the cross product of their
    // offsets. A cross product within EPSILON of the offsets' lengths'
    // product counts as collinear (the rounding of Real coordinates).
    unsigned j = 1;
    while (j < n && dot(minus(at(j), origin), minus(at(j), origin)) == 0)
      ++j;
    if (j == n)
      return true;
    const auto u = minus(at(j), origin);
    for (unsigned k = j + 1; k < n; ++k) {
      const auto v = minus(at(k), origin);
      std::array<double, 3> normal{u[1] * v[2] - u[2] * v[1], u[2] * v[0] - u[0] * v[2], u[0] * v[1] - u[1] * v[0]};
      const double length = std::sqrt(dot(normal, normal));
      if (!(length > double(Math::EPSILON) * std::sqrt(dot(u, u) * dot(v, v))))
        continue;
      for (double& c : normal)
        c /= length;
      for (unsigned i = 0; i < n; ++i)
        if (!Math::Approx_Equal(Real(dot(minus(at(i), origin), normal)), Real(0), decimals))
          return false;
      return true;
    }
    return true;  // all vertices on one line
  }
}

template class CKRPolygonT<2, float, double>;
template class CKRPolygonT<3, float, double>;
template class CKRPolygonT<4, float, double>;
template class CKRPolygonT<2, double, float>;
template class CKRPolygonT<3, double, float>;
template class CKRPolygonT<4, double, float>;
template class CKRPolygon3T<float, double>;
template class CKRPolygon3T<double, float>;
template class CKRPolygon4T<float, double>;
template class CKRPolygon4T<double, float>;
