// SPDX-License-Identifier: Apache-2.0
/// Pictures of half the samples each, beside the whole picture in one file. What differs between
/// them is noise.
#pragma once

#include "film/picture.h"

#include <array>
#include <optional>

namespace zsi::host {

/// Puts the layers of both halves behind those of `picture`: "halfA" (the beauty), "halfA.albedo",
/// ..., "halfB", ...
void appendHalves(Picture& picture, std::array<Picture, 2> halves);
/// What `appendHalves` has put there; nothing where a half is missing.
std::optional<std::array<Picture, 2>> halvesOf(Picture const& picture);

} // namespace zsi::host
