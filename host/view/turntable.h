// SPDX-License-Identifier: Apache-2.0
/// Pictures of a scene from all around.
#pragma once

#include "view/liveScene.h"
#include "view/preview.h"

#include <atomic>

namespace zsi::view {

/// The camera goes once around its target, around the up direction, in equal steps; the first
/// picture is the camera's own.
class Turntable {
public:
    /// Throws InputError for numbers out of range.
    Turntable(int frames, int samples);

    bool isDone() const { return pictures_.size() == frames_; }
    double done() const
    {
        return static_cast<double>(pictures_.size()) / static_cast<double>(frames_);
    }
    /// Renders the next picture; what was rendered of it stays when `cancel` ends the step.
    void step(LiveScene& scene, std::atomic<bool> const& cancel);
    std::vector<std::string>& pictures() { return pictures_; } ///< PNG files

private:
    std::size_t frames_;
    std::uint32_t samples_;
    host::Film film_;
    std::uint32_t rendered_ = 0;
    std::vector<std::string> pictures_;
};

} // namespace zsi::view
