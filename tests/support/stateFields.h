// SPDX-License-Identifier: Apache-2.0
/// Fields of the shading record by name, as lists of numbers.
#pragma once

#include <cstdint>
#include <cstring>
#include <string>
#include <type_traits>
#include <vector>
#include <zsi/zsi.h>

namespace zsi::test {

// clang-format off
#define ZSI_STATE_FIELDS(X) \
    X(E) X(I) X(P) X(N) X(Ng) X(Pref) X(Nref) X(rasterX) X(rasterY) X(imageHeight) \
    X(incomingIor) X(beyondIor) X(objectToWorld) X(rayType) X(rayDepth) X(maxRayDepth) X(Ci) \
    X(transmissionColor) X(sampleDirection) X(outBrdf) X(sampleCosine) X(sampleInvPdf) \
    X(sampleType) X(allowReflection) X(allowTransmission) X(lightPosition) X(lightAxis) \
    X(lightToPoint) X(lightDistance) X(lightColor) X(lightShadow) X(discardHit)
// clang-format on

/// Calls `visit` with each number of the field, as what it is; false when the record has no such
/// field.
template <class Visit>
bool forStateField(ShadeState& state, std::string const& name, Visit const& visit)
{
    auto const each = [&](auto& field) {
        using Element = std::remove_all_extents_t<std::remove_reference_t<decltype(field)>>;
        using Number = std::conditional_t<std::is_integral_v<Element>, Element, float>;
        for (std::size_t i = 0; i < sizeof field / sizeof(Number); ++i)
            visit(i, reinterpret_cast<Number*>(&field)[i]);
        return true;
    };
#define ZSI_FIELD(field) (name == #field && each(state.field)) ||
    return ZSI_STATE_FIELDS(ZSI_FIELD) false;
#undef ZSI_FIELD
}

inline bool writeState(ShadeState& state, std::string const& name, std::vector<float> const& v)
{
    return forStateField(state, name, [&](std::size_t i, auto& number) {
        if (i < v.size())
            number = static_cast<std::remove_reference_t<decltype(number)>>(v[i]);
    });
}

/// Empty when the record has no such field.
inline std::vector<float> readState(ShadeState state, std::string const& name)
{
    std::vector<float> v;
    forStateField(state, name,
                  [&](std::size_t, auto& number) { v.push_back(static_cast<float>(number)); });
    return v;
}

} // namespace zsi::test
