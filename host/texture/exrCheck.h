// SPDX-License-Identifier: Apache-2.0
/// Whether the header of an EXR file fits what follows it.
#pragma once

#include <filesystem>
#include <string>

namespace zsi::host {

/// What is wrong with an EXR file before its pixels are read: tiles that take gigabytes for a few
/// pixels, or a first block of another size than the header makes it. Readers take memory for the
/// one, and show what happens to lie in it for the other. Empty: nothing, or another kind of file.
std::string whatIsWrongWithExr(std::filesystem::path const& file);

} // namespace zsi::host
