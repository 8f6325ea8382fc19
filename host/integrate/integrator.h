// SPDX-License-Identifier: Apache-2.0
/// How light is gathered along camera rays.
#pragma once

#include "integrate/features.h"
#include "shading/shadingContext.h"

namespace zsi::host {

/// What is to be known of a camera sample beside its colour. Knowing it takes time and does not
/// change the colour.
struct SampleWants {
    bool parts = false; ///< CameraSample::parts
    bool feature = false; ///< CameraSample::feature
};

/// What one camera sample brought: its colour, and what layers of the film show beside it.
struct CameraSample {
    Vec4f color; ///< linear RGB and alpha
    bool isFinite; ///< false: the sample does not count
    SurfacePoint const* surface; ///< first seen; null where no surface is
    float distance; ///< to `surface` from the camera
    LightParts parts = {}; ///< of `color`, where asked for
    Feature feature = {}; ///< where asked for
    float shaderId = 0.0f, objectId = 0.0f; ///< of `surface`, as film/cryptomatte.h has them

    Vec3f indirect() const { return rgb(color) - parts.sum(); }
};

/// One thread's integrator. An implementation answers `radiance`: for camera rays, and for the rays
/// that the shading services send out on behalf of materials. Where the context keeps `parts`, it
/// leaves there those of what it answers.
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
                        Sampler& sampler, SampleWants wants = {});

    ShadingContext const& context() const { return context_; }

protected:
    ShadingContext context_;
};

} // namespace zsi::host
