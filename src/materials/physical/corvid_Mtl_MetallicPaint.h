// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "materials/physical/shared/materialSkeleton.h"
#include "materials/physical/shared/safeReflect.h"

#include <optional>

namespace zsi {

/// Car paint: a coloured base, metal or pearl flakes over a part of it, and a clear coat that may
/// have an orange peel.
#define METALLIC_PAINT(P, U, A)                                                                    \
    PHYSICAL_FRONT(P, U, A)                                                                        \
    P(int, u_finish, (0), "1: the coat has an orange peel, others: it is level", slider(0, 1),     \
      group("finish"))                                                                             \
    P(float, u_finishPeelamount, (0.05f), "slope of the orange peel", slider(0, 0.5f))             \
    P(Vec4f, u_pearlColor, (1.0f, 1.0f, 1.0f, 0.0f), "flakes met edge on: colour and amount")      \
    P(bool, u_baseMapEnable, (false), "base colour from the map", group("base"))                   \
    P(TextureSampler2D, u_baseMap, (), "base colour")                                              \
    P(Vec3f, u_baseColor, (0.02f, 0.05f, 0.2f), "base colour as seen under a coat, 0..1")          \
    U(Mat3f, u_baseTransform, "UV transform of the base colour map", when("u_baseMapEnable"),      \
      when("u_baseMap"))                                                                           \
    P(float, u_baseAmount, (1.0f), "multiplier of the base colour map", slider(0, 2))              \
    P(float, u_baseRoughValue, (0.3f), "relief of the base, 0 smooth to 1", slider(0, 1))          \
    P(float, u_flakeSize, (0.01f), "width of a flake, world units", slider(0, 0.1f), suits(5.0f),  \
      group("flakes"))                                                                             \
    P(float, u_flakeDensity, (0.6f), "share of the surface that flakes cover, 0..1", slider(0, 1)) \
    P(float, u_flakeSpread, (0.18f), "width of the flakes' slopes, 0 lie flat, to 1",              \
      slider(0, 1))                                                                                \
    P(float, u_flakeRoughValue, (0.08f), "width of the lobe of one flake, 0.01..1",                \
      slider(0.01f, 1))                                                                            \
    P(bool, u_flakeMapEnable, (false), "flake colour from the map")                                \
    P(TextureSampler2D, u_flakeMap, (), "flake colour")                                            \
    P(Vec3f, u_flakeColor, (0.3f, 0.45f, 0.75f), "colour of flakes met face on, 0..1")             \
    U(Mat3f, u_flakeTransform, "UV transform of the flake colour map", when("u_flakeMapEnable"),   \
      when("u_flakeMap"))                                                                          \
    P(float, u_flakeAmount, (1.0f), "multiplier of the flake colour map", slider(0, 2))            \
    P(float, u_coatReflectivity, (0.04f), "reflectance of the coat at normal incidence, 0..1",     \
      slider(0, 1), group("coat"))                                                                 \
    P(bool, u_coatRoughMapEnable, (false), "roughness of the coat from the map")                   \
    P(TextureSampler2D, u_coatRoughMap, (), "roughness in its red channel")                        \
    P(float, u_coatRoughValue, (0.02f), "width of the slopes of the coat, 0.001..0.5",             \
      slider(0.001f, 0.5f))                                                                        \
    U(Mat3f, u_coatRoughTransform, "UV transform of the roughness map",                            \
      when("u_coatRoughMapEnable"), when("u_coatRoughMap"))                                        \
    P(float, u_coatRoughAmount, (1.0f), "multiplier of the roughness map", slider(0, 2))

class FlakeFootprint;
class PaintLobe;
struct PaintColors;
struct PaintFrames;
struct PaintLayers;

class corvid_Mtl_MetallicPaint final : public MaterialShader,
                                       public PhysicalShading<corvid_Mtl_MetallicPaint>,
                                       public SafeReflectFunctions {
public:
    static constexpr bool kMaskSaturates = true;
    static constexpr Departure kDepartures[] = {
        {"reciprocity", "single flakes and an orange peel; the crowd of flakes holds it"}};

    SHADER(corvid_Mtl_MetallicPaint, kShade | kTransfer | kSample, METALLIC_PAINT)
    void shade(IShaderAPI* api, ShadeState& state) const override;
    void transfer(IShaderAPI* api, ShadeState& state) const override;
    void sample(IShaderAPI* api, ShadeState& state) const override;

    void f_calculateColors(IShaderAPI* api, ShadeState const& state, PhysicalColors& out) const;
    /// frame: of base and flakes, of the world-space normal as it is. peelFrame: of the coat, bent
    /// by the orange peel, which leaves its normal unnormalised.
    void f_computeShadingFrame(IShaderAPI* api, ShadeState const& state, Vec3f const& P,
                               Vec3f const& N, Mat3f const& toWorld, SLArray<Vec3f>& frame,
                               SLArray<Vec3f>& peelFrame) const;

private:
    struct Event;
    static bool draw(IShaderAPI* api, PaintLobe const& paint, PaintLayers layers, Event& event);
    static Vec3f traced(IShaderAPI* api, ShadeState const& state, PaintLobe const& paint,
                        PaintLayers layers);
    PaintFrames frames(IShaderAPI* api, ShadeState const& state, Vec3f const& Nf,
                       Vec3f const& V) const;
    FlakeFootprint footprint(IShaderAPI* api, ShadeState const& state) const;
    PaintColors colors(ShadeState const& state) const;
    float coatWidth(ShadeState const& state) const;
    std::optional<PaintLobe> lobe(IShaderAPI* api, ShadeState const& state) const;
};

} // namespace zsi
