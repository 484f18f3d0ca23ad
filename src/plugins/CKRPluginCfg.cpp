#include <krCoreLib/plugins/CKRPluginCfg.h>

#include <krCoreLib/serialization/CKRFieldT.h>

KR_IMPLEMENT_SERIAL_TYPE(CKRPluginCfg, CKRSerialObject)

void CKRPluginCfg::CKRPluginCfgType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  // The display name is the configuration type's own, not that of a
  // derived configuration type that brings these fields in.
  if (object == nullptr && target == this) {
    SetName(L"Plugin");
    SetDescription(L"An optional application module");
  }
  AppendParentFields(target, object);
  BindField<CKRFieldT<CKRGuid>>(target, object, &CKRPluginCfg::m_PluginID, L"Plugin ID",
                                L"The unique identifier for this plugin", PluginIDFieldID, KRDT_GUID, FieldFlags);
  BindField<CKRFieldT<CKRString>>(target, object, &CKRPluginCfg::m_Name, L"Name", L"The name of this plugin", NameFieldID,
                                  KRDT_STRING, FieldFlags);
  BindField<CKRFieldT<CKRString>>(target, object, &CKRPluginCfg::m_Description, L"Description",
                                  L"A brief description of this plugin", DescriptionFieldID, KRDT_STRING, FieldFlags);
  BindField<CKRFieldT<CKRString>>(target, object, &CKRPluginCfg::m_ModuleName, L"Module Name",
                                  L"The primary plugin module file", ModuleNameFieldID, KRDT_STRING, FieldFlags);
  // The defaults of a new configuration, given with its field data.
  if (auto* config = dynamic_cast<CKRPluginCfg*>(object)) {
    config->m_PluginID = CKRGuid::CreateNewGUID();
    config->m_Name = L"Generic";
    config->m_Description = L"A Generic Plugin";
    config->m_ModuleName = L"myplugin.plg";
  }
}
