// SPDX-License-Identifier: Apache-2.0
#include "lab/merl.h"

#include "base/error.h"
#include "base/replacedFile.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstring>
#include <fmt/format.h>
#include <fstream>
#include <zsi/vecmath.h>

namespace zsi::lab {
namespace {

static_assert(std::endian::native == std::endian::little); // as the files are

constexpr double kPi = 3.14159265358979323846;
constexpr std::int32_t kSize[] = {MerlTable::kHalf, MerlTable::kDifference, MerlTable::kAzimuth};
constexpr std::size_t kBytes = sizeof kSize + 3 * MerlTable::kCells * sizeof(double);
constexpr double kUnits[] = {1.0 / 1500, 1.15 / 1500, 1.66 / 1500}; ///< of the channels, 1/sr

} // namespace

MerlTable MerlTable::read(std::filesystem::path const& file)
{
    std::ifstream in(file, std::ios::binary);
    // One byte more than there should be tells a file that is too long.
    std::vector<char> bytes(kBytes + 1);
    if (!in || (in.read(bytes.data(), static_cast<std::streamsize>(bytes.size())), in.bad()))
        throw host::InputError(file.string() + ": cannot be read");
    auto const got = static_cast<std::size_t>(in.gcount());
    if (got != kBytes || std::memcmp(bytes.data(), kSize, sizeof kSize) != 0)
        throw host::InputError(fmt::format(
            "{}: expected a MERL table, {} bytes that begin with the sizes {}, {}, {}; got {}",
            file.string(), kBytes, kHalf, kDifference, kAzimuth,
            got == kBytes      ? "other sizes"
                : got > kBytes ? "more bytes"
                               : fmt::format("{} bytes", got)));
    MerlTable table;
    auto const value = [&](std::size_t channel, std::size_t cell) {
        double v;
        std::memcpy(&v, bytes.data() + sizeof kSize + (channel * kCells + cell) * sizeof v,
                    sizeof v);
        return static_cast<float>(v * kUnits[channel]);
    };
    for (std::size_t i = 0; i < kCells; ++i)
        table.values[i] = {value(0, i), value(1, i), value(2, i)};
    return table;
}

void MerlTable::write(std::filesystem::path const& file) const
{
    std::vector<unsigned char> bytes(kBytes);
    std::memcpy(bytes.data(), kSize, sizeof kSize);
    for (std::size_t c = 0; c < 3; ++c)
        for (std::size_t i = 0; i < kCells; ++i) {
            float const channels[] = {values[i].x, values[i].y, values[i].z};
            double const v = static_cast<double>(channels[c]) / kUnits[c];
            std::memcpy(bytes.data() + sizeof kSize + (c * kCells + i) * sizeof v, &v, sizeof v);
        }
    host::ReplacedFile out(file);
    out.write(bytes);
    out.commit();
}

std::array<Vec3f, 2> MerlTable::directionsOf(std::size_t cell)
{
    auto const middle = [](std::size_t i, int count) {
        return (static_cast<double>(i) + 0.5) / count;
    };
    // Half angles are finer towards 0, where highlights are.
    double const root = middle(cell / (kDifference * kAzimuth), kHalf);
    double const half = kPi / 2 * root * root;
    double const difference = kPi / 2 * middle(cell / kAzimuth % kDifference, kDifference);
    double const azimuth = kPi * middle(cell % kAzimuth, kAzimuth);
    double const x = std::sin(difference) * std::cos(azimuth);
    double const y = std::sin(difference) * std::sin(azimuth), z = std::cos(difference);
    // The difference vector is wi where the half vector is the normal: tilt both by the half angle.
    double const c = std::cos(half), s = std::sin(half);
    double const wi[] = {c * x + s * z, y, c * z - s * x};
    double const twice = 2 * (wi[0] * s + wi[2] * c);
    auto const vector = [](double a, double b, double d) {
        return Vec3f(static_cast<float>(a), static_cast<float>(b), static_cast<float>(d));
    };
    return {vector(wi[0], wi[1], wi[2]), vector(twice * s - wi[0], -wi[1], twice * c - wi[2])};
}

std::size_t MerlTable::cellOf(Vec3f wi, Vec3f wo)
{
    auto const d = [](float v) { return static_cast<double>(v); };
    double hx = d(wi.x) + d(wo.x), hy = d(wi.y) + d(wo.y), hz = d(wi.z) + d(wo.z);
    double const length = std::hypot(hx, hy, hz);
    hx /= length, hy /= length, hz /= length;
    double const half = std::acos(std::clamp(hz, -1.0, 1.0)), phi = std::atan2(hy, hx);
    // wi turned so that the half vector is the normal.
    double const x = std::cos(phi) * d(wi.x) + std::sin(phi) * d(wi.y);
    double const y = std::cos(phi) * d(wi.y) - std::sin(phi) * d(wi.x);
    double const dx = std::cos(half) * x - std::sin(half) * d(wi.z);
    double const dz = std::sin(half) * x + std::cos(half) * d(wi.z);
    double const difference = std::acos(std::clamp(dz, -1.0, 1.0));
    double azimuth = std::atan2(y, dx);
    if (azimuth < 0)
        azimuth += kPi;
    auto const cell = [](double share, int count) {
        double const at = std::isfinite(share) ? share * count : 0.0;
        return static_cast<std::size_t>(std::clamp(static_cast<int>(at), 0, count - 1));
    };
    return (cell(std::sqrt(half / (kPi / 2)), kHalf) * kDifference
            + cell(difference / (kPi / 2), kDifference))
        * kAzimuth
        + cell(azimuth / kPi, kAzimuth);
}

} // namespace zsi::lab
