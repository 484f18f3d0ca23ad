// Saving and loading a graph through the XML file archive, side by side
// with cereal's XML archive (shared pointers) and Boost.Serialization's XML
// archive (tracked pointers) storing the same nodes and edges: 100,000
// nodes, each joined by an edge to a random earlier node. The archive
// also stores one chain of 100,000 nodes, which the peers, whose saving
// and loading recurse once per link, cannot store on a default stack.
//
// Reported per operation: time, the file's size and the peak heap memory
// of the operation above what the process held before, also as a multiple
// of the file size. A peer that is not installed leaves its benchmarks out.
#include <krCoreLib/framework/CKRGraphNode.h>
#include <krCoreLib/framework/CKRGraphNodeVisitor.h>
#include <krCoreLib/objectmodel/CKRTypeSystem.h>
#include <krCoreLib/storage/xml/CKRXMLFileArchive.h>

#include "KRBenchReport.h"

#include <cstdio>
#include <algorithm>
#include <cstring>
#include <new>
#include <filesystem>
#include <fstream>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include <malloc.h>

// Heap bytes in use and their high-water mark (see CKRPeakMemory).
static std::size_t g_InUse = 0;
static std::size_t g_Peak = 0;

void* operator new(std::size_t size) {
  void* memory = std::malloc(size == 0 ? 1 : size);
  if (memory == nullptr)
    throw std::bad_alloc();
  g_InUse += malloc_usable_size(memory);
  g_Peak = std::max(g_Peak, g_InUse);
  return memory;
}
void* operator new[](std::size_t size) {
  return operator new(size);
}
void operator delete(void* memory) noexcept {
  if (memory != nullptr)
    g_InUse -= malloc_usable_size(memory);
  std::free(memory);
}
void operator delete[](void* memory) noexcept {
  operator delete(memory);
}
void operator delete(void* memory, std::size_t) noexcept {
  operator delete(memory);
}
void operator delete[](void* memory, std::size_t) noexcept {
  operator delete(memory);
}

#if KR_HAVE_CEREAL
#include <cereal/archives/xml.hpp>
#include <cereal/types/memory.hpp>
#include <cereal/types/vector.hpp>
#endif
#if KR_HAVE_BOOST
#include <boost/archive/xml_iarchive.hpp>
#include <boost/archive/xml_oarchive.hpp>
#include <boost/serialization/vector.hpp>
#endif

namespace {

constexpr int kNodes = 100000;
constexpr unsigned kSeed = 20261206;  // the same graph in every run
constexpr CKRGuid kRepository = CKRGuid::Literal("{5D000000-0000-4000-8000-0000000000B7}");
constexpr CKRGuid kDocumentID = CKRGuid::Literal("{5D000000-0000-4000-8000-0000000000B8}");

// The random earlier node each node i > 0 is joined to.
const std::vector<int>& Parents() {
  static const std::vector<int> s_Parents = [] {
    std::mt19937 random(kSeed);
    std::vector<int> parents(kNodes, -1);
    for (int i = 1; i < kNodes; ++i)
      parents[i] = std::uniform_int_distribution<int>(0, i - 1)(random);
    return parents;
  }();
  return s_Parents;
}

std::string FilePath(const char* name) {
  return (std::filesystem::temp_directory_path() / name).string();
}

// The peak of heap bytes in use above the start, counted by the program's
// global operator new and delete (the XML library allocates through them
// too; so do the peers). Benchmarks run on one thread.
class CKRPeakMemory {
public:
  CKRPeakMemory() : m_Base(g_InUse) { g_Peak = g_InUse; }
  long Peak() const { return long(g_Peak - m_Base); }

private:
  std::size_t m_Base;
};

void Report(benchmark::State& state, const std::string& path, long peak) {
  const double bytes = double(std::filesystem::file_size(path));
  state.counters["file_MB"] = bytes / 1e6;
  state.counters["peak_MB"] = double(peak) / 1e6;
  state.counters["peak/file"] = double(peak) / bytes;
}

// --- krCoreLib --------------------------------------------------------------

CKRGraphNode* NewNode() {
  return static_cast<CKRGraphNode*>(CKRGraphNode::GetCKRGraphNodeType()->CreateInstance(CKRGuid()));
}

void Join(CKRGraphNode* a, CKRGraphNode* b) {
  auto* edge = static_cast<CKRGraphEdge*>(CKRGraphEdge::GetCKRGraphEdgeType()->CreateInstance(CKRGuid()));
  edge->SetNodes(a, b);
  edge->Connect();
}

// The random graph or the chain; the first node reaches all.
std::vector<CKRGraphNode*> BuildGraph(bool chain) {
  std::vector<CKRGraphNode*> nodes;
  nodes.reserve(kNodes);
  for (int i = 0; i < kNodes; ++i) {
    nodes.push_back(NewNode());
    if (i > 0)
      Join(nodes[chain ? i - 1 : Parents()[i]], nodes[i]);
  }
  return nodes;
}

void ReleaseGraph(CKRGraphNode* node) {
  auto* visitor = static_cast<CKRReleaseVisitor*>(CKRReleaseVisitor::GetCKRReleaseVisitorType()->CreateInstance(CKRGuid()));
  visitor->Start(node);
  visitor->Release();
}

bool SaveGraph(const std::string& path, CKRGraphNode* root) {
  auto* archive = static_cast<CKRXMLFileArchive*>(CKRXMLFileArchive::GetCKRXMLFileArchiveType()->CreateInstance(CKRGuid()));
  archive->SetFile(CKRString::FromUtf8(path));
  bool ok = archive->Open(CKRArchive::AccessWrite);
  ok = ok && root->SerializeTo(archive->CreateNewDocument(kDocumentID, nullptr)) != 0;
  ok = bool(archive->Close()) && ok;
  archive->Release();
  return ok;
}

CKRGraphNode* LoadGraph(const std::string& path, const CKRGuid& rootID) {
  auto* archive = static_cast<CKRXMLFileArchive*>(CKRXMLFileArchive::GetCKRXMLFileArchiveType()->CreateInstance(CKRGuid()));
  archive->SetFile(CKRString::FromUtf8(path));
  CKRGraphNode* root = nullptr;
  if (archive->Open(CKRArchive::AccessRead))
    if (auto* document = static_cast<CKRDocument*>(archive->GetDocumentCollection()->Find(kDocumentID)))
      root = dynamic_cast<CKRGraphNode*>(document->GetObject(rootID, CKRGraphNode::TypeID));
  archive->Close();
  archive->Release();
  return root;
}

void BM_KRSave(benchmark::State& state) {
  const bool chain = state.range(0) != 0;
  const std::vector<CKRGraphNode*> nodes = BuildGraph(chain);
  const std::string path = FilePath("krbench-graph.xml");
  long peak = 0;
  for (auto _ : state) {
    CKRPeakMemory memory;
    if (!SaveGraph(path, nodes[0]))
      state.SkipWithError("the save failed");
    peak = memory.Peak();
  }
  Report(state, path, peak);
  ReleaseGraph(nodes[0]);
}

void BM_KRLoad(benchmark::State& state) {
  const bool chain = state.range(0) != 0;
  const std::vector<CKRGraphNode*> nodes = BuildGraph(chain);
  const CKRGuid rootID = nodes[0]->GetInstanceID();
  const std::string path = FilePath("krbench-graph.xml");
  SaveGraph(path, nodes[0]);
  ReleaseGraph(nodes[0]);
  long peak = 0;
  for (auto _ : state) {
    CKRPeakMemory memory;
    CKRGraphNode* root = LoadGraph(path, rootID);
    peak = memory.Peak();
    state.PauseTiming();
    if (root == nullptr)
      state.SkipWithError("the load failed");
    else
      ReleaseGraph(root);
    state.ResumeTiming();
  }
  Report(state, path, peak);
}

// --- The peers' graph: the same data in plain structures ----------------------

struct SPeerEdge;
struct SPeerNode {
  int m_ID = 0;
  std::vector<std::shared_ptr<SPeerEdge>> m_Edges;
};
struct SPeerEdge {
  std::shared_ptr<SPeerNode> m_pPrimary;
  std::shared_ptr<SPeerNode> m_pSecondary;
};

struct SRawEdge;
struct SRawNode {
  int m_ID = 0;
  std::vector<SRawEdge*> m_Edges;
};
struct SRawEdge {
  SRawNode* m_pPrimary = nullptr;
  SRawNode* m_pSecondary = nullptr;
};

#if KR_HAVE_CEREAL
template <class Archive>
void serialize(Archive& archive, SPeerNode& node) {
  archive(cereal::make_nvp("id", node.m_ID), cereal::make_nvp("edges", node.m_Edges));
}
template <class Archive>
void serialize(Archive& archive, SPeerEdge& edge) {
  archive(cereal::make_nvp("primary", edge.m_pPrimary), cereal::make_nvp("secondary", edge.m_pSecondary));
}

std::vector<std::shared_ptr<SPeerNode>> BuildShared() {
  std::vector<std::shared_ptr<SPeerNode>> nodes(kNodes);
  for (int i = 0; i < kNodes; ++i) {
    nodes[i] = std::make_shared<SPeerNode>();
    nodes[i]->m_ID = i;
    if (i > 0) {
      auto edge = std::make_shared<SPeerEdge>(SPeerEdge{nodes[Parents()[i]], nodes[i]});
      nodes[Parents()[i]]->m_Edges.push_back(edge);
      nodes[i]->m_Edges.push_back(edge);
    }
  }
  return nodes;
}
// The cycles node -> edge -> node keep shared pointers alive: cut them.
void ReleaseShared(std::vector<std::shared_ptr<SPeerNode>>& nodes) {
  for (auto& node : nodes)
    node->m_Edges.clear();
  nodes.clear();
}

void BM_CerealSave(benchmark::State& state) {
  std::vector<std::shared_ptr<SPeerNode>> nodes = BuildShared();
  const std::string path = FilePath("krbench-cereal.xml");
  long peak = 0;
  for (auto _ : state) {
    CKRPeakMemory memory;
    {
      std::ofstream out(path);
      cereal::XMLOutputArchive archive(out);
      archive(cereal::make_nvp("nodes", nodes));
    }
    peak = memory.Peak();
  }
  Report(state, path, peak);
  ReleaseShared(nodes);
}

void BM_CerealLoad(benchmark::State& state) {
  const std::string path = FilePath("krbench-cereal.xml");
  {
    std::vector<std::shared_ptr<SPeerNode>> nodes = BuildShared();
    std::ofstream out(path);
    cereal::XMLOutputArchive archive(out);
    archive(cereal::make_nvp("nodes", nodes));
    ReleaseShared(nodes);
  }
  long peak = 0;
  for (auto _ : state) {
    CKRPeakMemory memory;
    std::vector<std::shared_ptr<SPeerNode>> nodes;
    {
      std::ifstream in(path);
      cereal::XMLInputArchive archive(in);
      archive(cereal::make_nvp("nodes", nodes));
    }
    peak = memory.Peak();
    state.PauseTiming();
    if (nodes.size() != std::size_t(kNodes))
      state.SkipWithError("the load failed");
    ReleaseShared(nodes);
    state.ResumeTiming();
  }
  Report(state, path, peak);
}
#endif

#if KR_HAVE_BOOST
template <class Archive>
void serialize(Archive& archive, SRawNode& node, const unsigned int) {
  archive& boost::serialization::make_nvp("id", node.m_ID);
  archive& boost::serialization::make_nvp("edges", node.m_Edges);
}
template <class Archive>
void serialize(Archive& archive, SRawEdge& edge, const unsigned int) {
  archive& boost::serialization::make_nvp("primary", edge.m_pPrimary);
  archive& boost::serialization::make_nvp("secondary", edge.m_pSecondary);
}

std::vector<SRawNode*> BuildRaw() {
  std::vector<SRawNode*> nodes(kNodes);
  for (int i = 0; i < kNodes; ++i) {
    nodes[i] = new SRawNode{i, {}};
    if (i > 0) {
      auto* edge = new SRawEdge{nodes[Parents()[i]], nodes[i]};
      nodes[Parents()[i]]->m_Edges.push_back(edge);
      nodes[i]->m_Edges.push_back(edge);
    }
  }
  return nodes;
}
// Each edge is listed by its two nodes: deleted by its secondary.
void ReleaseRaw(std::vector<SRawNode*>& nodes) {
  for (SRawNode* node : nodes)
    for (SRawEdge* edge : node->m_Edges)
      if (edge->m_pSecondary == node)
        delete edge;
  for (SRawNode* node : nodes)
    delete node;
  nodes.clear();
}

void BM_BoostSave(benchmark::State& state) {
  std::vector<SRawNode*> nodes = BuildRaw();
  const std::string path = FilePath("krbench-boost.xml");
  long peak = 0;
  for (auto _ : state) {
    CKRPeakMemory memory;
    {
      std::ofstream out(path);
      boost::archive::xml_oarchive archive(out);
      archive << boost::serialization::make_nvp("nodes", nodes);
    }
    peak = memory.Peak();
  }
  Report(state, path, peak);
  ReleaseRaw(nodes);
}

void BM_BoostLoad(benchmark::State& state) {
  const std::string path = FilePath("krbench-boost.xml");
  {
    std::vector<SRawNode*> nodes = BuildRaw();
    std::ofstream out(path);
    {
      boost::archive::xml_oarchive archive(out);
      archive << boost::serialization::make_nvp("nodes", nodes);
    }
    ReleaseRaw(nodes);
  }
  long peak = 0;
  for (auto _ : state) {
    CKRPeakMemory memory;
    std::vector<SRawNode*> nodes;
    {
      std::ifstream in(path);
      boost::archive::xml_iarchive archive(in);
      archive >> boost::serialization::make_nvp("nodes", nodes);
    }
    peak = memory.Peak();
    state.PauseTiming();
    if (nodes.size() != std::size_t(kNodes))
      state.SkipWithError("the load failed");
    ReleaseRaw(nodes);
    state.ResumeTiming();
  }
  Report(state, path, peak);
}
#endif

class CKRStorageReporter : public CKRBenchReporter {
public:
  // CPU times: steadier than wall-clock time on a shared machine.
  CKRStorageReporter() : CKRBenchReporter(ETime::Cpu, kNodes) {}

protected:
  void Summarize(std::ostream& out) override {
    out << "  per node, 100,000 nodes joined to random earlier nodes (aims: save below both peers,\n"
        << "  load within 1.5x of the faster peer, load memory below 10x the file size):\n";
    for (const char* peer : {"BM_CerealSave", "BM_BoostSave"})
      Ratio(out, std::string("save vs ") + peer, "BM_KRSave/0", peer, 1.0);
    for (const char* peer : {"BM_CerealLoad", "BM_BoostLoad"})
      Ratio(out, std::string("load vs ") + peer, "BM_KRLoad/0", peer, 1.5);
    for (const char* name : {"BM_KRSave/0", "BM_KRLoad/0", "BM_KRSave/1", "BM_KRLoad/1", "BM_CerealSave",
                             "BM_CerealLoad", "BM_BoostSave", "BM_BoostLoad"}) {
      SKRResult result;
      if (Find(name, result))
        out << "   " << std::left << std::setw(16) << name << std::right << std::setprecision(1) << std::setw(8)
            << result.m_Time * kNodes / 1e6 << " ms  file " << std::setw(6) << Counter(result, "file_MB")
            << " MB  peak " << std::setw(6) << Counter(result, "peak_MB") << " MB  peak/file " << std::setprecision(2)
            << Counter(result, "peak/file") << "\n";
    }
    out << "  (/0 the random graph, /1 the chain of 100,000 nodes, which only the library stores)\n";
  }
};

}  // namespace

BENCHMARK(BM_KRSave)->Arg(0)->Arg(1)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_KRLoad)->Arg(0)->Arg(1)->Unit(benchmark::kMillisecond)->Iterations(3);
#if KR_HAVE_CEREAL
BENCHMARK(BM_CerealSave)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_CerealLoad)->Unit(benchmark::kMillisecond)->Iterations(3);
#endif
#if KR_HAVE_BOOST
BENCHMARK(BM_BoostSave)->Unit(benchmark::kMillisecond)->Iterations(3);
BENCHMARK(BM_BoostLoad)->Unit(benchmark::kMillisecond)->Iterations(3);
#endif

int main(int argc, char** argv) {
  CKRTypeSystem::Initialize(kRepository);
  benchmark::Initialize(&argc, argv);
  CKRStorageReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  for (const char* name : {"krbench-graph.xml", "krbench-cereal.xml", "krbench-boost.xml"})
    std::remove(FilePath(name).c_str());
  CKRTypeSystem::Release();
  return 0;
}
