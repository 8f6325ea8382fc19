// SPDX-License-Identifier: Apache-2.0
#include "render/render.h"

#include "film/cryptomatte.h"
#include "film/halves.h"

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

Picture developed(Film const& film, Scene const& scene)
{
    Picture picture = film.picture();
    auto const& asked = scene.film.layers;
    if (std::find(asked.begin(), asked.end(), "halves") != asked.end())
        appendHalves(picture, {film.half(0), film.half(1)});
    ObjectNames const names = objectNames(scene);
    for (LayerFormat const& layer : film.layers())
        if (layer.value == LayerFormat::Value::Ids)
            for (Attachment& line : cryptomatteHeader(
                     layer.name, layer.name == "shaderId" ? names.shaders : names.objects))
                picture.attachments.push_back(std::move(line));
    if (scene.film.alpha == false) {
        std::vector<float>& rgba = picture.layers.front().values;
        for (std::size_t i = 3; i < rgba.size(); i += 4)
            rgba[i] = 1.0f;
    }
    return picture;
}

ScreenView screenView(FilmSettings const& settings, std::string const& ocioConfig)
{
    return {settings.exposure, settings.alpha == true, settings.view, ocioConfig};
}

} // namespace zsi::host
