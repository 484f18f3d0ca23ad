// CKRPolyLineT: an open chain of points of dimension N = 2, 3 or 4.
//
// == holds when both have the same number of points and all are bitwise
// equal in order; < when this polyline has fewer points than the other.
// Copies and assignment copy all points. CKRPolyLine3T and CKRPolyLine4T add
// nothing but constructors and assignment. Indexes are not checked: the
// caller keeps them below GetCount(). Plain values.
#pragma once

#include <krCoreLib/core/KRExport.h>
#include <krCoreLib/math/CKRPointT.h>

#include <vector>

template <int N, class Real, class Other>
class CKRPolyLineT {
public:
  using Point = CKRPointT<N, Real, Other>;

  CKRPolyLineT() = default;
  // n points at the origin.
  explicit CKRPolyLineT(unsigned n) : m_Points(n, Point::ZERO()) {}
  CKRPolyLineT(const CKRPolyLineT&) = default;
  CKRPolyLineT(CKRPolyLineT&&) noexcept = default;
  CKRPolyLineT& operator=(const CKRPolyLineT&) = default;
  CKRPolyLineT& operator=(CKRPolyLineT&&) noexcept = default;
  ~CKRPolyLineT() = default;

  Point& operator[](unsigned i) { return m_Points[i]; }
  const Point& operator[](unsigned i) const { return m_Points[i]; }
  unsigned GetCount() const noexcept { return unsigned(m_Points.size()); }
  std::vector<Point>& GetPoints() noexcept { return m_Points; }
  const std::vector<Point>& GetPoints() const noexcept { return m_Points; }

  bool operator==(const CKRPolyLineT& p) const { return m_Points == p.m_Points; }
  bool operator!=(const CKRPolyLineT& p) const { return !(*this == p); }
  bool operator<(const CKRPolyLineT& p) const noexcept { return m_Points.size() < p.m_Points.size(); }
  // As many points, each equal after rounding to `decimals` places.
  bool Approx_Equal(const CKRPolyLineT& p, int decimals) const {
    if (m_Points.size() != p.m_Points.size())
      return false;
    for (std::size_t i = 0; i < m_Points.size(); ++i)
      if (!m_Points[i].Approx_Equal(p.m_Points[i], decimals))
        return false;
    return true;
  }

private:
  std::vector<Point> m_Points;
};

// The named polylines: constructors and assignment only.
#define KR_NAMED_POLYLINE(Name, Dimension)                  \
  template <class Real, class Other>                        \
  class Name : public CKRPolyLineT<Dimension, Real, Other> { \
    using Base = CKRPolyLineT<Dimension, Real, Other>;       \
                                                            \
  public:                                                   \
    Name() = default;                                       \
    explicit Name(unsigned n) : Base(n) {}                  \
    Name(const Base& p) : Base(p) {}                        \
    Name& operator=(const Base& p) {                        \
      Base::operator=(p);                                   \
      return *this;                                         \
    }                                                       \
  }
KR_NAMED_POLYLINE(CKRPolyLine3T, 3);
KR_NAMED_POLYLINE(CKRPolyLine4T, 4);
#undef KR_NAMED_POLYLINE

extern template class KRCORELIB_API CKRPolyLineT<2, float, double>;
extern template class KRCORELIB_API CKRPolyLineT<3, float, double>;
extern template class KRCORELIB_API CKRPolyLineT<4, float, double>;
extern template class KRCORELIB_API CKRPolyLineT<2, double, float>;
extern template class KRCORELIB_API CKRPolyLineT<3, double, float>;
extern template class KRCORELIB_API CKRPolyLineT<4, double, float>;
extern template class KRCORELIB_API CKRPolyLine3T<float, double>;
extern template class KRCORELIB_API CKRPolyLine3T<double, float>;
extern template class KRCORELIB_API CKRPolyLine4T<float, double>;
extern template class KRCORELIB_API CKRPolyLine4T<double, float>;
