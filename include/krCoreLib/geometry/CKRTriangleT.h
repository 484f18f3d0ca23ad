// CKRTriangleT: a triangle of dimension N = 2, 3 or 4 as three vertex
// indices into a vertex source it does not own.
//
// operator[](i) gives a reference to the source's vertex for the index at
// corner i (0, 1, 2). A triangle without a source (the default one), or a
// corner outside 0..2, gives a reference to the triangle's own detached
// point, which is the origin until written, and so does a vertex index not
// below the source's count: never a fault. The source must outlive the
// triangle's uses of it.
//
// The mark is the caller's to use (for example "visited" during a walk over
// a mesh): false after construction, copied with the triangle, and not part
// of the comparisons. == compares the three referenced points pairwise in
// corner order, bit by bit; Approx_Equal after rounding to `decimals` places.
// Not internally synchronised.
#pragma once

#include <krCoreLib/core/KRExport.h>
#include <krCoreLib/geometry/CKRVertexSourceT.h>

template <int N, class Real, class Other>
class CKRTriangleT {
public:
  using Point = CKRPointT<N, Real, Other>;
  using Source = CKRVertexSourceT<N, Real, Other>;

  CKRTriangleT() noexcept : m_Index{0, 0, 0} {}
  CKRTriangleT(Source* source, unsigned i0, unsigned i1, unsigned i2) noexcept
      : m_Index{i0, i1, i2}, m_pSource(source) {}
  CKRTriangleT(const CKRTriangleT&) noexcept = default;
  CKRTriangleT& operator=(const CKRTriangleT&) noexcept = default;
  virtual ~CKRTriangleT() = default;

  virtual Point& operator[](int i) {
    if (!IsAttached(i))
      return m_Detached;
    return (*m_pSource)[m_Index[i]];
  }
  Point operator[](int i) const {
    if (!IsAttached(i))
      return m_Detached;
    return static_cast<const Source&>(*m_pSource)[m_Index[i]];
  }

  Source* GetSource() const noexcept { return m_pSource; }
  void SetSource(Source* source) noexcept { m_pSource = source; }
  // The vertex index at corner i (0..2, not checked).
  unsigned GetIndex(int i) const noexcept { return m_Index[i]; }
  void SetIndex(int i, unsigned index) noexcept { m_Index[i] = index; }
  bool IsMarked() const noexcept { return m_bMarked; }
  void SetMarked(bool marked) noexcept { m_bMarked = marked; }

  bool operator==(const CKRTriangleT& t) const {
    for (int i = 0; i < 3; ++i)
      if ((*this)[i] != t[i])
        return false;
    return true;
  }
  bool operator!=(const CKRTriangleT& t) const { return !(*this == t); }
  bool Approx_Equal(const CKRTriangleT& t, int decimals) const {
    for (int i = 0; i < 3; ++i)
      if (!(*this)[i].Approx_Equal(t[i], decimals))
        return false;
    return true;
  }

private:
  bool IsAttached(int i) const { return m_pSource != nullptr && i >= 0 && i <= 2 && m_Index[i] < m_pSource->GetCount(); }

  bool m_bMarked = false;
  unsigned m_Index[3];
  Source* m_pSource = nullptr;
  Point m_Detached = Point::ZERO();
};

extern template class KRCORELIB_API CKRTriangleT<2, float, double>;
extern template class KRCORELIB_API CKRTriangleT<3, float, double>;
extern template class KRCORELIB_API CKRTriangleT<4, float, double>;
extern template class KRCORELIB_API CKRTriangleT<2, double, float>;
extern template class KRCORELIB_API CKRTriangleT<3, double, float>;
extern template class KRCORELIB_API CKRTriangleT<4, double, float>;
