// SPDX-License-Identifier: Apache-2.0
#include "model/gltfLights.h"

#include "model/gltfTexture.h"
#include "json/jsonText.h"

#include <cmath>
#include <fmt/format.h>

namespace zsi::host {
namespace {

constexpr float kPi = 3.14159265f;
constexpr float kDegrees = 180.0f / kPi; ///< of a radian

/// Lights and cameras look along -z of their node, which is y once it is turned.
Vec3f aheadOf(JsonReader const& node, Matrix const& toWorld)
{
    Vec3f const ahead = toWorld.direction({0, 1, 0});
    if (!(length(ahead) > 0.0f) || !std::isfinite(length(ahead)))
        node.fail("has no direction: it is flattened");
    return normalize(ahead);
}

float degrees(JsonReader const& spot, char const* key, float otherwise)
{
    auto const angle = spot.find(key);
    return clamp(angle ? angle->toFloat() : otherwise, 0.0f, kPi / 2) * 2 * kDegrees;
}

} // namespace

JsonValue gltfLight(GltfFile const& file, GltfNode const& node, LeftOut& leftOut)
{
    JsonReader const place = file.element("nodes", node.index);
    auto const index = findPath(place, {"extensions", "KHR_lights_punctual", "light"});
    if (!index)
        return {};
    auto const lights = findPath(file.root(), {"extensions", "KHR_lights_punctual", "lights"});
    std::size_t const count = lights ? lights->items().size() : 0;
    std::uint32_t const i = index->toUint32();
    if (i >= count)
        index->fail(fmt::format("there is no light {}; the file has {}", i, count));
    JsonReader const light = lights->items()[i];

    auto const color = light.find("color"), intensity = light.find("intensity");
    // Candela or lux; a colour here is irradiance over pi.
    Vec3f const shown = (color ? color->toVec3f() : Vec3f(1, 1, 1))
        * ((intensity ? intensity->toFloat(0) : 1.0f) / kPi);
    if (light.find("range"))
        leftOut.add(
            "the range of lights is left out; they fall off with the square of the distance");
    Matrix const toWorld = turnedUp(node.toWorld);
    JsonValue const position = jsonOf(toWorld.point({0, 0, 0}));
    switch (light.at("type").toChoice({"point", "spot", "directional"})) {
    case 0:
        return jsonObject(
            {{"kind", jsonOf("point")}, {"position", position}, {"color", jsonShort(shown)}});
    case 1: {
        JsonReader const spot = light.at("spot");
        float const outer = degrees(spot, "outerConeAngle", kPi / 4);
        float const inner = minOf(degrees(spot, "innerConeAngle", 0), outer);
        return jsonObject({{"kind", jsonOf("spot")},
                           {"position", position},
                           {"axis", jsonOf(aheadOf(place, toWorld))},
                           {"angle", jsonShort(outer)},
                           {"innerAngle", jsonShort(inner)},
                           {"color", jsonShort(shown)}});
    }
    default:
        return jsonObject({{"kind", jsonOf("sun")},
                           {"direction", jsonOf(aheadOf(place, toWorld) * -1.0f)},
                           {"angle", jsonOf(0)},
                           {"color", jsonShort(shown)}});
    }
}

JsonValue gltfCamera(GltfFile const& file, GltfNode const& node, Vec3f centre, float& aspect,
                     LeftOut& leftOut)
{
    JsonReader const place = file.element("nodes", node.index);
    auto const index = place.find("camera");
    if (!index)
        return {};
    JsonReader const camera = file.element("cameras", *index);
    if (camera.at("type").toChoice({"perspective", "orthographic"}) == 1) {
        leftOut.add("orthographic cameras are left out", node.name);
        return {};
    }
    JsonReader const perspective = camera.at("perspective");
    Matrix const toWorld = turnedUp(node.toWorld);
    Vec3f const position = toWorld.point({0, 0, 0}), ahead = aheadOf(place, toWorld);
    float const distance = dot(centre - position, ahead);
    JsonReader const opening = perspective.at("yfov");
    float const fov = opening.toPositive() * kDegrees;
    if (!(fov < 180.0f))
        opening.failExpected("an angle below pi");
    if (auto const ratio = perspective.find("aspectRatio"))
        aspect = ratio->toPositive();
    return jsonObject({{"position", jsonOf(position)},
                       {"target", jsonOf(position + ahead * (distance > 0.0f ? distance : 1.0f))},
                       {"up", jsonOf(toWorld.direction({0, 0, 1}))},
                       {"fov", jsonShort(fov)}});
}

} // namespace zsi::host
