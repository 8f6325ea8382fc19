// SPDX-License-Identifier: Apache-2.0
/// Surfaces that a path goes through unbent.
#pragma once

#include <zsi/zsi.h>

namespace zsi {

/// The sample that goes straight on, with weight 1.
inline void sampleStraightThrough(ShadeState& state)
{
    state.sampleDirection = state.I;
    state.outBrdf = {1.0f, 1.0f, 1.0f};
    state.sampleCosine = 1.0f;
    state.sampleInvPdf = 1.0f;
    state.sampleType = kSampleStraight;
}

} // namespace zsi
