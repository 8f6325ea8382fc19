/// Renders a scene into a picture.
#pragma once

#include "scene/scene.h"

#include <atomic>
#include <cstdint>
#include <functional>
#include <string>
#include <vector>

namespace zsi::host {

/// Linear RGBA, rows from the top, four floats a pixel.
struct Picture {
    int width = 0;
    int height = 0;
    std::vector<float> rgba;
};

struct RenderOptions {
    int threads = 0; ///< 0: all
    std::function<void(double)> progress; ///< fraction done, 0..1, from any thread, serialised
    std::atomic<bool> const* cancel = nullptr; ///< set to stop early
};

struct RenderReport {
    std::uint64_t nonFinite = 0; ///< results that were not finite and were left out
    std::uint64_t rays = 0;
    double seconds = 0;
};

/// The same scene and seed give the same picture bit for bit, whatever the number of threads.
Picture render(Scene const& scene, RenderOptions const& options, RenderReport* report = nullptr);

} // namespace zsi::host
