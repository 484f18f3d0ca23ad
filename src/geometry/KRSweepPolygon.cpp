// Polygon: the contours, the vertex classes and the sweep (pass 1). The
// monotone pieces and their triangles are in KRSweepMonotones.cpp.
#include <krCoreLib/geometry/KRSweepPolygon.h>

#include <krCoreLib/geometry/KRAdaptiveOrient2d.h>

#include "KRSweepOrder.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <ostream>

namespace {

using krPolygonTriangulation::Pointbase;
using krPolygonTriangulation::PointbaseMap;

// The diagnostics of malformed input, on standard output.
constexpr char kMessageOrientation[] =
    "Please check your input polygon:\n1)orientations?\n2)duplicated points?\n"
    "triangulation stopped.\n";
constexpr char kMessageDuplicated[] = "No duplicated points please! triangulation stopped\n";

// A slot of the coordinate table holds the high half of the point's hash
// (a tag that spares most coordinate comparisons) above its id.
constexpr std::uint64_t kIdBits = 0xFFFFFFFFull;
// How many points ahead AddContour prefetches their slots: enough loads in
// flight to hide the memory latency of a table larger than the caches.
constexpr std::size_t kPrefetchDistance = 16;

// The hash of exact coordinates; 0 and -0 compare equal and hash alike
// (adding 0 turns -0 into +0). The slot index comes from the low bits, the
// tag from the high ones.
std::uint64_t CoordinateHash(double x, double y) {
  std::uint64_t h = std::bit_cast<std::uint64_t>(x + 0.0) * 0x9E3779B97F4A7C15ull;
  h ^= std::bit_cast<std::uint64_t>(y + 0.0);
  // The finaliser of the splitmix64 generator spreads every input bit.
  h ^= h >> 30;
  h *= 0xBF58476D1CE4E5B9ull;
  h ^= h >> 27;
  h *= 0x94D049BB133111EBull;
  h ^= h >> 31;
  return h;
}

// The slot of the point (x, y) with this hash, or the free slot that ends
// its probe run (linear probing in a table of a power-of-two size).
std::size_t ProbeSlot(const std::vector<std::uint64_t>& slots, const PointbaseMap& points, double x, double y,
                      std::uint64_t hash) {
  const std::size_t mask = slots.size() - 1;
  const std::uint64_t tag = hash & ~kIdBits;
  for (std::size_t slot = hash & mask;; slot = (slot + 1) & mask) {
    const std::uint64_t entry = slots[slot];
    if (entry == 0)
      return slot;
    if ((entry & ~kIdBits) == tag) {
      const Pointbase& p = points[static_cast<unsigned>(entry & kIdBits)];
      if (p.m_X == x && p.m_Y == y)
        return slot;
    }
  }
}

}  // namespace

namespace krPolygonTriangulation {

Polygon::Polygon() = default;

Polygon::~Polygon() = default;

void Polygon::setDebugLog(std::ostream* log) noexcept {
  m_pLog = log;
  m_bDebug = log != nullptr;
}

// ---- contours ----

bool Polygon::is_exist(double x, double y) const {
  if (m_PointSlots.empty())
    return false;
  return m_PointSlots[ProbeSlot(m_PointSlots, m_Points, x, y, CoordinateHash(x, y))] != 0;
}

bool Polygon::AddContour(const std::vector<CKRPoint2T<double, float>>& points, bool reverse, bool closed) {
  if (m_Stage != Stage::Adding)
    return false;
  std::size_t count = points.size();
  if (closed && count > 0)
    --count;
  if (count < 3 || count > MAX_VERTICES - m_Points.size())
    return false;

  // Keep the table at most half full, so that probe runs stay short.
  const std::size_t total = m_Points.size() + count;
  if (2 * total > m_PointSlots.size()) {
    m_PointSlots.assign(std::bit_ceil(2 * total), 0);
    for (const Pointbase& p : m_Points) {
      const std::uint64_t hash = CoordinateHash(p.m_X, p.m_Y);
      m_PointSlots[ProbeSlot(m_PointSlots, m_Points, p.m_X, p.m_Y, hash)] = (hash & ~kIdBits) | p.m_Id;
    }
  }
  // Room for the whole contour at once (a large one is stored without
  // copying), growing geometrically over many small ones.
  if (total > m_Points.capacity())
    m_Points.Reserve(std::max(total, 2 * m_Points.capacity()));

  const std::size_t mask = m_PointSlots.size() - 1;
  const auto pointAt = [&](std::size_t k) -> const CKRPoint2T<double, float>& {
    return points[reverse ? count - 1 - k : k];
  };
  const std::size_t first = m_Points.size();
  for (std::size_t k = 0; k < count; ++k) {
    if (k + kPrefetchDistance < count) {
      const CKRPoint2T<double, float>& ahead = pointAt(k + kPrefetchDistance);
      __builtin_prefetch(&m_PointSlots[CoordinateHash(ahead.X(), ahead.Y()) & mask]);
    }
    const double x = pointAt(k).X();
    const double y = pointAt(k).Y();
    if (!(std::fabs(x) <= MAX_COORDINATE && std::fabs(y) <= MAX_COORDINATE)) {
      rollbackPoints(m_Points.size() - first);
      return false;
    }
    const std::uint64_t hash = CoordinateHash(x, y);
    const std::size_t slot = ProbeSlot(m_PointSlots, m_Points, x, y, hash);
    if (m_PointSlots[slot] != 0) {
      rollbackPoints(m_Points.size() - first);
      return false;
    }
    m_XMin = std::min(m_XMin, x);
    m_XMax = std::max(m_XMax, x);
    m_YMin = std::min(m_YMin, y);
    m_YMax = std::max(m_YMax, y);
    const unsigned id = static_cast<unsigned>(m_Points.size() + 1);
    m_Points.PushBack(Pointbase(id, x, y, CONTOUR));
    m_PointSlots[slot] = (hash & ~kIdBits) | id;
  }
  ++m_ContourCount;
  m_ContourSizes.push_back(static_cast<unsigned>(count));
  return true;
}

void Polygon::rollbackPoints(std::size_t count) {
  // The points leave the table newest first, each by backward-shift
  // deletion: the entries after it in its probe run move up where their
  // home slot allows, so no tombstones are needed.
  const std::size_t mask = m_PointSlots.size() - 1;
  for (; count > 0; --count) {
    const Pointbase& p = m_Points[static_cast<unsigned>(m_Points.size())];
    std::size_t hole = ProbeSlot(m_PointSlots, m_Points, p.m_X, p.m_Y, CoordinateHash(p.m_X, p.m_Y));
    for (std::size_t slot = (hole + 1) & mask; m_PointSlots[slot] != 0; slot = (slot + 1) & mask) {
      const Pointbase& moved = m_Points[static_cast<unsigned>(m_PointSlots[slot] & kIdBits)];
      const std::size_t home = CoordinateHash(moved.m_X, moved.m_Y) & mask;
      if (((slot - home) & mask) >= ((slot - hole) & mask)) {
        m_PointSlots[hole] = m_PointSlots[slot];
        hole = slot;
      }
    }
    m_PointSlots[hole] = 0;
    m_Points.PopBack();
  }
}

void Polygon::Finish() {
  if (m_Stage != Stage::Adding)
    return;
  // Every event adds at most two diagonals (a MERGE vertex joins two
  // helpers), so the edges never outgrow this and the status may keep
  // pointers to them.
  m_Edges.Reserve(3 * m_Points.size());
  unsigned total = 0;
  for (unsigned& size : m_ContourSizes) {
    const unsigned first = total + 1;
    total += size;
    size = total;
    for (unsigned i = first; i <= total; ++i)
      m_Edges.PushBack(Linebase(++m_LastEdgeId, &m_Points[i], &m_Points[i == total ? first : i + 1], CONTOUR));
  }
  m_VertexCount = total;
  m_Stage = Stage::Finished;
  initializate();
}

unsigned Polygon::prev(unsigned i) const noexcept {
  // The contour of i is the first whose running total reaches i: a binary
  // search, since a sweep meets the contours in any order.
  const auto contour = std::lower_bound(m_ContourSizes.begin(), m_ContourSizes.end(), i);
  const unsigned first = contour == m_ContourSizes.begin() ? 1 : *(contour - 1) + 1;
  return i == first ? *contour : i - 1;
}

void Polygon::initializate() {
  m_EventQueue.reserve(m_VertexCount);
  unsigned first = 1;
  for (const unsigned last : m_ContourSizes) {
    for (unsigned i = first; i <= last; ++i) {
      Pointbase& p = m_Points[i];
      const Pointbase& before = m_Points[i == first ? last : i - 1];
      const Pointbase& after = m_Points[i == last ? first : i + 1];
      if (p.IsAbove(after) && before.IsAbove(p)) {
        p.m_Type = REGULAR_DOWN;
      } else if (p.IsAbove(before) && after.IsAbove(p)) {
        p.m_Type = REGULAR_UP;
      } else {
        const double turn = orient2d(before.m_X, before.m_Y, p.m_X, p.m_Y, after.m_X, after.m_Y);
        if (before.IsAbove(p) && after.IsAbove(p))
          p.m_Type = turn > 0 ? END : MERGE;
        else if (p.IsAbove(before) && p.IsAbove(after))
          p.m_Type = turn > 0 ? START : SPLIT;
      }
      m_EventQueue.push_back(i);
    }
    first = last + 1;
  }
  // The points are distinct and finite, so the order is strict and total:
  // sorted once, the queue pops exactly as a heap of them would.
  std::vector<unsigned> buffer;
  SortFromHighest(m_EventQueue, buffer, [this](unsigned a, unsigned b) { return m_Points[a].IsAbove(m_Points[b]); });
}

// ---- pass 1: the sweep ----

bool Polygon::partition2Monotone() {
  if (m_Stage == Stage::Adding || m_Stage == Stage::Failed)
    return false;
  if (m_Stage != Stage::Finished)
    return true;
  if (m_EventQueue.empty() || m_Points[m_EventQueue.front()].m_Type != START || !contoursAgreeWithNesting())
    return fail(kMessageOrientation);

  for (const unsigned id : m_EventQueue) {
    const Pointbase& v = m_Points[id];
    // Every key the status compares from here on is taken at this height.
    m_Status.SetSweepHeight(v.m_Y);
    if (std::ostream* out = trace())
      *out << "\n\nHandle vertex:" << v.m_Id << " type:" << TypeName(v.m_Type);
    switch (v.m_Type) {
    case START:
      handleStartVertex(v);
      break;
    case END:
      handleEndVertex(v);
      break;
    case SPLIT:
      handleSplitVertex(v);
      break;
    case MERGE:
      handleMergeVertex(v);
      break;
    case REGULAR_UP:
      handleRegularVertexUp(v);
      break;
    case REGULAR_DOWN:
      handleRegularVertexDown(v);
      break;
    default:
      return fail(kMessageDuplicated);
    }
  }
  m_Status.MakeEmpty();
  m_EventQueue = std::vector<unsigned>();
  m_Stage = Stage::Partitioned;
  return true;
}

bool Polygon::isMergeVertex(unsigned id) const noexcept {
  const Pointbase* p = m_Points.find(id);
  return p != nullptr && p->m_Type == MERGE;
}

void Polygon::addDiagonal(unsigned i, unsigned j) {
  // A helper is a stored vertex other than i in any sweep of valid input,
  // and the edge map has room (see Finish).
  if (i == j || m_Points.find(i) == nullptr || m_Points.find(j) == nullptr || m_Edges.size() == m_Edges.capacity())
    return;
  const Linebase& diagonal = m_Edges.PushBack(Linebase(++m_LastEdgeId, &m_Points[i], &m_Points[j], DIAGONAL));
  m_Diagonals.push_back(diagonal.id());
  if (std::ostream* out = trace())
    *out << "Add Diagonal from " << i << " to " << j << "\n";
}

void Polygon::insertEdge(const Pointbase& v) {
  Linebase& edge = m_Edges[v.m_Id];
  edge.setHelper(v.m_Id);
  edge.setKeyValue(v.m_Y);
  if (std::ostream* out = trace())
    *out << "set e" << v.m_Id << " helper to " << v.m_Id << "\n"
         << "Insert e" << v.m_Id << " to splay tree\n"
         << "Insert key:" << edge.keyValue() << "\n";
  m_Status.Insert(&edge);
}

void Polygon::removePreviousEdge(const Pointbase& v) {
  Linebase& previous = m_Edges[prev(v.m_Id)];
  if (isMergeVertex(previous.helper()))
    addDiagonal(v.m_Id, previous.helper());
  previous.setKeyValue(v.m_Y);
  m_Status.Delete(previous.keyValue());
  if (std::ostream* out = trace())
    *out << "Remove e" << previous.id() << " from splay tree\n"
         << "key:" << previous.keyValue() << "\n";
}

bool Polygon::updateLeftEdge(const Pointbase& v, bool joinAnyHelper) {
  BTreeNode* node = nullptr;
  if (!m_Status.FindMaxSmallerThan(v.m_X, node)) {
    if (std::ostream* out = trace())
      *out << "Search key:" << v.m_X << " could not be found\n";
    return false;
  }
  Linebase& left = *node->m_pData;
  if (std::ostream* out = trace())
    *out << "Search key:" << v.m_X << " edge key:" << left.keyValue() << "\n"
         << "e" << left.id() << " is directly left to v" << v.m_Id << "\n";
  if (joinAnyHelper || isMergeVertex(left.helper()))
    addDiagonal(v.m_Id, left.helper());
  left.setHelper(v.m_Id);
  if (std::ostream* out = trace())
    *out << "Set e" << left.id() << " helper to " << v.m_Id << "\n";
  return true;
}

void Polygon::handleStartVertex(const Pointbase& v) { insertEdge(v); }

void Polygon::handleEndVertex(const Pointbase& v) { removePreviousEdge(v); }

void Polygon::handleSplitVertex(const Pointbase& v) {
  // A split vertex always joins the helper of the edge to its left; without
  // such an edge it is skipped as a whole.
  if (updateLeftEdge(v, true))
    insertEdge(v);
}

void Polygon::handleMergeVertex(const Pointbase& v) {
  removePreviousEdge(v);
  updateLeftEdge(v, false);
}

void Polygon::handleRegularVertexUp(const Pointbase& v) { updateLeftEdge(v, false); }

void Polygon::handleRegularVertexDown(const Pointbase& v) {
  removePreviousEdge(v);
  insertEdge(v);
}

bool Polygon::fail(const char* message) {
  if (message != nullptr) {
    std::fputs(message, stdout);
    std::fflush(stdout);
  }
  m_Triangles = std::vector<Triangle>();
  m_MonotonePieces = std::vector<Piece>();
  m_Status.MakeEmpty();
  m_EventQueue = std::vector<unsigned>();
  m_PieceQueue = std::vector<PieceVertex>();
  m_PieceBuffer = std::vector<PieceVertex>();
  m_Stack = std::vector<unsigned>();
  m_Stage = Stage::Failed;
  return false;
}

}  // namespace krPolygonTriangulation
