// SPDX-License-Identifier: Apache-2.0
/// What the headers of the Ward variants start from: the order of their rows, and the nodes.
///
/// A variant is `corvid_Mtl_Ward` with a network of nodes in some of its channels. Its header lists
/// the rows, those of the network among them; its source says what feeds what.
#pragma once

#include "materials/ward/bitmapNode.h"
#include "materials/ward/noiseNode.h"
#include "materials/ward/tileNode.h"
#include "materials/ward/wardMaterial.h"

namespace zsi {

#define WARD_VARIANT_FRONT(P, U, A) \
    TANGENT_ATTRIBUTES(P, U, A)     \
    WARD_CHANNELS(P, U, A)
#define WARD_VARIANT_BACK(P, U, A) \
    AMBIENT_OCCLUSION(P, U, A)     \
    MASKING(P, U, A)

} // namespace zsi
