// SPDX-License-Identifier: Apache-2.0
#include "texture/pictureTreatment.h"

#include <cmath>
#include <fmt/format.h>
#include <fmt/ranges.h>
#include <zsi/vecmath.h>

namespace zsi::host {
namespace {

Vec3f onCurve(std::vector<Vec3f> const& curve, float x)
{
    float const at = clamp01(x) * static_cast<float>(curve.size() - 1);
    auto const i = static_cast<std::size_t>(at);
    return mix(curve[i], curve[i + 1 < curve.size() ? i + 1 : i], at - static_cast<float>(i));
}

} // namespace

bool PictureTreatment::keepsValues() const
{
    return !fromNormals && factor == std::array<float, 4>{1, 1, 1, 1} && power == 1 && curve.empty()
        && threshold < 0 && !weight;
}

Vec4f PictureTreatment::applied(Vec4f texel, Vec2f at) const
{
    std::array<float, 4> values{texel.x, texel.y, texel.z, texel.w};
    if (channel >= 0)
        values.fill(values[static_cast<std::size_t>(channel)]);
    for (std::size_t i = 0; i < values.size(); ++i) {
        values[i] *= factor[i];
        if (power != 1)
            values[i] = std::pow(maxOf(values[i], 0.0f), power);
    }
    if (!curve.empty())
        for (std::size_t i = 0; i < 3; ++i) {
            Vec3f const v = onCurve(curve, values[i]);
            values[i] = i == 0 ? v.x : i == 1 ? v.y : v.z;
        }
    if (threshold >= 0)
        for (float& v : values)
            v = v >= threshold ? 1.0f : 0.0f;
    if (weight) {
        Vec4f share;
        weight->lookup(&share, &at);
        for (std::size_t i = 0; i < 3; ++i)
            values[i] = ground + (values[i] - ground) * share.x;
    }
    return {values[0], values[1], values[2], values[3]};
}

std::string PictureTreatment::key() const
{
    std::string knots;
    for (Vec3f const& v : curve)
        knots += fmt::format("{},{},{};", v.x, v.y, v.z);
    return fmt::format("{} {} {} {} {} {} {} {} {} {}", fromNormals, channel,
                       fmt::join(factor, ","), power, knots, threshold, weight ? weightKey : "",
                       ground, static_cast<int>(edges[0]), static_cast<int>(edges[1]));
}

} // namespace zsi::host
