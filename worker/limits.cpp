// SPDX-License-Identifier: MIT
#include "worker/limits.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <limits>

#include <sys/resource.h>

#include "platform/parent_death.h"

namespace {

bool lowerLimit(int resource, std::uint64_t wanted) {
  struct rlimit limit = {};
  if (getrlimit(resource, &limit) != 0) return false;
  const std::uint64_t most = std::numeric_limits<rlim_t>::max();
  limit.rlim_max = std::min(limit.rlim_max, static_cast<rlim_t>(std::min(wanted, most)));
  limit.rlim_cur = std::min(limit.rlim_cur, limit.rlim_max);
  return setrlimit(resource, &limit) == 0;
}

}  // namespace

bool limitThisProcess(const WorkerOptions& options, std::string& whyNot) {
  if (options.parent && !endWithParent(*options.parent)) {
    whyNot = "this system does not end a process with its parent";
    return false;
  }
  const bool isLimited = (!options.withoutCore || lowerLimit(RLIMIT_CORE, 0)) &&
                         (!options.fileSizeLimit || lowerLimit(RLIMIT_FSIZE, *options.fileSizeLimit)) &&
                         (!options.memoryLimit || lowerLimit(RLIMIT_AS, *options.memoryLimit));
  if (!isLimited) whyNot = std::string("cannot lower a limit: ") + std::strerror(errno);
  return isLimited;
}
