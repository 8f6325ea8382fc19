// SPDX-License-Identifier: Apache-2.0
#include "view/sceneText.h"

#include "json/jsonText.h"

namespace zsi::view {

std::string sceneText(Json const& document) { return host::jsonText(toTree(document, {})); }

} // namespace zsi::view
