// SPDX-License-Identifier: Apache-2.0
/// Parameter rows of the Ward family, in blocks that a class puts in its own order.
#pragma once

#include "materials/physical/shared/materialSkeleton.h"

namespace zsi {

inline constexpr int kWardEntryPoints = kShade | kTransmission | kTransfer | kSample;

/// The channels, 90 rows. A scalar map is read in its red channel; where a map is on, it times its
/// amount replaces the plain value. Transforms take the uv attribute to map coordinates.
#define WARD_CHANNELS(P, U, A)                                                                     \
    P(int, u_procedureMapEnable, (0), "bump pattern: 0 none, 1 noise, 2 brush, 3 smoke, 4 cells",  \
      slider(0, 4), group("bump"))                                                                 \
    P(Vec3f, u_procedureMapTiling, (1.0f, 1.0f, 1.0f), "pattern repeats per object unit")          \
    P(float, u_procedureMapAmount, (0.0f), "depth of the pattern, about 0..1", slider(0, 1))       \
    P(TextureSampler1D, u_smokeMap, (), "height of the smoke pattern over its density, 0..1")      \
    P(bool, u_normal0MapEnable, (false), "first bump map on; the pattern is then off")             \
    P(TextureSampler2D, u_normal0Map, (), "first bump map: height, r + g + b")                     \
    P(bool, u_normal0AmountMapEnable, (false), "scale the first bump by a map")                    \
    P(TextureSampler2D, u_normal0AmountMap, (), "multiplier of u_normal0Amount")                   \
    U(Mat3f, u_normal0AmountTransform, "UV transform of that map",                                 \
      when("u_normal0AmountMapEnable"), when("u_normal0AmountMap"))                                \
    P(float, u_normal0Amount, (0.0f), "depth of the first bump, either sign", slider(-1, 1))       \
    U(Mat3f, u_normal0Transform, "UV transform of the first bump map", when("u_normal0MapEnable")) \
    P(bool, u_normal1MapEnable, (false), "second bump map on, on top of the first")                \
    P(TextureSampler2D, u_normal1Map, (), "second bump map: height, r + g + b")                    \
    P(float, u_normal1Amount, (0.0f), "depth of the second bump, either sign", slider(-1, 1))      \
    U(Mat3f, u_normal1Transform, "UV transform of the second bump map",                            \
      when("u_normal1MapEnable"), when("u_normal1Map"))                                            \
    P(bool, u_normal1AsShadingNormal, (false), "light by the bumped normal, not the plain one")    \
    P(bool, u_diffuseMapEnable, (false), "diffuse colour from a map", group("diffuse"))            \
    P(TextureSampler2D, u_diffuseMap, (), "diffuse reflectance; alpha fades it in mode 1")         \
    P(Vec3f, u_diffuseColor, (0.0f, 0.0f, 0.0f), "diffuse reflectance, linear RGB, 0..1")          \
    U(Mat3f, u_diffuseTransform, "UV transform of the diffuse map", when("u_diffuseMapEnable"),    \
      when("u_diffuseMap"))                                                                        \
    P(float, u_diffuseAmount, (1.0f), "multiplier of the diffuse map", slider(0, 2))               \
    P(int, u_imageFadeEnable, (0), "0 off, 1 map over colour by alpha, 2 map, 3 colour, 4 grey",   \
      slider(0, 4), group("image fade"))                                                           \
    P(float, u_imageFade, (1.0f), "strength of the fade, 0..1", slider(0, 1))                      \
    P(TextureSampler2D, u_imageFadeMap, (), "colour blended in, mode 2")                           \
    U(Mat3f, u_imageFadeTransform, "UV transform of that map", when("u_imageFadeEnable", 2, 2),    \
      when("u_imageFadeMap"))                                                                      \
    P(float, u_imageFadeAmount, (1.0f), "multiplier of that map", slider(0, 2))                    \
    P(Vec3f, u_imageFadeColor, (0.0f, 0.0f, 0.0f), "colour blended in, mode 3")                    \
    P(bool, u_specularMapEnable, (false), "specular colour from a map", group("specular"))         \
    P(TextureSampler2D, u_specularMap, (), "specular colour")                                      \
    P(Vec3f, u_specularColor, (1.0f, 1.0f, 1.0f), "specular colour, linear RGB, 0..1")             \
    U(Mat3f, u_specularTransform, "UV transform of the specular map", when("u_specularMapEnable"), \
      when("u_specularMap"))                                                                       \
    P(float, u_specularAmount, (1.0f), "multiplier of the specular map", slider(0, 2))             \
    P(bool, u_roughMapEnable, (false), "roughness from a map", group("roughness"))                 \
    P(TextureSampler2D, u_roughMap, (), "glossiness, 0 rough .. 1 polished")                       \
    P(float, u_roughValue, (0.01f), "roughness along the tangent: slope deviation, above 0",       \
      slider(0.001f, 1))                                                                           \
    U(Mat3f, u_roughTransform, "UV transform of the glossiness map", when("u_roughMapEnable"),     \
      when("u_roughMap"))                                                                          \
    P(float, u_roughAmount, (1.0f), "multiplier of the glossiness map", slider(0, 2))              \
    P(float, u_reflectGlossyValue, (0.0f), "spread of traced reflections, 0 sharp .. 1",           \
      slider(0, 1))                                                                                \
    P(bool, u_refractGlossyMapEnable, (false), "spread of traced refractions from a map")          \
    P(TextureSampler2D, u_refractGlossyMap, (), "glossiness of refraction, 0 blurred .. 1 clear")  \
    U(Mat3f, u_refractGlossyTransform, "UV transform of that map",                                 \
      when("u_refractGlossyMapEnable"), when("u_refractGlossyMap"))                                \
    P(float, u_refractGlossyAmount, (1.0f), "multiplier of that map", slider(0, 2))                \
    P(float, u_refractGlossyValue, (0.0f), "spread of traced refractions, 0 sharp .. 1",           \
      slider(0, 1))                                                                                \
    P(bool, u_anisotropyMapEnable, (false), "anisotropy from a map", group("anisotropy"))          \
    P(TextureSampler2D, u_anisotropyMap, (), "bitangent over tangent roughness")                   \
    P(float, u_anisotropyValue, (1.0f), "bitangent over tangent roughness, above 0",               \
      slider(0.1f, 10))                                                                            \
    U(Mat3f, u_anisotropyTransform, "UV transform of the anisotropy map",                          \
      when("u_anisotropyMapEnable"), when("u_anisotropyMap"))                                      \
    P(float, u_anisotropyAmount, (1.0f), "multiplier of the anisotropy map", slider(0, 2))         \
    P(bool, u_anisoRotationMapEnable, (false), "anisotropy rotation from a map")                   \
    P(TextureSampler2D, u_anisoRotationMap, (), "rotation about the normal, radians")              \
    P(float, u_anisoRotationValue, (0.0f), "rotation about the normal, radians",                   \
      slider(-3.1416f, 3.1416f))                                                                   \
    U(Mat3f, u_anisoRotationTransform, "UV transform of the rotation map",                         \
      when("u_anisoRotationMapEnable"), when("u_anisoRotationMap"))                                \
    P(float, u_anisoRotationAmount, (1.0f), "multiplier of the rotation map", slider(0, 2))        \
    P(float, u_brdfCurvePower, (0.0f), "exponent of the reflectivity curve; 0: grazing value",     \
      slider(0, 10), group("reflectivity"))                                                        \
    P(bool, u_brdf00ReflectMapEnable, (false), "head-on reflectivity from a map")                  \
    P(TextureSampler2D, u_brdf00ReflectMap, (), "head-on reflectivity, 0..1")                      \
    U(Mat3f, u_brdf00ReflectTransform, "UV transform of that map",                                 \
      when("u_brdf00ReflectMapEnable"), when("u_brdf00ReflectMap"))                                \
    P(float, u_brdf00ReflectAmount, (1.0f), "multiplier of that map", slider(0, 2))                \
    P(float, u_brdf00Reflectivity, (0.1f), "head-on reflectivity, 0..1", slider(0, 1))             \
    P(bool, u_brdf90ReflectMapEnable, (false), "grazing reflectivity from a map")                  \
    P(TextureSampler2D, u_brdf90ReflectMap, (), "grazing reflectivity, 0..1")                      \
    U(Mat3f, u_brdf90ReflectTransform, "UV transform of that map",                                 \
      when("u_brdf90ReflectMapEnable"), when("u_brdf90ReflectMap"))                                \
    P(float, u_brdf90Reflectivity, (1.0f), "grazing reflectivity, 0..1", slider(0, 1))             \
    P(float, u_brdf90ReflectAmount, (1.0f), "multiplier of that map", slider(0, 2))                \
    P(float, u_reflectivity, (1.0f), "multiplier of the reflectivity curve, 0..1", slider(0, 1))   \
    P(bool, u_isMetal, (false), "tint reflections by the diffuse colour")                          \
    P(bool, u_transparency, (false), "refraction and translucency on", group("transparency"))      \
    P(bool, u_transparencyMapEnable, (false), "blend a transparency map in")                       \
    P(TextureSampler2D, u_transparencyMap, (), "transparency")                                     \
    P(float, u_transparencyValue, (0.0f), "transparency, 0..1", slider(0, 1))                      \
    U(Mat3f, u_transparencyTransform, "UV transform of the transparency map",                      \
      when("u_transparency"), when("u_transparencyMapEnable"), when("u_transparencyMap"))          \
    P(float, u_transparencyFade, (0.0f), "weight of the map against the value, 0..1",              \
      slider(0, 1))                                                                                \
    P(float, u_ior, (1.33f), "refractive index of the inside", slider(1, 3))                       \
    P(float, u_transparencyAmount, (1.0f), "multiplier of the transparency map", slider(0, 2))     \
    P(bool, u_translucencyMapEnable, (false), "translucency from a map", group("translucency"))    \
    P(TextureSampler2D, u_translucencyMap, (), "translucency")                                     \
    P(float, u_translucencyValue, (0.0f), "part of the transparency that diffuses, 0..1",          \
      slider(0, 1))                                                                                \
    U(Mat3f, u_translucencyTransform, "UV transform of the translucency map",                      \
      when("u_transparency"), when("u_translucencyMapEnable"), when("u_translucencyMap"))          \
    P(float, u_translucencyAmount, (1.0f), "multiplier of the translucency map", slider(0, 2))     \
    P(bool, u_cutoutMapEnable, (false), "cut the surface out by a map", group("cut-out"))          \
    P(TextureSampler2D, u_cutoutMap, (), "0 hole .. 1 surface")                                    \
    U(Mat3f, u_cutoutTransform, "UV transform of the cut-out map", when("u_cutoutMapEnable"))      \
    P(float, u_cutoutAmount, (1.0f), "multiplier of the cut-out map", slider(0, 2))                \
    P(bool, u_additionalMapEnable, (false), "emission from a map", group("added colour"))          \
    P(TextureSampler2D, u_additionalMap, (), "multiplier of the added colour, clamped to 0..1")    \
    U(Vec3f, u_additionalColor, "colour added to the result, linear RGB")                          \
    U(Mat3f, u_additionalMapTransform, "UV transform of that map", when("u_additionalMapEnable"),  \
      when("u_additionalMap"))                                                                     \
    P(float, u_additionalAmount, (1.0f), "multiplier of that map; without it not applied",         \
      slider(0, 2))                                                                                \
    P(bool, u_cosineUsesBump, (false), "cosine of transfer and sample against the bumped normal",  \
      group("rays"))                                                                               \
    P(bool, u_reflectionHighlightOnly, (false), "highlights of lights only, no traced mirror",     \
      groupEnd())

} // namespace zsi
