// CKRPathHelper: file and directory tests, path splitting and joining,
// recursive creation and removal of directories, directory listings and the
// application's own folder.
//
// Paths use "/" as their separator; NormalizePath turns "\" into "/". The
// text operations (GetFileExtension to AddSlash) work on the text alone and
// never touch the file system. The file-system operations treat a path that
// is empty, longer than the system's limit (4095 bytes in UTF-8) or holds
// characters without a UTF-8 form as naming nothing: tests give false and
// actions fail. All operations are static, never throw, and may be called
// from any thread; none changes the current directory.
#pragma once

#include <krCoreLib/core/CKRString.h>

#include <vector>

class KRCORELIB_API CKRPathHelper {
public:
  // Nesting depth RemoveDirectoryW descends into; deeper trees are left in
  // place (and the call reports failure) rather than exhausting the
  // process's descriptors.
  static constexpr int kMaxRemoveDepth = 512;

  // True when the path names an existing entry: a file, a directory or a
  // special file, following symbolic links (a dangling link gives false).
  static bool FileExists(const wchar_t* path);
  // True when the path names a directory the process may enter.
  static bool DirectoryExists(const wchar_t* path);
  // The current directory, or empty when it cannot be read.
  static CKRString GetCurrentWorkingDirectory();

  // The text from the last "." of the file name (the part after the last
  // "/") to the end, the dot included; empty when the name has no ".".
  static CKRString GetFileExtension(const wchar_t* path);
  // The path without its extension (as GetFileExtension gives it) followed
  // by `extension`.
  static CKRString ChangeFileExtension(const wchar_t* path, const wchar_t* extension);
  // The text after the last "/" (the whole path when there is none); without
  // its extension (the text from the last ".") when withExtension is false.
  static CKRString GetFileName(const wchar_t* path, bool withExtension = true);
  // The text up to and including the last "/"; empty when there is none.
  static CKRString GetFilePath(const wchar_t* path);
  // Every "\" replaced by "/".
  static CKRString NormalizePath(const wchar_t* path);
  // The path with a "/" appended unless it already ends with one; an empty
  // path stays empty.
  static CKRString AddSlash(const wchar_t* path);
  // AddSlash(directory) followed by GetFileName(file) when the directory
  // exists; otherwise file unchanged.
  static CKRString BuildCompletePath(const wchar_t* directory, const wchar_t* file);

  // Creates the directory and every missing parent. 1 on success (also when
  // it exists already as a directory), else 0 with errno set: EEXIST when
  // the path or a parent exists as something else than a directory.
  static int CreatePath(const wchar_t* path);
  // Removes the directory with everything in it, subdirectories included.
  // Symbolic links inside are removed, never followed, and folders on
  // which another file system is mounted are left (the call then fails).
  // Refused (0) with nothing touched: a path that is itself a symbolic
  // link, a path whose last component is "." or ".." ("X/.", "p/c/..";
  // name the folder itself instead), the root directory in any spelling
  // and the root of a mounted file system. 1 when the directory is gone; 0
  // when it did not exist or something in it could not be removed (what
  // could be removed is gone).
  static int RemoveDirectoryW(const wchar_t* path);
  // Appends to `list` the names (not full paths) of the entries of
  // `directory` that match `pattern` ("*" any run of characters, "?" one
  // character, other characters themselves, case-sensitive; "*.*" matches
  // every name, as "*" does), in the order the file system returns them, "." and ".."
  // included when they match. Names that are not valid UTF-8 have no exact
  // wide form and are left out. Returns the number of names appended; 0
  // when the directory cannot be listed.
  static int GetChildPaths(std::vector<CKRString>& list, const wchar_t* directory, const wchar_t* pattern);

  // The running program's full file name (withModuleName) or its folder
  // with a trailing "/", letters in the case the file system has them. With
  // stripBuildFolders, the build-output folders "release", "debug",
  // "unicode", "releaseunicode" and "debugunicode" (letters of any case) are
  // cut from the folder part wherever they occur as whole folder names.
  // Empty when the program's file name cannot be read.
  static CKRString GetAppPath(bool withModuleName = false, bool stripBuildFolders = false);
};
