// SPDX-License-Identifier: Apache-2.0
#include "lab/densityTest.h"

#include "base/grid.h"
#include "base/hash.h"

#include <algorithm>
#include <array>
#include <boost/math/special_functions/gamma.hpp>
#include <cmath>
#include <set>
#include <tuple>
#include <zsi/vecmath.h>

namespace zsi::lab {
namespace {

constexpr double kPi = 3.14159265358979323846;
constexpr std::size_t kLeaf = 160; ///< draws of the first set; more are divided
constexpr std::size_t kEnough = 60; ///< draws of the second set, for an error that is normal
constexpr double kSteep = 0.8; ///< standard deviation of 1/density over its mean
constexpr double kSmooth = 0.4; ///< likewise; below this there is no steep side
constexpr int kFine = 3; ///< parts of a cell in each direction, with nine draws and more in each
constexpr std::size_t kFew = 8; ///< directions of mirrors and lenses

struct Draw {
    double z, phi, area; ///< area: 1/density
};

/// All draws of one seed, sorted by kind.
struct Set {
    std::vector<Draw> spread;
    std::size_t declined = 0, ofDensityOne = 0, notUnit = 0, noDensity = 0;
    std::set<std::tuple<long, long, long>> directionsOfOne; ///< up to a few more than kFew

    Set(host::MaterialProbe const& probe, Vec3f wi, std::uint32_t draws, std::uint32_t seed,
        int threads)
    {
        std::vector<Vec3f> direction(draws), weight(draws);
        std::vector<float> density(draws);
        std::vector<std::uint32_t> type(draws);
        probe.sampleApart(wi, seed, {direction, weight, density, type}, threads);
        for (std::size_t i = 0; i < draws; ++i) {
            Vec3f const d = direction[i];
            if (type[i] == kSampleNone) {
                ++declined;
            } else if (!(std::fabs(dot(d, d) - 1.0f) < 1e-3f)) {
                ++notUnit;
            } else if (!(density[i] > 0.0f && std::isfinite(density[i]))) {
                ++noDensity;
            } else if (density[i] == 1.0f) {
                ++ofDensityOne;
                if (directionsOfOne.size() <= kFew) {
                    auto const rounded = [](float v) { return std::lround(v * 1e4f); };
                    directionsOfOne.emplace(rounded(d.x), rounded(d.y), rounded(d.z));
                }
            } else {
                spread.push_back({std::clamp(static_cast<double>(d.z), -1.0, 1.0),
                                  std::atan2(static_cast<double>(d.y), static_cast<double>(-d.x)),
                                  1.0 / static_cast<double>(density[i])});
            }
        }
    }
};

using Draws = std::span<Draw>;

double variance(Draws draws, double& mean)
{
    double sum = 0, squares = 0;
    for (Draw const& d : draws) {
        sum += d.area;
        squares += d.area * d.area;
    }
    auto const n = static_cast<double>(draws.size());
    mean = sum / n;
    return std::max(0.0, squares / n - mean * mean);
}

/// Whether the draws leave no part of the cell out: where a lobe ends within it, what they tell of
/// the density says nothing about the rest.
bool fills(Draws draws, DensityCell const& cell)
{
    std::array<int, kFine * kFine> counts{};
    for (Draw const& d : draws) {
        auto const part = [](double share) {
            return std::clamp(static_cast<int>(share * kFine), 0, kFine - 1);
        };
        ++counts[host::cellIndex(part((d.phi - cell.phi0) / (cell.phi1 - cell.phi0)),
                                 part((d.z - cell.z0) / (cell.z1 - cell.z0)), kFine)];
    }
    return std::find(counts.begin(), counts.end(), 0) == counts.end();
}

/// Whether a cell is longer around the normal than away from it, as angles on the sphere.
bool isWide(DensityCell const& cell)
{
    double const middle = (cell.z0 + cell.z1) / 2;
    return (cell.phi1 - cell.phi0) * std::sqrt(1 - middle * middle)
        > std::acos(cell.z0) - std::acos(cell.z1);
}

/// Divides a cell by the half of its draws: across the side along which densities differ more, or,
/// where they hardly differ, across the longer one, so that no side stays whole that a wrong
/// sampler may be uneven along.
void divide(Draws draws, DensityCell cell, std::vector<DensityCell>& leaves)
{
    double mean = 0;
    double const spread = draws.empty() ? 0.0 : std::sqrt(variance(draws, mean));
    if (draws.size() <= kLeaf || cell.solidAngle() < 1e-10) {
        cell.count = static_cast<std::uint32_t>(draws.size());
        cell.judged = draws.size() >= kEnough && spread < kSteep * mean && fills(draws, cell);
        leaves.push_back(cell);
        return;
    }
    auto const byHeight = [](Draw const& a, Draw const& b) { return a.z < b.z; };
    auto const byAzimuth = [](Draw const& a, Draw const& b) { return a.phi < b.phi; };
    std::size_t const half = draws.size() / 2;
    auto const halve = [&](auto const& order) {
        std::nth_element(draws.begin(), draws.begin() + static_cast<std::ptrdiff_t>(half),
                         draws.end(), order);
    };
    auto const remaining = [&](auto const& order) {
        halve(order);
        double ignored = 0;
        return variance(draws.first(half), ignored) + variance(draws.subspan(half), ignored);
    };
    bool const alongAzimuth =
        spread < kSmooth * mean ? isWide(cell) : remaining(byAzimuth) < remaining(byHeight);
    DensityCell first = cell, second = cell;
    if (alongAzimuth) {
        halve(byAzimuth);
        first.phi1 = second.phi0 = draws[half].phi;
    } else {
        halve(byHeight);
        first.z1 = second.z0 = draws[half].z;
    }
    divide(draws.first(half), first, leaves);
    divide(draws.subspan(half), second, leaves);
}

} // namespace

DensityTest testDensity(host::MaterialProbe const& probe, Vec3f wi, std::uint32_t draws,
                        std::uint32_t seed, int threads)
{
    Set pilot(probe, wi, draws, host::hashCombine(seed, 1), threads);
    Set const set(probe, wi, draws, host::hashCombine(seed, 2), threads);
    DensityTest test;
    auto const n = static_cast<double>(draws);
    test.draws = draws;
    test.declined = static_cast<double>(set.declined) / n;
    test.notUnit = static_cast<double>(set.notUnit) / n;
    test.noDensity = static_cast<double>(set.noDensity) / n;
    (set.directionsOfOne.size() <= kFew ? test.specular : test.untold) =
        static_cast<double>(set.ofDensityOne) / n;

    // The horizon is an edge of almost every density.
    auto const horizon = std::partition(pilot.spread.begin(), pilot.spread.end(),
                                        [](Draw const& d) { return d.z < 0; });
    auto const below = static_cast<std::size_t>(horizon - pilot.spread.begin());
    Draws const all = pilot.spread;
    divide(all.first(below), {-1, 0, -kPi, kPi}, test.cells);
    divide(all.subspan(below), {0, 1, -kPi, kPi}, test.cells);

    double expected = 0;
    for (DensityCell& cell : test.cells) {
        cell.expected = cell.count / (cell.solidAngle() * n);
        expected += cell.judged ? cell.count / n : 0;
        cell.count = 0;
    }
    double scales = 0, scaleSquares = 0;
    std::vector<double> sums(test.cells.size()), squares(test.cells.size());
    // Few enough cells for a search by height first: sorted by z0 they are looked through from the
    // last one that begins below.
    std::sort(test.cells.begin(), test.cells.end(),
              [](DensityCell const& a, DensityCell const& b) { return a.z0 < b.z0; });
    for (Draw const& d : set.spread) {
        auto const after =
            std::upper_bound(test.cells.begin(), test.cells.end(), d.z,
                             [](double z, DensityCell const& cell) { return z < cell.z0; });
        for (auto i = static_cast<std::size_t>(after - test.cells.begin()); i-- > 0;) {
            DensityCell& cell = test.cells[i];
            if (d.z > cell.z1 || d.phi < cell.phi0 || d.phi > cell.phi1)
                continue;
            ++cell.count;
            sums[i] += d.area;
            squares[i] += d.area * d.area;
            // The sum over cells of density times what their draws say of their solid angle.
            double const share = cell.judged ? cell.expected * d.area : 0;
            scales += share / n;
            scaleSquares += share * share / n;
            break;
        }
    }
    for (std::size_t i = 0; i < test.cells.size(); ++i) {
        DensityCell& cell = test.cells[i];
        if (cell.count > 0)
            cell.told = cell.count / sums[i];
        // A cell that the second set misses has no error of its own; that of the first set's count
        // stands in.
        double const mean = sums[i] / n;
        double const error = cell.count > 1
            ? std::sqrt(std::max(0.0, squares[i] / n - mean * mean) / n)
            : cell.solidAngle() / std::sqrt(std::max(1.0, cell.expected * cell.solidAngle() * n));
        cell.deviation = (mean - cell.solidAngle()) / error;
        if (!cell.judged)
            continue;
        test.chiSquare += cell.deviation * cell.deviation;
        ++test.degrees;
        test.judged += cell.count / n;
    }
    if (test.degrees > 0) {
        test.scale = scales / expected;
        test.scaleError = std::sqrt(std::max(0.0, scaleSquares - scales * scales) / n) / expected;
        double const off = std::fabs(test.scale - 1) / test.scaleError;
        test.pValue =
            std::min(1.0,
                     2
                         * std::min(boost::math::gamma_q(test.degrees / 2.0, test.chiSquare / 2),
                                    std::erfc(off / std::sqrt(2.0))));
    }
    if (test.isBroken())
        test.pValue = 0;
    return test;
}

} // namespace zsi::lab
