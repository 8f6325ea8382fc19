// SPDX-License-Identifier: Apache-2.0
/// Pictures to files.
#pragma once

#include "film/picture.h"
#include "film/screenTransform.h"

#include <filesystem>

namespace zsi::host {

/// Whether a file of this name holds all layers of a picture; others hold the first.
bool keepsLayers(std::filesystem::path const& file);

/// Throws InputError when `writePicture` could not write there: unknown extension, no such folder,
/// no permission. For the time before a long rendering; leaves nothing behind.
void checkPictureFile(std::filesystem::path const& file);

/// Writes by extension. .exr: all layers in linear float, in their place in the frame (data window
/// inside display window) with the primaries' chromaticities. .hdr: linear RGB. .png and .jpg: 8
/// bits as `view` says; colours are written as they are over black, alpha beside them. What stands
/// there is whole or as it was (see ReplacedFile). Throws InputError, also as `screenTransform`
/// does.
void writePicture(std::filesystem::path const& file, Picture const& picture,
                  ScreenView const& view);

/// The bytes of such a file; of `file` only the extension counts.
std::vector<unsigned char> encodePicture(std::filesystem::path const& file, Picture const& picture,
                                         ScreenView const& view);

/// What `writePicture` has written to an .exr file, or another renderer: channels without a layer
/// are "beauty", which comes first. Throws InputError, also where the file has no R, G, B and A.
Picture readPicture(std::filesystem::path const& file);

} // namespace zsi::host
