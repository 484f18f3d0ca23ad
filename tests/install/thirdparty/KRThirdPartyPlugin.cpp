// A plug-in written by a third party against the installed package only:
// built with
//   g++ -std=c++20 -shared -fPIC KRThirdPartyPlugin.cpp $(pkg-config --cflags --libs krCoreLib) -o thirdparty.plg
// Its classes derive from the library's across the module boundary, and it
// checks the host's sockets by their classes (dynamic_cast) as well.
#include <krCoreLib/krCoreLib.h>

namespace {
constexpr CKRGuid kPluginID = CKRGuid::Literal("{3D7F0A12-6C4B-4E59-8A13-2B9C7D4E6F01}");
constexpr CKRGuid kGreet = CKRGuid::Literal("{3D7F0A12-6C4B-4E59-8A13-2B9C7D4E6F02}");
constexpr CKRGuid kGreetingFieldID = CKRGuid::Literal("{3D7F0A12-6C4B-4E59-8A13-2B9C7D4E6F03}");
}  // namespace

class CKRThirdPartyCfg : public CKRPluginCfg {
  KR_DECLARE_SERIAL_TYPE(CKRThirdPartyCfg, CKRSerialObjectTypeImpl, "{3D7F0A12-6C4B-4E59-8A13-2B9C7D4E6F04}")

public:
  CKRString m_Greeting = L"Hello";

protected:
  CKRThirdPartyCfg() = default;
};

KR_IMPLEMENT_SERIAL_TYPE(CKRThirdPartyCfg, CKRPluginCfg)

void CKRThirdPartyCfg::CKRThirdPartyCfgType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
  BindField<CKRFieldT<CKRString>>(target, object, &CKRThirdPartyCfg::m_Greeting, L"Greeting", L"What it says",
                                  kGreetingFieldID, KRDT_STRING, KRF_READ | KRF_WRITE | KRF_VISIBLE);
}

class CKRThirdPartyTarget : public CKRPluginCmdTarget {
public:
  CKRThirdPartyCfg* m_pConfig = nullptr;
  int OnCommand(CKRGuid id, CKRString argument, void* data) override {
    if (id != kGreet)
      return CKRPluginCmdTarget::OnCommand(id, argument, data);
    m_pConfig->m_Description = m_pConfig->m_Greeting + L", " + argument;
    return 1;
  }
};

class CKRThirdPartyPlugin : public CKRPlugin {
  KR_DECLARE_OBJECT_TYPE(CKRThirdPartyPlugin, CKRObjectTypeImpl, "{3D7F0A12-6C4B-4E59-8A13-2B9C7D4E6F05}")

public:
  void* GetInterface(CKRGuid iid) override {
    if (void* view = CKRPlugin::GetInterface(iid))
      return view;
    // Each interface ID answered with the view of exactly that interface.
    if (iid == IID_IKRPluginSocketCmdRegistrant)
      return static_cast<IKRPluginSocketCmdRegistrant*>(&m_Target);
    if (iid == IID_IKRPluginSocketCmdSource)
      return static_cast<IKRPluginSocketCmdSource*>(&m_Target);
    return nullptr;
  }
  int ShouldFilter(CKRGuid) override { return 0; }
  // Joins the library's own socket classes only, told apart by C++ type.
  int ShouldRegister(CKRPluginSocket* socket) override {
    if (dynamic_cast<CKRPluginSocketMnu*>(socket) != nullptr || dynamic_cast<CKRPluginSocketCmd*>(socket) != nullptr) {
      ++m_Joined;
      return 1;
    }
    return 0;
  }
  CKRPluginCfg* GetConfiguration() override { return m_pConfig; }
  int OnInitialize() override {
    m_pConfig = dynamic_cast<CKRThirdPartyCfg*>(CKRThirdPartyCfg::GetCKRThirdPartyCfgType()->CreateInstance(CKRGuid()));
    if (m_pConfig == nullptr)
      return 0;
    m_pConfig->m_PluginID = kPluginID;
    m_pConfig->m_Name = L"Third Party";
    m_pConfig->m_ModuleName = L"thirdparty.plg";
    m_Target.m_pConfig = m_pConfig;
    m_Target.AddCmd(CKRPluginCmd(kGreet, L"&Greet", L"Says hello", nullptr, KR_PLUGINCMD_MENU));
    return 1;
  }
  int OnBeforeRelease() override {
    if (m_pConfig != nullptr)
      m_pConfig->Release();
    m_pConfig = nullptr;
    return CKRPlugin::OnBeforeRelease();
  }
  int m_Joined = 0;

protected:
  CKRThirdPartyPlugin() = default;

private:
  CKRThirdPartyCfg* m_pConfig = nullptr;
  CKRThirdPartyTarget m_Target;
};

KR_IMPLEMENT_OBJECT_TYPE(CKRThirdPartyPlugin, CKRPlugin)

extern "C" KR_PLUGIN_EXPORT IKRObjectType* GetPluginType() {
  return CKRThirdPartyPlugin::GetCKRThirdPartyPluginType();
}
