// Counted wide strings with the allocation semantics of the platform's COM
// strings (BSTR).
//
// A BSTR points at the first character of a NUL-terminated wide text that is
// preceded by its length in bytes (32 bits). The length, not the terminator,
// is authoritative: a BSTR may hold embedded NULs. The null BSTR is a valid
// empty string for every function below. A BSTR is owned by whoever receives
// it and is released with SysFreeString; the functions are thread-safe.
#pragma once

#include <krCoreLib/core/KRExport.h>

using BSTR = wchar_t*;

// Allocates a copy of the NUL-terminated text; null text gives null.
// Returns null when memory is exhausted.
KRCORELIB_API BSTR SysAllocString(const wchar_t* text) noexcept;

// Allocates `length` characters copied from `text` (which may hold NULs), or
// `length` zero characters when `text` is null. Returns null when memory is
// exhausted or the length is beyond what a BSTR can count.
KRCORELIB_API BSTR SysAllocStringLen(const wchar_t* text, unsigned int length) noexcept;

// Releases a string made by the functions above; null is ignored.
KRCORELIB_API void SysFreeString(BSTR text) noexcept;

// Number of characters in the string (0 for null).
KRCORELIB_API unsigned int SysStringLen(BSTR text) noexcept;

// Number of bytes in the string, terminator excluded (0 for null).
KRCORELIB_API unsigned int SysStringByteLen(BSTR text) noexcept;
