// SPDX-License-Identifier: Apache-2.0
/// Pictures to files.
#pragma once

#include "film/picture.h"

#include <filesystem>

namespace zsi::host {

/// How a linear picture becomes 8 bits for a screen.
struct ScreenView {
    float exposure = 0.0f; ///< stops
    bool alpha = false; ///< PNG alone: with the picture's alpha; otherwise it is opaque
};

/// Whether a file of this name holds all layers of a picture; others hold the first.
bool keepsLayers(std::filesystem::path const& file);

/// Throws InputError when `writePicture` could not write there: unknown extension, no such folder,
/// no permission. For the time before a long rendering; leaves nothing behind.
void checkPictureFile(std::filesystem::path const& file);

/// Writes by extension. .exr: all layers in linear float, in their place in the frame (data window
/// inside display window). .hdr: linear RGB. .png and .jpg: 8-bit sRGB as `view` says; colours are
/// written as they are over black, alpha beside them. What stands there is whole or as it was (see
/// ReplacedFile). Throws InputError.
void writePicture(std::filesystem::path const& file, Picture const& picture,
                  ScreenView const& view);

} // namespace zsi::host
