// SPDX-License-Identifier: Apache-2.0
/// Renders a whole picture until it is good, its time is over or somebody stops it.
#pragma once

#include "render/checkpoint.h"
#include "render/session.h"

namespace zsi::host {

struct RenderStatus {
    double done = 0; ///< of all that is to do, as far as it is known, 0..1
    double samples = 0; ///< of a pixel, in the mean
    double noise = -1; ///< of the picture at the end of the last block; below 0: not known
};

struct RenderOptions {
    int threads = 0; ///< 0: one per processor
    /// From any thread, one at a time.
    std::function<void(RenderStatus const&)> progress = {};
    std::atomic<bool> const* cancel = nullptr; ///< set to stop early
    double seconds = 0; ///< above 0: stops after them, with the units of work that were begun
    /// Not empty: the state of the render is kept in this file, and gone on from where it is there
    /// already.
    std::filesystem::path checkpoint = {};
    /// Between two of them, and more where they take more than a fortieth of the time.
    double checkpointSeconds = 30;
    /// Gets the film as it is, between two passes, at least `previewSeconds` after the last time,
    /// and later where it takes long itself.
    std::function<void(Film const&)> preview = {};
    double previewSeconds = 1;
};

/// Adds samples of the scene's film: up to `settings.samples` of each pixel; with `settings.noise`
/// tiles whose noise is below it at the end of a block of 16 samples get no more. Which they are
/// depends on the film alone, so that the picture does not depend on threads, time or
/// interruptions. `film`: a new one of the session.
RenderReport renderProgressively(Session& session, Film& film, RenderOptions const& options);

} // namespace zsi::host
