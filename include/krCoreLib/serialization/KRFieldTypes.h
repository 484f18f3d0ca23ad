// The constants of fields and field data: the flag bits of a field, the kinds
// of change notification, the data type IDs the library and its stores know,
// the implementation IDs answered by HasFieldDataImplTypeOf, and the
// interface IDs of the serialization framework.
#pragma once

#include <krCoreLib/objectmodel/CKRGuid.h>

// Flag bits of IKRField::GetFlags.
enum : int {
  KRF_READ = 0x1,                    // read when an object is loaded
  KRF_WRITE = 0x2,                   // written when an object is saved
  KRF_VISIBLE = 0x4,                 // shown
  KRF_READONLY = 0x8,                // not editable
  KRF_SHOW_LINKED_FIELDS = 0x40,     // a link whose object's fields show under it
  KRF_READONLY_BY_OBJECT = 0x80,     // IsFieldReadOnly decides
  KRF_HILITE_EDITABLE = 0x100,       // highlighted when editable
  KRF_VISIBLE_BY_OBJECT = 0x200,     // IsFieldVisible decides
  KRF_EXPANDED = 0x400,              // shown expanded
  KRF_EXPANDED_BY_OBJECT = 0x800,    // IsFieldExpanded decides
  KRF_CHECKBOX = 0x1000,             // has a check box; IsFieldChecked gives its state
};

// The kind of change passed with IKRFieldData::NotifyOfChange and on to the
// object's OnAfterFieldChanged. The field data layer passes it through
// unchanged; the identifier that comes with it is null unless a kind says
// otherwise.
enum KRF_NOTIFICATION_TYPE : int {
  // The value changed: a store read it, CloneFieldData copied it, or code
  // set it and says so.
  KRF_VALUE_CHANGED = 0,
  // A user edited the value (a property grid).
  KRF_VALUE_EDITED = 1,
  // An element was added to or removed from a collection field; the
  // identifier is the element's instance ID.
  KRF_ELEMENT_ADDED = 2,
  KRF_ELEMENT_REMOVED = 3,
  // A command pseudo-field (CKRFieldDataAction) was invoked; the identifier
  // is its action ID.
  KRF_ACTION_INVOKED = 4,
};

// Data type IDs of fields (IKRField::GetDataTypeID): what a value is, so that
// stores and the property grid choose its representation. Hidden, one copy
// per module, as the interface IDs (IKRObject.h).
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_STRING = CKRGuid::Literal("{9FD8ACE1-6007-4A97-BB0A-01A0E7999305}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_GUID = CKRGuid::Literal("{B95F42C3-073B-4A29-A52D-D30B7DD68D89}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_INTEGER = CKRGuid::Literal("{D5F60C41-B258-4282-BF90-4CCD3026D817}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_DOUBLE = CKRGuid::Literal("{0B63F8B5-5844-4A97-B3DB-3389C7145822}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_OBJECT_LINK = CKRGuid::Literal("{A629E578-AB5F-4698-818A-C26C47FF59E6}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_OBJECT_COLLECTION = CKRGuid::Literal("{95C92BDC-00F3-4E4E-8BE8-7AAFAA2DC3EB}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_POINT3D = CKRGuid::Literal("{AF1DB213-390E-43D1-A41F-03A6E4ED00D8}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_VECTOR3D = CKRGuid::Literal("{70DB68CB-ACA4-4382-A7F5-3C9342ADB9C4}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_POINT2D = CKRGuid::Literal("{B0138713-162C-4A0B-BFC9-76AE8AC5F842}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_ENUM = CKRGuid::Literal("{B8871843-6AAF-43EC-BF8D-074F3577F177}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_RANGED_DOUBLE = CKRGuid::Literal("{2A985F6B-B7C5-4469-B75E-9F586F92F7E3}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_RANGED_INTEGER = CKRGuid::Literal("{8DEE80BD-99D9-4387-8720-0086BADEE215}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_SCIENTIFIC_DATA = CKRGuid::Literal("{10EE76ED-C6CD-4198-A138-144A4C41C32E}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_CHECKBOX = CKRGuid::Literal("{CC034841-9D4E-4FBA-A169-BAC60680B933}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_COLOR = CKRGuid::Literal("{0A10425A-993B-4900-BC3D-D833D49894FC}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_DIRECTORY = CKRGuid::Literal("{FB6FDB50-A7A9-48A8-8FAB-1C3071BF7A1D}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_OPTION_SET = CKRGuid::Literal("{97CA6F1E-F7D5-4A7D-B185-70BA579F8FB2}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_PRINTER = CKRGuid::Literal("{998FF1B8-F461-4692-879D-C2F68FE25FA6}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRDT_FILE = CKRGuid::Literal("{B0252865-26F3-4fbf-9A1F-C8BF5A02FE74}");

// Implementation IDs (IKRFieldData::HasFieldDataImplTypeOf); each class
// answers its own only.
KRCORELIB_LOCAL inline constexpr CKRGuid KRIMPL_FIELDDATA_ADAPTOR = CKRGuid::Literal("{833FDD1D-F93F-400F-8E59-29DB2D23F2CB}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRIMPL_FIELDDATA_VALUE = CKRGuid::Literal("{6E4B0BCF-5A34-428D-9944-90E7CD1269FA}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRIMPL_FIELDDATA_OBJECT = CKRGuid::Literal("{92D3C099-BC72-43CF-B38B-4E6FCBCC6C07}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRIMPL_FIELDDATA_COLLECTION = CKRGuid::Literal("{86F0200B-79C3-4A29-8575-AA8250E611BB}");
KRCORELIB_LOCAL inline constexpr CKRGuid KRIMPL_FIELDDATA_ACTION = CKRGuid::Literal("{08193064-D705-4A26-82B1-7B34826815FB}");

// Interface IDs answered by GetInterface.
KRCORELIB_LOCAL inline constexpr CKRGuid IID_IKRSerializable = CKRGuid::Literal("{50E210EC-528E-408D-A63B-85F4BFF21DC1}");
KRCORELIB_LOCAL inline constexpr CKRGuid IID_IKRFieldStream = CKRGuid::Literal("{098F1AA7-F503-4856-A575-AF4A04974767}");
