// SPDX-License-Identifier: Apache-2.0
// Every class with `transfer` and `sample`, asked the same questions: do directions follow the
// density that they report, do they carry the value of `transfer`, is their mean weight its
// integral, does no more light come back than falls in, is the value reciprocal, does one light
// show pi times the value.
#include "support/lobeSampling.h"
#include "support/textTable.h"

namespace zsi::test {
namespace {

Vec3d viewAt(double cosine, double azimuth)
{
    double const s = std::sqrt(1 - cosine * cosine);
    return {s * std::cos(azimuth), s * std::sin(azimuth), cosine};
}

/// A line of tests/data/sampling.txt, which tells what stands there.
struct Setting {
    std::string className, name;
    std::set<std::string> flags;
    Line line;

    explicit Setting(Line const& l)
        : line(l)
    {
        std::istringstream words(l.why);
        words >> className >> name;
        for (std::string word; words >> word;)
            flags.insert(word);
    }
    static std::vector<Setting> all()
    {
        std::vector<Setting> settings;
        for (Line const& l : tableOf("sampling.txt"))
            settings.emplace_back(l);
        return settings;
    }
};

class Sampling : public testing::TestWithParam<Setting> {
protected:
    Subject subject{GetParam().className};
    std::vector<float> const& numbers = GetParam().line.want;
    Random random;

    Sampling()
    {
        subject.set(GetParam().line.settings);
        ShadeState& s = subject.state;
        s.P = s.Pref = {0.3f, 0.7f, 0.2f};
        s.imageHeight = 728; // a pixel of an opening of 40 degrees is 1/1000 rad
        if (subject.byName.contains("usingHDRbuffer"))
            subject.set("usingHDRbuffer=1");
        if (is("glossy"))
            s.allowReflection[0] = s.allowReflection[1] = 0;
        std::memset(s.allowTransmission, is("clear"), sizeof s.allowTransmission);
        subject.host.randoms.resize(5);
        subject.host.onNoise = [](Vec4f p) {
            return 0.5f + 0.4f * std::sin(2.1f * p.x + 1.3f * p.y) * std::cos(1.7f * p.z - p.x);
        };
    }
    bool is(char const* flag) const { return GetParam().flags.contains(flag); }
    MirrorMap map(Vec3d v) const { return {double(numbers[0]), double(numbers[1]), v}; }
    void see(Vec3d v)
    {
        ShadeState& s = subject.state;
        s.I = -toFloat(v);
        s.E = s.P - s.I * (numbers.size() > 4 ? numbers[4] : 1e6f);
    }
    ShadeState draw()
    {
        for (float& u : subject.host.randoms)
            u = random.in(0, 0.9999999f);
        subject.host.randomCalls = 0;
        ShadeState s = subject.state;
        subject.material().sample(&subject.host, s);
        return s;
    }
    ShadeState value(Vec3f l)
    {
        ShadeState s = subject.state;
        s.sampleDirection = l;
        subject.material().transfer(&subject.host, s);
        return s;
    }
};

/// Mean of numbers, and its standard error.
struct Mean {
    double sum = 0, squares = 0;
    int count = 0;
    void add(double x) { sum += x, squares += x * x, ++count; }
    double mean() const { return sum / count; }
    double error() const
    {
        return std::sqrt(std::max(0.0, squares / count - mean() * mean()) / count);
    }
};

TEST_P(Sampling, DrawsFollowTheirDensityCarryTheValueAndAddUpToTheIntegral)
{
    // Rounding of the half vector, 1e-7, over the width, by its square and again.
    float const tolerance = 1e-4f + 2e-6f / numbers[0];
    for (Vec3d const v : {viewAt(0.95, 0.4), viewAt(0.55, 1.2), viewAt(0.15, 2.5)}) {
        SCOPED_TRACE(v.z);
        see(v);
        DensityCheck check{map(v)};
        Mean scattered, all;
        for (int i = 0; i < 20000; ++i) {
            ShadeState const s = draw();
            double const weight = s.sampleType == kSampleNone
                ? 0
                : double(s.outBrdf.y) * double(s.sampleCosine) * double(s.sampleInvPdf);
            ASSERT_TRUE(std::isfinite(weight) && weight >= 0);
            all.add(weight);
            bool const scatters = s.sampleType == (is("glossy") ? kSampleStraight : kSampleMixture);
            scattered.add(scatters ? weight : 0);
            if (!scatters) {
                check.reject();
                continue;
            }
            ASSERT_GT(s.sampleDirection.z, 0.0f) << "below the surface";
            check.accept(s.sampleDirection, double(s.sampleInvPdf));
            if (is("stated") || is("glossy") || i % 8)
                continue;
            ShadeState const t = value(s.sampleDirection);
            ASSERT_NEAR(s.outBrdf.x, t.outBrdf.x, tolerance * t.outBrdf.x);
            ASSERT_NEAR(s.outBrdf.z, t.outBrdf.z, tolerance * t.outBrdf.z);
            ASSERT_NEAR(s.sampleCosine, t.sampleCosine, 1e-5f);
        }
        EXPECT_LT(all.mean(), double(numbers[3]) + 4 * all.error() + 0.006);
        EXPECT_GT(all.mean(), double(numbers[2]) - 4 * all.error());
        if (is("stated"))
            continue;
        int cells = 0;
        double const deviation = check.deviation(cells);
        EXPECT_TRUE(is("leaning") || deviation < cells + 5 * std::sqrt(2.0 * cells + 1))
            << "chi-square " << deviation << " of " << cells;
        if (is("glossy"))
            continue;
        double const integral = hemisphere(check.map, 96, [&](Vec3d l) {
            ShadeState const s = value(toFloat(l));
            return double(s.outBrdf.y) * double(s.sampleCosine) / l.z;
        });
        // The quadrature itself is good to a five-hundredth.
        EXPECT_NEAR(scattered.mean(), integral, 4 * scattered.error() + 0.003 * integral);
    }
}

TEST_P(Sampling, ValuesAreReciprocalAndOneLightShowsThem)
{
    if (is("stated"))
        return;
    for (int i = 0; i < 200; ++i) {
        Vec3f a = random.unit(), b = random.unit();
        a.z = std::fabs(a.z) + 0.02f;
        b.z = std::fabs(b.z) + 0.3f; // the Ward lights fade towards the horizon
        a = normalize(a), b = normalize(b);
        see(a);
        ShadeState const there = value(b);
        if (!is("unlit")) {
            ScriptedHost& host = subject.host;
            host.lights.clear();
            host.addLight(b, {2, 3, 4}, {1, 0.5f, 0.25f}, there.sampleCosine);
            Vec3f const want =
                there.outBrdf * Vec3f(2, 1.5f, 1) * (there.sampleCosine * 3.14159265f);
            ASSERT_TRUE(near(subject.shade(), want, 2e-4 * (1e-3 + double(length(want)))));
            host.lights.clear();
        }
        if (is("oneWay"))
            continue;
        see(b);
        Vec3f const back = value(a).outBrdf;
        ASSERT_TRUE(near(there.outBrdf, back,
                         (1e-3 + 2e-6 / double(numbers[0])) * (1e-3 + double(length(back)))));
    }
}

/// In a world that is brighter on one side.
TEST_P(Sampling, RaysOfShadeFindWhatPathsFind)
{
    if (is("stated") || is("unlit") || is("gathers"))
        return;
    see(viewAt(0.5, 0.5));
    auto const world = [](Vec3f d) { return 1 + 0.5f * d.x; };
    ScriptedHost& host = subject.host;
    host.onTrace = [&](Vec3f, Vec3f d) { return grey(world(normalize(d))); };
    host.onThrough = [&](Vec3f, Vec3f d) { return withAlpha(grey(world(d)), 1); };
    host.onIndirect = [](Vec3f, Vec3f n) { return grey(1 + n.x / 3); }; // its mean over the cosine
    Mean shown, found;
    for (int i = 0; i < 8000; ++i) {
        ShadeState const s = draw();
        found.add(s.sampleType == kSampleNone ? 0
                                              : double(s.outBrdf.y * s.sampleCosine * s.sampleInvPdf
                                                       * world(s.sampleDirection)));
        for (float& u : host.randoms)
            u = random.in(0, 0.9999999f);
        shown.add(double(subject.shade().y));
        for (Call const& call : host.calls)
            ASSERT_TRUE(call.service != "traceSpecular" || call.scalars[0] == 0)
                << "a ray of the lobe is spread no further";
    }
    EXPECT_NEAR(shown.mean(), found.mean(), 4 * std::hypot(shown.error(), found.error()) + 0.01);
}

TEST(SamplingTable, ValuesStayFiniteAtTheEndsOfEveryRange)
{
    constexpr float kEnds[] = {-1, 0, 1e-40f, 1e-6f, 0.5f, 1, 1e6f};
    Random random;
    for (char const* name : {"corvid_Mtl_Metal", "corvid_Mtl_MetallicPaint", "MarlowLegacy"})
        for (int i = 0; i < 3000; ++i) {
            Subject s(name);
            for (Registered const& row : s.rows.rows)
                for (std::size_t at = 0; at < row.size; at += sizeof(float))
                    if ((row.type == "float" || row.type.starts_with("Vec")) && i % 4 != 0)
                        std::memcpy(row.field + at, &kEnds[random.engine() % 7], sizeof(float));
            Vec3f const d = random.unit();
            float const height = std::max(std::fabs(d.z), 1e-6f) * (i % 3 ? 1.0f : 1e-5f);
            s.state.I = -normalize({d.x, d.y, height});
            if (i % 5 == 0)
                s.attribute("tangent", Vec3f(0, 0, i % 2 ? 1.0f : 0.0f)); // no tangent
            s.host.randoms = i % 7 ? std::vector{random.in(0, 1), random.in(0, 1), random.in(0, 1)}
                                   : std::vector{0.0f};
            s.host.onTrace = s.host.onIndirect = [](Vec3f, Vec3f) { return grey(1); };
            bool const negative = name == std::string("MarlowLegacy"); // colours are kept as given
            auto const sound = [&](Vec3f v) {
                return std::isfinite(v.x + v.y + v.z) && (negative || minComponent(v) >= 0);
            };
            ASSERT_TRUE(sound(s.transfer(i % 2 ? normalize({-d.x, -d.y, height}) : random.unit())))
                << name << i;
            ASSERT_TRUE(sound(s.shade())) << name << i;
            s.material().sample(&s.host, s.state);
            ASSERT_TRUE(s.state.sampleType == kSampleNone
                        || (sound(s.state.outBrdf) && std::isfinite(s.state.sampleInvPdf)
                            && std::fabs(length(s.state.sampleDirection) - 1) < 1e-4f))
                << name << i;
        }
}

INSTANTIATE_TEST_SUITE_P(Classes, Sampling, testing::ValuesIn(Setting::all()),
                         [](auto const& of) { return of.param.className + "_" + of.param.name; });

TEST(SamplingTable, HasEveryClassThatScatters)
{
    std::set<std::string> listed, scatter;
    for (Setting const& s : Setting::all())
        listed.insert(s.className);
    for (std::string const& name : Library::instance().classes)
        if ((Subject(name).rows.masks.at(0) & (kTransfer | kSample)) == (kTransfer | kSample))
            scatter.insert(name);
    EXPECT_EQ(listed, scatter);
}

} // namespace
} // namespace zsi::test
