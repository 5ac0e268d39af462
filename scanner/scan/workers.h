// SPDX-License-Identifier: MIT
// Where the programs that load plug-ins are installed.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "scanner/plan/run_list.h"

namespace scanner {

/// The first line that a program prints with --version; empty where it cannot be run or prints none in time.
std::string askVersion(const std::string& program);

/// Looks in `folders`, then beside this program, then where packages install them, one for each processor. A
/// program of that name that is not ours, or of another version, is left out with a sentence in `notes`.
/// `versionOf` answers as askVersion() does.
WorkersByProcessor findWorkers(const std::vector<std::string>& folders, std::vector<std::string>& notes,
                               const std::function<std::string(const std::string& program)>& versionOf);

/// The processor that this program was built for.
std::string ownProcessor();

/// The folders that findWorkers() looks in, for the sentence that says where there is none.
std::vector<std::string> workerFolders(const std::vector<std::string>& folders);

}  // namespace scanner
