// Polygon triangulation: krCoreLib's sweep-line triangulator against CGAL's
// constrained Delaunay triangulation, side by side in one run, on
//
//   circle/N   a regular N-gon (N = 1,000, 10,000, 100,000, 1,000,000)
//   holes/H    a square with H square holes in a grid (H = 100, 10,000)
//
// Each iteration triangulates from the contours to the triangle list. The
// sweep: Polygon, AddContour per contour (holes reversed to clockwise),
// Finish, triangulation. CGAL: the Delaunay triangulation with the contours
// inserted as constraints (its bulk insertion of points and index pairs,
// which sorts the points spatially first), then the faces inside the domain
// marked by their nesting depth below the constraints. Both results are
// checked: the triangle counts agree and equal vertices + 2 holes - 2.
//
// Targets: the sweep faster than CGAL at every size (ratio below 1), and its
// time per vertex on the circles flat within 2x from 1,000 to 1,000,000
// vertices. A summary prints both after the results.
//
// Memory: on this machine the first touch of a fresh page costs about 20 us
// (a hundred times the usual), so memory the allocator hands back to the
// system and maps again would dominate the large cases of both sides. The
// program therefore keeps freed memory (mallopt) and measures the
// algorithms; KR_BENCH_SYSTEM_MALLOC=1 keeps the allocator's defaults.
//
// Run: bench_geometry --benchmark_repetitions=5 --benchmark_report_aggregates_only=true
// (the ratios use CPU time, the median when repetitions are aggregated)
#include <krCoreLib/geometry/KRSweepPolygon.h>

#include "KRBenchReport.h"

#include <CGAL/Constrained_Delaunay_triangulation_2.h>
#include <CGAL/Exact_predicates_inexact_constructions_kernel.h>
#include <CGAL/Triangulation_face_base_with_info_2.h>
#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <malloc.h>
#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <iomanip>
#include <map>
#include <numbers>
#include <ostream>
#include <string>
#include <utility>
#include <vector>

namespace {

using KRPoint = CKRPoint2T<double, float>;
using KRContour = std::vector<KRPoint>;

// ---- inputs ---------------------------------------------------------------------

// Counter-clockwise contours: the outer boundary first, then the holes.
struct SKRShape {
  std::vector<KRContour> m_Contours;
  std::size_t m_Vertices = 0;
  std::size_t m_Triangles = 0;
};

SKRShape Circle(int n) {
  SKRShape shape;
  KRContour& contour = shape.m_Contours.emplace_back();
  for (int i = 0; i < n; ++i) {
    const double angle = 2 * std::numbers::pi * i / n;
    contour.emplace_back(std::cos(angle), std::sin(angle));
  }
  shape.m_Vertices = std::size_t(n);
  shape.m_Triangles = std::size_t(n) - 2;
  return shape;
}

// A square of side `grid` with grid x grid holes of side 0.5, one per unit cell.
SKRShape SquareWithHoles(int grid) {
  SKRShape shape;
  const double side = grid;
  shape.m_Contours.push_back({KRPoint(0.0, 0.0), KRPoint(side, 0.0), KRPoint(side, side), KRPoint(0.0, side)});
  for (int i = 0; i < grid; ++i)
    for (int j = 0; j < grid; ++j) {
      const double x = i + 0.25;
      const double y = j + 0.25;
      shape.m_Contours.push_back({KRPoint(x, y), KRPoint(x + 0.5, y), KRPoint(x + 0.5, y + 0.5), KRPoint(x, y + 0.5)});
    }
  const std::size_t holes = std::size_t(grid) * std::size_t(grid);
  shape.m_Vertices = 4 + 4 * holes;
  shape.m_Triangles = shape.m_Vertices + 2 * holes - 2;
  return shape;
}

// The shapes by name, made once.
const SKRShape& Shape(const std::string& name) {
  static std::map<std::string, SKRShape> shapes;
  auto found = shapes.find(name);
  if (found == shapes.end()) {
    const int size = std::stoi(name.substr(name.find('/') + 1));
    found = shapes.emplace(name, name.starts_with("circle") ? Circle(size) : SquareWithHoles(int(std::lround(std::sqrt(size)))))
                .first;
  }
  return found->second;
}

void Describe(benchmark::State& state, const SKRShape& shape, std::size_t triangles) {
  state.SetItemsProcessed(std::int64_t(state.iterations() * shape.m_Vertices));
  state.counters["vertices"] = double(shape.m_Vertices);
  if (triangles != shape.m_Triangles)
    state.SkipWithError(("wrong triangle count " + std::to_string(triangles)).c_str());
}

// ---- krCoreLib --------------------------------------------------------------------

// triangulation() reports its count on standard output: the loop runs with
// standard output sent to /dev/null.
class CKRQuietOutput {
public:
  CKRQuietOutput() {
    std::fflush(stdout);
    m_Saved = dup(STDOUT_FILENO);
    const int null = open("/dev/null", O_WRONLY);
    dup2(null, STDOUT_FILENO);
    close(null);
  }
  ~CKRQuietOutput() {
    std::fflush(stdout);
    dup2(m_Saved, STDOUT_FILENO);
    close(m_Saved);
  }
  CKRQuietOutput(const CKRQuietOutput&) = delete;
  CKRQuietOutput& operator=(const CKRQuietOutput&) = delete;

private:
  int m_Saved = -1;
};

void BM_krCoreLib(benchmark::State& state, const std::string& name) {
  const SKRShape& shape = Shape(name);
  std::size_t triangles = 0;
  {
    CKRQuietOutput quiet;
    for (auto _ : state) {
      krPolygonTriangulation::Polygon polygon;
      polygon.AddContour(shape.m_Contours.front());
      for (std::size_t c = 1; c < shape.m_Contours.size(); ++c)
        polygon.AddContour(shape.m_Contours[c], true);
      polygon.Finish();
      polygon.triangulation();
      triangles = polygon.triangles().size();
      benchmark::DoNotOptimize(polygon.triangles().data());
    }
  }
  Describe(state, shape, triangles);
}

// ---- CGAL -------------------------------------------------------------------------

using Kernel = CGAL::Exact_predicates_inexact_constructions_kernel;
// Per face the nesting depth below the constraints: -1 until reached;
// odd inside the polygon.
using FaceBase = CGAL::Constrained_triangulation_face_base_2<Kernel, CGAL::Triangulation_face_base_with_info_2<int, Kernel>>;
using Tds = CGAL::Triangulation_data_structure_2<CGAL::Triangulation_vertex_base_2<Kernel>, FaceBase>;
using CDT = CGAL::Constrained_Delaunay_triangulation_2<Kernel, Tds, CGAL::Exact_predicates_tag>;

// Marks every face with its depth: the faces reached from the infinite
// face without crossing a constraint get 0, those behind their constraints
// 1, and so on, breadth first.
std::size_t MarkDomain(CDT& cdt) {
  for (CDT::Face_handle face : cdt.all_face_handles())
    face->info() = -1;
  std::size_t inside = 0;
  std::vector<CDT::Face_handle> level{cdt.infinite_face()};
  std::vector<CDT::Face_handle> next;
  std::vector<CDT::Face_handle> pending;
  for (int depth = 0; !level.empty(); ++depth) {
    next.clear();
    for (CDT::Face_handle start : level) {
      if (start->info() != -1)
        continue;
      start->info() = depth;
      pending.assign(1, start);
      while (!pending.empty()) {
        const CDT::Face_handle face = pending.back();
        pending.pop_back();
        if (depth % 2 == 1)
          ++inside;
        for (int i = 0; i < 3; ++i) {
          const CDT::Face_handle neighbour = face->neighbor(i);
          if (neighbour->info() != -1)
            continue;
          if (cdt.is_constrained(CDT::Edge(face, i))) {
            next.push_back(neighbour);
          } else {
            neighbour->info() = depth;
            pending.push_back(neighbour);
          }
        }
      }
    }
    level.swap(next);
  }
  return inside;
}

void BM_CGAL(benchmark::State& state, const std::string& name) {
  const SKRShape& shape = Shape(name);
  std::vector<CDT::Point> points;
  std::vector<std::pair<std::size_t, std::size_t>> constraints;
  for (const KRContour& contour : shape.m_Contours) {
    const std::size_t first = points.size();
    for (std::size_t i = 0; i < contour.size(); ++i) {
      points.emplace_back(contour[i].X(), contour[i].Y());
      constraints.emplace_back(first + i, first + (i + 1) % contour.size());
    }
  }
  std::size_t triangles = 0;
  for (auto _ : state) {
    CDT cdt;
    cdt.insert_constraints(points.begin(), points.end(), constraints.begin(), constraints.end());
    triangles = MarkDomain(cdt);
    benchmark::DoNotOptimize(triangles);
  }
  Describe(state, shape, triangles);
}

const char* const kShapes[] = {"circle/1000", "circle/10000", "circle/100000", "circle/1000000", "holes/100",
                               "holes/10000"};

// A warm-up run first, so that the timed runs of both sides find their
// memory already in the process.
void RegisterAll() {
  for (const char* shape : kShapes) {
    benchmark::RegisterBenchmark((std::string(shape) + "/krCoreLib").c_str(), BM_krCoreLib, std::string(shape))
        ->Unit(benchmark::kMillisecond)
        ->MinWarmUpTime(0.2);
    benchmark::RegisterBenchmark((std::string(shape) + "/CGAL").c_str(), BM_CGAL, std::string(shape))
        ->Unit(benchmark::kMillisecond)
        ->MinWarmUpTime(0.2);
  }
}

// ---- reporting --------------------------------------------------------------------

// CPU time per vertex, because other work on a shared machine inflates real
// time.
class CKRGeometryReporter : public CKRBenchReporter {
public:
  CKRGeometryReporter() : CKRBenchReporter(ETime::Cpu) {}

protected:
  double UnitsPerIteration(const Run& run) const override {
    const auto vertices = run.counters.find("vertices");
    return vertices != run.counters.end() ? vertices->second.value : 0;
  }

  void Summarize(std::ostream& out) override {
    out << "\nCPU time per vertex, krCoreLib / CGAL (target: below 1 everywhere, flat within 2x on the circles)\n";
    double fastest = 0;
    double slowest = 0;
    for (const char* shape : kShapes) {
      Ratio(out, shape, std::string(shape) + "/krCoreLib", std::string(shape) + "/CGAL", 1.0);
      SKRResult ours;
      if (std::string(shape).starts_with("circle") && Find(std::string(shape) + "/krCoreLib", ours)) {
        fastest = fastest == 0 ? ours.m_Time : std::min(fastest, ours.m_Time);
        slowest = std::max(slowest, ours.m_Time);
      }
    }
    if (fastest > 0)
      out << "\n   circles: slowest / fastest time per vertex " << std::setprecision(2) << slowest / fastest << "x   "
          << (slowest / fastest <= 2 ? "met" : "MISSED") << "\n";
  }
};

}  // namespace

int main(int argc, char** argv) {
  const char* systemMalloc = std::getenv("KR_BENCH_SYSTEM_MALLOC");
  if (systemMalloc == nullptr || std::string(systemMalloc) != "1") {
    // Serve every block from the heap and never return freed memory to the
    // system (see the file comment).
    mallopt(M_MMAP_THRESHOLD, 1 << 30);
    mallopt(M_TRIM_THRESHOLD, -1);
  }
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv))
    return 1;
  RegisterAll();
  CKRGeometryReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  benchmark::Shutdown();
  return 0;
}
