// SPDX-License-Identifier: MIT
#include "describer/describe_bundle.h"

#include <memory>

#include "describer/description_json.h"
#include "describer/plugin_description.h"
#include "driver/crash_guard.h"
#include "driver/instance.h"
#include "driver/report.h"

namespace {

/// The name of a plug-in that gives none: that of its file, without the extension.
std::string nameOfBundle(const std::string& path) {
  const std::size_t end = path.find_last_not_of('/');
  const std::string plain = path.substr(0, end == std::string::npos ? 0 : end + 1);
  const std::size_t slash = plain.rfind('/');
  const std::string file = slash == std::string::npos ? plain : plain.substr(slash + 1);
  const std::size_t point = file.rfind('.');
  return point == std::string::npos || point == 0 ? file : file.substr(0, point);
}

DescribedBundle loadAndDescribe(const std::string& path, const VST_loadID& loadID) {
  const VST_DLL_Info dllInfo(path, nameOfBundle(path).c_str());
  const NiduCOM::i_ptr<VSTPluginLoader> loader = VSTPluginLoader::demandLoadedPlugin(dllInfo);
  std::unique_ptr<VSTWrapper> wrapper;
  deleteAndNew(loader, loadID, wrapper, false);
  if (wrapper == nullptr) crashOnPurpose();

  gCurTest = "gather info";
  const PluginDescription description(*wrapper, VST_Class_Spec(dllInfo, VST_ChildSpec(loadID)));
  closeInstance(wrapper);
  return {description.info.isShell, descriptionAsJson(description)};
}

}  // namespace

std::optional<DescribedBundle> describeBundle(const std::string& path, const VST_loadID& loadID) {
  gCurTest = "create and initialize";
  try {
    return loadAndDescribe(path, loadID);
  } catch (int code) {
    printFailure(code);
  } catch (...) {
    printFailure();
  }
  return std::nullopt;
}
