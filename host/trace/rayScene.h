// SPDX-License-Identifier: Apache-2.0
/// The scene as rays meet it.
#pragma once

#include "scene/scene.h"

#include <cstdint>
#include <exception>
#include <functional>
#include <limits>
#include <memory>

namespace zsi::host {

struct Ray {
    Vec3f origin;
    Vec3f direction; ///< unit
    float tMax = std::numeric_limits<float>::infinity();
};

/// Where a ray met a triangle.
struct Hit {
    float t;
    std::uint32_t instance; ///< index into Scene::instances
    std::uint32_t triangle; ///< index into Mesh::triangles
    float u, v; ///< barycentric weights of the second and third corner
};

/// The surface at a hit. World space where nothing else is said.
struct SurfacePoint {
    Vec3f P;
    Vec3f N; ///< unit, interpolated
    Vec3f Ng; ///< unit, of the face, on the side that the mesh's normals point to
    Vec3f objectP;
    Vec3f objectN; ///< unit
    std::uint32_t instance;
    std::uint32_t triangle;
    float u, v;
};

/// Which of a scene's instances a query sees.
enum class Visibility {
    All,
    Opaque, ///< materials without a `transmission` of their own
    Clear, ///< materials with one
};

/// Thrown when a `BuildProgress` ends the building of an acceleration structure.
class Cancelled : public std::exception {
public:
    char const* what() const noexcept override { return "cancelled"; }
};

/// Asked now and then while acceleration structures are built; false ends it. `done` of 1, of the
/// scene's triangles.
using BuildProgress = std::function<bool(double done)>;

/// Acceleration structures over a scene, which must outlive this. Queries are thread-safe and do
/// not allocate; they must not overlap with rebuilding.
class RayScene {
public:
    /// Throws std::bad_alloc when memory runs out, InputError for a scene that cannot be traced and
    /// Cancelled.
    explicit RayScene(Scene const& scene, BuildProgress const& progress = {});
    ~RayScene();
    RayScene(RayScene&&) noexcept;
    RayScene& operator=(RayScene&&) noexcept;

    /// The scene's instances or their materials have changed, its meshes have not.
    void rebuildInstances(BuildProgress const& progress);

    /// The nearest hit, if any.
    bool intersect(Ray const& ray, Visibility visible, Hit& hit) const;
    /// Whether anything is hit.
    bool occluded(Ray const& ray, Visibility visible) const;

    SurfacePoint surface(Hit const& hit) const;
    /// `P` moved outwards onto the curved surface that the normals describe, from where shadow rays
    /// of a coarse mesh do not meet its own facets (Hanika 2021, "Hacking the Shadow Terminator").
    Vec3f smoothPoint(SurfacePoint const& s) const;

private:
    struct Impl;
    std::unique_ptr<Impl> impl_;
};

/// `P` moved off its surface to the side that `n` points to, by slightly more than the rounding
/// error of a computed hit point: a ray from there does not meet the surface again.
/// Waechter and Binder 2019, "A Fast and Robust Method for Avoiding Self-Intersection".
Vec3f offsetPoint(Vec3f P, Vec3f n);

} // namespace zsi::host
