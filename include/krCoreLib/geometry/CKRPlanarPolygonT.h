// CKRPlanarPolygonT: a closed polygon of dimension N = 2, 3 or 4 whose
// points lie in the x-y plane, with the matrix that brought them there.
//
// Built from (polygon, matrix), it holds matrix * vertex for every vertex
// of the polygon's sequence, in order (the polygon itself is not taken
// over); for a 3-D polygon the matrix is typically a rotation whose third
// row is the polygon's normal, so that the points land in the x-y plane.
// All measures below read x and y only.
//
// Measures (n points, indices cyclic):
//   GetArea             0.5 * sum x_i (y_(i+1) - y_(i-1)), signed, positive
//                       counter-clockwise; 0 for fewer than 3 points.
//   GetDoubleSignedArea twice that, summed in double.
//   GetVertexOrientation  the sign of that as _EKRVertexOrientation.
//   IsConvex            false for fewer than 3 distinct points; true when
//                       every turn has the same sign (straight vertices
//                       allowed, repeated points skipped) and the boundary
//                       winds once (a pentagram turns one way but twice);
//                       a boundary that doubles back is not convex.
//   IsSimple            at least 3 points, no repeated consecutive point,
//                       no two edges meeting anywhere but at the vertex
//                       adjacent edges share, and no adjacent edges folding
//                       back over each other. Quadratic in n.
//   IsSelfIntersecting  at least 3 points and not simple.
//   GetEdges            the segments (p_i, p_(i+1)), the closing one
//                       included, for 3 or more points; one segment for 2
//                       points, none for fewer.
// The turn and intersection tests use the exact orientation predicate, so
// they hold for every finite input; NaN coordinates make a polygon neither
// convex nor simple. Plain values.
#pragma once

#include <krCoreLib/core/KRExport.h>
#include <krCoreLib/geometry/CKRLineT.h>
#include <krCoreLib/geometry/CKRPolygonT.h>
#include <krCoreLib/math/CKRMatrixT.h>

#include <vector>

// The winding of a polygon's points.
enum _EKRVertexOrientation : int {
  KRORIENTATION_CLOCKWISE = -1,
  KRORIENTATION_DEGENERATE = 0,  // zero area: fewer than 3 points, or all on a line
  KRORIENTATION_COUNTERCLOCKWISE = 1,
};

template <int N, class Real, class Other>
class CKRPlanarPolygonT {
public:
  using Math = CKRMathT<Real, Other>;
  using Point = CKRPointT<N, Real, Other>;
  using Matrix = CKRMatrixT<N, Real, Other>;
  using Segment = CKRSegmentT<N, Real, Other>;
  using Polygon = CKRPolygonT<N, Real, Other>;

  // No points; the identity matrix.
  CKRPlanarPolygonT() : m_Matrix(false) {}
  CKRPlanarPolygonT(const Polygon& polygon, const Matrix& matrix);
  CKRPlanarPolygonT(const CKRPlanarPolygonT&) = default;
  CKRPlanarPolygonT& operator=(const CKRPlanarPolygonT&) = default;
  ~CKRPlanarPolygonT() = default;

  // (p1.x - p0.x)(p2.y - p0.y) - (p2.x - p0.x)(p1.y - p0.y): positive when
  // p2 lies left of the directed line p0 -> p1 (rounded in Real).
  static Real isLeft(const Point& p0, const Point& p1, const Point& p2) noexcept {
    return (p1[0] - p0[0]) * (p2[1] - p0[1]) - (p2[0] - p0[0]) * (p1[1] - p0[1]);
  }

  Real GetArea() const noexcept { return Real(DoubleArea() / 2); }
  Real GetDoubleSignedArea() const noexcept { return Real(DoubleArea()); }
  _EKRVertexOrientation GetVertexOrientation() const noexcept;
  bool IsConvex() const;
  bool IsSimple() const;
  bool IsSelfIntersecting() const { return m_Points.size() >= 3 && !IsSimple(); }
  std::vector<Segment> GetEdges() const;
  // Reverses the order of the points.
  void ReverseWinding();

  std::vector<Point>& GetPoints() noexcept { return m_Points; }
  const std::vector<Point>& GetPoints() const noexcept { return m_Points; }
  Matrix& GetMatrix() noexcept { return m_Matrix; }
  const Matrix& GetMatrix() const noexcept { return m_Matrix; }

  bool operator==(const CKRPlanarPolygonT& p) const { return m_Points == p.m_Points && m_Matrix == p.m_Matrix; }
  bool operator!=(const CKRPlanarPolygonT& p) const { return !(*this == p); }

private:
  double DoubleArea() const noexcept;

  std::vector<Point> m_Points;
  Matrix m_Matrix;
};

extern template class KRCORELIB_API CKRPlanarPolygonT<2, float, double>;
extern template class KRCORELIB_API CKRPlanarPolygonT<3, float, double>;
extern template class KRCORELIB_API CKRPlanarPolygonT<4, float, double>;
extern template class KRCORELIB_API CKRPlanarPolygonT<2, double, float>;
extern template class KRCORELIB_API CKRPlanarPolygonT<3, double, float>;
extern template class KRCORELIB_API CKRPlanarPolygonT<4, double, float>;
