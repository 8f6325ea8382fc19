// SPDX-License-Identifier: Apache-2.0
/// What a picture grows from: sums and counts of samples, pixel by pixel and layer by layer.
#pragma once

#include "film/exactSum.h"
#include "film/picture.h"

#include <span>

namespace zsi::host {

/// A named layer of a film.
struct LayerFormat {
    enum class Value {
        Mean, ///< of the samples that have a value
        Count, ///< of the first layer's samples; one channel, nothing is added to it
    };
    std::string name;
    std::vector<std::string> channels;
    Value value = Value::Mean;

    bool operator==(LayerFormat const&) const = default;
};

/// Adding is exact (see ExactSum), so films of the same frame and layers add up to the same bits in
/// any order and division. Writing to different pixels from several threads is safe.
class Film {
public:
    Film() = default;
    Film(int frameWidth, int frameHeight, Window window, std::vector<LayerFormat> layers);

    int frameWidth() const { return frameWidth_; }
    int frameHeight() const { return frameHeight_; }
    Window const& window() const { return window_; }
    std::vector<LayerFormat> const& layers() const { return layers_; }

    /// One sample of a layer; `values`: one for each of its channels. The pixel lies in the window.
    void add(int x, int y, std::size_t layer, std::span<float const> values);
    /// All that `other`, a film of the same frame and layers, holds of this film's window.
    void add(Film const& other);
    void clear();

    /// How many samples a pixel's layer has got.
    std::uint32_t count(int x, int y, std::size_t layer) const;
    /// The fewest and most samples that any pixel of the first layer has.
    std::pair<std::uint32_t, std::uint32_t> sampleRange() const;

    /// Means, 0 where there is no sample.
    Picture picture() const;

private:
    std::size_t pixel(int x, int y) const
    {
        return static_cast<std::size_t>(y - window_.y0) * static_cast<std::size_t>(window_.width())
            + static_cast<std::size_t>(x - window_.x0);
    }

    int frameWidth_ = 0, frameHeight_ = 0;
    Window window_;
    std::vector<LayerFormat> layers_;
    std::vector<std::size_t> firstChannel_; ///< of each layer, within a pixel's sums
    std::size_t channels_ = 0; ///< of all layers
    std::vector<ExactSum> sums_;
    std::vector<std::uint32_t> counts_; ///< a pixel's layers together
};

} // namespace zsi::host
