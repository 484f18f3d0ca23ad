// A tour of krCoreLib: what a host application does with the library, one
// section per subsystem.
#include "KRDemo.h"

int main() {
  Print(L"krCoreLib demo\n");
  PrintSection(L"Object model");
  KRDemoObjectModel();
  PrintSection(L"Fields and storable objects");
  KRDemoSerialization();
  PrintSection(L"Graphs, walks and preferences");
  KRDemoFramework();
  PrintSection(L"Models, views and tools");
  KRDemoTools();
  PrintSection(L"XML storage: a graph and preferences in one file");
  KRDemoStorage();
  PrintSection(L"Registry storage");
  KRDemoRegistry();
  PrintSection(L"Units and engineering values");
  KRDemoUnits();
  PrintSection(L"Math in two precisions");
  KRDemoMath();
  PrintSection(L"Geometry: exact orientation and triangulation");
  KRDemoGeometry();
  PrintSection(L"Paths, files and mapped memory");
  KRDemoFiles();
  PrintSection(L"Threads and locks");
  KRDemoThreads();
  PrintSection(L"Plug-ins, sockets and menus");
  KRDemoPlugins();

  // Shutdown: the type system, then the process-wide singletons.
  CKRTypeSystem::Release();
  CKRSingleton::ReleaseAll();
  return 0;
}
