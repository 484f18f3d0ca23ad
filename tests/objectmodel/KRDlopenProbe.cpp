// A C++ host that does not link the library loads a plug-in built on it,
// unloads it, and checks that the plug-in is gone (the library it brought
// may stay: it defines process-wide unique symbols, as libstdc++ does):
//   kr_dlopen_probe MODULE
// Exit status 0 on success; the reason on standard error otherwise.
#include <dlfcn.h>

#include <iostream>
#include <string>

int main(int argc, char** argv) {
  if (argc != 2)
    return 2;
  const std::string path = argv[1];
  void* module = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
  if (module == nullptr) {
    std::cerr << "dlopen: " << dlerror() << "\n";
    return 1;
  }
  if (dlclose(module) != 0)
    return 1;
  if (void* still = dlopen(path.c_str(), RTLD_NOW | RTLD_NOLOAD)) {
    std::cerr << path << " stays mapped after dlclose\n";
    dlclose(still);
    return 1;
  }
  return 0;
}
