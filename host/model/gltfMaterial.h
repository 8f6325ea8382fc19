// SPDX-License-Identifier: Apache-2.0
/// glTF materials as shader classes.
#pragma once

#include "model/gltfPictures.h"
#include "model/gltfSurface.h"

namespace zsi::host {

/// A material of a scene, {"class": ..., "parameters": ...}, that is nearest to the surface. What
/// lets light through becomes corvid_Mtl_Dielectric or, without a volume, corvid_Mtl_Glazing; what
/// is metal corvid_Mtl_Metal, the rest corvid_Mtl_MetallicPaint without flakes; where these lack
/// what the surface has, corvid_Mtl_Ward.
JsonValue gltfMaterial(GltfSurface const& surface, GltfPictures& pictures, LeftOut& leftOut);

} // namespace zsi::host
