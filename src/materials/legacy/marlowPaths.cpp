// The legacy material for path tracers: the layers of `shade`, drawn one at a time.
#include "materials/legacy/MarlowLegacy.h"
#include "materials/physical/shared/materialSkeleton.h"
#include "materials/physical/shared/safeReflect.h"
#include "materials/physical/shared/shadingFrame.h"

namespace zsi {
namespace {

constexpr Vec3f kWhite(1.0f, 1.0f, 1.0f);

/// Below it, mirrored and refracted paths are not blurred.
constexpr float kSmooth = 0.005f;

/// How often a layer of this weight is drawn, before the sum of all is scaled to 1.
float chanceOf(Vec3f weight)
{
    return saturate(weight.x) + saturate(weight.y) + saturate(weight.z);
}

bool isFinite(Vec3f v) { return std::isfinite(v.x) && std::isfinite(v.y) && std::isfinite(v.z); }

Vec3f cosineHemisphere(Vec2f u)
{
    float const r = std::sqrt(u.x), phi = 2.0f * kPi * u.y;
    return {r * std::cos(phi), r * std::sin(phi), std::sqrt(1.0f - u.x)};
}

/// What a path goes on with.
struct Event {
    Vec3f direction{0.0f, 0.0f, 0.0f};
    Vec3f value{0.0f, 0.0f, 0.0f};
    float cosine = 1.0f;
    float invPdf = 1.0f;
    SampleType type = kSampleNone;
};

} // namespace

/// Scattering value of base and lobes, without cosine and mask.
Vec3f MarlowLegacy::scattered(Layers const& layers, Vec3f v, Vec3f l) const
{
    if (unlitSurface)
        return kBlack;
    if (faceLight && l.z < 0.0f) {
        v.z = -v.z;
        l.z = -l.z;
    }
    if (!(l.z > 0.0f))
        return kBlack;
    auto const glossy = [&](GlossyLobe const& lobe) {
        return lobe.part == kBlack ? kBlack : lobe.part * lobe.value(v, l);
    };
    return layers.shares.base * layers.diffuse * kInvPi + glossy(layers.lobe[0])
        + glossy(layers.lobe[1]) + glossy(layers.lobe[2]);
}

void MarlowLegacy::transfer(IShaderAPI* api, ShadeState& state) const
{
    Surface const at = surface(api, state);
    Vec3f const l = toLocal(at.frame, state.sampleDirection);
    Vec3f const kept = kWhite - saturate(mask(api, state));
    Vec3f const value = kept * scattered(layersAt(api, state, at), at.v, l);
    state.outBrdf = isFinite(value) ? value : kBlack;
    state.sampleCosine = std::isfinite(l.z) ? std::fabs(l.z) : 0.0f;
}

void MarlowLegacy::sample(IShaderAPI* api, ShadeState& state) const
{
    bool const reflects = anySwitch(state.allowReflection);
    bool const transmits = anySwitch(state.allowTransmission);
    state.sampleType = kSampleNone;
    if (!reflects && !transmits)
        return;

    Surface const at = surface(api, state);
    Layers const layers = layersAt(api, state, at);
    Vec3f const removed = saturate(mask(api, state));
    Vec3f const kept = kWhite - removed;
    Vec3f const facing = at.v.z < 0.0f ? -at.n() : at.n();
    Vec3f const above(at.v.x, at.v.y, std::fabs(at.v.z));
    float const blur = lobeWidth(surfaceRoughness);

    // One of: straight on, refracted, mirrored; diffuse and up to three lobes, which are a mixture.
    constexpr int kStraight = 0, kRefracted = 1, kMirrored = 2, kDiffuse = 3, kLobes = 4, kAll = 7;
    Vec3f weight[kAll] = {};
    if (transmits) {
        Vec3f const clear = kept * layers.shares.clear;
        weight[kStraight] = removed;
        if (bends())
            weight[kRefracted] = clear;
        else
            weight[kStraight] += clear * paneTransmittance(api, state, minOf(above.z, 1.0f));
    }
    GlossyLobe const(&lobe)[3] = layers.lobe;
    if (reflects && !unlitSurface) {
        if (!reflectLight)
            weight[kMirrored] = kept * layers.shares.reflection;
        weight[kDiffuse] = kept * layers.shares.base * layers.diffuse;
        for (int i = 0; i < 3 && at.v.z > 0.0f; ++i)
            weight[kLobes + i] = kept * lobe[i].part;
    }
    float chance[kAll], total = 0.0f;
    for (int i = 0; i < kAll; ++i)
        total += chance[i] = chanceOf(weight[i]);
    if (!(total > 0.0f))
        return;
    float pick = api->random() * total;
    int drawn = 0;
    while (drawn + 1 < kAll && !(pick < chance[drawn]))
        pick -= chance[drawn++];
    if (!(chance[drawn] > 0.0f)) // rounding went past the last
        return;

    Event e;
    if (drawn == kStraight) {
        e.direction = state.I;
        e.type = kSampleStraight;
    } else if (drawn == kRefracted || drawn == kMirrored) {
        // Blurred by the facets that the viewer sees; what their masks lose is not taken away.
        Vec3f facet = facing;
        bool const rough = std::fabs(surfaceRoughness) > kSmooth && above.z > 0.0f;
        if (rough) {
            Vec3f const l = GlossyLobe{blur, kBlack}.sample(above, api->random2D());
            Vec3f const h = normalize(above + l);
            facet = toWorld({{at.frame[0], at.frame[1], facing}}, h);
        }
        if (drawn == kMirrored) {
            Vec3f const Ng = dot(state.I, state.Ng) > 0.0f ? -state.Ng : state.Ng;
            e.direction = f_safe_reflect(api, state, state.I, Ng, facet);
            e.type = kSampleStraight;
        } else {
            e.direction = refracted(api, state, facet);
            e.type = rough ? kSampleRough : kSampleSmooth;
        }
        e.direction = normalize(e.direction);
    } else {
        Vec2f const u = api->random2D();
        Vec3f const l =
            drawn == kDiffuse ? cosineHemisphere(u) : lobe[drawn - kLobes].sample(at.v, u);
        if (!(l.z > 0.0f))
            return;
        float density = chance[kDiffuse] * l.z * kInvPi;
        for (int i = 0; i < 3; ++i)
            if (chance[kLobes + i] > 0.0f)
                density += chance[kLobes + i] * lobe[i].density(at.v, l);
        e = {toWorld(at.frame, l), kept * scattered(layers, at.v, l), l.z, total / density,
             kSampleMixture};
    }
    if (e.type != kSampleMixture)
        e.value = weight[drawn] * (total / chance[drawn]);
    if (!isFinite(e.value) || !isFinite(e.direction) || !std::isfinite(e.invPdf))
        return;
    state.sampleDirection = e.direction;
    state.outBrdf = e.value;
    state.sampleCosine = e.cosine;
    state.sampleInvPdf = e.invPdf;
    state.sampleType = e.type;
}

} // namespace zsi
