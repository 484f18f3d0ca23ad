#include <krCoreLib/system/CKRPathHelper.h>

#include "KRFilesScratch.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

namespace {

std::vector<CKRString> Sorted(std::vector<CKRString> names) {
  std::sort(names.begin(), names.end());
  return names;
}

}  // namespace

TEST(CKRPathHelper, TextOperationsSplitAtTheLastSeparator) {
  struct SKRCase {
    const wchar_t* m_Path;
    const wchar_t* m_Extension;
    const wchar_t* m_Name;
    const wchar_t* m_Stem;
    const wchar_t* m_Folder;
  };
  const SKRCase cases[] = {
      {L"a.b.c", L".c", L"a.b.c", L"a.b", L""},
      {L"/home/u/report.txt", L".txt", L"report.txt", L"report", L"/home/u/"},
      {L"/home/u/README", L"", L"README", L"README", L"/home/u/"},
      {L"/home/u.d/README", L"", L"README", L"README", L"/home/u.d/"},
      {L"/home/u/", L"", L"", L"", L"/home/u/"},
      {L"name.", L".", L"name.", L"name", L""},
      {L"", L"", L"", L"", L""},
  };
  for (const SKRCase& c : cases) {
    SCOPED_TRACE(CKRString(c.m_Path).ToUtf8());
    EXPECT_EQ(CKRPathHelper::GetFileExtension(c.m_Path), c.m_Extension);
    EXPECT_EQ(CKRPathHelper::GetFileName(c.m_Path), c.m_Name);
    EXPECT_EQ(CKRPathHelper::GetFileName(c.m_Path, false), c.m_Stem);
    EXPECT_EQ(CKRPathHelper::GetFilePath(c.m_Path), c.m_Folder);
    EXPECT_EQ(CKRPathHelper::ChangeFileExtension(c.m_Path, L".new"),
              CKRPathHelper::GetFilePath(c.m_Path) + c.m_Stem + L".new");
  }
  EXPECT_EQ(CKRPathHelper::GetFileExtension(nullptr), L"");
  EXPECT_EQ(CKRPathHelper::NormalizePath(L"C:\\data\\in/out\\"), L"C:/data/in/out/");
  EXPECT_EQ(CKRPathHelper::AddSlash(L"/home/u"), L"/home/u/");
  EXPECT_EQ(CKRPathHelper::AddSlash(L"/home/u/"), L"/home/u/");
  EXPECT_EQ(CKRPathHelper::AddSlash(L""), L"");
  EXPECT_EQ(CKRPathHelper::AddSlash(nullptr), L"");
}

TEST(CKRPathHelper, ExistenceFollowsLinksAndRefusesBadPaths) {
  CKRFilesScratch scratch;
  ASSERT_TRUE(scratch.IsValid());
  scratch.WriteFile("file", "x");
  scratch.MakeFolder("folder");
  scratch.MakePipe("pipe");
  scratch.MakeLink(scratch.Native("folder"), "folder-link");
  scratch.MakeLink(scratch.Native("gone"), "dangling");
  const wchar_t invalid[] = {L'/', L't', L'm', L'p', wchar_t(0x110000), L'\0'};

  struct SKRCase {
    const char* m_What;
    CKRString m_Path;
    bool m_Exists;
    bool m_IsDirectory;
  };
  const SKRCase cases[] = {
      {"file", scratch.Wide("file"), true, false},
      {"folder", scratch.Wide("folder"), true, true},
      {"folder with slash", scratch.Wide("folder/"), true, true},
      {"pipe", scratch.Wide("pipe"), true, false},
      {"link to a folder", scratch.Wide("folder-link"), true, true},
      {"dangling link", scratch.Wide("dangling"), false, false},
      {"missing", scratch.Wide("missing"), false, false},
      {"empty", CKRString(), false, false},
      {"overlong", CKRString(L"/") + CKRString(4096, L'x'), false, false},
      {"beyond U+10FFFF", CKRString(invalid), false, false},
  };
  for (const SKRCase& c : cases) {
    SCOPED_TRACE(c.m_What);
    EXPECT_EQ(CKRPathHelper::FileExists(c.m_Path.GetString()), c.m_Exists);
    EXPECT_EQ(CKRPathHelper::DirectoryExists(c.m_Path.GetString()), c.m_IsDirectory);
  }
  EXPECT_FALSE(CKRPathHelper::FileExists(nullptr));
  EXPECT_FALSE(CKRPathHelper::DirectoryExists(nullptr));

  if (KRPermissionsApply()) {
    scratch.MakeFolder("closed");
    ::chmod(scratch.Native("closed").c_str(), 0600);
    EXPECT_FALSE(CKRPathHelper::DirectoryExists(scratch.Wide("closed").GetString())) << "cannot be entered";
  }

  EXPECT_EQ(CKRPathHelper::BuildCompletePath(scratch.Wide("folder").GetString(), L"/elsewhere/doc.txt"),
            scratch.Wide("folder/doc.txt"));
  EXPECT_EQ(CKRPathHelper::BuildCompletePath(scratch.Wide("missing").GetString(), L"/elsewhere/doc.txt"),
            L"/elsewhere/doc.txt");
}

TEST(CKRPathHelper, DirectoryTestsLeaveTheCurrentDirectoryAlone) {
  CKRFilesScratch scratch;
  ASSERT_TRUE(scratch.IsValid());
  scratch.MakeFolder("work");
  scratch.MakeFolder("other");
  const std::filesystem::path before = std::filesystem::current_path();
  ASSERT_EQ(::chdir(scratch.Native("work").c_str()), 0);
  EXPECT_EQ(CKRPathHelper::GetCurrentWorkingDirectory(), scratch.Wide("work"));

  // A current directory that no longer exists cannot be read; directories
  // are found all the same, and the current directory stays where it is.
  ASSERT_EQ(::rmdir(scratch.Native("work").c_str()), 0);
  EXPECT_EQ(CKRPathHelper::GetCurrentWorkingDirectory(), L"");
  EXPECT_TRUE(CKRPathHelper::DirectoryExists(scratch.Wide("other").GetString()));
  char buffer[4096];
  EXPECT_EQ(::getcwd(buffer, sizeof buffer), nullptr) << "still in the removed directory";

  // A name that is not UTF-8 has no exact wide form: no current directory.
  scratch.MakeFolder("bad\xFF");
  ASSERT_EQ(::chdir(scratch.Native("bad\xFF").c_str()), 0);
  EXPECT_EQ(CKRPathHelper::GetCurrentWorkingDirectory(), L"");
  std::filesystem::current_path(before);
}

TEST(CKRPathHelper, CreatePathMakesEveryMissingLevel) {
  CKRFilesScratch scratch;
  ASSERT_TRUE(scratch.IsValid());
  EXPECT_EQ(CKRPathHelper::CreatePath(scratch.Wide("a/b/c").GetString()), 1);
  EXPECT_TRUE(CKRPathHelper::DirectoryExists(scratch.Wide("a/b/c").GetString()));
  EXPECT_EQ(CKRPathHelper::CreatePath(scratch.Wide("a/b/c/").GetString()), 1) << "exists: nothing to do";
  EXPECT_EQ(CKRPathHelper::CreatePath(scratch.Wide("x/y/").GetString()), 1);
  EXPECT_TRUE(CKRPathHelper::DirectoryExists(scratch.Wide("x/y").GetString()));

  scratch.WriteFile("file", "x");
  errno = 0;
  EXPECT_EQ(CKRPathHelper::CreatePath(scratch.Wide("file").GetString()), 0);
  EXPECT_EQ(errno, EEXIST);
  errno = 0;
  EXPECT_EQ(CKRPathHelper::CreatePath(scratch.Wide("file/below").GetString()), 0);
  EXPECT_EQ(errno, EEXIST);
  scratch.MakeLink(scratch.Native("gone"), "dangling");
  EXPECT_EQ(CKRPathHelper::CreatePath(scratch.Wide("dangling").GetString()), 0);
  EXPECT_EQ(CKRPathHelper::CreatePath(scratch.Wide("dangling/below").GetString()), 0);
  EXPECT_NE(::access(scratch.Native("gone").c_str(), F_OK), 0) << "nothing made through the link";

  EXPECT_EQ(CKRPathHelper::CreatePath(L""), 0);
  EXPECT_EQ(CKRPathHelper::CreatePath(nullptr), 0);
  errno = 0;
  EXPECT_EQ(CKRPathHelper::CreatePath((scratch.Wide("") + L"/" + CKRString(5000, L'n')).GetString()), 0);
  EXPECT_EQ(errno, ENAMETOOLONG);
  EXPECT_EQ(CKRPathHelper::CreatePath(L"/"), 1);
}

TEST(CKRPathHelper, RemoveDirectoryRemovesTheTreeAndNothingOutside) {
  CKRFilesScratch scratch;
  ASSERT_TRUE(scratch.IsValid());
  // Outside the tree: a folder and a file that links inside point at.
  scratch.MakeFolder("outside");
  scratch.WriteFile("outside/keep.txt", "keep");
  scratch.WriteFile("outside-file", "keep");

  scratch.MakeFolder("tree");
  scratch.MakeFolder("tree/sub");
  scratch.MakeFolder("tree/sub/deeper");
  scratch.WriteFile("tree/a.txt", "a");
  scratch.WriteFile("tree/sub/b.txt", "b");
  scratch.WriteFile("tree/sub/deeper/c.txt", "c");
  ::chmod(scratch.Native("tree/a.txt").c_str(), 0400);
  scratch.MakeFolder("tree/locked");
  scratch.WriteFile("tree/locked/d.txt", "d");
  ::chmod(scratch.Native("tree/locked").c_str(), 0500);
  scratch.MakeLink(scratch.Native("outside"), "tree/link-to-folder");
  scratch.MakeLink(scratch.Native("outside-file"), "tree/sub/link-to-file");
  scratch.MakeLink(scratch.Native("nowhere"), "tree/dangling");
  scratch.MakePipe("tree/pipe");

  EXPECT_EQ(CKRPathHelper::RemoveDirectoryW(scratch.Wide("tree").GetString()), 1);
  EXPECT_FALSE(CKRPathHelper::FileExists(scratch.Wide("tree").GetString()));
  EXPECT_TRUE(CKRPathHelper::FileExists(scratch.Wide("outside/keep.txt").GetString()));
  EXPECT_TRUE(CKRPathHelper::FileExists(scratch.Wide("outside-file").GetString()));

  // A link given as the directory is refused, and its target untouched.
  scratch.MakeLink(scratch.Native("outside"), "link");
  EXPECT_EQ(CKRPathHelper::RemoveDirectoryW(scratch.Wide("link").GetString()), 0);
  EXPECT_EQ(CKRPathHelper::RemoveDirectoryW(scratch.Wide("link/").GetString()), 0);
  EXPECT_TRUE(CKRPathHelper::FileExists(scratch.Wide("outside/keep.txt").GetString()));

  EXPECT_EQ(CKRPathHelper::RemoveDirectoryW(scratch.Wide("missing").GetString()), 0);
  EXPECT_EQ(CKRPathHelper::RemoveDirectoryW(scratch.Wide("outside-file").GetString()), 0);
  EXPECT_TRUE(CKRPathHelper::FileExists(scratch.Wide("outside-file").GetString()));
  EXPECT_EQ(CKRPathHelper::RemoveDirectoryW(L""), 0);
  EXPECT_EQ(CKRPathHelper::RemoveDirectoryW(nullptr), 0);
  EXPECT_EQ(CKRPathHelper::RemoveDirectoryW(scratch.Wide("outside/").GetString()), 1) << "trailing slash";
}

TEST(CKRPathHelper, GetChildPathsListsMatchingNames) {
  CKRFilesScratch scratch;
  ASSERT_TRUE(scratch.IsValid());
  scratch.WriteFile("a.txt", "");
  scratch.WriteFile("b.TXT", "");
  scratch.WriteFile("c.dat", "");
  scratch.WriteFile("noext", "");
  scratch.WriteFile("\xC3\xA9.txt", "");  // é.txt
  scratch.WriteFile("bad\xFF.txt", "");   // not UTF-8: no wide name
  scratch.MakeFolder("sub.txt");

  std::vector<CKRString> list = {L"kept"};
  EXPECT_EQ(CKRPathHelper::GetChildPaths(list, scratch.Wide().GetString(), L"*.txt"), 3);
  EXPECT_EQ(Sorted(list), Sorted({L"kept", L"a.txt", L"sub.txt", L"\u00e9.txt"}));

  list.clear();
  EXPECT_EQ(CKRPathHelper::GetChildPaths(list, scratch.Wide().GetString(), L"*.*"), 8);
  EXPECT_EQ(Sorted(list), Sorted({L".", L"..", L"a.txt", L"b.TXT", L"c.dat", L"noext", L"sub.txt", L"\u00e9.txt"}));

  struct SKRCase {
    const wchar_t* m_Pattern;
    std::vector<CKRString> m_Names;
  };
  const SKRCase cases[] = {
      {L"?.dat", {L"c.dat"}},
      {L"?.txt", {L"a.txt", L"\u00e9.txt"}},
      {L"*ext", {L"noext"}},
      {L"b.txt", {}},
      {L"*.*.*", {L".."}},
      {L"**a*", {L"a.txt", L"c.dat"}},
      {L"", {}},
  };
  for (const SKRCase& c : cases) {
    SCOPED_TRACE(CKRString(c.m_Pattern).ToUtf8());
    list.clear();
    EXPECT_EQ(CKRPathHelper::GetChildPaths(list, scratch.Wide().GetString(), c.m_Pattern), int(c.m_Names.size()));
    EXPECT_EQ(Sorted(list), Sorted(c.m_Names));
  }
  list.clear();
  EXPECT_EQ(CKRPathHelper::GetChildPaths(list, scratch.Wide("missing").GetString(), L"*"), 0);
  EXPECT_EQ(CKRPathHelper::GetChildPaths(list, scratch.Wide("a.txt").GetString(), L"*"), 0);
  EXPECT_EQ(CKRPathHelper::GetChildPaths(list, L"", L"*"), 0);
  EXPECT_TRUE(list.empty());
}

// Run by AppPathStripsBuildFolders in a copy of this program: writes what
// GetAppPath says to the file named by KR_FILES_APP_PATH_REPORT.
TEST(CKRPathHelper, DISABLED_ReportAppPath) {
  const char* report = std::getenv("KR_FILES_APP_PATH_REPORT");
  ASSERT_NE(report, nullptr);
  std::ofstream out(report);
  out << CKRPathHelper::GetAppPath(true, false).ToUtf8() << '\n'
      << CKRPathHelper::GetAppPath(false, false).ToUtf8() << '\n'
      << CKRPathHelper::GetAppPath(true, true).ToUtf8() << '\n'
      << CKRPathHelper::GetAppPath(false, true).ToUtf8() << '\n';
}

TEST(CKRPathHelper, AppPathStripsBuildFolders) {
  const std::string self = CKRPathHelper::GetAppPath(true).ToUtf8();
  ASSERT_EQ(self, std::filesystem::read_symlink("/proc/self/exe").string());
  EXPECT_EQ(CKRPathHelper::GetAppPath() + CKRPathHelper::GetFileName(CKRString::FromUtf8(self).GetString()),
            CKRString::FromUtf8(self));

  // A copy of this program in build folders of mixed case, beside folders
  // whose names only begin like them.
  CKRFilesScratch scratch;
  ASSERT_TRUE(scratch.IsValid());
  const std::string folder = "Releases/App/Release/DebugUnicode/";
  std::filesystem::create_directories(scratch.Native(folder));
  const std::string copy = scratch.Native(folder + "MyApp");
  std::filesystem::copy_file(self, copy);
  const std::string report = scratch.Native("report.txt");
  ::setenv("KR_FILES_APP_PATH_REPORT", report.c_str(), 1);
  const int status = KRRunTestProgram(copy, "CKRPathHelper.DISABLED_ReportAppPath");
  ::unsetenv("KR_FILES_APP_PATH_REPORT");
  ASSERT_EQ(status, 0);
  std::ifstream in(report);
  std::string withModule, folderOnly, strippedWithModule, strippedFolder;
  std::getline(in, withModule);
  std::getline(in, folderOnly);
  std::getline(in, strippedWithModule);
  std::getline(in, strippedFolder);
  EXPECT_EQ(withModule, copy) << "the case of the path is kept";
  EXPECT_EQ(folderOnly, scratch.Native(folder));
  EXPECT_EQ(strippedWithModule, scratch.Native("Releases/App/MyApp"));
  EXPECT_EQ(strippedFolder, scratch.Native("Releases/App/"));
}
