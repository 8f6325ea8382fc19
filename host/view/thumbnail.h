// SPDX-License-Identifier: Apache-2.0
/// Small pictures of texture files.
#pragma once

#include "view/display.h"

#include <filesystem>

namespace zsi::view {

/// Its longer side has `size` pixels, or as many as the picture has. Throws InputError that names
/// the file.
ShownPicture thumbnailOf(std::filesystem::path const& file, int size);

} // namespace zsi::view
