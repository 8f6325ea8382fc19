// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "environments/channelGrading.h"
#include "environments/textureMapping.h"
#include "materials/legacy/glossyLobe.h"
#include "materials/legacy/layerAlbedo.h"
#include "materials/physical/shared/ambientOcclusion.h"
#include "materials/physical/shared/masking.h"

namespace zsi {

// Mapping modes throughout: -1 black, 0 colour, 1 UV, 2 planar, 3 box, 4 angular. A texture matrix
// takes the reference position to texture space in modes 2 to 4, a UV matrix the uv in mode 1.
// Gain sources: 0 value, 1 colour per channel, 2 colour times luminance; the value scales all.

#define LEGACY_LIGHT(P, U, A)                                                                \
    P(Vec3f, shadowColor, (0.0f, 0.0f, 0.0f), "factor on a light that full shadow tends to", \
      group("light"))                                                                        \
    P(float, shadowIntensity, (1.0f), "strength of received shadow, 0..1", slider(0, 1))     \
    P(bool, reverseNormal, (false), "flip the shading normal, and inside with outside")      \
    P(bool, faceForward, (false), "turn the shading normal towards the viewer")              \
    P(bool, faceLight, (false), "lights count from either side of the surface")              \
    P(bool, showNormalsOnly, (false), "show which way normals face")                         \
    AMBIENT_OCCLUSION_SWITCHES(P, U, A)

#define LEGACY_DIFFUSE(P, U, A)                                                                   \
    P(Vec3f, diffuseColor, (0.0f, 0.0f, 1.0f), "colour of mode 0; blue stands out",               \
      group("diffuse"))                                                                           \
    P(int, diffuseMode, (0), "mapping mode", slider(-1, 4))                                       \
    P(TextureSampler2D, diffuseTexture, (), "diffuse map; its alpha for transparencyFromDiffuse") \
    U(Mat4f, diffuseTextureMatrix, "reference position to texture space",                         \
      when("diffuseMode", 2, 4), when("diffuseTexture"))                                          \
    P(float, diffuseAngularRepeat, (1.0f), "repeats around the axis, mode 4", slider(0, 16),      \
      when("diffuseMode", 4, 4))                                                                  \
    U(Mat3f, diffuseUVMatrix, "UV transform", when("diffuseMode", 1, 1), when("diffuseTexture"))  \
    P(Vec3f, diffuseIBLGainColor, (1.0f, 1.0f, 1.0f), "diffuseIBLCube here: gain colour")         \
    P(Vec3f, diffuseIBLContrastPivot, (1.0f, 1.0f, 1.0f), "diffuseIBLCube here: contrast pivot")  \
    P(float, diffuseIBLContrastValue, (1.0f), "diffuseIBLCube here: contrast, 1 unchanged",       \
      slider(0, 2))                                                                               \
    P(int, diffuseIBLGainSource, (0), "diffuseIBLCube here: gain source", slider(0, 2))           \
    P(float, diffuseLightGainValue, (1.0f), "scales what lights add to the diffuse", slider(0, 4))

#define LEGACY_SPECULAR(P, U, A)                                                                \
    P(Vec3f, specularColor, (0.5f, 0.5f, 0.5f), "first highlight: colour of mode 0",            \
      group("highlights"))                                                                      \
    P(Vec3f, specularREG, (0.66f, 0.33f, 1.0f), "first: roll-off, eccentricity 0..1, gain")     \
    P(Vec3f, specular2REG, (0.66f, 0.33f, 1.0f), "second: roll-off, eccentricity 0..1, gain")   \
    P(int, specularMode, (0), "mapping mode of the first highlight's colour", slider(-1, 4))    \
    P(TextureSampler2D, specularTexture, (), "map of the first highlight's colour")             \
    U(Mat4f, specularTextureMatrix, "reference position to texture space",                      \
      when("specularMode", 2, 4), when("specularTexture"))                                      \
    P(float, specularAngularRepeat, (1.0f), "repeats around the axis, mode 4", slider(0, 16),   \
      when("specularMode", 4, 4))                                                               \
    P(Vec3f, specular2Color, (0.5f, 0.5f, 0.5f), "second highlight: colour")                    \
    U(Mat3f, specularUVMatrix, "UV transform", when("specularMode", 1, 1),                      \
      when("specularTexture"))                                                                  \
    P(Vec3f, specularIBLGainColor, (1.0f, 1.0f, 1.0f), "specularIBLCube here: gain colour")     \
    P(Vec3f, specularIBLContrastPivot, (1.0f, 1.0f, 1.0f), "specularIBLCube here: pivot")       \
    P(float, specularIBLContrastValue, (1.0f), "specularIBLCube here: contrast, 1 unchanged",   \
      slider(0, 2))                                                                             \
    P(int, specularIBLGainSource, (0), "specularIBLCube here: gain source", slider(0, 2))       \
    P(float, specularLightGainValue, (1.0f), "scales what lights add to the first highlight",   \
      slider(0, 4))                                                                             \
    P(float, specular2LightGainValue, (1.0f), "scales what lights add to the second highlight", \
      slider(0, 4))

#define LEGACY_TRANSPARENCY(P, U, A)                                                              \
    P(Vec3f, transparencyColor, (0.8f, 0.8f, 0.8f), "of mode 0: 0 opaque, 1 clear",               \
      group("transparency"))                                                                      \
    P(int, transparencyMode, (0), "mapping mode; -1 opaque", slider(-1, 4))                       \
    P(TextureSampler2D, transparencyTexture, (), "transparency map")                              \
    U(Mat4f, transparencyTextureMatrix, "reference position to texture space",                    \
      when("transparencyMode", 2, 4), when("transparencyTexture"))                                \
    P(float, transparencyAngularRepeat, (1.0f), "repeats around the axis, mode 4", slider(0, 16), \
      when("transparencyMode", 4, 4))                                                             \
    P(bool, transparencyInvert, (false), "1 opaque, 0 clear")                                     \
    P(bool, transparencyFromDiffuse, (false), "alpha of the diffuse map, else diffuse colour")    \
    U(Mat3f, transparencyUVMatrix, "UV transform", when("transparencyMode", 1, 1),                \
      when("transparencyTexture"))                                                                \
    P(bool, transparencyBlocksHighlights, (false), "no reflection or highlight where clear")

#define LEGACY_BUMP(P, U, A)                                                                     \
    P(int, bumpMode, (-1), "mapping mode; below 1 none", slider(-1, 4), group("bump"))           \
    P(TextureSampler2D, bumpTexture, (), "tangent-space normal map, linear")                     \
    U(Mat4f, bumpTextureMatrix, "reference position to texture space", when("bumpMode", 2, 4),   \
      when("bumpTexture"))                                                                       \
    U(Mat4f, bumpTextureMatrixInverse, "inverse of bumpTextureMatrix, mode 4",                   \
      when("bumpMode", 4, 4), when("bumpTexture"))                                               \
    P(float, bumpAngularRepeat, (1.0f), "repeats around the axis, mode 4", slider(0, 16),        \
      when("bumpMode", 4, 4))                                                                    \
    P(float, bumpDepth, (1.0f), "scales the slopes; 0 none, negative inside out", slider(-4, 4)) \
    U(Mat3f, bumpUVMatrix, "UV transform", when("bumpMode", 1, 1), when("bumpTexture"))

#define LEGACY_REFLECTION(P, U, A)                                                                 \
    P(Vec3f, reflectivityColor, (0.0f, 0.0f, 0.0f), "mirrored share, linear RGB, 0..1",            \
      group("reflection"))                                                                         \
    P(bool, useUniformReflectivity, (true), "the same from everywhere, without fresnel")           \
    P(Vec4f, fresnel, (0.0f, 0.0f, 0.0f, 0.0f), "factor: base, scale, exponent, ceiling")          \
    P(bool, reflectLight, (false), "mirror lights too, as wide as surfaceRoughness")               \
    P(Vec3f, reflectIBLGainColor, (1.0f, 1.0f, 1.0f), "reflectionCubeIBL here: gain colour")       \
    P(int, reflectIBLGainSource, (0), "reflectionCubeIBL here: gain source", slider(0, 2))         \
    P(float, reflectIBLGainValue, (1.0f), "reflectionCubeIBL here: gain", slider(0, 4))            \
    P(TextureSamplerCube, reflectionCubeIBL, (), "what is mirrored with useReflectionCubeIBL")     \
    P(bool, useReflectionCubeIBL, (false), "mirror the cube where there is one, not the scene")    \
    P(float, surfaceRoughness, (0.0f), "width of mirrored and refracted rays, 0..1", slider(0, 1)) \
    P(float, refractiveIndex, (1.0f), "of the body behind; 1 does not bend", slider(1, 3))         \
    P(float, simulatedThickness, (0.0f), "world units; above 0 a pane that absorbs, not a body",   \
      slider(0, 10))

#define LEGACY_IBL(P, U, A)                                                                      \
    P(int, IBLDiffMode, (-1), "diffuse: -1 the host's light, 0 the cube instead, 1 both",        \
      slider(-1, 1), group("image-based light"))                                                 \
    P(int, IBLSpecMode, (-1), "highlights: -1 the host's light, 0 the cube instead, 1 both",     \
      slider(-1, 1))                                                                             \
    P(float, diffuseIBLGainValue, (1.0f), "diffuseIBLCube here: gain", slider(0, 4))             \
    P(float, specularIBLGainValue, (1.0f), "specularIBLCube here: gain", slider(0, 4))           \
    P(TextureSamplerCube, diffuseIBLCube, (), "light on a white surface that faces a direction") \
    P(TextureSamplerCube, specularIBLCube, (), "blurred surroundings")                           \
    GLOBAL_IBL(P, U, A, whenAny("diffuseIBLCube", "specularIBLCube", "reflectionCubeIBL"))       \
    LEGACY_IBL_CHANNEL(P, diffuse, "diffuseIBLCube")                                             \
    LEGACY_IBL_CHANNEL(P, specular, "specularIBLCube")                                           \
    LEGACY_IBL_CHANNEL(P, reflect, "reflectionCubeIBL")

#define LEGACY_IBL_CHANNEL(P, channel, cube)                                                \
    P(Vec3f, channel##IBLChannelContrastPivot, (1.0f, 1.0f, 1.0f), cube ": contrast pivot", \
      group(cube))                                                                          \
    P(float, channel##IBLChannelContrastValue, (1.0f), cube ": contrast, 1 unchanged",      \
      slider(0, 2))                                                                         \
    P(Vec3f, channel##IBLChannelGainColor, (1.0f, 1.0f, 1.0f), cube ": gain colour")        \
    P(int, channel##IBLChannelGainSource, (0), cube ": gain source", slider(0, 2))          \
    P(float, channel##IBLChannelGainValue, (1.0f), cube ": gain", slider(0, 4))             \
    P(float, channel##IBLChannelSatValue, (1.0f), cube ": saturation, 1 unchanged, 0 grey", \
      slider(0, 2), groupEnd())

#define LEGACY_OUTPUT(P, U, A)                                                                 \
    P(Vec3f, absorbanceRGB, (-1.0f, -1.0f, -1.0f), "of a pane, 1/world unit; -1 swallows all", \
      group("output"))                                                                         \
    P(bool, useAlpha, (true), "alpha tells what is seen behind; else it is 1")                 \
    P(float, globalIllumIntensity, (1.0f), "scales the host's indirect light on the diffuse",  \
      slider(0, 2))                                                                            \
    P(bool, unlitSurface, (false), "plain diffuse colour, not lit; clear and masked as told")  \
    P(bool, selfIlluminance, (false), "the diffuse colour shines, on top of its light")        \
    P(bool, usingHDRbuffer, (false), "keep values beyond 0..1")                                \
    P(bool, triplanarXY, (false), "mode 3 projects along z of texture space from everywhere")

/// All-purpose surface of older scenes: diffuse, two highlights, reflection, transparency,
/// refraction, bump and mask, each with a map or an image-based light of its own.
#define MARLOW_LEGACY(P, U, A)       \
    LEGACY_LIGHT(P, U, A)            \
    LEGACY_DIFFUSE(P, U, A)          \
    LEGACY_SPECULAR(P, U, A)         \
    LEGACY_TRANSPARENCY(P, U, A)     \
    LEGACY_BUMP(P, U, A)             \
    MASKING(P, U, A)                 \
    LEGACY_REFLECTION(P, U, A)       \
    LEGACY_IBL(P, U, A)              \
    AMBIENT_OCCLUSION_BAKED(P, U, A) \
    LEGACY_OUTPUT(P, U, A)           \
    A(Vec2f, uv)                     \
    A(Vec2f, uv1)                    \
    A(Vec3f, tangent)                \
    A(Vec3f, bitangent)              \
    A(Vec4f, vtxcolor)

class MarlowLegacy final : public MaterialShader,
                           public TriplanarMappingFunctions,
                           public AmbientOcclusionFunctions<MarlowLegacy> {
public:
    static constexpr Departure kDepartures[] = {
        {"reciprocity", "highlights and the base under them follow the viewer's direction"}};

    SHADER(MarlowLegacy, kShade | kTransmission | kTransfer | kSample, MARLOW_LEGACY)
    void shade(IShaderAPI* api, ShadeState& state) const override;
    void transmission(IShaderAPI* api, ShadeState& state) const override;
    void transfer(IShaderAPI* api, ShadeState& state) const override;
    void sample(IShaderAPI* api, ShadeState& state) const override;

    /// Share of light that is left after `distance`: exp(-distance absorbance), and 0 where the
    /// absorbance is exactly -1, the mark of one that was never set.
    Vec3f f_beersUnabsorbedRGB(IShaderAPI* api, ShadeState const& state, Vec3f absorbance,
                               float distance) const;

private:
    /// Where and how a hit is looked at. Local directions have z on the viewer's side of the
    /// normal.
    struct Surface {
        SLArray<Vec3f> frame; ///< about the bent normal, turned to the viewer
        Vec3f v; ///< direction to the viewer, local
        Vec3f ng; ///< true normal on the side of the frame's, local
        bool behind; ///< the viewer is behind the bent normal

        Vec3f const& facing() const { return frame[2]; }
        Vec3f n() const { return behind ? -frame[2] : frame[2]; }
        /// Whether l, local, is on one side of the surface by both normals.
        bool clears(Vec3f l) const { return !(l.z * dot(ng, l) < 0.0f); }
    };
    /// What a hit consists of, before the mask.
    struct Layers {
        Vec3f diffuse; ///< colour of the base
        LayerAlbedo albedo;
        GlossyLobe highlight[2];
        GlossyLobe reflection; ///< none where it is not blurred: a plain mirror
        bool mirrorsLights; ///< the reflection is one more highlight
    };
    struct Lit {
        Vec3f diffuse, glossy;
    };

    // marlowChannels.cpp: what the parameters and textures say at a hit.
    Vec4f channel(IShaderAPI* api, ShadeState const& state, MappedChannel const& c,
                  bool alphaAsColor = false) const;
    Vec3f mask(IShaderAPI* api, ShadeState const& state) const;
    Vec3f transparency(IShaderAPI* api, ShadeState const& state) const;
    Vec4f diffuse(IShaderAPI* api, ShadeState const& state, bool alphaAsColor) const;
    Vec3f reflectance(float cosine) const;
    Surface surface(IShaderAPI* api, ShadeState const& state) const;
    Layers layersAt(IShaderAPI* api, ShadeState const& state, Surface const& at) const;
    bool bends() const;
    bool blurs(Surface const& at) const;
    Vec3f paneTransmittance(IShaderAPI* api, ShadeState const& state, float cosine) const;

    // MarlowLegacy.cpp: what is seen.
    Lit lights(IShaderAPI* api, ShadeState const& state, Surface const& at,
               Layers const& layers) const;
    Vec3f diffuseSurroundings(IShaderAPI* api, ShadeState const& state, Vec3f const& n,
                              Vec3f const& weight) const;
    Vec3f mirrored(IShaderAPI* api, ShadeState const& state, Surface const& at,
                   Layers const& layers, Vec3f const& open) const;
    Vec3f opaquePart(IShaderAPI* api, ShadeState const& state, Surface const& at,
                     Layers const& layers) const;

    // marlowPaths.cpp: where light goes on.
    Vec3f mirrorDirection(IShaderAPI* api, ShadeState const& state, Surface const& at,
                          GlossyLobe const& lobe) const;
    Vec3f refractedDirection(IShaderAPI* api, ShadeState const& state, Surface const& at) const;
    Vec3f scattered(Surface const& at, Layers const& layers, Vec3f l) const;
};

} // namespace zsi
