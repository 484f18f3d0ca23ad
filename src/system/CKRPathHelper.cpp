#include <krCoreLib/system/CKRPathHelper.h>

#include "KRNativePath.h"
#include "SKRFiles.h"

#include <cerrno>
#include <string>

namespace {

constexpr wchar_t kSeparator = L'/';

std::wstring_view View(const wchar_t* text) {
  return text != nullptr ? std::wstring_view(text) : std::wstring_view();
}

// The file name: the text after the last separator.
std::wstring_view NamePart(std::wstring_view path) {
  const std::size_t slash = path.rfind(kSeparator);
  return slash == std::wstring_view::npos ? path : path.substr(slash + 1);
}

// Length of the extension at the end of `path` ("." included), 0 for none.
std::size_t ExtensionLength(std::wstring_view path) {
  const std::wstring_view name = NamePart(path);
  const std::size_t dot = name.rfind(L'.');
  return dot == std::wstring_view::npos ? 0 : name.size() - dot;
}

// Wildcard match of a whole name: "*" any run, "?" one character. Greedy
// with one backtracking point, so hostile patterns stay O(name * pattern).
bool MatchWildcard(std::wstring_view pattern, std::wstring_view name) {
  std::size_t p = 0, n = 0;
  std::size_t starPattern = std::wstring_view::npos, starName = 0;
  while (n < name.size()) {
    if (p < pattern.size() && (pattern[p] == L'?' || pattern[p] == name[n])) {
      ++p;
      ++n;
    } else if (p < pattern.size() && pattern[p] == L'*') {
      starPattern = p++;
      starName = n;
    } else if (starPattern != std::wstring_view::npos) {
      p = starPattern + 1;
      n = ++starName;
    } else {
      return false;
    }
  }
  while (p < pattern.size() && pattern[p] == L'*')
    ++p;
  return p == pattern.size();
}

bool IsBuildFolder(std::wstring_view folder) {
  static constexpr const wchar_t* kBuildFolders[] = {L"release", L"debug", L"unicode", L"releaseunicode",
                                                     L"debugunicode"};
  const CKRString text(folder);
  for (const wchar_t* name : kBuildFolders) {
    if (text.CompareNoCase(name) == 0)
      return true;
  }
  return false;
}

// Removes the build-output folders from the folder part of `path` (the text
// up to its last separator); the file name part stays.
std::wstring StripBuildFolders(std::wstring_view path) {
  const std::size_t lastSlash = path.rfind(kSeparator);
  if (lastSlash == std::wstring_view::npos)
    return std::wstring(path);
  std::wstring result;
  std::size_t start = 0;
  while (start <= lastSlash) {
    const std::size_t slash = path.find(kSeparator, start);
    const std::wstring_view folder = path.substr(start, slash - start);
    if (!IsBuildFolder(folder)) {
      result += folder;
      result += kSeparator;
    }
    start = slash + 1;
  }
  result += path.substr(lastSlash + 1);
  return result;
}

int CreateNativePath(const CKRString& path) {
  std::string native;
  if (!SKRNativePath::ToNative(path.str(), native)) {
    if (path.IsEmpty())
      errno = ENOENT;
    else if (path.ToUtf8().size() > SKRNativePath::kMaxBytes)
      errno = ENAMETOOLONG;
    else
      errno = EINVAL;  // a character with no file-system form
    return 0;
  }
  switch (SKRFiles::GetKind(native.c_str())) {
  case SKRFiles::EKRKind::Directory:
    return 1;
  case SKRFiles::EKRKind::File:
  case SKRFiles::EKRKind::Other:
    errno = EEXIST;
    return 0;
  case SKRFiles::EKRKind::Missing:
    break;
  }
  const std::size_t slash = path.str().rfind(kSeparator);
  if (slash != std::wstring::npos && slash > 0 && CreateNativePath(path.Left(int(slash))) == 0)
    return 0;
  const int error = SKRFiles::MakeDirectory(native.c_str());
  // Made meanwhile by another thread or process: just as good.
  if (error == 0 || (error == EEXIST && SKRFiles::GetKind(native.c_str()) == SKRFiles::EKRKind::Directory))
    return 1;
  errno = error;
  return 0;
}

}  // namespace

bool CKRPathHelper::FileExists(const wchar_t* path) {
  std::string native;
  return SKRNativePath::ToNative(path, native) && SKRFiles::GetKind(native.c_str()) != SKRFiles::EKRKind::Missing;
}

bool CKRPathHelper::DirectoryExists(const wchar_t* path) {
  std::string native;
  return SKRNativePath::ToNative(path, native) && SKRFiles::IsEnterableDirectory(native.c_str());
}

CKRString CKRPathHelper::GetCurrentWorkingDirectory() {
  std::string native;
  CKRString path;
  if (!SKRFiles::GetCurrentDirectory(native) || !SKRNativePath::FromNative(native, path))
    return CKRString();
  return path;
}

CKRString CKRPathHelper::GetFileExtension(const wchar_t* path) {
  const std::wstring_view text = View(path);
  return CKRString(text.substr(text.size() - ExtensionLength(text)));
}

CKRString CKRPathHelper::ChangeFileExtension(const wchar_t* path, const wchar_t* extension) {
  const std::wstring_view text = View(path);
  CKRString result(text.substr(0, text.size() - ExtensionLength(text)));
  result += extension;
  return result;
}

CKRString CKRPathHelper::GetFileName(const wchar_t* path, bool withExtension) {
  const std::wstring_view name = NamePart(View(path));
  return CKRString(withExtension ? name : name.substr(0, name.size() - ExtensionLength(name)));
}

CKRString CKRPathHelper::GetFilePath(const wchar_t* path) {
  const std::wstring_view text = View(path);
  const std::size_t slash = text.rfind(kSeparator);
  return slash == std::wstring_view::npos ? CKRString() : CKRString(text.substr(0, slash + 1));
}

CKRString CKRPathHelper::NormalizePath(const wchar_t* path) {
  CKRString result(path);
  for (wchar_t& c : result.str()) {
    if (c == L'\\')
      c = kSeparator;
  }
  return result;
}

CKRString CKRPathHelper::AddSlash(const wchar_t* path) {
  CKRString result(path);
  if (!result.IsEmpty() && result.str().back() != kSeparator)
    result += kSeparator;
  return result;
}

CKRString CKRPathHelper::BuildCompletePath(const wchar_t* directory, const wchar_t* file) {
  if (!DirectoryExists(directory))
    return CKRString(file);
  return AddSlash(directory) + GetFileName(file);
}

int CKRPathHelper::CreatePath(const wchar_t* path) {
  CKRString text(path);
  if (text.GetLength() > 1 && text.str().back() == kSeparator)
    text = text.Left(text.GetLength() - 1);
  return CreateNativePath(text);
}

int CKRPathHelper::RemoveDirectoryW(const wchar_t* path) {
  std::string native;
  if (!SKRNativePath::ToNative(path, native))
    return 0;
  // "link/" would name the link's target: drop trailing separators so that
  // a link given as the directory is seen, and refused, as a link.
  while (native.size() > 1 && native.back() == '/')
    native.pop_back();
  return SKRFiles::RemoveTree(native.c_str(), kMaxRemoveDepth) ? 1 : 0;
}

int CKRPathHelper::GetChildPaths(std::vector<CKRString>& list, const wchar_t* directory, const wchar_t* pattern) {
  std::string native;
  const std::wstring_view wanted = View(pattern) == L"*.*" ? std::wstring_view(L"*") : View(pattern);
  if (wanted.empty() || !SKRNativePath::ToNative(directory, native))
    return 0;
  int count = 0;
  try {
    std::vector<std::string> names;
    if (!SKRFiles::ListDirectory(native.c_str(), names))
      return 0;
    CKRString name;
    for (const std::string& entry : names) {
      if (SKRNativePath::FromNative(entry, name) && MatchWildcard(wanted, name.str())) {
        list.push_back(name);
        ++count;
      }
    }
  } catch (...) {
    // Out of memory: the names appended so far stay.
  }
  return count;
}

CKRString CKRPathHelper::GetAppPath(bool withModuleName, bool stripBuildFolders) {
  std::string native;
  CKRString path;
  if (!SKRFiles::GetExecutablePath(native) || !SKRNativePath::FromNative(native, path))
    return CKRString();
  if (!withModuleName)
    path = GetFilePath(path.GetString());
  if (stripBuildFolders)
    path = CKRString(StripBuildFolders(path.str()));
  return path;
}
