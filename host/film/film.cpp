// SPDX-License-Identifier: Apache-2.0
#include "film/film.h"

#include <utility>

namespace zsi::host {

Film::Film(int frameWidth, int frameHeight, Window window, std::vector<LayerFormat> layers)
    : frameWidth_(frameWidth)
    , frameHeight_(frameHeight)
    , window_(window)
    , layers_(std::move(layers))
{
    for (LayerFormat const& layer : layers_) {
        firstChannel_.push_back(channels_);
        if (layer.value == LayerFormat::Value::Mean)
            channels_ += layer.channels.size();
    }
    auto const pixels =
        static_cast<std::size_t>(window_.width()) * static_cast<std::size_t>(window_.height());
    sums_.resize(pixels * channels_);
    counts_.resize(pixels * layers_.size());
}

void Film::add(int x, int y, std::size_t layer, std::span<float const> values)
{
    std::size_t const at = pixel(x, y);
    ++counts_[at * layers_.size() + layer];
    ExactSum* const sums = &sums_[at * channels_ + firstChannel_[layer]];
    for (std::size_t c = 0; c < values.size(); ++c)
        sums[c].add(values[c]);
}

void Film::add(Film const& other)
{
    Window const common = intersection(window_, other.window_);
    for (int y = common.y0; y < common.y1; ++y)
        for (int x = common.x0; x < common.x1; ++x) {
            std::size_t const to = pixel(x, y), from = other.pixel(x, y);
            for (std::size_t c = 0; c < channels_; ++c)
                sums_[to * channels_ + c].add(other.sums_[from * channels_ + c]);
            for (std::size_t l = 0; l < layers_.size(); ++l)
                counts_[to * layers_.size() + l] += other.counts_[from * layers_.size() + l];
        }
}

void Film::clear()
{
    std::fill(sums_.begin(), sums_.end(), ExactSum());
    std::fill(counts_.begin(), counts_.end(), 0u);
}

std::uint32_t Film::count(int x, int y, std::size_t layer) const
{
    return counts_[pixel(x, y) * layers_.size() + layer];
}

std::pair<std::uint32_t, std::uint32_t> Film::sampleRange() const
{
    std::pair<std::uint32_t, std::uint32_t> range{0, 0};
    for (std::size_t i = 0; i < counts_.size(); i += layers_.size()) {
        range.first = i == 0 ? counts_[i] : std::min(range.first, counts_[i]);
        range.second = std::max(range.second, counts_[i]);
    }
    return range;
}

Picture Film::picture() const
{
    Picture picture{frameWidth_, frameHeight_, window_, {}};
    std::size_t const pixels = layers_.empty() ? 0 : counts_.size() / layers_.size();
    for (std::size_t l = 0; l < layers_.size(); ++l) {
        LayerFormat const& format = layers_[l];
        Layer layer{format.name, format.channels, {}};
        layer.values.reserve(pixels * format.channels.size());
        for (std::size_t i = 0; i < pixels; ++i) {
            if (format.value == LayerFormat::Value::Count) {
                layer.values.push_back(static_cast<float>(counts_[i * layers_.size()]));
                continue;
            }
            std::uint32_t const count = counts_[i * layers_.size() + l];
            ExactSum const* const sums = &sums_[i * channels_ + firstChannel_[l]];
            for (std::size_t c = 0; c < format.channels.size(); ++c)
                layer.values.push_back(count ? static_cast<float>(sums[c].value() / count) : 0.0f);
        }
        picture.layers.push_back(std::move(layer));
    }
    return picture;
}

} // namespace zsi::host
