// SPDX-License-Identifier: Apache-2.0
/// Measured isotropic materials in the binary format of the MERL database.
#pragma once

#include <array>
#include <filesystem>
#include <vector>
#include <zsi/types.h>

namespace zsi::lab {

/// A table over half angle, difference angle and its azimuth (Rusinkiewicz 1998, "A New Change of
/// Variables for Efficient BRDF Representation"; Matusik et al. 2003, "A Data-Driven Reflectance
/// Model"). The azimuth goes to pi: a turn by pi swaps the two directions.
class MerlTable {
public:
    static constexpr int kHalf = 90, kDifference = 90, kAzimuth = 180;
    static constexpr std::size_t kCells = std::size_t(kHalf) * kDifference * kAzimuth;

    /// Throws InputError for a file that cannot be read or is no such table.
    static MerlTable read(std::filesystem::path const& file);
    /// Replaces the file as a whole. Throws InputError.
    void write(std::filesystem::path const& file) const;

    /// wi and wo of the middle of a cell, unit, away from the surface. wo can lie below it, where
    /// there is nothing to measure.
    static std::array<Vec3f, 2> directionsOf(std::size_t cell);
    /// The cell of two unit directions.
    static std::size_t cellOf(Vec3f wi, Vec3f wo);

    /// 1/sr, linear RGB; negative where nothing was measured. The azimuth runs fastest.
    std::vector<Vec3f> values = std::vector<Vec3f>(kCells);
};

} // namespace zsi::lab
