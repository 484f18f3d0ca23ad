// Planar polygons: area, winding, convexity and simplicity in the x-y
// plane, and the instantiations of both precision pairs.
#include <krCoreLib/geometry/CKRPlanarPolygonT.h>

#include <krCoreLib/geometry/KRAdaptiveOrient2d.h>

#include <algorithm>
#include <cmath>
#include <numbers>

namespace {

using krPolygonTriangulation::orient2d;

// The exact sign of the turn a -> b -> c: +1 left, -1 right, 0 straight.
template <class Point>
int Turn(const Point& a, const Point& b, const Point& c) {
  const double d = orient2d(a[0], a[1], b[0], b[1], c[0], c[1]);
  return (d > 0) - (d < 0);
}

// c lies within the bounding box of a and b (for a point known to be on the
// line through them, on the closed segment).
template <class Point>
bool Between(const Point& a, const Point& b, const Point& c) {
  return std::min(a[0], b[0]) <= c[0] && c[0] <= std::max(a[0], b[0]) && std::min(a[1], b[1]) <= c[1] &&
         c[1] <= std::max(a[1], b[1]);
}

// The closed segments a-b and c-d have a point in common.
template <class Point>
bool SegmentsMeet(const Point& a, const Point& b, const Point& c, const Point& d) {
  const int o1 = Turn(a, b, c);
  const int o2 = Turn(a, b, d);
  const int o3 = Turn(c, d, a);
  const int o4 = Turn(c, d, b);
  if (o1 * o2 < 0 && o3 * o4 < 0)
    return true;
  return (o1 == 0 && Between(a, b, c)) || (o2 == 0 && Between(a, b, d)) || (o3 == 0 && Between(c, d, a)) ||
         (o4 == 0 && Between(c, d, b));
}

template <class Point>
bool Finite(const Point& p) {
  return std::isfinite(double(p[0])) && std::isfinite(double(p[1]));
}

}  // namespace

template <int N, class Real, class Other>
CKRPlanarPolygonT<N, Real, Other>::CKRPlanarPolygonT(const Polygon& polygon, const Matrix& matrix)
    : m_Matrix(matrix) {
  const unsigned n = polygon.GetLength();
  m_Points.reserve(n);
  for (unsigned i = 0; i < n; ++i)
    m_Points.push_back(matrix * polygon[i]);
}

// The shoelace sum in double: x_i (y_(i+1) - y_(i-1)).
template <int N, class Real, class Other>
double CKRPlanarPolygonT<N, Real, Other>::DoubleArea() const noexcept {
  const std::size_t n = m_Points.size();
  if (n < 3)
    return 0;
  double sum = 0;
  for (std::size_t i = 0; i < n; ++i) {
    const Point& next = m_Points[(i + 1) % n];
    const Point& previous = m_Points[(i + n - 1) % n];
    sum += double(m_Points[i][0]) * (double(next[1]) - double(previous[1]));
  }
  return sum;
}

template <int N, class Real, class Other>
_EKRVertexOrientation CKRPlanarPolygonT<N, Real, Other>::GetVertexOrientation() const noexcept {
  const double area = DoubleArea();
  if (area > 0)
    return KRORIENTATION_COUNTERCLOCKWISE;
  if (area < 0)
    return KRORIENTATION_CLOCKWISE;
  return KRORIENTATION_DEGENERATE;
}

template <int N, class Real, class Other>
bool CKRPlanarPolygonT<N, Real, Other>::IsConvex() const {
  // The points without consecutive repeats (the closing pair included).
  std::vector<Point> ring;
  ring.reserve(m_Points.size());
  for (const Point& p : m_Points) {
    if (!Finite(p))
      return false;
    if (ring.empty() || p[0] != ring.back()[0] || p[1] != ring.back()[1])
      ring.push_back(p);
  }
  while (ring.size() > 1 && ring.front()[0] == ring.back()[0] && ring.front()[1] == ring.back()[1])
    ring.pop_back();
  const std::size_t n = ring.size();
  if (n < 3)
    return false;
  int sign = 0;
  double winding = 0;
  for (std::size_t i = 0; i < n; ++i) {
    const Point& a = ring[(i + n - 1) % n];
    const Point& b = ring[i];
    const Point& c = ring[(i + 1) % n];
    const double ux = double(b[0]) - double(a[0]), uy = double(b[1]) - double(a[1]);
    const double vx = double(c[0]) - double(b[0]), vy = double(c[1]) - double(b[1]);
    const int turn = Turn(a, b, c);
    if (turn == 0) {
      if (ux * vx + uy * vy < 0)
        return false;  // doubles back
      continue;
    }
    if (sign != 0 && turn != sign)
      return false;
    sign = turn;
    winding += std::atan2(ux * vy - uy * vx, ux * vx + uy * vy);
  }
  // One full turn is 2 pi; a star that winds twice reaches 4 pi. Rounding
  // of the angles is far below the pi between them.
  return sign != 0 && std::fabs(winding) < 3 * std::numbers::pi;
}

template <int N, class Real, class Other>
bool CKRPlanarPolygonT<N, Real, Other>::IsSimple() const {
  const std::size_t n = m_Points.size();
  if (n < 3)
    return false;
  for (const Point& p : m_Points)
    if (!Finite(p))
      return false;
  const auto at = [&](std::size_t i) -> const Point& { return m_Points[i % n]; };
  for (std::size_t i = 0; i < n; ++i) {
    const Point& a = at(i);
    const Point& b = at(i + 1);
    if (a[0] == b[0] && a[1] == b[1])
      return false;
    // The next edge shares b: it may only fold back along this one.
    const Point& c = at(i + 2);
    if (Turn(a, b, c) == 0 && (double(a[0]) - b[0]) * (double(c[0]) - b[0]) + (double(a[1]) - b[1]) * (double(c[1]) - b[1]) > 0)
      return false;
    // Edges that share no vertex must not meet at all.
    for (std::size_t j = i + 2; j < n; ++j) {
      if (i == 0 && j == n - 1)
        continue;  // the closing edge shares the first vertex
      if (SegmentsMeet(a, b, at(j), at(j + 1)))
        return false;
    }
  }
  return true;
}

template <int N, class Real, class Other>
std::vector<typename CKRPlanarPolygonT<N, Real, Other>::Segment> CKRPlanarPolygonT<N, Real, Other>::GetEdges() const {
  std::vector<Segment> edges;
  const std::size_t n = m_Points.size();
  if (n == 2)
    edges.emplace_back(m_Points[0], m_Points[1]);
  if (n >= 3)
    for (std::size_t i = 0; i < n; ++i)
      edges.emplace_back(m_Points[i], m_Points[(i + 1) % n]);
  return edges;
}

template <int N, class Real, class Other>
void CKRPlanarPolygonT<N, Real, Other>::ReverseWinding() {
  std::reverse(m_Points.begin(), m_Points.end());
}

template class CKRPlanarPolygonT<2, float, double>;
template class CKRPlanarPolygonT<3, float, double>;
template class CKRPlanarPolygonT<4, float, double>;
template class CKRPlanarPolygonT<2, double, float>;
template class CKRPlanarPolygonT<3, double, float>;
template class CKRPlanarPolygonT<4, double, float>;
