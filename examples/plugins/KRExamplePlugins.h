// The identities of the two example plug-ins, for the hosts that use them
// (the demo and the tests): plug-in IDs, command IDs and filter IDs.
#pragma once

#include <krCoreLib/objectmodel/CKRGuid.h>

namespace KRExamplePlugins {

// Hidden, as every constant a module shares between its files (KRExport.h).

// shapes.plg: draws shapes; hidden by kHideShapes.
KRCORELIB_LOCAL inline constexpr CKRGuid kShapesPluginID = CKRGuid::Literal("{5A3C1E20-7B14-4F0A-9C61-2E8D4B7A1001}");
KRCORELIB_LOCAL inline constexpr CKRGuid kDrawHexagon = CKRGuid::Literal("{5A3C1E20-7B14-4F0A-9C61-2E8D4B7A1101}");
KRCORELIB_LOCAL inline constexpr CKRGuid kDrawSquare = CKRGuid::Literal("{5A3C1E20-7B14-4F0A-9C61-2E8D4B7A1102}");
KRCORELIB_LOCAL inline constexpr CKRGuid kResetShapes = CKRGuid::Literal("{5A3C1E20-7B14-4F0A-9C61-2E8D4B7A1103}");
KRCORELIB_LOCAL inline constexpr CKRGuid kHideShapes = CKRGuid::Literal("{5A3C1E20-7B14-4F0A-9C61-2E8D4B7A1201}");

// notes.plg: keeps notes; its plug-in class is storable; hidden by
// kHideNotes.
KRCORELIB_LOCAL inline constexpr CKRGuid kNotesPluginID = CKRGuid::Literal("{5A3C1E20-7B14-4F0A-9C61-2E8D4B7A2001}");
KRCORELIB_LOCAL inline constexpr CKRGuid kNewNote = CKRGuid::Literal("{5A3C1E20-7B14-4F0A-9C61-2E8D4B7A2101}");
KRCORELIB_LOCAL inline constexpr CKRGuid kClearNotes = CKRGuid::Literal("{5A3C1E20-7B14-4F0A-9C61-2E8D4B7A2102}");
KRCORELIB_LOCAL inline constexpr CKRGuid kHideNotes = CKRGuid::Literal("{5A3C1E20-7B14-4F0A-9C61-2E8D4B7A2201}");

}  // namespace KRExamplePlugins
