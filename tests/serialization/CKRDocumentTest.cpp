// Saving and loading through archives, documents, manifests and streams,
// with the memory store of tests/common: what is written, once per session;
// cycles; a chain of 100,000 objects on a default stack; one live object per
// stored object; links that cannot be resolved; hostile stored values; and
// ownership down the structure.
#include <krCoreLib/objectmodel/CKRTypeSystem.h>
#include <krCoreLib/serialization/IKRFieldData.h>

#include "KRMemoryStore.h"
#include "KRSerialTestObjects.h"

#include <gtest/gtest.h>

#include <thread>
#include <vector>

using namespace KRTestFields;

namespace {

constexpr CKRGuid kRepository = CKRGuid::Literal("{5D000000-0000-4000-8000-000000000002}");
constexpr CKRGuid kDocumentID = CKRGuid::Literal("{5D000000-0000-4000-8000-0000000000D0}");

class CKRDocumentTest : public testing::Test {
protected:
  void SetUp() override { CKRTypeSystem::Initialize(kRepository); }

  // An archive on `m_Medium`, open in `mode`.
  CKRMemoryArchive* OpenArchive(CKRArchive::AccessMode mode) {
    auto* archive = static_cast<CKRMemoryArchive*>(CKRMemoryArchive::GetCKRMemoryArchiveType()->CreateInstance(CKRGuid()));
    archive->SetMedium(&m_Medium);
    EXPECT_TRUE(archive->Open(mode));
    return archive;
  }

  // Saves the roots into one document; the archive's result.
  int Save(const std::vector<CKRSerialObject*>& roots) {
    CKRMemoryArchive* archive = OpenArchive(CKRArchive::AccessWrite);
    CKRDocument* document = archive->CreateNewDocument(kDocumentID, nullptr);
    int result = document != nullptr ? 1 : 0;
    for (CKRSerialObject* root : roots)
      result &= root->SerializeTo(document);
    archive->Release();
    return result;
  }

  // Opens the medium for reading; the caller releases the archive.
  CKRDocument* Load(CKRMemoryArchive*& archive) {
    archive = OpenArchive(CKRArchive::AccessRead);
    return static_cast<CKRDocument*>(archive->GetDocumentCollection()->Find(kDocumentID));
  }

  CKRTestRecord* GetRecord(CKRDocument* document, CKRGuid id) {
    return dynamic_cast<CKRTestRecord*>(document->GetObject(id, CKRTestRecord::TypeID));
  }

  SKRStoredObject& Stored(IKRObject* object) { return m_Medium.m_Documents[kDocumentID].m_Objects[object->GetInstanceID()]; }

  SKRStoredMedium m_Medium;
};

}  // namespace

TEST_F(CKRDocumentTest, EveryFieldKindRoundTripsAsItsFlagsSay) {
  CKRTestRecord* root = NewRecord(L"root");
  CKRTestRecord* next = NewRecord(L"next");
  CKRTestRecord* child = NewRecord(L"child");
  root->m_Count = -12;
  root->m_Ref = CKRGuid::CreateNewGUID();
  root->m_pNext = next;
  root->m_Children.Add(child);
  root->m_Children.Add(next);
  root->m_ReadOnly = L"never written";
  root->m_WriteOnly = L"written";
  ASSERT_EQ(Save({root}), 1);

  SKRStoredObject& stored = Stored(root);
  EXPECT_EQ(stored.m_Values.count(kReadOnly), 0u);
  EXPECT_EQ(stored.m_Values.at(kWriteOnly), L"written");
  // List order: the record's own fields as declared.
  EXPECT_EQ(stored.m_WriteOrder, (std::vector<CKRGuid>{kName, kCount, kRef, kNext, kChildren, kWriteOnly}));
  EXPECT_EQ(Stored(next).m_HeaderWrites, 1);  // linked twice, stored once
  // Each linked object right after the link that reaches it first.
  EXPECT_EQ(m_Medium.m_Documents[kDocumentID].m_HeaderOrder,
            (std::vector<CKRGuid>{root->GetInstanceID(), next->GetInstanceID(), child->GetInstanceID()}));
  stored.m_Values[kReadOnly] = L"read";

  CKRMemoryArchive* archive = nullptr;
  CKRDocument* document = Load(archive);
  CKRTestRecord* loaded = GetRecord(document, root->GetInstanceID());
  ASSERT_NE(loaded, nullptr);
  EXPECT_NE(loaded, root);
  EXPECT_EQ(loaded->GetInstanceID(), root->GetInstanceID());
  EXPECT_EQ(loaded->m_Name, L"root");
  EXPECT_EQ(loaded->m_Count, -12);
  EXPECT_EQ(loaded->m_Ref, root->m_Ref);
  EXPECT_EQ(loaded->m_ReadOnly, L"read");
  EXPECT_EQ(loaded->m_WriteOnly, L"");
  ASSERT_NE(loaded->m_pNext, nullptr);
  EXPECT_EQ(loaded->m_pNext->m_Name, L"next");
  ASSERT_EQ(loaded->m_Children.GetCount(), 2);
  EXPECT_EQ(*std::next(loaded->m_Children.begin()), loaded->m_pNext);  // one live object each
  EXPECT_EQ(loaded->m_Patches, 1);
  // The same object again, read once.
  EXPECT_EQ(GetRecord(document, root->GetInstanceID()), loaded);
  EXPECT_EQ(Stored(root).m_HeaderReads, 1);
  archive->Release();
  for (CKRTestRecord* record : {root, next, child, loaded, loaded->m_pNext, *loaded->m_Children.begin()})
    record->Release();

  // A collection over a map of records.
  m_Medium = SKRStoredMedium();
  auto* index = static_cast<CKRTestIndex*>(CKRTestIndex::GetCKRTestIndexType()->CreateInstance(CKRGuid()));
  CKRTestRecord* members[] = {NewRecord(L"a"), NewRecord(L"b")};
  for (CKRTestRecord* member : members)
    index->m_Members.Add(member);
  ASSERT_EQ(Save({index}), 1);
  document = Load(archive);
  auto* loadedIndex = dynamic_cast<CKRTestIndex*>(document->GetObject(index->GetInstanceID(), CKRTestIndex::TypeID));
  ASSERT_NE(loadedIndex, nullptr);
  ASSERT_EQ(loadedIndex->m_Members.GetCount(), 2);
  for (CKRTestRecord* member : members) {
    CKRTestRecord* copy = loadedIndex->m_Members.Find(member->GetInstanceID());
    ASSERT_NE(copy, nullptr);
    EXPECT_NE(copy, member);
    EXPECT_EQ(copy->m_Name, member->m_Name);
  }
  archive->Release();
  loadedIndex->m_Members.RemoveAll(true);
  loadedIndex->Release();
  index->Release();
  for (CKRTestRecord* member : members)
    member->Release();
}

// Two and three objects linked in a circle: each stored once, saving ends,
// also with a store that refuses a second header; loading gives one live
// object each, linked in the same circle.
TEST_F(CKRDocumentTest, CyclesAreStoredOnceAndLoadedAsOneObjectEach) {
  for (const int size : {2, 3}) {
    SCOPED_TRACE(testing::Message() << size << " objects");
    m_Medium = SKRStoredMedium();
    m_Medium.m_RefuseSecondHeader = true;
    std::vector<CKRTestRecord*> ring;
    for (int i = 0; i < size; ++i)
      ring.push_back(NewRecord(L"ring"));
    for (int i = 0; i < size; ++i)
      ring[i]->m_pNext = ring[(i + 1) % size];
    ring[0]->m_Children.Add(ring[size - 1]);
    ASSERT_EQ(Save({ring[0]}), 1);
    for (CKRTestRecord* record : ring)
      EXPECT_EQ(Stored(record).m_HeaderWrites, 1);

    CKRMemoryArchive* archive = nullptr;
    CKRDocument* document = Load(archive);
    CKRTestRecord* first = GetRecord(document, ring[1]->GetInstanceID());
    ASSERT_NE(first, nullptr);
    CKRTestRecord* walk = first;
    for (int i = 0; i < size; ++i) {
      ASSERT_NE(walk->m_pNext, nullptr);
      walk = walk->m_pNext;
    }
    EXPECT_EQ(walk, first);
    for (CKRTestRecord* record : ring)
      EXPECT_EQ(Stored(record).m_HeaderReads, 1);
    archive->Release();
    for (int i = 0; i < size; ++i) {
      CKRTestRecord* following = walk->m_pNext;
      walk->Release();
      walk = following;
      ring[i]->Release();
    }
  }
}

// A chain far deeper than the native stack could nest, saved and loaded on
// a thread with the default stack; each object stored and loaded once.
TEST_F(CKRDocumentTest, LongChainSavesAndLoadsOnADefaultStack) {
  constexpr int kLength = 100000;
  std::vector<CKRTestRecord*> chain;
  for (int i = 0; i < kLength; ++i)
    chain.push_back(NewRecord());
  for (int i = 0; i + 1 < kLength; ++i)
    chain[i]->m_pNext = chain[i + 1];
  int saved = 0;
  std::thread([&] { saved = Save({chain[0]}); }).join();
  EXPECT_EQ(saved, 1);
  const auto& objects = m_Medium.m_Documents[kDocumentID].m_Objects;
  EXPECT_EQ(objects.size(), std::size_t(kLength));
  for (const auto& [id, object] : objects)
    ASSERT_EQ(object.m_HeaderWrites, 1);
  // While the nesting is shallow, in the order of the chain.
  const std::vector<CKRGuid>& order = m_Medium.m_Documents[kDocumentID].m_HeaderOrder;
  ASSERT_EQ(order.size(), std::size_t(kLength));
  for (int i = 0; i < 1000; ++i)
    ASSERT_EQ(order[i], chain[i]->GetInstanceID()) << i;

  CKRMemoryArchive* archive = nullptr;
  CKRTestRecord* first = nullptr;
  std::thread([&] { first = GetRecord(Load(archive), chain[0]->GetInstanceID()); }).join();
  int length = 0;
  int patches = 0;
  for (CKRTestRecord* walk = first; walk != nullptr; walk = walk->m_pNext, ++length)
    patches += walk->m_Patches;
  EXPECT_EQ(length, kLength);
  EXPECT_EQ(patches, kLength);
  for (const auto& [id, object] : objects)
    ASSERT_EQ(object.m_HeaderReads, 1);
  archive->Release();
  ReleaseChains(first, chain);
}

TEST_F(CKRDocumentTest, OncePerSessionAndAgainAfterAFailure) {
  CKRTestRecord* record = NewRecord(L"r");
  CKRMemoryArchive* archive = OpenArchive(CKRArchive::AccessWrite);
  CKRDocument* document = archive->CreateNewDocument(kDocumentID, nullptr);
  EXPECT_EQ(record->SerializeTo(document), 1);
  EXPECT_EQ(record->SerializeTo(document), 1);
  EXPECT_EQ(Stored(record).m_HeaderWrites, 1);
  EXPECT_EQ(m_Medium.m_Documents[kDocumentID].m_TypeHeaders[CKRTestRecord::TypeID], 1);
  document->AdvanceSerialSessionID();
  EXPECT_EQ(record->SerializeTo(document), 1);
  EXPECT_EQ(Stored(record).m_HeaderWrites, 2);
  // A field that fails fails the save and leaves the object unmarked.
  document->AdvanceSerialSessionID();
  m_Medium.m_FailWriteOfField = kCount;
  EXPECT_EQ(record->SerializeTo(document), 0);
  m_Medium.m_FailWriteOfField = CKRGuid();
  EXPECT_EQ(record->SerializeTo(document), 1);
  EXPECT_EQ(Stored(record).m_HeaderWrites, 4);
  EXPECT_EQ(record->SerializeTo(nullptr), 0);
  archive->Release();
  record->Release();
}

// Missing, empty and malformed stored values leave members (or give what
// the value type says); links to unknown or unusable types resolve to null
// and leave nothing half-built behind.
TEST_F(CKRDocumentTest, HostileStoredDataLoadsSafely) {
  const int destroyed = CKRTestRecord::s_Destroyed;
  SKRStoredDocument& stored = m_Medium.m_Documents[kDocumentID];
  const CKRGuid id = CKRGuid::CreateNewGUID();
  SKRStoredObject& object = stored.m_Objects[id];
  object.m_TypeID = CKRTestRecord::TypeID;
  object.m_Values = {{kName, L""}, {kCount, L"12abc"}, {kRef, L"{not-a-guid}"}};
  const CKRGuid leafID = CKRGuid::CreateNewGUID();
  stored.m_Objects[leafID].m_TypeID = CKRTestLeaf::TypeID;
  object.m_Links[kNext] = {{CKRTestLeaf::TypeID, leafID}};  // storable, but not a record
  object.m_Links[kChildren] = {{CKRGuid::CreateNewGUID(), CKRGuid::CreateNewGUID()},  // unknown type
                               {CKRTestPlain::TypeID, CKRGuid::CreateNewGUID()},     // not storable
                               {CKRTestRecord::TypeID, CKRGuid::CreateNewGUID()},    // never stored
                               {CKRGuid(), CKRGuid()},
                               {CKRTestLeaf::TypeID, leafID}};  // storable, but not a record
  const CKRGuid refused = CKRGuid::CreateNewGUID();
  stored.m_Objects[refused].m_TypeID = CKRTestRecord::TypeID;

  CKRMemoryArchive* archive = nullptr;
  CKRDocument* document = Load(archive);
  CKRTestRecord* loaded = GetRecord(document, id);
  ASSERT_NE(loaded, nullptr);
  EXPECT_EQ(loaded->m_Name, L"");
  EXPECT_EQ(loaded->m_Count, 12);
  EXPECT_TRUE(loaded->m_Ref.IsNull());
  EXPECT_EQ(loaded->m_pNext, nullptr);
  EXPECT_EQ(loaded->m_Children.GetCount(), 0);
  // The link of another class made no object (the sanitizer build reports
  // a leak otherwise), and the field says it failed; the stored object is
  // still there for a request of its own class.
  auto* manifest = dynamic_cast<CKRTypeManifest*>(document->GetTypeManifestCollection()->Find(CKRTestRecord::TypeID));
  ASSERT_NE(manifest, nullptr);
  auto* stream = dynamic_cast<CKRFieldStream*>(manifest->GetInstanceFieldStreamCollection()->Find(id));
  ASSERT_NE(stream, nullptr);
  EXPECT_EQ(loaded->GetFieldData(kNext)->SerializeFrom(stream), 0);
  EXPECT_EQ(stored.m_Objects[leafID].m_HeaderReads, 0);
  IKRObject* leaf = document->GetObject(leafID, CKRTestLeaf::TypeID);
  ASSERT_NE(leaf, nullptr);
  EXPECT_EQ(stored.m_Objects[leafID].m_HeaderReads, 1);
  leaf->Release();
  EXPECT_EQ(CKRTestPlain::GetCKRTestPlainType()->GetInstanceCount(), 0);
  EXPECT_EQ(CKRTestRecord::s_Destroyed, destroyed + 1);  // the record that was never stored
  EXPECT_EQ(document->GetObject(id, CKRGuid::CreateNewGUID()), nullptr);
  EXPECT_EQ(document->GetObject(id, CKRGuid()), nullptr);
  CKRTestRecord::s_RefuseInitialize = true;
  EXPECT_EQ(GetRecord(document, refused), nullptr);
  CKRTestRecord::s_RefuseInitialize = false;
  CKRTestRecord* accepted = GetRecord(document, refused);  // and once it initialises
  ASSERT_NE(accepted, nullptr);
  archive->Release();
  loaded->Release();
  accepted->Release();
}

// Containers refuse unsuitable types and taken IDs, report absent IDs as
// deleted, and releasing the archive releases everything below it.
TEST_F(CKRDocumentTest, ArchivesOwnTheirStructure) {
  CKRMemoryArchive* archive = OpenArchive(CKRArchive::AccessRead);
  const CKRBOOL refused = archive->Save();
  EXPECT_FALSE(refused);
  EXPECT_EQ(refused.GetMessage(), L"Archive Not Open in Write Mode");
  EXPECT_TRUE(archive->Open(CKRArchive::AccessWrite) && archive->Save());
  EXPECT_EQ(archive->CKRArchive::CreateNewDocument(kDocumentID, nullptr), nullptr);
  EXPECT_EQ(archive->CreateNewDocument(kDocumentID, CKRTestRecord::GetCKRTestRecordType()), nullptr);
  CKRDocument* document = archive->CreateNewDocument(kDocumentID, nullptr);
  ASSERT_NE(document, nullptr);
  EXPECT_EQ(archive->CreateNewDocument(kDocumentID, nullptr), nullptr);
  EXPECT_TRUE(archive->DeleteDocument(CKRGuid::CreateNewGUID()));

  CKRTypeManifest* manifest = document->CreateTypeManifest(CKRTestRecord::TypeID, nullptr);
  ASSERT_NE(manifest, nullptr);
  EXPECT_EQ(document->CreateTypeManifest(CKRTestRecord::TypeID, nullptr), nullptr);
  EXPECT_EQ(CKRMemoryTypeManifest::GetCKRMemoryTypeManifestType()->GetInstance(CKRTestRecord::TypeID), manifest);
  EXPECT_EQ(manifest->CreateFieldStream(CKRGuid::CreateNewGUID(), CKRMemoryDocument::GetCKRMemoryDocumentType()), nullptr);
  EXPECT_EQ(manifest->CreateFieldStream(CKRGuid::CreateNewGUID(), CKRFieldStream::GetCKRFieldStreamType()), nullptr);
  for (int i = 0; i < 3; ++i)
    ASSERT_NE(manifest->CreateFieldStream(CKRGuid::CreateNewGUID(), nullptr), nullptr);
  CKRFieldStream* stream = manifest->GetInstanceFieldStreamIterator().Next(1);
  EXPECT_EQ(manifest->DeleteFieldStream(stream->GetStoredInstanceID()), 1);
  EXPECT_EQ(manifest->GetInstanceFieldStreamCollection()->GetCount(), 2);
  archive->CreateNewDocument(CKRGuid::CreateNewGUID(), nullptr)->CreateTypeManifest(CKRTestBase::TypeID, nullptr);

  archive->Release();
  for (IKRObjectType* type :
       std::vector<IKRObjectType*>{CKRMemoryArchive::GetCKRMemoryArchiveType(), CKRMemoryDocument::GetCKRMemoryDocumentType(),
                                   CKRMemoryTypeManifest::GetCKRMemoryTypeManifestType(),
                                   CKRMemoryFieldStream::GetCKRMemoryFieldStreamType()}) {
    std::vector<CKRGuid> alive;
    type->GetInstanceList(alive);
    EXPECT_TRUE(alive.empty()) << type->GetName().ToUtf8();
  }
}
