// SPDX-License-Identifier: Apache-2.0
#include "film/film.h"

#include "film/cryptomatte.h"

#include <bit>
#include <utility>

namespace zsi::host {
namespace {

using Value = LayerFormat::Value;

constexpr std::size_t kBoth = 2; ///< halves

void addTo(std::vector<IdCount>& counts, IdCount more)
{
    auto const at = std::lower_bound(counts.begin(), counts.end(), more.id,
                                     [](IdCount const& c, std::uint32_t id) { return c.id < id; });
    if (at != counts.end() && at->id == more.id)
        at->count += more.count;
    else
        counts.insert(at, more);
}

} // namespace

Film::Film(int frameWidth, int frameHeight, Window window, std::vector<LayerFormat> layers)
    : frameWidth_(frameWidth)
    , frameHeight_(frameHeight)
    , window_(window)
    , layers_(std::move(layers))
{
    for (LayerFormat const& layer : layers_) {
        std::size_t const halves = layer.half.empty() ? 1 : 2;
        places_.push_back({sumsOfPixel_, countsOfPixel_, halves, idsOfPixel_});
        if (layer.value == Value::Mean || layer.value == Value::Variance)
            sumsOfPixel_ += halves * layer.channels.size();
        countsOfPixel_ += halves;
        idsOfPixel_ += layer.value == Value::Ids;
    }
    sums_.resize(pixels() * sumsOfPixel_);
    counts_.resize(pixels() * countsOfPixel_);
    ids_.resize(pixels() * idsOfPixel_);
}

void Film::add(int x, int y, std::size_t layer, std::span<float const> values, std::uint32_t number)
{
    std::size_t const at = pixel(x, y);
    Place const& place = places_[layer];
    std::size_t const half = number % place.halves;
    ++counts_[at * countsOfPixel_ + place.count + half];
    if (layers_[layer].value == Value::Ids)
        return addTo(ids_[at * idsOfPixel_ + place.ids],
                     {std::bit_cast<std::uint32_t>(values[0]), 1});
    ExactSum* const sums =
        &sums_[at * sumsOfPixel_ + place.sums + half * layers_[layer].channels.size()];
    for (std::size_t c = 0; c < values.size(); ++c)
        sums[c].add(values[c]);
}

void Film::add(Film const& other)
{
    Window const common = intersection(window_, other.window_);
    for (int y = common.y0; y < common.y1; ++y)
        for (int x = common.x0; x < common.x1; ++x) {
            std::size_t const to = pixel(x, y), from = other.pixel(x, y);
            for (std::size_t i = 0; i < sumsOfPixel_; ++i)
                sums_[to * sumsOfPixel_ + i].add(other.sums_[from * sumsOfPixel_ + i]);
            for (std::size_t i = 0; i < countsOfPixel_; ++i)
                counts_[to * countsOfPixel_ + i] += other.counts_[from * countsOfPixel_ + i];
            for (std::size_t i = 0; i < idsOfPixel_; ++i)
                for (IdCount const& more : other.ids_[from * idsOfPixel_ + i])
                    addTo(ids_[to * idsOfPixel_ + i], more);
        }
}

void Film::clear()
{
    std::fill(sums_.begin(), sums_.end(), ExactSum());
    std::fill(counts_.begin(), counts_.end(), 0u);
    for (auto& ids : ids_)
        ids.clear();
}

std::uint32_t Film::countOf(std::size_t pixel, std::size_t layer, std::size_t half) const
{
    Place const& place = places_[layer];
    std::uint32_t const* const counts = &counts_[pixel * countsOfPixel_ + place.count];
    return half < kBoth ? counts[half] : counts[0] + (place.halves == 2 ? counts[1] : 0);
}

ExactSum Film::sumOf(std::size_t pixel, std::size_t layer, std::size_t channel,
                     std::size_t half) const
{
    Place const& place = places_[layer];
    std::size_t const channels = layers_[layer].channels.size();
    ExactSum const* const sums = &sums_[pixel * sumsOfPixel_ + place.sums + channel];
    ExactSum sum = half < kBoth ? sums[half * channels] : sums[0];
    if (half == kBoth && place.halves == 2)
        sum.add(sums[channels]);
    return sum;
}

std::uint32_t Film::count(int x, int y, std::size_t layer) const
{
    return countOf(pixel(x, y), layer, kBoth);
}

std::pair<std::uint32_t, std::uint32_t> Film::sampleRange() const
{
    std::pair<std::uint32_t, std::uint32_t> range{0, 0};
    for (std::size_t i = 0; i < pixels(); ++i) {
        std::uint32_t const count = countOf(i, 0, kBoth);
        range.first = i == 0 ? count : std::min(range.first, count);
        range.second = std::max(range.second, count);
    }
    return range;
}

double Film::meanSamples() const
{
    std::uint64_t sum = 0;
    for (std::size_t i = 0; i < pixels(); ++i)
        sum += countOf(i, 0, kBoth);
    return pixels() ? static_cast<double>(sum) / static_cast<double>(pixels()) : 0.0;
}

std::array<float, 2> Film::halves(int x, int y, std::size_t layer, std::size_t channel) const
{
    std::array<float, 2> means{};
    for (std::size_t half = 0; half < 2; ++half)
        if (std::uint32_t const count = countOf(pixel(x, y), layer, half))
            means[half] =
                static_cast<float>(sumOf(pixel(x, y), layer, channel, half).value() / count);
    return means;
}

Layer Film::means(std::size_t layer, std::size_t half) const
{
    LayerFormat const& format = layers_[layer];
    Layer result{half < kBoth ? format.half : format.name, format.channels, {}};
    result.values.reserve(pixels() * format.channels.size());
    for (std::size_t i = 0; i < pixels(); ++i) {
        std::uint32_t const count = countOf(i, layer, half);
        for (std::size_t c = 0; c < format.channels.size(); ++c)
            result.values.push_back(
                count ? static_cast<float>(sumOf(i, layer, c, half).value() / count) : 0.0f);
    }
    return result;
}

Layer Film::variance(std::size_t layer) const
{
    LayerFormat const& format = layers_[layer];
    Layer result{format.name, format.channels, {}};
    for (std::size_t i = 0; i < pixels(); ++i) {
        std::uint32_t const count = countOf(i, 0, kBoth);
        for (std::size_t c = 0; c < format.channels.size(); ++c) {
            double const n = count;
            double const mean = count ? sumOf(i, 0, c, kBoth).value() / n : 0.0;
            double const squares = count ? sumOf(i, layer, c, kBoth).value() / n : 0.0;
            result.values.push_back(
                count > 1 ? static_cast<float>(std::max(0.0, squares - mean * mean) / (n - 1))
                          : 0.0f);
        }
    }
    return result;
}

void Film::addIdLayers(std::size_t layer, Picture& picture) const
{
    std::size_t const first = picture.layers.size();
    for (std::string const& name : cryptomatteLayers(layers_[layer].name))
        picture.layers.push_back({name, {"R", "G", "B", "A"}, std::vector<float>(4 * pixels())});
    for (std::size_t i = 0; i < pixels(); ++i) {
        std::vector<IdCount> ranked = ids_[i * idsOfPixel_ + places_[layer].ids];
        std::stable_sort(ranked.begin(), ranked.end(),
                         [](IdCount const& a, IdCount const& b) { return a.count > b.count; });
        auto const samples = static_cast<float>(countOf(i, 0, kBoth));
        for (std::size_t rank = 0; rank < std::min(ranked.size(), kCryptomatteRanks); ++rank) {
            float* const pair = &picture.layers[first + rank / 2].values[4 * i + rank % 2 * 2];
            pair[0] = std::bit_cast<float>(ranked[rank].id);
            pair[1] = static_cast<float>(ranked[rank].count) / samples;
        }
    }
}

Picture Film::picture() const
{
    Picture picture{frameWidth_, frameHeight_, window_, {}};
    for (std::size_t l = 0; l < layers_.size(); ++l)
        switch (layers_[l].value) {
        case Value::Mean:
            picture.layers.push_back(means(l, kBoth));
            break;
        case Value::Count: {
            Layer& layer =
                picture.layers.emplace_back(Layer{layers_[l].name, layers_[l].channels, {}});
            for (std::size_t i = 0; i < pixels(); ++i)
                layer.values.push_back(static_cast<float>(countOf(i, 0, kBoth)));
            break;
        }
        case Value::Variance:
            picture.layers.push_back(variance(l));
            break;
        case Value::Ids:
            addIdLayers(l, picture);
            break;
        }
    return picture;
}

Picture Film::half(std::size_t which) const
{
    Picture picture{frameWidth_, frameHeight_, window_, {}};
    for (std::size_t l = 0; l < layers_.size(); ++l)
        if (!layers_[l].half.empty())
            picture.layers.push_back(means(l, which));
    return picture;
}

} // namespace zsi::host
