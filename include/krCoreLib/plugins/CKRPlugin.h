// CKRPlugin, the base of every plug-in, and CKRPluginError, the plug-in that
// stands for a module that could not be loaded.
//
// A plug-in module defines one class derived from CKRPlugin with its own
// nested type (KR_DECLARE_OBJECT_TYPE with CKRObjectTypeImpl or a storable
// type base; parent class CKRPlugin), implements the three IKRPlugin
// operations and exports its type:
//
//   extern "C" KR_PLUGIN_EXPORT IKRObjectType* GetPluginType() {
//     return CKRMyPlugin::GetCKRMyPluginType();
//   }
//
// The plug-in manager (CKRPluginManager) creates the one plug-in object,
// offers it to the sockets and releases it before the module is unloaded.
// A plug-in releases in its OnBeforeRelease everything it created from its
// module's types (its configuration first of all). Not synchronised.
#pragma once

#include <krCoreLib/plugins/CKRPluginCfg.h>
#include <krCoreLib/plugins/IKRPlugin.h>

// Marks a plug-in module's entry point for export whatever the module's
// default visibility.
#if defined(__GNUC__) || defined(__clang__)
#define KR_PLUGIN_EXPORT __attribute__((visibility("default")))
#else
#define KR_PLUGIN_EXPORT
#endif

// The entry point a plug-in module exports, unmangled: the type of its
// plug-in class.
extern "C" {
using KRGetPluginTypeFn = IKRObjectType* (*)();
}
KRCORELIB_LOCAL inline constexpr const char* KR_PLUGIN_ENTRY_POINT = "GetPluginType";

class KRCORELIB_API CKRPlugin : public CKRSerialObject, public IKRPlugin {
  KR_DECLARE_OBJECT_TYPE(CKRPlugin, CKRObjectTypeImpl, "{D867BA1A-5D5F-485E-B4FB-15C2E7179E2A}")

public:
  // The base's views, then the IKRPlugin view for IID_IKRPlugin.
  void* GetInterface(CKRGuid iid) override;

protected:
  CKRPlugin() = default;
  ~CKRPlugin() override = default;
};

class KRCORELIB_API CKRPluginError : public CKRPlugin {
  KR_DECLARE_OBJECT_TYPE(CKRPluginError, CKRObjectTypeImpl, "{CDD124AA-1516-463F-B572-983ACF9B84E8}")

public:
  // Creates the configuration: name "Plugin Error", empty description and
  // module name, plug-in ID the error type's ID. 0 (no plug-in) when the
  // configuration cannot be created.
  int OnInitialize() override;
  // Releases the configuration, then answers as the base.
  int OnBeforeRelease() override;
  // Always 1: error plug-ins are hidden by every filter.
  int ShouldFilter(CKRGuid filterID) override;
  // Always 0: error plug-ins join no socket.
  int ShouldRegister(CKRPluginSocket* socket) override;
  CKRPluginCfg* GetConfiguration() override;

protected:
  CKRPluginError() = default;
  ~CKRPluginError() override = default;

private:
  CKRPluginCfg* m_pConfig = nullptr;
};
