// Serialization framework benchmarks: saving and loading storable objects of
// four fields (a string, an int, a GUID and one link) through a document, with
// the memory store of the tests: one that keeps nothing for saving (the
// framework alone), one that serves the stored values from maps for loading.
//
//   BM_Save/N  N objects saved into a fresh document per iteration
//   BM_Load/N  N objects loaded through GetObject from an archive opened on
//              the stored medium per iteration (the store's Open, which makes
//              a manifest entry and a stream per stored object, included)
//
// Targets: at least 1,000,000 objects per second saved and 500,000 loaded,
// and the cost per object flat from N = 10,000 to N = 100,000 (within 1.5x;
// a quadratic look-up would grow 10x).
#include <krCoreLib/krCoreLib.h>

#include <benchmark/benchmark.h>

#include "KRBenchReport.h"
#include "KRMemoryStore.h"

#include <string>
#include <vector>

namespace {

constexpr CKRGuid kRepository = CKRGuid::Literal("{5E000000-0000-4000-8000-000000000001}");
constexpr CKRGuid kDocumentID = CKRGuid::Literal("{5E000000-0000-4000-8000-000000000002}");

}  // namespace

class CKRBenchRecord : public CKRSerialObject {
  KR_DECLARE_SERIAL_TYPE(CKRBenchRecord, CKRSerialObjectTypeImpl, "{5E000000-0000-4000-8000-0000000000A1}")

public:
  CKRString m_Name;
  int m_Count = 0;
  CKRGuid m_Ref;
  CKRBenchRecord* m_pLink = nullptr;

protected:
  CKRBenchRecord() = default;
};

KR_IMPLEMENT_SERIAL_TYPE(CKRBenchRecord, CKRSerialObject)

void CKRBenchRecord::CKRBenchRecordType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  constexpr int kStored = KRF_READ | KRF_WRITE;
  AppendParentFields(target, object);
  BindField<CKRFieldT<CKRString>>(target, object, &CKRBenchRecord::m_Name, L"Name", L"",
                                  CKRGuid::Literal("{5E000000-0000-4000-8000-0000000000F1}"), KRDT_STRING, kStored);
  BindField<CKRFieldT<int>>(target, object, &CKRBenchRecord::m_Count, L"Count", L"",
                            CKRGuid::Literal("{5E000000-0000-4000-8000-0000000000F2}"), KRDT_INTEGER, kStored);
  BindField<CKRFieldT<CKRGuid>>(target, object, &CKRBenchRecord::m_Ref, L"Ref", L"",
                                CKRGuid::Literal("{5E000000-0000-4000-8000-0000000000F3}"), KRDT_GUID, kStored);
  BindField<CKRObjFieldT<CKRBenchRecord>>(target, object, &CKRBenchRecord::m_pLink, L"Link", L"",
                                          CKRGuid::Literal("{5E000000-0000-4000-8000-0000000000F4}"), KRDT_OBJECT_LINK,
                                          kStored);
}

namespace {

// N records; record i links to record i / 2, so that the link of every
// record but the first leads to one stored before it.
std::vector<CKRBenchRecord*> MakeRecords(std::size_t count) {
  std::vector<CKRBenchRecord*> records;
  auto* type = CKRBenchRecord::GetCKRBenchRecordType();
  for (std::size_t i = 0; i < count; ++i) {
    auto* record = static_cast<CKRBenchRecord*>(type->CreateInstance(CKRGuid()));
    record->m_Name = L"record";
    record->m_Count = int(i);
    record->m_Ref = CKRGuid::CreateNewGUID();
    records.push_back(record);
  }
  for (std::size_t i = 1; i < count; ++i)
    records[i]->m_pLink = records[i / 2];
  return records;
}

void ReleaseAll(const std::vector<CKRBenchRecord*>& records) {
  for (CKRBenchRecord* record : records)
    record->Release();
}

CKRMemoryArchive* OpenArchive(SKRStoredMedium& medium, CKRArchive::AccessMode mode) {
  auto* archive = static_cast<CKRMemoryArchive*>(CKRMemoryArchive::GetCKRMemoryArchiveType()->CreateInstance(CKRGuid()));
  archive->SetMedium(&medium);
  archive->Open(mode);
  return archive;
}

int SaveAll(SKRStoredMedium& medium, const std::vector<CKRBenchRecord*>& records) {
  CKRMemoryArchive* archive = OpenArchive(medium, CKRArchive::AccessWrite);
  CKRDocument* document = archive->CreateNewDocument(kDocumentID, nullptr);
  int saved = 0;
  for (CKRBenchRecord* record : records)
    saved += record->SerializeTo(document);
  archive->Release();
  return saved;
}

void BM_Save(benchmark::State& state) {
  const auto count = std::size_t(state.range(0));
  const std::vector<CKRBenchRecord*> records = MakeRecords(count);
  SKRStoredMedium nothing;
  nothing.m_KeepNothing = true;
  std::size_t saved = 0;
  for (auto _ : state)
    saved += std::size_t(SaveAll(nothing, records));
  state.SetItemsProcessed(state.iterations() * std::int64_t(count));
  ReleaseAll(records);
  if (saved != count * std::size_t(state.iterations()))
    state.SkipWithError("an object was not saved");
}

void BM_Load(benchmark::State& state) {
  const auto count = std::size_t(state.range(0));
  SKRStoredMedium medium;
  std::vector<CKRGuid> ids;
  {
    const std::vector<CKRBenchRecord*> records = MakeRecords(count);
    SaveAll(medium, records);
    for (CKRBenchRecord* record : records)
      ids.push_back(record->GetInstanceID());
    ReleaseAll(records);
  }
  std::vector<IKRObject*> loaded(count, nullptr);
  std::size_t found = 0;
  for (auto _ : state) {
    CKRMemoryArchive* archive = OpenArchive(medium, CKRArchive::AccessRead);
    CKRDocument* document = static_cast<CKRDocument*>(archive->GetDocumentCollection()->Find(kDocumentID));
    for (std::size_t i = 0; i < count; ++i)
      found += (loaded[i] = document->GetObject(ids[i], CKRBenchRecord::TypeID)) != nullptr ? 1 : 0;
    state.PauseTiming();
    archive->Release();
    for (IKRObject* object : loaded)
      object->Release();
    state.ResumeTiming();
  }
  state.SetItemsProcessed(state.iterations() * std::int64_t(count));
  if (found != count * std::size_t(state.iterations()))
    state.SkipWithError("an object was not loaded");
}

}  // namespace

BENCHMARK(BM_Save)->Arg(10000)->Arg(100000)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Load)->Arg(10000)->Arg(100000)->Unit(benchmark::kMillisecond);

namespace {

// CPU time: the machine is shared, and the wall clock counts the waits for
// a core as well.
class CKRSerializationReporter : public CKRBenchReporter {
public:
  CKRSerializationReporter() : CKRBenchReporter(ETime::Cpu) {}

protected:
  void Summarize(std::ostream& out) override {
    out << "\nObjects per second (and ns per object)\n";
    for (const char* name : {"BM_Save", "BM_Load"}) {
      const double target = std::string(name) == "BM_Save" ? 1e6 : 5e5;
      SKRResult small;
      SKRResult large;
      if (!Find(std::string(name) + "/10000", small) || !Find(std::string(name) + "/100000", large))
        continue;
      const double perSmall = small.m_Time / 1e4;
      const double perLarge = large.m_Time / 1e5;
      out << "   " << name << ": N = 10,000 " << std::setprecision(0) << 1e9 / perSmall << "/s (" << std::setprecision(1)
          << perSmall << " ns), N = 100,000 " << std::setprecision(0) << 1e9 / perLarge << "/s (" << std::setprecision(1)
          << perLarge << " ns); target >= " << std::setprecision(0) << target
          << "/s: " << (1e9 / perLarge >= target ? "met" : "MISSED") << "; flat (<= 1.5x): " << std::setprecision(2)
          << perLarge / perSmall << "x " << (perLarge / perSmall <= 1.5 ? "met" : "MISSED") << "\n";
    }
  }
};

}  // namespace

int main(int argc, char** argv) {
  CKRTypeSystem::Initialize(kRepository);
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv))
    return 1;
  CKRSerializationReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  benchmark::Shutdown();
  CKRTypeSystem::Release();
  CKRSingleton::ReleaseAll();
  return 0;
}
