// Ear clipping: input checks, the query set-up by strategy, and the clipping
// itself with its convex, reflex and ear lists.
#include <krCoreLib/geometry/CKRTriangulateEarClipping.h>

#include <algorithm>
#include <cmath>
#include <utility>

using namespace krRationalArithmetic;

template <class Real, class Other>
CKRTriangulateEarClipping<Real, Other>::CKRTriangulateEarClipping(int n, const Vector* positions,
                                                                  Query::Type queryType, Real epsilon,
                                                                  int*& indices) {
  indices = nullptr;
  if (const wchar_t* reason = Check(n, positions, queryType)) {
    m_Error = reason;
    return;
  }
  MakeQuery(n, positions, queryType, epsilon);
  int* result = new int[std::size_t(3) * std::size_t(n - 2) + 3];
  if (Triangulate(n, result)) {
    indices = result;
    m_iTriangles = n - 2;
  } else {
    delete[] result;
    m_Error = L"no ear left";
  }
  // The query and the scaled positions live only while the constructor runs.
  m_pQuery.reset();
  m_Scaled = std::vector<Vector>();
  m_Vertex = std::vector<Vertex>();
}

template <class Real, class Other>
CKRTriangulateEarClipping<Real, Other>::~CKRTriangulateEarClipping() = default;

template <class Real, class Other>
const wchar_t* CKRTriangulateEarClipping<Real, Other>::Check(int n, const Vector* positions, Query::Type queryType) {
  if (n < 3 || positions == nullptr)
    return L"fewer than 3 vertices";
  if (int(queryType) < int(Query::TYPE_INT64) || int(queryType) > int(Query::TYPE_FILTERED))
    return L"unknown query type";
  std::vector<std::pair<float, float>> sorted(static_cast<std::size_t>(n));
  for (int i = 0; i < n; ++i) {
    if (!std::isfinite(positions[i].X()) || !std::isfinite(positions[i].Y()))
      return L"a vertex coordinate is not finite";
    // +0 for -0, so that the two zeros count as one position.
    sorted[std::size_t(i)] = {positions[i].X() + 0.0f, positions[i].Y() + 0.0f};
  }
  std::sort(sorted.begin(), sorted.end());
  if (std::adjacent_find(sorted.begin(), sorted.end()) != sorted.end())
    return L"two vertices coincide";
  // Twice the signed area; the products of floats are exact in double.
  double area = 0;
  for (int i = 0, j = n - 1; i < n; j = i++)
    area += double(positions[j].X()) * double(positions[i].Y()) - double(positions[i].X()) * double(positions[j].Y());
  if (!(area > 0))
    return L"the polygon is not counter-clockwise";
  return nullptr;
}

// The integer strategies need small integral coordinates: the bounding box
// goes into [0, 2^20] (64-bit determinants of such differences stay below
// 2^42) or [0, 2^24] (the multi-word integers' 32-bit differences); the
// floating-point strategy works in the unit square.
template <class Real, class Other>
void CKRTriangulateEarClipping<Real, Other>::MakeQuery(int n, const Vector* positions, Query::Type queryType,
                                                       Real epsilon) {
  double range = 1;
  switch (queryType) {
    case Query::TYPE_INT64:
      range = double(1 << 20);
      break;
    case Query::TYPE_INTEGER:
      range = double(1 << 24);
      break;
    case Query::TYPE_REAL:
      range = 1;
      break;
    case Query::TYPE_RATIONAL:
      m_pQuery = std::make_unique<Query2TRational<Real, Other>>(n, positions);
      return;
    case Query::TYPE_FILTERED:
      m_pQuery = std::make_unique<Query2Filtered<Real, Other>>(n, positions, epsilon);
      return;
  }
  double minX = positions[0].X(), minY = positions[0].Y(), maxX = minX, maxY = minY;
  for (int i = 1; i < n; ++i) {
    minX = std::min(minX, double(positions[i].X()));
    minY = std::min(minY, double(positions[i].Y()));
    maxX = std::max(maxX, double(positions[i].X()));
    maxY = std::max(maxY, double(positions[i].Y()));
  }
  // A power of two: scaling then rounds nothing, so integral (or dyadic)
  // input keeps its exact positions and its exact decisions whenever the
  // scaled box holds its spacing.
  const double extent = std::max(maxX - minX, maxY - minY);
  const double scale = extent > 0 ? std::exp2(std::floor(std::log2(range / extent))) : 1;
  m_Scaled.resize(std::size_t(n));
  for (int i = 0; i < n; ++i)
    m_Scaled[std::size_t(i)] = Vector(float((positions[i].X() - minX) * scale), float((positions[i].Y() - minY) * scale));
  if (queryType == Query::TYPE_INT64)
    m_pQuery = std::make_unique<Query2Int64<Real, Other>>(n, m_Scaled.data());
  else if (queryType == Query::TYPE_INTEGER)
    m_pQuery = std::make_unique<Query2TInteger<Real, Other>>(n, m_Scaled.data());
  else
    m_pQuery = std::make_unique<Query2>(n, m_Scaled.data());
}

template <class Real, class Other>
bool CKRTriangulateEarClipping<Real, Other>::Triangulate(int n, int* indices) {
  m_Vertex.assign(std::size_t(n), Vertex());
  for (int i = 0; i < n; ++i) {
    m_Vertex[i].VPrev = i > 0 ? i - 1 : n - 1;
    m_Vertex[i].VNext = i < n - 1 ? i + 1 : 0;
  }
  for (int i = 0; i < n; ++i) {
    if (IsConvex(i))
      InsertAfterC(i);
    else
      InsertAfterR(i);
  }

  int* out = indices;
  const auto emit = [&](int e) {
    *out++ = m_Vertex[e].VPrev;
    *out++ = e;
    *out++ = m_Vertex[e].VNext;
  };

  if (m_iRFirst == -1) {
    // Convex: the fan from vertex 0.
    for (int i = 1; i < n - 1; ++i) {
      *out++ = 0;
      *out++ = i;
      *out++ = i + 1;
    }
    return true;
  }

  for (int i = m_iCFirst; i != -1; i = m_Vertex[i].SNext)
    if (IsEar(i))
      InsertEndE(i);
  if (m_iEFirst == -1)
    return false;
  m_Vertex[m_iEFirst].EPrev = m_iELast;
  m_Vertex[m_iELast].ENext = m_iEFirst;

  emit(m_iEFirst);
  RemoveV(m_iEFirst);

  for (int step = 0; step < n - 4; ++step) {
    const int ear = m_iEFirst;
    const int p = m_Vertex[ear].VPrev;
    const int q = m_Vertex[ear].VNext;
    Update(p, true);
    Update(q, false);
    // The ear just cut leaves the ring; the next one is cut in turn.
    RemoveE(ear);
    if (m_iEFirst == -1)
      return false;
    emit(m_iEFirst);
    RemoveV(m_iEFirst);
  }

  // Three vertices remain: the last triangle. The ring's next ear names it
  // when the ring still holds one of them; otherwise the neighbour of the
  // ear cut last does.
  const int last = m_iEFirst;
  const int neighbour = m_Vertex[last].VNext;
  RemoveE(last);
  emit(m_iEFirst != -1 && m_iEFirst != last ? m_iEFirst : neighbour);
  return true;
}

template <class Real, class Other>
bool CKRTriangulateEarClipping<Real, Other>::IsConvex(int i) {
  Vertex& vertex = m_Vertex[i];
  vertex.IsConvex = m_pQuery->ToLine(i, vertex.VPrev, vertex.VNext) > 0;
  return vertex.IsConvex;
}

// A reflex vertex anywhere in the closed triangle other than at its corners
// blocks the ear: cut with a reflex vertex on its diagonal, the rest of the
// polygon would touch itself there, and a later ear at that vertex could
// turn over. Every simple polygon keeps two ears whose diagonals touch no
// other vertex, so the stricter test never runs out of ears.
template <class Real, class Other>
bool CKRTriangulateEarClipping<Real, Other>::IsEar(int i) {
  Vertex& vertex = m_Vertex[i];
  vertex.IsEar = true;
  for (int j = m_iRFirst; j != -1; j = m_Vertex[j].SNext) {
    if (j == vertex.VPrev || j == i || j == vertex.VNext)
      continue;
    if (m_pQuery->ToTriangle(j, vertex.VPrev, i, vertex.VNext) <= 0) {
      vertex.IsEar = false;
      break;
    }
  }
  return vertex.IsEar;
}

// A neighbour of the ear just cut: its angle has shrunk, so a reflex vertex
// may have turned convex and become an ear, and an ear may have stopped
// being one. Convexity is tested again for ears too: with straight
// vertices, or an approximate strategy, an ear can turn reflex, and it then
// joins the reflex list so that it blocks the ears around it.
template <class Real, class Other>
void CKRTriangulateEarClipping<Real, Other>::Update(int v, bool beforeFirst) {
  Vertex& vertex = m_Vertex[v];
  const bool wasConvex = vertex.IsConvex;
  const bool wasEar = vertex.IsEar;
  if (!IsConvex(v)) {
    if (wasEar)
      RemoveE(v);
    if (wasConvex) {
      vertex.SPrev = vertex.SNext = -1;  // out of the convex list, which is no longer walked
      InsertAfterR(v);
    }
    return;
  }
  if (!wasConvex)
    RemoveR(v);
  const bool ear = IsEar(v);
  if (ear && !wasEar) {
    if (beforeFirst)
      InsertBeforeE(v);
    else
      InsertAfterE(v);
  } else if (!ear && wasEar) {
    RemoveE(v);
  }
}

template <class Real, class Other>
void CKRTriangulateEarClipping<Real, Other>::Append(int i, int& first, int& last) {
  if (first == -1)
    first = i;
  else {
    m_Vertex[last].SNext = i;
    m_Vertex[i].SPrev = last;
  }
  last = i;
}

template <class Real, class Other>
void CKRTriangulateEarClipping<Real, Other>::InsertAfterC(int i) {
  Append(i, m_iCFirst, m_iCLast);
}

template <class Real, class Other>
void CKRTriangulateEarClipping<Real, Other>::InsertAfterR(int i) {
  Append(i, m_iRFirst, m_iRLast);
}

template <class Real, class Other>
void CKRTriangulateEarClipping<Real, Other>::RemoveR(int i) {
  Vertex& vertex = m_Vertex[i];
  if (vertex.SPrev != -1)
    m_Vertex[vertex.SPrev].SNext = vertex.SNext;
  else
    m_iRFirst = vertex.SNext;
  if (vertex.SNext != -1)
    m_Vertex[vertex.SNext].SPrev = vertex.SPrev;
  else
    m_iRLast = vertex.SPrev;
  vertex.SPrev = vertex.SNext = -1;
}

template <class Real, class Other>
void CKRTriangulateEarClipping<Real, Other>::InsertEndE(int i) {
  if (m_iEFirst == -1)
    m_iEFirst = m_iELast = i;
  else {
    m_Vertex[m_iELast].ENext = i;
    m_Vertex[i].EPrev = m_iELast;
    m_iELast = i;
  }
}

// The ring is circular once built: an empty ring becomes a ring of one.
// Otherwise i goes between `previous` and `next`, neighbours in the ring.
template <class Real, class Other>
bool CKRTriangulateEarClipping<Real, Other>::LinkE(int i, int previous, int next) {
  if (m_iEFirst == -1) {
    m_iEFirst = m_iELast = i;
    m_Vertex[i].EPrev = m_Vertex[i].ENext = i;
    return false;
  }
  m_Vertex[i].EPrev = previous;
  m_Vertex[i].ENext = next;
  m_Vertex[previous].ENext = i;
  m_Vertex[next].EPrev = i;
  return true;
}

template <class Real, class Other>
void CKRTriangulateEarClipping<Real, Other>::InsertAfterE(int i) {
  const int first = m_iEFirst;
  if (LinkE(i, first, first != -1 ? m_Vertex[first].ENext : -1) && m_iELast == first)
    m_iELast = i;
}

template <class Real, class Other>
void CKRTriangulateEarClipping<Real, Other>::InsertBeforeE(int i) {
  const int first = m_iEFirst;
  if (LinkE(i, first != -1 ? m_Vertex[first].EPrev : -1, first))
    m_iELast = i;
}

template <class Real, class Other>
void CKRTriangulateEarClipping<Real, Other>::RemoveE(int i) {
  Vertex& vertex = m_Vertex[i];
  vertex.IsEar = false;
  if (vertex.ENext == i || vertex.ENext == -1) {  // the only ear
    if (m_iEFirst == i)
      m_iEFirst = m_iELast = -1;
    vertex.EPrev = vertex.ENext = -1;
    return;
  }
  m_Vertex[vertex.EPrev].ENext = vertex.ENext;
  m_Vertex[vertex.ENext].EPrev = vertex.EPrev;
  if (m_iEFirst == i)
    m_iEFirst = vertex.ENext;
  if (m_iELast == i)
    m_iELast = vertex.EPrev;
  vertex.EPrev = vertex.ENext = -1;
}

template <class Real, class Other>
void CKRTriangulateEarClipping<Real, Other>::RemoveV(int i) {
  const Vertex& vertex = m_Vertex[i];
  m_Vertex[vertex.VPrev].VNext = vertex.VNext;
  m_Vertex[vertex.VNext].VPrev = vertex.VPrev;
}

template class CKRTriangulateEarClipping<float, double>;
template class CKRTriangulateEarClipping<double, float>;
