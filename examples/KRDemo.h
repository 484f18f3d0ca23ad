// The sections of the demo, one per subsystem, and what they share.
#pragma once

#include <krCoreLib/krCoreLib.h>

#include <cstdio>

// Prints a wide text as UTF-8 on standard output.
inline void Print(const CKRString& text) {
  std::fputs(text.ToUtf8().c_str(), stdout);
  std::fflush(stdout);
}

// Prints a heading for a section.
inline void PrintSection(const wchar_t* title) {
  Print(CKRString::Formatted(L"\n== %s ==\n\n", title));
}

void KRDemoObjectModel();
void KRDemoSerialization();
void KRDemoFramework();
void KRDemoTools();
void KRDemoUnits();
void KRDemoMath();
void KRDemoGeometry();
void KRDemoFiles();
void KRDemoThreads();
void KRDemoPlugins();
void KRDemoStorage();
void KRDemoRegistry();
