// CKRTriangulateEarClipping: the triangulation of one simple polygon
// without holes by cutting off ears, with every geometric decision made by
// a krRationalArithmetic query of the caller's strategy.
//
// The constructor does all the work. Input: n vertices (single-precision
// 2-D vectors in both precision pairs) of a simple polygon in
// counter-clockwise order, the query type and the filtered strategy's
// uncertainty `epsilon`. On success `indices` points to a new array (array
// new, the caller's to delete[]) of 3 (n - 2) vertex indices, three per
// counter-clockwise triangle, followed by room for three more;
// GetTriangleCount() is n - 2 and GetError() the empty text.
//
// On failure `indices` is null, GetTriangleCount() 0 and GetError() says
// why (nothing is thrown, nothing is written to the vertices):
//   "fewer than 3 vertices"             n < 3 or no vertex array
//   "unknown query type"                a type outside the five
//   "a vertex coordinate is not finite" NaN or infinity
//   "two vertices coincide"             the same position twice
//   "the polygon is not counter-clockwise"  zero or negative area
//   "no ear left"                       the ear ring ran empty before n - 2
//                                       triangles: the polygon is not simple,
//                                       or it has straight vertices the
//                                       clipping could not get round.
// A vertex is an ear when it is convex and no reflex vertex other than the
// triangle's corners lies in its closed triangle: a reflex vertex on the
// diagonal blocks the cut, which would leave a polygon touching itself.
// Neighbours of a cut ear are tested again for convexity and ear-ness.
// Straight (collinear) vertices of an otherwise simple polygon are fine
// where an ear remains; such a vertex may end up in a triangle of zero area.
//
// Positions given to the query: TYPE_INT64 and TYPE_INTEGER translate the
// vertices by their bounding box's minimum corner and scale them by the
// largest power of two that keeps the box within 2^20 and 2^24 (s the larger
// extent of the box; s = 0 leaves the scale at 1, though such input has no
// area and is refused first), TYPE_REAL by the largest power of two not above
// 1 / s; TYPE_RATIONAL and TYPE_FILTERED use the input positions. Scaling
// by a power of two rounds nothing: integral input whose box fits is used
// at its exact positions. The integer strategies truncate the scaled
// coordinates, so vertices closer than 2s / 2^20 (2s / 2^24) may merge and
// their decisions are exact only for what remains; the rational and
// filtered strategies are exact within the ranges KRQuery2.h documents,
// TYPE_REAL is not exact.
//
// Cost: O(n) for a convex polygon, O(n r) ear tests otherwise (r the number
// of reflex vertices). Each object is used by one thread; distinct objects
// from several at once.
#pragma once

#include <krCoreLib/core/CKRString.h>
#include <krCoreLib/core/KRExport.h>
#include <krCoreLib/geometry/KRQuery2.h>
#include <krCoreLib/math/CKRVector2T.h>

#include <memory>
#include <vector>

template <class Real, class Other>
class CKRTriangulateEarClipping {
public:
  using Vector = CKRVector2T<float, double>;
  using Query = krRationalArithmetic::Query;
  using Query2 = krRationalArithmetic::Query2<Real, Other>;

  CKRTriangulateEarClipping(int n, const Vector* positions, Query::Type queryType, Real epsilon, int*& indices);
  CKRTriangulateEarClipping(const CKRTriangulateEarClipping&) = delete;
  CKRTriangulateEarClipping& operator=(const CKRTriangulateEarClipping&) = delete;
  ~CKRTriangulateEarClipping();

  // n - 2 after success, else 0.
  int GetTriangleCount() const noexcept { return m_iTriangles; }
  // Empty after success, else the reason (see above).
  const CKRString& GetError() const noexcept { return m_Error; }

private:
  struct Vertex {
    bool IsConvex = false;
    bool IsEar = false;
    int VPrev = -1, VNext = -1;  // neighbours in the shrinking polygon
    int SPrev = -1, SNext = -1;  // neighbours in the convex or the reflex list
    int EPrev = -1, ENext = -1;  // neighbours in the ear ring
  };

  // The reason the input cannot be triangulated, or null.
  static const wchar_t* Check(int n, const Vector* positions, Query::Type queryType);
  void MakeQuery(int n, const Vector* positions, Query::Type queryType, Real epsilon);
  bool Triangulate(int n, int* indices);

  bool IsConvex(int i);
  bool IsEar(int i);
  // Tests a neighbour of the ear just cut again and moves it between the
  // lists; an ear that joins the ring goes before or after the first ear.
  void Update(int v, bool beforeFirst);
  void Append(int i, int& first, int& last);  // to the convex or the reflex list
  bool LinkE(int i, int previous, int next);   // false when the ring was empty
  void InsertAfterC(int i);  // appends to the convex list
  void InsertAfterR(int i);  // appends to the reflex list
  void RemoveR(int i);
  void InsertEndE(int i);
  void InsertAfterE(int i);  // after the first ear
  void InsertBeforeE(int i);  // before the first ear
  void RemoveE(int i);
  void RemoveV(int i);

  std::unique_ptr<Query2> m_pQuery;
  std::vector<Vertex> m_Vertex;
  std::vector<Vector> m_Scaled;
  int m_iCFirst = -1, m_iCLast = -1;
  int m_iRFirst = -1, m_iRLast = -1;
  int m_iEFirst = -1, m_iELast = -1;
  int m_iTriangles = 0;
  CKRString m_Error;
};

extern template class KRCORELIB_API CKRTriangulateEarClipping<float, double>;
extern template class KRCORELIB_API CKRTriangulateEarClipping<double, float>;
