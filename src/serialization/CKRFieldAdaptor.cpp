#include <krCoreLib/serialization/CKRFieldAdaptor.h>

CKRFieldAdaptor::CKRFieldAdaptor(CKRString name, CKRString description, CKRGuid fieldID, CKRGuid dataTypeID,
                                 CKRSerialObjectTypeImpl* originType, int flags, double version)
    : m_Flags(flags),
      m_Version(version),
      m_pOriginType(originType),
      m_Name(std::move(name)),
      m_Description(std::move(description)),
      m_FieldID(fieldID),
      m_DataTypeID(dataTypeID) {}

int CKRFieldAdaptor::SupportsStringStorage() {
  return 0;
}

CKRString CKRFieldAdaptor::GetName() {
  return m_Name;
}

void CKRFieldAdaptor::SetName(CKRString name) {
  m_Name = std::move(name);
}

void CKRFieldAdaptor::SetFieldID(CKRGuid id) {
  m_FieldID = id;
}

CKRGuid CKRFieldAdaptor::GetFieldID() {
  return m_FieldID;
}

CKRString CKRFieldAdaptor::GetDescription() {
  return m_Description;
}

void CKRFieldAdaptor::SetDescription(CKRString description) {
  m_Description = std::move(description);
}

double CKRFieldAdaptor::GetVersion() {
  return m_Version;
}

void CKRFieldAdaptor::SetVersion(double version) {
  m_Version = version;
}

CKRGuid CKRFieldAdaptor::GetDataTypeID() {
  return m_DataTypeID;
}

void CKRFieldAdaptor::SetDataTypeID(CKRGuid id) {
  m_DataTypeID = id;
}

int CKRFieldAdaptor::GetFlags() {
  return m_Flags;
}

void CKRFieldAdaptor::SetFlags(int flags) {
  m_Flags = flags;
}

CKRSerialObjectTypeImpl* CKRFieldAdaptor::GetOriginType() {
  return m_pOriginType;
}

void CKRFieldAdaptor::SetOriginType(CKRSerialObjectTypeImpl* type) {
  m_pOriginType = type;
}
