#include <krCoreLib/framework/CKRToolEvent.h>

KR_IMPLEMENT_OBJECT_TYPE(CKRToolEvent, CKRObservation)
KR_IMPLEMENT_OBJECT_TYPE(CKRFocusEvent, CKRObservation)
KR_IMPLEMENT_OBJECT_TYPE(CKRToolEventRouter, CKRObservable)
