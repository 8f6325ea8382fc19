// SPDX-License-Identifier: Apache-2.0
/// The Ward material: every shading function of the family, once, over the fields of a class.
///
/// `Fields` is a MaterialShader with the rows of WARD_CHANNELS, MASKING, AMBIENT_OCCLUSION and
/// TANGENT_ATTRIBUTES in the order of its class. It may have members of the names of three
/// channels, which are then asked in the place of the channel's map:
///   Vec4f diffuse_color(NetworkSite const&) const   for transform, map and amount together
///   Vec4f normal0_map(NetworkSite const&) const     for the map: uv is transformed already, and
///   Vec4f cutout_map(NetworkSite const&) const      the amount still applies
///
/// In this order: entry points; what `shade` adds up; the frame; roughness and colours of the
/// lobes; maps.
#pragma once

#include "materials/physical/shared/anisoRotation.h"
#include "materials/physical/shared/indirectDiffuse.h"
#include "materials/physical/shared/lightFade.h"
#include "materials/physical/shared/materialSkeleton.h"
#include "materials/physical/shared/safeReflect.h"
#include "materials/physical/shared/shadingFrame.h"
#include "materials/ward/network.h"
#include "materials/ward/visibleNormal.h"
#include "materials/ward/wardCurves.h"
#include "materials/ward/wardLobe.h"
#include "materials/ward/wardParameters.h"
#include "materials/ward/wardPatterns.h"
#include "runtime/arithmetic.h"
#include "runtime/builtins.h"

#include <limits>

namespace zsi {

template <class Fields>
class WardMaterial : public Fields,
                     public PhysicalShading<WardMaterial<Fields>>,
                     public AnisoRotationFunctions<WardMaterial<Fields>>,
                     public SafeReflectFunctions,
                     public IndirectDiffuseFunctions {
public:
    static constexpr Departure kDepartures[] = {
        {"light", "lights bring no pi to the glossy lobe, and fade out towards the horizon"},
        {"reciprocity", "the reflectivity follows the viewer's angle unless its curve is flat"}};

#define WARD_USING(T, name, ...) using Fields::name;
    WARD_CHANNELS(WARD_USING, WARD_USING, ZSI_ROW_NONE)
#undef WARD_USING
    using Fields::attribute_tangent;
    using Fields::attribute_uv;

    // Entry points. Flattened, so that frame and colours stay in registers; what is rare and large
    // is called all the same.

    [[gnu::flatten]] void shade(IShaderAPI* api, ShadeState& state) const final
    {
        this->shadePhysical(api, state);
    }

    /// What a shadow ray keeps: the hole of the cut-out, or the transparency, which replaces it.
    void transmission(IShaderAPI* api, ShadeState& state) const final
    {
        Vec3f result = kBlack;
        if (float const c = cutout(api, state); c != 1.0f)
            result = grey(1.0f - c);
        if (u_transparency) {
            float const side = facingSign(state.I, state.Ng);
            Vec3f const n = side > 0.0f ? -state.N : state.N;
            // Positive on the front, negative on the far side, which then shows its grazing
            // reflectivity.
            float const cosTheta = side * dot(n, state.I);
            Vec3f diffuse, specular, filter;
            f_computeWardLobeColors(api, state, side <= 0.0f, true, cosTheta, diffuse, specular,
                                    result, filter, state.Pref);
        }
        state.transmissionColor = result;
    }

    /// Diffuse plus glossy value for `sampleDirection`.
    [[gnu::flatten]] void transfer(IShaderAPI* api, ShadeState& state) const final
    {
        Surface const at = surface(api, state);
        Vec3f const l = toLocal(at.frame, state.sampleDirection);
        if (!(l.z > 0.0f && at.v.z < 0.0f)) {
            state.sampleCosine = 0.0f;
            state.outBrdf = kBlack;
            return;
        }
        float const cosine = cosineOf(state, at.Nf, l.z);
        if (cosine <= 0.0f) {
            state.sampleCosine = 0.0f;
            state.outBrdf = kBlack;
            return;
        }
        float const glossy = lobe(api, state).value(at.v, l);
        Lobes const lobes = frontLobes(api, state, at.v.z);
        state.sampleCosine = cosine;
        state.outBrdf = lobes.diffuse * kWardInvPi + lobes.specular * glossy;
    }

    /// A direction from the mixture of both lobes, or from the glossy lobe alone where the host
    /// asks for neither of the first two kinds of reflected samples.
    [[gnu::flatten]] void sample(IShaderAPI* api, ShadeState& state) const final
    {
        Surface const at = surface(api, state);
        if (!(at.v.z < 0.0f)) {
            state.sampleType = kSampleNone;
            return;
        }
        WardLobe const glossy = lobe(api, state);
        Lobes const lobes = frontLobes(api, state, at.v.z);
        Vec3f const diffuse = lobes.diffuse * kWardInvPi;
        // Densities below have no finite inverse.
        constexpr float kLeastDensity = std::numeric_limits<float>::min();

        if (!state.allowReflection[0] && !state.allowReflection[1]) {
            WardGlossySample const g = sampleWardLobe(glossy, at.v, api->random2D());
            if (!(g.direction.z >= 0.0f)
                || (g.direction.z > 0.0f && !(g.density >= kLeastDensity))) {
                state.sampleType = kSampleNone;
                return;
            }
            state.sampleDirection = toWorld(at.frame, g.direction);
            state.sampleCosine = cosineOf(state, at.Nf, g.direction.z); // either sign
            state.sampleInvPdf = 1.0f / g.density;
            // The diffuse part goes in and out again: the rounding is that of the mixture.
            state.outBrdf = (diffuse + lobes.specular * g.value) - diffuse;
            state.sampleType = kSampleStraight;
            return;
        }

        float const pd = maxComponent(lobes.diffuse) == 0.0f ? 0.0f
            : maxComponent(lobes.specular) == 0.0f           ? 1.0f
                                                             : 0.5f;
        WardGlossySample g;
        if (api->random() <= pd) {
            g = evaluateWardLobe(glossy, at.v, sampleCosineHemisphere(api->random2D()));
        } else {
            g = sampleWardLobe(glossy, at.v, api->random2D());
            if (!(g.direction.z >= 0.0f)) {
                state.sampleType = kSampleNone;
                return;
            }
        }
        state.sampleDirection = toWorld(at.frame, g.direction);
        state.sampleCosine = cosineOf(state, at.Nf, g.direction.z);
        float const pdf = g.direction.z * kWardInvPi * pd + (1.0f - pd) * g.density;
        if (state.sampleCosine < 0.0f || !(pdf >= kLeastDensity)) {
            state.sampleType = kSampleNone;
            return;
        }
        state.sampleInvPdf = 1.0f / pdf;
        state.outBrdf = diffuse + lobes.specular * g.value;
        state.sampleType = kSampleMixture;
    }

    // What `shade` adds up

    void f_calculateColors(IShaderAPI* api, ShadeState const& state, PhysicalColors& out) const
    {
        if (u_cutoutMapEnable) [[unlikely]]
            out = colorsWithHoles(api, state);
        else
            surfaceColors(api, state, out);
    }

private:
    /// Every term, blended with what is seen through the holes of the cut-out. The transmission
    /// weight stays that of the surface: occlusion darkens what is left of it in full.
    PhysicalColors colorsWithHoles(IShaderAPI* api, ShadeState const& state) const
    {
        PhysicalColors out;
        float const c = cutout(api, state); // 0 hole .. 1 surface
        Vec3f seen = kBlack;
        if (c != 1.0f) {
            seen = rgb(api->traceThrough(&state.P, &state.I, 1.0f - c));
            if (c == 0.0f) {
                out.refraction = seen;
                out.transmissionWeight = {1.0f, 1.0f, 1.0f};
                return out;
            }
        }
        surfaceColors(api, state, out);
        out.lit *= c;
        out.highlight *= c;
        out.reflection *= c;
        out.indirect *= c;
        out.additional *= c;
        out.refraction = seen * (1.0f - c) + out.refraction * c;
        return out;
    }

    /// The terms of the surface itself.
    void surfaceColors(IShaderAPI* api, ShadeState const& state, PhysicalColors& out) const
    {
        float const side = facingSign(state.I, state.Ng);
        bool const far = side > 0.0f;
        Vec3f const Nf = state.N * -side;
        SLArray<Vec3f> frame;
        f_computeShadingFrame(api, state, state.P, Nf, state.objectToWorld, frame);
        bool const bent = !(frame[2] == Nf);
        if (bent) [[unlikely]] { // the frame of a plain normal is square and visible already
            frame[2] = f_adjustBumpNormal(api, state, -state.I, Nf, frame[2]);
            f_basisOrthonormalize(api, state, frame);
        }
        Vec3f const v = toLocal(frame, state.I);
        WardLobe const glossyLobe = lobe(api, state);
        Vec3f diffuse, specular, transmit, filter;
        f_computeWardLobeColors(api, state, true, false, -v.z, diffuse, specular, transmit, filter,
                                state.Pref);
        Vec3f N = Nf;
        if (u_normal1AsShadingNormal) [[unlikely]]
            N = frame[2];
        constexpr float kSpecularThreshold = 1e-5f; // below, not worth its exponential
        bool const glossy = maxComponent(specular) > kSpecularThreshold;

        addLights(api, state, N, bent, frame, v, diffuse, specular, glossyLobe,
                  glossy && v.z < 0.0f, out);

        Vec3f translucent = kBlack;
        if (far) {
            Vec3f ignored;
            f_computeWardLobeColors(api, state, false, false, -v.z, translucent, ignored, transmit,
                                    filter, state.Pref);
            translucent *= filter;
            out.lit += translucent * lightBehind(api, state, -N);
        }
        out.transmissionWeight = transmit;

        Vec3f const NgFaced = state.Ng * -side;
        if (side < 0.0f && glossy && !u_reflectionHighlightOnly) {
            Vec3f const R = this->f_safe_reflect(api, state, state.I, NgFaced, frame[2]);
            Vec3f const traced =
                api->traceSpecular(&state.P, &R, u_reflectGlossyValue, maxComponent(specular));
            out.reflectionWeight = specular;
            out.reflection = traced * specular;
        }
        if (u_transparency && !(transmit == kBlack)) {
            float const eta = far ? u_ior / state.beyondIor : state.incomingIor / u_ior;
            Vec3f T = sl_lib_refract(state.I, N, eta);
            if (!(dot(T, T) > 0.0f)) // total reflection, or no index
                T = this->f_safe_reflect(api, state, state.I, NgFaced, N);
            out.refraction = transmit
                * api->traceRefraction(&state.P, &T, refractionSpread(state),
                                       maxComponent(transmit));
        }

        out.indirect = this->f_rtIndirectDiffuse(api, state, diffuse, state.P, N);
        out.indirectWeight = diffuse;
        if (far) {
            out.indirect += this->f_rtIndirectDiffuse(api, state, translucent, state.P, -N);
            out.indirectWeight += translucent;
        }

        out.additional = u_additionalColor;
        if (u_additionalMapEnable) [[unlikely]]
            out.additional *= u_additionalAmount
                * clamp01(rgb(texel(state, u_additionalMap, u_additionalMapTransform)));
    }

    /// Lights on the viewer's side. bent: whether N may differ from the frame's normal; shines:
    /// whether the glossy lobe counts.
    static void addLights(IShaderAPI* api, ShadeState const& state, Vec3f N, bool bent,
                          SLArray<Vec3f> const& frame, Vec3f v, Vec3f diffuse, Vec3f specular,
                          WardLobe lobe, bool shines, PhysicalColors& out)
    {
        Vec3f lit = kBlack, highlight = kBlack;
        float const norm = lobe.norm();
        for (LightSample const* light = api->getLightSamples(0, &state.P, &N); light;
             light = light->next) {
            float const height = dot(frame[2], light->L);
            float const w = light->weight * lightFade(bent ? dot(N, light->L) : height);
            if (w == 0.0f)
                continue;
            auto const black = [&] { return light->color == kBlack; };
            auto const arriving = [&] { return light->color * light->shadow * w; };
            if (shines && height > 0.0f) {
                // The lobe before the colours: no register outlives the call of its exponential.
                Vec3f const l(dot(frame[0], light->L), dot(frame[1], light->L), height);
                float const glossy = lobe.value(v, l, norm);
                if (black()) [[unlikely]]
                    continue;
                Vec3f const c = arriving();
                lit += diffuse * c;
                highlight += specular * glossy * c;
            } else if (!black()) {
                lit += diffuse * arriving();
            }
        }
        out.lit = lit;
        out.highlight = highlight;
    }

    /// Light that arrives on the side of `N`, with the horizon fade.
    static Vec3f lightBehind(IShaderAPI* api, ShadeState const& state, Vec3f N)
    {
        Vec3f sum = kBlack;
        for (LightSample const* light = api->getLightSamples(0, &state.P, &N); light;
             light = light->next)
            if (!(light->color == kBlack))
                sum += light->color * light->shadow * (light->weight * lightFade(dot(light->L, N)));
        return sum;
    }

    /// Spread of a traced refraction: the plain value as it is, a map read as glossiness.
    float refractionSpread(ShadeState const& state) const
    {
        if (!u_refractGlossyMapEnable)
            return u_refractGlossyValue;
        float const t = texel(state, u_refractGlossyMap, u_refractGlossyTransform).x;
        return spreadOfGlossiness(clamp01(t * u_refractGlossyAmount));
    }

    // Frame

    struct Surface {
        Vec3f Nf; ///< plain normal on the viewer's side; zero edge on
        SLArray<Vec3f> frame;
        Vec3f v; ///< incident direction, local
    };
    /// The hit as `transfer` and `sample` see it.
    Surface surface(IShaderAPI* api, ShadeState const& state) const
    {
        Surface at;
        at.Nf = state.N * -facingSign(state.I, state.Ng);
        f_computeShadingFrame(api, state, state.P, at.Nf, state.objectToWorld, at.frame);
        at.v = toLocal(at.frame, state.I);
        return at;
    }
    float cosineOf(ShadeState const& state, Vec3f Nf, float localZ) const
    {
        return u_cosineUsesBump ? localZ : dot(Nf, state.sampleDirection);
    }

public:
    /// Tangent, bitangent and normal at `P`, bent by the pattern or the first bump map, then by
    /// the second, then turned about the normal. toWorld takes the "tangent" attribute to world
    /// space. A pattern leaves the normal's length as it comes out.
    void f_computeShadingFrame(IShaderAPI* api, ShadeState const& state, Vec3f const& P, Vec3f N,
                               Mat4f const& toWorld, SLArray<Vec3f>& frame) const
    {
        if (u_normal0MapEnable || isProcedure(u_procedureMapEnable) || u_normal1MapEnable)
            [[unlikely]]
            frame = bentFrame(api, state, P, scalars(N), toWorld);
        else
            frame = computeBaseFrame(attribute_tangent(state), N, Mat3f(toWorld));
        this->f_anisoRotateFrame(api, state, frame, 0.0f);
    }

    /// Makes tangent and bitangent unit and perpendicular to the normal, which stays.
    void f_basisOrthonormalize(IShaderAPI*, ShadeState const&, SLArray<Vec3f>& frame) const
    {
        reorthogonalize(frame);
    }

private:
    /// The whole frame by value, so that one that nothing bends need not be in memory for this.
    [[gnu::noinline]] SLArray<Vec3f> bentFrame(IShaderAPI* api, ShadeState const& state,
                                               Vec3f const& P, Vec3f N,
                                               Mat4f const& objectToWorld) const
    {
        Mat3f const toWorld(objectToWorld);
        SLArray<Vec3f> frame = computeBaseFrame(attribute_tangent(state), N, toWorld);
        if (u_normal0MapEnable) {
            float const amount = u_normal0Amount
                * scalar(state, u_normal0AmountMapEnable, u_normal0AmountMap,
                         u_normal0AmountTransform, 1.0f, 1.0f);
            bend(frame, normal0Heights(api, state, frame), amount);
        } else if (isProcedure(u_procedureMapEnable)) {
            Vec3f const offset = patternOffset(api, state, u_procedureMapEnable, P, toWorld,
                                               u_procedureMapTiling, u_smokeMap, frame);
            bendByOffset(frame, offset * u_procedureMapAmount);
        }
        if (u_normal1MapEnable)
            bend(frame, bumpHeights(u_normal1Map, u_normal1Transform, attribute_uv(state)),
                 u_normal1Amount);
        return frame;
    }
    static void bend(SLArray<Vec3f>& frame, SLArray<float> const& heights, float amount)
    {
        bendByHeights(frame, heights, amount);
        normalizeAndReorthogonalize(frame);
    }

    // Roughness and colours of the lobes

public:
    /// Ward roughness along the tangent (ax) and the bitangent (ay).
    void f_computeWardRoughness(IShaderAPI*, ShadeState const& state, float& ax, float& ay) const
    {
        ax = u_roughValue;
        if (u_roughMapEnable) [[unlikely]]
            ax = roughnessOfGlossiness(
                1.0f - clamp01(mapped(state, u_roughMap, u_roughTransform, u_roughAmount)));
        ay = ax
            * scalar(state, u_anisotropyMapEnable, u_anisotropyMap, u_anisotropyTransform,
                     u_anisotropyAmount, u_anisotropyValue);
    }

    /// Colours of the lobes: diffuse and specular reflectance, straight transmittance, and the
    /// filter that translucent light takes on. cosTheta: of the incident direction.
    /// The far side reflects nothing but what shadow rays ask for by `withFresnel`.
    void f_computeWardLobeColors(IShaderAPI* api, ShadeState const& state, bool frontSide,
                                 bool withFresnel, float cosTheta, Vec3f& diffuse, Vec3f& specular,
                                 Vec3f& transmit, Vec3f& filter, Vec3f position) const
    {
        float F = 0.0f;
        if (frontSide || withFresnel)
            F = reflectivity(state, cosTheta);
        specular = u_specularColor;
        if (u_specularMapEnable) [[unlikely]]
            specular = specularMap(state);
        diffuse = u_diffuseColor;
        if (u_diffuseMapEnable || u_imageFadeEnable > 1) [[unlikely]]
            diffuse = fadedDiffuse(api, state, position);
        if (u_isMetal) {
            float const Y = dot(Vec3f(0.212671f, 0.71516f, 0.072169f), specular);
            specular *= diffuse;
            diffuse *= 1.0f - Y * F;
        }
        specular *= F;
        diffuse *= 1.0f - F;
        transmit = {0.0f, 0.0f, 0.0f};
        filter = {1.0f, 1.0f, 1.0f};
        if (u_transparency) [[unlikely]] {
            Layers const layers = layTransparency(state, frontSide, F);
            diffuse *= layers.diffuse;
            transmit = layers.transmit;
            filter = layers.filter;
        } else if (!frontSide) {
            diffuse = {0.0f, 0.0f, 0.0f};
        }
    }

private:
    WardLobe lobe(IShaderAPI* api, ShadeState const& state) const
    {
        WardLobe lobe;
        f_computeWardRoughness(api, state, lobe.ax, lobe.ay);
        return lobe;
    }

    struct Lobes {
        Vec3f diffuse, specular;
    };
    Lobes frontLobes(IShaderAPI* api, ShadeState const& state, float vz) const
    {
        Lobes lobes;
        Vec3f transmit, filter;
        f_computeWardLobeColors(api, state, true, false, -vz, lobes.diffuse, lobes.specular,
                                transmit, filter, state.Pref);
        return lobes;
    }

    /// Part of the light that the specular layer reflects, from head-on to grazing along a power
    /// curve.
    float reflectivity(ShadeState const& state, float cosTheta) const
    {
        float const r0 =
            scalar(state, u_brdf00ReflectMapEnable, u_brdf00ReflectMap, u_brdf00ReflectTransform,
                   u_brdf00ReflectAmount, u_brdf00Reflectivity);
        float const r90 =
            scalar(state, u_brdf90ReflectMapEnable, u_brdf90ReflectMap, u_brdf90ReflectTransform,
                   u_brdf90ReflectAmount, u_brdf90Reflectivity);
        float const curve = std::pow(1.0f - clamp01(cosTheta), u_brdfCurvePower);
        float const F = r0 + curve * (r90 - r0);
        // 0 for what is no number: a curve of negative power has no end at grazing.
        return (F > 0.0f ? minOf(F, 1.0f) : 0.0f) * u_reflectivity;
    }

    Vec3f specularMap(ShadeState const& state) const
    {
        return clamp01(rgb(texel(state, u_specularMap, u_specularTransform)) * u_specularAmount);
    }

    /// The diffuse colour where a map or the image fade gives it.
    [[gnu::noinline]] Vec3f fadedDiffuse(IShaderAPI* api, ShadeState const& state,
                                         Vec3f position) const
    {
        Vec3f diffuse = u_diffuseColor;
        if (u_diffuseMapEnable) {
            Vec4f const c = diffuseMap(api, state, position);
            diffuse = u_imageFadeEnable == 1 ? mix(diffuse, rgb(c), c.w * u_imageFade) : rgb(c);
        }
        if (u_imageFadeEnable > 1)
            diffuse = f_rtMix2Color(api, state, diffuse, fadeColor(state), u_imageFade);
        return diffuse;
    }
    Vec3f fadeColor(ShadeState const& state) const
    {
        switch (u_imageFadeEnable) {
        case 2:
            return rgb(texel(state, u_imageFadeMap, u_imageFadeTransform)) * u_imageFadeAmount;
        case 3:
            return u_imageFadeColor;
        case 4:
            return grey(kFadeGrey);
        default:
            return kBlack;
        }
    }

    struct Layers {
        float diffuse; ///< what transparency leaves of the diffuse layer
        Vec3f transmit, filter;
    };
    /// What transmission takes from the diffuse layer, straight and diffused.
    Layers layTransparency(ShadeState const& state, bool frontSide, float F) const
    {
        float tr = u_transparencyValue;
        if (u_transparencyMapEnable) {
            float const t = texel(state, u_transparencyMap, u_transparencyTransform).x;
            tr = tr * (1.0f - u_transparencyFade) + u_transparencyAmount * t * u_transparencyFade;
        }
        // The plain colour, never the map.
        Vec3f const filter = u_diffuseColor * (1.0f - tr) + grey(tr);
        if (frontSide)
            return {1.0f - tr, filter * ((1.0f - F) * tr), filter};
        float const tl = scalar(state, u_translucencyMapEnable, u_translucencyMap,
                                u_translucencyTransform, u_translucencyAmount, u_translucencyValue);
        return {tl * tr, filter * ((1.0f - F) * (1.0f - tl) * tr), filter};
    }

    // Maps

    /// A map at the uv attribute taken through its transform.
    static Vec4f texel(ShadeState const& state, TextureSampler2D const& map, Mat3f const& transform)
    {
        return map.lookup(transformUv(transform, attribute_uv(state)));
    }
    /// A scalar map times its amount.
    static float mapped(ShadeState const& state, TextureSampler2D const& map,
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

    /// Diffuse map or network: its colour with the amount applied, and the alpha that fades it.
    Vec4f diffuseMap(IShaderAPI* api, ShadeState const& state, Vec3f position) const
    {
        if constexpr (requires { &Fields::diffuse_color; }) {
            return this->diffuse_color({api, state, attribute_uv(state), position});
        } else {
            Vec4f const map = texel(state, u_diffuseMap, u_diffuseTransform);
            return withAlpha(rgb(map) * u_diffuseAmount, map.w);
        }
    }

    /// Heights (r + g + b) of the first bump map or network: here, one step along the tangent or
    /// u, one step along the bitangent or v. frame: tangent, bitangent, normal so far.
    SLArray<float> normal0Heights(IShaderAPI* api, ShadeState const& state,
                                  SLArray<Vec3f> const& frame) const
    {
        Vec2f const uv = attribute_uv(state);
        if constexpr (requires { &Fields::normal0_map; }) {
            auto const network = [&](NetworkSite const& at) { return this->normal0_map(at); };
            return f_bumpLookup(api, state, network, frame, transformUv(u_normal0Transform, uv),
                                state.Pref);
        } else {
            return bumpHeights(u_normal0Map, u_normal0Transform, uv);
        }
    }

    /// The cut-out channel, 0 hole .. 1 surface; 1 where there is none.
    float cutout(IShaderAPI* api, ShadeState const& state) const
    {
        if (!u_cutoutMapEnable)
            return 1.0f;
        Vec2f const uv = transformUv(u_cutoutTransform, attribute_uv(state));
        if constexpr (requires { &Fields::cutout_map; })
            return this->cutout_map({api, state, uv, state.Pref}).x * u_cutoutAmount;
        else
            return u_cutoutMap.lookup(uv).x * u_cutoutAmount;
    }
};

} // namespace zsi
