// SPDX-License-Identifier: Apache-2.0
#include "scene/resize.h"

#include <cmath>

namespace zsi::host {
namespace {

Vec2f* pair(Shader const& shader, char const* name)
{
    Parameter const* const p = shader.find(name);
    return p && p->type == ParameterType::Vec2f ? static_cast<Vec2f*>(p->field) : nullptr;
}

} // namespace

void resize(Scene& scene, int width, int height)
{
    FilmSettings& film = scene.film;
    double const down = static_cast<double>(height) / film.height;
    if (film.crop) {
        auto& c = *film.crop;
        auto const scaled = [](int at, int to, int from) {
            return static_cast<double>(at) * to / from;
        };
        c = {static_cast<int>(std::floor(scaled(c[0], width, film.width))),
             static_cast<int>(std::floor(scaled(c[1], height, film.height))),
             static_cast<int>(std::ceil(scaled(c[2], width, film.width))),
             static_cast<int>(std::ceil(scaled(c[3], height, film.height)))};
    }
    if (scene.environment) {
        Vec2f* const scale = pair(*scene.environment, "uv_scale");
        Vec2f* const offset = pair(*scene.environment, "uv_offset");
        Vec2f* const size = pair(*scene.environment, "render_size");
        auto const s = static_cast<float>(down);
        // The field of view is that of the height: a wider picture shows more at both sides.
        float const shift = 0.5f * static_cast<float>(film.width - width / down);
        if (scale && offset) {
            offset->x += scale->x * shift;
            *scale = *scale * (1.0f / s);
        }
        if (size && size->y >= 0.0f)
            *size = *size * s;
    }
    film.width = width;
    film.height = height;
}

} // namespace zsi::host
