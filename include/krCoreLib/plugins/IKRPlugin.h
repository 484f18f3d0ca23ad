// IKRPlugin: what the plug-in manager and the sockets ask of a plug-in, and
// IKRPluginResource, the host's interface handed to plug-ins.
#pragma once

#include <krCoreLib/objectmodel/CKRGuid.h>

class CKRPluginCfg;
class CKRPluginSocket;

// Interface ID of IKRPlugin.
KRCORELIB_LOCAL inline constexpr CKRGuid IID_IKRPlugin = CKRGuid::Literal("{3E8089B1-504B-4C5C-A918-892E40CDB404}");

class KRCORELIB_API IKRPlugin {
public:
  // Nonzero when a socket's filter `filterID` is to hide the plug-in.
  virtual int ShouldFilter(CKRGuid filterID) = 0;
  // Nonzero when the plug-in wants to join `socket`.
  virtual int ShouldRegister(CKRPluginSocket* socket) = 0;
  // The plug-in's configuration (owned by the plug-in; may be null only
  // for a plug-in that could not make one).
  virtual CKRPluginCfg* GetConfiguration() = 0;

protected:
  ~IKRPlugin() = default;
};

// An interface of the host application that the plug-in manager keeps for
// plug-ins (CKRPluginManager::GetResourceInterface). The host defines what
// it offers by deriving from it; the manager only stores the pointer.
class KRCORELIB_API IKRPluginResource {
public:
  // The host's further interface `iid`, or null.
  virtual void* GetInterface(CKRGuid iid) = 0;

protected:
  ~IKRPluginResource() = default;
};
