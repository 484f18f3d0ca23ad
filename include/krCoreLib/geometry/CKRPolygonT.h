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

// The named polygons: constructors and assignment only.
#define KR_NAMED_POLYGON(Name, Dimension)                   \
  template <class Real, class Other>                        \
  class Name : public CKRPolygonT<Dimension, Real, Other> { \
    using Base = CKRPolygonT<Dimension, Real, Other>;       \
                                                            \
  public:                                                   \
    explicit Name(unsigned n = 0) : Base(n) {}              \
    Name(const Base& p) : Base(p) {}                        \
    Name& operator=(const Base& p) {                        \
      Base::operator=(p);                                   \
      return *this;                                         \
    }                                                       \
  }
KR_NAMED_POLYGON(CKRPolygon3T, 3);
KR_NAMED_POLYGON(CKRPolygon4T, 4);
#undef KR_NAMED_POLYGON

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
