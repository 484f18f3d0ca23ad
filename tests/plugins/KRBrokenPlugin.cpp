// Plug-in modules that break the module contract, one way each, chosen by
// KR_BROKEN_KIND when the module is built:
//   1 no "GetPluginType" export        2 the export returns null
//   3 the type creates no object       4 the object is not a plug-in
//   5 OnInitialize refuses             6 a static constructor throws
//   7 a plug-in that refuses its first release
#include <krCoreLib/krCoreLib.h>

#include <stdexcept>

#ifndef KR_BROKEN_KIND
#error "KR_BROKEN_KIND names the fault"
#endif

class CKRBrokenThing : public CKRObjectImpl {
  KR_DECLARE_OBJECT_TYPE(CKRBrokenThing, CKRObjectTypeImpl, "{0B0B0B0B-0000-4000-8000-00000000B001}")

protected:
  CKRBrokenThing() = default;
};
KR_IMPLEMENT_OBJECT_TYPE(CKRBrokenThing, CKRObjectImpl)

class CKRBrokenPlugin : public CKRPlugin {
  KR_DECLARE_OBJECT_TYPE(CKRBrokenPlugin, CKRObjectTypeImpl, "{0B0B0B0B-0000-4000-8000-00000000B002}")

public:
  int ShouldFilter(CKRGuid) override { return 0; }
  int ShouldRegister(CKRPluginSocket*) override { return 1; }
  CKRPluginCfg* GetConfiguration() override { return nullptr; }
  int OnInitialize() override { return KR_BROKEN_KIND == 5 ? 0 : 1; }
  int OnBeforeRelease() override { return KR_BROKEN_KIND == 7 && m_Refusals++ == 0 ? 0 : 1; }

protected:
  CKRBrokenPlugin() = default;

private:
  int m_Refusals = 0;
};
#if KR_BROKEN_KIND == 3
KR_IMPLEMENT_ABSTRACT_OBJECT_TYPE(CKRBrokenPlugin, CKRPlugin)
#else
KR_IMPLEMENT_OBJECT_TYPE(CKRBrokenPlugin, CKRPlugin)
#endif

#if KR_BROKEN_KIND == 6
namespace {
struct SKRThrowsAtLoad {
  SKRThrowsAtLoad() { throw std::runtime_error("a static constructor of the test module throws"); }
};
const SKRThrowsAtLoad s_ThrowsAtLoad;
}  // namespace
#endif

#if KR_BROKEN_KIND != 1
extern "C" KR_PLUGIN_EXPORT IKRObjectType* GetPluginType() {
  if (KR_BROKEN_KIND == 2)
    return nullptr;
  if (KR_BROKEN_KIND == 4)
    return CKRBrokenThing::GetCKRBrokenThingType();
  return CKRBrokenPlugin::GetCKRBrokenPluginType();
}
#endif
