// SPDX-License-Identifier: Apache-2.0
/// A glTF material as numbers and pictures, with the defaults of the format filled in.
#pragma once

#include "model/gltfTexture.h"
#include "model/leftOut.h"

#include <limits>

namespace zsi::host {

/// A number, times a channel of a picture.
struct GltfNumber {
    float factor = 0;
    int channel = 0; ///< of the picture: 0 red to 3 alpha
    std::optional<GltfTexture> texture = {};
};

struct GltfColor {
    Vec3f factor{1, 1, 1};
    std::optional<GltfTexture> texture = {};
};

enum class AlphaMode { Opaque, Mask, Blend };

struct GltfSurface {
    std::string name; ///< as messages call it
    GltfColor base;
    GltfNumber alpha{1, 3};
    AlphaMode alphaMode = AlphaMode::Opaque;
    float alphaCutoff = 0.5f;
    GltfNumber metallic{1, 2}, roughness{1, 1};
    GltfColor emission{{0, 0, 0}}; ///< with its strength
    std::optional<GltfTexture> normal;
    float normalScale = 1;
    GltfNumber occlusion{1, 0}; ///< the factor is its strength
    bool unlit = false;

    float ior = 1.5f;
    GltfNumber specular{1, 3};
    GltfColor specularColor;
    GltfNumber coat{0, 0}, coatRoughness{0, 1};
    GltfNumber transmission{0, 0};
    bool hasVolume = false;
    float attenuationDistance = std::numeric_limits<float>::infinity();
    Vec3f attenuationColor{1, 1, 1};
    GltfNumber anisotropy{0, 2};
    float anisotropyRotation = 0; ///< radians, from the tangent towards the bitangent

    float headOn() const; ///< reflectance of the dielectric at normal incidence, by its index
};

/// `index`: nothing is the format's default material.
GltfSurface gltfSurface(GltfFile const& file, std::optional<std::size_t> index, LeftOut& leftOut);

} // namespace zsi::host
