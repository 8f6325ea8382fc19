// SPDX-License-Identifier: Apache-2.0
/// Small pictures of texture files.
#pragma once

#include "texture/pictureFile.h"
#include "view/display.h"

namespace zsi::view {

/// Its longer side has `size` pixels, or as many as the picture has. Throws InputError that names
/// the file.
ShownPicture thumbnailOf(host::PictureSource const& source, int size);

} // namespace zsi::view
