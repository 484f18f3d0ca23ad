#include <krCoreLib/platform/KRMenu.h>

#include <map>
#include <mutex>
#include <new>
#include <vector>

namespace {

struct SKRMenuItem {
  unsigned m_Flags = MF_STRING;
  unsigned m_ID = 0;
  UINT_PTR m_Popup = 0;  // handle number of the sub-menu of a pop-up item
  CKRString m_Text;
};

struct SKRMenu {
  std::vector<SKRMenuItem> m_Items;
  UINT_PTR m_Owner = 0;  // the menu whose pop-up item this menu is
};

// Every live menu by handle number. Handle numbers count up from 1 and are
// never given out twice.
struct SKRMenuTable {
  std::mutex m_Lock;
  std::map<UINT_PTR, SKRMenu> m_Menus;
  UINT_PTR m_Next = 1;

  SKRMenu* Find(UINT_PTR handle) {
    auto it = m_Menus.find(handle);
    return it != m_Menus.end() ? &it->second : nullptr;
  }

  // Destroys a menu and its sub-menus (the table is a tree: no cycles).
  void Destroy(UINT_PTR handle) {
    auto it = m_Menus.find(handle);
    if (it == m_Menus.end())
      return;
    std::vector<UINT_PTR> children;
    for (const SKRMenuItem& item : it->second.m_Items)
      if (item.m_Popup != 0)
        children.push_back(item.m_Popup);
    m_Menus.erase(it);
    for (UINT_PTR child : children)
      Destroy(child);
  }

  // The item addressed by (id, flags) in `menu` or, by command, in its
  // sub-menus: its menu and position.
  bool Locate(UINT_PTR handle, unsigned id, unsigned flags, UINT_PTR& owner, std::size_t& position) {
    SKRMenu* menu = Find(handle);
    if (menu == nullptr)
      return false;
    if ((flags & MF_BYPOSITION) != 0) {
      if (id >= menu->m_Items.size())
        return false;
      owner = handle;
      position = id;
      return true;
    }
    for (std::size_t i = 0; i < menu->m_Items.size(); ++i) {
      const SKRMenuItem& item = menu->m_Items[i];
      if (item.m_Popup == 0 && (item.m_Flags & MF_SEPARATOR) == 0 && item.m_ID == id) {
        owner = handle;
        position = i;
        return true;
      }
    }
    for (const SKRMenuItem& item : menu->m_Items)
      if (item.m_Popup != 0 && Locate(item.m_Popup, id, flags, owner, position))
        return true;
    return false;
  }
};

SKRMenuTable& Table() {
  static SKRMenuTable s_Table;
  return s_Table;
}

UINT_PTR Number(HMENU menu) { return reinterpret_cast<UINT_PTR>(menu); }

}  // namespace

HMENU CreatePopupMenu() noexcept {
  SKRMenuTable& table = Table();
  std::lock_guard<std::mutex> hold(table.m_Lock);
  try {
    const UINT_PTR handle = table.m_Next;
    table.m_Menus.emplace(handle, SKRMenu());
    ++table.m_Next;
    return reinterpret_cast<HMENU>(handle);
  } catch (const std::bad_alloc&) {
    return nullptr;
  }
}

bool AppendMenuW(HMENU menu, unsigned flags, UINT_PTR idOrPopup, const wchar_t* text) noexcept {
  SKRMenuTable& table = Table();
  std::lock_guard<std::mutex> hold(table.m_Lock);
  SKRMenu* target = table.Find(Number(menu));
  if (target == nullptr)
    return false;
  SKRMenuItem item;
  try {
    if ((flags & MF_POPUP) != 0) {
      SKRMenu* popup = table.Find(idOrPopup);
      if (popup == nullptr || popup->m_Owner != 0)
        return false;
      // The new pop-up must not be `menu` or one of its ancestors.
      for (UINT_PTR up = Number(menu); up != 0; up = table.Find(up)->m_Owner)
        if (up == idOrPopup)
          return false;
      item.m_Flags = flags & ~MF_SEPARATOR;
      item.m_Popup = idOrPopup;
      item.m_Text = text;
      target->m_Items.push_back(std::move(item));
      popup->m_Owner = Number(menu);
      return true;
    }
    if ((flags & MF_SEPARATOR) != 0) {
      item.m_Flags = MF_SEPARATOR;
    } else {
      item.m_Flags = flags;
      item.m_ID = static_cast<unsigned>(idOrPopup);
      item.m_Text = text;
    }
    target->m_Items.push_back(std::move(item));
    return true;
  } catch (const std::bad_alloc&) {
    return false;
  }
}

bool DeleteMenu(HMENU menu, unsigned position, unsigned flags) noexcept {
  SKRMenuTable& table = Table();
  std::lock_guard<std::mutex> hold(table.m_Lock);
  UINT_PTR owner = 0;
  std::size_t at = 0;
  if (!table.Locate(Number(menu), position, flags, owner, at))
    return false;
  SKRMenu* holder = table.Find(owner);
  const UINT_PTR popup = holder->m_Items[at].m_Popup;
  holder->m_Items.erase(holder->m_Items.begin() + static_cast<std::ptrdiff_t>(at));
  table.Destroy(popup);
  return true;
}

bool DestroyMenu(HMENU menu) noexcept {
  SKRMenuTable& table = Table();
  std::lock_guard<std::mutex> hold(table.m_Lock);
  SKRMenu* target = table.Find(Number(menu));
  if (target == nullptr)
    return false;
  if (SKRMenu* owner = table.Find(target->m_Owner)) {
    for (auto it = owner->m_Items.begin(); it != owner->m_Items.end(); ++it)
      if (it->m_Popup == Number(menu)) {
        owner->m_Items.erase(it);
        break;
      }
  }
  table.Destroy(Number(menu));
  return true;
}

int GetMenuItemCount(HMENU menu) noexcept {
  SKRMenuTable& table = Table();
  std::lock_guard<std::mutex> hold(table.m_Lock);
  SKRMenu* target = table.Find(Number(menu));
  return target != nullptr ? static_cast<int>(target->m_Items.size()) : -1;
}

unsigned GetMenuState(HMENU menu, unsigned id, unsigned flags) noexcept {
  SKRMenuTable& table = Table();
  std::lock_guard<std::mutex> hold(table.m_Lock);
  UINT_PTR owner = 0;
  std::size_t at = 0;
  if (!table.Locate(Number(menu), id, flags, owner, at))
    return 0xFFFFFFFFu;
  const SKRMenuItem& item = table.Find(owner)->m_Items[at];
  if (item.m_Popup == 0)
    return item.m_Flags;
  // A pop-up item: its sub-menu's item count in the second byte (at most
  // 255 show there, as with the window system).
  const std::size_t count = table.Find(item.m_Popup)->m_Items.size();
  return (item.m_Flags & 0xFFu) | MF_POPUP | (static_cast<unsigned>(count < 0xFF ? count : 0xFF) << 8);
}

CKRString GetMenuStringW(HMENU menu, unsigned id, unsigned flags) {
  SKRMenuTable& table = Table();
  std::lock_guard<std::mutex> hold(table.m_Lock);
  UINT_PTR owner = 0;
  std::size_t at = 0;
  if (!table.Locate(Number(menu), id, flags, owner, at))
    return CKRString();
  return table.Find(owner)->m_Items[at].m_Text;
}

unsigned GetMenuItemID(HMENU menu, int position) noexcept {
  SKRMenuTable& table = Table();
  std::lock_guard<std::mutex> hold(table.m_Lock);
  SKRMenu* target = table.Find(Number(menu));
  if (target == nullptr || position < 0 || static_cast<std::size_t>(position) >= target->m_Items.size())
    return 0;
  const SKRMenuItem& item = target->m_Items[static_cast<std::size_t>(position)];
  return item.m_Popup != 0 ? 0xFFFFFFFFu : item.m_ID;
}

HMENU GetSubMenu(HMENU menu, int position) noexcept {
  SKRMenuTable& table = Table();
  std::lock_guard<std::mutex> hold(table.m_Lock);
  SKRMenu* target = table.Find(Number(menu));
  if (target == nullptr || position < 0 || static_cast<std::size_t>(position) >= target->m_Items.size())
    return nullptr;
  return reinterpret_cast<HMENU>(target->m_Items[static_cast<std::size_t>(position)].m_Popup);
}

bool IsMenu(HMENU menu) noexcept {
  SKRMenuTable& table = Table();
  std::lock_guard<std::mutex> hold(table.m_Lock);
  return table.Find(Number(menu)) != nullptr;
}
