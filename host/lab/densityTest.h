// SPDX-License-Identifier: Apache-2.0
/// Whether a material draws directions by the density that it tells.
#pragma once

#include "measure/materialProbe.h"

#include <cstdint>
#include <vector>

namespace zsi::lab {

/// A rectangle over height and azimuth, so that its solid angle is its area.
struct DensityCell {
    double z0, z1; ///< cosines from the normal
    double phi0, phi1; ///< radians around the normal from where `wi` is mirrored to, -pi to pi
    std::uint32_t count = 0; ///< draws in it
    double expected = 0; ///< density of the first set of draws, 1/sr
    double told = 0; ///< mean density of these as the material tells it (harmonic), 1/sr
    double deviation = 0; ///< from what was told, in standard errors; positive: too many
    bool judged = false;

    double solidAngle() const { return (z1 - z0) * (phi1 - phi0); }
};

struct DensityTest {
    std::vector<DensityCell> cells;
    std::uint32_t draws = 0;
    double chiSquare = 0; ///< sum over the judged cells of the squared deviations
    int degrees = 0; ///< of freedom: judged cells
    double scale = 1; ///< mean over the judged draws of the density drawn with over the one told
    double scaleError = 0; ///< standard
    double pValue = 1; ///< of the sum or the scale being so far off by chance
    double judged = 0; ///< share of the draws that lie in judged cells
    // Shares of draws that have no density to judge:
    double declined = 0; ///< no direction
    double specular = 0; ///< one of a few directions, of density 1 as the contract asks for
    double untold = 0; ///< spread, yet of density 1
    double notUnit = 0; ///< the direction has another length
    double noDensity = 0; ///< the density is not above 0 and finite

    /// Whether a part of the draws was spread and told a density.
    bool applies() const { return degrees > 0 || isBroken(); }
    bool isBroken() const { return notUnit > 0 || noDensity > 0; }
};

/// For what goes on where `wi` came from. The contract tells the density of drawn directions only.
/// Where the draws of a cell fill it, the mean over all draws of 1/density for those in the cell is
/// its solid angle. The cells are the leaves of a tree that a first set of draws makes, so that
/// each gets about as many of the second, independent set; cells that the first set does not fill,
/// or in which its densities differ too much for an estimate to have a normal error, are not
/// judged.
DensityTest testDensity(host::MaterialProbe const& probe, Vec3f wi, std::uint32_t draws,
                        std::uint32_t seed, int threads);

} // namespace zsi::lab
