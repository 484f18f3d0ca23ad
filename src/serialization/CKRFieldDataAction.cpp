#include <krCoreLib/serialization/CKRFieldDataAction.h>

CKRFieldDataAction::CKRFieldDataAction(CKRGuid actionID, CKRString text)
    : m_ActionID(actionID), m_Text(std::move(text)) {}

IKRField* CKRFieldDataAction::GetField() {
  return nullptr;
}

CKRString CKRFieldDataAction::GetStringValue() {
  return m_Text;
}

int CKRFieldDataAction::HasFieldDataImplTypeOf(CKRGuid implementationID) {
  return implementationID == KRIMPL_FIELDDATA_ACTION ? 1 : 0;
}

void CKRFieldDataAction::Release(bool) {
  delete this;
}

CKRGuid CKRFieldDataAction::GetActionID() {
  return m_ActionID;
}
