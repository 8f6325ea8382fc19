// SPDX-License-Identifier: Apache-2.0
// The Ward material where no table of numbers says it: maps, the blend of the cut-out, patterns.
#include "support/textTable.h"

namespace zsi {
namespace {

constexpr Vec3f kWhite(1, 1, 1);

/// Diffuse (0.6, 0.5, 0.4) under a lobe (0.9, 0.8, 0.7) of width 0.2 that reflects half at every
/// angle, which leaves (0.3, 0.25, 0.2) and (0.45, 0.4, 0.35).
struct Ward : test::Subject {
    explicit Ward(std::string const& settings = "")
        : Subject("corvid_Mtl_Ward")
    {
        set("diffuseColor=.6,.5,.4 specularColor=.9,.8,.7 roughValue=.2 brdf00Reflectivity=.5 "
            "brdf90Reflectivity=.5");
        set(settings);
    }
};

void expectNear(Vec3f got, Vec3f want, std::string const& why, double tolerance = 2e-5)
{
    EXPECT_TRUE(test::near(got, want, tolerance)) << why;
}

TEST(Ward, EveryMapIsReadThroughItsOwnTransformTimesItsOwnAmount)
{
    Ward w("transparency=1 transparencyFade=.5 transparencyValue=.5 translucencyValue=.5 ior=1 "
           "brdfCurvePower=1 normal0Amount=.5 normal1AsShadingNormal=1 additionalColor=1,1,1 "
           "uv=.5,.25");
    w.host.addLight({0.28f, 0, 0.96f}, kWhite);
    w.host.onTrace = w.host.onIndirect = [](Vec3f, Vec3f d) { return grey(0.5f) + d * 0.3f; };
    std::map<std::string, test::FunctionTexture<Vec2f>*> textures;
    for (auto const& [name, row] : w.byName)
        if (row.type == "texture2D") {
            textures[name] = &w.texture(name, [](Vec2f p) {
                return Vec4f(0.4f + 0.3f * std::sin(90 * p.x), 0.4f + 0.3f * std::sin(80 * p.y),
                             0.5f, 0.6f);
            });
        } else if (row.type == "Mat3f") {
            float const k = static_cast<float>(std::hash<std::string>{}(name) % 97) / 97;
            w.set(name, {k, 1 - k, 0, k * k, 0.3f, 0, 2 * k, 3 - k, 1});
        }
    int channels = 0;
    for (auto const& [name, row] : w.byName) {
        if (!name.ends_with("MapEnable") || name == "u_procedureMapEnable")
            continue;
        std::string const channel = name.substr(0, name.size() - 9);
        SCOPED_TRACE(channel);
        ++channels;
        bool const scaling = channel == "u_normal0Amount"; // the map of another channel
        w.state.I = {0.6f, 0, channel == "u_translucency" ? 0.8f : -0.8f};
        w.set(name, 1);
        w.set("u_normal0MapEnable", scaling || channel == "u_normal0");
        auto const run = [&] {
            for (auto const& [texture, read] : textures)
                read->lookups.clear();
            w.material().sample(&w.host, w.state);
            Vec3f const shown = w.shade() + w.state.sampleDirection;
            return std::pair(w.host.calls, std::vector{shown.x, shown.y, shown.z});
        };
        auto const before = run();
        std::string const map = channel + "Map", transform = channel + "Transform";
        auto const* m = reinterpret_cast<float*>(
            w.byName.at(w.byName.contains(transform) ? transform : map + "Transform").field);
        ASSERT_FALSE(textures.at(map)->lookups.empty());
        EXPECT_NEAR(textures.at(map)->lookups[0].x, m[0] * 0.5f + m[3] * 0.25f + m[6], 1e-5f);
        EXPECT_NEAR(textures.at(map)->lookups[0].y, m[1] * 0.5f + m[4] * 0.25f + m[7], 1e-5f);
        for (auto const& [texture, read] : textures)
            EXPECT_EQ(!read->lookups.empty(),
                      texture == map || (scaling && texture == "u_normal0Map"))
                << texture;
        std::string const amount = scaling ? "u_normal0Amount" : channel + "Amount";
        float const was = *reinterpret_cast<float*>(w.byName.at(amount).field);
        w.set(amount, 0.7f);
        EXPECT_NE(run(), before);
        w.set(amount, was);
        w.set(name, 0);
    }
    EXPECT_EQ(channels, 15);
}

TEST(Ward, CutOutBlendsEveryTermButNotTheOpacity)
{
    for (float const map : {0.0f, 0.3f, 0.5f}) {
        float const c = 2 * map;
        Ward w("transparency=1 transparencyValue=.25 additionalColor=.2,.4,.6 cutoutAmount=2");
        w.host.addLight({0, 0, 1}, {0.5f, 0.25f, 1});
        w.host.onTrace = w.host.onIndirect = [](Vec3f, Vec3f d) { return grey(0.5f) + d * 0.4f; };
        w.host.onThrough = [](Vec3f, Vec3f) { return Vec4f(3, 2, 1, 0); };
        Vec3f const whole = w.shade();
        w.set("u_cutoutMap", {map, 0, 0, 1});
        w.set("cutoutMapEnable=1");
        expectNear(w.shade(), whole * c + Vec3f(3, 2, 1) * (1 - c), "blend", 1e-4);
        EXPECT_EQ(w.host.count("traceThrough"), c < 1);
        EXPECT_EQ(w.host.count("getLightSamples"), c > 0);
    }
}

TEST(Ward, PatternsBendByTheirAmountAtAnyTiling)
{
    Ward w("cosineUsesBump=1");
    w.host.onNoise = [](Vec4f p) {
        return 0.5f + 0.5f * std::sin(1.3f * p.x + 0.7f * p.y) * std::cos(0.9f * p.z - 1.1f * p.w);
    };
    w.host.onCellNoise = [](Vec3f p) {
        return Vec3f(fract(p.x * 0.37f), fract(p.y * 0.59f), 0.5f);
    };
    auto const slope = [&](float kind, float amount, float tiling, Vec3f P) {
        w.set("u_procedureMapEnable", kind);
        w.set("u_procedureMapAmount", amount);
        w.set("u_procedureMapTiling", {tiling, tiling, tiling});
        w.state.P = P;
        w.transfer({0, 0, 1});
        EXPECT_EQ(w.state.sampleCosine, 1.0f) << "the length is left as it comes out";
        w.transfer({0.1f, 0.1f, 1}); // the cosine is 1 + 0.1 slope
        return (w.state.sampleCosine - 1) * 10;
    };
    test::Random random;
    for (float const kind : {1.0f, 2.0f, 3.0f, 4.0f}) {
        float sum = 0, tiled = 0;
        for (int i = 0; i < 200; ++i) {
            Vec3f const P = random.color() * 5;
            float const s = slope(kind, 1, 1, P);
            EXPECT_NEAR(slope(kind, 0.5f, 1, P) * 2, s, 2e-5f);
            sum += std::fabs(s) / 200;
            tiled += std::fabs(slope(kind, 1, 7, P)) / 200;
        }
        EXPECT_GT(sum, 0.1f) << kind;
        EXPECT_LT(sum, 3) << kind;
        EXPECT_NEAR(tiled / sum, 1, 0.35f) << "tiling changes the size, not the depth " << kind;
    }
    for (float const kind : {0.0f, -1.0f, 5.0f})
        EXPECT_EQ(slope(kind, 1, 1, {1, 2, 3}), 0.0f) << kind;
    EXPECT_NE(slope(3, 1, 1, {1, 2, 3}), 0.0f);
    test::FunctionTexture<float> const flat([](float) { return Vec4f(0.5f, 0, 0, 1); });
    auto const* const ramp = &flat;
    std::memcpy(w.byName.at("u_smokeMap").field, &ramp, sizeof ramp);
    EXPECT_EQ(slope(3, 1, 1, {1, 2, 3}), 0.0f) << "heights of the smoke are those of its ramp";
}

} // namespace
} // namespace zsi
