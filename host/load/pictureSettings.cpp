// SPDX-License-Identifier: Apache-2.0
#include "load/pictureSettings.h"

#include "integrate/integrators.h"
#include "integrate/layers.h"
#include "load/placing.h"

#include <cmath>

namespace zsi::host {
namespace {

constexpr int kLargestFilm = 32768; // pixels a side
constexpr int kMostSamples = 1 << 20;

} // namespace

Camera readCamera(JsonReader const& reader)
{
    reader.expectKeys({"position", "target", "up", "fov", "lensRadius", "focusDistance"});
    Camera camera;
    if (auto const v = reader.find("position"))
        camera.position = readPosition(*v);
    if (auto const v = reader.find("target"))
        camera.target = readPosition(*v);
    if (auto const v = reader.find("up"))
        camera.up = v->toVec3f();
    if (auto const v = reader.find("fov")) {
        camera.verticalFov = v->toPositive();
        if (camera.verticalFov >= 180.0f)
            v->failExpected("degrees below 180");
    }
    if (auto const v = reader.find("lensRadius"))
        camera.lensRadius = v->toFloat(0, kFarthest / 2);
    if (auto const v = reader.find("focusDistance"))
        camera.focusDistance = v->toFloat(0, kFarthest);
    Vec3f const view = camera.target - camera.position;
    if (!(length(view) > 0.0f) || !std::isfinite(length(view)))
        reader.fail("the target has no direction from the position");
    if (!(length(cross(normalize(view), normalize(camera.up))) > 1e-5f))
        reader.fail("up must point across the view, not along it");
    return camera;
}

FilmSettings readFilm(JsonReader const& reader)
{
    reader.expectKeys({"width", "height", "exposure", "view", "alpha", "crop", "layers"});
    FilmSettings film;
    if (auto const v = reader.find("width"))
        film.width = v->toInt(1, kLargestFilm);
    if (auto const v = reader.find("height"))
        film.height = v->toInt(1, kLargestFilm);
    if (auto const v = reader.find("exposure"))
        film.exposure = v->toFloat(-64, 64);
    if (auto const v = reader.find("view"))
        film.view = v->toString();
    if (auto const v = reader.find("alpha"))
        film.alpha = v->toBool();
    if (auto const v = reader.find("layers"))
        for (JsonReader const& name : v->items())
            film.layers.push_back(layerNames()[name.toChoice(layerNames())]);
    if (auto const v = reader.find("crop")) {
        std::vector<JsonReader> const items = v->items();
        if (items.size() != 4)
            v->failExpected("[x0, y0, x1, y1] in pixels, the end exclusive");
        int const x0 = items[0].toInt(0, film.width - 1), y0 = items[1].toInt(0, film.height - 1);
        int const x1 = items[2].toInt(x0 + 1, film.width);
        int const y1 = items[3].toInt(y0 + 1, film.height);
        film.crop = {x0, y0, x1, y1};
    }
    return film;
}

Settings readSettings(JsonReader const& reader)
{
    reader.expectKeys({"samples", "noise", "maxDepth", "occlusionSamples", "indirectSamples",
                       "occlusionDistance", "ambient", "sampleClamp", "seed", "integrator"});
    Settings settings;
    if (auto const v = reader.find("samples"))
        settings.samples = v->toInt(1, kMostSamples);
    if (auto const v = reader.find("noise"))
        settings.noise = v->toFloat(0);
    if (auto const v = reader.find("maxDepth"))
        settings.maxDepth = v->toInt(0, 1000);
    if (auto const v = reader.find("occlusionSamples"))
        settings.occlusionSamples = v->toInt(1, 4096);
    if (auto const v = reader.find("indirectSamples"))
        settings.indirectSamples = v->toInt(1, 4096);
    if (auto const v = reader.find("occlusionDistance"))
        settings.occlusionDistance = v->toFloat(0);
    if (auto const v = reader.find("ambient"))
        settings.ambient = v->toVec3f();
    if (auto const v = reader.find("sampleClamp"))
        settings.sampleClamp = v->toFloat(0);
    if (auto const v = reader.find("seed"))
        settings.seed = v->toUint32();
    if (auto const v = reader.find("integrator")) {
        settings.integrator = integratorNames()[v->toChoice(integratorNames())];
    }
    return settings;
}

} // namespace zsi::host
