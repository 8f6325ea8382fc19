/// The channels of the Ward family: roughness, lobe colours, and the maps behind them.
#pragma once

#include "materials/ward/wardColor.h"
#include "materials/ward/wardGlossy.h"
#include "runtime/builtins.h"

#include <zsi/zsi.h>

namespace zsi {

/// Roughness that a glossiness channel stands for; x = 1 - glossiness. The curve is fitted in
/// three pieces.
constexpr float roughnessOfGlossiness(float x)
{
    if (x < 0.5f)
        return (1.11078f * x - 0.225494f) * x + 0.0505339f;
    if (x < 0.9f)
        return ((24.1745f * x - 45.6128f) * x + 28.605f) * x - 5.72202f;
    return (x - 0.9f) * 3.0f + 0.7f;
}

/// Spread of a traced refraction for a glossiness map; 0 sharp. The exponential never reaches its
/// ends, so that clear and fully blurred are taken exactly.
inline float spreadOfGlossiness(float glossiness)
{
    constexpr float kEnd = 0.01f;
    if (std::fabs(glossiness) <= kEnd)
        return 1.0f;
    if (std::fabs(glossiness - 1.0f) <= kEnd)
        return 0.0f;
    return 0.8082f * std::exp(-4.956f * glossiness);
}

/// Grey of the procedural fade: 0.58 and 0.65 blended at the mean of the noise, 0.2160714. The
/// pattern's finest octave is always wider than the filter, so that only its mean is left.
inline constexpr float kFadeGrey = 0.595125f;

/// Channel members of a Ward class, which derives from this with itself as the argument.
template <class Shader>
struct WardLobeFunctions {
    // Splice points: where a class puts a pattern of its own in the place of a map. It does so by
    // a member of the same name and signature, found at compile time. They are asked only while
    // the channel's MapEnable is set.

    /// Diffuse map: its colour with the amount applied, and the alpha that fades it.
    /// uv: the uv attribute; position: where procedural patterns live, `Pref`.
    Vec4f diffuseMap(IShaderAPI*, ShadeState const&, Vec2f uv, Vec3f /*position*/) const
    {
        auto const& s = self();
        Vec4f const map = s.u_diffuseMap.lookup(transformUv(s.u_diffuseTransform, uv));
        return withAlpha(rgb(map) * s.u_diffuseAmount, map.w);
    }

    /// Cut-out map, 0 hole .. 1 surface, without the amount.
    float cutoutMap(IShaderAPI*, ShadeState const&, Vec2f uv, Vec3f /*position*/) const
    {
        auto const& s = self();
        return s.u_cutoutMap.lookup(transformUv(s.u_cutoutTransform, uv)).x;
    }

    /// The cut-out channel; 1 where there is none.
    float cutout(IShaderAPI* api, ShadeState const& state) const
    {
        auto const& s = self();
        if (!s.u_cutoutMapEnable)
            return 1.0f;
        return s.cutoutMap(api, state, Shader::attribute_uv(state), state.Pref) * s.u_cutoutAmount;
    }

    /// Ward roughness along the tangent (ax) and the bitangent (ay).
    void f_computeWardRoughness(IShaderAPI*, ShadeState const& state, float& ax, float& ay) const
    {
        auto const& s = self();
        ax = s.u_roughValue;
        if (s.u_roughMapEnable) [[unlikely]]
            ax = roughnessOfGlossiness(
                1.0f - clamp01(mapped(state, s.u_roughMap, s.u_roughTransform, s.u_roughAmount)));
        ay = ax
            * scalar(state, s.u_anisotropyMapEnable, s.u_anisotropyMap, s.u_anisotropyTransform,
                     s.u_anisotropyAmount, s.u_anisotropyValue);
    }

    /// Colours of the lobes: diffuse and specular reflectance, straight transmittance, and the
    /// filter that translucent light takes on. cosTheta: of the incident direction.
    /// The far side reflects nothing but what shadow rays ask for by `withFresnel`.
    /// Inlined into each caller, so that the colours stay in registers; maps are called.
    [[gnu::always_inline]] void f_computeWardLobeColors(IShaderAPI* api, ShadeState const& state,
                                                        bool frontSide, bool withFresnel,
                                                        float cosTheta, Vec3f& diffuse,
                                                        Vec3f& specular, Vec3f& transmit,
                                                        Vec3f& filter, Vec3f position) const
    {
        auto const& s = self();
        float F = 0.0f;
        if (frontSide || withFresnel)
            F = reflectivity(state, cosTheta);
        specular = s.u_specularColor;
        if (s.u_specularMapEnable) [[unlikely]]
            specular = specularMap(state);
        diffuse = s.u_diffuseColor;
        if (s.u_diffuseMapEnable || s.u_imageFadeEnable > 1) [[unlikely]]
            diffuse = fadedDiffuse(api, state, position);
        if (s.u_isMetal) {
            float const Y = dot(Vec3f(0.212671f, 0.71516f, 0.072169f), specular);
            specular *= diffuse;
            diffuse *= 1.0f - Y * F;
        }
        specular *= F;
        diffuse *= 1.0f - F;
        transmit = {0.0f, 0.0f, 0.0f};
        filter = {1.0f, 1.0f, 1.0f};
        if (s.u_transparency) [[unlikely]] {
            Layers const layers = layTransparency(state, frontSide, F);
            diffuse *= layers.diffuse;
            transmit = layers.transmit;
            filter = layers.filter;
        } else if (!frontSide) {
            diffuse = {0.0f, 0.0f, 0.0f};
        }
    }

    Vec3f f_rtMix2Color(IShaderAPI*, ShadeState const&, Vec3f a, Vec3f b, float t) const
    {
        return mix2Color(a, b, t);
    }

    /// A map at the uv attribute taken through its transform.
    static Vec4f texel(ShadeState const& state, TextureSampler2D const& map, Mat3f const& transform)
    {
        return map.lookup(transformUv(transform, Shader::attribute_uv(state)));
    }
    /// A scalar map times its amount.
    [[gnu::noinline]] static float mapped(ShadeState const& state, TextureSampler2D const& map,
                                          Mat3f const& transform, float amount)
    {
        return texel(state, map, transform).x * amount;
    }
    /// A scalar channel.
    static float scalar(ShadeState const& state, bool enable, TextureSampler2D const& map,
                        Mat3f const& transform, float amount, float plain)
    {
        if (enable) [[unlikely]]
            return mapped(state, map, transform, amount);
        return plain;
    }

private:
    Shader const& self() const { return static_cast<Shader const&>(*this); }

    /// Part of the light that the specular layer reflects, from head-on to grazing along a power
    /// curve.
    float reflectivity(ShadeState const& state, float cosTheta) const
    {
        auto const& s = self();
        float const r0 =
            scalar(state, s.u_brdf00ReflectMapEnable, s.u_brdf00ReflectMap,
                   s.u_brdf00ReflectTransform, s.u_brdf00ReflectAmount, s.u_brdf00Reflectivity);
        float const r90 =
            scalar(state, s.u_brdf90ReflectMapEnable, s.u_brdf90ReflectMap,
                   s.u_brdf90ReflectTransform, s.u_brdf90ReflectAmount, s.u_brdf90Reflectivity);
        float const curve = std::pow(1.0f - clamp01(cosTheta), s.u_brdfCurvePower);
        float const F = r0 + curve * (r90 - r0);
        // 0 for what is no number: a curve of negative power has no end at grazing.
        return (F > 0.0f ? minOf(F, 1.0f) : 0.0f) * s.u_reflectivity;
    }

    [[gnu::noinline]] Vec3f specularMap(ShadeState const& state) const
    {
        auto const& s = self();
        return clamp01(rgb(texel(state, s.u_specularMap, s.u_specularTransform))
                       * s.u_specularAmount);
    }

    /// The diffuse colour where a map or the image fade gives it.
    [[gnu::noinline]] Vec3f fadedDiffuse(IShaderAPI* api, ShadeState const& state,
                                         Vec3f position) const
    {
        auto const& s = self();
        Vec3f diffuse = s.u_diffuseColor;
        if (s.u_diffuseMapEnable) {
            Vec4f const c = s.diffuseMap(api, state, Shader::attribute_uv(state), position);
            diffuse = s.u_imageFadeEnable == 1 ? mix(diffuse, rgb(c), c.w * s.u_imageFade) : rgb(c);
        }
        if (s.u_imageFadeEnable > 1)
            diffuse = s.f_rtMix2Color(api, state, diffuse, fadeColor(state), s.u_imageFade);
        return diffuse;
    }

    struct Layers {
        float diffuse; ///< what transparency leaves of the diffuse layer
        Vec3f transmit, filter;
    };

    /// What transmission takes from the diffuse layer, straight and diffused.
    [[gnu::noinline]] Layers layTransparency(ShadeState const& state, bool frontSide, float F) const
    {
        auto const& s = self();
        float tr = s.u_transparencyValue;
        if (s.u_transparencyMapEnable) {
            float const t = texel(state, s.u_transparencyMap, s.u_transparencyTransform).x;
            tr = tr * (1.0f - s.u_transparencyFade)
                + s.u_transparencyAmount * t * s.u_transparencyFade;
        }
        // The plain colour, never the map.
        Vec3f const filter = s.u_diffuseColor * (1.0f - tr) + grey(tr);
        if (frontSide)
            return {1.0f - tr, filter * ((1.0f - F) * tr), filter};
        float const tl =
            scalar(state, s.u_translucencyMapEnable, s.u_translucencyMap, s.u_translucencyTransform,
                   s.u_translucencyAmount, s.u_translucencyValue);
        return {tl * tr, filter * ((1.0f - F) * (1.0f - tl) * tr), filter};
    }

    Vec3f fadeColor(ShadeState const& state) const
    {
        auto const& s = self();
        switch (s.u_imageFadeEnable) {
        case 2:
            return rgb(texel(state, s.u_imageFadeMap, s.u_imageFadeTransform))
                * s.u_imageFadeAmount;
        case 3:
            return s.u_imageFadeColor;
        case 4:
            return grey(kFadeGrey);
        default:
            return {0.0f, 0.0f, 0.0f};
        }
    }
};

} // namespace zsi
