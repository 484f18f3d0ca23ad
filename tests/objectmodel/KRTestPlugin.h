// What the type-system tests and their plug-in module (KRTestPlugin.cpp)
// share: the IDs of the module's types and fields, the module's entry
// points, and a singleton class compiled into both.
#pragma once

#include <krCoreLib/core/CKRSingleton.h>
#include <krCoreLib/objectmodel/CKRGuid.h>

class IKRObject;

namespace KRTestPlugin {
constexpr CKRGuid kThingTypeID = CKRGuid::Literal("{7C0D2E1F-0000-4000-8000-0000000000A1}");
constexpr CKRGuid kRecordTypeID = CKRGuid::Literal("{7C0D2E1F-0000-4000-8000-0000000000A2}");
constexpr CKRGuid kCountFieldID = CKRGuid::Literal("{7C0D2E1F-0000-4000-8000-0000000000F1}");

// Exported by the module: works `object` (an instance of the record type)
// through its interfaces, its field and a singleton of the module's own;
// 1 when every step answered as expected. Releases the module's singleton
// before it returns.
using UseFunction = int (*)(IKRObject* object);
constexpr const char* kUseFunctionName = "KRTestPluginUse";
// Exported by the module: the shared singleton as the module sees it.
using SharedFunction = void* (*)();
constexpr const char* kSharedFunctionName = "KRTestPluginShared";
}  // namespace KRTestPlugin

// A singleton whose GetInstance is compiled into the test program and into
// the module, as a library singleton would be: both must see one instance.
class CKRTestSharedSingleton : public CKRSingletonT<CKRTestSharedSingleton> {
  friend class CKRSingletonT<CKRTestSharedSingleton>;
  CKRTestSharedSingleton() = default;
};
