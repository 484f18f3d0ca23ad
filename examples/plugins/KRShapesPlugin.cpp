// shapes.plg: an example plug-in module. Its configuration stores the
// number of shapes drawn; its two menu commands draw a shape, a third
// command (not in menus) starts again. Command state: "Draw Square" is
// checked once a square has been drawn.
#include "KRExamplePlugins.h"

#include <krCoreLib/krCoreLib.h>

using namespace KRExamplePlugins;

namespace {
constexpr CKRGuid kDrawnFieldID = CKRGuid::Literal("{5A3C1E20-7B14-4F0A-9C61-2E8D4B7A1301}");
}

class CKRShapesCfg : public CKRPluginCfg {
  KR_DECLARE_SERIAL_TYPE(CKRShapesCfg, CKRSerialObjectTypeImpl, "{5A3C1E20-7B14-4F0A-9C61-2E8D4B7A1002}")

public:
  int m_Drawn = 0;

protected:
  CKRShapesCfg() = default;
};

KR_IMPLEMENT_SERIAL_TYPE(CKRShapesCfg, CKRPluginCfg)

void CKRShapesCfg::CKRShapesCfgType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRFieldT<int>>(target, object, &CKRShapesCfg::m_Drawn, L"Drawn", L"Shapes drawn so far", kDrawnFieldID,
                            KRDT_INTEGER, KRF_READ | KRF_WRITE | KRF_VISIBLE);
}

class CKRShapesTarget : public CKRPluginCmdTarget {
public:
  CKRShapesCfg* m_pConfig = nullptr;
  bool m_SquareDrawn = false;

  int OnCommand(CKRGuid id, CKRString argument, void* data) override {
    if (id == kDrawHexagon || id == kDrawSquare) {
      ++m_pConfig->m_Drawn;
      m_SquareDrawn = m_SquareDrawn || id == kDrawSquare;
      m_pConfig->m_Description = CKRString::Formatted(L"Drew a %s (%d so far)", id == kDrawSquare ? L"square" : L"hexagon",
                                                       m_pConfig->m_Drawn);
      return 1;
    }
    if (id == kResetShapes) {
      m_pConfig->m_Drawn = 0;
      m_SquareDrawn = false;
      m_pConfig->m_Description = L"Draws shapes";
      return 1;
    }
    return CKRPluginCmdTarget::OnCommand(id, argument, data);
  }

  int OnCommandUI(CKRGuid id, CKRCmdUI* update) override {
    if (update == nullptr || id != kDrawSquare)
      return 0;
    update->SetCheck(m_SquareDrawn ? 1 : 0);
    return 1;
  }
};

class CKRShapesPlugin : public CKRPlugin {
  KR_DECLARE_OBJECT_TYPE(CKRShapesPlugin, CKRObjectTypeImpl, "{5A3C1E20-7B14-4F0A-9C61-2E8D4B7A1003}")

public:
  void* GetInterface(CKRGuid iid) override {
    if (void* view = CKRPlugin::GetInterface(iid))
      return view;
    if (iid == IID_IKRPluginSocketCmdRegistrant)
      return static_cast<IKRPluginSocketCmdRegistrant*>(&m_Target);
    if (iid == IID_IKRPluginSocketCmdSource)
      return static_cast<IKRPluginSocketCmdSource*>(&m_Target);
    return nullptr;
  }
  int ShouldFilter(CKRGuid filterID) override { return filterID == kHideShapes ? 1 : 0; }
  int ShouldRegister(CKRPluginSocket*) override { return 1; }
  CKRPluginCfg* GetConfiguration() override { return m_pConfig; }

  int OnInitialize() override {
    m_pConfig = dynamic_cast<CKRShapesCfg*>(CKRShapesCfg::GetCKRShapesCfgType()->CreateInstance(CKRGuid()));
    if (m_pConfig == nullptr)
      return 0;
    m_pConfig->m_PluginID = kShapesPluginID;
    m_pConfig->m_Name = L"Shapes";
    m_pConfig->m_Description = L"Draws shapes";
    m_pConfig->m_ModuleName = L"shapes.plg";
    m_Target.m_pConfig = m_pConfig;
    m_Target.AddCmd(CKRPluginCmd(kDrawHexagon, L"Draw &Hexagon", L"Draws a hexagon", nullptr, KR_PLUGINCMD_MENU));
    m_Target.AddCmd(CKRPluginCmd(kDrawSquare, L"Draw &Square", L"Draws a square", nullptr, KR_PLUGINCMD_MENU));
    m_Target.AddCmd(CKRPluginCmd(kResetShapes, L"Reset", L"Forgets the shapes drawn", nullptr, 0));
    return 1;
  }

  // The configuration is of this module's storable type: it ends here, with
  // the plug-in.
  int OnBeforeRelease() override {
    if (m_pConfig != nullptr)
      m_pConfig->Release();
    m_pConfig = nullptr;
    return CKRPlugin::OnBeforeRelease();
  }

protected:
  CKRShapesPlugin() = default;

private:
  CKRShapesCfg* m_pConfig = nullptr;
  CKRShapesTarget m_Target;
};

KR_IMPLEMENT_OBJECT_TYPE(CKRShapesPlugin, CKRPlugin)

extern "C" KR_PLUGIN_EXPORT IKRObjectType* GetPluginType() {
  return CKRShapesPlugin::GetCKRShapesPluginType();
}
