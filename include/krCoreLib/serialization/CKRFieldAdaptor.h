// CKRFieldAdaptor: the default field descriptor. The typed templates
// (CKRFieldT, CKRObjFieldT, CKRObjCollectionFieldT) derive from it and add
// CreateFieldData and Release. Its origin type owns it.
#pragma once

#include <krCoreLib/serialization/IKRField.h>

class KRCORELIB_API CKRFieldAdaptor : public IKRField {
public:
  CKRFieldAdaptor(CKRString name, CKRString description, CKRGuid fieldID, CKRGuid dataTypeID,
                  CKRSerialObjectTypeImpl* originType, int flags, double version);

  // 0: no plain-text storage unless a template says otherwise.
  int SupportsStringStorage() override;
  CKRString GetName() override;
  void SetName(CKRString name) override;
  void SetFieldID(CKRGuid id) override;
  CKRGuid GetFieldID() override;
  CKRString GetDescription() override;
  void SetDescription(CKRString description) override;
  double GetVersion() override;
  void SetVersion(double version) override;
  CKRGuid GetDataTypeID() override;
  void SetDataTypeID(CKRGuid id) override;
  int GetFlags() override;
  void SetFlags(int flags) override;
  CKRSerialObjectTypeImpl* GetOriginType() override;
  void SetOriginType(CKRSerialObjectTypeImpl* type) override;

protected:
  virtual ~CKRFieldAdaptor() = default;
  CKRFieldAdaptor(const CKRFieldAdaptor&) = delete;
  CKRFieldAdaptor& operator=(const CKRFieldAdaptor&) = delete;

private:
  int m_Flags;
  double m_Version;
  CKRSerialObjectTypeImpl* m_pOriginType;
  CKRString m_Name;
  CKRString m_Description;
  CKRGuid m_FieldID;
  CKRGuid m_DataTypeID;
};
