// Vertex sequences: the walk by indices, and the instantiations of both
// precision pairs.
#include <krCoreLib/geometry/CKRVertexSequenceT.h>

#include <algorithm>

template <int N, class Real, class Other>
bool CKRVertexSequenceT<N, Real, Other>::Locate(unsigned i, unsigned& index) const {
  if (m_pSource == nullptr)
    return false;
  if (m_Indices.empty())
    index = i;
  else if (i < m_Indices.size())
    index = m_Indices[i];
  else
    return false;
  return index < m_pSource->GetCount();
}

template <int N, class Real, class Other>
typename CKRVertexSequenceT<N, Real, Other>::Point& CKRVertexSequenceT<N, Real, Other>::operator[](unsigned i) {
  unsigned index = 0;
  if (!Locate(i, index))
    return m_Detached;
  return (*m_pSource)[index];
}

template <int N, class Real, class Other>
typename CKRVertexSequenceT<N, Real, Other>::Point CKRVertexSequenceT<N, Real, Other>::operator[](
    unsigned i) const {
  unsigned index = 0;
  if (!Locate(i, index))
    return m_Detached;
  return static_cast<const Source&>(*m_pSource)[index];
}

template <int N, class Real, class Other>
void CKRVertexSequenceT<N, Real, Other>::Reverse() {
  std::reverse(m_Indices.begin(), m_Indices.end());
}

template <int N, class Real, class Other>
unsigned CKRVertexSequenceT<N, Real, Other>::GetLength() const {
  if (!m_Indices.empty())
    return unsigned(m_Indices.size());
  return m_pSource != nullptr ? m_pSource->GetCount() : 0u;
}

template <int N, class Real, class Other>
void CKRVertexSequenceT<N, Real, Other>::SetLength(unsigned n) {
  if (n == 0)
    m_Indices.clear();
  else
    m_Indices.resize(n, 0u);
}

template class CKRVertexSequenceT<2, float, double>;
template class CKRVertexSequenceT<3, float, double>;
template class CKRVertexSequenceT<4, float, double>;
template class CKRVertexSequenceT<2, double, float>;
template class CKRVertexSequenceT<3, double, float>;
template class CKRVertexSequenceT<4, double, float>;
