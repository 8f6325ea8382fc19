// SPDX-License-Identifier: Apache-2.0
/// Light by the way on which it came.
#pragma once

#include <zsi/vecmath.h>

namespace zsi::host {

/// What of a ray's light came straight from the environment or from surfaces that give it off, and
/// what was sent on by one surface. What remains was sent on by several.
struct LightParts {
    Vec3f environment{0, 0, 0}, emission{0, 0, 0}, direct{0, 0, 0};

    Vec3f straight() const { return environment + emission; }
    Vec3f sum() const { return straight() + direct; }
    LightParts operator*(Vec3f f) const { return {environment * f, emission * f, direct * f}; }
    void add(LightParts const& p)
    {
        environment += p.environment;
        emission += p.emission;
        direct += p.direct;
    }
};

} // namespace zsi::host
