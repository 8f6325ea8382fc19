// SPDX-License-Identifier: Apache-2.0
// After Bitterli, Rousselle, Moon, Iglesias-Guitian, Adler, Mitchell, Jarosz, Novak: Nonlinearly
// Weighted First-order Regression for Denoising Monte Carlo Renderings (2016). docs/denoising.md
// tells the steps and what differs.
#include "denoise/denoise.h"

#include "base/error.h"
#include "base/grid.h"
#include "base/threads.h"
#include "denoise/regression.h"
#include "film/halves.h"

#include <algorithm>
#include <cmath>
#include <mutex>

namespace zsi::host {
namespace {

constexpr int kTile = 32; ///< pixels of a side
constexpr int kReach = 9; ///< of the regression's neighbours, pixels; at most half a tile
constexpr int kFeatureReach = 5; ///< of those that features are filtered with
constexpr int kPatch = 3, kFeaturePatch = 1;
constexpr int kVarianceReach = 1; ///< over which two samples of the noise are averaged
constexpr int kSelectionReach = 1; ///< over which errors are compared
constexpr std::size_t kBandwidths = 3;
/// Standard deviations that features have at least: differences below say nothing.
constexpr float kLeastAlbedo = 0.01f, kLeastNormal = 0.02f, kLeastDepth = 0.005f,
                kLeastPlace = 0.05f;
constexpr float kOutlier = 2.0f; ///< times the brightest that surrounds it

using Halves = std::array<Raster<Float4>, 2>;

Float4 operator+(Float4 a, Float4 const& b)
{
    for (std::size_t c = 0; c < 4; ++c)
        a[c] += b[c];
    return a;
}

Float4 operator*(Float4 a, float s)
{
    for (float& v : a)
        v *= s;
    return a;
}

float square(float v) { return v * v; }

/// A layer's channels, the rest 0.
Raster<Float4> rasterOf(Picture const& half, char const* name, std::size_t channels)
{
    Layer const* const layer = half.find(name);
    if (!layer || layer->channels.size() != channels)
        throw InputError(std::string("the half's layer \"") + name + "\" is missing");
    Raster<Float4> raster(half.width(), half.height());
    if (layer->values.size() != raster.pixels.size() * channels)
        throw InputError(std::string("the half's layer \"") + name
                         + "\" has another size than the picture");
    for (std::size_t i = 0; i < raster.pixels.size(); ++i)
        std::copy_n(&layer->values[i * channels], channels, raster.pixels[i].begin());
    return raster;
}

Halves rastersOf(std::array<Picture, 2> const& halves, char const* name, std::size_t channels)
{
    return {rasterOf(halves[0], name, channels), rasterOf(halves[1], name, channels)};
}

/// Of the mean of two halves.
Raster<Float4> varianceOf(Halves const& halves, int reach)
{
    Raster<Float4> variance = halves[0];
    for (std::size_t i = 0; i < variance.pixels.size(); ++i)
        for (std::size_t c = 0; c < 4; ++c)
            variance.pixels[i][c] = square(halves[0].pixels[i][c] - halves[1].pixels[i][c]) * 0.25f;
    return boxMean(variance, reach);
}

Raster<Float4> meanOf(Halves const& halves)
{
    Raster<Float4> mean = halves[0];
    for (std::size_t i = 0; i < mean.pixels.size(); ++i)
        mean.pixels[i] = (mean.pixels[i] + halves[1].pixels[i]) * 0.5f;
    return mean;
}

class Denoiser {
public:
    Denoiser(std::array<Picture, 2> const& halves, DenoiseOptions const& options)
        : options_(options)
        , colors_(rastersOf(halves, "beauty", 4))
        , width_(colors_[0].width)
        , height_(colors_[0].height)
        , features_(width_, height_)
        , featureNoise_(width_, height_)
        , excess_(width_, height_)
    {
        if (colors_[1].width != width_ || colors_[1].height != height_)
            throw InputError("the halves differ in size");
        Halves depth = rastersOf(halves, "depth", 1);
        float farthest = 1e-30f;
        for (Raster<Float4> const& half : depth)
            for (Float4 const& d : half.pixels)
                farthest = std::max(farthest, d[0]);
        for (Raster<Float4>& half : depth)
            for (Float4& d : half.pixels)
                d[0] /= farthest;
        groups_.emplace_back(rastersOf(halves, "albedo", 3), 3, kLeastAlbedo);
        groups_.emplace_back(rastersOf(halves, "normal", 3), 3, kLeastNormal);
        groups_.emplace_back(std::move(depth), 1, kLeastDepth);
        for (auto& half : sums_)
            half.fill(Raster<Sum>(width_, height_));
    }

    std::optional<Layer> run()
    {
        if (!forEachTile(0, 1, [&](Window const& tile) { filterFeatures(tile); }))
            return {};
        setOutliersAside();
        variance_ = varianceOf(colors_, kVarianceReach);
        for (Float4& variance : variance_.pixels)
            variance = variance * 2.0f; // of a half
        // Tiles write beyond their edges. Four rounds keep those apart that run at the same time,
        // and give each pixel its sums in the same order.
        for (int round = 0; round < 4; ++round)
            if (!forEachTile(round, 2, [&](Window const& tile) { regress(tile); }))
                return {};
        return result();
    }

private:
    /// Features that are filtered together.
    struct Group {
        Group(Halves both, std::size_t count, float leastDeviation)
            : halves(std::move(both))
            , mean(meanOf(halves))
            , variance(varianceOf(halves, kVarianceReach))
            , channels(count)
            , least(leastDeviation)
        {
        }
        Halves halves;
        Raster<Float4> mean, variance;
        std::size_t channels;
        float least;
    };
    struct Sum {
        Float4 color{};
        float weight = 0.0f;

        void add(Float4 const& value, float w)
        {
            color = color + value * w;
            weight += w;
        }
        Float4 mean() const { return color * (1.0f / weight); }
        bool isEmpty() const { return !(weight > 0.0f); }
    };

    /// Every `step`-th tile both ways from the `round`-th corner. False when cancelled.
    template <class Work>
    bool forEachTile(int round, int step, Work const& work)
    {
        std::vector<Window> tiles;
        for (int y = round / 2 * kTile; y < height_; y += step * kTile)
            for (int x = round % 2 * kTile; x < width_; x += step * kTile)
                tiles.push_back({x, y, std::min(width_, x + kTile), std::min(height_, y + kTile)});
        std::atomic<std::size_t> next{0};
        std::atomic<bool> cancelled{false};
        onThreads(options_.threads, [&] {
            for (std::size_t i; (i = next++) < tiles.size();) {
                if (options_.cancel && *options_.cancel)
                    cancelled = true;
                if (cancelled)
                    return;
                work(tiles[i]);
                std::lock_guard const guard(progressLock_);
                // A tile's regression takes about five times as long as its features.
                done_ += (step == 1 ? 1.0 : 5.0) * tiles[i].width() * tiles[i].height();
                if (options_.progress)
                    options_.progress(done_ / (6.0 * width_ * height_));
            }
        });
        return !cancelled;
    }

    /// Calls `use(dx, dy, weights)` for the neighbours within `reach`.
    template <class Use>
    static void forEachNeighbour(NoisyRaster const& picture, Window const& tile, int reach,
                                 int patch, Use const& use)
    {
        std::vector<float> weights(cellCount(tile.width(), tile.height()));
        for (int dy = -reach; dy <= reach; ++dy)
            for (int dx = -reach; dx <= reach; ++dx) {
                nlMeansWeights(picture, tile, dx, dy, patch, weights.data());
                use(dx, dy, weights.data());
            }
    }

    /// Features by non-local means over themselves, and what noise is left.
    void filterFeatures(Window const& tile)
    {
        std::size_t first = 1;
        for (Group const& group : groups_) {
            std::array<std::vector<Sum>, 2> sums;
            sums.fill(std::vector<Sum>(cellCount(tile.width(), tile.height())));
            float const share = 1.0f / static_cast<float>(group.channels);
            forEachNeighbour(
                {group.mean, group.variance, {share, share, share, share}}, tile, kFeatureReach,
                kFeaturePatch, [&](int dx, int dy, float const* weight) {
                    std::size_t i = 0;
                    for (int y = tile.y0; y < tile.y1; ++y)
                        for (int x = tile.x0; x < tile.x1; ++x, ++i)
                            if (weight[i] > 0.0f)
                                for (std::size_t h = 0; h < 2; ++h)
                                    sums[h][i].add(group.halves[h].at(x + dx, y + dy), weight[i]);
                });
            std::size_t i = 0;
            for (int y = tile.y0; y < tile.y1; ++y)
                for (int x = tile.x0; x < tile.x1; ++x, ++i) {
                    Float4 const a = sums[0][i].mean(), b = sums[1][i].mean();
                    for (std::size_t c = 0; c < group.channels; ++c) {
                        features_.at(x, y)[first + c] = 0.5f * (a[c] + b[c]);
                        featureNoise_.at(x, y)[first + c] =
                            square(group.least) + 0.25f * square(a[c] - b[c]);
                    }
                }
            first += group.channels;
        }
        // Where a pixel lies, in reaches: light may change along a surface of one normal.
        for (int y = tile.y0; y < tile.y1; ++y)
            for (int x = tile.x0; x < tile.x1; ++x)
                for (std::size_t c = 0; c < 2; ++c) {
                    features_.at(x, y)[first + c] = static_cast<float>(c ? y : x) / kReach;
                    featureNoise_.at(x, y)[first + c] = square(kLeastPlace);
                }
    }

    FeatureRow rowOf(std::size_t p, std::size_t q) const
    {
        FeatureRow row;
        row[0] = 1.0f;
        for (std::size_t i = 1; i < row.size(); ++i)
            row[i] = features_.pixels[q][i] - features_.pixels[p][i];
        return row;
    }

    /// What is far brighter than all around it in either half has no neighbours to be smoothed
    /// with: it is dimmed to them, and the light spread over what has the same features.
    void setOutliersAside()
    {
        Halves const before = colors_;
        auto const peak = [](Float4 const& c) { return std::max({c[0], c[1], c[2]}); };
        for (std::size_t h = 0; h < 2; ++h)
            for (int y = 0; y < height_; ++y)
                for (int x = 0; x < width_; ++x) {
                    float around = 0.0f;
                    for (int v = std::max(0, y - 1); v <= std::min(height_ - 1, y + 1); ++v)
                        for (int u = std::max(0, x - 1); u <= std::min(width_ - 1, x + 1); ++u)
                            for (std::size_t other = 0; other < 2; ++other)
                                if (u != x || v != y || other != h)
                                    around = std::max(around, peak(before[other].at(u, v)));
                    Float4& color = colors_[h].at(x, y);
                    if (peak(color) <= kOutlier * around)
                        continue;
                    float const kept = kOutlier * around / peak(color);
                    Float4 light = color * (0.5f * (1.0f - kept));
                    light[3] = 0.0f;
                    for (std::size_t c = 0; c < 3; ++c)
                        color[c] *= kept;
                    spread(light, x, y);
                }
    }

    void spread(Float4 const& light, int x, int y)
    {
        constexpr float kAlike = 0.1f; // standard deviation of features
        std::vector<std::pair<std::size_t, float>> shares;
        float sum = 0.0f;
        for (int v = std::max(0, y - kReach); v <= std::min(height_ - 1, y + kReach); ++v)
            for (int u = std::max(0, x - kReach); u <= std::min(width_ - 1, x + kReach); ++u) {
                float distance = 0.0f;
                for (std::size_t i = 1; i + 2 < kFeatures + 1; ++i) // all but the place
                    distance += square(features_.at(x, y)[i] - features_.at(u, v)[i]);
                shares.emplace_back(features_.index(u, v),
                                    std::exp(-0.5f * distance / square(kAlike)));
                sum += shares.back().second;
            }
        for (auto const& share : shares)
            excess_.pixels[share.first] =
                excess_.pixels[share.first] + light * (share.second / sum);
    }

    /// Whether a plane is made around the pixel in any case.
    bool isCentre(std::size_t pixel) const
    {
        auto const width = static_cast<std::size_t>(width_);
        return (pixel / width + pixel % width) % 2 == 0;
    }

    /// Either half by planes over the features, with weights from the other half's colours. Each
    /// plane speaks for all the pixels that it was made from, so every other pixel has one, and
    /// those that are like none of these.
    void regress(Window const& tile)
    {
        auto const pixels = cellCount(tile.width(), tile.height());
        constexpr float kLeastWeight = 1e-3f;
        struct Neighbour {
            std::size_t pixel;
            float weight;
        };
        thread_local std::array<std::vector<std::vector<Neighbour>>, 2> neighbours;
        for (std::size_t h = 0; h < 2; ++h) {
            neighbours[h].resize(pixels);
            for (auto& list : neighbours[h])
                list.clear();
            constexpr float kThird = 1.0f / 3.0f;
            forEachNeighbour({colors_[h], variance_, {kThird, kThird, kThird, 1.0f}}, tile, kReach,
                             kPatch, [&](int dx, int dy, float const* weight) {
                                 std::size_t i = 0;
                                 for (int y = tile.y0; y < tile.y1; ++y)
                                     for (int x = tile.x0; x < tile.x1; ++x, ++i)
                                         if (weight[i] > kLeastWeight)
                                             neighbours[h][i].push_back(
                                                 {features_.index(x + dx, y + dy), weight[i]});
                             });
        }
        for (std::size_t h = 0; h < 2; ++h)
            for (std::size_t k = 0; k < kBandwidths; ++k) {
                // Half the bandwidth is the fourth power of the weight.
                auto const weightOf = [k](Neighbour const& n) {
                    float weight = n.weight;
                    for (std::size_t i = 0; i < 2 * k; ++i)
                        weight *= weight;
                    return weight;
                };
                for (std::size_t i = 0; i < pixels; ++i) {
                    std::size_t const p =
                        features_.index(tile.x0 + static_cast<int>(i) % tile.width(),
                                        tile.y0 + static_cast<int>(i) / tile.width());
                    auto const near = [&](Neighbour const& n) {
                        return isCentre(n.pixel) && weightOf(n) > kLeastWeight;
                    };
                    auto const& around = neighbours[1 - h][i];
                    if (!isCentre(p) && std::any_of(around.begin(), around.end(), near))
                        continue;
                    Regression plane;
                    for (Neighbour const& n : neighbours[1 - h][i])
                        if (weightOf(n) > kLeastWeight)
                            plane.add(rowOf(p, n.pixel), colors_[h].pixels[n.pixel], weightOf(n));
                    plane.solve(featureNoise_.pixels[p]);
                    for (Neighbour const& n : neighbours[1 - h][i])
                        if (weightOf(n) > kLeastWeight)
                            sums_[h][k].pixels[n.pixel].add(plane.at(rowOf(p, n.pixel)),
                                                            weightOf(n));
                }
            }
    }

    /// The bandwidth that is nearer to the half it has not seen, where it is, and the mean of both
    /// halves.
    Layer result()
    {
        // Weights are nearly the same both ways: where none came back, the pixel is as it was.
        for (auto& half : sums_)
            for (auto& sums : half)
                for (std::size_t i = 0; i < sums.pixels.size(); ++i)
                    if (sums.pixels[i].isEmpty())
                        sums.pixels[i].add((colors_[0].pixels[i] + colors_[1].pixels[i]) * 0.5f,
                                           1.0f);
        Raster<Float4> errors(width_, height_);
        for (std::size_t i = 0; i < errors.pixels.size(); ++i)
            for (std::size_t k = 0; k < kBandwidths; ++k)
                for (std::size_t h = 0; h < 2; ++h) {
                    Float4 const seen = sums_[h][k].pixels[i].mean();
                    Float4 const& other = colors_[1 - h].pixels[i];
                    for (std::size_t c = 0; c < 4; ++c)
                        errors.pixels[i][k] += square(seen[c] - other[c]);
                }
        errors = boxMean(errors, kSelectionReach);
        for (Float4& error : errors.pixels) {
            auto const best = std::min_element(error.begin(), error.begin() + kBandwidths);
            auto const chosen = static_cast<std::size_t>(best - error.begin());
            error = {};
            error[chosen] = 1.0f;
        }
        errors = boxMean(errors, kSelectionReach);
        Layer layer{"beauty", {"R", "G", "B", "A"}, {}};
        layer.values.reserve(4 * errors.pixels.size());
        for (std::size_t i = 0; i < errors.pixels.size(); ++i) {
            Float4 color = excess_.pixels[i];
            for (std::size_t h = 0; h < 2; ++h)
                for (std::size_t k = 0; k < kBandwidths; ++k)
                    color = color + sums_[h][k].pixels[i].mean() * (0.5f * errors.pixels[i][k]);
            for (std::size_t c = 0; c < 4; ++c)
                layer.values.push_back(std::max(0.0f, color[c]));
        }
        return layer;
    }

    DenoiseOptions const& options_;
    Halves colors_;
    int width_, height_;
    std::vector<Group> groups_;
    Raster<FeatureRow> features_, featureNoise_; ///< the first entry of each row is 0
    Raster<Float4> variance_; ///< of a half's colours
    Raster<Float4> excess_; ///< light of outliers, spread
    std::array<std::array<Raster<Sum>, kBandwidths>, 2> sums_; ///< by half and bandwidth
    std::mutex progressLock_;
    double done_ = 0.0;
};

} // namespace

std::optional<Layer> denoised(std::array<Picture, 2> const& halves, DenoiseOptions const& options)
{
    return Denoiser(halves, options).run();
}

std::optional<Picture> denoised(Picture picture, DenoiseOptions const& options)
{
    std::optional<std::array<Picture, 2>> const halves = halvesOf(picture);
    if (!halves)
        throw InputError("the layers halfA and halfB are missing; expected a picture with halves "
                         "(--layers halves)");
    std::optional<Layer> beauty = denoised(*halves, options);
    if (!beauty)
        return {};
    std::vector<float>& before = picture.layers.front().values;
    bool opaque = true;
    for (std::size_t i = 3; i < before.size(); i += 4)
        opaque = opaque && before[i] == 1.0f;
    before = std::move(beauty->values);
    for (std::size_t i = 3; opaque && i < before.size(); i += 4)
        before[i] = 1.0f;
    return picture;
}

} // namespace zsi::host
