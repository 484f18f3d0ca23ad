#include <krCoreLib/framework/CKRModel.h>

KR_IMPLEMENT_ABSTRACT_OBJECT_TYPE(CKRView, CKRObserver)
KR_IMPLEMENT_ABSTRACT_SERIAL_TYPE(CKRModel, CKRObservable)
KR_IMPLEMENT_SERIAL_TYPE(CKRModelVoid, CKRModel)

void CKRView::OnUpdate(CKRObservation*) {}

void CKRModel::CKRModelType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
}

void CKRModelVoid::CKRModelVoidType::CreateFields(CKRSerialObjectTypeImpl* target, IKRObject* object) {
  AppendParentFields(target, object);
}

void* CKRModel::GetInterface(CKRGuid iid) {
  if (void* view = CKRObjectImpl::GetInterface(iid))
    return view;
  if (iid.IsValid() && iid == IID_IKRSerializable)
    return static_cast<IKRSerializable*>(this);
  return nullptr;
}

IKRObject* CKRModel::GetThisObject() {
  return this;
}

int CKRModel::AddView(CKRView* view) {
  return AddObserver(view, CKRObservation::TypeID);
}

CKRView* CKRModel::GetView(CKRGuid viewID) {
  CKRObserver* observer = GetObserver(viewID, CKRObservation::TypeID);
  return observer != nullptr && observer->IsTypeOf(CKRView::TypeID) != 0 ? static_cast<CKRView*>(observer) : nullptr;
}

int CKRModel::RemoveView(CKRGuid viewID) {
  if (CKRObserver* observer = GetObserver(viewID, CKRObservation::TypeID))
    RemoveObserver(observer, CKRObservation::TypeID);
  return 1;
}
