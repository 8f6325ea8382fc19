// SPDX-License-Identifier: Apache-2.0
// Noise, brickwork and the wiring of the nine Ward variants, seen through the entry points.
#include "support/textTable.h"

namespace zsi {
namespace {

/// A variant with its network on: diffuse colour without lobe, cosine against the bumped normal.
struct Variant : test::Subject {
    explicit Variant(std::string const& name)
        : Subject("corvid_Mtl_Ward_" + name)
    {
        set("reflectivity=0 cosineUsesBump=1");
        for (auto const& [flag, network] : {std::pair("u_diffuseMapEnable", "_ward_diffuse"),
                                            {"u_normal0MapEnable", "_ward_normal0"},
                                            {"u_cutoutMapEnable", "_ward_cutout"}})
            set(flag, byName.lower_bound(network)->first.starts_with(network));
    }
    Vec3f albedo() { return transfer({0, 0, 1}) * 3.14159265f; }
    /// Diffuse colour, cosine, what a shadow ray keeps.
    std::array<float, 5> results(Vec3f L = {0, 0, 1})
    {
        Vec3f const c = transfer(L) * 3.14159265f;
        material().transmission(&host, state);
        return {c.x, c.y, c.z, state.sampleCosine, state.transmissionColor.x};
    }
};

TEST(WardNetworks, NoiseHasOctavesOfItsPlace)
{
    // Octaves of a placed position, of which the phase is none; an end to any number of levels.
    Variant v("120b7820");
    v.prefix = "_ward_diffuse_color_Noise_";
    v.set("type=1 size=2 levels=2 phase=.75 xform=1,2,3,0,4,5,6,0,7,8,9,0,10,20,30,1");
    v.state.Pref = {1, 10, 100};
    std::vector<Vec4f> asked;
    v.host.onNoise = [&](Vec4f p) {
        asked.push_back(p);
        return 0.5f;
    };
    v.albedo();
    ASSERT_EQ(asked.size(), 2u);
    EXPECT_TRUE(test::near(asked[0], {375.5f, 436, 496.5f, 0.75f}, 0)); // (1 + 40 + 700 + 10)/2 ..
    EXPECT_TRUE(test::near(asked[1], {751, 872, 993, 0.75f}, 0));
    v.set("size=0 levels=1e9");
    asked.clear();
    v.albedo();
    EXPECT_LT(asked.size(), 100u);
    EXPECT_TRUE(std::isfinite(asked.at(0).x)) << "a size of 0";
}

TEST(WardNetworks, TileLaysBricksInMortar)
{
    for (test::Line const& line : test::tableOf("bricks.txt")) {
        Variant v("f05db29e");
        v.prefix = "_ward_diffuse_color_Tile_";
        v.set("brickColor_UnifiedBitmap_texture=1,0,0,1 brickColor_UnifiedBitmap_amount=1 "
              "mortarColor_UnifiedBitmap_texture=0,1,0,1 mortarColor_UnifiedBitmap_amount=1 "
              "horizontalCount=3.9 verticalCount=3.9 horizontalGap=.1 verticalGap=.1 "
              "lineShift=-.5 normal0MapEnable=0 "
              + line.settings);
        v.host.onNoise = [](Vec4f p) { return p.y > 0 || p.x < 5 ? 1.0f : 0.75f; };
        v.host.onCellNoise = [](Vec3f p) {
            return Vec3f(p.x < 1 || p.z > 5 ? 0.75f : 0.25f, 0.25f, 0.1f);
        };
        v.state.imageHeight = 100;
        v.state.E = v.state.P - v.state.I * line.want.at(2);
        EXPECT_TRUE(test::near(v.albedo(), Vec3f(line.want[0], line.want[1], 0), 1e-4)) << line.why;
    }
}

/// What feeds what, by the names of the parameters: pictures are linear in u, noises in the
/// position's x, all nodes are distinct, and tiles are all brick or all mortar.
struct Wiring {
    Variant& v;
    char const* tileInput;

    static float distinct(std::string const& name)
    {
        return static_cast<float>(std::hash<std::string>{}(name) % 89) / 89;
    }
    static Vec4f picture(float k, float u)
    {
        return {0.1f + 0.3f * k + 0.2f * u, 0.6f - k * u * 0.5f, 0.5f * k * k, 0.3f + 0.5f * k};
    }
    Vec4f operator()(std::string const& path, float u, float x) const
    {
        auto const has = [&](char const* field) { return v.byName.contains(path + field); };
        if (has("_UnifiedBitmap_xform"))
            return picture(distinct(path + "_UnifiedBitmap_texture"), u) * 0.75f;
        if (has("_Tile_xform"))
            return (*this)(path + tileInput, u, x);
        if (!has("_Noise_xform"))
            return *reinterpret_cast<Vec4f const*>(v.byName.at(path).field);
        float const w = (0.5f + 0.1f * x) / (1 + distinct(path + "_Noise_thresholdHigh"));
        return (*this)(path + "_Noise_color1", u, x) * (1 - w)
            + (*this)(path + "_Noise_color2", u, x) * w;
    }
};

TEST(WardNetworks, EveryNodeFeedsItsInputAndEveryRootItsChannel)
{
    for (char const* name : {"120b7820", "33632204", "5592d496", "5ba0bfff", "82261344", "aa598cb4",
                             "b9aac246", "ccb3a2e6", "f05db29e"})
        for (float const holes : {0.0f, 100.0f}) {
            SCOPED_TRACE(name);
            Variant v(name);
            v.set("uv=.4,.3 Pref=.7,0,0 imageFadeEnable=1 imageFade=.8 diffuseColor=.5,.5,.5 "
                  "diffuseAmount=9 diffuseTransform=9,9,9,9,9,9,9,9,9 normal0Amount=400 "
                  "normal0Transform=2,0,0,0,1,0,.1,0,1 cutoutAmount=.9 "
                  "cutoutTransform=3,0,0,0,1,0,-.4,0,1");
            v.host.onNoise = [](Vec4f p) { return 0.5f + 0.1f * p.x; };
            for (auto const& [row, field] : v.byName) {
                float const k = Wiring::distinct(row);
                if (row.ends_with("_texture"))
                    v.texture(row, [k](Vec2f p) { return Wiring::picture(k, p.x); });
                else if (row.ends_with("_thresholdHigh"))
                    v.set(row, 1 + k);
                else if (row.ends_with("_amount"))
                    v.set(row, 0.75f);
                else if (row.ends_with("lCount")) // horizontal and vertical
                    v.set(row, 1);
                else if (row.ends_with("_holes"))
                    v.set(row, holes);
                else if (field.type == "Vec4f")
                    v.set(row, {k, row.ends_with('1') ? 0.1f : 0.9f, 0.6f, 0.9f});
            }
            Wiring const network{v, holes == 0 ? "_Tile_brickColor" : "_Tile_mortarColor"};
            auto const on = [&](char const* flag) { return *v.byName.at(flag).field != 0; };
            Vec3f diffuse(0.5f, 0.5f, 0.5f);
            float slope = 0, cut = 1;
            if (on("u_diffuseMapEnable")) {
                Vec4f const c = network("_ward_diffuse_color", 0.4f, 0.7f);
                diffuse = mix(diffuse, rgb(c), c.w * 0.8f);
            }
            if (on("u_normal0MapEnable")) { // both u and the position move by 0.001
                auto const height = [&](float step) {
                    Vec4f const c = network("_ward_normal0_map", 0.9f + step, 0.7f + step);
                    return c.x + c.y + c.z;
                };
                slope = (height(-0.0495f) - height(0.0505f)) * (0.01f * 400 * 3.33f);
                EXPECT_GT(std::fabs(slope), 1e-2f);
            }
            if (on("u_cutoutMapEnable"))
                cut = 0.9f * network("_ward_cutout_map", 0.8f, 0.7f).x;
            auto const got = v.results({0.6f, 0, 0.8f});
            EXPECT_TRUE(test::near(Vec3f(got[0], got[1], got[2]), diffuse, 1e-5));
            EXPECT_NEAR(got[3], (0.6f * slope + 0.8f) / std::sqrt(1 + slope * slope), 1e-3f);
            EXPECT_NEAR(got[4], 1 - cut, 1e-5f);
        }
}

TEST(WardNetworks, ReliefTurnsAndGrowsWithItsObject)
{
    Variant v("5ba0bfff");
    v.prefix = "_ward_normal0_map_Noise_";
    v.set("color2=1,1,1,1 thresholdHigh=1 size=1 normal0Amount=40");
    v.host.onNoise = [](Vec4f p) { return 0.5f + p.x - 2 * p.y + 3 * p.z; };
    float const plain = v.results({0.48f, 0.36f, 0.8f})[3];
    // Row by row, twice as large: x to y, y to z, z to x.
    v.state.objectToWorld = Mat4f(0, 2, 0, 0, 0, 0, 2, 0, 2, 0, 0, 0, 0, 0, 0, 1);
    v.state.I = {-1, 0, 0};
    v.state.N = v.state.Ng = {1, 0, 0};
    EXPECT_NEAR(v.results({0.8f, 0.48f, 0.36f})[3], plain, 1e-3f);
    EXPECT_GT(std::fabs(plain - 0.8f), 0.1f);
}

} // namespace
} // namespace zsi
