// SPDX-License-Identifier: Apache-2.0
#include "integrate/shadeIntegrator.h"

namespace zsi::host {

Vec4f ShadeIntegrator::radiance(PathRay ray)
{
    for (;;) {
        SurfacePoint surface;
        Vec4f seen;
        if (!context_.intersect(ray, surface, seen))
            return seen;
        if (context_.shade(ray, surface, seen))
            return seen;
        ShadingContext::passIgnored(ray, surface);
    }
}

} // namespace zsi::host
