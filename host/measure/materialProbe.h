// SPDX-License-Identifier: Apache-2.0
/// How a material scatters light, without a scene.
#pragma once

#include "plugin/shader.h"

#include <cstdint>
#include <span>
#include <vector>

namespace zsi::host {

/// Where the results of `MaterialProbe::sample` go; all of one length.
struct DrawnDirections {
    std::span<Vec3f> direction; ///< unit; 0 where the material gave none
    std::span<Vec3f> weight; ///< value times cosine over density
    std::span<float> density; ///< 1/sr as the material tells it; 1 for perfectly specular draws
    std::span<std::uint32_t> type; ///< a `zsi::SampleType`
};

/// Draws counted over the sphere, in cells of one solid angle: `rows` of equal height from +z to -z
/// times `columns` of equal azimuth from +x over +y.
struct SphereHistogram {
    int rows, columns;
    std::vector<float> density; ///< share of the draws over the cell's solid angle, 1/sr
    /// Mean over all draws of 1/density for those in the cell, over its solid angle: 1 where the
    /// densities that the material tells are those that it draws with and the cell is full.
    std::vector<float> coverage;
    double declined = 0; ///< share of draws that gave no direction
};

/// A point of a flat surface with the material: at the origin and at the middle of the uv square,
/// with normal z, tangent x and bitangent y, seen by a camera ray. All directions are unit and
/// point away from the surface: `wi` to where the ray came from, `wo` to where it goes on. On the
/// side of -z a material that bounds a medium is seen from within.
///
/// Operations run on `threads` threads (0: one per processor) and give the same whatever their
/// number. Draw j for direction i depends on `seed`, i and j alone; the first 2^k draws of a
/// direction are stratified.
class MaterialProbe {
public:
    /// `shader` must outlive this. Throws InputError for what is no material.
    explicit MaterialProbe(Shader const& shader);

    /// The value for each pair, 1/sr: what `transfer` gives with its cosine, divided by |cos wo|
    /// unless `withCosine`. As many `wi` and `wo` as `values`, or one for all. Throws InputError
    /// for a material without `transfer`.
    void evaluate(std::span<Vec3f const> wi, std::span<Vec3f const> wo, bool withCosine,
                  std::span<Vec3f> values, int threads = 0) const;
    /// As many draws for each `wi` as fit into `out`, one direction's after the other's. Throws
    /// InputError for a material without `sample`.
    void sample(std::span<Vec3f const> wi, std::uint32_t seed, DrawnDirections const& out,
                int threads = 0) const;
    /// Draws for one `wi` that depend on each other in nothing, as statistics take them; else as
    /// above.
    void sampleApart(Vec3f wi, std::uint32_t seed, DrawnDirections const& out,
                     int threads = 0) const;
    /// What one light of colour 1 towards each of `wo` adds to what `shade` shows, where there is
    /// nothing else, found with one of 1/128, since some classes clip what they show: pi times the
    /// value times the cosine for a material that lights itself as `transfer` says. NaN where it
    /// discards the hit.
    void lit(std::span<Vec3f const> wi, std::span<Vec3f const> wo, std::span<Vec3f> values,
             int threads = 0) const;
    /// The share of light that a white furnace gets back, for `wi` at `theta` radians from z
    /// towards x: the mean weight of `draws` draws.
    void albedo(std::span<float const> theta, std::uint32_t draws, std::uint32_t seed,
                std::span<Vec3f> values, int threads = 0) const;
    SphereHistogram histogram(Vec3f wi, std::uint32_t draws, std::uint32_t seed, int rows,
                              int columns, int threads = 0) const;

private:
    class Call;
    void need(int entryPoint, char const* name) const;

    Shader const& shader_;
    MaterialShader const& material_;
};

} // namespace zsi::host
