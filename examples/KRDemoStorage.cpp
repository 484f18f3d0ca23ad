// XML storage: a small graph and a preferences object with two sections
// saved into one XML file, loaded back into fresh objects and printed.
#include "KRDemo.h"

#include <krCoreLib/framework/CKRGraphNode.h>
#include <krCoreLib/framework/CKRGraphNodeVisitor.h>
#include <krCoreLib/framework/CKRPreferences.h>

#include <filesystem>

namespace {

constexpr CKRGuid kDocumentID = CKRGuid::Literal("{7E0F1A2B-3C4D-4E5F-8A9B-0C1D2E3F4C00}");

template <typename T>
T* New(IKRObjectType* type) {
  return static_cast<T*>(type->CreateInstance(CKRGuid()));
}

CKRXMLFileArchive* NewArchive(const CKRString& file) {
  auto* archive = New<CKRXMLFileArchive>(CKRXMLFileArchive::GetCKRXMLFileArchiveType());
  archive->SetFile(file);
  return archive;
}

void Join(CKRGraphNode* a, CKRGraphNode* b) {
  auto* edge = New<CKRGraphEdge>(CKRGraphEdge::GetCKRGraphEdgeType());
  edge->SetNodes(a, b);
  edge->Connect();
}

}  // namespace

void KRDemoStorage() {
  const CKRString file = CKRString::FromUtf8((std::filesystem::temp_directory_path() / "krdemo-storage.xml").string());

  // A triangle of nodes with a tail, and preferences with two sections.
  CKRGraphNode* nodes[4];
  for (CKRGraphNode*& node : nodes)
    node = New<CKRGraphNode>(CKRGraphNode::GetCKRGraphNodeType());
  Join(nodes[0], nodes[1]);
  Join(nodes[1], nodes[2]);
  Join(nodes[2], nodes[0]);
  Join(nodes[2], nodes[3]);
  auto* preferences = New<CKRPreferences>(CKRPreferences::GetCKRPreferencesType());
  for (const wchar_t* name : {L"Display", L"Units"}) {
    auto* section = New<CKRPreferenceSection>(CKRPreferenceSection::GetCKRPreferenceSectionType());
    section->SetName(name);
    preferences->GetPreferenceSectionMap().Add(section);
  }
  const CKRGuid graphID = nodes[0]->GetInstanceID();
  const CKRGuid preferencesID = preferences->GetInstanceID();

  CKRXMLFileArchive* archive = NewArchive(file);
  archive->Open(CKRArchive::AccessWrite);
  CKRDocument* document = archive->CreateNewDocument(kDocumentID, nullptr);
  nodes[0]->SerializeTo(document);  // the whole connected graph
  preferences->SerializeTo(document);
  const CKRBOOL saved = archive->Close();
  archive->Release();
  Print(CKRString::Formatted(L"saved to %s: %s (%d bytes)\n", file.GetString(), saved ? L"yes" : L"no",
                             int(std::filesystem::file_size(file.ToUtf8()))));
  auto* release = New<CKRReleaseVisitor>(CKRReleaseVisitor::GetCKRReleaseVisitorType());
  release->Start(nodes[0]);
  preferences->GetPreferenceSectionMap().RemoveAll(true);
  preferences->Release();

  archive = NewArchive(file);
  archive->Open(CKRArchive::AccessRead);
  document = static_cast<CKRDocument*>(archive->GetDocumentCollection()->Find(kDocumentID));
  auto* graph = dynamic_cast<CKRGraphNode*>(document->GetObject(graphID, CKRGraphNode::TypeID));
  auto* loaded = dynamic_cast<CKRPreferences*>(document->GetObject(preferencesID, CKRPreferences::TypeID));
  archive->Close();
  archive->Release();

  auto* walk = New<CKRDFSVisitor>(CKRDFSVisitor::GetCKRDFSVisitorType());
  walk->Start(graph);
  Print(CKRString::Formatted(L"loaded graph: %d nodes reachable from the first, which has %d edges\n",
                             walk->GetDFSNodeCollection()->GetCount(), graph->GetEdgeCollection()->GetCount()));
  walk->Release();
  Print(L"loaded preferences, sections:");
  auto sections = loaded->GetPreferenceSectionMap().GetIterator();
  for (CKRPreferenceSection* section = sections.Next(1); section != nullptr; section = sections.Next(0))
    Print(L" " + section->GetName());
  Print(L"\n");
  release->Start(graph);
  release->Release();
  loaded->GetPreferenceSectionMap().RemoveAll(true);
  loaded->Release();
  std::filesystem::remove(file.ToUtf8());
}
