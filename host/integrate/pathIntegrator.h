// SPDX-License-Identifier: Apache-2.0
/// Paths by the materials' `sample` and `transfer`.
#pragma once

#include "integrate/integrator.h"

namespace zsi::host {

/// Materials whose samples are drawn from what `transfer` tells are continued as paths, with what
/// `shade` shows beside that; others are shaded and end them.
class PathIntegrator final : public Integrator {
public:
    using Integrator::Integrator;
    Vec4f radiance(PathRay ray) override;

private:
    /// What a path gathers and what remains of it.
    struct Path {
        Vec3f light{0, 0, 0};
        Vec3f throughput{1, 1, 1};
        /// What is left of the line of the ray that it began as: how clear all before it is. 0 once
        /// the path has turned.
        float open = 1.0f;
        float clear = 0.0f; ///< how clear all along branches of that line is

        int bends = 0;
        LightParts parts = {}; ///< of `light`

        void weigh(Vec3f weight, PathRay& ray);
        /// Light that arrives at the path's end.
        void add(Vec3f arrived, LightParts const& partsOfIt);
    };
    /// Adds the light at the surface and turns the ray; false when the path ends here.
    bool scatter(PathRay& ray, SurfacePoint const& surface, Path& path);
    /// Adds what `shade` shows beside; true when the ray goes straight on.
    bool passes(PathRay& ray, SurfacePoint const& surface, Path& path);
    /// Draws the ray on from the surface; false when there is none.
    bool draw(PathRay& ray, ShadingContext::Call& call, Path& path);
    Vec3f directLight(ShadingContext::Call& call);
    bool survives(PathRay& ray, Path& path);
};

} // namespace zsi::host
