// SPDX-License-Identifier: Apache-2.0
#include "render/render.h"

#include "film/cryptomatte.h"
#include "film/halves.h"
#include "integrate/layers.h"

#include <algorithm>

namespace zsi::host {

Picture render(Scene const& scene, RenderOptions const& options, RenderReport* report)
{
    Session session(scene, [&](double) { return !options.cancel || !*options.cancel; });
    Film film = session.newFilm();
    RenderReport const result = renderProgressively(session, film, options);
    if (report)
        *report = result;
    return developed(film, scene);
}

Development developmentOf(Scene const& scene)
{
    Development development;
    auto const& asked = scene.film.layers;
    development.halves = std::find(asked.begin(), asked.end(), "halves") != asked.end();
    development.opaque = scene.film.alpha == false;
    development.view = screenView(scene.film);
    ObjectNames const names = objectNames(scene);
    for (LayerFormat const& layer : chooseLayers(asked, false))
        if (layer.value == LayerFormat::Value::Ids)
            for (Attachment& line : cryptomatteHeader(
                     layer.name, layer.name == "shaderId" ? names.shaders : names.objects))
                development.attachments.push_back(std::move(line));
    return development;
}

Picture developed(Film const& film, Development const& development)
{
    Picture picture = film.picture();
    if (development.halves)
        appendHalves(picture, {film.half(0), film.half(1)});
    picture.attachments = development.attachments;
    if (development.opaque) {
        std::vector<float>& rgba = picture.layers.front().values;
        for (std::size_t i = 3; i < rgba.size(); i += 4)
            rgba[i] = 1.0f;
    }
    return picture;
}

Picture developed(Film const& film, Scene const& scene)
{
    return developed(film, developmentOf(scene));
}

ScreenView screenView(FilmSettings const& settings, std::string const& ocioConfig)
{
    return {settings.exposure, settings.alpha == true, settings.view, ocioConfig};
}

} // namespace zsi::host
