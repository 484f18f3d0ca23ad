// notes.plg: an example plug-in module whose plug-in class is itself
// storable (it stores its notes) and handles its own commands: the
// commands name the plug-in as their handler, the command target only
// routes them. "Clear Notes" is disabled while there are no notes.
#include "KRExamplePlugins.h"

#include <krCoreLib/krCoreLib.h>

using namespace KRExamplePlugins;

namespace {
constexpr CKRGuid kFolderFieldID = CKRGuid::Literal("{5A3C1E20-7B14-4F0A-9C61-2E8D4B7A2301}");
constexpr CKRGuid kNotesFieldID = CKRGuid::Literal("{5A3C1E20-7B14-4F0A-9C61-2E8D4B7A2302}");
}  // namespace

class CKRNotesCfg : public CKRPluginCfg {
  KR_DECLARE_SERIAL_TYPE(CKRNotesCfg, CKRSerialObjectTypeImpl, "{5A3C1E20-7B14-4F0A-9C61-2E8D4B7A2002}")

public:
  CKRString m_Folder = L"notes";

protected:
  CKRNotesCfg() = default;
};

KR_IMPLEMENT_SERIAL_TYPE(CKRNotesCfg, CKRPluginCfg)

void CKRNotesCfg::CKRNotesCfgType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRFieldT<CKRString>>(target, object, &CKRNotesCfg::m_Folder, L"Folder", L"Where the notes are kept",
                                  kFolderFieldID, KRDT_STRING, KRF_READ | KRF_WRITE | KRF_VISIBLE);
}

class CKRNotesPlugin : public CKRPlugin, public IKRPluginCmdHandler {
  KR_DECLARE_SERIAL_TYPE(CKRNotesPlugin, CKRSerialObjectTypeImpl, "{5A3C1E20-7B14-4F0A-9C61-2E8D4B7A2003}")

public:
  int m_Notes = 0;

  void* GetInterface(CKRGuid iid) override {
    if (void* view = CKRPlugin::GetInterface(iid))
      return view;
    if (iid == IID_IKRPluginSocketCmdListener)
      return static_cast<IKRPluginSocketCmdListener*>(&m_Target);
    if (iid == IID_IKRPluginSocketCmdSource)
      return static_cast<IKRPluginSocketCmdSource*>(&m_Target);
    return nullptr;
  }
  int ShouldFilter(CKRGuid filterID) override { return filterID == kHideNotes ? 1 : 0; }
  int ShouldRegister(CKRPluginSocket*) override { return 1; }
  CKRPluginCfg* GetConfiguration() override { return m_pConfig; }

  int OnCommand(CKRGuid id, CKRString argument, void*) override {
    if (id == kNewNote)
      ++m_Notes;
    else if (id == kClearNotes)
      m_Notes = 0;
    else
      return 0;
    m_pConfig->m_Description = CKRString::Formatted(L"%d notes", m_Notes);
    if (!argument.IsEmpty())
      m_pConfig->m_Description += L": " + argument;
    return 1;
  }
  int OnCommandUI(CKRGuid id, CKRCmdUI* update) override {
    if (update == nullptr || id != kClearNotes)
      return 0;
    update->Enable(m_Notes > 0);
    return 1;
  }

  int OnInitialize() override {
    m_pConfig = dynamic_cast<CKRNotesCfg*>(CKRNotesCfg::GetCKRNotesCfgType()->CreateInstance(CKRGuid()));
    if (m_pConfig == nullptr)
      return 0;
    m_pConfig->m_PluginID = kNotesPluginID;
    m_pConfig->m_Name = L"Notes";
    m_pConfig->m_Description = L"Keeps notes";
    m_pConfig->m_ModuleName = L"notes.plg";
    m_Target.AddCmd(CKRPluginCmd(kNewNote, L"&New Note", L"Adds a note", this, KR_PLUGINCMD_MENU));
    m_Target.AddCmd(CKRPluginCmd(kClearNotes, L"&Clear Notes", L"Removes every note", this, KR_PLUGINCMD_MENU));
    return 1;
  }
  int OnBeforeRelease() override {
    if (m_pConfig != nullptr)
      m_pConfig->Release();
    m_pConfig = nullptr;
    return CKRPlugin::OnBeforeRelease();
  }

protected:
  CKRNotesPlugin() = default;

private:
  CKRNotesCfg* m_pConfig = nullptr;
  CKRPluginCmdTarget m_Target;
};

KR_IMPLEMENT_SERIAL_TYPE(CKRNotesPlugin, CKRPlugin)

void CKRNotesPlugin::CKRNotesPluginType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRFieldT<int>>(target, object, &CKRNotesPlugin::m_Notes, L"Notes", L"The number of notes", kNotesFieldID,
                            KRDT_INTEGER, KRF_READ | KRF_WRITE | KRF_VISIBLE);
}

extern "C" KR_PLUGIN_EXPORT IKRObjectType* GetPluginType() {
  return CKRNotesPlugin::GetCKRNotesPluginType();
}
