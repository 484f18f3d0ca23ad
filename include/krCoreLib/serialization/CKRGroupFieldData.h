// CKRGroupFieldData: one field across several objects, for editing a field
// of a selection at once (the property grid).
//
// The group shows the common text of its members, "*Varies*" when they
// differ and "EMPTY" without members; a text set on the group is trimmed and
// set on every member (an empty text changes nothing). The group does not
// own its members unless released deep.
#pragma once

#include <krCoreLib/serialization/CKRFieldDataAdaptor.h>

#include <vector>

class KRCORELIB_API CKRGroupFieldData : public CKRFieldDataAdaptor {
public:
  explicit CKRGroupFieldData(IKRField* field);

  int NotifyOfPendingChange(CKRString& newValue) override;
  void NotifyOfChange(KRF_NOTIFICATION_TYPE kind, CKRGuid id) override;
  int SetTo(IKRFieldData* other) override;
  IKRField* GetField() override;
  CKRString GetStringValue() override;
  int GroupDataVaries() override;
  int IsGroupData() override;
  IKRFieldData* GetEffectiveData() override;
  void Release(bool deep) override;
  int SetValueFromString(const CKRString& text) override;
  int HasFieldDataImplTypeOf(CKRGuid implementationID) override;

  // Appends `fieldData` unless it is a member already (null is ignored).
  virtual void AddFieldData(IKRFieldData* fieldData);
  virtual IKRFieldData* GetFirstFieldData();
  virtual int SupportsStringStorage();

protected:
  ~CKRGroupFieldData() override = default;

private:
  // True when every member's text equals the first one's.
  bool AllEqual();

  std::vector<IKRFieldData*> m_Members;
  IKRField* m_pField;
};
