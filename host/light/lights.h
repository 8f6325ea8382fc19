// SPDX-License-Identifier: Apache-2.0
/// What the scene's lights bring to a point.
#pragma once

#include "light/lightTree.h"
#include "scene/scene.h"

#include <memory>
#include <optional>
#include <vector>

namespace zsi::host {

/// Records of light lists of one thread. A list lives until the mark before it is released, so
/// that lists of nested shading calls stand on each other.
class LightRecords {
public:
    std::size_t mark() const { return used_; }
    void release(std::size_t mark) { used_ = mark; }
    LightSample& add();

private:
    static constexpr std::size_t kBlock = 64;
    std::vector<std::unique_ptr<LightSample[]>> blocks_; // grows to the deepest nesting, then stays
    std::size_t used_ = 0;
};

/// Light that would arrive at a point if nothing stood between.
struct Arrival {
    Vec3f L; ///< unit, towards the light
    Vec3f to; ///< place of the light that was picked; where the light is far away, a direction
    bool isFar = false; ///< nothing lies behind it
    Vec3f color{0, 0, 0};
    /// Per steradian at the point, with which `L` was picked; 0 where rays do not meet the light.
    float density = 0.0f;
};

/// A point of a light's surface.
struct EmittingPoint {
    Vec3f P, Ng; ///< world; `Ng` unit
};

/// The surface of a SurfaceLight, ready for picking points.
class EmittingSurface {
public:
    EmittingSurface(Scene const& scene, SurfaceLight const& light);
    float area() const { return area_; } ///< world units squared
    /// What it is for a tree of lights.
    TreeLight bounds(std::uint32_t light, Vec3f emission) const;
    /// Uniform over the surface; `u` in [0, 1)^2.
    EmittingPoint sample(Vec2f u) const;
    /// Per steradian at `from`, with which `sample` picks the point at `to`; infinite edge-on.
    float density(Vec3f from, Vec3f to, Vec3f Ng) const;

private:
    struct Triangle {
        Vec3f corner, edge1, edge2, Ng;
    };
    std::vector<Triangle> triangles_;
    std::vector<float> sums_; ///< of areas up to and with each triangle, divided by the whole
    float area_ = 0.0f;
};

/// The scene's lights, ready to be asked. Holds on to the scene's own.
class LightSet {
public:
    explicit LightSet(Scene const& scene);

    Light const& operator[](std::size_t i) const { return scene_->lights[i]; }
    /// Of a SurfaceLight.
    EmittingSurface const& surface(std::size_t light) const { return *surfaces_[light]; }
    bool hasSurfaces() const { return hasSurfaces_; }
    /// Calls `ask` with each light to ask at `P`, lit from the side of `normal`, and the factor by
    /// which it counts. That is every light, but of point and surface lights, where there are more
    /// than LightTree::kMost, so many that stand for all. `random`: gives numbers in [0, 1).
    template <class Random, class Ask>
    void forEach(Vec3f P, Vec3f normal, Random const& random, Ask const& ask) const
    {
        for (std::uint32_t const light : always_)
            ask(light, 1.0f);
        if (!tree_)
            return;
        LightTree::Picks picks;
        std::size_t const count = tree_->pick(P, normal, picks, random);
        for (std::size_t i = 0; i < count; ++i)
            ask(picks[i].light, picks[i].scale);
    }
    /// Whether a light has an extent, so that `arrival` makes use of its random numbers.
    bool isSpread(std::size_t light) const;

    /// What light `light` brings to `P`; nothing from behind `normal`. The colour of a ShaderLight
    /// is left black, for `askLight` to find.
    std::optional<Arrival> arrival(std::size_t light, Vec3f P, Vec3f normal, Vec2f u) const;

private:
    Scene const* scene_;
    std::vector<std::unique_ptr<EmittingSurface>> surfaces_; ///< null for other kinds
    bool hasSurfaces_ = false;
    std::vector<std::uint32_t> always_; ///< lights to ask everywhere
    std::optional<LightTree> tree_; ///< of the others
};

/// A point on the disc of the ball around `position` that faces `P`: what `P` sees of the ball.
/// `u` in [0, 1)^2.
Vec3f pointOfBall(Vec3f position, float radius, Vec3f P, Vec2f u);

/// Asks a shader for what arrives at `P` from `position`, a point of the light. Returns false, with
/// `sample` unset, when nothing does: the shader wrote nothing, wrote black, or the light lies on
/// the light-less side of `normal`. `sample.weight` is the cosine to `normal`.
/// `record` gives `P`'s surroundings (ray, surface); its light fields and results are overwritten.
bool askLight(ShaderLight const& light, Vec3f position, Vec3f P, Vec3f normal, IShaderAPI* api,
              ShadeState& record, LightSample& sample);

} // namespace zsi::host
