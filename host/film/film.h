// SPDX-License-Identifier: Apache-2.0
/// What a picture grows from: sums and counts of samples, pixel by pixel and layer by layer.
#pragma once

#include "film/exactSum.h"
#include "film/picture.h"

#include <array>
#include <span>

namespace zsi::host {

/// A named layer of a film.
struct LayerFormat {
    enum class Value {
        Mean, ///< of the samples that have a value
        Count, ///< of the first layer's samples; one channel, nothing is added to it
        /// Of the first layer's mean, as independent samples would have it; the squares of its
        /// values are added.
        Variance,
        /// Shares of the samples by name, each a float of Cryptomatte (film/cryptomatte.h) that is
        /// added; channels are made as the picture is.
        Ids,
    };
    std::string name;
    std::vector<std::string> channels;
    Value value = Value::Mean;
    /// Where not empty, samples of even and of odd number are kept apart: the layer's name in
    /// pictures of either half.
    std::string half = {};

    bool operator==(LayerFormat const&) const = default;
};

/// How many samples of a pixel showed a name.
struct IdCount {
    std::uint32_t id;
    std::uint32_t count;

    bool operator==(IdCount const&) const = default;
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

    /// What a sample adds to a layer; `values`: one for each of its channels; `number`: the
    /// sample's. The pixel lies in the window.
    void add(int x, int y, std::size_t layer, std::span<float const> values,
             std::uint32_t number = 0);
    /// All that `other`, a film of the same frame and layers, holds of this film's window.
    void add(Film const& other);
    void clear();

    /// How many samples a pixel's layer has got.
    std::uint32_t count(int x, int y, std::size_t layer) const;
    /// The fewest and most samples that any pixel of the first layer has.
    std::pair<std::uint32_t, std::uint32_t> sampleRange() const;
    double meanSamples() const; ///< a pixel's of the first layer

    /// Means, 0 where there is no sample.
    Picture picture() const;
    /// The layers of which halves are kept, by the names that they have there, from the samples of
    /// even (0) or odd (1) number.
    Picture half(std::size_t which) const;
    /// Of a layer with halves: mean of a channel over either half of a pixel's samples.
    std::array<float, 2> halves(int x, int y, std::size_t layer, std::size_t channel) const;

    /// All that a pixel holds, for files.
    struct State {
        std::span<ExactSum> sums;
        std::span<std::uint32_t> counts;
        std::span<std::vector<IdCount>> ids; ///< each by rising id
    };
    struct ConstState {
        std::span<ExactSum const> sums;
        std::span<std::uint32_t const> counts;
        std::span<std::vector<IdCount> const> ids;
    };
    State state(int x, int y) { return stateOf<State>(*this, pixel(x, y)); }
    ConstState state(int x, int y) const { return stateOf<ConstState>(*this, pixel(x, y)); }

private:
    /// Where a layer's values stand within a pixel's. Its halves follow each other.
    struct Place {
        std::size_t sums, count, halves;
        std::size_t ids; ///< for Value::Ids
    };

    std::size_t pixel(int x, int y) const
    {
        return static_cast<std::size_t>(y - window_.y0) * static_cast<std::size_t>(window_.width())
            + static_cast<std::size_t>(x - window_.x0);
    }
    template <class State, class Film>
    static State stateOf(Film& film, std::size_t at)
    {
        return {std::span(film.sums_).subspan(at * film.sumsOfPixel_, film.sumsOfPixel_),
                std::span(film.counts_).subspan(at * film.countsOfPixel_, film.countsOfPixel_),
                std::span(film.ids_).subspan(at * film.idsOfPixel_, film.idsOfPixel_)};
    }
    std::size_t pixels() const
    {
        return static_cast<std::size_t>(window_.width())
            * static_cast<std::size_t>(window_.height());
    }
    /// Samples of a pixel in a layer, of one half or (2) of both.
    std::uint32_t countOf(std::size_t pixel, std::size_t layer, std::size_t half) const;
    ExactSum sumOf(std::size_t pixel, std::size_t layer, std::size_t channel,
                   std::size_t half) const;
    Layer means(std::size_t layer, std::size_t half) const;
    Layer variance(std::size_t layer) const;
    void addIdLayers(std::size_t layer, Picture& picture) const;

    int frameWidth_ = 0, frameHeight_ = 0;
    Window window_;
    std::vector<LayerFormat> layers_;
    std::vector<Place> places_;
    std::size_t sumsOfPixel_ = 0, countsOfPixel_ = 0, idsOfPixel_ = 0;
    std::vector<ExactSum> sums_;
    std::vector<std::uint32_t> counts_;
    std::vector<std::vector<IdCount>> ids_; ///< by rising id
};

} // namespace zsi::host
