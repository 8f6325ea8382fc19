// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "environments/iblParameters.h"
#include "runtime/shaderTable.h"

namespace zsi {

/// Environment for compositing: camera rays see a picture fixed to the screen, or a cube map
/// through a window before the camera, at alpha 0; the graded cubes light the scene.
#define ENV_BACKPLATE(P, U, A)                                                                     \
    IBL_GRADING(P, U, A)                                                                           \
    P(bool, useBackgroundImage, (false), "camera rays see the backplate, not backgroundColor")     \
    P(bool, useCubeBackplate, (false), "backplate from backplateCube, not from backgroundImage")   \
    P(bool, useCubeReflection, (true), "reflection rays see the graded reflectionCube")            \
    P(Vec3f, backgroundColor, (0.0f, 0.5f, 0.7f), "what other rays see, linear RGB, alpha 0")      \
    P(TextureSampler2D, backgroundImage, (), "backplate that is fixed to the screen")              \
    P(TextureSamplerCube, reflectionCube, (), "environment of reflection rays")                    \
    P(TextureSamplerCube, diffuseCube, (), "environment of diffuse rays")                          \
    P(TextureSamplerCube, backplateCube, (), "backplate that is seen through the camera window")   \
    P(float, backplateCloseUp, (1.0f), "zoom: divides the camera window, not 0", slider(0.1f, 10)) \
    P(float, backplateHorizon, (0.0f), "upward shift of the camera window", slider(-1, 1))         \
    P(Vec2f, camerawindowsize, (1.0f, 1.0f), "width and height of the camera window, distance 1")  \
    U(Mat4f, backplatetransform, "placement of the camera window; its 3x3 block, as rows",         \
      when("useBackgroundImage"), when("useCubeBackplate"), when("backplateCube"))                 \
    U(Mat3f, backplateCubeRotation, "rotation before the lookup in backplateCube",                 \
      when("useBackgroundImage"), when("useCubeBackplate"), when("backplateCube"))                 \
    P(Vec2f, uv_scale, (1.0f, 1.0f), "from raster position in pixels to image coordinates")        \
    P(Vec2f, uv_offset, (0.0f, 0.0f), "added after scaling; the cube's window subtracts its y")    \
    P(Vec2f, render_size, (-1.0f, -1.0f), "pixels; a height below 0 takes the host's. x is unused")

class corvid_Env_Backplate final : public EnvironmentShader {
public:
    SHADER(corvid_Env_Backplate, kEnvironmentShade, ENV_BACKPLATE)
    void shade(IShaderAPI* api, ShadeState& state) const override;

private:
    Vec3f screenPlate(ShadeState const& state) const;
    Vec3f cubePlate(ShadeState const& state) const;
};

} // namespace zsi
