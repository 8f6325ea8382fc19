// SPDX-License-Identifier: Apache-2.0
#include "integrate/layers.h"

#include "base/error.h"
#include "base/names.h"

#include <algorithm>

namespace zsi::host {
namespace {

using Value = LayerFormat::Value;

constexpr char const* kHalves = "halves";
constexpr SampleWants kNothing{}, kParts{true, false}, kFeatures{false, true};

bool put(Vec3f v, float* values)
{
    values[0] = v.x;
    values[1] = v.y;
    values[2] = v.z;
    return true;
}

} // namespace

std::vector<LayerKind> const& layerKinds()
{
    std::vector<std::string> const rgbNames{"R", "G", "B"}, xyz{"X", "Y", "Z"};
    // A new layer is an entry here; what it needs to know of a sample goes into CameraSample.
    static std::vector<LayerKind> const kinds{
        {{"beauty", {"R", "G", "B", "A"}, Value::Mean, "beauty"},
         "what the camera sees, linear, with alpha",
         kNothing,
         [](CameraSample const& s, float* values) {
             put(rgb(s.color), values);
             values[3] = s.color.w;
             return true;
         }},
        {{"direct", rgbNames},
         "light that one surface has sent on to the camera",
         kParts,
         [](CameraSample const& s, float* values) { return put(s.parts.direct, values); }},
        {{"indirect", rgbNames},
         "light that several surfaces have sent on",
         kParts,
         [](CameraSample const& s, float* values) { return put(s.indirect(), values); }},
        {{"emission", rgbNames},
         "what surfaces in view give off themselves",
         kParts,
         [](CameraSample const& s, float* values) { return put(s.parts.emission, values); }},
        {{"environment", rgbNames},
         "the environment where nothing bends the view of it",
         kParts,
         [](CameraSample const& s, float* values) { return put(s.parts.environment, values); }},
        {{"albedo", rgbNames, Value::Mean, "albedo"},
         "what the first rough surface, also behind glass and in mirrors, shows under light of 1 "
         "from everywhere",
         kFeatures,
         [](CameraSample const& s, float* values) { return put(s.feature.albedo, values); }},
        {{"denoiseNormal", xyz, Value::Mean, "normal"},
         "interpolated normal of that surface, world space",
         kFeatures,
         [](CameraSample const& s, float* values) { return put(s.feature.normal, values); }},
        {{"denoiseDepth", {"Z"}, Value::Mean, "depth"},
         "length of the way to that surface, scene units",
         kFeatures,
         [](CameraSample const& s, float* values) {
             values[0] = s.feature.depth;
             return true;
         }},
        {{"normal", xyz},
         "interpolated normal of the first surface, world space",
         kNothing,
         [](CameraSample const& s, float* values) {
             return s.surface && put(s.surface->N, values);
         }},
        {{"position", xyz},
         "point of the first surface, world space, scene units",
         kNothing,
         [](CameraSample const& s, float* values) {
             return s.surface && put(s.surface->P, values);
         }},
        {{"depth", {"Z"}},
         "distance of the first surface from the camera, scene units",
         kNothing,
         [](CameraSample const& s, float* values) {
             values[0] = s.distance;
             return s.surface != nullptr;
         }},
        {{"shaderId", {}, Value::Ids},
         "names of the materials that a pixel shows, with their shares (Cryptomatte)",
         kNothing,
         [](CameraSample const& s, float* values) {
             values[0] = s.shaderId;
             return s.surface != nullptr;
         }},
        {{"objectId", {}, Value::Ids},
         "names of the instances that a pixel shows, with their shares (Cryptomatte)",
         kNothing,
         [](CameraSample const& s, float* values) {
             values[0] = s.objectId;
             return s.surface != nullptr;
         }},
        {{"variance", rgbNames, Value::Variance},
         "variance of the beauty, as if its samples were independent",
         kNothing,
         [](CameraSample const& s, float* values) {
             return put(rgb(s.color) * rgb(s.color), values);
         }},
        {{"samples", {"count"}, Value::Count}, "number of samples of the pixel", kNothing, nullptr},
    };
    return kinds;
}

std::vector<std::string> layerNames()
{
    std::vector<std::string> names;
    for (LayerKind const& kind : layerKinds())
        if (&kind != &layerKinds().front())
            names.push_back(kind.format.name);
    names.push_back(kHalves);
    return names;
}

std::vector<LayerFormat> chooseLayers(std::vector<std::string> const& names, bool halved)
{
    std::vector<std::string> const known = layerNames();
    for (std::string const& name : names)
        if (std::find(known.begin(), known.end(), name) == known.end())
            throw InputError(printable(name) + ": unknown layer" + suggestion(name, known));
    auto const wanted = [&](std::string const& name) {
        return std::find(names.begin(), names.end(), name) != names.end();
    };
    std::vector<LayerFormat> chosen;
    for (LayerKind const& kind : layerKinds()) {
        bool const isFirst = chosen.empty();
        bool const inHalves = !kind.format.half.empty() && wanted(kHalves);
        if (!isFirst && !inHalves && !wanted(kind.format.name))
            continue;
        chosen.push_back(kind.format);
        if (!inHalves && !(isFirst && halved))
            chosen.back().half.clear();
    }
    return chosen;
}

LayerKind const* kindOf(LayerFormat const& format)
{
    for (LayerKind const& kind : layerKinds())
        if (kind.format.name == format.name && kind.format.channels == format.channels
            && kind.format.value == format.value)
            return &kind;
    return nullptr;
}

} // namespace zsi::host
