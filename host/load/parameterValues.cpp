// SPDX-License-Identifier: Apache-2.0
#include "load/parameterValues.h"

#include "base/error.h"
#include "load/transforms.h"
#include "model/gltfPictures.h"
#include "texture/textureStore.h"

#include <algorithm>
#include <fmt/format.h>
#include <zsi/vecmath.h>

namespace zsi::host {

namespace {

constexpr float kRadians = 0.0174532925f;

ColorSpace readColorSpace(JsonReader const& reader)
{
    if (auto const space = reader.find("colorSpace")) {
        constexpr ColorSpace kSpaces[] = {ColorSpace::Auto, ColorSpace::Linear, ColorSpace::Srgb};
        return kSpaces[space->toChoice({"auto", "linear", "srgb"})];
    }
    return ColorSpace::Auto;
}

/// `load` with the file's place in the scene before what it finds wrong.
template <class Load>
auto loaded(JsonReader const& file, Load&& load)
{
    try {
        return load(file.toFile());
    } catch (InputError const& error) {
        if (std::string_view(error.what()).starts_with(file.place()))
            throw;
        file.fail(error.what());
    }
}

template <class Load>
auto readTexture(JsonReader const& reader, Load&& load)
{
    if (!reader.isObject())
        reader.failExpected("{\"texture\": file, \"colorSpace\": ...}");
    reader.expectKeys({"texture", "colorSpace"});
    ColorSpace const space = readColorSpace(reader);
    return loaded(reader.at("texture"), [&](auto const& file) { return load(file, space); });
}

/// A picture of its own, or one in a model.
PictureSource sourceOf(JsonReader const& reader, std::filesystem::path const& file)
{
    auto const image = reader.find("image");
    if (!image)
        return {file};
    std::shared_ptr<GltfFile const> const model = GltfFile::open(file);
    return pictureSource(model, model->indexOf("images", *image));
}

std::array<EdgeMode, 2> readEdges(JsonReader const& reader)
{
    constexpr EdgeMode kModes[] = {EdgeMode::Repeat, EdgeMode::Clamp, EdgeMode::Mirror};
    auto const mode = [&](JsonReader const& one) {
        return kModes[one.toChoice({"repeat", "clamp", "mirror"})];
    };
    if (reader.kind() != JsonValue::Kind::Array)
        return {mode(reader), mode(reader)};
    std::vector<JsonReader> const both = reader.items();
    if (both.size() != 2)
        reader.failExpected("one mode, or two, along u and v");
    return {mode(both[0]), mode(both[1])};
}

HostTexture2D const* readTexture2D(JsonReader const& reader, TextureStore& textures);

Vec3f readKnot(JsonReader const& reader)
{
    return reader.kind() == JsonValue::Kind::Array ? reader.toVec3f() : grey(reader.toFloat());
}

PictureTreatment readTreatment(JsonReader const& reader, TextureStore& textures)
{
    PictureTreatment treatment;
    if (auto const v = reader.find("from"))
        treatment.fromNormals = v->toChoice({"values", "normals"}) == 1;
    if (auto const v = reader.find("channel"))
        treatment.channel = static_cast<int>(v->toChoice({"r", "g", "b", "a"}));
    if (auto const v = reader.find("factor")) {
        if (v->kind() == JsonValue::Kind::Array) {
            std::vector<float> const f = v->toFloats(v->value().items.size() == 3 ? 3 : 4);
            std::copy(f.begin(), f.end(), treatment.factor.begin());
        } else {
            treatment.factor.fill(v->toFloat());
        }
    }
    if (auto const v = reader.find("power"))
        treatment.power = v->toPositive();
    if (auto const v = reader.find("curve"))
        for (JsonReader const& knot : v->items())
            treatment.curve.push_back(readKnot(knot));
    if (auto const v = reader.find("threshold"))
        treatment.threshold = v->toFloat(0);
    if (auto const v = reader.find("weight"))
        treatment.weight = readTexture2D(*v, textures);
    if (auto const v = reader.find("ground"))
        treatment.ground = v->toFloat();
    if (auto const v = reader.find("wrap"))
        treatment.edges = readEdges(*v);
    return treatment;
}

HostTexture2D const* readTexture2D(JsonReader const& reader, TextureStore& textures)
{
    if (!reader.isObject())
        reader.failExpected("{\"texture\": file, \"colorSpace\": ...}");
    reader.expectKeys({"texture", "colorSpace", "image", "from", "channel", "factor", "power",
                       "curve", "threshold", "weight", "ground", "wrap"});
    ColorSpace const space = readColorSpace(reader);
    PictureTreatment const treatment = readTreatment(reader, textures);
    return loaded(reader.at("texture"), [&](auto const& file) {
        return textures.load2D(sourceOf(reader, file), space, treatment);
    });
}

HostTextureCube const* readCube(JsonReader const& reader, TextureStore& textures)
{
    if (!reader.isObject())
        reader.failExpected("{\"cube\": file, \"colorSpace\": ..., \"blur\": ...}");
    reader.expectKeys({"cube", "colorSpace", "blur", "irradiance"});
    ColorSpace const space = readColorSpace(reader);
    std::optional<JsonReader> const blur = reader.find("blur");
    std::optional<JsonReader> const irradiance = reader.find("irradiance");
    bool const convolved = irradiance && irradiance->toBool();
    if (convolved && blur)
        blur->fail("an irradiance picture has no other blur");
    float const halfAngle = blur ? blur->toFloat(0, 90) * kRadians : 0.0f;
    return loaded(reader.at("cube"), [&](auto const& file) {
        return convolved ? textures.loadIrradiance(file, space)
                         : textures.loadCube(file, space, halfAngle);
    });
}

} // namespace

ParameterValue readParameterValue(JsonReader const& reader, ParameterType type,
                                  TextureStore& textures)
{
    switch (type) {
    case ParameterType::Bool:
        return reader.toBool();
    case ParameterType::Int:
        return reader.toInt(std::numeric_limits<int>::min(), std::numeric_limits<int>::max());
    case ParameterType::Float:
        return reader.toFloat();
    case ParameterType::Vec2f: {
        std::vector<float> const v = reader.toFloats(2);
        return Vec2f(v[0], v[1]);
    }
    case ParameterType::Vec3f:
        return reader.toVec3f();
    case ParameterType::Vec4f: {
        std::vector<float> const v = reader.toFloats(4);
        return Vec4f(v[0], v[1], v[2], v[3]);
    }
    case ParameterType::Mat3f:
        return readTransform3(reader);
    case ParameterType::Mat4f:
        return readTransform(reader);
    case ParameterType::Texture1D:
        return readTexture(reader, [&](auto const& file, ColorSpace space) {
            return textures.load1D(file, space);
        });
    case ParameterType::Texture2D:
        return readTexture2D(reader, textures);
    case ParameterType::TextureCube:
        return readCube(reader, textures);
    }
    reader.fail("a parameter of unknown type");
}

HostTextureCube const* readPictureAround(JsonReader const& reader, float halfAngle,
                                         TextureStore& textures)
{
    ColorSpace const space = readColorSpace(reader);
    return loaded(reader.at("file"),
                  [&](auto const& file) { return textures.loadCube(file, space, halfAngle); });
}

} // namespace zsi::host
