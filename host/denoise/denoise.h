// SPDX-License-Identifier: Apache-2.0
/// Takes the noise out of a picture that was rendered in two halves.
#pragma once

#include "film/picture.h"

#include <array>
#include <atomic>
#include <functional>
#include <optional>

namespace zsi::host {

struct DenoiseOptions {
    int threads = 0; ///< 0: one per processor
    std::function<void(double)> progress = {}; ///< fraction done, 0..1, from any thread, serialised
    std::atomic<bool> const* cancel = nullptr; ///< set to stop early
};

/// The beauty of both halves together, RGBA, without its noise; nothing when cancelled. `halves`
/// are pictures of the same window from different samples, each with the layers `beauty` (RGBA),
/// `albedo` (3 channels), `normal` (3) and `depth` (1); throws InputError that names a missing one.
/// Values are finite. The result has the same bits with any number of threads.
std::optional<Layer> denoised(std::array<Picture, 2> const& halves,
                              DenoiseOptions const& options = {});

/// The picture with its first layer denoised by the halves that it holds (film/halves.h); nothing
/// when cancelled. An opaque picture stays so. Throws InputError, also where the halves are
/// missing.
std::optional<Picture> denoised(Picture picture, DenoiseOptions const& options = {});

} // namespace zsi::host
