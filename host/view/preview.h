// SPDX-License-Identifier: Apache-2.0
/// The picture of a live scene while it refines.
#pragma once

#include "view/display.h"
#include "view/liveScene.h"

#include <atomic>
#include <cstdint>
#include <map>
#include <set>

namespace zsi::view {

/// Rows of a shown picture as a page is sent them: a header and RGBA (docs/view.md).
using Band = std::shared_ptr<std::string const>;

/// What is new of a layer. A page that has an older generation or another size of it takes all.
struct LayerUpdate {
    std::string layer;
    std::uint32_t generation = 0;
    int width = 0, height = 0;
    std::size_t bandCount = 0; ///< of the whole picture
    std::map<std::size_t, Band> bands;
};

/// Renders step by step; one thread's.
class Preview {
public:
    explicit Preview(LiveScene& scene);

    /// What pages look at, beside what the scene's film has. True when samples start anew.
    bool wantLayers(std::set<std::string> const& layers, bool halves);
    /// The scene is another one: a new generation.
    void restart();
    /// All of what is shown is made again, of the samples that there are.
    void redisplay() { isStale_ = true; }
    /// This beauty is shown in place of the film's from now on, until a restart; RGBA.
    void showDenoised(host::Layer layer);
    void showNoisy();

    bool isDone() const;
    /// Renders for some 0.15 s, less when `cancel` or `pause` say so, and gives what is new.
    std::vector<LayerUpdate> step(std::atomic<bool> const& cancel, std::atomic<bool> const& pause);
    /// What is new without rendering.
    std::vector<LayerUpdate> updates();

    std::uint32_t generation() const { return generation_; }
    host::Film const& film() const { return film_; }
    /// Samples that every pixel has.
    std::uint32_t samples() const { return samples_; }
    double noise() const; ///< below 0: not known
    double seconds() const { return seconds_; } ///< of rendering, of this generation
    double raysPerSecond() const
    {
        return seconds_ > 0 ? static_cast<double>(rays_) / seconds_ : 0;
    }
    /// What is shown of a layer; throws InputError for one that is not there.
    ShownPicture shown(std::string const& name) const;
    /// The picture as it is now, with the layers of the scene's film and those that were wanted.
    host::Picture picture() const;

private:
    void renderCoarse(std::atomic<bool> const& cancel);
    void renderUnits(std::atomic<bool> const& cancel, std::atomic<bool> const& pause);
    void nextPass();
    void show(host::Film const& film, std::set<std::size_t> const& bands);
    host::Picture developedPart(host::Film const& film, host::Window const& window) const;
    void count(host::RenderReport const& report, double samples);

    LiveScene& live_;
    std::set<std::string> wanted_{"beauty"};
    bool halves_ = false;
    std::uint32_t generation_ = 0;
    host::Film film_;
    std::vector<host::RenderUnit> units_; ///< of this pass, what is left of it
    std::uint32_t samples_ = 0, passEnd_ = 0;
    bool isCoarse_ = true, isStale_ = false;
    std::optional<host::Layer> denoised_;
    std::map<std::string, LayerUpdate> updates_;
    double seconds_ = 0, secondsPerSample_ = 4e-6; ///< the latter of one pixel, all threads at work
    std::uint64_t rays_ = 0;
};

/// A message of rows `y` to before `y + rows` of a picture.
Band makeBand(ShownPicture const& picture, int y, int rows, std::uint32_t generation,
              std::uint32_t samples, int kind);
/// Likewise of a whole picture as PNG.
Band makePngBand(ShownPicture const& picture, std::uint32_t generation, int kind);
/// A PNG file.
std::string pngOf(ShownPicture const& picture);

} // namespace zsi::view
