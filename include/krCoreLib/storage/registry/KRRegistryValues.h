// The value types of the registry serializer's typed value helpers: the
// collections it stores as binary values and a rectangle beside the
// toolkit's point (CKRScreenPoint).
#pragma once

#include <krCoreLib/core/CKRString.h>
#include <krCoreLib/platform/KRWindowTypes.h>

#include <cstdint>
#include <list>
#include <vector>

using CKRRegistryByteArray = std::vector<std::uint8_t>;
using CKRRegistryWordArray = std::vector<std::uint16_t>;
using CKRRegistryDWordArray = std::vector<std::uint32_t>;
using CKRRegistryStringArray = std::vector<CKRString>;
// Kept apart from the string array so that both can be read and written
// by overloads; both are stored alike.
using CKRRegistryStringList = std::list<CKRString>;

// A rectangle in window pixels.
struct CKRScreenRect {
  int left = 0;
  int top = 0;
  int right = 0;
  int bottom = 0;
  bool operator==(const CKRScreenRect&) const = default;
};
