// Do the Ward samplers follow the density that they report, and reflect what `transfer` says?
#include "support/wardOracle.h"
#include "support/wardSetup.h"

#include <gtest/gtest.h>

namespace zsi {
namespace {

using test::D3;
using test::WardOracle;

constexpr int kDraws = 30000;
/// Cells of the hemisphere in cos(theta) and phi, and midpoints per cell and axis.
constexpr int kRings = 8, kSectors = 16, kFine = 24;

struct Lobe {
    float roughness, anisotropy, cosI;
    bool mixture;
};

class WardSampling : public testing::TestWithParam<Lobe> {
protected:
    corvid_Mtl_Ward m;
    ShadeState s = test::plainWardHit();
    test::ScriptedHost host;
    test::Random random;

    void SetUp() override
    {
        test::plainWard(m);
        m.u_roughValue = GetParam().roughness;
        m.u_anisotropyValue = GetParam().anisotropy;
        float const c = GetParam().cosI, r = std::sqrt(1 - c * c);
        s.I = {-0.8f * r, -0.6f * r, -c}; // off both axes of the lobe
        std::memset(s.allowReflection, GetParam().mixture, 3);
        host.randoms.resize(GetParam().mixture ? 3 : 2);
    }
    ShadeState draw()
    {
        for (float& u : host.randoms)
            u = random.in(0, 1);
        ShadeState drawn = s;
        m.sample(&host, drawn);
        return drawn;
    }
    static std::size_t cell(double cosine, double phi)
    {
        auto const index = [](double t, int n) {
            return static_cast<std::size_t>(std::fmin(n - 1, std::floor(t * n)));
        };
        double const turn = phi / (2 * WardOracle::kPi);
        return index(cosine, kRings) * kSectors + index(turn - std::floor(turn), kSectors);
    }
    /// visit(direction, its solid angle) over midpoints of the hemisphere.
    template <class Visit>
    static void integrate(Visit const& visit)
    {
        int const rings = kRings * kFine, sectors = kSectors * kFine;
        double const weight = 2 * WardOracle::kPi / rings / sectors;
        for (int i = 0; i < rings; ++i)
            for (int j = 0; j < sectors; ++j) {
                double const z = (i + 0.5) / rings, phi = 2 * WardOracle::kPi * (j + 0.5) / sectors;
                double const r = std::sqrt(1 - z * z);
                visit(D3(r * std::cos(phi), r * std::sin(phi), z), weight);
            }
    }
};

TEST_P(WardSampling, DirectionsFollowTheReportedDensity)
{
    WardOracle const oracle(m, s);
    double const pd = GetParam().mixture ? 0.5 : 0;
    std::vector<double> want(kRings * kSectors + 1), got(want.size());
    double inside = 0;
    integrate([&](D3 l, double solidAngle) {
        double const p =
            (pd * l.z / WardOracle::kPi + (1 - pd) * oracle.glossyDensity(l)) * solidAngle;
        want[cell(l.z, std::atan2(l.y, l.x))] += p * kDraws;
        inside += p;
    });
    want.back() = kDraws * std::fmax(0, 1 - inside); // declined: mirrored into the surface
    for (int i = 0; i < kDraws; ++i) {
        ShadeState const drawn = draw();
        Vec3f const d = drawn.sampleDirection;
        ++got[drawn.sampleType == kSampleNone ? want.size() - 1 : cell(d.z, std::atan2(d.y, d.x))];
    }
    // Cells of few expected draws go together.
    double chi2 = 0, restWant = 0, restGot = 0;
    int cells = 0;
    auto const add = [&](double g, double w) {
        chi2 += (g - w) * (g - w) / w;
        ++cells;
    };
    for (std::size_t i = 0; i < want.size(); ++i)
        if (want[i] >= 20) {
            add(got[i], want[i]);
        } else {
            restWant += want[i];
            restGot += got[i];
        }
    if (restWant >= 5)
        add(restGot, restWant);
    EXPECT_GT(cells, 5);
    // Mean and deviation of chi-square: k and sqrt(2k); 5 deviations are one failure in 10^5.
    EXPECT_LT(chi2, cells + 5 * std::sqrt(2.0 * cells)) << cells << " cells";
}

TEST_P(WardSampling, ReflectsWhatTransferIntegratesTo)
{
    D3 want;
    if (!GetParam().mixture)
        m.u_diffuseColor = {0, 0, 0};
    integrate([&](D3 l, double solidAngle) {
        ShadeState at = s;
        at.sampleDirection = l.single();
        m.transfer(&host, at);
        want = want + D3(at.outBrdf) * (at.sampleCosine * solidAngle);
    });
    double sum = 0, squares = 0;
    for (int i = 0; i < kDraws; ++i) {
        ShadeState const drawn = draw();
        if (drawn.sampleType == kSampleNone)
            continue;
        double const w = double(drawn.outBrdf.x) * drawn.sampleCosine * drawn.sampleInvPdf;
        sum += w;
        squares += w * w;
    }
    double const mean = sum / kDraws, error = std::sqrt((squares / kDraws - mean * mean) / kDraws);
    // The quadrature adds a thousandth: its steps are a sixth of the narrowest lobe.
    EXPECT_NEAR(mean, want.x, 4 * error + 1e-3 * want.x);
}

std::vector<Lobe> lobes()
{
    std::vector<Lobe> all;
    for (float const roughness : {0.1f, 0.3f, 0.7f})
        for (float const anisotropy : {1.0f, 2.5f})
            for (float const cosI : {0.95f, 0.5f, 0.15f})
                for (bool const mixture : {false, true})
                    all.push_back({roughness, anisotropy, cosI, mixture});
    return all;
}
std::string lobeName(testing::TestParamInfo<Lobe> const& lobe)
{
    Lobe const& l = lobe.param;
    std::string name = l.mixture ? "mixture" : "glossy";
    for (float const v : {l.roughness, l.anisotropy, l.cosI})
        name.append(1, '_').append(std::to_string(std::lround(100 * v)));
    return name;
}
INSTANTIATE_TEST_SUITE_P(Lobes, WardSampling, testing::ValuesIn(lobes()), lobeName);

} // namespace
} // namespace zsi
