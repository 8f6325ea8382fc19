// SPDX-License-Identifier: Apache-2.0
#include "light/lightTree.h"

#include <algorithm>
#include <limits>
#include <span>

namespace zsi::host {
namespace {

constexpr float kPi = 3.14159265f;

/// The smallest cone of directions around two.
struct Cone {
    Vec3f axis;
    float spread;
};

Cone joined(Cone a, Cone b)
{
    if (b.spread > a.spread)
        std::swap(a, b);
    float const between = std::acos(clamp(dot(a.axis, b.axis), -1.0f, 1.0f));
    if (minOf(between + b.spread, kPi) <= a.spread)
        return a;
    float const spread = (a.spread + between + b.spread) / 2.0f;
    Vec3f const across = b.axis - a.axis * dot(a.axis, b.axis);
    if (spread >= kPi || !(length(across) > 1e-4f))
        return {a.axis, kPi};
    float const turn = spread - a.spread;
    return {normalize(a.axis * std::cos(turn) + normalize(across) * std::sin(turn)), spread};
}

/// What lights have in common: a box around them, a cone around their normals, their power.
struct Cluster {
    Vec3f low{std::numeric_limits<float>::max(), std::numeric_limits<float>::max(),
              std::numeric_limits<float>::max()};
    Vec3f high = -low;
    Cone cone{};
    float power = 0.0f;

    void add(TreeLight const& l)
    {
        Vec3f const r(l.radius, l.radius, l.radius);
        Vec3f const a = l.center - r, b = l.center + r;
        low = {minOf(low.x, a.x), minOf(low.y, a.y), minOf(low.z, a.z)};
        high = {maxOf(high.x, b.x), maxOf(high.y, b.y), maxOf(high.z, b.z)};
        cone = power > 0.0f ? joined(cone, {l.axis, l.spread}) : Cone{l.axis, l.spread};
        power += l.power;
    }
    float radius() const { return length(high - low) / 2.0f; }
    /// How much is lost when one light stands for all: power over a surface and over directions
    /// (Conty Estevez and Kulla 2018, eq. 1 and 2).
    float cost() const
    {
        float const o = cone.spread, w = minOf(o + kPi / 2.0f, kPi);
        float const directions = 2.0f * kPi * (1.0f - std::cos(o))
            + kPi / 2.0f
                * (2.0f * w * std::sin(o) - std::cos(o - 2.0f * w) - 2.0f * o * std::sin(o)
                   + std::cos(o));
        float const r = radius();
        return power * r * r * directions;
    }
};

float along(Vec3f v, int axis) { return axis == 0 ? v.x : axis == 1 ? v.y : v.z; }

void sortAlong(std::span<TreeLight> lights, int axis)
{
    std::stable_sort(lights.begin(), lights.end(), [&](TreeLight const& a, TreeLight const& b) {
        return along(a.center, axis) < along(b.center, axis);
    });
}

/// Cosine of the angle less another, not below that of 0; of angles in [0, pi].
float cosineLess(float cosine, float sine, float cosLess, float sinLess)
{
    return cosine > cosLess ? 1.0f : cosine * cosLess + sine * sinLess;
}

float sineOf(float cosine) { return std::sqrt(maxOf(1.0f - cosine * cosine, 0.0f)); }

} // namespace

LightTree::LightTree(std::vector<TreeLight> lights)
{
    nodes_.reserve(2 * lights.size());
    build(lights, 0, lights.size());
}

void LightTree::build(std::vector<TreeLight>& lights, std::size_t begin, std::size_t end)
{
    std::span<TreeLight> const part(lights.data() + begin, end - begin);
    Cluster all;
    for (TreeLight const& light : part)
        all.add(light);
    std::size_t const node = nodes_.size();
    float const radius = part.size() == 1 ? part[0].radius : all.radius();
    nodes_.push_back({(all.low + all.high) * 0.5f, radius, all.cone.axis, std::cos(all.cone.spread),
                      std::sin(all.cone.spread), all.power, part[0].light, part.size() == 1});
    if (part.size() == 1)
        return;

    float best = std::numeric_limits<float>::infinity();
    std::size_t middle = part.size() / 2;
    int bestAxis = 0;
    std::vector<float> costs(part.size());
    for (int axis = 0; axis < 3; ++axis) {
        sortAlong(part, axis);
        Cluster left, right;
        for (std::size_t i = 0; i + 1 < part.size(); ++i) {
            left.add(part[i]);
            costs[i + 1] = left.cost();
        }
        for (std::size_t i = part.size() - 1; i > 0; --i) {
            right.add(part[i]);
            if (float const cost = costs[i] + right.cost(); cost < best) {
                best = cost;
                bestAxis = axis;
                middle = i;
            }
        }
    }
    sortAlong(part, bestAxis);
    build(lights, begin, begin + middle);
    nodes_[node].next = static_cast<std::uint32_t>(nodes_.size());
    build(lights, begin + middle, end);
}

float LightTree::value(Node const& node, Vec3f P, Vec3f normal) const
{
    Vec3f const way = node.center - P;
    float const squared = dot(way, way), r2 = node.radius * node.radius;
    if (!(squared > r2))
        return r2 > 0.0f ? node.power / r2 : 0.0f;
    Vec3f const L = way / std::sqrt(squared);
    // The half angle under which the cluster's ball is seen.
    float const sinBall = node.radius / std::sqrt(squared), cosBall = sineOf(sinBall);
    float const cosHere = dot(L, normal);
    float const here = cosineLess(cosHere, sineOf(cosHere), cosBall, sinBall);
    if (!(here > 0.0f))
        return 0.0f;
    float there = 1.0f;
    if (node.cosSpread > -1.0f) {
        float const cosThere = -dot(L, node.axis), sinThere = sineOf(cosThere);
        if (cosThere < node.cosSpread) {
            float const cosBeyond = cosThere * node.cosSpread + sinThere * node.sinSpread;
            float const sinBeyond = sinThere * node.cosSpread - cosThere * node.sinSpread;
            there = cosineLess(cosBeyond, sinBeyond, cosBall, sinBall);
        }
    }
    return there > 0.0f ? node.power * here * there / squared : 0.0f;
}

std::size_t LightTree::cutFor(Vec3f P, Vec3f normal, std::array<Entry, kMost>& cut) const
{
    cut[0] = {0, value(nodes_[0], P, normal)};
    std::size_t count = 1;
    for (;;) {
        std::size_t widest = count;
        for (std::size_t i = 0; i < count; ++i)
            if (!isLeaf(cut[i].node) && (widest == count || cut[i].value > cut[widest].value))
                widest = i;
        if (widest == count || count == kMost)
            return count;
        std::uint32_t const node = cut[widest].node, second = nodes_[node].next;
        cut[widest] = {node + 1, value(nodes_[node + 1], P, normal)};
        if (float const v = value(nodes_[second], P, normal); v > 0.0f)
            cut[count++] = {second, v};
        if (!(cut[widest].value > 0.0f))
            cut[widest] = cut[--count];
    }
}

bool LightTree::draw(std::uint32_t node, Vec3f P, Vec3f normal, float u, PickedLight& picked) const
{
    float chance = 1.0f;
    while (!isLeaf(node)) {
        std::uint32_t const first = node + 1, second = nodes_[node].next;
        float const a = value(nodes_[first], P, normal), b = value(nodes_[second], P, normal);
        if (!(a + b > 0.0f))
            return false;
        float const share = a / (a + b);
        bool const isFirst = u < share;
        // The place within the chosen share is uniform again.
        u = isFirst ? u / share : (u - share) / (1.0f - share);
        u = minOf(u, 0x1.fffffep-1f);
        chance *= isFirst ? share : 1.0f - share;
        node = isFirst ? first : second;
    }
    picked = {nodes_[node].next, 1.0f / chance};
    return true;
}

} // namespace zsi::host
