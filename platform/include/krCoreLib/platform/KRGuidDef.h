// The platform GUID structure: 128 bits in four fields, standard layout.
//
// Stored archives contain the in-memory byte image of this structure (Data1,
// Data2 and Data3 least significant byte first, then Data4[0..7]), so its
// layout is fixed and checked below.
#pragma once

#include <cstdint>

#ifndef GUID_DEFINED
#define GUID_DEFINED
struct GUID {
  std::uint32_t Data1;
  std::uint16_t Data2;
  std::uint16_t Data3;
  std::uint8_t Data4[8];
};
#endif

static_assert(sizeof(GUID) == 16, "GUID is exactly 128 bits");
