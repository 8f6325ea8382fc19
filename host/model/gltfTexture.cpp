// SPDX-License-Identifier: Apache-2.0
#include "model/gltfTexture.h"

#include "json/jsonText.h"

#include <cmath>
#include <fmt/format.h>

namespace zsi::host {
namespace {

/// KHR_texture_transform scales, turns and shifts coordinates whose v runs downwards; a turn is
/// counterclockwise to the eye. Here v runs upwards, so it happens between two flips.
Mat3f upwards(Vec2f offset, float rotation, Vec2f scale)
{
    float const c = std::cos(rotation), s = std::sin(rotation);
    // u' = a u + b v + e, v' = d u + g v + f, downwards
    float const a = c * scale.x, b = s * scale.y, d = -s * scale.x, g = c * scale.y;
    // with v = 1 - w and v' = 1 - w'
    return {a, -d, 0, -b, g, 0, b + offset.x, 1 - g - offset.y, 1};
}

Vec2f pairOf(JsonReader const& object, char const* key, float otherwise)
{
    auto const given = object.find(key);
    if (!given)
        return {otherwise, otherwise};
    std::vector<float> const v = given->toFloats(2);
    return {v[0], v[1]};
}

JsonValue wrapOf(JsonReader const& sampler)
{
    auto const mode = [&](char const* key) -> std::string {
        auto const given = sampler.find(key);
        switch (given ? given->toInt(0, 1 << 20) : 10497) {
        case 10497:
            return "repeat";
        case 33071:
            return "clamp";
        case 33648:
            return "mirror";
        default:
            given->failExpected("10497, 33071 or 33648");
        }
    };
    std::string const u = mode("wrapS"), v = mode("wrapT");
    if (u == v)
        return u == "repeat" ? JsonValue() : jsonOf(u);
    return jsonArray({jsonOf(u), jsonOf(v)});
}

int setOf(JsonReader const& object, int otherwise)
{
    auto const set = object.find("texCoord");
    return set ? set->toInt(0, 255) : otherwise;
}

} // namespace

std::optional<JsonReader> findPath(JsonReader const& reader,
                                   std::initializer_list<char const*> keys)
{
    std::optional<JsonReader> at = reader;
    for (char const* const key : keys)
        if (at)
            at = at->find(key);
    return at;
}

GltfTexture gltfTexture(GltfFile const& file, JsonReader const& info)
{
    JsonReader const texture = file.element("textures", info.at("index"));
    auto source = texture.find("source");
    if (auto const webp = findPath(texture, {"extensions", "EXT_texture_webp", "source"}))
        source = webp;
    if (!source)
        texture.fail("has no \"source\" that is known here");
    GltfTexture result;
    result.image = file.indexOf("images", *source);
    result.set = setOf(info, 0);
    if (auto const transform = findPath(info, {"extensions", "KHR_texture_transform"})) {
        auto const rotation = transform->find("rotation");
        result.transform =
            upwards(pairOf(*transform, "offset", 0), rotation ? rotation->toFloat() : 0.0f,
                    pairOf(*transform, "scale", 1));
        result.isTransformed = true;
        result.set = setOf(*transform, result.set);
    }
    if (auto const sampler = texture.find("sampler"))
        result.wrap = wrapOf(file.element("samplers", *sampler));
    return result;
}

std::vector<JsonReader> picturesOf(JsonReader const& material)
{
    std::vector<JsonReader> found;
    auto const look = [&](JsonReader const& object) {
        for (auto const& [key, value] : object.members())
            if (key.ends_with("Texture") && key != "occlusionTexture" && value.isObject())
                found.push_back(value);
    };
    if (auto const pbr = material.find("pbrMetallicRoughness"))
        look(*pbr);
    look(material);
    if (auto const extensions = material.find("extensions"))
        for (auto const& [name, extension] : extensions->members())
            if (extension.isObject())
                look(extension);
    return found;
}

UvSets uvSetsOf(GltfFile const& file, JsonReader const& primitive)
{
    UvSets sets;
    auto const index = primitive.find("material");
    if (!index)
        return sets;
    JsonReader const material = file.element("materials", *index);
    if (std::vector<JsonReader> const pictures = picturesOf(material); !pictures.empty())
        sets.uv = sets.uv1 = gltfTexture(file, pictures.front()).set;
    if (auto const occlusion = material.find("occlusionTexture")) {
        GltfTexture const texture = gltfTexture(file, *occlusion);
        sets.uv1 = texture.set;
        sets.uv1Transform = texture.transform;
    }
    return sets;
}

} // namespace zsi::host
