// SPDX-License-Identifier: Apache-2.0
#include "render/unit.h"

#include "base/error.h"
#include "integrate/layers.h"
#include "scene/sceneHash.h"

#include <algorithm>
#include <fmt/format.h>
#include <nlohmann/json.hpp>

namespace zsi::host {
namespace {

using Json = nlohmann::json;

constexpr char const* kVersion = "zsi:version";
constexpr char const* kScene = "zsi:scene";
constexpr char const* kSeed = "zsi:seed";
constexpr char const* kBlock = "zsi:block";
constexpr char const* kSamples = "zsi:samples";
constexpr char const* kOfSamples = "zsi:ofSamples";
constexpr char const* kWindow = "zsi:window";
constexpr char const* kDevelopment = "zsi:development";
constexpr char const* kRays = "zsi:rays";
constexpr char const* kNonFinite = "zsi:nonFinite";

Json toJson(Development const& d)
{
    Json attachments = Json::array();
    for (Attachment const& a : d.attachments)
        attachments.push_back({a.name, a.text});
    return {{"halves", d.halves},
            {"opaque", d.opaque},
            {"attachments", std::move(attachments)},
            {"exposure", d.view.exposure},
            {"alpha", d.view.alpha},
            {"view", d.view.view}};
}

Development developmentOf(Json const& json)
{
    Development d;
    d.halves = json.at("halves").get<bool>();
    d.opaque = json.at("opaque").get<bool>();
    for (Json const& a : json.at("attachments"))
        d.attachments.push_back({a.at(0).get<std::string>(), a.at(1).get<std::string>()});
    d.view.exposure = json.at("exposure").get<float>();
    d.view.alpha = json.at("alpha").get<bool>();
    d.view.view = json.at("view").get<std::string>();
    return d;
}

std::vector<Attachment> labelOf(UnitHead const& head)
{
    UnitOrigin const& o = head.origin;
    SampleRange const& s = head.place.samples;
    return {{kVersion, o.version},
            {kScene, o.scene},
            {kSeed, std::to_string(o.seed)},
            {kBlock, std::to_string(s.begin / (s.end - s.begin))},
            {kSamples, Json{s.begin, s.end}.dump()},
            {kOfSamples, std::to_string(o.samples)},
            {kWindow, Json{o.window.x0, o.window.y0, o.window.x1, o.window.y1}.dump()},
            {kDevelopment, toJson(o.development).dump()},
            {kRays, std::to_string(head.rays)},
            {kNonFinite, std::to_string(head.nonFinite)}};
}

UnitHead headOf(std::string const& name, FilmHead const& film)
{
    auto const value = [&](char const* what) { return Json::parse(labelText(film.label, what)); };
    UnitHead head;
    UnitOrigin& o = head.origin;
    // What follows may be told in other ways by other versions.
    o.version = labelText(film.label, kVersion);
    if (o.version.empty() || labelText(film.label, kBlock).empty())
        throw InputError(name + ": is no unit of a picture");
    if (o.version != ZSI_HOST_VERSION)
        return head;
    try {
        o.scene = labelText(film.label, kScene);
        o.seed = value(kSeed).get<std::uint32_t>();
        o.samples = value(kOfSamples).get<std::uint32_t>();
        o.frameWidth = film.frameWidth;
        o.frameHeight = film.frameHeight;
        Json const w = value(kWindow), s = value(kSamples);
        o.window = {w.at(0).get<int>(), w.at(1).get<int>(), w.at(2).get<int>(), w.at(3).get<int>()};
        o.layers = film.layers;
        o.development = developmentOf(value(kDevelopment));
        head.place = {film.window, {s.at(0).get<std::uint32_t>(), s.at(1).get<std::uint32_t>()}};
        head.rays = value(kRays).get<std::uint64_t>();
        head.nonFinite = value(kNonFinite).get<std::uint64_t>();
    } catch (Json::exception const&) {
        throw InputError(name + ": is no unit of a picture, or its header is damaged");
    }
    return head;
}

/// Refuses a place that is not in the picture.
void check(RenderUnit const& place, UnitOrigin const& origin, std::string const& name)
{
    Window const& w = place.pixels;
    SampleRange const& s = place.samples;
    if (w.width() == 0 || w.height() == 0 || intersection(w, origin.window) != w)
        throw InputError(fmt::format("{}: the window {},{},{},{} is not a part of the picture, "
                                     "which is {},{},{},{}",
                                     name, w.x0, w.y0, w.x1, w.y1, origin.window.x0,
                                     origin.window.y0, origin.window.x1, origin.window.y1));
    if (s.begin >= s.end || s.end > origin.samples)
        throw InputError(fmt::format("{}: the samples {} to {} are none of the picture's, which "
                                     "has {} (settings.samples)",
                                     name, s.begin, s.end, origin.samples));
}

UnitHead checked(std::string const& name, UnitHead head)
{
    if (head.origin.version == ZSI_HOST_VERSION)
        check(head.place, head.origin, name);
    return head;
}

Unit unitOf(std::string const& name, StoredFilm stored)
{
    FilmHead const head{stored.film.frameWidth(), stored.film.frameHeight(), stored.film.window(),
                        stored.film.layers(), std::move(stored.label)};
    return {checked(name, headOf(name, head)), std::move(stored.film)};
}

} // namespace

UnitOrigin unitOriginOf(Scene const& scene)
{
    if (scene.settings.noise > 0)
        throw InputError(scene.file
                         + ": settings.noise decides by the whole picture where samples go; units "
                           "render all of them: set it to 0");
    FilmSettings const& film = scene.film;
    return {ZSI_HOST_VERSION,
            sceneHash(scene),
            scene.settings.seed,
            static_cast<std::uint32_t>(scene.settings.samples),
            film.width,
            film.height,
            windowOf(film),
            chooseLayers(film.layers),
            host::developmentOf(scene)};
}

std::string differenceOf(UnitOrigin const& unit, UnitOrigin const& expected)
{
    auto const differs = [](char const* what, auto const& is, auto const& should) {
        return is == should ? std::string()
                            : fmt::format("is of {} {}, expected {}", what, is, should);
    };
    auto const size = [](UnitOrigin const& o) {
        return fmt::format("{}x{}", o.frameWidth, o.frameHeight);
    };
    auto const window = [](UnitOrigin const& o) {
        return fmt::format("{},{},{},{}", o.window.x0, o.window.y0, o.window.x1, o.window.y1);
    };
    auto const layers = [](UnitOrigin const& o) {
        std::string names;
        for (LayerFormat const& l : o.layers)
            names += (names.empty() ? "" : ",") + l.name + (l.half.empty() ? "" : "+halves");
        return names;
    };
    for (std::string const& difference :
         {differs("version", unit.version, expected.version),
          differs("size", size(unit), size(expected)), differs("seed", unit.seed, expected.seed),
          differs("scene", unit.scene, expected.scene),
          differs("a picture of samples", unit.samples, expected.samples),
          differs("crop", window(unit), window(expected)),
          differs("layers", layers(unit), layers(expected))})
        if (!difference.empty())
            return difference;
    if (unit.layers != expected.layers || unit.development != expected.development)
        return "has other names of things, alpha, exposure or view";
    return {};
}

std::optional<Unit> renderUnit(Session& session, UnitOrigin const& origin, RenderUnit const& place,
                               RenderJob job)
{
    check(place, origin, session.scene().file);
    Unit unit{{origin, place}, session.newFilm(place.pixels)};
    job.window = place.pixels;
    job.samples = place.samples;
    RenderReport const report = session.render(unit.film, job);
    if (!report.complete)
        return {};
    unit.head.rays = report.rays.sum();
    unit.head.nonFinite = report.nonFinite;
    return unit;
}

std::vector<unsigned char> unitBytes(Unit const& unit)
{
    return filmBytes(unit.film, labelOf(unit.head));
}

UnitHead readUnitHead(std::filesystem::path const& file)
{
    return checked(file.string(), headOf(file.string(), readFilmHead(file)));
}

Unit readUnit(std::filesystem::path const& file) { return unitOf(file.string(), readFilm(file)); }

Unit readUnit(std::string const& name, std::span<unsigned char const> bytes)
{
    return unitOf(name, readFilm(name, bytes));
}

std::string placeText(RenderUnit const& place)
{
    Window const& w = place.pixels;
    return fmt::format("samples {} to {} of {},{},{},{}", place.samples.begin, place.samples.end,
                       w.x0, w.y0, w.x1, w.y1);
}

} // namespace zsi::host
