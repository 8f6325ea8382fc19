// SPDX-License-Identifier: Apache-2.0
// A shader library with one class: light in flat bands, a round highlight, a bright rim.
#include <new>
#include <zsi/vecmath.h>
#include <zsi/zsi.h>

namespace {

using namespace zsi;

float smoothstep(float from, float to, float x)
{
    float const t = clamp01((x - from) / (to - from));
    return t * t * (3.0f - 2.0f * t);
}

class ToonRim final : public MaterialShader {
public:
    // The fields in the order in which they are registered; values here are the defaults.
    Vec3f color{0.9f, 0.35f, 0.2f};
    Vec3f shadowColor{0.18f, 0.07f, 0.12f};
    int bands = 3;
    float softness = 0.08f;
    float highlightAngle = 9.0f;
    Vec3f rimColor{0.8f, 0.9f, 1.0f};
    float rimPower = 4.0f;
    TextureSampler2D colorMap;

    void registerShader(IShaderManager* manager) override
    {
        manager->declareEntryPoints(this, kShade);
        manager->registerVec3f(this, "color", &color);
        manager->registerVec3f(this, "shadowColor", &shadowColor);
        manager->registerInt(this, "bands", &bands);
        manager->registerFloat(this, "softness", &softness);
        manager->registerFloat(this, "highlightAngle", &highlightAngle);
        manager->registerVec3f(this, "rimColor", &rimColor);
        manager->registerFloat(this, "rimPower", &rimPower);
        manager->registerTexture2D(this, "colorMap", &colorMap);
        manager->registerAttribute(this, kAttributeVec2f, "uv", kUvOffset);
    }
    void copy(IShaderBase const* other) override { *this = *static_cast<ToonRim const*>(other); }

    void shade(IShaderAPI* api, ShadeState& state) const override
    {
        Vec3f const V = -state.I;
        Vec3f const N = dot(state.N, V) < 0.0f ? -state.N : state.N;

        Vec3f lit = api->ambientLight(&state.P, &N);
        Vec3f highlight{0, 0, 0};
        for (LightSample const* l = api->getLightSamples(0, &state.P, &N); l; l = l->next) {
            float const open = maxComponent(l->shadow);
            lit += l->color * band(l->weight * open);
            highlight += l->color * (open * inHighlight(dot(N, normalize(V + l->L))));
        }

        Vec3f base = color;
        if (colorMap.texture) {
            auto const* const uv = reinterpret_cast<Vec2f const*>(state.attributes + kUvOffset);
            base *= rgb(colorMap.lookup(*uv));
        }
        // Where light is missing the second colour stands, not black.
        Vec3f const result = mix(shadowColor, base, clamp01(lit)) + clamp01(highlight)
            + rimColor * std::pow(1.0f - clamp01(dot(N, V)), rimPower);
        state.Ci = withAlpha(result, 1.0f);
    }

private:
    static constexpr long kUvOffset = 0;

    /// The light rounded down to a multiple of 1 / `bands`, with a soft step to the next. The steps
    /// stand at equal distances inside 0..1, so that full light has room.
    float band(float light) const
    {
        float const count = maxOf(static_cast<float>(bands), 1.0f);
        float const level = minOf(clamp01(light) * (count + 1.0f), count);
        float const low = std::floor(level);
        float const edge = clamp(softness, 1e-3f, 1.0f);
        return (low + smoothstep(1.0f - edge, 1.0f, level - low)) / count;
    }
    /// 1 inside the disc of half vectors that the angle gives, with an edge of an eighth of it.
    float inHighlight(float cosine) const
    {
        float const radians = clamp(highlightAngle, 0.0f, 90.0f) * 0.017453293f;
        return smoothstep(std::cos(radians), std::cos(radians * 0.875f) + 1e-6f, cosine);
    }
};

} // namespace

#define EXPORTED extern "C" __attribute__((visibility("default")))

EXPORTED int ToonRim_getAPIVersion() { return zsi::kApiVersion; }
EXPORTED zsi::IShaderBase* ToonRim_create() { return new (std::nothrow) ToonRim; }
