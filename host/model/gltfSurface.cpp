// SPDX-License-Identifier: Apache-2.0
#include "model/gltfSurface.h"

#include "base/names.h"

#include <algorithm>
#include <fmt/format.h>

namespace zsi::host {
namespace {

/// Reads parts of one material.
class Reader {
public:
    Reader(GltfFile const& file, JsonReader const& material)
        : file_(file)
        , material_(material)
    {
    }

    std::optional<JsonReader> extension(char const* name) const
    {
        return findPath(material_, {"extensions", name});
    }
    std::optional<JsonReader> metallicRoughness() const
    {
        return material_.find("pbrMetallicRoughness");
    }
    std::optional<JsonReader> material() const { return material_; }

    void number(std::optional<JsonReader> const& object, char const* key, float& into) const
    {
        if (auto const v = object ? object->find(key) : std::nullopt)
            into = v->toFloat();
    }
    void share(std::optional<JsonReader> const& object, char const* key, float& into) const
    {
        number(object, key, into);
        into = clamp01(into);
    }
    void color(std::optional<JsonReader> const& object, char const* key, Vec3f& into) const
    {
        auto const v = object ? object->find(key) : std::nullopt;
        if (!v)
            return;
        Vec3f const c = v->toVec3f();
        into = {maxOf(c.x, 0.0f), maxOf(c.y, 0.0f), maxOf(c.z, 0.0f)};
    }
    void texture(std::optional<JsonReader> const& object, char const* key,
                 std::optional<GltfTexture>& into) const
    {
        if (auto const v = object ? object->find(key) : std::nullopt)
            into = gltfTexture(file_, *v);
    }

private:
    GltfFile const& file_;
    JsonReader const& material_;
};

void readBase(Reader const& read, GltfSurface& s)
{
    auto const pbr = read.metallicRoughness();
    if (auto const color = pbr ? pbr->find("baseColorFactor") : std::nullopt) {
        std::vector<float> const c = color->toFloats(4);
        s.base.factor = {clamp01(c[0]), clamp01(c[1]), clamp01(c[2])};
        s.alpha.factor = clamp01(c[3]);
    }
    read.texture(pbr, "baseColorTexture", s.base.texture);
    s.alpha.texture = s.base.texture;
    read.share(pbr, "metallicFactor", s.metallic.factor);
    read.share(pbr, "roughnessFactor", s.roughness.factor);
    read.texture(pbr, "metallicRoughnessTexture", s.metallic.texture);
    s.roughness.texture = s.metallic.texture;
}

void readCommon(Reader const& read, GltfSurface& s)
{
    auto const material = read.material();
    if (auto const mode = material->find("alphaMode"))
        s.alphaMode = static_cast<AlphaMode>(mode->toChoice({"OPAQUE", "MASK", "BLEND"}));
    read.number(material, "alphaCutoff", s.alphaCutoff);
    s.alphaCutoff = maxOf(s.alphaCutoff, 0.0f);
    read.color(material, "emissiveFactor", s.emission.factor);
    read.texture(material, "emissiveTexture", s.emission.texture);
    float strength = 1;
    read.number(read.extension("KHR_materials_emissive_strength"), "emissiveStrength", strength);
    s.emission.factor = s.emission.factor * maxOf(strength, 0.0f);
    read.texture(material, "normalTexture", s.normal);
    read.number(material->find("normalTexture"), "scale", s.normalScale);
    read.texture(material, "occlusionTexture", s.occlusion.texture);
    read.share(material->find("occlusionTexture"), "strength", s.occlusion.factor);
    s.unlit = read.extension("KHR_materials_unlit").has_value();
}

void readLayers(Reader const& read, GltfSurface& s)
{
    read.number(read.extension("KHR_materials_ior"), "ior", s.ior);
    auto const specular = read.extension("KHR_materials_specular");
    read.share(specular, "specularFactor", s.specular.factor);
    read.texture(specular, "specularTexture", s.specular.texture);
    read.color(specular, "specularColorFactor", s.specularColor.factor);
    read.texture(specular, "specularColorTexture", s.specularColor.texture);
    auto const coat = read.extension("KHR_materials_clearcoat");
    read.share(coat, "clearcoatFactor", s.coat.factor);
    read.texture(coat, "clearcoatTexture", s.coat.texture);
    read.share(coat, "clearcoatRoughnessFactor", s.coatRoughness.factor);
    read.texture(coat, "clearcoatRoughnessTexture", s.coatRoughness.texture);
    auto const transmission = read.extension("KHR_materials_transmission");
    read.share(transmission, "transmissionFactor", s.transmission.factor);
    read.texture(transmission, "transmissionTexture", s.transmission.texture);
    auto const volume = read.extension("KHR_materials_volume");
    float thickness = 0;
    read.number(volume, "thicknessFactor", thickness);
    s.hasVolume = thickness > 0.0f;
    read.number(volume, "attenuationDistance", s.attenuationDistance);
    read.color(volume, "attenuationColor", s.attenuationColor);
    auto const anisotropy = read.extension("KHR_materials_anisotropy");
    read.share(anisotropy, "anisotropyStrength", s.anisotropy.factor);
    read.number(anisotropy, "anisotropyRotation", s.anisotropyRotation);
    read.texture(anisotropy, "anisotropyTexture", s.anisotropy.texture);
}

void tellLeftOut(Reader const& read, JsonReader const& material, GltfSurface const& s,
                 LeftOut& leftOut)
{
    static constexpr std::pair<char const*, char const*> kExtensions[] = {
        {"KHR_materials_sheen", "sheen has no counterpart and is left out"},
        {"KHR_materials_iridescence", "iridescence has no counterpart and is left out"},
        {"KHR_materials_dispersion", "dispersion has no counterpart and is left out"},
        {"KHR_materials_pbrSpecularGlossiness",
         "specular-glossiness values are left out; the metallic-roughness ones are taken"},
    };
    for (auto const& [name, what] : kExtensions)
        if (read.extension(name))
            leftOut.add(what, s.name);
    if (auto const coat = read.extension("KHR_materials_clearcoat"))
        if (coat->find("clearcoatNormalTexture"))
            leftOut.add("normal pictures of a clear coat are left out", s.name);
    std::vector<JsonReader> const pictures = picturesOf(material);
    for (JsonReader const& picture : pictures)
        if (auto const set = picture.find("texCoord"), first = pictures.front().find("texCoord");
            (set ? set->value().number : 0) != (first ? first->value().number : 0))
            leftOut.add("pictures of a material share one set of texture coordinates, that of its "
                        "first",
                        s.name);
}

} // namespace

float GltfSurface::headOn() const
{
    if (ior == 0.0f) // for materials converted from others: as much as `specular` says
        return 1.0f;
    float const n = maxOf(ior, 1.0f), r = (n - 1.0f) / (n + 1.0f);
    return r * r;
}

GltfSurface gltfSurface(GltfFile const& file, std::optional<std::size_t> index, LeftOut& leftOut)
{
    GltfSurface surface;
    if (!index)
        return surface;
    JsonReader const material = file.element("materials", *index);
    auto const name = material.find("name");
    surface.name =
        name && !name->toString().empty() ? name->toString() : fmt::format("materials[{}]", *index);
    Reader const read(file, material);
    readBase(read, surface);
    readCommon(read, surface);
    readLayers(read, surface);
    tellLeftOut(read, material, surface, leftOut);
    return surface;
}

} // namespace zsi::host
