#include <krCoreLib/framework/CKRObservation.h>

KR_IMPLEMENT_OBJECT_TYPE(CKRObservation, CKRObjectImpl)

int CKRObservation::OnInitialize() {
  m_AutoRelease = 1;
  return 1;
}

int CKRObservation::CanAutoRelease() {
  return m_AutoRelease;
}

void CKRObservation::SetAutoRelease(int autoRelease) {
  m_AutoRelease = autoRelease;
}

void CKRObservation::SetSourceID(CKRGuid sourceID) {
  m_SourceID = sourceID;
}

CKRGuid CKRObservation::GetSourceID() {
  return m_SourceID;
}
