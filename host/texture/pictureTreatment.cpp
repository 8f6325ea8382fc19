// SPDX-License-Identifier: Apache-2.0
#include "texture/pictureTreatment.h"

#include <cmath>
#include <fmt/format.h>
#include <fmt/ranges.h>
#include <zsi/vecmath.h>

namespace zsi::host {
namespace {

float onCurve(std::vector<float> const& curve, float x)
{
    float const at = clamp01(x) * static_cast<float>(curve.size() - 1);
    auto const i = static_cast<std::size_t>(at);
    float const next = curve[i + 1 < curve.size() ? i + 1 : i];
    return curve[i] + (next - curve[i]) * (at - static_cast<float>(i));
}

} // namespace

bool PictureTreatment::keepsValues() const
{
    return factor == std::array<float, 4>{1, 1, 1, 1} && power == 1 && curve.empty()
        && threshold < 0;
}

Vec4f PictureTreatment::applied(Vec4f texel) const
{
    std::array<float, 4> values{texel.x, texel.y, texel.z, texel.w};
    if (channel >= 0)
        values.fill(values[static_cast<std::size_t>(channel)]);
    for (std::size_t i = 0; i < values.size(); ++i) {
        float& v = values[i];
        v *= factor[i];
        if (power != 1)
            v = std::pow(maxOf(v, 0.0f), power);
        if (!curve.empty())
            v = onCurve(curve, v);
        if (threshold >= 0)
            v = v >= threshold ? 1.0f : 0.0f;
    }
    return {values[0], values[1], values[2], values[3]};
}

std::string PictureTreatment::key() const
{
    return fmt::format("{} {} {} {} {} {} {}", channel, fmt::join(factor, ","), power,
                       fmt::join(curve, ","), threshold, static_cast<int>(edges[0]),
                       static_cast<int>(edges[1]));
}

} // namespace zsi::host
