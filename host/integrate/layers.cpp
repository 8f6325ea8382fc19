// SPDX-License-Identifier: Apache-2.0
#include "integrate/layers.h"

#include "base/error.h"
#include "base/names.h"

#include <algorithm>

namespace zsi::host {
namespace {

using Value = LayerFormat::Value;

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
    // A new layer is an entry here; what it needs to know of a sample goes into CameraSample.
    static std::vector<LayerKind> const kinds{
        {{"beauty", {"R", "G", "B", "A"}, Value::Mean},
         "what the camera sees, linear, with alpha",
         [](CameraSample const& s, float* values) {
             put(rgb(s.color), values);
             values[3] = s.color.w;
             return true;
         }},
        {{"normal", {"X", "Y", "Z"}, Value::Mean},
         "interpolated normal of the first surface, world space",
         [](CameraSample const& s, float* values) {
             return s.surface && put(s.surface->N, values);
         }},
        {{"position", {"X", "Y", "Z"}, Value::Mean},
         "point of the first surface, world space, scene units",
         [](CameraSample const& s, float* values) {
             return s.surface && put(s.surface->P, values);
         }},
        {{"depth", {"Z"}, Value::Mean},
         "distance of the first surface from the camera, scene units",
         [](CameraSample const& s, float* values) {
             values[0] = s.distance;
             return s.surface != nullptr;
         }},
        {{"samples", {"count"}, Value::Count}, "number of samples of the pixel", nullptr},
    };
    return kinds;
}

std::vector<std::string> layerNames()
{
    std::vector<std::string> names;
    for (LayerKind const& kind : layerKinds())
        if (&kind != &layerKinds().front())
            names.push_back(kind.format.name);
    return names;
}

std::vector<LayerKind> chooseLayers(std::vector<std::string> const& names)
{
    std::vector<std::string> const known = layerNames();
    for (std::string const& name : names)
        if (std::find(known.begin(), known.end(), name) == known.end())
            throw InputError(printable(name) + ": unknown layer" + suggestion(name, known));
    std::vector<LayerKind> chosen;
    for (LayerKind const& kind : layerKinds())
        if (chosen.empty()
            || std::find(names.begin(), names.end(), kind.format.name) != names.end())
            chosen.push_back(kind);
    return chosen;
}

} // namespace zsi::host
