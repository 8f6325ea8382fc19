// SPDX-License-Identifier: Apache-2.0
#include "view/turntable.h"

#include "base/error.h"

#include <cmath>
#include <numbers>

namespace zsi::view {
namespace {

/// `v` turned around the unit vector `axis` (Rodrigues).
Vec3f turned(Vec3f v, Vec3f axis, float angle)
{
    float const c = std::cos(angle), s = std::sin(angle);
    return v * c + cross(axis, v) * s + axis * (dot(axis, v) * (1.0f - c));
}

/// Another camera for as long as it lives.
class OtherCamera {
public:
    OtherCamera(host::Scene& scene, float angle)
        : scene_(scene)
        , before_(scene.camera)
    {
        host::Camera& camera = scene_.camera;
        camera.position =
            camera.target + turned(camera.position - camera.target, normalize(camera.up), angle);
    }
    ~OtherCamera() { scene_.camera = before_; }
    OtherCamera(OtherCamera const&) = delete;
    OtherCamera& operator=(OtherCamera const&) = delete;

private:
    host::Scene& scene_;
    host::Camera before_;
};

} // namespace

Turntable::Turntable(int frames, int samples)
    : frames_(static_cast<std::size_t>(frames))
    , samples_(static_cast<std::uint32_t>(samples))
{
    if (frames < 2 || frames > 720 || samples < 1 || samples > 65536)
        throw host::InputError("turntable: expected 2 to 720 frames of 1 to 65536 samples");
}

void Turntable::step(LiveScene& scene, std::atomic<bool> const& cancel)
{
    float const angle = 2.0f * std::numbers::pi_v<float> * static_cast<float>(pictures_.size())
        / static_cast<float>(frames_);
    OtherCamera const camera(scene.scene(), angle);
    if (film_.frameWidth() == 0)
        film_ = scene.session().newFilm();
    // Sample by sample, so that one that was not finished can be taken back.
    for (; rendered_ < samples_; ++rendered_) {
        host::Film sample = scene.session().newFilm();
        host::RenderJob const job{film_.window(), {rendered_, rendered_ + 1}, 0, &cancel};
        if (!scene.session().render(sample, job).complete)
            return;
        film_.add(sample);
    }
    host::Picture const picture = film_.picture();
    ShownPicture shown{picture.frameWidth, picture.frameHeight, {}};
    shown.rgba.resize(picture.rgba().size());
    Display(scene.scene()).show(picture, picture.layers.front(), shown);
    pictures_.push_back(pngOf(shown));
    film_ = {};
    rendered_ = 0;
}

} // namespace zsi::view
