// SPDX-License-Identifier: Apache-2.0
#include "film/halves.h"

#include <utility>

namespace zsi::host {
namespace {

constexpr char const* kNames[] = {"halfA", "halfB"};
constexpr char const* kBeauty = "beauty";

} // namespace

void appendHalves(Picture& picture, std::array<Picture, 2> halves)
{
    for (std::size_t i = 0; i < 2; ++i)
        for (Layer& layer : halves[i].layers) {
            layer.name = layer.name == kBeauty ? kNames[i] : kNames[i] + ('.' + layer.name);
            picture.layers.push_back(std::move(layer));
        }
}

std::optional<std::array<Picture, 2>> halvesOf(Picture const& picture)
{
    std::array<Picture, 2> halves;
    for (std::size_t i = 0; i < 2; ++i) {
        std::string const name = kNames[i], prefix = name + '.';
        halves[i] = {picture.frameWidth, picture.frameHeight, picture.window, {}};
        for (Layer const& layer : picture.layers)
            if (layer.name == name)
                halves[i].layers.insert(halves[i].layers.begin(),
                                        {kBeauty, layer.channels, layer.values});
            else if (layer.name.starts_with(prefix))
                halves[i].layers.push_back(
                    {layer.name.substr(prefix.size()), layer.channels, layer.values});
        if (halves[i].layers.empty() || halves[i].layers.front().name != kBeauty)
            return {};
    }
    return halves;
}

} // namespace zsi::host
