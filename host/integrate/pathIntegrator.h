// SPDX-License-Identifier: Apache-2.0
/// Paths by the materials' `sample` and `transfer`.
#pragma once

#include "integrate/integrator.h"

namespace zsi::host {

/// Materials with both entry points are continued as paths; others are shaded and end them.
class PathIntegrator final : public Integrator {
public:
    using Integrator::Integrator;
    Vec4f radiance(PathRay ray) override;

private:
    /// What a path gathers and what remains of it.
    struct Path {
        Vec3f light{0, 0, 0};
        Vec3f throughput{1, 1, 1};
        bool straight = true; ///< still on the line of the ray that it began as
    };
    /// Adds the light at the surface and turns the ray; false when the path ends here.
    bool scatter(PathRay& ray, SurfacePoint const& surface, Path& path);
    Vec3f directLight(ShadingContext::Call& call);
    bool survives(PathRay const& ray, Path& path);
};

} // namespace zsi::host
