// SPDX-License-Identifier: MIT
// The name and version that this host tells plug-ins.
#pragma once

#include <cstdint>
#include <string>

/// A version in three parts.
struct KelClientVersion {
  std::int32_t major = 0;
  std::int32_t minor = 0;
  std::int32_t third = 0;
};

/// Fills in the host's version: 8.0.0.
void GetHostVersion(KelClientVersion& version);

/// The bundle identifier of the application that starts this program, in reverse-DNS form.
std::string GetHostId();
