// CKRPluginCfg: the storable description of a plug-in.
//
// Four stored fields: the plug-in ID that tells plug-ins apart (two loaded
// plug-ins never share one), the name the user sees, a description and the
// module file name. A new configuration has a fresh plug-in ID, the name
// "Generic", the description "A Generic Plugin" and the module name
// "myplugin.plg". A plug-in module derives its own configuration class from
// it to store more (its CreateFields calls this type's first, through
// AppendParentFields). Not synchronised.
#pragma once

#include <krCoreLib/serialization/CKRSerialObject.h>

class KRCORELIB_API CKRPluginCfg : public CKRSerialObject {
  KR_DECLARE_SERIAL_TYPE(CKRPluginCfg, CKRSerialObjectTypeImpl, "{B62ADF0D-E42D-45BB-A051-0F26C6611EB8}")

public:
  // Field IDs of the four stored fields, in their order.
  KRCORELIB_LOCAL static constexpr CKRGuid PluginIDFieldID = CKRGuid::Literal("{A29A7B06-BEB3-41FF-9F4A-2CFD89CF9270}");
  KRCORELIB_LOCAL static constexpr CKRGuid NameFieldID = CKRGuid::Literal("{24B99629-D268-470B-9587-8C242EDE1ABC}");
  KRCORELIB_LOCAL static constexpr CKRGuid DescriptionFieldID = CKRGuid::Literal("{E475A5FB-AFD6-4479-AC56-31384C8A2D1A}");
  KRCORELIB_LOCAL static constexpr CKRGuid ModuleNameFieldID = CKRGuid::Literal("{39F41F51-597A-4AF6-ABE1-32C4C290B98D}");
  // The flags of the four field descriptors: read, written, shown, read-only
  // and expanded (KRF_READ | KRF_WRITE | KRF_VISIBLE | KRF_READONLY |
  // KRF_EXPANDED).
  static constexpr int FieldFlags = 0x40F;

  CKRGuid m_PluginID;
  CKRString m_Name;
  CKRString m_Description;
  CKRString m_ModuleName;

protected:
  CKRPluginCfg() = default;
  ~CKRPluginCfg() override = default;
};
