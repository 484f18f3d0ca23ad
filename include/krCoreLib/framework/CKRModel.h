// CKRModel, CKRModelVoid and CKRView: the document side of an editor.
//
// A model is a storable observable that owns no views: it tells the views
// registered with it (AddView, under CKRObservation's type ID, so that they
// hear every observation) about changes by raising observations. Models
// declare no stored fields of their own. A view is an observer whose
// OnUpdate does nothing until a concrete view overrides it. Models, like all
// storable objects, are not tracked by their type. Not synchronised.
#pragma once

#include <krCoreLib/framework/CKRObservable.h>
#include <krCoreLib/serialization/CKRSerialObject.h>

class KRCORELIB_API CKRView : public CKRObserver {
  KR_DECLARE_OBJECT_TYPE(CKRView, CKRObjectTypeImpl, "{DCC62E4B-249A-470F-87E1-DEB9E4E976DD}")

public:
  // Does nothing.
  void OnUpdate(CKRObservation* observation) override;

protected:
  CKRView() = default;
  ~CKRView() override = default;
};

class KRCORELIB_API CKRModel : public CKRObservable, public IKRSerializableAdaptor {
  KR_DECLARE_SERIAL_TYPE(CKRModel, CKRSerialObjectTypeImpl, "{A0220F9B-B946-4ACF-B582-B9BE858A07D6}")

public:
  // The object, then its storable view for IID_IKRSerializable.
  void* GetInterface(CKRGuid iid) override;
  IKRObject* GetThisObject() override;

  // AddObserver(view, CKRObservation's type ID).
  virtual int AddView(CKRView* view);
  // The view registered under CKRObservation's type ID with that instance
  // ID, when it is a CKRView; null otherwise.
  virtual CKRView* GetView(CKRGuid viewID);
  // Removes that view (1, also when none is registered).
  virtual int RemoveView(CKRGuid viewID);

protected:
  CKRModel() = default;
  ~CKRModel() override = default;
};

// A model with nothing of its own: for hosts that need a model to hang
// views on.
class KRCORELIB_API CKRModelVoid : public CKRModel {
  KR_DECLARE_SERIAL_TYPE(CKRModelVoid, CKRSerialObjectTypeImpl, "{AEE77D3B-F748-4C02-AEFE-53E785C7142F}")

protected:
  CKRModelVoid() = default;
  ~CKRModelVoid() override = default;
};
