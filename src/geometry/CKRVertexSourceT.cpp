// The array vertex source's owned array and comparisons, and the
// instantiations of the vertex sources of both precision pairs.
#include <krCoreLib/geometry/CKRVertexSourceT.h>

#include <cstring>
#include <utility>

template <int N, class Real, class Other>
CKRArrayVertexSourceT<N, Real, Other>::CKRArrayVertexSourceT(unsigned n)
    : m_Count(n), m_pPoints(n > 0 ? new Point[n] : nullptr) {
  for (unsigned i = 0; i < n; ++i)
    m_pPoints[i] = Point::ZERO();
}

template <int N, class Real, class Other>
CKRArrayVertexSourceT<N, Real, Other>::CKRArrayVertexSourceT(const CKRArrayVertexSourceT& source)
    : CKRVertexSourceT<N, Real, Other>(source),
      m_Count(source.m_Count),
      m_pPoints(source.m_Count > 0 ? new Point[source.m_Count] : nullptr) {
  for (unsigned i = 0; i < m_Count; ++i)
    m_pPoints[i] = source.m_pPoints[i];
}

template <int N, class Real, class Other>
CKRArrayVertexSourceT<N, Real, Other>::CKRArrayVertexSourceT(CKRArrayVertexSourceT&& source) noexcept
    : m_Count(std::exchange(source.m_Count, 0u)), m_pPoints(std::exchange(source.m_pPoints, nullptr)) {}

// Copy and swap: the points of a failed copy never replace these.
template <int N, class Real, class Other>
CKRArrayVertexSourceT<N, Real, Other>& CKRArrayVertexSourceT<N, Real, Other>::operator=(
    const CKRArrayVertexSourceT& source) {
  if (this != &source) {
    CKRArrayVertexSourceT copy(source);
    *this = std::move(copy);
  }
  return *this;
}

template <int N, class Real, class Other>
CKRArrayVertexSourceT<N, Real, Other>& CKRArrayVertexSourceT<N, Real, Other>::operator=(
    CKRArrayVertexSourceT&& source) noexcept {
  std::swap(m_Count, source.m_Count);
  std::swap(m_pPoints, source.m_pPoints);
  return *this;
}

template <int N, class Real, class Other>
CKRArrayVertexSourceT<N, Real, Other>::~CKRArrayVertexSourceT() {
  delete[] m_pPoints;
}

template <int N, class Real, class Other>
bool CKRArrayVertexSourceT<N, Real, Other>::operator==(const CKRArrayVertexSourceT& source) const noexcept {
  if (m_Count != source.m_Count)
    return false;
  for (unsigned i = 0; i < m_Count; ++i)
    if (m_pPoints[i] != source.m_pPoints[i])
      return false;
  return true;
}

template <int N, class Real, class Other>
bool CKRArrayVertexSourceT<N, Real, Other>::operator<(const CKRArrayVertexSourceT& source) const noexcept {
  if (m_Count != source.m_Count)
    return m_Count < source.m_Count;
  for (unsigned i = 0; i < m_Count; ++i)
    if (m_pPoints[i] != source.m_pPoints[i])
      return m_pPoints[i] < source.m_pPoints[i];
  return false;
}

template class CKRVertexSourceT<2, float, double>;
template class CKRVertexSourceT<3, float, double>;
template class CKRVertexSourceT<4, float, double>;
template class CKRVertexSourceT<2, double, float>;
template class CKRVertexSourceT<3, double, float>;
template class CKRVertexSourceT<4, double, float>;
template class CKRArrayVertexSourceT<2, float, double>;
template class CKRArrayVertexSourceT<3, float, double>;
template class CKRArrayVertexSourceT<4, float, double>;
template class CKRArrayVertexSourceT<2, double, float>;
template class CKRArrayVertexSourceT<3, double, float>;
template class CKRArrayVertexSourceT<4, double, float>;
template class CKRVectorVertexSourceT<2, float, double>;
template class CKRVectorVertexSourceT<3, float, double>;
template class CKRVectorVertexSourceT<4, float, double>;
template class CKRVectorVertexSourceT<2, double, float>;
template class CKRVectorVertexSourceT<3, double, float>;
template class CKRVectorVertexSourceT<4, double, float>;
