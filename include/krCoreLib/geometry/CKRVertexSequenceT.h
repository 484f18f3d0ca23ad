// CKRVertexSequenceT: an ordered walk over the points of a vertex source of
// dimension N = 2, 3 or 4, by a sequence of indices into it.
//
// With indices, element i is source[indices[i]] and the length is the
// number of indices; without any, the sequence is the source itself in its
// own order (element i is source[i], the length the source's count). The
// source is not owned and must outlive the sequence's uses of it; a
// sequence without a source has length 0 and its elements are a detached
// point (the origin until written), as is any element whose position or
// index lies outside the source: a bad position never faults.
//
// Reverse() reverses the indices (a sequence without indices is unchanged);
// SetLength(n) resizes the indices (new entries 0), SetLength(0) clears
// them. Not internally synchronised.
#pragma once

#include <krCoreLib/core/KRExport.h>
#include <krCoreLib/geometry/CKRVertexSourceT.h>

#include <vector>

template <int N, class Real, class Other>
class CKRVertexSequenceT {
public:
  using Point = CKRPointT<N, Real, Other>;
  using Source = CKRVertexSourceT<N, Real, Other>;

  CKRVertexSequenceT() = default;
  explicit CKRVertexSequenceT(Source* source) noexcept : m_pSource(source) {}
  CKRVertexSequenceT(const CKRVertexSequenceT&) = default;
  CKRVertexSequenceT& operator=(const CKRVertexSequenceT&) = default;
  virtual ~CKRVertexSequenceT() = default;

  virtual void SetSource(Source* source) { m_pSource = source; }
  virtual Point& operator[](unsigned i);
  virtual Point operator[](unsigned i) const;
  virtual void Reverse();
  virtual unsigned GetLength() const;
  virtual void SetLength(unsigned n);

  Source* GetSource() const noexcept { return m_pSource; }
  // The index sequence itself (empty when the sequence walks the source in
  // its own order).
  std::vector<unsigned>& GetIndices() noexcept { return m_Indices; }
  const std::vector<unsigned>& GetIndices() const noexcept { return m_Indices; }

private:
  // The source index of element i, or false when there is none.
  bool Locate(unsigned i, unsigned& index) const;

  Source* m_pSource = nullptr;
  std::vector<unsigned> m_Indices;
  Point m_Detached = Point::ZERO();
};

extern template class KRCORELIB_API CKRVertexSequenceT<2, float, double>;
extern template class KRCORELIB_API CKRVertexSequenceT<3, float, double>;
extern template class KRCORELIB_API CKRVertexSequenceT<4, float, double>;
extern template class KRCORELIB_API CKRVertexSequenceT<2, double, float>;
extern template class KRCORELIB_API CKRVertexSequenceT<3, double, float>;
extern template class KRCORELIB_API CKRVertexSequenceT<4, double, float>;
