// A folder unique to the test, removed with everything in it: for tests
// that write files, modules or archives.
#pragma once

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <system_error>

#include <stdlib.h>

class CKRScratchFolder {
public:
  CKRScratchFolder() {
    std::string pattern = (std::filesystem::temp_directory_path() / "krtest-XXXXXX").string();
    if (::mkdtemp(pattern.data()) == nullptr) {
      std::perror("no scratch folder");
      std::abort();
    }
    m_Root = pattern;
  }
  ~CKRScratchFolder() {
    std::error_code error;  // a test may have taken folders' permissions away: give them back
    std::filesystem::permissions(m_Root, std::filesystem::perms::owner_all, error);
    for (auto it = std::filesystem::recursive_directory_iterator(m_Root, error);
         !error && it != std::filesystem::recursive_directory_iterator(); it.increment(error)) {
      if (it->is_directory(error) && !it->is_symlink(error))
        std::filesystem::permissions(it->path(), std::filesystem::perms::owner_all,
                                     std::filesystem::perm_options::add, error);
    }
    std::filesystem::remove_all(m_Root, error);
  }
  CKRScratchFolder(const CKRScratchFolder&) = delete;
  CKRScratchFolder& operator=(const CKRScratchFolder&) = delete;

  const std::string& Root() const { return m_Root; }
  std::string Path(const std::string& name) const { return m_Root + "/" + name; }

private:
  std::string m_Root;
};
