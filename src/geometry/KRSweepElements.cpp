// Type names and the edge's sweep key.
#include <krCoreLib/geometry/KRSweepElements.h>

#include <algorithm>
#include <utility>

namespace krPolygonTriangulation {

const char* TypeName(Type type) noexcept {
  switch (type) {
  case START:
    return "START";
  case END:
    return "END";
  case MERGE:
    return "MERGE";
  case SPLIT:
    return "SPLIT";
  case REGULAR_UP:
    return "REGULAR_UP";
  case REGULAR_DOWN:
    return "REGULAR_DOWN";
  default:
    return "";
  }
}

void Linebase::setKeyValue(double y) noexcept {
  const Pointbase& start = *m_pEndPoints[0];
  const Pointbase& end = *m_pEndPoints[1];
  if (start.m_Y == end.m_Y)
    m_Key = std::min(start.m_X, end.m_X);
  else
    m_Key = start.m_X + (end.m_X - start.m_X) * (y - start.m_Y) / (end.m_Y - start.m_Y);
}

void Linebase::reverse() noexcept { std::swap(m_pEndPoints[0], m_pEndPoints[1]); }

}  // namespace krPolygonTriangulation
