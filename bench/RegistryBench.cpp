// The registry store against its floor: the same 10,000 values written to
// and read from a plain SQLite table (WAL, full sync, one transaction per
// write, as the store) by a minimal hand-written loop, and the REGEDIT4
// export of a 10,000-value tree against dumping that table as text.
//
// Both stores live in a scratch folder removed at exit. The summary divides
// every time by the 10,000 values of one iteration.
#include <krCoreLib/platform/KRRegistryAPI.h>
#include <krCoreLib/system/CKRRegistry.h>

#include "KRBenchReport.h"

#include <sqlite3.h>

#include <cstdio>
#include <cstring>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <vector>

namespace {

constexpr int kValues = 10000;
// The export's tree: 100 keys of 100 values each.
constexpr int kKeys = 100;

std::string& Scratch() {
  static std::string folder = [] {
    std::string pattern = (std::filesystem::temp_directory_path() / "krregbench-XXXXXX").string();
    if (::mkdtemp(pattern.data()) == nullptr)
      std::abort();
    ::setenv("KR_REGISTRY_DIR", (pattern + "/store").c_str(), 1);
    return pattern;
  }();
  return folder;
}

std::vector<std::wstring> Names() {
  std::vector<std::wstring> names;
  for (int i = 0; i < kValues; ++i)
    names.push_back(L"Value " + std::to_wstring(i));
  return names;
}

// A short UTF-16 text, as settings usually are.
const std::string& Payload() {
  static const std::string bytes = [] {
    std::string text;
    for (const char c : std::string("C:/Projects/model-17/settings\0", 30)) {
      text.push_back(c);
      text.push_back('\0');
    }
    return text;
  }();
  return bytes;
}

HKEY OpenBenchKey(const wchar_t* path) {
  HKEY key = nullptr;
  if (KRRegCreateKeyEx(HKEY_CURRENT_USER, path, 0, KRKEY_ALL_ACCESS, &key, nullptr) != KRERROR_SUCCESS)
    std::abort();
  return key;
}

void BM_Write_krCoreLib(benchmark::State& state) {
  Scratch();
  HKEY key = OpenBenchKey(L"Software\\Bench\\Flat");
  const std::vector<std::wstring> names = Names();
  const auto* data = reinterpret_cast<const std::uint8_t*>(Payload().data());
  for (auto _ : state)
    for (const std::wstring& name : names)
      if (KRRegSetValueEx(key, name.c_str(), KRREG_SZ, data, std::uint32_t(Payload().size())) != 0)
        state.SkipWithError("write failed");
  KRRegCloseKey(key);
}

void BM_Read_krCoreLib(benchmark::State& state) {
  Scratch();
  HKEY key = OpenBenchKey(L"Software\\Bench\\Flat");
  const std::vector<std::wstring> names = Names();
  std::uint8_t buffer[256];
  for (auto _ : state) {
    for (const std::wstring& name : names) {
      std::uint32_t size = sizeof buffer;
      std::uint32_t type = 0;
      if (KRRegQueryValueEx(key, name.c_str(), &type, buffer, &size) != 0)
        state.SkipWithError("read failed (run the write benchmark first)");
      benchmark::DoNotOptimize(buffer);
    }
  }
  KRRegCloseKey(key);
}

void BM_Export_krCoreLib(benchmark::State& state) {
  Scratch();
  const auto* data = reinterpret_cast<const std::uint8_t*>(Payload().data());
  for (int k = 0; k < kKeys; ++k) {
    HKEY key = OpenBenchKey((L"Software\\Bench\\Tree\\Key " + std::to_wstring(k)).c_str());
    for (int v = 0; v < kValues / kKeys; ++v)
      KRRegSetValueEx(key, (L"Value " + std::to_wstring(v)).c_str(), KRREG_SZ, data, std::uint32_t(Payload().size()));
    KRRegCloseKey(key);
  }
  const std::wstring file = std::filesystem::path(Scratch() + "/tree.reg").wstring();
  for (auto _ : state)
    if (!CKRRegistry::WriteRegistryTreeToFile(L"HKEY_CURRENT_USER\\Software\\Bench\\Tree", file.c_str()))
      state.SkipWithError("export failed");
}

// The floor: one table, a prepared statement, nothing else.
struct SKRPlainTable {
  sqlite3* m_pDb = nullptr;
  SKRPlainTable() {
    const std::string path = Scratch() + "/plain.db";
    if (sqlite3_open(path.c_str(), &m_pDb) != SQLITE_OK ||
        sqlite3_exec(m_pDb,
                     "PRAGMA journal_mode=WAL; PRAGMA synchronous=FULL;"
                     "CREATE TABLE IF NOT EXISTS vals(name TEXT PRIMARY KEY, type INTEGER, data BLOB)",
                     nullptr, nullptr, nullptr) != SQLITE_OK)
      std::abort();
  }
  ~SKRPlainTable() { sqlite3_close(m_pDb); }
  sqlite3_stmt* Prepare(const char* sql) const {
    sqlite3_stmt* statement = nullptr;
    sqlite3_prepare_v2(m_pDb, sql, -1, &statement, nullptr);
    return statement;
  }
};

std::vector<std::string> NarrowNames() {
  std::vector<std::string> names;
  for (int i = 0; i < kValues; ++i)
    names.push_back("Value " + std::to_string(i));
  return names;
}

void BM_Write_SQLite(benchmark::State& state) {
  SKRPlainTable table;
  sqlite3_stmt* insert = table.Prepare("INSERT OR REPLACE INTO vals(name, type, data) VALUES(?1, 1, ?2)");
  const std::vector<std::string> names = NarrowNames();
  for (auto _ : state) {
    for (const std::string& name : names) {
      sqlite3_bind_text(insert, 1, name.c_str(), int(name.size()), SQLITE_STATIC);
      sqlite3_bind_blob(insert, 2, Payload().data(), int(Payload().size()), SQLITE_STATIC);
      if (sqlite3_step(insert) != SQLITE_DONE)
        state.SkipWithError("write failed");
      sqlite3_reset(insert);
    }
  }
  sqlite3_finalize(insert);
}

void BM_Read_SQLite(benchmark::State& state) {
  SKRPlainTable table;
  sqlite3_stmt* select = table.Prepare("SELECT type, data FROM vals WHERE name = ?1");
  const std::vector<std::string> names = NarrowNames();
  std::uint8_t buffer[256];
  for (auto _ : state) {
    for (const std::string& name : names) {
      sqlite3_bind_text(select, 1, name.c_str(), int(name.size()), SQLITE_STATIC);
      if (sqlite3_step(select) != SQLITE_ROW)
        state.SkipWithError("read failed (run the write benchmark first)");
      std::memcpy(buffer, sqlite3_column_blob(select, 1), std::size_t(sqlite3_column_bytes(select, 1)));
      benchmark::DoNotOptimize(buffer);
      sqlite3_reset(select);
    }
  }
  sqlite3_finalize(select);
}

void BM_Export_SQLite(benchmark::State& state) {
  SKRPlainTable table;
  sqlite3_stmt* select = table.Prepare("SELECT name, type, data FROM vals ORDER BY rowid");
  const std::string path = Scratch() + "/plain.txt";
  for (auto _ : state) {
    std::FILE* file = std::fopen(path.c_str(), "wb");
    while (sqlite3_step(select) == SQLITE_ROW) {
      std::fprintf(file, "\"%s\"=hex(%x):", reinterpret_cast<const char*>(sqlite3_column_text(select, 0)),
                   unsigned(sqlite3_column_int(select, 1)));
      const auto* bytes = static_cast<const std::uint8_t*>(sqlite3_column_blob(select, 2));
      for (int i = 0, n = sqlite3_column_bytes(select, 2); i < n; ++i)
        std::fprintf(file, i + 1 < n ? "%02x," : "%02x", bytes[i]);
      std::fputs("\r\n", file);
    }
    sqlite3_reset(select);
    std::fflush(file);
    ::fsync(fileno(file));
    std::fclose(file);
  }
  sqlite3_finalize(select);
}

// Writes first: the reads and the export use what they wrote.
BENCHMARK(BM_Write_krCoreLib)->Unit(benchmark::kMillisecond)->Iterations(2);
BENCHMARK(BM_Write_SQLite)->Unit(benchmark::kMillisecond)->Iterations(2);
BENCHMARK(BM_Read_krCoreLib)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Read_SQLite)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Export_krCoreLib)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Export_SQLite)->Unit(benchmark::kMillisecond);

class CKRRegistryReporter : public CKRBenchReporter {
public:
  CKRRegistryReporter() : CKRBenchReporter(ETime::Real, kValues) {}

protected:
  void Summarize(std::ostream& out) override {
    out << "per value:\n";
    Ratio(out, "write (one transaction each)", "BM_Write_krCoreLib", "BM_Write_SQLite",
          0.0);
    Ratio(out, "read", "BM_Read_krCoreLib", "BM_Read_SQLite", 0.0);
    Ratio(out, "export of the tree / dump of the table", "BM_Export_krCoreLib", "BM_Export_SQLite", 0.0);
  }
};

}  // namespace

int main(int argc, char** argv) {
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv))
    return 1;
  CKRRegistryReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  benchmark::Shutdown();
  std::error_code error;
  std::filesystem::remove_all(Scratch(), error);
  return 0;
}
