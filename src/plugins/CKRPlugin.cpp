#include <krCoreLib/plugins/CKRPlugin.h>

KR_IMPLEMENT_ABSTRACT_OBJECT_TYPE(CKRPlugin, CKRObjectImpl)
KR_IMPLEMENT_OBJECT_TYPE(CKRPluginError, CKRPlugin)

void* CKRPlugin::GetInterface(CKRGuid iid) {
  if (void* view = CKRSerialObject::GetInterface(iid))
    return view;
  if (iid.IsValid() && iid == IID_IKRPlugin)
    return static_cast<IKRPlugin*>(this);
  return nullptr;
}

int CKRPluginError::OnInitialize() {
  if (CKRPlugin::OnInitialize() == 0)
    return 0;
  m_pConfig = dynamic_cast<CKRPluginCfg*>(CKRPluginCfg::GetCKRPluginCfgType()->CreateInstance(CKRGuid()));
  if (m_pConfig == nullptr)
    return 0;
  m_pConfig->m_Name = L"Plugin Error";
  m_pConfig->m_Description.Empty();
  m_pConfig->m_ModuleName.Empty();
  m_pConfig->m_PluginID = CKRPluginError::TypeID;
  return 1;
}

int CKRPluginError::OnBeforeRelease() {
  if (m_pConfig != nullptr) {
    m_pConfig->Release();
    m_pConfig = nullptr;
  }
  return CKRPlugin::OnBeforeRelease();
}

int CKRPluginError::ShouldFilter(CKRGuid) {
  return 1;
}

int CKRPluginError::ShouldRegister(CKRPluginSocket*) {
  return 0;
}

CKRPluginCfg* CKRPluginError::GetConfiguration() {
  return m_pConfig;
}
