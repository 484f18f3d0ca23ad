// CKRObservation: what an observable hands to its observers, created through
// its type, filled in and passed to CKRObservable::NotifyObservers.
// Derived classes (tool and focus events) add their data; their type chain
// leads to CKRObservation's type. With the auto-release flag set (the
// default) the observable releases the observation after delivering it.
#pragma once

#include <krCoreLib/objectmodel/CKRObjectImpl.h>

class KRCORELIB_API CKRObservation : public CKRObjectImpl {
  KR_DECLARE_OBJECT_TYPE(CKRObservation, CKRObjectTypeImpl, "{060C1069-68A0-400F-B3F4-45E9A33A1204}")

public:
  // Sets the auto-release flag.
  int OnInitialize() override;

  virtual int CanAutoRelease();
  virtual void SetAutoRelease(int autoRelease);
  // Who raised the observation: set and read by the parties, not
  // interpreted by the library.
  virtual void SetSourceID(CKRGuid sourceID);
  virtual CKRGuid GetSourceID();

protected:
  CKRObservation() = default;
  ~CKRObservation() override = default;

private:
  CKRGuid m_SourceID;
  int m_AutoRelease = 1;
};
