#include <krCoreLib/system/CKRPathHelper.h>

#include "KRFilesScratch.h"

#include <sched.h>
#include <sys/mount.h>

TEST(CKRPathHelper, TextOperationsSplitAtTheLastSeparator) {
  // Path, extension, name, stem, folder.
  const std::array<const wchar_t*, 5> cases[] = {
      {L"a.b.c", L".c", L"a.b.c", L"a.b", L""},
      {L"/home/u/report.txt", L".txt", L"report.txt", L"report", L"/home/u/"},
      {L"/home/u.d/README", L"", L"README", L"README", L"/home/u.d/"},
      {L"/home/u/", L"", L"", L"", L"/home/u/"},
      {L"name.", L".", L"name.", L"name", L""},
      {L"", L"", L"", L"", L""},
  };
  for (const auto& [path, extension, name, stem, folder] : cases) {
    SCOPED_TRACE(CKRString(path).ToUtf8());
    EXPECT_EQ(CKRPathHelper::GetFileExtension(path), extension);
    EXPECT_EQ(CKRPathHelper::GetFileName(path), name);
    EXPECT_EQ(CKRPathHelper::GetFileName(path, false), stem);
    EXPECT_EQ(CKRPathHelper::GetFilePath(path), folder);
    EXPECT_EQ(CKRPathHelper::ChangeFileExtension(path, L".new"), CKRString(folder) + stem + L".new");
  }
  EXPECT_EQ(CKRPathHelper::GetFileExtension(nullptr), L"");
  EXPECT_EQ(CKRPathHelper::NormalizePath(L"C:\\data\\in/out\\"), L"C:/data/in/out/");
  EXPECT_EQ(CKRPathHelper::AddSlash(L"/home/u"), L"/home/u/");
  EXPECT_EQ(CKRPathHelper::AddSlash(L"/home/u/"), L"/home/u/");
  EXPECT_EQ(CKRPathHelper::AddSlash(nullptr), L"");
}

TEST(CKRPathHelper, ExistenceAndCreatePathFollowLinksAndRefuseBadPaths) {
  CKRFilesScratch scratch;
  scratch.Make({"file", "folder/"});
  scratch.MakePipe("pipe");
  scratch.MakeLink(scratch.Native("folder"), "folder-link");
  scratch.MakeLink(scratch.Native("gone"), "dangling");

  // What, path, whether it exists, whether it is a directory.
  const std::tuple<const char*, CKRString, bool, bool> cases[] = {
      {"file", scratch.Wide("file"), true, false},
      {"folder", scratch.Wide("folder"), true, true},
      {"folder with slash", scratch.Wide("folder/"), true, true},
      {"pipe", scratch.Wide("pipe"), true, false},
      {"link to a folder", scratch.Wide("folder-link"), true, true},
      {"dangling link", scratch.Wide("dangling"), false, false},
      {"missing", scratch.Wide("missing"), false, false},
      {"empty", CKRString(), false, false},
      {"overlong", CKRString(L"/") + CKRString(4096, L'x'), false, false},
      {"beyond U+10FFFF", CKRString(L"/tmp") + wchar_t(0x110000), false, false},
  };
  for (const auto& [what, path, exists, isDirectory] : cases) {
    SCOPED_TRACE(what);
    EXPECT_EQ(CKRPathHelper::FileExists(path.GetString()), exists);
    EXPECT_EQ(CKRPathHelper::DirectoryExists(path.GetString()), isDirectory);
  }
  EXPECT_FALSE(CKRPathHelper::FileExists(nullptr) || CKRPathHelper::DirectoryExists(nullptr));
  if (!KRCanActAsAnotherUser()) {
    scratch.Make({"closed/"});
    ::chmod(scratch.Native("closed").c_str(), 0600);
    EXPECT_FALSE(CKRPathHelper::DirectoryExists(scratch.Wide("closed").GetString())) << "cannot be entered";
  }

  EXPECT_EQ(CKRPathHelper::BuildCompletePath(scratch.Wide("folder").GetString(), L"/elsewhere/doc.txt"),
            scratch.Wide("folder/doc.txt"));
  EXPECT_EQ(CKRPathHelper::BuildCompletePath(scratch.Wide("missing").GetString(), L"/elsewhere/doc.txt"),
            L"/elsewhere/doc.txt");

  // CreatePath makes every missing level, never through a link.
  EXPECT_EQ(CKRPathHelper::CreatePath(scratch.Wide("a/b/c").GetString()), 1);
  EXPECT_TRUE(CKRPathHelper::DirectoryExists(scratch.Wide("a/b/c").GetString()));
  EXPECT_EQ(CKRPathHelper::CreatePath(scratch.Wide("a/b/c/").GetString()), 1) << "exists: nothing to do";

  errno = 0;
  EXPECT_EQ(CKRPathHelper::CreatePath(scratch.Wide("file").GetString()), 0);
  EXPECT_EQ(errno, EEXIST);
  EXPECT_EQ(CKRPathHelper::CreatePath(scratch.Wide("file/below").GetString()), 0);
  EXPECT_EQ(CKRPathHelper::CreatePath(scratch.Wide("dangling").GetString()), 0);
  EXPECT_EQ(CKRPathHelper::CreatePath(scratch.Wide("dangling/below").GetString()), 0);
  EXPECT_NE(::access(scratch.Native("gone").c_str(), F_OK), 0) << "nothing made through the link";

  EXPECT_EQ(CKRPathHelper::CreatePath(nullptr), 0);
  EXPECT_EQ(CKRPathHelper::CreatePath((scratch.Wide("") + L"/" + CKRString(5000, L'n')).GetString()), 0);
}

TEST(CKRPathHelper, DirectoryTestsLeaveTheCurrentDirectoryAlone) {
  CKRFilesScratch scratch;
  scratch.Make({"work/", "other/"});
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
  scratch.Make({"bad\xFF/"});
  ASSERT_EQ(::chdir(scratch.Native("bad\xFF").c_str()), 0);
  EXPECT_EQ(CKRPathHelper::GetCurrentWorkingDirectory(), L"");
  std::filesystem::current_path(before);
}

TEST(CKRPathHelper, RemoveDirectoryRemovesTheTreeAndNothingOutside) {
  CKRFilesScratch scratch;
  // Outside the tree: a folder and a file that links inside point at.
  scratch.Make({"outside/keep.txt", "outside-file", "tree/sub/deeper/", "tree/a.txt", "tree/locked/d.txt"});
  ::chmod(scratch.Native("tree/a.txt").c_str(), 0400);
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

  // Spellings that name a folder through itself or a child: refused, with
  // nothing touched; a folder named through its parent goes.
  scratch.Make({"p/c/d/", "p/keep"});
  for (const char* spelling : {"p/.", "p/./", "p/c/..", "p/c/../", "p/c/d/../..", "p/c/../."}) {
    SCOPED_TRACE(spelling);
    EXPECT_EQ(CKRPathHelper::RemoveDirectoryW(scratch.Wide(spelling).GetString()), 0);
    EXPECT_TRUE(CKRPathHelper::FileExists(scratch.Wide("p/keep").GetString()));
    EXPECT_TRUE(CKRPathHelper::FileExists(scratch.Wide("p/c/d").GetString()));
  }
  EXPECT_EQ(CKRPathHelper::RemoveDirectoryW(scratch.Wide("p/c/d/../../c").GetString()), 1);
  EXPECT_FALSE(CKRPathHelper::FileExists(scratch.Wide("p/c").GetString()));
  EXPECT_TRUE(CKRPathHelper::FileExists(scratch.Wide("p/keep").GetString()));

  EXPECT_EQ(CKRPathHelper::RemoveDirectoryW(scratch.Wide("missing").GetString()), 0);
  EXPECT_EQ(CKRPathHelper::RemoveDirectoryW(scratch.Wide("outside-file").GetString()), 0);
  EXPECT_EQ(CKRPathHelper::RemoveDirectoryW(nullptr), 0);
  EXPECT_EQ(CKRPathHelper::RemoveDirectoryW(scratch.Wide("outside/").GetString()), 1) << "trailing slash";
}

// In a child confined to a scratch folder (its root) with mounts of its
// own, so that a failing guard could empty nothing but the scratch folder.
TEST(CKRPathHelper, RemoveDirectoryLeavesTheRootAndMountedFileSystemsAlone) {
  if (!KRCanActAsAnotherUser())
    GTEST_SKIP() << "needs root to confine a child to a scratch folder and mounts of its own";
  CKRFilesScratch scratch;
  scratch.Make({"canary", "sub/", "outside/keep", "tree/mounted/", "tree/file"});
  constexpr int kNoNamespace = 200;
  const int status = KRRunInChild([&] {
    // The bind mount is seen by this child only.
    if (::unshare(CLONE_NEWNS) != 0 || ::mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) != 0 ||
        ::mount(scratch.Native("outside").c_str(), scratch.Native("tree/mounted").c_str(), nullptr, MS_BIND,
                nullptr) != 0)
      return kNoNamespace;
    if (::chroot(scratch.Native().c_str()) != 0 || ::chdir("/") != 0)
      return kNoNamespace + 1;
    int removed = 0;
    for (const wchar_t* root : {L"/", L"//", L"/.", L"/..", L"/./", L"/../..", L"/sub/..", L"/sub/../.", L"."})
      removed += CKRPathHelper::RemoveDirectoryW(root);
    // A mount point is refused, and a folder holding one is not removed.
    removed += CKRPathHelper::RemoveDirectoryW(L"/tree/mounted");
    removed += CKRPathHelper::RemoveDirectoryW(L"/tree");
    return removed;
  });
  if (status == kNoNamespace)
    GTEST_SKIP() << "no mount namespace of its own for the child";
  EXPECT_EQ(status, 0);
  for (const char* kept : {"canary", "sub", "outside/keep", "tree/mounted"})
    EXPECT_TRUE(CKRPathHelper::FileExists(scratch.Wide(kept).GetString())) << kept;
  EXPECT_FALSE(CKRPathHelper::FileExists(scratch.Wide("tree/file").GetString())) << "what could go is gone";
}

TEST(CKRPathHelper, GetChildPathsListsMatchingNames) {
  CKRFilesScratch scratch;
  // "bad\xFF.txt" is not UTF-8: it has no wide name.
  scratch.Make({"a.txt", "b.TXT", "c.dat", "noext", "\xC3\xA9.txt", "bad\xFF.txt", "sub.txt/"});
  auto sorted = [](std::vector<CKRString> names) {
    std::sort(names.begin(), names.end());
    return names;
  };
  std::vector<CKRString> list = {L"kept"};
  EXPECT_EQ(CKRPathHelper::GetChildPaths(list, scratch.Wide().GetString(), L"*.txt"), 3);
  EXPECT_EQ(sorted(list), sorted({L"kept", L"a.txt", L"sub.txt", L"\u00e9.txt"})) << "appended";

  const std::pair<const wchar_t*, std::vector<CKRString>> cases[] = {
      {L"*.*", {L".", L"..", L"a.txt", L"b.TXT", L"c.dat", L"noext", L"sub.txt", L"\u00e9.txt"}},
      {L"?.dat", {L"c.dat"}},
      {L"?.txt", {L"a.txt", L"\u00e9.txt"}},
      {L"*ext", {L"noext"}},
      {L"b.txt", {}},
      {L"*.*.*", {L".."}},
      {L"**a*", {L"a.txt", L"c.dat"}},
      {L"", {}},
  };
  for (const auto& [pattern, names] : cases) {
    SCOPED_TRACE(CKRString(pattern).ToUtf8());
    list.clear();
    EXPECT_EQ(CKRPathHelper::GetChildPaths(list, scratch.Wide().GetString(), pattern), int(names.size()));
    EXPECT_EQ(sorted(list), sorted(names));
  }
  list.clear();
  EXPECT_EQ(CKRPathHelper::GetChildPaths(list, scratch.Wide("missing").GetString(), L"*"), 0);
  EXPECT_EQ(CKRPathHelper::GetChildPaths(list, scratch.Wide("a.txt").GetString(), L"*"), 0);
  EXPECT_TRUE(list.empty());
}

// Run by AppPathStripsBuildFolders in a copy of this program.
TEST(CKRPathHelper, DISABLED_ReportAppPath) {
  const char* report = std::getenv("KR_FILES_APP_PATH_REPORT");
  ASSERT_NE(report, nullptr);
  std::ofstream(report) << CKRPathHelper::GetAppPath(true, false).ToUtf8() << '\n'
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
  const std::string folder = "Releases/App/Release/DebugUnicode/";
  scratch.Make({folder});
  const std::string copy = scratch.Native(folder + "MyApp");
  std::filesystem::copy_file(self, copy);
  const std::string report = scratch.Native("report.txt");
  ::setenv("KR_FILES_APP_PATH_REPORT", report.c_str(), 1);
  const int status = KRRunTestProgram(copy, "CKRPathHelper.DISABLED_ReportAppPath");
  ::unsetenv("KR_FILES_APP_PATH_REPORT");
  ASSERT_EQ(status, 0);
  EXPECT_EQ(KRLoadText(CKRString::FromUtf8(report)),
            copy + "\n" + scratch.Native(folder) + "\n" + scratch.Native("Releases/App/MyApp\n") +
                scratch.Native("Releases/App/\n"));
}
