#include "materials/physical/corvid_Mtl_Dielectric.h"
#include "support/reference.h"
#include "support/scriptedHost.h"

namespace zsi {
namespace {

using test::D3;
using test::minus;
using test::plus;
using test::times;

corvid_Mtl_Dielectric randomGlass(test::Random& random)
{
    corvid_Mtl_Dielectric glass;
    glass.maskingMode = -1;
    glass.u_ior = random.in(1.3f, 1.9f);
    glass.u_reflectance = random.in(0, 0.5f);
    glass.u_roughValue = random.in(0.05f, 0.8f);
    glass.u_reflectColor = random.color();
    glass.u_refractColor = random.color();
    glass.u_absorptionCoef = random.color();
    return glass;
}

struct Indices {
    double outer, inner;
};
Indices indicesOf(corvid_Mtl_Dielectric const& glass, ShadeState const& s, bool front)
{
    return front ? Indices{double(s.incomingIor), double(glass.u_ior)}
                 : Indices{double(glass.u_ior), double(s.beyondIor)};
}

/// Walter et al. 2007, eq. 21, with V in the outer medium.
double transmittedOf(double a2, D3 v, D3 l, Indices n)
{
    D3 const h = test::unitOf(times(plus(times(l, n.inner), times(v, n.outer)), -1));
    double const i = inner(v, h), o = inner(l, h);
    return smithG1(a2, v, h) * smithG1(a2, l, h) * test::ggxOf(a2, h.z) * n.inner * n.inner
        * std::fabs(i * o) / (std::fabs(v.z * l.z) * std::pow(n.outer * i + n.inner * o, 2));
}

TEST(Dielectric, TransferIsTheFacetModelOnBothSides)
{
    test::Random random;
    test::ScriptedHost host;
    int transmitted = 0;
    for (int i = 0; i < 8000; ++i) {
        corvid_Mtl_Dielectric const glass = randomGlass(random);
        bool const front = i % 2;
        ShadeState s = test::randomHit(random, front);
        test::DFrame const frame = test::frameOf(s, front ? 1 : -1);
        D3 const v = frame.in(times(s.I, -1));
        // Half of the directions about straight on, where transmission is.
        s.sampleDirection = i % 4 < 2 ? random.unit() : normalize(s.I + random.unit() * 0.6f);
        D3 const l = frame.in(s.sampleDirection);
        if (std::fabs(l.z) < 1e-2)
            continue;
        glass.transfer(&host, s);
        double const r = double(glass.u_roughValue),
                     F = test::schlickOf(double(glass.u_reflectance), v.z);
        double const through = transmittedOf(r * r, v, l, indicesOf(glass, s, front));
        double const want =
            F * reflectedOf(r * r, v, l, test::unitOf(plus(v, l))) + (1 - F) * through;
        // 1e-7 of rounding in h, over the width of the lobe (0.05 at least) and the length of the
        // unnormalised half-vector (0.1 at least for these indices).
        EXPECT_NEAR(double(s.outBrdf.x), want, 1e-3 * want + 1e-6) << front;
        EXPECT_EQ(s.outBrdf, grey(s.outBrdf.x)) << "no tint";
        EXPECT_NEAR(double(s.sampleCosine), std::fabs(l.z), 1e-4);
        transmitted += through > 1e-3;
    }
    EXPECT_GT(transmitted, 300);
}

TEST(Dielectric, SamplesWhatTheStepsSay)
{
    test::Random random;
    int seen[4] = {}; // polished, rough, ended by the facet, totally reflected
    for (int i = 0; i < 12000; ++i) {
        corvid_Mtl_Dielectric glass = randomGlass(random);
        bool const front = i % 2, mayReflect = i % 3, mayTransmit = (i / 3) % 3;
        if (i % 5 == 0)
            glass.u_roughValue = i % 10 ? 0.01f : 0.0099f;
        ShadeState s = test::randomHit(random, front);
        if (i % 7 == 0)
            s.incomingIor = 2.4f; // from the denser side, so that facets reflect totally too
        s.allowReflection[i % 3 ? i % 2 : 2] = mayReflect;
        s.allowTransmission[i % 3] = mayTransmit;
        test::ScriptedHost host;
        double const u[3] = {0.875 * double(random.in(0, 1)), double(random.in(0, 1)),
                             double(random.in(0, 1))};
        bool const rough = front && glass.u_roughValue >= 0.01f;
        host.randoms = {float(u[0]), float(u[1]), float(u[2])};
        if (!rough)
            host.randoms = {float(u[2])};
        ShadeState const before = s;
        glass.sample(&host, s);

        test::DFrame const frame = test::frameOf(s, front ? 1 : -1);
        D3 const v = frame.in(times(s.I, -1));
        double const r = double(glass.u_roughValue), a2 = r * r;
        Indices const n = indicesOf(glass, before, front);
        double const eta = n.outer / n.inner;
        D3 m(0, 0, 1);
        if (rough) {
            double const t = std::sqrt(a2 * u[0] / (1 - u[0])), phi = 2 * std::numbers::pi * u[1];
            m = times({t * std::cos(phi), t * std::sin(phi), 1}, 1 / std::sqrt(1 + t * t));
        }
        double const c = inner(v, m), F = test::schlickOf(double(glass.u_reflectance), v.z);
        bool refracts = mayReflect && mayTransmit ? F < u[2] : mayTransmit;
        double weight = mayReflect && mayTransmit ? 1 : mayReflect ? F : 1 - F;
        double const k = (c * c - 1) * eta * eta + 1;
        if (std::fabs(c) < 1e-4 || std::fabs(k) < 1e-4 || std::fabs(F - u[2]) < 1e-5)
            continue; // too near to a decision for single precision
        bool const total = refracts && k < 0;
        if ((!mayReflect && !mayTransmit) || c < 0 || (total && !mayReflect)) {
            EXPECT_EQ(s.sampleType, 0u);
            ++seen[2];
            continue;
        }
        if (total) {
            refracts = false;
            weight = 1;
            ++seen[3];
        }
        D3 d = minus(times(m, 2 * c), v);
        if (refracts)
            d = test::unitOf(minus(times(m, eta * c - std::sqrt(k)), times(v, eta)));
        if (std::fabs(d.z) < 1e-3)
            continue;
        if (rough) {
            double const w = c * smithG1(a2, v, m) * smithG1(a2, d, m) / (v.z * m.z);
            weight *= w < 0 ? 0 : w > 4 ? 4 : w;
        }
        ++seen[rough];
        EXPECT_EQ(s.sampleType, rough ? 16u : 32u);
        EXPECT_EQ(s.sampleCosine, 1);
        EXPECT_EQ(s.sampleInvPdf, 1);
        EXPECT_EQ(double(s.beyondIor), refracts ? n.inner : n.outer) << "the medium it goes on in";
        // sqrt(k) with k of 1e-4 at least carries 1e-7 / 1e-2; tangents may be short.
        EXPECT_LT(test::distance(s.sampleDirection, frame.out(d)), 2e-4);
        EXPECT_NEAR(double(s.outBrdf.y), weight, 1e-3 * weight + 1e-5);
        EXPECT_EQ(s.outBrdf, grey(s.outBrdf.y));
    }
    for (int n : seen)
        EXPECT_GT(n, 200);
}

TEST(Dielectric, ShadesLightsReflectionAndAbsorbedRefractionAndLetsShadowRaysThrough)
{
    test::Random random;
    int totals = 0;
    for (int i = 0; i < 4000; ++i) {
        corvid_Mtl_Dielectric glass = randomGlass(random);
        bool const front = i % 2, mapped = i % 5 == 0;
        glass.u_falloffEnable = i % 3;
        if (i % 13 == 0)
            glass.u_refractColor = {0, 0, 0};
        Vec3f const texel = {random.in(0.2f, 1), random.in(0.2f, 1), random.in(0.2f, 1)};
        test::FunctionTexture<Vec2f> map([&](Vec2f) { return withAlpha(texel, 1); });
        glass.u_transmittanceMapEnable = mapped;
        glass.u_transmittanceMap.texture = &map;
        glass.u_transmittanceAmount = 0.5f;
        ShadeState s = test::randomHit(random, front);
        test::ScriptedHost host;
        Vec3f const color = random.color(), L = random.unit();
        host.addLight(L, color, {0.5f, 1, 1}, 0.75f);
        host.onTrace = [](Vec3f, Vec3f) { return Vec3f(0.5f, 0.25f, 1); };
        glass.shade(&host, s);

        // The frame keeps the normal as it is: from inside, F is 1 for the lights and then 0.
        test::DFrame const frame = test::frameOf(s, 1);
        D3 const v = frame.in(times(s.I, -1)), l = frame.in(L);
        double const r = double(glass.u_roughValue);
        double F = test::schlickOf(double(glass.u_reflectance), v.z);
        Indices const n = indicesOf(glass, s, front);
        D3 h = test::unitOf(plus(v, l));
        if (h.z < 0)
            h = times(h, -1);
        double const value = F * reflectedOf(r, v, l, h) + (1 - F) * transmittedOf(r, v, l, n);
        double want = value * 0.75 * test::fadeOf(test::dotOf(L, s.Ng)) * double(color.x * 0.5f);
        ASSERT_EQ(host.calls[0].service, "getLightSamples");
        EXPECT_EQ(host.calls[0].vectors[1], s.N);
        F = front ? F : 0;
        std::size_t next = 1;
        if (front) {
            test::Call const& ray = host.calls[next++];
            ASSERT_EQ(ray.service, "traceSpecular");
            EXPECT_EQ(ray.scalars[0], glass.u_roughValue);
            EXPECT_NEAR(double(ray.scalars[1]), F * double(maxComponent(glass.u_reflectColor)),
                        1e-6);
            EXPECT_GT(test::dotOf(ray.vectors[1], s.Ng), 0.0499);
            want += F * double(glass.u_reflectColor.x) * 0.5;
        }
        ASSERT_EQ(host.calls.size(), next + !(glass.u_refractColor == Vec3f(0, 0, 0)));
        if (host.calls.size() > next) {
            test::Call const& ray = host.calls[next];
            ASSERT_EQ(ray.service, "traceRefraction");
            EXPECT_EQ(ray.scalars[0], glass.u_roughValue);
            double const weight = (1 - F) * double(glass.u_refractColor.x);
            // Snell's law: what lies along the surface scales by the ratio of the indices.
            D3 const I(s.I), N = times(s.N, front ? 1 : -1), got = ray.vectors[1];
            D3 const across = minus(I, times(N, inner(I, N)));
            double const sine2 = inner(across, across) * std::pow(n.outer / n.inner, 2);
            if (sine2 > 1 + 1e-5) {
                EXPECT_GT(inner(got, times(s.Ng, front ? 1 : -1)), 0.0499) << "back to I's side";
                ++totals;
            } else if (sine2 < 1 - 1e-5) {
                D3 const snell =
                    minus(times(across, n.outer / n.inner), times(N, std::sqrt(1 - sine2)));
                EXPECT_LT(test::distance(got, snell), 1e-4);
            }
            double sigma = double(glass.u_absorptionCoef.x);
            if (mapped)
                sigma = -std::log(0.5 * double(texel.x)) / sigma;
            bool const absorbs = !front && glass.u_falloffEnable;
            EXPECT_EQ(map.lookups.size(), absorbs && mapped) << "looked up where it counts only";
            want += weight * 0.5 * (absorbs ? std::pow(10, -sigma * test::distance(s.P, s.E)) : 1);
        }
        EXPECT_NEAR(double(s.Ci.x), want, 2e-4 * want + 1e-6);

        // Shadow rays are absorbed inside whatever the switch says, and know no map.
        glass.transmission(&host, s);
        double const faced = std::fabs(test::dotOf(s.N, s.I));
        double left = 1 - test::schlickOf(double(glass.u_reflectance), faced);
        if (!front)
            left *= std::pow(10, -double(glass.u_absorptionCoef.y) * test::distance(s.P, s.E));
        EXPECT_NEAR(double(s.transmissionColor.y), double(glass.u_refractColor.y) * left, 1e-5);
    }
    EXPECT_GT(totals, 100);
}

TEST(Dielectric, BendsItsFrameByTheFirstMapOrTheRippleThenTheSecondMap)
{
    struct Case {
        char const* why;
        bool first, second;
        int ripple;
        bool ripples;
    };
    constexpr Case kCases[] = {
        {"other ripple modes", false, true, 2, false},
        {"ripple", false, false, 1, true},
        {"the first map stops the ripple", true, false, 1, false},
        {"the second does not", false, true, 1, true},
        {"both maps", true, true, 1, false},
    };
    for (Case const& c : kCases) {
        SCOPED_TRACE(c.why);
        auto const slope = [](Vec2f p) { return Vec4f(40 * p.x, 0, 0, 1); };
        test::FunctionTexture<Vec2f> first(slope), second(slope);
        test::Trial<corvid_Mtl_Dielectric> t;
        t.host.onNoise = [](Vec4f p) { return 0.2f * p.y; };
        corvid_Mtl_Dielectric& glass = t.shader;
        glass.u_normal0MapEnable = c.first;
        glass.u_normal1MapEnable = c.second;
        glass.u_procedureMapEnable = c.ripple;
        glass.u_normal0Map.texture = &first;
        glass.u_normal1Map.texture = &second;
        glass.u_normal0Transform = glass.u_normal1Transform = Mat3f::identity();
        glass.u_normal0UVScale = 0.5f;
        glass.u_normal0Amount = glass.u_normal1Amount = 2;
        glass.u_procedureMapAmount = 0.25f;
        test::setAttribute(t.state, 36, Vec3f(1, 0, 0));
        test::setAttribute(t.state, 48, Vec2f(0.5f, 0.25f));
        t.shade();
        std::size_t const firstLookups = c.first ? 3 : 0, secondLookups = c.second ? 3 : 0;
        int const noises = c.ripples ? 6 : 0;
        EXPECT_EQ(first.lookups.size(), firstLookups);
        EXPECT_EQ(second.lookups.size(), secondLookups);
        EXPECT_EQ(t.host.noiseCalls, noises);
        EXPECT_TRUE(!c.first || first.lookups[0].x == 0.25f) << "its own scale";
        EXPECT_TRUE(!c.second || second.lookups[0].x == 0.5f) << "always scale 1";
        // Downhill is -x for the maps (0.04 x 2 x 3.33), -y for the ripple, which stays
        // unnormalised.
        test::DFrame frame({1, 0, 0}, {0, 0, 1}, Mat4f::identity());
        if (c.first)
            frame.bend(-0.04 * 2 * 3.33, 0, true);
        if (c.ripples)
            frame.bend(0, -0.2 * 2 * 1.5 * 0.25, false);
        if (c.second)
            frame.bend(-0.04 * 2 * 3.33, 0, true);
        EXPECT_TRUE(test::near(t.host.calls[0].vectors[1], frame.n, 1e-4));

        // `sample` reads the bumps, then the roughness, and draws at last.
        test::FunctionTexture<Vec2f> rough([&](Vec2f) {
            EXPECT_EQ(first.lookups.size(), 2 * firstLookups);
            EXPECT_EQ(second.lookups.size(), 2 * secondLookups);
            EXPECT_EQ(t.host.noiseCalls, 2 * noises);
            EXPECT_EQ(t.host.randomCalls, 0);
            return Vec4f(0.5f, 0, 0, 1);
        });
        glass.u_roughMapEnable = true;
        glass.u_roughMap.texture = &rough;
        t.state.allowReflection[0] = t.state.allowTransmission[0] = 1;
        glass.sample(&t.host, t.state);
        EXPECT_EQ(rough.lookups.size(), 1u);
        EXPECT_EQ(t.host.randomCalls, 3);
    }
}

/// What breaks a formula gives nothing, not NaN: facets of no width met exactly, no tangent, equal
/// indices, a ripple's long normal under wide facets.
TEST(Dielectric, DegenerateInputIsNeutral)
{
    Vec3f const kMirror(0.6f, 0, 0.8f), kThrough(0.6f, 0, -0.8f);
    for (float rough : {0.0f, 1e-30f, 4.0f})
        for (float ior : {1.0f, 1.5f})
            for (Vec3f tangent : {Vec3f(1, 0, 0), Vec3f(0, 0, 1), Vec3f(0, 0, 0)})
                for (int ripple : {0, 1}) {
                    test::Trial<corvid_Mtl_Dielectric> t;
                    t.shader.u_roughValue = rough;
                    t.shader.u_ior = ior;
                    t.shader.u_procedureMapEnable = ripple;
                    t.shader.u_procedureMapAmount = 3;
                    t.host.onNoise = [](Vec4f p) { return 0.5f * p.x; };
                    t.state.I = kThrough;
                    test::setAttribute(t.state, 36, tangent);
                    t.host.addLight(kMirror, {1, 1, 1});
                    t.host.addLight(kThrough, {1, 1, 1});
                    EXPECT_TRUE(std::isfinite(t.shade().x)) << rough << ior << ripple;
                    for (Vec3f const& d : {kMirror, kThrough}) {
                        t.state.sampleDirection = d;
                        t.shader.transfer(&t.host, t.state);
                        EXPECT_TRUE(std::isfinite(t.state.outBrdf.x)) << rough << ior << ripple;
                    }
                }
}

} // namespace
} // namespace zsi
