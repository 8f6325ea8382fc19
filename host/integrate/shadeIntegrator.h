// SPDX-License-Identifier: Apache-2.0
/// What the materials' `shade` shows.
#pragma once

#include "integrate/integrator.h"

namespace zsi::host {

/// The colour of a hit is what the material writes; all light transport is in its own queries.
class ShadeIntegrator final : public Integrator {
public:
    using Integrator::Integrator;
    Vec4f radiance(PathRay ray) override;
};

} // namespace zsi::host
