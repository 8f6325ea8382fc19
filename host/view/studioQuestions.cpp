// SPDX-License-Identifier: Apache-2.0
// What a session answers without changing.
#include "base/error.h"
#include "base/names.h"
#include "film/imageFile.h"
#include "lab/lab.h"
#include "model/gltfPictures.h"
#include "render/cameraRays.h"
#include "render/render.h"
#include "view/difference.h"
#include "view/sceneText.h"
#include "view/studio.h"
#include "view/thumbnail.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <fmt/format.h>

namespace zsi::view {
namespace {

Json toJson(Vec3f const& v) { return {v.x, v.y, v.z}; }

/// JSON has no NaN and no infinity.
Json number(float v) { return std::isfinite(v) ? Json(v) : Json(fmt::format("{}", v)); }

/// A picture's file, or the picture of a model that `image`, a number, says.
host::PictureSource sourceOf(std::filesystem::path const& file, std::string const& image)
{
    if (image.empty())
        return {file};
    auto const model = host::GltfFile::open(file);
    std::size_t index = 0;
    std::from_chars(image.data(), image.data() + image.size(), index);
    if (index >= model->count("images"))
        throw host::InputError(fmt::format("{}: there is no images[{}]", file.string(), index));
    return host::pictureSource(model, index);
}

/// White where the eye sees most, over yellow and red from black.
ShownPicture heatPicture(std::vector<float> const& values, int width, int height)
{
    ShownPicture picture{width, height, {}};
    auto const byte = [](float v) {
        return static_cast<std::uint8_t>(std::lround(255.0f * std::clamp(v, 0.0f, 1.0f)));
    };
    for (float const v : values)
        for (std::uint8_t const b :
             {byte(3 * v), byte(3 * v - 1), byte(3 * v - 2), std::uint8_t(255)})
            picture.rgba.push_back(b);
    return picture;
}

/// Every file that a document names.
void filesOf(Json const& value, std::set<std::string>& files)
{
    for (auto const& [key, member] : value.items()) {
        if (member.is_structured())
            filesOf(member, files);
        else if (member.is_string())
            files.insert(member.get<std::string>());
    }
}

/// A copy of a material, which stays as it is when the scene is edited.
lab::Specimen specimenOf(host::Scene const& scene, std::string const& name,
                         host::ShaderSource const& shaders)
{
    auto const found = std::ranges::find(scene.materialNames, name);
    if (found == scene.materialNames.end())
        throw host::InputError("lab: the scene has no material " + host::printable(name));
    host::Shader const& live =
        scene.materials[static_cast<std::size_t>(found - scene.materialNames.begin())];
    struct Owned {
        std::shared_ptr<host::TextureStore> textures;
        host::Shader shader;
    };
    auto const owned =
        std::make_shared<Owned>(Owned{scene.textures, shaders.create(live.className())});
    owned->shader.object()->copy(live.object());
    return {host::printable(name), owned->shader, owned};
}

bool isBelow(std::filesystem::path const& file, std::filesystem::path const& folder)
{
    auto const [end, at] = std::mismatch(folder.begin(), folder.end(), file.begin(), file.end());
    return end == folder.end() && at != file.end();
}

} // namespace

void Studio::pick(PageId page, Json const& message)
{
    host::Scene const& scene = live_.scene();
    float const x = message.at("x"), y = message.at("y");
    Vec3f origin, direction;
    host::CameraRays(scene.camera, scene.film).ray(x + 0.5f, y + 0.5f, {0, 0}, origin, direction);
    Json told = {{"type", "picked"}, {"id", message.value("id", Json())}, {"material", nullptr}};
    host::RayScene const& rays = live_.session().prepared().rays();
    host::Hit hit;
    if (rays.intersect({origin, direction}, host::Visibility::All, hit)) {
        host::SurfacePoint const s = rays.surface(hit);
        host::Instance const& instance = scene.instances[s.instance];
        std::string const& name = scene.instanceNames[s.instance];
        if (instance.light >= 0)
            told["light"] = scene.lightNames[static_cast<std::size_t>(instance.light)];
        else
            told["material"] = scene.materialNames[static_cast<std::size_t>(instance.material)];
        told["object"] = name;
        told["instance"] = name.substr(0, name.find('/'));
        told["position"] = toJson(s.P);
        told["normal"] = toJson(s.N);
        told["distance"] = hit.t;
    }
    audience_->tell(page, told);
}

void Studio::inspect(PageId page, Json const& message)
{
    int const x = message.at("x"), y = message.at("y");
    host::Film const& film = preview_.film();
    if (x < 0 || y < 0 || x >= film.frameWidth() || y >= film.frameHeight())
        throw host::InputError("inspect: the pixel lies outside of the picture");
    host::Film pixel(film.frameWidth(), film.frameHeight(), {x, y, x + 1, y + 1}, film.layers());
    pixel.add(film);
    host::Picture const picture = pixel.picture();
    Json layers = Json::object();
    for (host::Layer const& layer : picture.layers) {
        Json values = Json::array();
        for (float const v : layer.values)
            values.push_back(number(v));
        layers[layer.name] = values;
    }
    std::vector<float> rgb(picture.rgba().begin(), picture.rgba().begin() + 3);
    host::screenTransform(host::screenView(live_.scene().film))(rgb);
    Json shown = Json::array();
    for (float const v : rgb)
        shown.push_back(std::lround(255.0f * std::clamp(v, 0.0f, 1.0f)));
    audience_->tell(page,
                    {{"type", "values"},
                     {"id", message.value("id", Json())},
                     {"x", x},
                     {"y", y},
                     {"layers", layers},
                     {"shown", shown},
                     {"samples", film.count(x, y, 0)}});
}

Studio::Slot Studio::now() const
{
    return {document_.json(), preview_.picture().rgba(), preview_.shown("beauty")};
}

void Studio::keep(std::string const& slot)
{
    slots_[slot] = now();
    audience_->tell(kAllPages, {{"type", "kept"}, {"slot", slot}, {"samples", preview_.samples()}});
}

void Studio::compare(PageId page, Json const& message)
{
    if (slots_.empty())
        throw host::InputError("compare: nothing was kept");
    bool const both = slots_.size() == 2;
    Slot const& a = slots_.begin()->second;
    Slot const b = both ? slots_.rbegin()->second : now();
    if (a.shown.width != b.shown.width || a.shown.height != b.shown.height)
        throw host::InputError(fmt::format("compare: the pictures have different sizes, {}x{} and "
                                           "{}x{}",
                                           a.shown.width, a.shown.height, b.shown.width,
                                           b.shown.height));
    LinearDifference const linear = linearDifference(a.rgba, b.rgba);
    std::vector<float> const flip = flipDifference(a.shown, b.shown);
    double sum = 0;
    for (float const v : flip)
        sum += static_cast<double>(v);
    audience_->tell(page,
                    {{"type", "comparison"},
                     {"id", message.value("id", Json())},
                     {"rmse", linear.rmse},
                     {"flip", sum / static_cast<double>(flip.size())},
                     {"max", linear.largest}});
    ShownPicture const difference = heatPicture(flip, a.shown.width, a.shown.height);
    int kind = 2;
    for (ShownPicture const* picture : {&a.shown, &b.shown, &difference})
        audience_->send(page, makePngBand(*picture, preview_.generation(), kind++));
}

void Studio::ask(std::string name, Query query, std::function<void(Reply)> answer)
{
    post(
        [this, name = std::move(name), query = std::move(query), answer = std::move(answer)] {
            try {
                if (name == "thumbnail" || name == "lab") { // take long: not on this thread
                    std::erase_if(answers_, [](std::future<void> const& f) {
                        return f.wait_for(std::chrono::seconds(0)) == std::future_status::ready;
                    });
                    auto make = name == "lab" ? measurement(query) : thumbnail(query);
                    answers_.push_back(
                        std::async(std::launch::async, [make = std::move(make), answer] {
                            try {
                                answer(make());
                            } catch (std::exception const& error) {
                                answer({404, "text/plain", error.what() + std::string("\n")});
                            }
                        }));
                } else {
                    answer(this->answer(name, query));
                }
            } catch (std::exception const& error) {
                answer({404, "text/plain", error.what() + std::string("\n")});
            }
        },
        false);
}

Reply Studio::answer(std::string const& name, Query const& query)
{
    auto const value = [&](char const* key) { return valueOf(query, key); };
    std::string const stem = file_.stem().string();
    if (name == "scene.json")
        return {200, "application/json", sceneText(document_.json()), stem + ".json"};
    if (name == "class")
        return {200, "application/json", classJson(value("name")).dump(2) + '\n'};
    std::string const layer = value("layer").empty() ? "beauty" : value("layer");
    if (name == "picture.png")
        return {200, "image/png", pngOf(preview_.shown(layer)), stem + ".png"};
    if (name == "picture.exr") {
        host::Picture picture = preview_.picture();
        if (layer != "beauty")
            std::erase_if(picture.layers,
                          [&](host::Layer const& l) { return !l.name.starts_with(layer); });
        if (picture.layers.empty())
            throw host::InputError(host::printable(layer) + ": the picture has no such layer");
        std::vector<unsigned char> const bytes =
            host::encodePicture(name, picture, host::screenView(live_.scene().film));
        return {200, "image/x-exr", {bytes.begin(), bytes.end()}, stem + ".exr"};
    }
    std::size_t frame = 0;
    if (name.starts_with("turntable/")
        && std::from_chars(name.data() + 10, name.data() + name.size(), frame).ec == std::errc()
        && frame < turntablePictures_.size())
        return {200, "image/png", turntablePictures_[frame],
                fmt::format("{}-{:03}.png", stem, frame)};
    throw host::InputError(host::printable(name) + ": there is no such file");
}

/// What pages may read: files that the scene names, and those in its folder.
std::filesystem::path Studio::fileForPages(std::string const& file) const
{
    std::set<std::string> named;
    filesOf(document_.json(), named);
    std::filesystem::path const folder = std::filesystem::absolute(file_).parent_path();
    std::filesystem::path path = std::filesystem::weakly_canonical(folder / file);
    if (!named.contains(file) && !isBelow(path, std::filesystem::weakly_canonical(folder)))
        throw host::InputError(host::printable(file)
                               + ": expected a file that the scene names or that is in its folder");
    return path;
}

std::function<Reply()> Studio::thumbnail(Query const& query) const
{
    std::string const file = valueOf(query, "file"), side = valueOf(query, "size");
    if (file.empty())
        throw host::InputError("thumbnail: which file?");
    int size = 96;
    std::from_chars(side.data(), side.data() + side.size(), size);
    std::string const image = valueOf(query, "image");
    return [path = fileForPages(file), image, size = std::clamp(size, 16, 512)]() -> Reply {
        return {200, "image/png", pngOf(thumbnailOf(sourceOf(path, image), size))};
    };
}

/// Of materials of the scene as they are now (`material`), or of classes (`class`, with parameters
/// behind), and of measured tables (`merl`, files), overlaid.
std::function<Reply()> Studio::measurement(Query const& query) const
{
    std::vector<lab::Specimen> specimens;
    std::vector<std::string> words;
    std::vector<std::filesystem::path> tables;
    for (auto const& [key, value] : query) {
        if (key == "material") {
            specimens.push_back(specimenOf(live_.scene(), value, shaders_));
        } else if (key == "merl") {
            tables.push_back(fileForPages(value));
        } else if (key == "class") {
            if (!shaders_.has(value))
                throw host::InputError("lab: unknown class " + host::printable(value));
            words.push_back(value);
        } else if (key != "token") {
            words.push_back(fmt::format("{}={}", key, value));
        }
    }
    for (lab::Specimen& specimen : lab::specimensOf(words, shaders_))
        specimens.push_back(std::move(specimen));
    if (specimens.empty() && tables.empty())
        throw host::InputError("lab: expected a material or a class");
    return [this, specimens = std::move(specimens), tables = std::move(tables)]() mutable -> Reply {
        for (std::filesystem::path const& table : tables) // 33 MB each: not on the studio's thread
            specimens.push_back(lab::measuredSpecimen(table));
        lab::LabOptions options = lab::quickOptions();
        options.threads = 1; // the picture goes on beside
        options.cancel = &stopAnswers_;
        return {200, "application/json", lab::labJson(specimens, options)};
    };
}

} // namespace zsi::view
