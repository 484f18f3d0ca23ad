#include <krCoreLib/platform/KRRegistryAPI.h>

#include "SKRRegistryStore.h"

long KRRegOpenKeyEx(HKEY key, const wchar_t* subKey, std::uint32_t, std::uint32_t access, HKEY* result) {
  return SKRRegistryStore::OpenKey(key, subKey, access, false, 0, result, nullptr);
}

long KRRegCreateKeyEx(HKEY key, const wchar_t* subKey, std::uint32_t options, std::uint32_t access, HKEY* result,
                      std::uint32_t* disposition) {
  return SKRRegistryStore::OpenKey(key, subKey, access, true, options, result, disposition);
}

long KRRegQueryInfoKey(HKEY key, std::uint32_t* subKeys, std::uint32_t* maxSubKeyLength, std::uint32_t* values,
                       std::uint32_t* maxValueNameLength, std::uint32_t* maxValueLength) {
  return SKRRegistryStore::QueryInfo(key, subKeys, maxSubKeyLength, values, maxValueNameLength, maxValueLength);
}

long KRRegQueryValueEx(HKEY key, const wchar_t* name, std::uint32_t* type, std::uint8_t* data, std::uint32_t* size) {
  return SKRRegistryStore::QueryValue(key, name, type, data, size);
}

long KRRegSetValueEx(HKEY key, const wchar_t* name, std::uint32_t type, const std::uint8_t* data, std::uint32_t size) {
  return SKRRegistryStore::SetValue(key, name, type, data, size);
}

long KRRegEnumValue(HKEY key, std::uint32_t index, wchar_t* name, std::uint32_t* nameLength, std::uint32_t* type,
                    std::uint8_t* data, std::uint32_t* size) {
  return SKRRegistryStore::EnumValue(key, index, name, nameLength, type, data, size);
}

long KRRegEnumKeyEx(HKEY key, std::uint32_t index, wchar_t* name, std::uint32_t* nameLength) {
  return SKRRegistryStore::EnumKey(key, index, name, nameLength);
}

long KRRegDeleteValue(HKEY key, const wchar_t* name) {
  return SKRRegistryStore::DeleteValue(key, name);
}

long KRRegDeleteKey(HKEY key, const wchar_t* subKey) {
  return SKRRegistryStore::DeleteKey(key, subKey);
}

long KRRegCloseKey(HKEY key) {
  return SKRRegistryStore::CloseKey(key);
}
