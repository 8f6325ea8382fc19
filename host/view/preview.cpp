// SPDX-License-Identifier: Apache-2.0
#include "view/preview.h"

#include "base/error.h"
#include "base/threads.h"
#include "film/noise.h"
#include "integrate/layers.h"
#include "render/render.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <mutex>

namespace zsi::view {
namespace {

constexpr int kTile = 16, kBandRows = 64; ///< pixels; bands hold whole tiles
constexpr std::uint32_t kMostSamplesOfPass = 16;
constexpr int kLeastRows = 48; ///< of a first look
constexpr double kStepSeconds = 0.15, kFirstSeconds = 0.045;

/// "beauty", and layers that a film can have.
std::vector<std::string> namesOf(std::set<std::string> const& wanted,
                                 host::FilmSettings const& film, bool halves)
{
    std::vector<std::string> names = film.layers;
    for (std::string const& name : wanted)
        if (name != "beauty")
            names.push_back(name);
    if (halves)
        names.push_back("halves");
    return names;
}

std::vector<host::LayerFormat> formatsOf(host::Scene const& scene,
                                         std::set<std::string> const& wanted, bool halves)
{
    return host::chooseLayers(namesOf(wanted, scene.film, halves), scene.settings.noise > 0.0f);
}

} // namespace

Preview::Preview(LiveScene& scene)
    : live_(scene)
{
    restart();
}

bool Preview::wantLayers(std::set<std::string> const& layers, bool halves)
{
    wanted_ = layers;
    wanted_.insert("beauty");
    halves_ = halves;
    auto const formats = formatsOf(live_.scene(), wanted_, halves_);
    // A film that has more than is wanted stays.
    auto const has = [&](host::LayerFormat const& format) {
        return std::ranges::any_of(film_.layers(), [&](host::LayerFormat const& there) {
            return there.name == format.name && (format.half.empty() || there.half == format.half);
        });
    };
    isStale_ = true;
    bool const isOther = !std::ranges::all_of(formats, has);
    if (isOther)
        restart();
    return isOther;
}

void Preview::restart()
{
    host::FilmSettings const& film = live_.scene().film;
    ++generation_;
    film_ = host::Film(film.width, film.height, host::windowOf(film),
                       formatsOf(live_.scene(), wanted_, halves_));
    units_.clear();
    samples_ = passEnd_ = 0;
    isCoarse_ = true;
    isStale_ = false;
    denoised_.reset();
    updates_.clear();
    seconds_ = 0;
    rays_ = 0;
}

void Preview::showDenoised(host::Layer layer)
{
    denoised_ = std::move(layer);
    isStale_ = true;
}

void Preview::showNoisy()
{
    isStale_ = denoised_.has_value();
    denoised_.reset();
}

double Preview::noise() const
{
    if (film_.layers().front().half.empty() || samples_ < 2)
        return -1;
    return std::sqrt(host::squaredNoise(film_, film_.window()));
}

bool Preview::isDone() const
{
    host::Settings const& settings = live_.scene().settings;
    bool const isSmooth =
        settings.noise > 0.0f && samples_ >= 16 && noise() < static_cast<double>(settings.noise);
    return units_.empty() && (samples_ >= static_cast<std::uint32_t>(settings.samples) || isSmooth);
}

void Preview::nextPass()
{
    auto const target = static_cast<std::uint32_t>(live_.scene().settings.samples);
    passEnd_ = std::min({target, std::max(1u, 2 * samples_), samples_ + kMostSamplesOfPass});
    host::Window const all = film_.window();
    for (int y = all.y0; y < all.y1; y += kTile)
        for (int x = all.x0; x < all.x1; x += kTile)
            units_.push_back(
                {intersection(all, {x, y, x + kTile, y + kTile}), {samples_, passEnd_}});
}

void Preview::count(host::RenderReport const& report, double samples)
{
    seconds_ += report.seconds;
    rays_ += report.rays.sum();
    if (samples > 0 && report.seconds > 0)
        secondsPerSample_ = 0.5 * secondsPerSample_ + 0.5 * report.seconds / samples;
}

std::vector<LayerUpdate> Preview::step(std::atomic<bool> const& cancel,
                                       std::atomic<bool> const& pause)
{
    if (isCoarse_)
        renderCoarse(cancel);
    else if (!isDone())
        renderUnits(cancel, pause);
    return updates();
}

/// One sample of a smaller picture, where one of the whole would keep people waiting.
void Preview::renderCoarse(std::atomic<bool> const& cancel)
{
    int const width = film_.frameWidth(), height = film_.frameHeight();
    double const whole = secondsPerSample_ * width * height;
    // Small ones take little but what every call takes, which would count as slow samples.
    int const most = std::max(1, std::min(width, height) / kLeastRows);
    int const by = std::min(most, static_cast<int>(std::ceil(std::sqrt(whole / kFirstSeconds))));
    if (by < 2 || live_.countsPixels()) {
        isCoarse_ = false;
        return;
    }
    live_.setSize((width + by - 1) / by, (height + by - 1) / by);
    host::FilmSettings const& small = live_.scene().film;
    host::Film film(small.width, small.height, host::windowOf(small), film_.layers());
    host::RenderJob const job{film.window(), {0, 1}, 0, &cancel};
    host::RenderReport const report = live_.session().render(film, job);
    live_.setSize(width, height);
    if (!report.complete)
        return; // something else comes first
    count(report, static_cast<double>(film.frameWidth()) * film.frameHeight());
    isCoarse_ = false;
    std::set<std::size_t> all;
    for (int y = 0; y < film.frameHeight(); y += kBandRows)
        all.insert(static_cast<std::size_t>(y / kBandRows));
    show(film, all);
}

void Preview::renderUnits(std::atomic<bool> const& cancel, std::atomic<bool> const& pause)
{
    if (units_.empty())
        nextPass();
    double const ofUnit = secondsPerSample_ * kTile * kTile
        * (units_.front().samples.end - units_.front().samples.begin);
    std::size_t const some = std::clamp<std::size_t>(
        static_cast<std::size_t>(kStepSeconds / ofUnit), 8, units_.size() + 8);
    std::vector<host::RenderUnit> const now(
        units_.begin(),
        units_.begin() + static_cast<std::ptrdiff_t>(std::min(some, units_.size())));
    std::vector<char> done(now.size(), 0);
    host::RenderJob job;
    job.cancel = &cancel;
    job.pause = &pause;
    host::RenderReport const report = live_.session().render(film_, now, done, job);
    std::vector<host::RenderUnit> left;
    std::set<std::size_t> bands;
    double samples = 0;
    for (std::size_t i = 0; i < now.size(); ++i) {
        if (!done[i]) {
            left.push_back(now[i]);
            continue;
        }
        bands.insert(static_cast<std::size_t>(now[i].pixels.y0 / kBandRows));
        samples += static_cast<double>(now[i].pixels.width()) * now[i].pixels.height()
            * (now[i].samples.end - now[i].samples.begin);
    }
    left.insert(left.end(), units_.begin() + static_cast<std::ptrdiff_t>(now.size()), units_.end());
    units_ = std::move(left);
    count(report, report.complete ? samples : 0);
    if (units_.empty())
        samples_ = passEnd_;
    // The first ones go over the coarse picture, as soon as nothing is missing in them.
    if (samples_ == 0)
        for (host::RenderUnit const& unit : units_)
            bands.erase(static_cast<std::size_t>(unit.pixels.y0 / kBandRows));
    show(film_, bands);
}

std::vector<LayerUpdate> Preview::updates()
{
    if (std::exchange(isStale_, false)) {
        std::set<std::size_t> all;
        for (int y = 0; y < film_.frameHeight(); y += kBandRows)
            all.insert(static_cast<std::size_t>(y / kBandRows));
        if (samples_ > 0)
            show(film_, all);
    }
    std::vector<LayerUpdate> updates;
    for (auto& [name, update] : updates_)
        updates.push_back(std::move(update));
    updates_.clear();
    return updates;
}

host::Picture Preview::developedPart(host::Film const& film, host::Window const& window) const
{
    host::Film part(film.frameWidth(), film.frameHeight(), window, film.layers());
    part.add(film);
    host::Picture picture = part.picture();
    if (denoised_ && film.frameWidth() == film_.frameWidth()) {
        auto const row = static_cast<std::ptrdiff_t>(film.frameWidth()) * 4;
        picture.layers.front().values.assign(denoised_->values.begin() + window.y0 * row,
                                             denoised_->values.begin() + window.y1 * row);
    }
    return picture;
}

void Preview::show(host::Film const& film, std::set<std::size_t> const& bands)
{
    Display const display(live_.scene());
    int const width = film.frameWidth(), height = film.frameHeight();
    std::vector<std::size_t> const numbers(bands.begin(), bands.end());
    std::atomic<std::size_t> next{0};
    std::mutex lock;
    host::onThreads(0, [&] {
        ShownPicture shown{width, height, {}};
        for (std::size_t i; (i = next++) < numbers.size();) {
            int const y = static_cast<int>(numbers[i]) * kBandRows;
            int const rows = std::min(kBandRows, height - y);
            host::Picture picture = developedPart(film, {0, y, width, y + rows});
            // Of the band alone: its first row is the picture's.
            picture.window = {0, 0, width, rows};
            shown.height = rows;
            shown.rgba.resize(static_cast<std::size_t>(rows) * static_cast<std::size_t>(width) * 4);
            for (std::string const& name : wanted_) {
                host::Layer const* const layer = layerFor(picture, name);
                if (!layer)
                    continue;
                display.show(picture, *layer, shown);
                ShownPicture whole{width, height, {}};
                whole.rgba.swap(shown.rgba);
                bool const isDenoised = denoised_ && name == "beauty";
                Band band = makeBand(whole, y, rows, generation_, std::max(1u, samples_),
                                     isDenoised ? 1 : 0);
                whole.rgba.swap(shown.rgba);
                std::lock_guard const locked(lock);
                LayerUpdate& update = updates_[name];
                if (update.width != width || update.height != height)
                    update.bands.clear();
                update.layer = name;
                update.generation = generation_;
                update.width = width;
                update.height = height;
                update.bandCount = static_cast<std::size_t>((height + kBandRows - 1) / kBandRows);
                update.bands[numbers[i]] = std::move(band);
            }
        }
    });
}

ShownPicture Preview::shown(std::string const& name) const
{
    host::Window const all = film_.window();
    host::Picture const picture = developedPart(film_, all);
    host::Layer const* const layer = layerFor(picture, name);
    if (!layer)
        throw host::InputError(name + ": no page shows this layer, and the scene's film has none");
    ShownPicture shown{film_.frameWidth(), film_.frameHeight(), {}};
    shown.rgba.resize(4 * static_cast<std::size_t>(shown.width)
                      * static_cast<std::size_t>(shown.height));
    Display(live_.scene()).show(picture, *layer, shown);
    return shown;
}

host::Picture Preview::picture() const
{
    host::Picture picture = host::developed(film_, live_.scene());
    if (denoised_)
        picture.layers.front().values = denoised_->values;
    return picture;
}

} // namespace zsi::view
