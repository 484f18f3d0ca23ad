// Symbol visibility and version of the krCoreLib shared library.
//
// The library is built with hidden visibility; every public class and function
// carries KRCORELIB_API so that exactly the documented interface is exported.
// On ELF platforms exporting and importing use the same attribute, so users of
// the installed headers need not define anything.
//
// Constants that headers define (inline constexpr IDs, flags) are hidden:
// an exported inline variable becomes a process-wide unique symbol, and the
// dynamic loader never unmaps a module that defines one, so a plug-in that
// used such a constant could never be unloaded. Each module keeps its own
// copy instead; a plug-in's own shared constants follow the same rule
// (KRCORELIB_LOCAL, or a plain constexpr).
#pragma once

#if defined(__GNUC__) || defined(__clang__)
#define KRCORELIB_API __attribute__((visibility("default")))
#define KRCORELIB_LOCAL __attribute__((visibility("hidden")))
#else
#define KRCORELIB_API
#define KRCORELIB_LOCAL
#endif

#define KRCORELIB_VERSION_MAJOR 1
#define KRCORELIB_VERSION_MINOR 0
#define KRCORELIB_VERSION_PATCH 0
