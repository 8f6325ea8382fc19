#pragma once

#include "environments/channelGrading.h"
#include "environments/textureMapping.h"
#include "runtime/shaderTable.h"

namespace zsi {

/// Ground or backdrop that carries a photograph, lit by the scene and darkened by its shadows.
/// Front faces only.
#define BACKGROUND_GEOMETRY(P, U, A)                                                             \
    P(Vec3f, diffuseColor, (1.0f, 1.0f, 1.0f), "colour of mapping mode 0, linear RGB")           \
    P(TextureSampler2D, diffuseTexture, (), "the picture; alpha below 0.05 cuts out")            \
    P(int, diffuseMode, (0), "-1 black, 0 colour, 1 UV, 2 planar, 3 box, 4 angular")             \
    U(Mat4f, diffuseTextureMatrix, "reference position to texture space, modes 2 to 4")          \
    P(float, diffuseAngularRepeat, (1.0f), "repeats around the axis, mode 4")                    \
    U(Mat3f, diffuseUVMatrix, "UV transform, mode 1")                                            \
    P(Vec3f, diffuseIBLGainColor, (1.0f, 1.0f, 1.0f), "diffuseCube: gain colour")                \
    P(Vec3f, diffuseIBLContrastPivot, (1.0f, 1.0f, 1.0f), "diffuseCube: contrast pivot")         \
    P(float, diffuseIBLContrastValue, (1.0f), "diffuseCube: contrast, 1 unchanged")              \
    P(int, diffuseIBLGainSource, (0), "diffuseCube: 0 value, 1 colour, 2 colour of luminance")   \
    U(Vec3f, specularColor, "reflectivity of specular mode 0, linear RGB")                       \
    P(TextureSampler2D, specularTexture, (), "reflectivity map")                                 \
    P(int, specularMode, (0), "mapping mode, as diffuseMode")                                    \
    U(Mat4f, specularTextureMatrix, "as diffuseTextureMatrix")                                   \
    P(float, specularAngularRepeat, (1.0f), "as diffuseAngularRepeat")                           \
    U(Mat3f, specularUVMatrix, "as diffuseUVMatrix")                                             \
    P(Vec3f, specularIBLGainColor, (1.0f, 1.0f, 1.0f), "specularCube: gain colour")              \
    P(Vec3f, specularIBLContrastPivot, (1.0f, 1.0f, 1.0f), "specularCube: contrast pivot")       \
    P(float, specularIBLContrastValue, (1.0f), "specularCube: contrast, 1 unchanged")            \
    P(int, specularIBLGainSource, (0), "specularCube: 0 value, 1 colour, 2 colour of luminance") \
    P(int, bumpMode, (-1), "mapping mode of the bump; below 1 none")                             \
    P(TextureSampler2D, bumpTexture, (), "tangent-space normal map, linear")                     \
    U(Mat4f, bumpTextureMatrix, "as diffuseTextureMatrix")                                       \
    U(Mat4f, bumpTextureMatrixInverse, "inverse of bumpTextureMatrix, mode 4")                   \
    P(float, bumpAngularRepeat, (1.0f), "as diffuseAngularRepeat")                               \
    P(float, bumpScale, (1.0f), "scales the slopes of the bump; 0 none")                         \
    U(Mat3f, bumpUVMatrix, "as diffuseUVMatrix")                                                 \
    P(Vec3f, shadowColor, (0.0f, 0.0f, 0.0f), "factor that full shadow tends to")                \
    P(float, shadowIntensity, (1.0f), "strength of received shadow, 0..1")                       \
    P(bool, useCubeReflection, (true), "reflections come from reflectCube, not from the scene")  \
    P(TextureSamplerCube, reflectCube, (), "sharp environment")                                  \
    P(TextureSamplerCube, diffuseCube, (), "light of the sky on a white surface facing it")      \
    P(TextureSamplerCube, specularCube, (), "blurred environment")                               \
    P(Vec3f, diffuseTextureGainColor, (1.0f, 1.0f, 1.0f), "picture: gain colour")                \
    P(int, diffuseTextureGainSource, (0), "picture: 0 value, 1 colour, 2 colour of luminance")   \
    P(float, diffuseTextureGainValue, (1.0f), "picture: gain")                                   \
    P(float, diffuseTextureSatValue, (1.0f), "picture: saturation, 1 unchanged, 0 grey")         \
    GLOBAL_IBL(P, U, A)                                                                          \
    P(Vec3f, reflectIBLChannelGainColor, (1.0f, 1.0f, 1.0f), "reflectCube: gain colour")         \
    P(int, reflectIBLChannelGainSource, (0), "reflectCube: 0 value, 1 colour, 2 of luminance")   \
    P(float, reflectIBLChannelGainValue, (1.0f), "reflectCube: gain")                            \
    P(float, reflectIBLChannelSatValue, (1.0f), "reflectCube: saturation, 1 unchanged, 0 grey")  \
    P(float, diffuseIBLGainValue, (1.0f), "diffuseCube: gain")                                   \
    P(float, specularIBLGainValue, (1.0f), "specularCube: gain")                                 \
    A(Vec2f, uv)                                                                                 \
    A(Vec3f, tangent)                                                                            \
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
