// SPDX-License-Identifier: Apache-2.0
/// The noises of a shading call, which depend on their arguments alone.
#pragma once

#include "shading/noise.h"

#include <zsi/shaderApi.h>

namespace zsi::host {

class NoiseServices : public IShaderAPI {
public:
    float cellNoise1D(float x) override { return host::cellNoise1D(x); }
    float noise2D(Vec2f const* p) override { return host::noise2D(*p); }
    float noise3DPoint(Vec3f const* p) override { return signedNoise3D(*p); }
    float noise3D(Vec4f const* pointAndPhase) override { return noise4D(*pointAndPhase); }
    float noise3DRecord(Vec3f const* p) override { return host::noise3D(*p); }
    Vec3f cellNoise3D(Vec3f const* p) override { return host::cellNoise3D(*p); }

protected:
    ~NoiseServices() = default;
};

} // namespace zsi::host
