// IKRSerializableAdaptor: the default implementation of IKRSerializable,
// mixed into storable classes (CKRSerialObject, and models).
//
// The adaptor owns the object's field data (not the values behind them) and
// implements saving and loading:
// - SerializeTo stores the object once per serial session of the document:
//   the type manifest and the field stream are found or created, the stream
//   is marked as written as soon as the object header is written (so that a
//   link back to an object being written ends there), then the fields
//   flagged KRF_WRITE are written in list order, linked objects after their
//   link. A failing field clears the mark and gives 0.
// - SerializeFrom loads the object in place from its stream; links back to
//   it resolve to it.
// Linked objects nest on the native stack while the nesting is shallow;
// beyond a few thousand levels the document stores and restores the deeper
// objects after the outermost call instead (each exactly once), so a chain
// of any length is saved and loaded on a default-sized stack.
#pragma once

#include <krCoreLib/serialization/IKRSerializable.h>

#include <cstddef>
#include <vector>

class IKRObject;

class KRCORELIB_API IKRSerializableAdaptor : public IKRSerializable {
public:
  void AddFieldData(IKRFieldData* fieldData) override;
  IKRFieldData* GetFieldData(CKRGuid fieldID) override;
  void ReleaseFieldData() override;
  int SerializeTo(CKRDocument* document) override;
  int SerializeFrom(CKRDocument* document, CKRTypeManifest* manifest, IKRFieldStream* stream) override;
  void SetParentField(IKRFieldData* parent) override;
  // Does nothing; storable classes bind their fields here.
  void InitFieldData() override;
  CKRString GetInstanceName() override;
  void SetInstanceName(CKRString name) override;
  int OnBeforeLoad(CKRDocument* document, CKRTypeManifest* manifest, IKRFieldStream* stream) override;
  int OnBeforeSave(CKRDocument* document, CKRTypeManifest* manifest, IKRFieldStream* stream) override;
  // Calls PatchData.
  void OnAfterLoad(CKRDocument* document) override;
  void OnAfterSave(CKRDocument* document) override;
  int SerializeFieldDataFrom(IKRFieldStream* stream) override;
  int SerializeFieldDataTo(IKRFieldStream* stream) override;
  int OnBeforeFieldChanged(IKRFieldData* fieldData, CKRString& newValue) override;
  void OnAfterFieldChanged(IKRFieldData* fieldData, KRF_NOTIFICATION_TYPE kind, CKRGuid id) override;
  int IsFieldReadOnly(IKRFieldData* fieldData) override;
  int IsFieldVisible(IKRFieldData* fieldData) override;
  int IsFieldExpanded(IKRFieldData* fieldData) override;

  // Copies the values of `source`'s field data into the own field data with
  // the same field IDs, then sends one change notification (kind
  // KRF_VALUE_CHANGED, null ID) per own field data. Null does nothing.
  virtual void CloneFieldData(IKRSerializableAdaptor* source);
  // A hook run after every load; does nothing.
  virtual void PatchData();
  virtual int IsFieldChecked(IKRFieldData* fieldData);
  // The framework object this adaptor belongs to.
  virtual IKRObject* GetThisObject() = 0;

  // The field data in list order.
  const std::vector<IKRFieldData*>& GetFieldDataList() const { return m_FieldDataList; }

protected:
  IKRSerializableAdaptor() = default;
  IKRSerializableAdaptor(const IKRSerializableAdaptor&) = delete;
  IKRSerializableAdaptor& operator=(const IKRSerializableAdaptor&) = delete;
  // Releases the field data still held.
  virtual ~IKRSerializableAdaptor();

  // Room for `count` field data, so that binding them allocates once.
  void ReserveFieldData(std::size_t count) { m_FieldDataList.reserve(count); }

private:
  friend class CKRDocument;
  // What SerializeTo does for this object itself, with the
  // document's nesting already counted.
  int SaveToDocument(CKRDocument* document);

  CKRString m_InstanceName;
  std::vector<IKRFieldData*> m_FieldDataList;
};
