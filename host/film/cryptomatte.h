// SPDX-License-Identifier: Apache-2.0
/// Layers that tell by name what a pixel shows, as Friedman and Jones (2015, "Fully automatic ID
/// mattes with support for motion blur and transparency") and version 1.2 of the published
/// Cryptomatte format have them: pairs of a name's number and its share of the pixel, the largest
/// share first.
#pragma once

#include "film/picture.h"

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace zsi::host {

inline constexpr std::size_t kCryptomatteRanks = 6; ///< pairs of a pixel, two in a layer

std::uint32_t murmurHash3(std::string_view text); ///< MurmurHash3_x86_32, seed 0
/// The hash of a name as a float that is neither denormal nor infinite nor NaN.
float cryptomatteId(std::string_view name);
/// "name00", "name01", ...
std::vector<std::string> cryptomatteLayers(std::string const& name);
/// What the file's header says about the layers of `name`; `names`: all that may be in them.
std::vector<Attachment> cryptomatteHeader(std::string const& name,
                                          std::vector<std::string> const& names);

} // namespace zsi::host
