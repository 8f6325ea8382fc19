// SPDX-License-Identifier: Apache-2.0
#include "load/parameterValues.h"

#include "base/error.h"
#include "load/transforms.h"
#include "texture/textureStore.h"

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
        return readTexture(reader, [&](auto const& file, ColorSpace space) {
            return textures.load2D(file, space);
        });
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
