// Plug-in loading: a folder of 100 plug-in modules loaded by the plug-in
// manager and released again, next to a bare dlopen / dlsym("GetPluginType")
// / dlclose of the same files in the same run (the peer: the system's
// loader alone).
//
//   1. BM_ManagerLoadRelease: LoadPlugins on the folder (one command socket
//      registered), then ReleaseAllPlugins; the modules were loaded before,
//      so the manager's trial load of each file is remembered.
//   2. BM_ManagerFirstLoad: the same on fresh copies of the files, never
//      seen before: each module is first tried in a child process (the
//      guard against modules whose initialisation throws or crashes).
//   3. BM_BareLoader: the peer.
// Target: the manager's own work per module (1 minus 3) below the loader's
// (3), that is ratio 1 / 3 below 2. The first load is reported beside it.
//
// The 100 files are copies of one module (bench_plugin.plg): the loader
// maps each on its own, every plug-in object has its own plug-in ID, and
// the type system keeps the first copy's types (a second type with the same
// ID is refused, as always).
//
// Run: bench_plugins --benchmark_repetitions=3 --benchmark_report_aggregates_only=true
#include <krCoreLib/krCoreLib.h>

#include "KRBenchReport.h"

#include <benchmark/benchmark.h>

#include <dlfcn.h>
#include <stdlib.h>

#include <filesystem>
#include <iostream>
#include <string>
#include <vector>

namespace {

constexpr int kModules = 100;

// A folder of kModules copies of the benchmark module, removed at exit.
class CKRModuleFolder {
public:
  CKRModuleFolder() {
    std::string pattern = (std::filesystem::temp_directory_path() / "krbench-plugins-XXXXXX").string();
    if (mkdtemp(pattern.data()) != nullptr)
      m_Path = pattern;
  }
  ~CKRModuleFolder() {
    std::error_code ignored;
    if (!m_Path.empty())
      std::filesystem::remove_all(m_Path, ignored);
  }
  CKRModuleFolder(const CKRModuleFolder&) = delete;
  CKRModuleFolder& operator=(const CKRModuleFolder&) = delete;

  // Fresh copies (new files, new identities); false when they cannot be made.
  bool Fill() {
    std::error_code error;
    m_Files.clear();
    for (int i = 0; i < kModules && !m_Path.empty(); ++i) {
      const std::string file = m_Path + "/module" + std::to_string(i) + ".plg";
      std::filesystem::remove(file, error);
      if (!std::filesystem::copy_file(KR_BENCH_PLUGIN, file, error))
        return false;
      m_Files.push_back(file);
    }
    return !m_Files.empty();
  }
  const std::string& Path() const { return m_Path; }
  const std::vector<std::string>& Files() const { return m_Files; }

private:
  std::string m_Path;
  std::vector<std::string> m_Files;
};

CKRModuleFolder& Folder() {
  static CKRModuleFolder s_Folder;
  return s_Folder;
}

void LoadAndRelease(benchmark::State& state, const CKRString& folder) {
  CKRPluginManager::LoadPlugins(folder);
  const int loaded = CKRPluginManager::GetPluginIterator().Next(1) != nullptr
                         ? static_cast<int>(CKRPluginManager::GetManager()->GetRecords().size())
                         : 0;
  CKRPluginManager::ReleaseAllPlugins();
  if (loaded != kModules)
    state.SkipWithError("not every module became a plug-in");
}

CKRPluginSocketCmd* RegisterSocket() {
  auto* socket =
      dynamic_cast<CKRPluginSocketCmd*>(CKRPluginSocketCmd::GetCKRPluginSocketCmdType()->CreateInstance(CKRGuid()));
  socket->RegisterWithManager();
  return socket;
}

void BM_ManagerLoadRelease(benchmark::State& state) {
  if (Folder().Files().empty() && !Folder().Fill()) {
    state.SkipWithError("no module folder");
    return;
  }
  CKRPluginSocketCmd* socket = RegisterSocket();
  const CKRString folder = CKRString::FromUtf8(Folder().Path());
  LoadAndRelease(state, folder);  // the trial loads, once
  for (auto _ : state)
    LoadAndRelease(state, folder);
  state.SetItemsProcessed(state.iterations() * kModules);
  socket->Release();
}
BENCHMARK(BM_ManagerLoadRelease)->Unit(benchmark::kMillisecond);

void BM_ManagerFirstLoad(benchmark::State& state) {
  CKRPluginSocketCmd* socket = RegisterSocket();
  const CKRString folder = CKRString::FromUtf8(Folder().Path());
  for (auto _ : state) {
    state.PauseTiming();
    const bool filled = Folder().Fill();
    state.ResumeTiming();
    if (!filled) {
      state.SkipWithError("no module folder");
      break;
    }
    LoadAndRelease(state, folder);
  }
  state.SetItemsProcessed(state.iterations() * kModules);
  socket->Release();
}
BENCHMARK(BM_ManagerFirstLoad)->Unit(benchmark::kMillisecond)->Iterations(5);

void BM_BareLoader(benchmark::State& state) {
  if (Folder().Files().empty() && !Folder().Fill()) {
    state.SkipWithError("no module folder");
    return;
  }
  for (auto _ : state) {
    for (const std::string& file : Folder().Files()) {
      void* module = dlopen(file.c_str(), RTLD_NOW | RTLD_LOCAL);
      if (module == nullptr) {
        state.SkipWithError(dlerror());
        return;
      }
      benchmark::DoNotOptimize(dlsym(module, "GetPluginType"));
      dlclose(module);
    }
  }
  state.SetItemsProcessed(state.iterations() * kModules);
}
BENCHMARK(BM_BareLoader)->Unit(benchmark::kMillisecond);

class CKRPluginBenchReporter : public CKRBenchReporter {
public:
  CKRPluginBenchReporter() : CKRBenchReporter(ETime::Real, kModules) {}

protected:
  void Summarize(std::ostream& out) override {
    out << "\nPer module, a folder of " << kModules << " modules loaded and released\n";
    Ratio(out, "manager (trial remembered) / bare loader", "BM_ManagerLoadRelease", "BM_BareLoader", 2.0);
    Ratio(out, "manager, first load (trial) / bare loader", "BM_ManagerFirstLoad", "BM_BareLoader", 0.0);
    SKRResult manager;
    SKRResult loader;
    if (Find("BM_ManagerLoadRelease", manager) && Find("BM_BareLoader", loader))
      out << "   the manager's own work: " << std::setprecision(1) << manager.m_Time - loader.m_Time
          << " ns per module against the loader's " << loader.m_Time << " ns\n";
  }
};

}  // namespace

int main(int argc, char** argv) {
  CKRTypeSystem::Initialize(CKRGuid::Literal("{B3E4C5D6-0000-4000-8000-00000000BEFF}"));
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv))
    return 1;
  CKRPluginBenchReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  benchmark::Shutdown();
  CKRPluginManager::Release();
  CKRTypeSystem::Release();
  return 0;
}
