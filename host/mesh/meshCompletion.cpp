// SPDX-License-Identifier: Apache-2.0
#include "mesh/meshCompletion.h"

#include <algorithm>
#include <cmath>
#include <fmt/format.h>
#include <limits>
#include <map>
#include <tuple>

namespace zsi::host {

namespace {

using Triangle = std::array<std::uint32_t, 3>;
constexpr std::uint32_t kNone = std::numeric_limits<std::uint32_t>::max();

bool isFinite(Vec2f v) { return std::isfinite(v.x) && std::isfinite(v.y); }
bool isFinite(Vec3f v) { return std::isfinite(v.x) && std::isfinite(v.y) && std::isfinite(v.z); }
bool isFinite(Vec4f v) { return isFinite(rgb(v)) && std::isfinite(v.w); }
bool isDirection(Vec3f v) { return isFinite(v) && std::isfinite(length(v)) && length(v) > 0.0f; }

/// Calls `f` with every array that has a value for each vertex.
template <class F>
void forEachArray(Mesh& mesh, F&& f)
{
    f(mesh.positions);
    for (auto* const array : {&mesh.normals, &mesh.tangents, &mesh.bitangents})
        if (!array->empty())
            f(*array);
    for (auto* const array : {&mesh.uv, &mesh.uv1})
        if (!array->empty())
            f(*array);
    if (!mesh.colors.empty())
        f(mesh.colors);
}

/// Vertex i becomes what vertex from[i] was.
void rearrange(Mesh& mesh, std::vector<std::uint32_t> const& from)
{
    forEachArray(mesh, [&](auto& array) {
        std::decay_t<decltype(array)> moved;
        moved.reserve(from.size());
        for (std::uint32_t const i : from)
            moved.push_back(array[i]);
        array = std::move(moved);
    });
}

Vec3f faceCross(Mesh const& mesh, Triangle const& t)
{
    Vec3f const a = mesh.positions[t[0]];
    return cross(mesh.positions[t[1]] - a, mesh.positions[t[2]] - a);
}

std::string counted(std::size_t count, char const* thing)
{
    return fmt::format("{} {}{}", count, thing, count == 1 ? "" : "s");
}

void dropBadTriangles(Mesh& mesh, std::vector<std::string>& warnings)
{
    std::size_t missing = 0, notFinite = 0, flat = 0;
    auto const isBad = [&](Triangle const& t) {
        for (std::uint32_t const i : t)
            if (i >= mesh.positions.size())
                return ++missing, true;
        for (std::uint32_t const i : t)
            if (!isFinite(mesh.positions[i]))
                return ++notFinite, true;
        Vec3f const c = faceCross(mesh, t);
        if (!std::isfinite(length(c)))
            return ++notFinite, true;
        return isDirection(c) ? false : (++flat, true);
    };
    std::size_t kept = 0;
    for (std::size_t i = 0; i < mesh.triangles.size(); ++i)
        if (!isBad(mesh.triangles[i])) {
            if (!mesh.partOf.empty())
                mesh.partOf[kept] = mesh.partOf[i];
            mesh.triangles[kept++] = mesh.triangles[i];
        }
    mesh.triangles.resize(kept);
    mesh.partOf.resize(mesh.partOf.empty() ? 0 : kept);
    auto const warn = [&](std::size_t count, char const* why) {
        if (count > 0)
            warnings.push_back(fmt::format("{} {} left out", counted(count, "triangle"), why));
    };
    warn(missing, "with corners that do not exist");
    warn(notFinite, "with coordinates that are not finite or too large");
    warn(flat, "without area");
    if (missing + notFinite + flat == 0)
        return;
    std::vector<std::uint32_t> from, to(mesh.positions.size(), kNone);
    for (Triangle& t : mesh.triangles)
        for (std::uint32_t& i : t) {
            if (to[i] == kNone) {
                to[i] = static_cast<std::uint32_t>(from.size());
                from.push_back(i);
            }
            i = to[i];
        }
    rearrange(mesh, from);
}

template <class Value>
void replaceNonFinite(std::vector<Value>& values, Value by, char const* what,
                      std::vector<std::string>& warnings)
{
    std::size_t count = 0;
    for (Value& v : values)
        if (!isFinite(v)) {
            v = by;
            ++count;
        }
    if (count > 0)
        warnings.push_back(fmt::format("{} that {} not finite replaced", counted(count, what),
                                       count == 1 ? "is" : "are"));
}

float angleAt(Mesh const& mesh, Triangle const& t, std::size_t corner)
{
    Vec3f const p = mesh.positions[t[corner]];
    Vec3f const a = mesh.positions[t[(corner + 1) % 3]] - p;
    Vec3f const b = mesh.positions[t[(corner + 2) % 3]] - p;
    return std::atan2(length(cross(a, b)), dot(a, b));
}

/// A number for each vertex; vertices at one place have the same.
std::vector<std::uint32_t> places(Mesh const& mesh)
{
    std::map<std::tuple<float, float, float>, std::uint32_t> known;
    std::vector<std::uint32_t> place;
    place.reserve(mesh.positions.size());
    for (Vec3f const& p : mesh.positions) {
        auto const next = static_cast<std::uint32_t>(known.size());
        place.push_back(known.try_emplace({p.x, p.y, p.z}, next).first->second);
    }
    return place;
}

std::vector<Vec3f> smoothNormals(Mesh const& mesh)
{
    std::vector<std::uint32_t> const place = places(mesh);
    std::vector<Vec3f> sum(place.size(), Vec3f(0, 0, 0)), normals(place.size(), Vec3f(0, 0, 1));
    for (Triangle const& t : mesh.triangles) {
        Vec3f const face = normalize(faceCross(mesh, t));
        for (std::size_t i = 0; i < 3; ++i)
            sum[place[t[i]]] += face * angleAt(mesh, t, i);
    }
    for (Triangle const& t : mesh.triangles)
        for (std::uint32_t const i : t) {
            Vec3f const& mean = sum[place[i]];
            // The two sides of a sheet cancel out: there, each has its own.
            normals[i] = normalize(length(mean) > 1e-4f ? mean : faceCross(mesh, t));
        }
    return normals;
}

void makeFlat(Mesh& mesh)
{
    std::vector<std::uint32_t> from;
    std::vector<Vec3f> normals;
    for (Triangle& t : mesh.triangles) {
        Vec3f const face = normalize(faceCross(mesh, t));
        for (std::uint32_t& i : t) {
            from.push_back(i);
            i = static_cast<std::uint32_t>(normals.size());
            normals.push_back(face);
        }
    }
    rearrange(mesh, from);
    mesh.normals = std::move(normals);
}

void makeNormals(Mesh& mesh, NormalSource source)
{
    if (source == NormalSource::Flat) {
        makeFlat(mesh);
        return;
    }
    bool const complete =
        !mesh.normals.empty() && std::all_of(mesh.normals.begin(), mesh.normals.end(), isDirection);
    if (source == NormalSource::Smooth || !complete) {
        std::vector<Vec3f> const smooth = smoothNormals(mesh);
        if (source == NormalSource::Smooth || mesh.normals.empty())
            mesh.normals = smooth;
        for (std::size_t i = 0; i < smooth.size(); ++i)
            if (!isDirection(mesh.normals[i]))
                mesh.normals[i] = smooth[i];
    }
    for (Vec3f& n : mesh.normals)
        n = normalize(n);
}

/// Directions along which u and v grow, summed over the triangles around each vertex by area.
void tangentsFromUv(Mesh& mesh)
{
    mesh.tangents.assign(mesh.positions.size(), Vec3f(0, 0, 0));
    mesh.bitangents = mesh.tangents;
    for (Triangle const& t : mesh.triangles) {
        Vec3f const p1 = mesh.positions[t[1]] - mesh.positions[t[0]];
        Vec3f const p2 = mesh.positions[t[2]] - mesh.positions[t[0]];
        Vec2f const uv1 = mesh.uv[t[1]] - mesh.uv[t[0]], uv2 = mesh.uv[t[2]] - mesh.uv[t[0]];
        float const area = uv1.x * uv2.y - uv2.x * uv1.y;
        Vec3f const alongU = (p1 * uv2.y - p2 * uv1.y) * sign(area);
        Vec3f const alongV = (p2 * uv1.x - p1 * uv2.x) * sign(area);
        if (!isDirection(alongU) || !isDirection(alongV))
            continue;
        float const weight = length(cross(p1, p2));
        for (std::uint32_t const i : t) {
            mesh.tangents[i] += normalize(alongU) * weight;
            mesh.bitangents[i] += normalize(alongV) * weight;
        }
    }
}

void makeTangents(Mesh& mesh)
{
    if (mesh.tangents.empty() || mesh.bitangents.empty())
        tangentsFromUv(mesh);
    for (std::size_t i = 0; i < mesh.positions.size(); ++i) {
        Vec3f const n = mesh.normals[i];
        Vec3f t = normalize(mesh.tangents[i]);
        t = t - n * dot(n, t);
        if (!isDirection(t) || length(t) < 1e-3f) {
            Vec3f const level = cross({0, 0, 1}, n);
            t = length(level) > 1e-3f ? level : Vec3f(1, 0, 0) - n * n.x;
        }
        t = normalize(t);
        Vec3f const b = cross(n, t);
        mesh.tangents[i] = t;
        // Mirrored uv turn the other way round.
        mesh.bitangents[i] = dot(b, mesh.bitangents[i]) < 0.0f ? -b : b;
    }
}

/// 0 to 5 for +x, -x, +y, -y, +z, -z.
std::size_t sideOf(Vec3f n)
{
    float const x = std::fabs(n.x), y = std::fabs(n.y), z = std::fabs(n.z);
    if (z >= x && z >= y)
        return n.z < 0 ? 5 : 4;
    if (x >= y)
        return n.x < 0 ? 1 : 0;
    return n.y < 0 ? 3 : 2;
}

Vec2f projected(Vec3f p, std::size_t side)
{
    switch (side) {
    case 0:
        return {p.y, p.z};
    case 1:
        return {-p.y, p.z};
    case 2:
        return {-p.x, p.z};
    case 3:
        return {p.x, p.z};
    case 4:
        return {p.x, p.y};
    default:
        return {-p.x, p.y};
    }
}

} // namespace

std::vector<Mesh> partsOf(Mesh const& mesh)
{
    std::vector<Mesh> parts(mesh.parts.size());
    std::vector<std::vector<std::uint32_t>> from(parts.size()); // vertices of each part
    std::vector<std::uint32_t> to(mesh.positions.size()), owner(mesh.positions.size(), kNone);
    // The triangles of a part stand together, so that a vertex has one owner at a time.
    for (std::size_t i = 0; i < mesh.triangles.size(); ++i) {
        std::uint32_t const part = mesh.partOf[i];
        Triangle t = mesh.triangles[i];
        for (std::uint32_t& corner : t) {
            if (owner[corner] != part) {
                owner[corner] = part;
                to[corner] = static_cast<std::uint32_t>(from[part].size());
                from[part].push_back(corner);
            }
            corner = to[corner];
        }
        parts[part].triangles.push_back(t);
    }
    auto const take = [&](auto Mesh::*array) {
        if (!(mesh.*array).empty())
            for (std::size_t part = 0; part < parts.size(); ++part)
                for (std::uint32_t const i : from[part])
                    (parts[part].*array).push_back((mesh.*array)[i]);
    };
    take(&Mesh::positions);
    take(&Mesh::normals);
    take(&Mesh::tangents);
    take(&Mesh::bitangents);
    take(&Mesh::uv);
    take(&Mesh::uv1);
    take(&Mesh::colors);
    return parts;
}

void projectUv(Mesh& mesh)
{
    std::array<std::uint32_t, 6> unused;
    unused.fill(kNone);
    std::vector<std::array<std::uint32_t, 6>> split(mesh.positions.size(), unused);
    std::vector<std::uint32_t> from;
    std::vector<Vec2f> uv;
    for (Triangle& t : mesh.triangles) {
        std::size_t const side = sideOf(faceCross(mesh, t));
        for (std::uint32_t& i : t) {
            std::uint32_t& vertex = split[i][side];
            if (vertex == kNone) {
                vertex = static_cast<std::uint32_t>(from.size());
                from.push_back(i);
                uv.push_back(projected(mesh.positions[i], side));
            }
            i = vertex;
        }
    }
    mesh.uv.clear();
    rearrange(mesh, from);
    mesh.uv = std::move(uv);
}

void completeMesh(Mesh& mesh, NormalSource source, std::vector<std::string>& warnings)
{
    dropBadTriangles(mesh, warnings);
    makeNormals(mesh, source);
    if (mesh.uv.empty())
        projectUv(mesh);
    replaceNonFinite(mesh.uv, Vec2f(0, 0), "texture coordinate", warnings);
    replaceNonFinite(mesh.uv1, Vec2f(0, 0), "second texture coordinate", warnings);
    replaceNonFinite(mesh.colors, Vec4f(1, 1, 1, 1), "vertex colour", warnings);
    makeTangents(mesh);
}

} // namespace zsi::host
