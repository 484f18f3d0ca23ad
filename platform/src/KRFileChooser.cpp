#include <krCoreLib/platform/KRFileChooser.h>

namespace {

struct SKRInstalledChooser {
  SKRFileChooser::Chooser m_pChooser = &SKRFileChooser::Cancel;
  void* m_pContext = nullptr;
};

SKRInstalledChooser& Installed() {
  static SKRInstalledChooser s_Installed;
  return s_Installed;
}

}  // namespace

SKRFileChooser::Chooser SKRFileChooser::SetChooser(Chooser chooser, void* context) {
  SKRInstalledChooser& installed = Installed();
  const Chooser previous = installed.m_pChooser;
  installed.m_pChooser = chooser != nullptr ? chooser : &SKRFileChooser::Cancel;
  installed.m_pContext = chooser != nullptr ? context : nullptr;
  return previous;
}

bool SKRFileChooser::Choose(const SKRFileChooserRequest& request, std::wstring& path) {
  const SKRInstalledChooser& installed = Installed();
  path.clear();
  return installed.m_pChooser(request, path, installed.m_pContext) && !path.empty();
}

bool SKRFileChooser::Cancel(const SKRFileChooserRequest&, std::wstring&, void*) {
  return false;
}
