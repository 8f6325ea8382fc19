// SPDX-License-Identifier: Apache-2.0
#include "view/display.h"

#include "base/hash.h"
#include "render/render.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>

namespace zsi::view {
namespace {

std::uint8_t quantised(float v)
{
    return !(v > 0.0f) ? std::uint8_t(0)
                       : static_cast<std::uint8_t>(std::lround(minOf(v, 1.0f) * 255.0f));
}

/// A colour for a name, the same in every picture.
Vec3f colorOf(float id)
{
    std::uint32_t const bits = host::hashCombine(std::bit_cast<std::uint32_t>(id), 0x5eed);
    auto const part = [&](int shift) {
        return 0.2f + 0.8f * static_cast<float>((bits >> shift) & 255u) / 255.0f;
    };
    return {part(0), part(8), part(16)};
}

bool isAnyOf(std::string const& name, std::initializer_list<char const*> names)
{
    return std::ranges::any_of(names, [&](char const* n) { return name == n; });
}

} // namespace

Display::Display(host::Scene const& scene)
    : view_(host::screenView(scene.film))
    , target_(scene.camera.target)
    , reach_(maxOf(length(scene.camera.target - scene.camera.position), 1e-6f))
    , samples_(static_cast<float>(scene.settings.samples))
{
}

void Display::show(host::Picture const& picture, host::Layer const& layer,
                   ShownPicture& shown) const
{
    std::size_t const channels = layer.channels.size();
    std::size_t const pixels = layer.values.size() / std::max<std::size_t>(channels, 1);
    std::string const& name = layer.name;
    bool const isAlbedo = name == "albedo";
    bool const isLight =
        isAnyOf(name, {"beauty", "direct", "indirect", "emission", "environment", "variance"});
    std::vector<float> rgb(pixels * 3);
    for (std::size_t i = 0; i < pixels; ++i) {
        float const* const v = &layer.values[i * channels];
        Vec3f c;
        if (isLight || isAlbedo)
            c = {v[0], v[1], v[2]};
        else if (isAnyOf(name, {"normal", "denoiseNormal"}))
            c = (v[0] != 0 || v[1] != 0 || v[2] != 0)
                ? Vec3f(v[0], v[1], v[2]) * 0.5f + Vec3f(0.5f, 0.5f, 0.5f)
                : Vec3f(0, 0, 0);
        else if (name == "position")
            c = (Vec3f(v[0], v[1], v[2]) - target_) * (0.5f / reach_) + Vec3f(0.5f, 0.5f, 0.5f);
        else if (isAnyOf(name, {"depth", "denoiseDepth"}))
            c = Vec3f(1, 1, 1) * (v[0] > 0 ? reach_ / (reach_ + v[0]) : 0.0f);
        else if (name == "samples")
            c = Vec3f(1, 1, 1) * (v[0] / samples_);
        else if (channels == 4) // two names with their shares
            c = colorOf(v[0]) * v[1] + colorOf(v[2]) * v[3];
        std::copy_n(&c.x, 3, &rgb[i * 3]);
    }
    if (isLight || isAlbedo)
        host::screenTransform(isLight ? view_ : host::ScreenView{0.0f, false, "plain", {}})(rgb);
    auto const width = static_cast<std::size_t>(picture.width());
    for (std::size_t i = 0; i < pixels; ++i) {
        auto const x = static_cast<std::size_t>(picture.window.x0) + i % width;
        auto const y = static_cast<std::size_t>(picture.window.y0) + i / width;
        std::uint8_t* const to = &shown.rgba[4 * (y * static_cast<std::size_t>(shown.width) + x)];
        for (std::size_t k = 0; k < 3; ++k)
            to[k] = quantised(rgb[i * 3 + k]);
        to[3] = 255;
    }
}

host::Layer const* layerFor(host::Picture const& picture, std::string const& name)
{
    for (host::Layer const& layer : picture.layers)
        if (layer.name == name || layer.name == name + "00")
            return &layer;
    return nullptr;
}

} // namespace zsi::view
