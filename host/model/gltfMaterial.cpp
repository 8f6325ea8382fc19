// SPDX-License-Identifier: Apache-2.0
#include "model/gltfMaterial.h"

#include "json/jsonText.h"

#include <algorithm>
#include <cmath>

namespace zsi::host {
namespace {

constexpr float kNarrowest = 0.001f; ///< width of a lobe
constexpr float kWidestCoat = 0.5f;
using Values = GltfPictures::Values;

/// Roughness is squared once, to the width of the facets' slopes (Burley 2012, "Physically-Based
/// Shading at Disney", section 5.4).
float widthOf(float roughness) { return maxOf(roughness * roughness, kNarrowest); }

bool isBlack(Vec3f c) { return c == Vec3f(0, 0, 0); }
bool isWhite(Vec3f c) { return c == Vec3f(1, 1, 1); }
float meanOf(Vec3f c) { return (c.x + c.y + c.z) / 3.0f; }

/// One material while it is made.
class Maker {
public:
    Maker(GltfSurface const& surface, GltfPictures& pictures, LeftOut& leftOut)
        : s_(surface)
        , pictures_(pictures)
        , leftOut_(leftOut)
    {
    }

    JsonValue made()
    {
        char const* const shader = chosen();
        occlude();
        mask(shader);
        return jsonObject(
            {{"class", jsonOf(shader)}, {"parameters", jsonObject(std::move(rows_))}});
    }

private:
    char const* chosen()
    {
        if (s_.unlit)
            return unlit();
        bool const glows = !isBlack(s_.emission.factor);
        float const metal = s_.metallic.factor * meanOfPicture(s_.metallic);
        if (metal < 0.5f && s_.transmission.factor * meanOfPicture(s_.transmission) >= 0.5f) {
            if (glows)
                leftOut("emission of what lets light through is left out");
            return s_.hasVolume ? dielectric() : glazing();
        }
        if (s_.transmission.factor > 0.0f)
            leftOut("transmission below one half is left out");
        if (glows || isMixed())
            return ward();
        if (metal >= 0.5f)
            return hasCoat() ? coatedMetal() : bareMetal();
        if (s_.normal && hasCoat())
            leftOut("bumps below a clear coat are left out");
        else if (s_.normal)
            return ward();
        bool const hasTint = !isWhite(s_.specularColor.factor) || s_.specularColor.texture;
        bool const isPlain = !hasTint && reflected() > 0.0f;
        return isPlain || hasCoat() ? paint() : ward(); // the coat is the paint's only highlight
    }

    // Classes

    char const* unlit()
    {
        bool const isPlain = !s_.base.texture && s_.alphaMode == AlphaMode::Opaque;
        if (isPlain) {
            set("diffuseColor", jsonOf(s_.base.factor));
            return "corvid_Mtl_Unlit";
        }
        set("u_reflectivity", jsonOf(0));
        added({s_.base.factor, s_.base.texture});
        return "corvid_Mtl_Ward";
    }

    char const* dielectric()
    {
        set("u_ior", jsonOf(maxOf(s_.ior, 1.0f)));
        set("u_reflectance", jsonShort(s_.headOn()));
        tint("u_refractColor");
        rough("u_rough", s_.roughness, 1.0f);
        Vec3f const kept = s_.attenuationColor;
        if (std::isfinite(s_.attenuationDistance) && s_.attenuationDistance > 0.0f
            && !isWhite(kept)) {
            // Beer and Lambert: `kept` of the light after that distance; the class counts decades.
            constexpr float kLeast = 1e-6f;
            auto const decades = [&](float c) {
                return -std::log10(maxOf(clamp01(c), kLeast)) / s_.attenuationDistance;
            };
            set("u_absorptionCoef",
                jsonShort(Vec3f(decades(kept.x), decades(kept.y), decades(kept.z))));
            set("u_falloffEnable", jsonOf(true));
        }
        bump("u_normal0", "u_normal0MapEnable");
        return "corvid_Mtl_Dielectric";
    }

    char const* glazing()
    {
        set("u_reflectance", jsonShort(std::sqrt(s_.headOn() * s_.specular.factor)));
        float const width = widthOf(s_.roughness.factor * meanOfPicture(s_.roughness));
        set("u_rough", jsonShort(maxOf(width * width, 0.0001f)));
        if (s_.roughness.factor > 0.2f)
            leftOut("a thin pane is clear; the roughness of what lies behind it is left out");
        if (s_.base.texture)
            map("u_transmittance", *s_.base.texture, Values::Colors, factorOf(s_.base.factor),
                "u_transmittanceTransform");
        set("u_refractColor", jsonShort(meanColor()));
        if (s_.normal)
            leftOut("bumps of thin panes are left out");
        return "corvid_Mtl_Glazing";
    }

    char const* bareMetal()
    {
        color("u_reflect", s_.base);
        set("u_edgeColor", jsonOf(Vec3f(1, 1, 1)));
        if (!anisotropic())
            rough("u_rough", s_.roughness, 1.0f);
        bump("u_pattern", "u_patternEnable");
        return "corvid_Mtl_Metal";
    }

    /// KHR_materials_anisotropy: along its direction the width is mix(a, 1, strength²), across a.
    bool anisotropic()
    {
        if (s_.anisotropy.factor == 0.0f)
            return false;
        if (s_.anisotropy.texture || s_.roughness.texture)
            leftOut("pictures of anisotropic roughness are left out; their mean counts");
        float const across = widthOf(s_.roughness.factor * meanOfPicture(s_.roughness));
        float const strength = s_.anisotropy.factor * meanOfPicture(s_.anisotropy);
        float const along = across + (1.0f - across) * strength * strength;
        set("u_roughValue", jsonShort(along));
        set("u_anisotropyValue", jsonShort(across / along));
        constexpr float kTurn = 6.2831853f;
        set("u_anisoRotationValue", jsonShort(std::remainder(s_.anisotropyRotation, kTurn)));
        return true;
    }

    /// Flakes that lie flat and leave no gap are a metal below the coat.
    char const* coatedMetal()
    {
        set("u_baseColor", jsonOf(Vec3f(0, 0, 0)));
        set("u_flakeDensity", jsonOf(1));
        set("u_flakeSpread", jsonOf(0));
        color("u_flake", s_.base);
        set("u_flakeRoughValue",
            jsonShort(maxOf(widthOf(s_.roughness.factor * meanOfPicture(s_.roughness)), 0.01f)));
        if (s_.roughness.texture)
            leftOut(
                "the picture of the roughness of metal below a clear coat is left out; its mean "
                "counts");
        set("u_pearlColor", jsonOf(std::array{1.0f, 1.0f, 1.0f, 0.0f}));
        coatOf(s_.coat.factor * meanOfPicture(s_.coat) * 0.04f, s_.coatRoughness);
        return "corvid_Mtl_MetallicPaint";
    }

    char const* paint()
    {
        float const coat =
            hasCoat() ? s_.coat.factor * meanOfPicture(s_.coat) * 0.04f : reflected();
        // The class takes it as it is seen below the coat.
        if (s_.base.texture) {
            color("u_base", s_.base);
            set("u_baseAmount", jsonShort(1.0f - coat));
        } else {
            set("u_baseColor", jsonShort(s_.base.factor * (1.0f - coat)));
        }
        set("u_baseRoughValue", jsonOf(0));
        set("u_flakeDensity", jsonOf(0));
        set("u_pearlColor", jsonOf(std::array{1.0f, 1.0f, 1.0f, 0.0f}));
        if (hasCoat())
            leftOut("under its clear coat the surface has no highlight of its own");
        coatOf(coat, hasCoat() ? s_.coatRoughness : s_.roughness);
        return "corvid_Mtl_MetallicPaint";
    }

    void coatOf(float reflectance, GltfNumber const& roughness)
    {
        set("u_coatReflectivity", jsonShort(reflectance));
        rough("u_coatRough", roughness, kWidestCoat);
    }

    /// Metal or not by texel, bumps, light of its own, a tinted highlight.
    char const* ward()
    {
        if (hasCoat())
            leftOut("a clear coat beside emission, bumps or metal in places is left out");
        bool const isMetal = s_.metallic.factor * meanOfPicture(s_.metallic) >= 0.5f;
        set("u_brdfCurvePower", jsonOf(5));
        if (isMixed()) {
            mixedLayers();
        } else if (isMetal) {
            set("u_diffuseColor", jsonOf(Vec3f(0, 0, 0)));
            color("u_specular", s_.base);
            set("u_brdf00Reflectivity", jsonOf(1));
            set("u_brdf90Reflectivity", jsonOf(1));
        } else {
            color("u_diffuse", s_.base);
            color("u_specular", s_.specularColor);
            set("u_brdf00Reflectivity", jsonShort(reflected()));
            set("u_brdf90Reflectivity", jsonOf(reflected() > 0.0f ? 1 : 0));
        }
        wardRoughness();
        bump("u_normal0", "u_normal0MapEnable");
        if (s_.normal) // for diffuse light too
            for (char const* const row : {"u_normal1AsShadingNormal", "u_cosineUsesBump"})
                set(row, jsonOf(true));
        added(s_.emission);
        return "corvid_Mtl_Ward";
    }

    /// By the share m of metal: diffuse base (1 - m), highlight of colour 1 - m + base m and of
    /// reflectance at normal incidence F0 (1 - m) + m.
    void mixedLayers()
    {
        GltfTexture const& metal = *s_.metallic.texture;
        if (s_.base.texture
            && !std::equal(std::begin(metal.transform.m), std::end(metal.transform.m),
                           std::begin(s_.base.texture->transform.m)))
            leftOut("metal in places lies as the base colour's picture does; its own transform is "
                    "left out");
        JsonMember const channel = channelOf(s_.metallic.channel);
        JsonMember const factor{"factor", jsonOf(s_.metallic.factor)};
        auto const along = [&](JsonValue none, JsonValue whole) {
            return std::vector<JsonMember>{
                channel, factor, {"curve", jsonArray({std::move(none), std::move(whole)})}};
        };
        Vec3f const black(0, 0, 0), white(1, 1, 1);
        set("u_brdf90Reflectivity", jsonOf(1));
        map("u_brdf00Reflect", metal, Values::Numbers, along(jsonShort(reflected()), jsonOf(1)),
            "u_brdf00ReflectTransform");
        if (!s_.base.texture) {
            map("u_diffuse", metal, Values::Numbers, along(jsonOf(s_.base.factor), jsonOf(black)),
                "u_diffuseTransform");
            map("u_specular", metal, Values::Numbers, along(jsonOf(white), jsonOf(s_.base.factor)),
                "u_specularTransform");
            return;
        }
        auto const base = [&](JsonValue share, float ground) {
            std::vector<JsonMember> treatment = factorOf(s_.base.factor);
            treatment.push_back({"weight", std::move(share)});
            if (ground != 0.0f)
                treatment.push_back({"ground", jsonOf(ground)});
            return treatment;
        };
        map("u_diffuse", *s_.base.texture, Values::Colors,
            base(pictures_.value(metal, Values::Numbers, along(jsonOf(1), jsonOf(0))), 0),
            "u_diffuseTransform");
        map("u_specular", *s_.base.texture, Values::Colors,
            base(pictures_.value(metal, Values::Numbers, {channel, factor}), 1),
            "u_specularTransform");
    }

    void wardRoughness()
    {
        float const roughness = s_.roughness.factor * meanOfPicture(s_.roughness);
        set("u_reflectGlossyValue", jsonShort(minOf(roughness * roughness, 1.0f)));
        if (!s_.roughness.texture)
            return set("u_roughValue", jsonShort(widthOf(roughness)));
        // The glossiness for which the class has the width r², at r = 0, 1/16 ... 1.
        static constexpr float kGlossiness[] = {0.898f, 0.898f, 0.898f, 0.898f, 0.753f, 0.669f,
                                                0.596f, 0.528f, 0.282f, 0.217f, 0.181f, 0.153f,
                                                0.129f, 0.108f, 0.078f, 0.04f,  0.0f};
        std::vector<JsonMember> treatment{channelOf(s_.roughness.channel)};
        if (s_.roughness.factor != 1.0f)
            treatment.push_back({"factor", jsonOf(s_.roughness.factor)});
        treatment.push_back({"curve", jsonOf(std::span<float const>(kGlossiness))});
        map("u_rough", *s_.roughness.texture, Values::Numbers, std::move(treatment),
            "u_roughTransform");
    }

    /// A normal map as heights: PREFIXMap, its transform and its depth.
    void bump(std::string const& prefix, char const* enable)
    {
        if (!s_.normal)
            return;
        // The classes add three channels of heights and take differences over 0.001 of the picture,
        // times 3.33: with this, amount 1 gives the slopes of the map.
        constexpr float kHeights = 1 / (3 * 3.33f * 0.001f);
        set(enable, jsonOf(true));
        set(prefix + "Map",
            pictures_.value(*s_.normal, Values::Numbers,
                            {{"from", jsonOf("normals")}, {"factor", jsonShort(kHeights)}}));
        set(prefix + "Transform", transformValue(*s_.normal));
        set(prefix + "Amount", jsonShort(s_.normalScale));
    }

    // Rows

    void set(std::string name, JsonValue value)
    {
        rows_.push_back({std::move(name), std::move(value)});
    }

    /// PREFIXMapEnable, PREFIXMap, and the transform, which some classes call otherwise.
    void map(std::string const& prefix, GltfTexture const& texture, Values values,
             std::vector<JsonMember> treatment, std::string const& transform)
    {
        set(prefix + "MapEnable", jsonOf(true));
        set(prefix + "Map", pictures_.value(texture, values, std::move(treatment)));
        set(transform, transformValue(texture));
    }

    void color(std::string const& prefix, GltfColor const& color)
    {
        if (!color.texture)
            return set(prefix + "Color", jsonOf(color.factor));
        map(prefix, *color.texture, Values::Colors, factorOf(color.factor), prefix + "Transform");
    }

    static std::vector<JsonMember> factorOf(Vec3f factor)
    {
        if (isWhite(factor))
            return {};
        return {{"factor", jsonOf(factor)}};
    }

    /// The width of a lobe from a roughness.
    void rough(std::string const& prefix, GltfNumber const& roughness, float widest)
    {
        if (!roughness.texture)
            return set(prefix + "Value", jsonShort(minOf(widthOf(roughness.factor), widest)));
        std::vector<JsonMember> treatment{channelOf(roughness.channel)};
        if (roughness.factor != 1.0f)
            treatment.push_back({"factor", jsonOf(roughness.factor)});
        treatment.push_back({"power", jsonOf(2)});
        map(prefix, *roughness.texture, Values::Numbers, std::move(treatment),
            prefix + "Transform");
    }

    static JsonMember channelOf(int channel)
    {
        return {"channel", jsonOf(std::string(1, "rgba"[channel]))};
    }

    /// Of what is let through, which has no picture.
    void tint(char const* name)
    {
        set(name, jsonShort(meanColor()));
        if (s_.base.texture)
            leftOut("the picture of the base colour of glass is left out; its mean counts");
    }
    Vec3f meanColor()
    {
        return s_.base.texture ? pictures_.meanColor(*s_.base.texture) * s_.base.factor
                               : s_.base.factor;
    }

    void added(GltfColor const& glow)
    {
        if (!glow.texture)
            return set("u_additionalColor", jsonOf(glow.factor));
        set("u_additionalColor", jsonOf(glow.factor));
        map("u_additional", *glow.texture, Values::Colors, {}, "u_additionalMapTransform");
    }

    void occlude()
    {
        if (!s_.occlusion.texture || s_.unlit)
            return;
        GltfTexture texture = *s_.occlusion.texture;
        set("ambientOcclusionMode", jsonOf(1));
        set("ambientOcclusionTexture",
            pictures_.value(texture, Values::Numbers, {channelOf(s_.occlusion.channel)}));
        if (s_.occlusion.factor != 1.0f)
            set("ambientOcclusionFactor", jsonOf(s_.occlusion.factor));
    }

    void mask(std::string const& shader)
    {
        if (s_.alphaMode == AlphaMode::Opaque || shader == "corvid_Mtl_Unlit")
            return;
        bool const cuts = s_.alphaMode == AlphaMode::Mask;
        if (!s_.alpha.texture) {
            float const gone =
                cuts ? (s_.alpha.factor < s_.alphaCutoff ? 1.0f : 0.0f) : 1.0f - s_.alpha.factor;
            if (gone > 0.0f)
                set("maskingColor", jsonOf(Vec3f(gone, gone, gone)));
            return;
        }
        std::vector<JsonMember> treatment{channelOf(s_.alpha.channel)};
        if (s_.alpha.factor != 1.0f)
            treatment.push_back({"factor", jsonOf(s_.alpha.factor)});
        if (cuts)
            treatment.push_back({"threshold", jsonOf(s_.alphaCutoff)});
        set("maskingMode", jsonOf(1));
        set("maskingTexture",
            pictures_.value(*s_.alpha.texture, Values::Numbers, std::move(treatment)));
        set("maskingUVMatrix", transformValue(*s_.alpha.texture));
        set("maskingInvertTexture", jsonOf(true)); // the mask says what goes, alpha what stays
    }

    // What the surface is

    float meanOfPicture(GltfNumber const& number)
    {
        return number.texture ? pictures_.mean(*number.texture, number.channel) : 1.0f;
    }
    /// Metal in places.
    bool isMixed()
    {
        if (!s_.metallic.texture)
            return false;
        float const share = pictures_.shareAbove(*s_.metallic.texture, s_.metallic.channel,
                                                 0.5f / maxOf(s_.metallic.factor, 1e-6f));
        return share > 0.02f && share < 0.98f;
    }
    bool hasCoat() { return s_.coat.factor * meanOfPicture(s_.coat) > 0.0f; }
    /// At normal incidence, of what is no metal.
    float reflected()
    {
        return minOf(s_.headOn() * s_.specular.factor * meanOfPicture(s_.specular)
                         * (s_.ior == 0.0f ? meanOf(s_.specularColor.factor) : 1.0f),
                     1.0f);
    }

    void leftOut(char const* what) { leftOut_.add(what, s_.name); }

    GltfSurface const& s_;
    GltfPictures& pictures_;
    LeftOut& leftOut_;
    std::vector<JsonMember> rows_;
};

} // namespace

JsonValue gltfMaterial(GltfSurface const& surface, GltfPictures& pictures, LeftOut& leftOut)
{
    return Maker(surface, pictures, leftOut).made();
}

} // namespace zsi::host
