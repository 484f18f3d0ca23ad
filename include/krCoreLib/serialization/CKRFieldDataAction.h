// CKRFieldDataAction: a command shown among the fields (a pseudo field with
// an action ID and a text, and no field descriptor).
#pragma once

#include <krCoreLib/serialization/CKRFieldDataAdaptor.h>

class KRCORELIB_API CKRFieldDataAction : public CKRFieldDataAdaptor {
public:
  CKRFieldDataAction(CKRGuid actionID, CKRString text);

  // Null: an action has no field.
  IKRField* GetField() override;
  // The text.
  CKRString GetStringValue() override;
  int HasFieldDataImplTypeOf(CKRGuid implementationID) override;
  void Release(bool deep) override;

  virtual CKRGuid GetActionID();

protected:
  ~CKRFieldDataAction() override = default;

private:
  CKRGuid m_ActionID;
  CKRString m_Text;
};
