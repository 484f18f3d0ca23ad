// Dynamic loading of modules: the system's loader, its lookup of exported
// functions and its own error texts.
//
// Paths are UTF-8. Modules are loaded with every reference resolved at once
// and with their symbols kept to themselves (RTLD_NOW | RTLD_LOCAL), so
// that two modules exporting the same names do not bind to each other.
// Nothing here throws.
//
// A module's initialisation (its static constructors) runs inside the
// loader, and the language ends the process when one of them throws; a
// constructor may as well crash. Before a file is loaded into the process
// for the first time, Load therefore tries it in a short-lived child
// process and refuses it when that child does not come back from the
// loader in good order. The verdict is remembered per file identity
// (device, inode, size and modification time), so reloading an unchanged
// file costs one stat. TryAll tries a whole folder's files in one child
// (a new child continues after a file that ended one), so that a folder
// costs one process rather than one per file. The trial needs a process that may fork: it is meant
// for the thread that loads modules, with no other thread loading modules
// at the same time.
#pragma once

#include <string>
#include <vector>

struct SKRModuleLoader {
  // Loads the module at `path`: its handle, or null with `error` set to the
  // loader's text ("<path>: cannot open shared object file: ..."), or to
  // the reason the trial load failed.
  static void* Load(const char* path, std::string& error);
  // The address of the exported function `name` of a loaded module, or null
  // with `error` set to the loader's text ("<path>: undefined symbol: ...").
  static void* FindExport(void* module, const char* name, std::string& error);
  // Tries in advance every file of `paths` whose identity has no verdict
  // yet, in order, in as few child processes as their failures allow.
  static void TryAll(const std::vector<std::string>& paths);
  // Unloads a module loaded by Load; null is ignored.
  static void Unload(void* module) noexcept;
  // Forgets the remembered verdicts (tests).
  static void ForgetTrials() noexcept;
};
