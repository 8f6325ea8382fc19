// SPDX-License-Identifier: Apache-2.0
#include "integrate/integrator.h"

namespace zsi::host {

CameraSample Integrator::sample(Vec3f origin, Vec3f direction, float rasterX, float rasterY,
                                Sampler& sampler, SampleWants wants)
{
    context_.start(sampler, rasterX, rasterY, wants.parts);
    PathRay ray;
    ray.E = ray.origin = origin;
    ray.direction = direction;
    ray.cone = context_.cameraCone();
    std::uint64_t const before = context_.nonFinite();
    Vec4f const color = radiance(ray);
    bool const finite = isFinite(rgb(color)) && std::isfinite(color.w);
    if (!finite && context_.nonFinite() == before)
        context_.countNonFinite();
    FirstHit const* const first = context_.firstHit();
    CameraSample sample{color, finite, first ? &first->surface : nullptr,
                        first ? first->distance : 0.0f};
    if (wants.parts)
        sample.parts = context_.parts();
    if (wants.feature)
        sample.feature = findFeature(context_, ray, sampler);
    return sample;
}

} // namespace zsi::host
