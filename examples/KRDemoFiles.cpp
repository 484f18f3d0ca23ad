// Paths, files and mapped memory: splitting and joining paths, a folder
// made and removed again, a whole file saved and loaded, and the same file
// changed through a memory mapping.
#include "KRDemo.h"

#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

void KRDemoFiles() {
  Print(L"1. Paths are split and joined as text:\n");
  const CKRString stored = CKRPathHelper::NormalizePath(L"projects\\bridge\\model.v2.krx");
  Print(CKRString::Formatted(L"   NormalizePath   %s\n", stored.GetString()));
  Print(CKRString::Formatted(L"   GetFilePath     %s\n", CKRPathHelper::GetFilePath(stored.GetString()).GetString()));
  Print(CKRString::Formatted(L"   GetFileName     %s (without extension: %s)\n",
                             CKRPathHelper::GetFileName(stored.GetString()).GetString(),
                             CKRPathHelper::GetFileName(stored.GetString(), false).GetString()));
  Print(CKRString::Formatted(L"   extension       %s -> %s\n",
                             CKRPathHelper::GetFileExtension(stored.GetString()).GetString(),
                             CKRPathHelper::ChangeFileExtension(stored.GetString(), L".bak").GetString()));
  Print(CKRString::Formatted(L"   this program    %s\n", CKRPathHelper::GetAppPath(true).GetString()));

  // A scratch folder of the demo's own in the temporary folder.
  std::string pattern = "/tmp/krdemo-files-XXXXXX";
  if (::mkdtemp(pattern.data()) == nullptr) {
    Print(L"   (no temporary folder: the rest of this section is skipped)\n");
    return;
  }
  const CKRString root = CKRString::FromUtf8(pattern);
  const CKRString folder = CKRPathHelper::AddSlash(root.GetString()) + L"output/2024/run1";

  Print(L"\n2. CreatePath makes every missing level:\n");
  const int created = CKRPathHelper::CreatePath(folder.GetString());
  Print(CKRString::Formatted(L"   CreatePath(%s) = %d, DirectoryExists = %d\n", folder.GetString(), created,
                             int(CKRPathHelper::DirectoryExists(folder.GetString()))));

  Print(L"\n3. A whole file saved, appended to and loaded:\n");
  const CKRString file = CKRPathHelper::BuildCompletePath(folder.GetString(), L"/anywhere/results.txt");
  const char first[] = "span=12.5 m\n";
  const char second[] = "load=40 kN\n";
  CKRSystem::Save(file.GetString(), first, std::strlen(first));
  CKRSystem::Append(file.GetString(), second, std::strlen(second));
  unsigned char* buffer = nullptr;
  std::size_t size = 0;
  if (CKRSystem::Load(file.GetString(), buffer, size)) {
    Print(CKRString::Formatted(L"   %s holds %d bytes:\n", file.GetString(), int(size)));
    CKRString text = CKRString::FromUtf8(reinterpret_cast<const char*>(buffer), std::ptrdiff_t(size));
    text.Replace(L"\n", L"\n   | ");
    Print(L"   | " + text.Left(text.GetLength() - 5));
    delete[] buffer;
  }
  const std::uint32_t bigEndian = 0x04030201;  // bytes 01 02 03 04 in memory
  std::uint32_t value = 0;
  CKRSystem::Read4be(static_cast<const void*>(&bigEndian), 1, &value);
  Print(CKRString::Formatted(L"   bytes 01 02 03 04 read big-endian: 0x%08X\n", value));

  Print(L"\n4. The same file through a memory mapping (with a terminator behind it):\n");
  {
    CKRMemMapFile map;
    if (map.MapFile(file.GetString(), false, 0, true) == 1) {
      auto* text = static_cast<char*>(map.Open(1000));
      Print(CKRString::Formatted(L"   mapped %u bytes as %s\n", map.GetSize(), map.GetName().GetString()));
      if (text != nullptr)
        std::memcpy(text, "SPAN", 4);  // written under the mapping's lock
      map.Close();
      map.UnMap();
    }
  }
  if (CKRSystem::Load(file.GetString(), buffer, size)) {
    Print(L"   after the mapping: " +
          CKRString::FromUtf8(reinterpret_cast<const char*>(buffer), std::ptrdiff_t(std::strlen(first) - 1)) + L"\n");
    delete[] buffer;
  }

  Print(L"\n5. Named shared memory, seen by two mappings:\n");
  {
    // Either mapping fails (0) when memory of that name belongs to another
    // user of the machine, or others may use it.
    CKRMemMapFile writer, reader;
    if (writer.MapMemory(L"krDemo\\Scratch", 32) == 1 && reader.MapExistingMemory(L"krDemo\\Scratch", 32, true) == 1) {
      std::memcpy(writer.Open(), "hello across mappings", 22);
      writer.Close();
      Print(CKRString::Formatted(L"   %s: \"%hs\"\n", reader.GetName().GetString(),
                                 static_cast<const char*>(reader.Open())));
    } else {
      Print(L"   (the shared memory could not be mapped)\n");
    }
  }

  Print(L"\n6. The folder listed and removed with everything in it:\n");
  std::vector<CKRString> names;
  CKRPathHelper::GetChildPaths(names, folder.GetString(), L"*.txt");
  for (const CKRString& name : names)
    Print(L"   " + name + L"\n");
  const int removed = CKRPathHelper::RemoveDirectoryW(root.GetString());
  Print(CKRString::Formatted(L"   RemoveDirectoryW = %d, still there: %d\n", removed,
                             int(CKRPathHelper::FileExists(root.GetString()))));
}
