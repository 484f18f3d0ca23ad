// Geometry: the exact orientation test, the sweep-line triangulation of a
// polygon with a hole, and the ear clipping of an L-shaped polygon with the
// exact predicates; malformed input is reported and the host goes on.
#include "KRDemo.h"

#include <vector>

namespace {

using namespace krPolygonTriangulation;
using Contour = std::vector<CKRPoint2T<double, float>>;

void PrintTriangles(const Polygon& polygon) {
  for (const Polygon::Triangle& t : polygon.triangles()) {
    const Pointbase& a = polygon.points()[t[0]];
    const Pointbase& b = polygon.points()[t[1]];
    const Pointbase& c = polygon.points()[t[2]];
    Print(CKRString::Formatted(L"   (%g, %g) (%g, %g) (%g, %g)\n", a.m_X, a.m_Y, b.m_X, b.m_Y, c.m_X, c.m_Y));
  }
}

}  // namespace

void KRDemoGeometry() {
  Print(L"1. The orientation of nearly collinear points, exactly:\n");
  // a lies one ulp off the line through b and c; rounded arithmetic sees no
  // turn, or the wrong one.
  const double ax = 0.5 + 0x1p-53;
  const double ay = 0.5;
  const double naive = (ax - 24.0) * (12.0 - 24.0) - (ay - 24.0) * (12.0 - 24.0);
  Print(CKRString::Formatted(L"   rounded determinant %g, orient2d %g (clockwise)\n", naive,
                             orient2d(ax, ay, 12.0, 12.0, 24.0, 24.0)));

  Print(L"\n2. A square with a square hole (outer counter-clockwise, hole clockwise):\n");
  const Contour square = {{0.0, 0.0}, {4.0, 0.0}, {4.0, 4.0}, {0.0, 4.0}};
  const Contour hole = {{1.0, 1.0}, {1.0, 3.0}, {3.0, 3.0}, {3.0, 1.0}};
  Polygon polygon;
  polygon.AddContour(square);
  polygon.AddContour(hole);
  polygon.Finish();
  Print(L"   ");
  if (polygon.triangulation())
    PrintTriangles(polygon);

  Print(L"\n3. A repeated point is refused when the contour is added:\n");
  Polygon repeated;
  Print(CKRString::Formatted(L"   AddContour = %d\n",
                             repeated.AddContour({{0.0, 0.0}, {1.0, 0.0}, {0.0, 0.0}, {0.0, 1.0}}) ? 1 : 0));

  Print(L"\n4. A clockwise boundary is reported, and the host carries on:\n");
  Polygon clockwise;
  clockwise.AddContour({{0.0, 0.0}, {0.0, 4.0}, {4.0, 4.0}, {4.0, 0.0}});
  clockwise.Finish();
  const bool done = clockwise.triangulation();
  Print(CKRString::Formatted(L"   triangulation() = %d, %d triangles\n", done ? 1 : 0, int(clockwise.triangles().size())));
  Polygon reversed;
  reversed.AddContour({{0.0, 0.0}, {0.0, 4.0}, {4.0, 4.0}, {4.0, 0.0}}, true);
  reversed.Finish();
  Print(L"   the same contour added reversed: ");
  reversed.triangulation();

  Print(L"\n5. Ear clipping of an L-shaped polygon, every decision exact (filtered predicates):\n");
  using Vertex = CKRVector2T<float, double>;
  const Vertex ell[] = {Vertex(0, 0), Vertex(2, 0), Vertex(2, 1), Vertex(1, 1), Vertex(1, 2), Vertex(0, 2)};
  int* indices = nullptr;
  const CKRTriangulateEarClipping<double, float> clipping(6, ell, krRationalArithmetic::Query::TYPE_FILTERED, 1e-12,
                                                          indices);
  for (int t = 0; t < clipping.GetTriangleCount(); ++t) {
    const Vertex& a = ell[indices[3 * t]];
    const Vertex& b = ell[indices[3 * t + 1]];
    const Vertex& c = ell[indices[3 * t + 2]];
    Print(CKRString::Formatted(L"   (%g, %g) (%g, %g) (%g, %g)\n", a.X(), a.Y(), b.X(), b.Y(), c.X(), c.Y()));
  }
  delete[] indices;
  const Vertex clockwiseEll[] = {ell[0], ell[5], ell[4], ell[3], ell[2], ell[1]};
  const CKRTriangulateEarClipping<double, float> refused(6, clockwiseEll, krRationalArithmetic::Query::TYPE_FILTERED,
                                                         1e-12, indices);
  Print(CKRString::Formatted(L"   the same polygon clockwise: \"%ls\"\n", refused.GetError().GetString()));
}
