// A plug-in module for the type-system tests: one framework class, built with
// the compiler's default options (default visibility, no special flags), as
// a plug-in author would build it.
#include <krCoreLib/objectmodel/CKRObjectImpl.h>

class CKRTestPluginThing : public CKRObjectImpl {
  KR_DECLARE_OBJECT_TYPE(CKRTestPluginThing, CKRObjectTypeImpl, "{7C0D2E1F-0000-4000-8000-0000000000A1}")

protected:
  CKRTestPluginThing() = default;
};

KR_IMPLEMENT_OBJECT_TYPE(CKRTestPluginThing, CKRObjectImpl)
