// SPDX-License-Identifier: Apache-2.0
/// How light is gathered along camera rays.
#pragma once

#include "shading/shadingContext.h"

namespace zsi::host {

/// What one camera sample brought: its colour, and what layers of the film show beside it.
struct CameraSample {
    Vec4f color; ///< linear RGB and alpha
    bool isFinite; ///< false: the sample does not count
    SurfacePoint const* surface; ///< first seen; null where no surface is
    float distance; ///< to `surface` from the camera
};

/// One thread's integrator. An implementation answers `radiance`: for camera rays, and for the rays
/// that the shading services send out on behalf of materials.
class Integrator : public RadianceSource {
public:
    /// `scene` must outlive this.
    explicit Integrator(PreparedScene const& scene)
        : context_(scene, *this)
    {
    }
    virtual ~Integrator() = default;
    Integrator(Integrator const&) = delete;
    Integrator& operator=(Integrator const&) = delete;

    /// Light along a camera ray through raster position (x, y), pixels. Draws from `sampler`. The
    /// result holds until the next call.
    CameraSample sample(Vec3f origin, Vec3f direction, float rasterX, float rasterY,
                        Sampler& sampler);

    ShadingContext const& context() const { return context_; }

protected:
    ShadingContext context_;
};

} // namespace zsi::host
