// SPDX-License-Identifier: MIT
#include "driver/instance.h"

#include "driver/report.h"

void deleteAndNew(NiduCOM::i_ptr<VSTPluginLoader> loader, const VST_loadID& loadID,
                  std::unique_ptr<VSTWrapper>& wrapper, bool announce) {
  if (announce) printStep("initialize");
  std::unique_ptr<VSTWrapper> old(VSTWrapper::New(loader, VST_ChildSpec(loadID), nullptr));
  wrapper.swap(old);
  closeInstance(old);
}

void closeInstance(std::unique_ptr<VSTWrapper>& wrapper) {
  // NOLINTNEXTLINE(readability-uniqueptr-delete-release): reset() is noexcept, an exception would terminate
  delete wrapper.release();
}
