#include <krCoreLib/platform/KRMenu.h>

#include <gtest/gtest.h>

// Stale and made-up handles, pop-ups owned once and never cyclic, and
// deletion that takes sub-menus along.
TEST(KRMenu, HandlesStayCheckedAndPopupsFormATree) {
  HMENU root = CreatePopupMenu();
  HMENU child = CreatePopupMenu();
  HMENU grandchild = CreatePopupMenu();
  ASSERT_TRUE(IsMenu(root) && IsMenu(child) && IsMenu(grandchild));
  EXPECT_TRUE(AppendMenuW(root, MF_STRING, 7, L"Seven"));
  EXPECT_TRUE(AppendMenuW(root, MF_SEPARATOR, 0, nullptr));
  EXPECT_TRUE(AppendMenuW(root, MF_POPUP, reinterpret_cast<UINT_PTR>(child), L"Child"));
  EXPECT_TRUE(AppendMenuW(child, MF_POPUP, reinterpret_cast<UINT_PTR>(grandchild), L"Grandchild"));
  EXPECT_TRUE(AppendMenuW(grandchild, MF_STRING | MF_CHECKED, 8, L"Eight"));
  // Owned once; never an ancestor or itself.
  EXPECT_FALSE(AppendMenuW(root, MF_POPUP, reinterpret_cast<UINT_PTR>(child), L"Again"));
  EXPECT_FALSE(AppendMenuW(grandchild, MF_POPUP, reinterpret_cast<UINT_PTR>(root), L"Loop"));
  EXPECT_FALSE(AppendMenuW(root, MF_POPUP, reinterpret_cast<UINT_PTR>(root), L"Self"));

  EXPECT_EQ(GetMenuState(root, 7, MF_BYCOMMAND), MF_STRING);
  EXPECT_EQ(GetMenuState(root, 8, MF_BYCOMMAND), MF_CHECKED);  // found in a sub-menu
  EXPECT_EQ(GetMenuStringW(root, 8, MF_BYCOMMAND), L"Eight");
  EXPECT_EQ(GetMenuState(root, 1, MF_BYPOSITION), MF_SEPARATOR);
  EXPECT_EQ(GetMenuState(root, 2, MF_BYPOSITION), MF_POPUP | (1u << 8));
  EXPECT_EQ(GetMenuState(root, 3, MF_BYPOSITION), 0xFFFFFFFFu);
  EXPECT_EQ(GetMenuState(root, 99, MF_BYCOMMAND), 0xFFFFFFFFu);

  // Deleting the pop-up item destroys the sub-menus with it.
  EXPECT_TRUE(DeleteMenu(root, 2, MF_BYPOSITION));
  EXPECT_FALSE(IsMenu(child));
  EXPECT_FALSE(IsMenu(grandchild));
  EXPECT_FALSE(DeleteMenu(root, 5, MF_BYPOSITION));
  EXPECT_TRUE(DeleteMenu(root, 7, MF_BYCOMMAND));
  EXPECT_EQ(GetMenuItemCount(root), 1);

  // Stale and made-up handles fail cleanly.
  EXPECT_TRUE(DestroyMenu(root));
  for (HMENU stale : {root, child, static_cast<HMENU>(nullptr), reinterpret_cast<HMENU>(~UINT_PTR(0))}) {
    EXPECT_FALSE(IsMenu(stale));
    EXPECT_EQ(GetMenuItemCount(stale), -1);
    EXPECT_FALSE(AppendMenuW(stale, MF_STRING, 1, L"x"));
    EXPECT_FALSE(DestroyMenu(stale));
    EXPECT_EQ(GetMenuState(stale, 0, MF_BYPOSITION), 0xFFFFFFFFu);
    EXPECT_EQ(GetSubMenu(stale, 0), nullptr);
  }
  // Destroying a pop-up takes its item out of the owner.
  HMENU owner = CreatePopupMenu();
  HMENU popup = CreatePopupMenu();
  ASSERT_TRUE(AppendMenuW(owner, MF_POPUP, reinterpret_cast<UINT_PTR>(popup), L"P"));
  EXPECT_TRUE(DestroyMenu(popup));
  EXPECT_EQ(GetMenuItemCount(owner), 0);
  DestroyMenu(owner);
}
