/// All shading functions of the Ward family, once, for every class of it.
///
/// A class derives from `WardFunctions<itself>`, states its rows with `WARD_CHANNELS` among them,
/// and forwards its four entry points. To put a pattern of its own in the place of a map it
/// declares one of the splice points with the same signature, which hides the one that reads
/// the map:
///   Vec4f diffuseMap(IShaderAPI*, ShadeState const&, Vec2f uv, Vec3f position) const
///   SLArray<float> normal0Heights(IShaderAPI*, ShadeState const&, SLArray<Vec3f> const& frame,
///                                 Vec2f uv, Vec3f position) const
///   float cutoutMap(IShaderAPI*, ShadeState const&, Vec2f uv, Vec3f position) const
#pragma once

#include "materials/ward/wardParameters.h"
#include "materials/ward/wardScattering.h"
#include "materials/ward/wardShading.h"

namespace zsi {

/// Empty: a class holds its vtable link and its parameters, nothing else.
template <class Shader>
struct WardFunctions : PhysicalShading<Shader>,
                       SafeReflectFunctions,
                       IndirectDiffuseFunctions,
                       AnisoRotationFunctions<Shader>,
                       WardLobeFunctions<Shader>,
                       WardNoiseFunctions<Shader>,
                       WardFrameFunctions<Shader>,
                       WardScatteringFunctions<Shader>,
                       WardShadingFunctions<Shader> {
};

inline constexpr int kWardEntryPoints = kShade | kTransmission | kTransfer | kSample;

} // namespace zsi
