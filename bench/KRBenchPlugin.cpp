// The plug-in module of the plug-in benchmark: one plug-in class with the
// default configuration (a fresh plug-in ID for every plug-in object, so
// that copies of the module are distinct plug-ins) and one command.
#include <krCoreLib/krCoreLib.h>

class CKRBenchPlugin : public CKRPlugin {
  KR_DECLARE_OBJECT_TYPE(CKRBenchPlugin, CKRObjectTypeImpl, "{B3E4C5D6-0000-4000-8000-00000000BE01}")

public:
  void* GetInterface(CKRGuid iid) override {
    if (void* view = CKRPlugin::GetInterface(iid))
      return view;
    if (iid == IID_IKRPluginSocketCmdRegistrant)
      return static_cast<IKRPluginSocketCmdRegistrant*>(&m_Target);
    return nullptr;
  }
  int ShouldFilter(CKRGuid) override { return 0; }
  int ShouldRegister(CKRPluginSocket*) override { return 1; }
  CKRPluginCfg* GetConfiguration() override { return m_pConfig; }
  int OnInitialize() override {
    m_pConfig = dynamic_cast<CKRPluginCfg*>(CKRPluginCfg::GetCKRPluginCfgType()->CreateInstance(CKRGuid()));
    m_Target.AddCmd(CKRPluginCmd(CKRGuid::CreateNewGUID(), L"Run", L"", nullptr, KR_PLUGINCMD_MENU));
    return m_pConfig != nullptr ? 1 : 0;
  }
  int OnBeforeRelease() override {
    if (m_pConfig != nullptr)
      m_pConfig->Release();
    m_pConfig = nullptr;
    return CKRPlugin::OnBeforeRelease();
  }

protected:
  CKRBenchPlugin() = default;

private:
  CKRPluginCfg* m_pConfig = nullptr;
  CKRPluginCmdTarget m_Target;
};

KR_IMPLEMENT_OBJECT_TYPE(CKRBenchPlugin, CKRPlugin)

extern "C" KR_PLUGIN_EXPORT IKRObjectType* GetPluginType() {
  return CKRBenchPlugin::GetCKRBenchPluginType();
}
