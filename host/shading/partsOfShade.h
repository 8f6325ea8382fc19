// SPDX-License-Identifier: Apache-2.0
/// Tells apart what a material's `shade` made of the light that it asked for.
#pragma once

#include "shading/shadingContext.h"

namespace zsi::host {

/// Calls the material's `shade` for a hit of depth 0 or 1, whose results `call.state` then has, and
/// gives the parts of the colour. `shade` is a function of what the services answer: it is called
/// again with the same answers, from which the environment, then what was given off, then what came
/// from several surfaces and last all light are left out; each part is the difference that it made.
/// So parts add up to the colour whatever `shade` does. Ambient light counts as that of several
/// surfaces; what is left when nothing arrives is what the surface gives off itself. Of a hit of
/// depth 1 the parts tell only what came straight, as emission.
LightParts shadeInParts(ShadingContext& context, ShadingContext::Call& call);

} // namespace zsi::host
