/// Pictures to files.
#pragma once

#include "render/render.h"

#include <filesystem>

namespace zsi::host {

/// Throws InputError when `writePicture` could not write there: unknown extension, no such folder,
/// no permission. For the time before a long rendering; leaves nothing behind.
void checkPictureFile(std::filesystem::path const& file);

/// Writes by extension: .exr and .hdr linear float, .png and .jpg 8-bit sRGB after `exposure`
/// stops (PNG keeps alpha, not premultiplied away: colour is written as it is over black).
/// Written beside and renamed, so that nothing half-written is left. Throws InputError.
void writePicture(std::filesystem::path const& file, Picture const& picture, float exposure);

} // namespace zsi::host
