// SPDX-License-Identifier: Apache-2.0
#include "light/lights.h"

#include "sampling/directions.h"

#include <algorithm>
#include <cmath>
#include <limits>

namespace zsi::host {

LightSample& LightRecords::add()
{
    if (used_ == blocks_.size() * kBlock)
        blocks_.push_back(std::make_unique<LightSample[]>(kBlock));
    LightSample& record = blocks_[used_ / kBlock][used_ % kBlock];
    ++used_;
    return record;
}

EmittingSurface::EmittingSurface(Scene const& scene, SurfaceLight const& light)
{
    Instance const& instance = scene.instances[static_cast<std::size_t>(light.instance)];
    Mesh const& mesh = scene.meshes[static_cast<std::size_t>(instance.mesh)];
    Mat4f const& m = instance.objectToWorld;
    Vec3f const x{m.m[0], m.m[1], m.m[2]}, y{m.m[4], m.m[5], m.m[6]}, z{m.m[8], m.m[9], m.m[10]};
    float const mirrored = dot(cross(x, y), z) < 0.0f ? -1.0f : 1.0f;
    double sum = 0;
    for (auto const& corner : mesh.triangles) {
        Vec3f const a = transformPoint(m, mesh.positions[corner[0]]);
        Vec3f const e1 = transformPoint(m, mesh.positions[corner[1]]) - a;
        Vec3f const e2 = transformPoint(m, mesh.positions[corner[2]]) - a;
        Vec3f const n = cross(e1, e2);
        float const doubled = length(n);
        if (!(doubled > 0.0f) || !std::isfinite(doubled))
            continue;
        // The side of the mesh's normals, as hits have it (RayScene::surface).
        float side = mirrored;
        if (!mesh.normals.empty()) {
            Vec3f const& p = mesh.positions[corner[0]];
            Vec3f const face = cross(mesh.positions[corner[1]] - p, mesh.positions[corner[2]] - p);
            Vec3f const normals =
                mesh.normals[corner[0]] + mesh.normals[corner[1]] + mesh.normals[corner[2]];
            side *= dot(face, normals) < 0.0f ? -1.0f : 1.0f;
        }
        triangles_.push_back({a, e1, e2, n * (side / doubled)});
        sum += 0.5 * static_cast<double>(doubled);
        sums_.push_back(static_cast<float>(sum));
    }
    area_ = static_cast<float>(sum);
    for (float& s : sums_)
        s /= area_;
}

TreeLight EmittingSurface::bounds(std::uint32_t light, Vec3f emission) const
{
    constexpr float kPi = 3.14159265f, kMost = std::numeric_limits<float>::max();
    Vec3f low{kMost, kMost, kMost}, high = -low, normals{0, 0, 0};
    for (Triangle const& t : triangles_) {
        for (Vec3f const p : {t.corner, t.corner + t.edge1, t.corner + t.edge2}) {
            low = {minOf(low.x, p.x), minOf(low.y, p.y), minOf(low.z, p.z)};
            high = {maxOf(high.x, p.x), maxOf(high.y, p.y), maxOf(high.z, p.z)};
        }
        normals +=
            cross(t.edge1, t.edge2) * (dot(cross(t.edge1, t.edge2), t.Ng) < 0 ? -1.0f : 1.0f);
    }
    TreeLight bounds{light,
                     (low + high) * 0.5f,
                     length(high - low) / 2.0f,
                     {0, 0, 1},
                     kPi,
                     maxComponent(emission) * area_ / kPi};
    if (float const l = length(normals); l > 1e-3f * area_) {
        bounds.axis = normals / l;
        float least = 1.0f;
        for (Triangle const& t : triangles_)
            least = minOf(least, dot(t.Ng, bounds.axis));
        bounds.spread = std::acos(clamp(least, -1.0f, 1.0f));
    }
    return bounds;
}

EmittingPoint EmittingSurface::sample(Vec2f u) const
{
    if (triangles_.empty())
        return {{0, 0, 0}, {0, 0, 0}};
    auto const found = std::upper_bound(sums_.begin(), sums_.end(), u.x);
    auto const i = std::min(static_cast<std::size_t>(found - sums_.begin()), sums_.size() - 1);
    float const before = i > 0 ? sums_[i - 1] : 0.0f;
    float const share = sums_[i] - before;
    // The place within the triangle's share is uniform again.
    float const r = std::sqrt(share > 0.0f ? clamp((u.x - before) / share, 0.0f, 1.0f) : 0.5f);
    Triangle const& t = triangles_[i];
    return {t.corner + t.edge1 * (r * (1.0f - u.y)) + t.edge2 * (r * u.y), t.Ng};
}

float EmittingSurface::density(Vec3f from, Vec3f to, Vec3f Ng) const
{
    Vec3f const way = to - from;
    float const squared = dot(way, way);
    float const cosine = std::fabs(dot(way, Ng)) / std::sqrt(squared);
    return cosine > 0.0f ? squared / (cosine * area_) : std::numeric_limits<float>::infinity();
}

LightSet::LightSet(Scene const& scene)
    : scene_(&scene)
{
    std::vector<TreeLight> bounded;
    for (std::uint32_t i = 0; i < scene.lights.size(); ++i) {
        Light const& light = scene.lights[i];
        auto const* const surface = std::get_if<SurfaceLight>(&light);
        surfaces_.push_back(surface ? std::make_unique<EmittingSurface>(scene, *surface) : nullptr);
        hasSurfaces_ = hasSurfaces_ || surface;
        if (auto const* const point = std::get_if<PointLight>(&light))
            bounded.push_back({i, point->position, point->radius, point->axis,
                               minOf(point->angle * (3.14159265f / 360.0f), 3.14159265f),
                               maxComponent(point->color)});
        else if (surface)
            bounded.push_back(surfaces_.back()->bounds(i, surface->emission));
        else
            always_.push_back(i); // only asking tells what it brings
    }
    std::erase_if(bounded, [](TreeLight const& l) { return !(l.power > 0.0f); });
    if (bounded.size() > LightTree::kMost)
        tree_.emplace(std::move(bounded));
    else
        for (TreeLight const& light : bounded)
            always_.push_back(light.light);
    std::ranges::sort(always_); // in the order of the scene
}

bool LightSet::isSpread(std::size_t light) const
{
    Light const& l = scene_->lights[light];
    if (auto const* const point = std::get_if<PointLight>(&l))
        return point->radius > 0.0f;
    if (auto const* const shader = std::get_if<ShaderLight>(&l))
        return shader->radius > 0.0f;
    return true;
}

namespace {

/// What of the light goes in a unit direction.
float inCone(PointLight const& light, Vec3f direction)
{
    constexpr float kHalf = 3.14159265f / 360.0f; // of an angle in degrees, radians
    if (light.angle >= 360.0f)
        return 1.0f;
    float const cosine = dot(direction, light.axis);
    float const outer = std::cos(light.angle * kHalf), inner = std::cos(light.innerAngle * kHalf);
    if (cosine >= inner || cosine <= outer)
        return cosine >= inner ? 1.0f : 0.0f;
    float const t = (cosine - outer) / (inner - outer);
    return t * t * (3.0f - 2.0f * t);
}

} // namespace

std::optional<Arrival> LightSet::arrival(std::size_t light, Vec3f P, Vec3f normal, Vec2f u) const
{
    constexpr float kPi = 3.14159265f;
    Light const& l = scene_->lights[light];
    Arrival a;
    if (auto const* const shader = std::get_if<ShaderLight>(&l)) {
        a.to = pointOfBall(shader->position, shader->radius, P, u);
        a.L = normalize(a.to - P);
        return dot(a.L, normal) > 0.0f ? std::optional(a) : std::nullopt;
    }
    if (auto const* const sun = std::get_if<SunLight>(&l)) {
        // Uniform over the disc that it shows.
        float const edge = std::cos(sun->angle * (kPi / 360.0f));
        a.L = a.to = around(sun->direction, 1.0f - u.x * (1.0f - edge), u.y);
        a.isFar = true;
        a.color = sun->color;
    } else if (auto const* const point = std::get_if<PointLight>(&l)) {
        a.to = pointOfBall(point->position, point->radius, P, u);
        Vec3f const way = a.to - P, middle = point->position - P;
        float const squared = dot(middle, middle);
        if (!(squared > 0.0f))
            return {};
        a.L = normalize(way);
        a.color = point->color * (inCone(*point, middle / -std::sqrt(squared)) / squared);
    } else {
        EmittingSurface const& surface = *surfaces_[light];
        EmittingPoint const from = surface.sample(u);
        a.to = from.P;
        Vec3f const way = from.P - P;
        float const squared = dot(way, way);
        if (!(squared > 0.0f) || !(surface.area() > 0.0f))
            return {};
        a.L = way / std::sqrt(squared);
        float const cosine = -dot(a.L, from.Ng);
        if (!(cosine > 0.0f))
            return {};
        a.density = squared / (cosine * surface.area());
        a.color = std::get<SurfaceLight>(l).emission / (a.density * kPi);
    }
    if (!(dot(a.L, normal) > 0.0f) || a.color == Vec3f(0, 0, 0))
        return {};
    return a;
}

Vec3f pointOfBall(Vec3f position, float radius, Vec3f P, Vec2f u)
{
    if (!(radius > 0.0f))
        return position;
    Vec3f const axis = normalize(position - P);
    // Any two directions across the axis; the one that is not near it starts them.
    Vec3f const across =
        normalize(cross(axis, std::fabs(axis.x) < 0.5f ? Vec3f(1, 0, 0) : Vec3f(0, 1, 0)));
    Vec3f const other = cross(axis, across);
    float const r = radius * std::sqrt(u.x);
    float const phi = 6.28318531f * u.y;
    return position + across * (r * std::cos(phi)) + other * (r * std::sin(phi));
}

bool askLight(ShaderLight const& light, Vec3f position, Vec3f P, Vec3f normal, IShaderAPI* api,
              ShadeState& record, LightSample& sample)
{
    Vec3f const towards = position - P;
    float const distance = length(towards);
    if (!(distance > 0.0f) || !std::isfinite(distance))
        return false;
    Vec3f const L = towards / distance;
    float const cosine = dot(L, normal);
    if (!(cosine > 0.0f))
        return false;

    record.P = P;
    record.lightPosition = position;
    record.lightAxis = light.axis;
    record.lightToPoint = -L;
    record.lightDistance = distance;
    record.lightColor = {0, 0, 0}; // what a light leaves untouched does not count
    record.lightShadow = {1, 1, 1};
    light.shader.light()->illumination(api, record);
    Vec3f const color = record.lightColor, shadow = record.lightShadow;
    if (color == Vec3f(0, 0, 0))
        return false;

    sample = {};
    sample.L = L;
    sample.color = color;
    sample.shadow = shadow;
    sample.weight = minOf(cosine, 1.0f);
    return true;
}

} // namespace zsi::host
