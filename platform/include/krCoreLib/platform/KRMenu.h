// Menus: pop-up menus of string, pop-up and separator items, with the menu
// functions and flag values of the platform's window system.
//
// A menu is named by a handle (HMENU) that stays invalid once the menu is
// destroyed: handles are never reused, and every function checks the
// handle it is given, so a stale or made-up handle gives the failure result
// below, never a crash. Items are addressed by command number (MF_BYCOMMAND,
// searched through sub-menus too) or by position (MF_BYPOSITION). A menu is
// the pop-up of at most one item, and never of an item of itself or of one
// of its own sub-menus. Thread-safe.
#pragma once

#include <krCoreLib/core/CKRString.h>

#include <cstdint>

struct HMENU__;
using HMENU = HMENU__*;
using UINT_PTR = std::uintptr_t;

// Item kinds and states (the window system's values).
KRCORELIB_LOCAL inline constexpr unsigned MF_STRING = 0x0;
KRCORELIB_LOCAL inline constexpr unsigned MF_GRAYED = 0x1;
KRCORELIB_LOCAL inline constexpr unsigned MF_DISABLED = 0x2;
KRCORELIB_LOCAL inline constexpr unsigned MF_CHECKED = 0x8;
KRCORELIB_LOCAL inline constexpr unsigned MF_POPUP = 0x10;
KRCORELIB_LOCAL inline constexpr unsigned MF_SEPARATOR = 0x800;
// How an item is addressed.
KRCORELIB_LOCAL inline constexpr unsigned MF_BYCOMMAND = 0x0;
KRCORELIB_LOCAL inline constexpr unsigned MF_BYPOSITION = 0x400;

// A new, empty pop-up menu; null when memory is exhausted.
KRCORELIB_API HMENU CreatePopupMenu() noexcept;
// Appends an item: with MF_POPUP, `idOrPopup` is the HMENU of the sub-menu
// (which the menu then owns) and `text` its title; with MF_SEPARATOR a
// separator (`idOrPopup` and `text` ignored); otherwise a string item with
// command number `idOrPopup` and `text` (null is empty). False for an
// invalid menu, an invalid sub-menu, a sub-menu that is already the pop-up
// of an item, or one that would contain the menu itself.
KRCORELIB_API bool AppendMenuW(HMENU menu, unsigned flags, UINT_PTR idOrPopup, const wchar_t* text) noexcept;
// Deletes an item; a pop-up item's sub-menu is destroyed with it. False
// when there is no such item.
KRCORELIB_API bool DeleteMenu(HMENU menu, unsigned position, unsigned flags) noexcept;
// Destroys a menu and its sub-menus; if it is another menu's pop-up, that
// item is removed. False for an invalid handle.
KRCORELIB_API bool DestroyMenu(HMENU menu) noexcept;
// Number of items, or -1 for an invalid handle.
KRCORELIB_API int GetMenuItemCount(HMENU menu) noexcept;
// The flags of an item (MF_STRING with its state bits, MF_SEPARATOR, or for
// a pop-up item MF_POPUP with the number of its sub-menu's items in bits 8
// to 15), or 0xFFFFFFFF when there is no such item.
KRCORELIB_API unsigned GetMenuState(HMENU menu, unsigned id, unsigned flags) noexcept;
// The text of an item; empty when there is none or no such item.
KRCORELIB_API CKRString GetMenuStringW(HMENU menu, unsigned id, unsigned flags);
// The command number of the item at `position`: 0xFFFFFFFF for a pop-up
// item, 0 for a separator, and for no such item.
KRCORELIB_API unsigned GetMenuItemID(HMENU menu, int position) noexcept;
// The sub-menu of the pop-up item at `position`, or null.
KRCORELIB_API HMENU GetSubMenu(HMENU menu, int position) noexcept;
// True for a menu handle that is valid now.
KRCORELIB_API bool IsMenu(HMENU menu) noexcept;
