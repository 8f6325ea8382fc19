// SPDX-License-Identifier: Apache-2.0
/// Picks, from many lights, a few that stand for all of them.
#pragma once

#include <array>
#include <cmath>
#include <cstdint>
#include <vector>
#include <zsi/vecmath.h>

namespace zsi::host {

/// One of a scene's lights to ask, instead of those that it stands for.
struct PickedLight {
    std::uint32_t light; ///< index into Scene::lights
    float scale; ///< 1 / the chance with which it was picked
};

/// A light as the tree knows it.
struct TreeLight {
    std::uint32_t light;
    Vec3f center;
    float radius; ///< of a ball that holds it
    Vec3f axis; ///< unit: where it shines, with `spread`
    float spread; ///< angle that its normals have to `axis` at most, radians; pi: any
    float power; ///< what would arrive at distance 1 in front of it, above 0
};

/// Lights in clusters of clusters, each with the bounds of Conty Estevez and Kulla 2018
/// ("Importance Sampling of Many Lights with Adaptive Tree Splitting"). A query opens the cluster
/// that may bring most, again and again, until `kMost` are left, as Walter et al. 2005 refine
/// "Lightcuts"; of each that is left one light is drawn, by what its halves may bring on the way
/// down. Never leaves out a light that brings anything, so that sums stay right in the mean.
class LightTree {
public:
    static constexpr std::size_t kMost = 8;
    using Picks = std::array<PickedLight, kMost>;

    /// `lights`: at least one.
    explicit LightTree(std::vector<TreeLight> lights);

    /// Fills the beginning of `picks` for a point that is lit from the side of `normal`; gives how
    /// many. `random`: gives numbers in [0, 1).
    template <class Random>
    std::size_t pick(Vec3f P, Vec3f normal, Picks& picks, Random const& random) const
    {
        std::array<Entry, kMost> cut;
        std::size_t const count = cutFor(P, normal, cut);
        std::size_t picked = 0;
        for (std::size_t i = 0; i < count; ++i)
            if (isLeaf(cut[i].node))
                picks[picked++] = {nodes_[cut[i].node].next, 1.0f};
            else if (draw(cut[i].node, P, normal, random(), picks[picked]))
                ++picked;
        return picked;
    }

private:
    struct Node {
        Vec3f center;
        float radius;
        Vec3f axis;
        float cosSpread, sinSpread;
        float power;
        std::uint32_t next; ///< of a leaf its light, else the second child; the first follows
        bool leaf;
    };
    struct Entry {
        std::uint32_t node;
        float value; ///< what it may bring
    };

    void build(std::vector<TreeLight>& lights, std::size_t begin, std::size_t end);
    bool isLeaf(std::uint32_t node) const { return nodes_[node].leaf; }
    /// What a cluster may bring at most, but for points inside of it: about as much.
    float value(Node const& node, Vec3f P, Vec3f normal) const;
    std::size_t cutFor(Vec3f P, Vec3f normal, std::array<Entry, kMost>& cut) const;
    bool draw(std::uint32_t node, Vec3f P, Vec3f normal, float u, PickedLight& picked) const;

    std::vector<Node> nodes_;
};

} // namespace zsi::host
