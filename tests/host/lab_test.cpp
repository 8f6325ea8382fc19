// SPDX-License-Identifier: Apache-2.0
// The lab measures what is known by hand, and its checks find what was made wrong on purpose.
#include "lab/checks.h"
#include "lab/densityTest.h"
#include "lab/integral.h"
#include "lab/lab.h"
#include "lab/ticks.h"
#include "support/hostLibraries.h"
#include "support/inputError.h"
#include "support/temporaryFolder.h"

#include <cmath>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>
#include <random>
#include <set>
#include <zsi/vecmath.h>

namespace zsi::test {
namespace {

using namespace lab;
using Json = nlohmann::json;

constexpr float kPi = 3.14159265f;

host::ShaderLibraries const& labLibraries()
{
    static host::ShaderLibraries const loaded = [] {
        host::ShaderLibraries l;
        l.load(ZSI_FIXTURE_DIR "/labShaders/labShaders.so");
        l.load(ZSI_SHADER_LIBRARY);
        return l;
    }();
    return loaded;
}

std::vector<Specimen> specimens(std::vector<std::string> const& words)
{
    return specimensOf(words, labLibraries());
}

TEST(Lab, ChecksFindEachDefectAndNothingElse)
{
    struct Row {
        char const* setting;
        std::set<std::string> fails;
    };
    Row const rows[] = {
        {"defect=0", {}},
        {"defect=1", {"density", "integral"}},
        {"defect=2", {"density"}},
        {"defect=3", {"value", "integral"}},
        {"defect=4", {"reciprocity"}},
        {"defect=5", {"light"}},
        {"color=1.02,0.5,0.5", {"energy"}},
    };
    for (Row const& row : rows) {
        std::set<std::string> fails;
        std::string text;
        for (Check const& check : checkMaterial(specimens({"Lambert", row.setting})[0], {})) {
            text += check.name + ": " + check.text + '\n';
            EXPECT_NE(check.verdict, Verdict::NotApplicable) << check.name;
            if (check.verdict == Verdict::Fails)
                fails.insert(check.name);
        }
        EXPECT_EQ(fails, row.fails) << row.setting << '\n' << text;
    }
    EXPECT_EQ(checkMaterial(specimens({"Lambert", "defect=6"})[0], {})[0].verdict, Verdict::Fails);
    // Classes that leave a property out at other settings still have it as they are made.
    for (char const* name : {"corvid_Mtl_Ward", "corvid_Mtl_MetallicPaint"})
        EXPECT_EQ(checkMaterial(specimens({name})[0], {})[5].verdict, Verdict::Holds) << name;
    Check const curved =
        checkMaterial(specimens({"corvid_Mtl_Ward", "u_brdfCurvePower=5"})[0], {})[5];
    EXPECT_EQ(curved.name, "reciprocity");
    EXPECT_EQ(curved.verdict, Verdict::Known) << curved.text;
    for (Check const& check : checkMaterial(specimens({"corvid_Mtl_Mirror"})[0], {}))
        EXPECT_EQ(check.verdict,
                  check.name == "finite" || check.name == "energy" ? Verdict::Holds
                                                                   : Verdict::NotApplicable)
            << check.name << check.text;
}

/// The sum is distributed as chi-square with the cells as degrees of freedom: over many seeds the
/// p-values of right densities are uniform, of a narrow lobe too.
TEST(Lab, DensitiesThatAreRightHaveUniformPValues)
{
    for (std::vector<std::string> const& words :
         {std::vector<std::string>{"Lambert"}, {"corvid_Mtl_Metal", "u_roughValue=0.1"}}) {
        std::vector<Specimen> const s = specimens(words);
        host::MaterialProbe const probe(*s[0].shader());
        constexpr int kSeeds = 40;
        double sum = 0, squares = 0, least = 1;
        for (std::uint32_t seed = 0; seed < kSeeds; ++seed) {
            DensityTest const test =
                testDensity(probe, normalize(Vec3f(1, 0, 1)), 1u << 14, seed, 0);
            ASSERT_GT(test.degrees, 20);
            double const z = (test.chiSquare - test.degrees) / std::sqrt(2.0 * test.degrees);
            sum += z / kSeeds;
            squares += z * z / kSeeds;
            least = std::min(least, test.pValue);
        }
        // Mean 0 and variance 1 within 4 standard errors; errors estimated from 80 draws a cell
        // make the sum larger by a few percent, a half of its standard deviation.
        EXPECT_NEAR(sum, 0.25, 0.25 + 4 / std::sqrt(double(kSeeds))) << words[0];
        EXPECT_NEAR(squares - sum * sum, 1, 4 * std::sqrt(2.0 / kSeeds)) << words[0];
        EXPECT_GT(least, 1e-4) << words[0];
    }
}

TEST(Lab, MeasuresWhatIsKnownOfADiffuseSurface)
{
    std::vector<Specimen> const s = specimens({"Lambert", "+", "Lambert", "color=0.4,0.4,0.4"});
    Json const numbers = Json::parse(labJson(s, quickOptions()));
    double const albedo[][3] = {{0.8, 0.5, 0.25}, {0.4, 0.4, 0.4}};
    for (std::size_t i = 0; i < 2; ++i) {
        Json const& series = numbers.at("albedo").at("series")[i];
        for (std::size_t c = 0; c < 3; ++c)
            for (Json const& value : series.at(std::string(1, "rgb"[c])))
                EXPECT_NEAR(value.get<double>(), albedo[i][c], 1e-3);
    }
    double const value = (0.2126 * 0.8 + 0.7152 * 0.5 + 0.0722 * 0.25) / M_PI;
    for (Json const& v : numbers.at("lobe").at("series")[0].at("value"))
        EXPECT_NEAR(v.get<double>(), value, 1e-6);
    Json const& light = numbers.at("oneLight").at("series")[2]; // seen at 60 degrees
    EXPECT_NEAR(light.at("shade")[89 + 60].get<double>(), value * M_PI * 0.5, 1e-4)
        << "without what it glows";
    EXPECT_EQ(numbers.at("figures").size(), 10u);
    for (auto const& [name, svg] : numbers.at("figures").items())
        EXPECT_TRUE(svg.get<std::string>().starts_with("<svg")) << name;

    // Without a sampler the same, of a lobe and of a narrow one.
    for (char const* width : {"u_roughValue=0.02", "u_roughValue=0.5"}) {
        Specimen const metal = specimens({"corvid_Mtl_Metal", "u_reflectColor=1,1,1", width})[0];
        Estimate const all = reflected(metal, normalize(Vec3f(1, 0, 1)), 1 << 16, 1, 0);
        EXPECT_NEAR(all.mean.y, 0.99, 0.02) << width << ": white metal keeps 97 to 101 %";
    }

    std::atomic<bool> const stop = true;
    LabOptions cancelled = quickOptions();
    cancelled.cancel = &stop;
    EXPECT_EQ(labJson(s, cancelled), "");
}

TEST(Lab, TablesKeepWhatIsWrittenAndTellTheError)
{
    TemporaryFolder const folder;
    MerlTable table;
    std::mt19937 engine(1);
    for (Vec3f& v : table.values)
        v = Vec3f(0.4f, 0.2f, 0.1f) * (1 / kPi);
    table.values[5] = {-1, -1, -1}; // not measured
    table.write(folder.path / "flat.binary");
    EXPECT_EQ(std::filesystem::file_size(folder.path / "flat.binary"), 34992012u);
    MerlTable const back = MerlTable::read(folder.path / "flat.binary");
    for (std::size_t i = 0; i < MerlTable::kCells; ++i)
        ASSERT_NEAR(back.values[i].z, table.values[i].z, 1e-7f) << i;

    // Half angle 20.5 and difference 20.5 degrees: 90 sqrt(20.5/90) = 42.95.
    float const a = 41 * kPi / 180;
    Vec3f const up{0, 0, 1}, away{std::sin(a), 0, std::cos(a)};
    std::size_t const cell = MerlTable::cellOf(up, away);
    EXPECT_EQ(cell / (90 * 180), 42u);
    EXPECT_EQ(cell / 180 % 90, 20u);
    for (int i = 0; i < 1000; ++i) {
        std::size_t const c = engine() % MerlTable::kCells;
        auto const d = MerlTable::directionsOf(c);
        EXPECT_EQ(MerlTable::cellOf(d[0], d[1]), c);
        EXPECT_EQ(MerlTable::cellOf(d[1], d[0]), c) << "reciprocal";
        float const cosine = std::cos(0.7f), sine = std::sin(0.7f);
        auto const turned = [&](Vec3f v) {
            return Vec3f(cosine * v.x - sine * v.y, sine * v.x + cosine * v.y, v.z);
        };
        EXPECT_EQ(MerlTable::cellOf(turned(d[0]), turned(d[1])), c) << "isotropic";
    }

    std::vector<Specimen> s = specimens({"Lambert", "color=0.5,0.25,0.125"}); // 1.25 times as much
    s.push_back(measuredSpecimen(folder.path / "flat.binary"));
    Json const numbers = Json::parse(labJson(s, quickOptions()));
    EXPECT_NEAR(numbers.at("tableError").at("pairs")[0].at("meanRelative").get<double>(), 0.25,
                1e-4);
    EXPECT_NEAR(numbers.at("albedo").at("series")[1].at("r")[10].get<double>(), 0.4, 0.01);
    EXPECT_LT(numbers.at("reciprocity")[1].at("worst").get<double>(), 1e-6);

    std::filesystem::resize_file(folder.path / "flat.binary", 34992011);
    expectContains(errorOf([&] { MerlTable::read(folder.path / "flat.binary"); }),
                   {"flat.binary", "34992012 bytes", "got 34992011 bytes"});
    std::string const other = std::string("\x5a\0\0\0\x5a\0\0\0\xb5\0\0\0", 12);
    folder.write("other.binary", other + std::string(34992000, '\0'));
    expectContains(errorOf([&] { MerlTable::read(folder.path / "other.binary"); }),
                   {"90, 90, 180", "other sizes"});
}

TEST(Lab, WordsThatNameNoMaterialAreToldOf)
{
    struct Row {
        std::vector<std::string> words, parts;
    };
    std::string const scene = ZSI_SOURCE_DIR "/tests/data/scenes/card.json";
    Row const rows[] = {
        {{"Lambret"}, {"Lambret", "did you mean Lambert?"}},
        {{"Lambert", "colour=1"}, {"colour: unknown parameter of Lambert", "did you mean color?"}},
        {{"Lambert", "color=1,2"}, {"Lambert: color: expected", "3"}},
        {{"Lambert", "defect=red"}, {"defect: expected", "red"}},
        {{"color=1,1,1"}, {"expected a class before"}},
        {{"voPointLight"}, {"voPointLight: is no material"}},
        {{"corvid_Mtl_Ward", "u_diffuseMap=none.png"}, {"none.png"}},
        {{scene + ":none"}, {"card.json: has no material none"}},
        {{"none.json:a"}, {"none.json"}},
    };
    for (Row const& row : rows)
        expectContains(errorOf([&] { specimens(row.words); }), row.parts);
}

TEST(Lab, AxesEndAtRoundNumbers)
{
    Axis const plain = fitted({}, {0.3, 0.87, NAN});
    EXPECT_EQ(plain.from, 0);
    EXPECT_NEAR(plain.to, 1, 1e-9);
    EXPECT_EQ(ticksOf(plain).size(), 6u);
    Axis const decades = fitted({"", true}, {1e-30, 3, 40}, 4);
    EXPECT_NEAR(decades.from, 0.01, 1e-12);
    EXPECT_NEAR(decades.to, 100, 1e-9);
    EXPECT_NEAR(placeOn(decades, 1), 0.5, 1e-9);
    EXPECT_EQ(numberText(-0.25), "−0.25");
    EXPECT_EQ(numberText(2e-6), "2·10⁻⁶");
    EXPECT_EQ(numberText(1e5), "10⁵");
}

} // namespace
} // namespace zsi::test
