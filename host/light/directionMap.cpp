// SPDX-License-Identifier: Apache-2.0
#include "light/directionMap.h"

#include "base/grid.h"
#include "sampling/directions.h"

#include <algorithm>
#include <cmath>

namespace zsi::host {
namespace {

/// Directions asked for, of equal solid angles.
constexpr int kAcross = 1024, kDown = 512;
/// Share of the light that has to lie elsewhere, where four directions make a cell, for the cells
/// not to do so.
constexpr double kSharp = 0.05;
/// Below this share of all light above the mean, drawing costs more than it saves.
constexpr double kWorthwhile = 0.05;
/// A cell has this share of its neighbours' light too: what a small lamp has beyond the directions
/// asked for would else be left to chance.
constexpr double kBeyond = 1.0 / 64;
/// Parts of [0, 1) whose first cells are known (Chen and Asau 1974).
constexpr int kParts = 128;
constexpr float kPi = 3.14159265f;

/// Of equal heights in z; `column` and `row` as shares of all.
Vec3f direction(float column, float row)
{
    float const z = 1.0f - 2.0f * row;
    float const r = std::sqrt(maxOf(0.0f, 1.0f - z * z)), phi = 2 * kPi * column;
    return {r * std::cos(phi), r * std::sin(phi), z};
}

/// Four cells in the place of each.
std::vector<double> halved(std::vector<double> const& cells)
{
    std::vector<double> sums(cells.size() / 4);
    for (int y = 0; y < kDown; ++y)
        for (int x = 0; x < kAcross; ++x)
            sums[cellIndex(x / 2, y / 2, kAcross / 2)] += cells[cellIndex(x, y, kAcross)];
    return sums;
}

/// Whether much of the light lies elsewhere than where the sums of four say.
bool isSharp(std::vector<double> const& cells, std::vector<double> const& sums)
{
    double all = 0, elsewhere = 0;
    for (int y = 0; y < kDown; ++y)
        for (int x = 0; x < kAcross; ++x) {
            double const cell = cells[cellIndex(x, y, kAcross)];
            all += cell;
            elsewhere += std::fabs(cell - 0.25 * sums[cellIndex(x / 2, y / 2, kAcross / 2)]);
        }
    return elsewhere > kSharp * all;
}

int clampedIndex(float x, int n) { return std::clamp(static_cast<int>(x), 0, n - 1); }

/// The first entry above `u` of ascending shares that end with 1, not before `i`, and the last one
/// at the end; `rest` is the place within.
int pick(float const* shares, int n, int i, float u, float& rest)
{
    while (i < n - 1 && !(shares[i] > u))
        ++i;
    float const before = i > 0 ? shares[i - 1] : 0.0f;
    float const share = shares[i] - before;
    rest = share > 0.0f ? clamp((u - before) / share, 0.0f, 1.0f) : 0.5f;
    return i;
}

/// For kParts equal parts of [0, 1) the first entry above their beginnings.
void addFirsts(float const* shares, int n, std::vector<std::uint16_t>& firsts)
{
    int i = 0;
    for (int part = 0; part < kParts; ++part) {
        while (i < n - 1 && !(shares[i] > static_cast<float>(part) / kParts))
            ++i;
        firsts.push_back(static_cast<std::uint16_t>(i));
    }
}

} // namespace

DirectionMap::DirectionMap(std::function<float(Vec3f)> const& radiance)
{
    std::vector<double> seen(std::size_t(kAcross) * kDown);
    for (int y = 0; y < kDown; ++y)
        for (int x = 0; x < kAcross; ++x) {
            float const value = radiance(direction((static_cast<float>(x) + 0.5f) / kAcross,
                                                   (static_cast<float>(y) + 0.5f) / kDown));
            seen[cellIndex(x, y, kAcross)] =
                value > 0.0f && std::isfinite(value) ? static_cast<double>(value) : 0.0;
        }
    std::vector<double> sums = halved(seen);
    bool const sharp = isSharp(seen, sums);
    if (!sharp)
        seen = std::move(sums);
    width_ = sharp ? kAcross : kAcross / 2;
    height_ = sharp ? kDown : kDown / 2;
    perCell_ = static_cast<float>(width_ * height_) / (4 * kPi);

    std::vector<double> cells = seen;
    for (int y = 0; y < height_; ++y)
        for (int x = 0; x < width_; ++x)
            for (int i = 0; i < 9; ++i) {
                int const row = std::clamp(y + i / 3 - 1, 0, height_ - 1);
                int const column = (x + i % 3 - 1 + width_) % width_;
                cells[cellIndex(x, y, width_)] += kBeyond * seen[cellIndex(column, row, width_)];
            }
    double sum = 0;
    for (double const cell : cells)
        sum += cell;
    double const mean = sum / static_cast<double>(cells.size());
    double above = 0;
    for (double& cell : cells) {
        cell = std::max(0.0, cell - mean);
        above += cell;
    }
    if (!(above > kWorthwhile * sum))
        return;
    double before = 0;
    for (int y = 0; y < height_; ++y) {
        double const* const row = &cells[cellIndex(0, y, width_)];
        double inRow = 0;
        for (int x = 0; x < width_; ++x)
            inRow += row[x];
        double part = 0;
        for (int x = 0; x < width_; ++x) {
            part += row[x];
            columns_.push_back(static_cast<float>(inRow > 0 ? part / inRow : (x + 1.0) / width_));
        }
        before += inRow;
        rows_.push_back(static_cast<float>(before / above));
        addFirsts(&columns_[cellIndex(0, y, width_)], width_, first_);
    }
    addFirsts(rows_.data(), height_, first_);
}

DirectionMap::Drawn DirectionMap::sample(Vec2f u) const
{
    auto const first = [&](int row, float x) {
        return int(first_[cellIndex(clampedIndex(x * kParts, kParts), row, kParts)]);
    };
    float inRow, inColumn;
    int const row = pick(rows_.data(), height_, first(height_, u.y), u.y, inRow);
    int const column =
        pick(&columns_[cellIndex(0, row, width_)], width_, first(row, u.x), u.x, inColumn);
    return {direction((static_cast<float>(column) + inColumn) / static_cast<float>(width_),
                      (static_cast<float>(row) + inRow) / static_cast<float>(height_)),
            cellDensity(row, column)};
}

float DirectionMap::density(Vec3f d) const
{
    if (isEmpty())
        return 0.0f;
    float const turn = angleOf(d.y, d.x) / (2 * kPi);
    return cellDensity(
        clampedIndex((1.0f - d.z) * 0.5f * static_cast<float>(height_), height_),
        clampedIndex((turn < 0.0f ? turn + 1.0f : turn) * static_cast<float>(width_), width_));
}

float DirectionMap::cellDensity(int row, int column) const
{
    auto const r = static_cast<std::size_t>(row), c = static_cast<std::size_t>(column);
    float const* const columns = &columns_[cellIndex(0, row, width_)];
    float const inRows = rows_[r] - (r > 0 ? rows_[r - 1] : 0.0f);
    float const inColumns = columns[c] - (c > 0 ? columns[c - 1] : 0.0f);
    return inRows * inColumns * perCell_;
}

} // namespace zsi::host
