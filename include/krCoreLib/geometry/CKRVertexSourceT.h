// CKRVertexSourceT: an indexed store of points of dimension N = 2, 3 or 4
// that triangles and vertex sequences refer to, and its two stores:
// CKRArrayVertexSourceT (a fixed-size owned array) and
// CKRVectorVertexSourceT (a growable sequence).
//
// operator[](i) gives a reference to point i (const: a copy); GetCount() the
// number of points. Indexes are not checked: the caller keeps them below
// GetCount(). A reference stays valid until the source is resized or
// destroyed.
//
// The array source compares by count first and then point by point: == when
// both counts and all points are bitwise equal, < when it has fewer points,
// or as many and the first differing point is less by the byte-image order.
//
// Not internally synchronised: distinct objects may be used from different
// threads, one object only from one thread at a time when it is written.
#pragma once

#include <krCoreLib/core/KRExport.h>
#include <krCoreLib/math/CKRPointT.h>

#include <cstddef>
#include <vector>

template <int N, class Real, class Other>
class CKRVertexSourceT {
public:
  using Point = CKRPointT<N, Real, Other>;

  virtual ~CKRVertexSourceT() = default;

  virtual Point& operator[](unsigned i) = 0;
  virtual Point operator[](unsigned i) const = 0;
  virtual unsigned GetCount() const = 0;

protected:
  CKRVertexSourceT() = default;
  CKRVertexSourceT(const CKRVertexSourceT&) = default;
  CKRVertexSourceT& operator=(const CKRVertexSourceT&) = default;
};

template <int N, class Real, class Other>
class CKRArrayVertexSourceT : public CKRVertexSourceT<N, Real, Other> {
public:
  using typename CKRVertexSourceT<N, Real, Other>::Point;

  // No points.
  CKRArrayVertexSourceT() noexcept = default;
  // n points at the origin.
  explicit CKRArrayVertexSourceT(unsigned n);
  // A new array with the same count and a copy of every point.
  CKRArrayVertexSourceT(const CKRArrayVertexSourceT& source);
  CKRArrayVertexSourceT(CKRArrayVertexSourceT&& source) noexcept;
  CKRArrayVertexSourceT& operator=(const CKRArrayVertexSourceT& source);
  CKRArrayVertexSourceT& operator=(CKRArrayVertexSourceT&& source) noexcept;
  ~CKRArrayVertexSourceT() override;

  Point& operator[](unsigned i) override { return m_pPoints[i]; }
  Point operator[](unsigned i) const override { return m_pPoints[i]; }
  unsigned GetCount() const override { return m_Count; }

  bool operator==(const CKRArrayVertexSourceT& source) const noexcept;
  bool operator!=(const CKRArrayVertexSourceT& source) const noexcept { return !(*this == source); }
  bool operator<(const CKRArrayVertexSourceT& source) const noexcept;

private:
  unsigned m_Count = 0;
  Point* m_pPoints = nullptr;
};

template <int N, class Real, class Other>
class CKRVectorVertexSourceT : public CKRVertexSourceT<N, Real, Other> {
public:
  using typename CKRVertexSourceT<N, Real, Other>::Point;

  // n points at the origin.
  explicit CKRVectorVertexSourceT(unsigned n = 0) : m_Points(n, Point::ZERO()) {}

  Point& operator[](unsigned i) override { return m_Points[i]; }
  Point operator[](unsigned i) const override { return m_Points[i]; }
  unsigned GetCount() const override { return unsigned(m_Points.size()); }

  // The points themselves, to add or remove some.
  std::vector<Point>& GetPoints() noexcept { return m_Points; }
  const std::vector<Point>& GetPoints() const noexcept { return m_Points; }

private:
  std::vector<Point> m_Points;
};

extern template class KRCORELIB_API CKRVertexSourceT<2, float, double>;
extern template class KRCORELIB_API CKRVertexSourceT<3, float, double>;
extern template class KRCORELIB_API CKRVertexSourceT<4, float, double>;
extern template class KRCORELIB_API CKRVertexSourceT<2, double, float>;
extern template class KRCORELIB_API CKRVertexSourceT<3, double, float>;
extern template class KRCORELIB_API CKRVertexSourceT<4, double, float>;
extern template class KRCORELIB_API CKRArrayVertexSourceT<2, float, double>;
extern template class KRCORELIB_API CKRArrayVertexSourceT<3, float, double>;
extern template class KRCORELIB_API CKRArrayVertexSourceT<4, float, double>;
extern template class KRCORELIB_API CKRArrayVertexSourceT<2, double, float>;
extern template class KRCORELIB_API CKRArrayVertexSourceT<3, double, float>;
extern template class KRCORELIB_API CKRArrayVertexSourceT<4, double, float>;
extern template class KRCORELIB_API CKRVectorVertexSourceT<2, float, double>;
extern template class KRCORELIB_API CKRVectorVertexSourceT<3, float, double>;
extern template class KRCORELIB_API CKRVectorVertexSourceT<4, float, double>;
extern template class KRCORELIB_API CKRVectorVertexSourceT<2, double, float>;
extern template class KRCORELIB_API CKRVectorVertexSourceT<3, double, float>;
extern template class KRCORELIB_API CKRVectorVertexSourceT<4, double, float>;
