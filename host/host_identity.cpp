// SPDX-License-Identifier: MIT
#include "host/host_identity.h"

void GetHostVersion(KelClientVersion& version) { version = {8, 0, 0}; }

std::string GetHostId() { return "com.nidu.kel"; }
