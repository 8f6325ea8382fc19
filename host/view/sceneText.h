// SPDX-License-Identifier: Apache-2.0
/// Documents as people write them.
#pragma once

#include "view/document.h"

namespace zsi::view {

/// JSON with two spaces a level; what fits into a line of 100 characters and holds no objects of
/// its own stands in one.
std::string sceneText(Json const& document);

} // namespace zsi::view
