// IKRSerializable: a storable object as the framework sees it.
//
// The interface holds the object's field data, writes them into a document
// and reads them back, and offers the hooks through which the object takes
// part in loading, saving and editing. Objects answer it through
// GetInterface(IID_IKRSerializable). IKRSerializableAdaptor implements it;
// CKRSerialObject is the storable framework object. Not synchronised.
#pragma once

#include <krCoreLib/core/CKRString.h>
#include <krCoreLib/serialization/KRFieldTypes.h>

class CKRDocument;
class CKRTypeManifest;
class IKRFieldData;
class IKRFieldStream;

class KRCORELIB_API IKRSerializable {
public:
  // Appends `fieldData` unless it is listed already; the object owns it.
  virtual void AddFieldData(IKRFieldData* fieldData) = 0;
  // The first field data whose field has that ID, or null.
  virtual IKRFieldData* GetFieldData(CKRGuid fieldID) = 0;
  // Releases every field data (not the values) and empties the list.
  virtual void ReleaseFieldData() = 0;
  // Stores the object, and the objects it links, in `document`: 1 on
  // success (also when it is stored already in the document's session).
  virtual int SerializeTo(CKRDocument* document) = 0;
  // Loads the object in place from its stream in `document` (a null
  // manifest or stream is looked up by the object's type and instance ID).
  virtual int SerializeFrom(CKRDocument* document, CKRTypeManifest* manifest, IKRFieldStream* stream) = 0;
  virtual void SetParentField(IKRFieldData* parent) = 0;
  // Binds the object's field data.
  virtual void InitFieldData() = 0;
  virtual CKRString GetInstanceName() = 0;
  virtual void SetInstanceName(CKRString name) = 0;
  virtual int OnBeforeLoad(CKRDocument* document, CKRTypeManifest* manifest, IKRFieldStream* stream) = 0;
  virtual int OnBeforeSave(CKRDocument* document, CKRTypeManifest* manifest, IKRFieldStream* stream) = 0;
  virtual void OnAfterLoad(CKRDocument* document) = 0;
  virtual void OnAfterSave(CKRDocument* document) = 0;
  // Reads every field flagged KRF_READ: always 1 (a field that cannot be
  // read keeps its value).
  virtual int SerializeFieldDataFrom(IKRFieldStream* stream) = 0;
  // Writes every field flagged KRF_WRITE: 0 at the first failure.
  virtual int SerializeFieldDataTo(IKRFieldStream* stream) = 0;
  // Nonzero allows `newValue` (which the object may rewrite) to replace the
  // value of `fieldData`.
  virtual int OnBeforeFieldChanged(IKRFieldData* fieldData, CKRString& newValue) = 0;
  virtual void OnAfterFieldChanged(IKRFieldData* fieldData, KRF_NOTIFICATION_TYPE kind, CKRGuid id) = 0;
  virtual int IsFieldReadOnly(IKRFieldData* fieldData) = 0;
  virtual int IsFieldVisible(IKRFieldData* fieldData) = 0;
  virtual int IsFieldExpanded(IKRFieldData* fieldData) = 0;

protected:
  ~IKRSerializable() = default;
};
