/// The light list that materials walk, made by calling the scene's light shaders.
#pragma once

#include "scene/scene.h"

#include <memory>
#include <vector>

namespace zsi::host {

/// Records of light lists of one thread. A list lives until the mark before it is released, so
/// that lists of nested shading calls stand on each other.
class LightRecords {
public:
    std::size_t mark() const { return used_; }
    void release(std::size_t mark) { used_ = mark; }
    LightSample& add();

private:
    static constexpr std::size_t kBlock = 64;
    std::vector<std::unique_ptr<LightSample[]>> blocks_; // grows to the deepest nesting, then stays
    std::size_t used_ = 0;
};

/// A point on the disc of the light's radius that faces `P`: what `P` sees of the ball.
/// `u` in [0, 1)^2.
Vec3f lightPoint(Light const& light, Vec3f P, Vec2f u);

/// Asks one light for what arrives at `P` from `position`, a point of it. Returns false, with
/// `sample` unset, when nothing does: the shader wrote nothing, wrote black, or the light lies on
/// the light-less side of `normal`. `sample.weight` is the cosine to `normal`.
/// `record` gives `P`'s surroundings (ray, surface); its light fields and results are overwritten.
bool askLight(Light const& light, Vec3f position, Vec3f P, Vec3f normal, IShaderAPI* api,
              ShadeState& record, LightSample& sample);

} // namespace zsi::host
