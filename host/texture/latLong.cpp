// SPDX-License-Identifier: Apache-2.0
#include "texture/latLong.h"

#include "sampling/directions.h"
#include "texture/areaShares.h"

#include <algorithm>
#include <cmath>
#include <zsi/vecmath.h>

namespace zsi::host {
namespace {

constexpr float kPi = 3.14159265f;
constexpr double kPiD = 3.14159265358979324;

/// Uniform cubic B-spline: never negative, so that bright spots get no dark rims, and smooth where
/// a mirror magnifies the picture.
struct SplineWeights {
    float w[4];

    explicit SplineWeights(float t)
    {
        float const s = 1.0f - t, t2 = t * t, t3 = t2 * t;
        w[0] = s * s * s * (1.0f / 6);
        w[1] = (0.5f * t - 1.0f) * t2 + 2.0f / 3;
        w[2] = ((1.0f - t) * t + 1.0f) * t * 0.5f + 1.0f / 6;
        w[3] = t3 * (1.0f / 6);
    }
};

int wrapped(int i, int n)
{
    if (i >= 0 && i < n)
        return i;
    int const r = i % n;
    return r < 0 ? r + n : r;
}

void addTo(double* sum, Vec4f const& v, double weight)
{
    sum[0] += weight * static_cast<double>(v.x);
    sum[1] += weight * static_cast<double>(v.y);
    sum[2] += weight * static_cast<double>(v.z);
    sum[3] += weight * static_cast<double>(v.w);
}

Vec4f mean(double const* sum, double weight)
{
    auto const m = [&](int c) { return static_cast<float>(sum[c] / weight); };
    return {m(0), m(1), m(2), m(3)};
}

double sineOfRow(int y, int height) { return std::sin((y + 0.5) / height * kPiD); }

} // namespace

Vec4f lookupLatLong(TiledPicture const& picture, Vec3f d)
{
    TiledPicture::Level const& level = picture.level(0);
    int const width = level.width, height = level.height;
    // Scaled first, so that no square leaves the range of a float.
    float const largest = maxOf(std::fabs(d.x), maxOf(std::fabs(d.y), std::fabs(d.z)));
    d = largest > 0.0f ? d / largest : Vec3f(0, 1, 0);
    float const across = std::sqrt(d.x * d.x + d.z * d.z);
    float const column = (0.5f + angleOf(d.x, -d.z) * (0.5f / kPi)) * static_cast<float>(width);
    float const row = angleOf(across, d.y) * (1.0f / kPi) * static_cast<float>(height);

    float const left = std::floor(column - 0.5f), top = std::floor(row - 0.5f);
    SplineWeights const wx(column - 0.5f - left), wy(row - 0.5f - top);
    TiledPicture::Place rows[4];
    for (int j = 0; j < 4; ++j) {
        int y = static_cast<int>(top) - 1 + j;
        int x = static_cast<int>(left) - 1;
        // Over a pole the picture goes on downwards on the other side.
        if (y < 0 || y >= height) {
            y = y < 0 ? -1 - y : 2 * height - 1 - y;
            x += width / 2;
        }
        rows[j] = {wrapped(x, width), std::clamp(y, 0, height - 1)};
    }
    return picture.sumOfBlock(level, rows, wx.w, wy.w);
}

void evenOutRow(Vec4f* row, int y, int width, int height)
{
    bool const atPole = y == 0 || y == height - 1;
    double const span = atPole ? width : std::min<double>(width, 1.0 / sineOfRow(y, height));
    if (span < 1.05)
        return;
    // Mean over `span` texels around each, from running sums.
    auto const n = static_cast<std::size_t>(width);
    std::vector<double> before(4 * (n + 1));
    for (std::size_t x = 0; x < n; ++x) {
        std::copy_n(&before[4 * x], 4, &before[4 * x + 4]);
        addTo(&before[4 * x + 4], row[x], 1.0);
    }
    double const* const around = &before[4 * n];
    auto const upTo = [&](double x, double sign, double* sum) { // from column 0 to x, either side
        double const turns = std::floor(x / width);
        auto const i = std::min(static_cast<std::size_t>(x - turns * width), n - 1);
        double const part = x - turns * width - static_cast<double>(i);
        for (std::size_t c = 0; c < 4; ++c)
            sum[c] += sign
                * (turns * around[c] + before[4 * i + c] * (1 - part)
                   + before[4 * i + 4 + c] * part);
    };
    std::vector<Vec4f> even(n);
    for (std::size_t x = 0; x < n; ++x) {
        double const centre = static_cast<double>(x) + 0.5;
        double sum[4] = {};
        upTo(centre + span / 2, 1, sum);
        upTo(centre - span / 2, -1, sum);
        even[x] = mean(sum, span);
    }
    if (atPole)
        std::fill(even.begin(), even.end(), even[0]);
    std::copy(even.begin(), even.end(), row);
}

LatLongReduction::LatLongReduction(int width, int height, int reducedWidth)
    : width_(width)
    , height_(height)
    , result_(reducedWidth, std::max(1, reducedWidth / 2))
    , narrow_(static_cast<std::size_t>(reducedWidth))
    , sums_(4 * narrow_.size())
{
}

void LatLongReduction::addRow(int y, Vec4f const* texels)
{
    auto const fromX = static_cast<std::size_t>(width_), toX = narrow_.size();
    std::fill(narrow_.begin(), narrow_.end(), Vec4f(0, 0, 0, 0));
    for (std::size_t x = 0; x < fromX; ++x)
        forAreaShares(x, fromX, toX, [&](std::size_t i, float share) {
            narrow_[i] = narrow_[i] + texels[x] * share;
        });

    auto const row = static_cast<std::size_t>(y);
    auto const fromY = static_cast<std::size_t>(height_);
    auto const toY = static_cast<std::size_t>(result_.height);
    double const sine = sineOfRow(y, height_);
    forAreaShares(row, fromY, toY, [&](std::size_t j, float share) {
        double const weight = static_cast<double>(share) * sine;
        for (std::size_t i = 0; i < toX; ++i)
            addTo(&sums_[4 * i], narrow_[i], weight);
        weight_ += weight;
        if (!endsArea(j, row, fromY, toY))
            return;
        for (std::size_t i = 0; i < toX; ++i)
            result_.row(static_cast<int>(j))[i] = mean(&sums_[4 * i], weight_);
        std::fill(sums_.begin(), sums_.end(), 0.0);
        weight_ = 0;
    });
}

bool blurShows(float halfAngle, int width)
{
    return static_cast<double>(halfAngle) >= 2 * kPiD / width;
}

int blurSourceWidth(float halfAngle, int width)
{
    // Six source texels to the half-angle resolve the weight, three resolve the result.
    auto const resolved = static_cast<int>(12 * kPiD / static_cast<double>(halfAngle));
    return std::max(64, std::min(resolved, width)) / 2 * 2;
}

LatLong blurred(LatLong const& source, float halfAngle)
{
    double const angle = std::min(static_cast<double>(halfAngle), kPiD / 2);
    LatLong result(source.width / 2, std::max(1, source.height / 2));
    double const cosLimit = std::cos(angle);
    std::vector<double> sums, weights;
    for (int y = 0; y < result.height; ++y) {
        double const theta = (y + 0.5) / result.height * kPiD;
        int const first =
            std::max(0, static_cast<int>(std::floor((theta - angle) / kPiD * source.height)));
        int const last =
            std::min(source.height - 1, static_cast<int>((theta + angle) / kPiD * source.height));
        sums.assign(4 * static_cast<std::size_t>(result.width), 0.0);
        double total = 0;
        for (int j = first; j <= last; ++j) {
            double const t = (j + 0.5) / source.height * kPiD;
            double const cc = std::cos(theta) * std::cos(t), ss = std::sin(theta) * std::sin(t);
            // cosine of the angle between = cc + ss cos(difference of longitudes)
            double const reach = std::acos(std::clamp((cosLimit - cc) / ss, -1.0, 1.0));
            double const columns = reach / (2 * kPiD) * source.width;
            int const from = static_cast<int>(std::floor(-columns));
            int const count = std::min(source.width, static_cast<int>(2 * columns) + 2);
            // The centre of a column of the result is an edge of the source's: one set of weights.
            weights.clear();
            for (int i = 0; i < count; ++i) {
                double const dphi = (from + i + 0.5) / source.width * 2 * kPiD;
                double const weight =
                    std::max(0.0, cc + ss * std::cos(dphi) - cosLimit) * std::sin(t);
                weights.push_back(weight);
                total += weight;
            }
            Vec4f const* const row = source.row(j);
            for (int x = 0; x < result.width; ++x) {
                double* const sum = &sums[4 * static_cast<std::size_t>(x)];
                int column = wrapped(2 * x + 1 + from, source.width);
                for (double const weight : weights) {
                    addTo(sum, row[column], weight);
                    column = column + 1 == source.width ? 0 : column + 1;
                }
            }
        }
        for (int x = 0; x < result.width; ++x)
            result.row(y)[x] = mean(&sums[4 * static_cast<std::size_t>(x)], total);
    }
    return result;
}

} // namespace zsi::host
