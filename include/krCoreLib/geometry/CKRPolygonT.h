// CKRPolygonT: a closed polygon of dimension N = 2, 3 or 4 as a vertex
// sequence over a vector vertex source that the polygon creates.
//
// Ownership: the source is held by shared ownership. A copy of a polygon
// copies the sequence and shares the source, so both see the same points;
// the source goes with the last polygon that holds it. A sequence pointed
// elsewhere with SetSource refers to a source the caller owns; the polygon's
// own source stays alive regardless.
//
// GetNormal is Newell's normal, normalised (the zero vector for fewer than 3
// vertices, for a degenerate polygon, and always in 2-D, where the normal
// would lie along the missing z axis; w is 0 in 4-D). IsPlanar(decimals):
// false for fewer than 3 vertices; otherwise true when every vertex lies
// within `decimals` places (CKRMathT::Approx_Equal) of the plane through the
// first three non-collinear vertices, and true when all are collinear. Only
// x, y and z take part; every 2-D polygon of 3 or more vertices is planar.
//
// ReverseWinding reverses the sequence's indices (a sequence without
// indices stays as it is). CKRPolygon3T and CKRPolygon4T add nothing but
// constructors and assignment. Not internally synchronised; copies share
// their points, so they share this rule.
#pragma once

#include <krCoreLib/core/KRExport.h>
#include <krCoreLib/geometry/CKRVertexSequenceT.h>
#include <krCoreLib/math/CKRVectorT.h>

#include <memory>

template <int N, class Real, class Other>
class CKRPolygonT {
public:
  using Math = CKRMathT<Real, Other>;
  using Point = CKRPointT<N, Real, Other>;
  using Vector = CKRVectorT<N, Real, Other>;
  using Source = CKRVectorVertexSourceT<N, Real, Other>;
  using Sequence = CKRVertexSequenceT<N, Real, Other>;

  // An owned source of n points at the origin, walked in its own order.
  explicit CKRPolygonT(unsigned n = 0);
  CKRPolygonT(const CKRPolygonT&) = default;
  CKRPolygonT& operator=(const CKRPolygonT&) = default;
  virtual ~CKRPolygonT() = default;

  virtual bool IsPlanar(int decimals) const;
  virtual Vector GetNormal() const;
  void ReverseWinding() { m_Sequence.Reverse(); }

  // Vertex i of the sequence.
  Point& operator[](unsigned i) { return m_Sequence[i]; }
  Point operator[](unsigned i) const { return static_cast<const Sequence&>(m_Sequence)[i]; }
  unsigned GetLength() const { return m_Sequence.GetLength(); }
  Sequence& GetSequence() noexcept { return m_Sequence; }
  const Sequence& GetSequence() const noexcept { return m_Sequence; }
  // The source the polygon created (shared with its copies).
  Source& GetSource() noexcept { return *m_pSource; }
  const Source& GetSource() const noexcept { return *m_pSource; }

private:
  std::shared_ptr<Source> m_pSource;
  Sequence m_Sequence;
};

template <class Real, class Other>
class CKRPolygon3T : public CKRPolygonT<3, Real, Other> {
  using Base = CKRPolygonT<3, Real, Other>;

public:
  explicit CKRPolygon3T(unsigned n = 0) : Base(n) {}
  CKRPolygon3T(const Base& p) : Base(p) {}
  CKRPolygon3T& operator=(const Base& p) {
    Base::operator=(p);
    return *this;
  }
};

template <class Real, class Other>
class CKRPolygon4T : public CKRPolygonT<4, Real, Other> {
  using Base = CKRPolygonT<4, Real, Other>;

public:
  explicit CKRPolygon4T(unsigned n = 0) : Base(n) {}
  CKRPolygon4T(const Base& p) : Base(p) {}
  CKRPolygon4T& operator=(const Base& p) {
    Base::operator=(p);
    return *this;
  }
};

extern template class KRCORELIB_API CKRPolygonT<2, float, double>;
extern template class KRCORELIB_API CKRPolygonT<3, float, double>;
extern template class KRCORELIB_API CKRPolygonT<4, float, double>;
extern template class KRCORELIB_API CKRPolygonT<2, double, float>;
extern template class KRCORELIB_API CKRPolygonT<3, double, float>;
extern template class KRCORELIB_API CKRPolygonT<4, double, float>;
extern template class KRCORELIB_API CKRPolygon3T<float, double>;
extern template class KRCORELIB_API CKRPolygon3T<double, float>;
extern template class KRCORELIB_API CKRPolygon4T<float, double>;
extern template class KRCORELIB_API CKRPolygon4T<double, float>;
