// SPDX-License-Identifier: Apache-2.0
/// Checks of glossy lobes that need no knowledge of their formulas beyond a GGX-like shape: energy,
/// and whether sampled directions follow the density that they report.
#pragma once

#include "support/record.h"

#include <algorithm>
#include <cstdint>
#include <vector>

namespace zsi::test {

/// Directions mirrored at facets of widths ax, ay seen from v, as a map of the unit square: u is
/// t^2 / (1 + t^2) with t the length of the slope in units of the widths, w the slope's azimuth.
struct MirrorMap {
    double ax, ay;
    Vec3d v;

    struct Point {
        Vec3d l;
        double solidAngle; ///< of l, per unit of the square; 0 where no facet shows
    };
    Point at(double u, double w) const
    {
        double const t = std::sqrt(u / (1 - u)), phi = 2 * M_PI * w;
        Vec3d h{-ax * t * std::cos(phi), -ay * t * std::sin(phi), 1};
        double const n = std::sqrt(dot(h, h));
        double const vh = dot(v, h) / n;
        Vec3d const l = h * (2 * vh / n) - v;
        // Slope area: ax ay t dt dphi, t dt = du / (2 (1 - u)^2); on the sphere times cos^3.
        double const area = ax * ay * M_PI / ((1 - u) * (1 - u));
        return {l, vh > 0 && l.z > 0 ? 4 * vh * area / (n * n * n) : 0};
    }
    /// Inverse of `at`.
    void square(Vec3d l, double& u, double& w) const
    {
        Vec3d const h = v + l;
        double const x = -h.x / (h.z * ax), y = -h.y / (h.z * ay), t2 = x * x + y * y;
        u = t2 / (1 + t2);
        w = std::atan2(y, x) / (2 * M_PI);
        w -= std::floor(w);
    }
    /// Density of `at` for uniform points, 1/sr.
    double density(Vec3d l) const
    {
        double u, w;
        square(l, u, w);
        double const s = u < 1 ? at(u, w).solidAngle : 0;
        return s > 0 ? 1 / s : 0;
    }
};

/// Integral of f(l) l.z over the hemisphere: a grid over mirrored directions and one over the
/// cosine-weighted hemisphere, joined by the balance heuristic.
template <class F>
double hemisphere(MirrorMap const& map, int grid, F const& f)
{
    double sum = 0;
    auto const add = [&](Vec3d l) {
        double const density = map.density(l) + l.z / M_PI;
        sum += f(l) * l.z / density;
    };
    for (int i = 0; i < grid; ++i)
        for (int j = 0; j < grid; ++j) {
            double const u = (i + 0.5) / grid, w = (j + 0.5) / grid;
            auto const point = map.at(u, w);
            if (point.solidAngle > 0)
                add(point.l);
            double const r = std::sqrt(u);
            add({r * std::cos(2 * M_PI * w), r * std::sin(2 * M_PI * w), std::sqrt(1 - u)});
        }
    return sum / (grid * grid);
}

/// Draws are accepted or not; each accepted one weighs 1/pdf. Per cell of the square the mean of
/// the weights is the cell's solid angle. Returns the sum of squared deviations in standard errors,
/// over the number of cells that were hit often enough. The outermost ring is left out: it reaches
/// to the horizon, where 1/pdf has no bound.
struct DensityCheck {
    static constexpr int kU = 6, kW = 8, kEnough = 200;
    MirrorMap map;
    double sum[kU * kW] = {}, squares[kU * kW] = {};
    int hits[kU * kW] = {};
    int draws = 0;

    void reject() { ++draws; }
    void accept(Vec3d l, double invPdf)
    {
        ++draws;
        double u, w;
        map.square(l, u, w);
        int const cell = std::min(int(u * kU), kU - 1) * kW + std::min(int(w * kW), kW - 1);
        sum[cell] += invPdf;
        squares[cell] += invPdf * invPdf;
        ++hits[cell];
    }
    double deviation(int& cells) const
    {
        double total = 0;
        cells = 0;
        for (int c = 0; c < (kU - 1) * kW; ++c) {
            if (hits[c] < kEnough)
                continue;
            constexpr int kFine = 64; // of a cell
            double solidAngle = 0;
            for (int i = 0; i < kFine; ++i)
                for (int j = 0; j < kFine; ++j)
                    solidAngle +=
                        map.at((c / kW + (i + 0.5) / kFine) / kU, (c % kW + (j + 0.5) / kFine) / kW)
                            .solidAngle;
            solidAngle /= double(kFine) * kFine * kU * kW;
            double const mean = sum[c] / draws;
            double const variance = (squares[c] / draws - mean * mean) / draws;
            total += (mean - solidAngle) * (mean - solidAngle) / variance;
            ++cells;
        }
        return total;
    }
};

} // namespace zsi::test
