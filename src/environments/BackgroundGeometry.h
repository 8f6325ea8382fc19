// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "environments/channelGrading.h"
#include "environments/textureMapping.h"
#include "runtime/shaderTable.h"

namespace zsi {

/// Ground or backdrop that carries a photograph, lit by the scene and darkened by its shadows.
/// Front faces only.
#define BACKGROUND_GEOMETRY(P, U, A)                                                               \
    P(Vec3f, diffuseColor, (1.0f, 1.0f, 1.0f), "colour of mapping mode 0, linear RGB",             \
      group("picture"))                                                                            \
    P(TextureSampler2D, diffuseTexture, (), "the picture; alpha below 0.05 cuts out")              \
    P(int, diffuseMode, (0), "-1 black, 0 colour, 1 UV, 2 planar, 3 box, 4 angular",               \
      slider(-1, 4))                                                                               \
    U(Mat4f, diffuseTextureMatrix, "reference position to texture space",                          \
      when("diffuseMode", 2, 4), when("diffuseTexture"))                                           \
    P(float, diffuseAngularRepeat, (1.0f), "repeats around the axis", slider(0, 16),               \
      when("diffuseMode", 4, 4))                                                                   \
    U(Mat3f, diffuseUVMatrix, "UV transform", when("diffuseMode", 1, 1), when("diffuseTexture"))   \
    P(Vec3f, diffuseIBLGainColor, (1.0f, 1.0f, 1.0f), "diffuseCube: gain colour",                  \
      group("diffuse cube"))                                                                       \
    P(Vec3f, diffuseIBLContrastPivot, (1.0f, 1.0f, 1.0f), "diffuseCube: contrast pivot")           \
    P(float, diffuseIBLContrastValue, (1.0f), "diffuseCube: contrast, 1 unchanged", slider(0, 2))  \
    P(int, diffuseIBLGainSource, (0), "diffuseCube: 0 value, 1 colour, 2 colour of luminance",     \
      slider(0, 2))                                                                                \
    U(Vec3f, specularColor, "reflectivity, linear RGB", group("reflectivity"),                     \
      when("specularMode", 0, 0))                                                                  \
    P(TextureSampler2D, specularTexture, (), "reflectivity map")                                   \
    P(int, specularMode, (0), "mapping mode, as diffuseMode", slider(-1, 4))                       \
    U(Mat4f, specularTextureMatrix, "as diffuseTextureMatrix", when("specularMode", 2, 4),         \
      when("specularTexture"))                                                                     \
    P(float, specularAngularRepeat, (1.0f), "as diffuseAngularRepeat", slider(0, 16),              \
      when("specularMode", 4, 4))                                                                  \
    U(Mat3f, specularUVMatrix, "as diffuseUVMatrix", when("specularMode", 1, 1),                   \
      when("specularTexture"))                                                                     \
    P(Vec3f, specularIBLGainColor, (1.0f, 1.0f, 1.0f), "specularCube: gain colour",                \
      group("specular cube"))                                                                      \
    P(Vec3f, specularIBLContrastPivot, (1.0f, 1.0f, 1.0f), "specularCube: contrast pivot")         \
    P(float, specularIBLContrastValue, (1.0f), "specularCube: contrast, 1 unchanged",              \
      slider(0, 2))                                                                                \
    P(int, specularIBLGainSource, (0), "specularCube: 0 value, 1 colour, 2 colour of luminance",   \
      slider(0, 2))                                                                                \
    P(int, bumpMode, (-1), "mapping mode of the bump; below 1 none", slider(-1, 4), group("bump")) \
    P(TextureSampler2D, bumpTexture, (), "tangent-space normal map, linear")                       \
    U(Mat4f, bumpTextureMatrix, "as diffuseTextureMatrix", when("bumpMode", 2, 4),                 \
      when("bumpTexture"))                                                                         \
    U(Mat4f, bumpTextureMatrixInverse, "inverse of bumpTextureMatrix", when("bumpMode", 4, 4),     \
      when("bumpTexture"))                                                                         \
    P(float, bumpAngularRepeat, (1.0f), "as diffuseAngularRepeat", slider(0, 16),                  \
      when("bumpMode", 4, 4))                                                                      \
    P(float, bumpScale, (1.0f), "scales the slopes of the bump; 0 none", slider(0, 4))             \
    U(Mat3f, bumpUVMatrix, "as diffuseUVMatrix", when("bumpMode", 1, 1), when("bumpTexture"))      \
    P(Vec3f, shadowColor, (0.0f, 0.0f, 0.0f), "factor that full shadow tends to", group("shadow")) \
    P(float, shadowIntensity, (1.0f), "strength of received shadow", slider(0, 1))                 \
    P(bool, useCubeReflection, (true), "reflections come from reflectCube, not from the scene",    \
      group("cubes"))                                                                              \
    P(TextureSamplerCube, reflectCube, (), "sharp environment")                                    \
    P(TextureSamplerCube, diffuseCube, (), "light of the sky on a white surface facing it")        \
    P(TextureSamplerCube, specularCube, (), "blurred environment")                                 \
    P(Vec3f, diffuseTextureGainColor, (1.0f, 1.0f, 1.0f), "picture: gain colour",                  \
      group("picture"))                                                                            \
    P(int, diffuseTextureGainSource, (0), "picture: 0 value, 1 colour, 2 colour of luminance",     \
      slider(0, 2))                                                                                \
    P(float, diffuseTextureGainValue, (1.0f), "picture: gain", slider(0, 4))                       \
    P(float, diffuseTextureSatValue, (1.0f), "picture: saturation, 1 unchanged, 0 grey",           \
      slider(0, 2))                                                                                \
    GLOBAL_IBL(P, U, A, whenAny("reflectCube", "diffuseCube", "specularCube"))                     \
    P(Vec3f, reflectIBLChannelGainColor, (1.0f, 1.0f, 1.0f), "reflectCube: gain colour",           \
      group("reflect cube"))                                                                       \
    P(int, reflectIBLChannelGainSource, (0), "reflectCube: 0 value, 1 colour, 2 of luminance",     \
      slider(0, 2))                                                                                \
    P(float, reflectIBLChannelGainValue, (1.0f), "reflectCube: gain", slider(0, 4))                \
    P(float, reflectIBLChannelSatValue, (1.0f), "reflectCube: saturation, 1 unchanged, 0 grey",    \
      slider(0, 2))                                                                                \
    P(float, diffuseIBLGainValue, (1.0f), "diffuseCube: gain", slider(0, 4),                       \
      group("diffuse cube"))                                                                       \
    P(float, specularIBLGainValue, (1.0f), "specularCube: gain", slider(0, 4),                     \
      group("specular cube"))                                                                      \
    A(Vec2f, uv)                                                                                   \
    A(Vec3f, tangent)                                                                              \
    A(Vec3f, bitangent)

class BackgroundGeometry final : public MaterialShader, public TextureMappingFunctions {
public:
    SHADER(BackgroundGeometry, kShade | kTransmission | kSample, BACKGROUND_GEOMETRY)
    void shade(IShaderAPI* api, ShadeState& state) const override;
    void transmission(IShaderAPI* api, ShadeState& state) const override;
    void sample(IShaderAPI* api, ShadeState& state) const override;

private:
    Vec3f bumpedNormal(IShaderAPI* api, ShadeState const& state) const;
    Vec3f cube(TextureSamplerCube const& cube, Vec3f direction, ChannelGrade const& grade) const;
    Vec3f receivedLight(IShaderAPI* api, ShadeState const& state, Vec3f n) const;
    Vec3f reflections(IShaderAPI* api, ShadeState const& state, Vec3f n) const;
};

} // namespace zsi
