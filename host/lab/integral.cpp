// SPDX-License-Identifier: Apache-2.0
#include "lab/integral.h"

#include "base/hash.h"
#include "sampling/directions.h"
#include "sampling/sampler.h"

#include <array>
#include <cmath>

namespace zsi::lab {
namespace {

constexpr float kPi = 3.14159265f;
/// Of lobes around the mirrored direction; together with the cosine they find highlights of any
/// width, by the balance heuristic (Veach 1997, 9.2.2).
constexpr float kWidths[] = {0.5f, 0.15f, 0.04f, 0.01f};
constexpr std::size_t kWays = std::size(kWidths) + 1;
constexpr std::size_t kBatches = 16; ///< drawn apart, so that their spread tells the error

} // namespace

Estimate reflected(Specimen const& specimen, Vec3f wi, int points, std::uint32_t seed, int threads)
{
    Vec3f const mirrored{-wi.x, -wi.y, wi.z};
    auto const each = static_cast<std::size_t>(points) / (kWays * kBatches);
    std::vector<Vec3f> directions;
    for (std::size_t batch = 0; batch < kBatches; ++batch) {
        host::Sampler sampler(host::hashCombine(seed, static_cast<std::uint32_t>(batch)), 0, 0);
        for (std::size_t i = 0; i < each; ++i) {
            sampler.start(static_cast<std::uint32_t>(i));
            directions.push_back(host::cosineDirection({0, 0, 1}, sampler.next2D()));
            for (float const width : kWidths)
                directions.push_back(host::lobeDirection(mirrored, width, 2.0f, sampler.next2D()));
        }
    }
    std::vector<Vec3f> values(directions.size());
    specimen.values({&wi, 1}, directions, values, threads);

    std::array<std::array<double, 3>, kBatches> sums{};
    for (std::size_t i = 0; i < directions.size(); ++i) {
        Vec3f const d = directions[i], v = values[i];
        if (!(d.z > 1e-4f) || !std::isfinite(v.x + v.y + v.z))
            continue;
        float density = d.z / kPi;
        for (float const width : kWidths)
            density += host::lobeDensity(dot(d, mirrored), width, 2.0f);
        double const weight = static_cast<double>(d.z / density) / static_cast<double>(each);
        auto& sum = sums[i / (each * kWays)];
        sum[0] += static_cast<double>(v.x) * weight;
        sum[1] += static_cast<double>(v.y) * weight;
        sum[2] += static_cast<double>(v.z) * weight;
    }
    float mean[3], error[3];
    for (std::size_t c = 0; c < 3; ++c) {
        double sum = 0, squares = 0;
        for (auto const& batch : sums) {
            sum += batch[c] / kBatches;
            squares += batch[c] * batch[c] / kBatches;
        }
        mean[c] = static_cast<float>(sum);
        error[c] =
            static_cast<float>(std::sqrt(std::max(0.0, squares - sum * sum) / (kBatches - 1.0)));
    }
    return {{mean[0], mean[1], mean[2]}, {error[0], error[1], error[2]}};
}

} // namespace zsi::lab
