// SPDX-License-Identifier: Apache-2.0
/// Names in the dynamic symbol table of a shared object, read from the file.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

namespace zsi::host {

/// The functions that the shared object defines and exports, in the file's order. The file is only
/// read, no code of it runs. Throws InputError when it cannot be read, is no shared object that
/// this machine could load, or is damaged.
std::vector<std::string> exportedFunctions(std::filesystem::path const& sharedObject);

} // namespace zsi::host
