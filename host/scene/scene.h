// SPDX-License-Identifier: Apache-2.0
/// A scene as the renderer takes it: plain data, loaded and checked. World is right-handed,
/// z up; lengths are in scene units; colours linear RGB.
#pragma once

#include "plugin/shader.h"

#include <array>
#include <memory>
#include <optional>
#include <string>
#include <variant>
#include <vector>
#include <zsi/vecmath.h>

namespace zsi::host {

class TextureStore;

/// Coordinates go up to this: rays are traced within 1.8e18, and squares are still finite.
constexpr float kFarthest = 1e18f;

/// What one node of a mesh file shows in one material.
struct MeshPart {
    std::string node, material; ///< names in the file
};

/// Triangles with per-vertex data. Every array of a vertex is either empty or as long as
/// `positions`; the loader fills normals, uv, tangents and bitangents that a file lacks.
struct Mesh {
    std::string name;
    std::vector<Vec3f> positions;
    std::vector<Vec3f> normals; ///< unit
    std::vector<Vec2f> uv;
    std::vector<Vec2f> uv1; ///< empty: uv stands in
    std::vector<Vec3f> tangents; ///< unit, along increasing u
    std::vector<Vec3f> bitangents;
    std::vector<Vec4f> colors; ///< empty: (1, 1, 1, 1)
    std::vector<std::array<std::uint32_t, 3>> triangles;
    std::vector<MeshPart> parts; ///< of a file
    std::vector<std::uint32_t> partOf; ///< each triangle's, index into `parts`; empty without parts
};

struct Instance {
    int mesh; ///< index into Scene::meshes
    int material; ///< index into Scene::materials; not used where `light` is set
    Mat4f objectToWorld; ///< points are row vectors: translation in m[12..14]
    int light = -1; ///< index into Scene::lights of the SurfaceLight that this is the surface of
};

// Lights. A light's colour is irradiance divided by pi: a white diffuse surface that faces a light
// of colour 1 shows 1. Only surface lights are met by rays.

/// A light of a shader library.
struct ShaderLight {
    Shader shader;
    Vec3f position;
    Vec3f axis{0, 0, -1}; ///< unit direction it points to
    float radius = 0.0f; ///< > 0: a ball that shadows sample, for soft edges
};

/// A ball that shines alike in all directions of its cone and falls off with the square of the
/// distance.
struct PointLight {
    Vec3f position;
    Vec3f color{1, 1, 1}; ///< that arrives at distance 1
    float radius = 0.0f;
    Vec3f axis{0, 0, -1}; ///< unit, of the cone
    /// Across, degrees: full within the inner one, dark outside, a smoothstep of the cosine
    /// between; 360 is all around.
    float innerAngle = 360.0f, angle = 360.0f;
};

/// A light so far away that its rays are parallel but for its angle.
struct SunLight {
    Vec3f direction{0, 0, 1}; ///< unit, towards it
    Vec3f color{1, 1, 1}; ///< that arrives
    float angle = 0.53f; ///< across, degrees
};

/// An instance that shines from the side that its normals point to; the other side is black.
struct SurfaceLight {
    int instance; ///< index into Scene::instances
    Vec3f emission{1, 1, 1}; ///< radiance
};

using Light = std::variant<ShaderLight, PointLight, SunLight, SurfaceLight>;

struct Camera {
    Vec3f position{0, -5, 1};
    Vec3f target{0, 0, 0};
    Vec3f up{0, 0, 1};
    float verticalFov = 40.0f; ///< degrees
    float lensRadius = 0.0f; ///< thin lens; 0 is a pinhole
    float focusDistance = 0.0f; ///< 0: the distance to the target
};

struct FilmSettings {
    int width = 640;
    int height = 360;
    std::optional<std::array<int, 4>> crop; ///< x0, y0, x1, y1 in pixels, end exclusive
    float exposure = 0.0f; ///< stops, applied to 8-bit output only
    std::string view; ///< of 8-bit output, as in ScreenView
    /// True: with the alpha of the shaders. False: opaque. Unset: opaque where 8 bits are written,
    /// with alpha elsewhere.
    std::optional<bool> alpha;
    std::vector<std::string> layers; ///< beside the beauty, by name (integrate/layers.h)
};

struct Settings {
    int samples = 64; ///< per pixel
    float noise = 0.0f; ///< where it is lower (film/noise.h), no more samples; 0: all samples
    int maxDepth = 64; ///< bends and bounces one after another
    int occlusionSamples = 4; ///< rays of one occlusion query
    int indirectSamples = 1; ///< rays of one indirect-diffuse query at the first hit
    float occlusionDistance = 0.0f; ///< reach of an occlusion query; 0: unlimited
    Vec3f ambient{0, 0, 0}; ///< what `ambientLight` gives
    float sampleClamp = 0.0f; ///< brightest channel that a camera sample may have; 0: no limit
    std::uint32_t seed = 1;
    std::string integrator = "shade"; ///< a name of integrate/integrators.h
};

struct Scene {
    std::string file; ///< for messages
    Camera camera;
    FilmSettings film;
    Settings settings;
    std::vector<Mesh> meshes;
    std::vector<Shader> materials;
    std::vector<std::string> materialNames;
    std::vector<Instance> instances;
    std::vector<std::string> instanceNames; ///< for mattes; may be shorter
    std::vector<Light> lights;
    std::vector<std::string> lightNames; ///< may be shorter
    std::optional<Shader> environment; ///< none: black
    /// The camera sees the environment as a ray does that has reached its depth, which for some
    /// shaders is the picture that is reflected.
    bool environmentVisible = false;
    std::shared_ptr<TextureStore> textures; ///< owns what the shaders' handles point to
    /// Read beside those that the scene file names, such as buffers of a mesh file.
    std::vector<std::string> furtherFiles;
    std::vector<std::string> notes; ///< what the loader chose by itself
    std::vector<std::string> warnings; ///< such as a matrix that a shader will read left unwritten
};

} // namespace zsi::host
