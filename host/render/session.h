// SPDX-License-Identifier: Apache-2.0
/// Renders parts of a scene's picture, again and again while the scene is changed.
#pragma once

#include "film/film.h"
#include "shading/preparedScene.h"
#include "shading/shadingContext.h"

#include <atomic>
#include <cstdint>
#include <functional>

namespace zsi::host {

/// Samples `begin` to before `end` of every pixel.
struct SampleRange {
    std::uint32_t begin = 0, end = 0;

    bool operator==(SampleRange const&) const = default;
};

/// Samples of some pixels.
struct RenderUnit {
    Window pixels;
    SampleRange samples;

    bool operator==(RenderUnit const&) const = default;
};

/// What to render, and who wants to know of it.
struct RenderJob {
    Window window; ///< of the frame; what lies outside of the film is left out
    SampleRange samples;
    int threads = 0; ///< 0: one per processor
    std::atomic<bool> const* cancel = nullptr; ///< set to stop within a sample
    std::atomic<bool> const* pause = nullptr; ///< set to stop when the begun units are done
    /// Called from any thread, one at a time.
    std::function<void(double done)> progress = {};
    /// Called likewise: these samples of the tile are in the film, which the call may read there.
    std::function<void(Window const& tile, SampleRange samples)> tileDone = {};
};

struct RenderReport {
    std::uint64_t nonFinite = 0; ///< results that were not finite and were left out
    std::vector<std::uint64_t> nonFiniteOf = {}; ///< the same by material, last the environment's
    std::uint64_t surfaces = 0; ///< camera samples that saw a surface
    RayCounts rays;
    double seconds = 0;
    bool complete = true; ///< false: cancelled, some samples are missing
    double noise = -1; ///< of the picture (film/noise.h), where it was asked for
};

/// Keeps a scene prepared for rendering. The scene stays its owner's, outlives the session, and may
/// be edited between two calls of `render`:
/// - a parameter's value, the camera, film and settings: nothing to tell
/// - the environment: `environmentChanged`
/// - lights: `lightsChanged`
/// - another shader in a material's place: `materialChanged`
/// - instances moved, added, removed, or given another mesh or material: `instancesChanged`
/// - meshes: `meshesChanged`
/// A sample depends on the scene, its pixel, its number and the seed alone, and films add up
/// exactly (ExactSum): jobs that together cover the same samples give the same picture bit for bit,
/// in any order and division of windows and sample ranges, with any number of threads, on any
/// machine that runs the same build.
class Session {
public:
    /// Throws as PreparedScene does. `progress`: of the acceleration structures.
    explicit Session(Scene const& scene, BuildProgress const& progress = {});

    Scene const& scene() const { return prepared_.scene(); }
    PreparedScene const& prepared() const { return prepared_; }
    void materialChanged(std::size_t index) { prepared_.materialChanged(index); }
    void environmentChanged() { prepared_.environmentChanged(); }
    void lightsChanged() { prepared_.lightsChanged(); }
    void instancesChanged(BuildProgress const& progress = {})
    {
        prepared_.instancesChanged(progress);
    }
    void meshesChanged(BuildProgress const& progress = {}) { prepared_.meshesChanged(progress); }

    /// What the scene's integrator does not show of its materials, a line for each of them. Throws
    /// InputError for an unknown integrator.
    std::vector<std::string> omissions();
    /// An empty film with the scene's layers over its crop. Throws InputError for an unknown layer.
    Film newFilm() const;
    /// The same over a part of the frame.
    Film newFilm(Window const& window) const;
    /// Adds the samples of the job to `film`, one of `newFilm` or of another session of the same
    /// scene. Throws InputError for an unknown integrator.
    RenderReport render(Film& film, RenderJob const& job);
    /// Likewise the samples of `units` instead of those of the job, units of the same corner one
    /// after another; `done`: as many as units, not 0 for those whose samples are in the film.
    RenderReport render(Film& film, std::span<RenderUnit const> units, std::span<char> done,
                        RenderJob const& job);

private:
    PreparedScene prepared_;
};

/// What layers of names call the material and the object of each instance.
struct ObjectNames {
    std::vector<std::string> shaders, objects;
};
ObjectNames objectNames(Scene const& scene);

/// The scene's picture, or the part in its crop.
Window windowOf(FilmSettings const& film);

} // namespace zsi::host
