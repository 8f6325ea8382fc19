// SPDX-License-Identifier: Apache-2.0
// The Ward material by numbers worked out by hand: what each channel does to the lobes, what a
// light, a ray and a random number give, and what the host is asked for.
#include "support/textTable.h"

namespace zsi {
namespace {

constexpr Vec3f kWhite(1, 1, 1), kNone(0, 0, 0);

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
    /// Bends the normal to (-slope, 0, 1), normalised.
    void bend(float slope)
    {
        if (slope == 0)
            return;
        set("normal0MapEnable=1");
        texture("u_normal0Map", [](Vec2f p) { return Vec4f(p.x, 0, 0, 1); });
        set("u_normal0Amount", slope / (0.001f * 3.33f)); // heights differ by 0.001
    }
};

void expectNear(Vec3f got, Vec3f want, std::string const& why, double tolerance = 2e-5)
{
    EXPECT_TRUE(test::near(got, want, tolerance)) << why;
}

TEST(Ward, ChannelsMakeTheColoursOfTheLobes)
{
    // What the surface gathers from above; what its rays bring from above and from below. From
    // behind (I upwards) these are translucent light, light straight through, and no mirror.
    // Fades of (0.6, 0.5, 0.4) by (0.1, 0.2, 0.3): the overlay is (0.28, 0.2, 0.24).
    for (test::Line const& line : test::table(R"(
plain                        |                                                          | .3 .25 .2     .45 .4 .35   0 0 0
map times amount             | diffuseMapEnable=1 diffuseMap=.2,.4,.6,.5 diffuseAmount=.5 | .05 .1 .15  .45 .4 .35   0 0 0
decal: alpha .5 times .4     | diffuseMapEnable=1 diffuseMap=.2,.4,.6,.5 diffuseAmount=.5 imageFadeEnable=1 imageFade=.4 | .25 .22 .19  .45 .4 .35  0 0 0
fade by a map                | imageFadeEnable=2 imageFadeMap=.2,.4,.6,0 imageFadeAmount=.5    | .014 .02 .036  .45 .4 .35  0 0 0
half: (a + o)/2 (1 + b)/2    | imageFadeEnable=2 imageFadeMap=.2,.4,.6,0 imageFadeAmount=.5 imageFade=.5 | .121 .105 .104  .45 .4 .35  0 0 0
by a colour                  | imageFadeEnable=3 imageFadeColor=.1,.2,.3 imageFade=.5       | .121 .105 .104  .45 .4 .35  0 0 0
by the grey .595125          | imageFadeEnable=4                                        | .201182 .1770869 .1416695  .45 .4 .35  0 0 0
by nothing                   | imageFadeEnable=5                                        | 0 0 0          .45 .4 .35   0 0 0
specular map, clamped        | specularMapEnable=1 specularMap=.2,.4,.6,1 specularAmount=2.5   | .3 .25 .2   .25 .5 .5    0 0 0
metal: luminance .81405      | isMetal=1                                                | .1778925 .1482437 .118595  .27 .2 .14  0 0 0
.1 to .9 by .2^2, halved     | brdf00Reflectivity=.1 brdf90Reflectivity=.9 brdfCurvePower=2 reflectivity=.5 I=.6,0,-.8 | .5604 .467 .3736  .0594 .0528 .0462  0 0 0
clamped, then scaled         | brdf00Reflectivity=3 brdf90Reflectivity=3 reflectivity=.5 | .3 .25 .2     .45 .4 .35   0 0 0
a curve without end          | brdfCurvePower=-1                                        | .6 .5 .4       0 0 0        0 0 0
filter .8 .75 .7             | transparency=1 transparencyValue=.5                      | .15 .125 .1    .45 .4 .35   .2 .1875 .175
.5 .75 + .2 .5 .25           | transparency=1 transparencyValue=.5 transparencyMapEnable=1 transparencyMap=.2,0,0,0 transparencyFade=.25 transparencyAmount=.5 | .18 .15 .12  .45 .4 .35  .152 .14 .128
highlights only              | reflectionHighlightOnly=1                                | .3 .25 .2      0 0 0        0 0 0
opaque behind                | I=0,0,1                                                  | 0 0 0          0 0 0        0 0 0
a quarter diffused behind    | I=0,0,1 transparency=1 transparencyValue=.5 translucencyValue=.25 | .06 .046875 .035  .3 .28125 .2625  0 0 0
)")) {
        Ward w(line.settings);
        auto const above = [](Vec3f, Vec3f d) { return d.z > 0 ? kWhite : kNone; };
        w.host.onIndirect = above;
        expectNear(w.shade(), test::vec3(line.want), line.why);
        w.host.onIndirect = nullptr;
        w.host.onTrace = above;
        expectNear(w.shade(), test::vec3(line.want, 3), line.why);
        w.host.onTrace = [](Vec3f, Vec3f d) { return d.z < 0 ? kWhite : kNone; };
        expectNear(w.shade(), test::vec3(line.want, 6), line.why);
    }
}

TEST(Ward, ShadowRaysSeeTheHoleOrTheTransparency)
{
    // Reflectivity 0.1 + 0.8 * 0.2^2 in front, 0.9 behind, where 0.25 is diffused on the way.
    for (test::Line const& line : test::table(R"(
whole                 | cutoutMap=.5,0,0,1  cutoutAmount=2                                 | 0 0 0
half a hole           | cutoutMap=.25,0,0,1 cutoutAmount=2                                 | .5 .5 .5
unbound               |                                                                    | 1 1 1
whatever the hole     | cutoutMap=.25,0,0,1 transparency=1                                 | .3472 .3255 .3038
from behind           | cutoutMap=.25,0,0,1 transparency=1 translucencyValue=.25 I=.6,0,.8 | .03 .028125 .02625
)")) {
        Ward w("cutoutMapEnable=1 transparencyValue=.5 brdf00Reflectivity=.1 brdf90Reflectivity=.9 "
               "brdfCurvePower=2 I=.6,0,-.8 "
               + line.settings);
        w.material().transmission(&w.host, w.state);
        expectNear(w.state.transmissionColor, test::vec3(line.want), line.why);
    }
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

TEST(Ward, TransferIsTheLobeOfItsWidthsInItsFrame)
{
    // Slope of the bump; light; value of the lobe where its colour is 1, without the diffuse layer;
    // cosine. Head-on the lobe is 1 / (4 pi ax ay), and light from (0.6, 0, 0.8) has slope 1/3.
    // Bent to (-0.6, 0, 0.8) the mirror direction is (-0.96, 0, 0.28).
    for (test::Line const& line : test::table(R"(
head-on                  |                                             | 0 0 0 1    1.9894368 1
glossiness .75           | roughMapEnable=1 roughMap=.375,0,0,1 roughAmount=2 | 0 0 0 1  19.683019 1
.3                       | roughMapEnable=1 roughMap=.3,0,0,1          | 0 0 0 1    1.3469696 1
.05                      | roughMapEnable=1 roughMap=.05,0,0,1         | 0 0 0 1    .11014183 1
unbound: width 1         | roughMapEnable=1                            | 0 0 0 1    .07957747 1
along the tangent        | anisotropyValue=2                           | 0 .6 0 .8  .0691483  .8
along the bitangent      | anisotropyValue=2                           | 0 0 .6 .8  .5553436  .8
turned by 90 degrees     | anisotropyValue=2 anisoRotationValue=1.5707963 | 0 .6 0 .8  .5553436 .8
mirror direction         | anisotropyValue=2 I=.6,0,-.8                | 0 .6 0 .8  1.2433980 .8
bent                     |                                             | .75 -.96 0 .28  2.4867960 .28
cosine against the bump  | cosineUsesBump=1                            | .75 -.96 0 .28  2.4867960 .8
light below              | diffuseColor=0,0,0                          | 0 .6 0 -.8 0 0
below the bent normal    | diffuseColor=0,0,0                          | .75 .9797959 0 .2 0 0
along the surface        | diffuseColor=0,0,0 I=1,0,0                  | 0 0 0 1    0 0
no width                 | roughValue=0                                | 0 0 0 1    0 1
next to none             | roughValue=1e-20                            | 0 0 0 1    0 1
)")) {
        Ward w(line.settings);
        w.bend(line.want[0]);
        float const diffuse = line.settings.starts_with(" diffuse") ? 0 : 0.0954930f;
        float const want = diffuse + 0.45f * line.want[4];
        EXPECT_NEAR(w.transfer(test::vec3(line.want, 1)).x, want, 5e-4f * want) << line.why;
        EXPECT_NEAR(w.state.sampleCosine, line.want[5], 1e-4f) << line.why;
    }
}

TEST(Ward, LightsAddDiffuseAndHighlight)
{
    // Slope of the bump; direction of the light, whose colour times shadow times weight is
    // (0.5, 0.25, 0.0625); what it adds.
    for (test::Line const& line : test::table(R"(
lobe and diffuse, head-on   |                                        | 0    0 0 1          .5976233 .2614437 .0560189
bent: the lobe is 2.48680   |                                        | .75  -.96 0 .28     .7095291 .3111796 .0668986
nothing at .05              | specularColor=0,0,0                    | 0    .9987492 0 .05 0 0 0
half at .15                 | specularColor=0,0,0                    | 0    .988686 0 .15  .075 .03125 .00625
all at .25                  | specularColor=0,0,0                    | 0    .9682458 0 .25 .15 .0625 .0125
.84375 over the plain one   | specularColor=0,0,0                    | .75  .9797959 0 .2  .1265625 .0527344 .0105469
below the bent one          | specularColor=0,0,0 normal1AsShadingNormal=1 | .75 .9797959 0 .2 0 0 0
behind, opaque              | specularColor=0,0,0 I=0,0,1            | 0    0 0 1          0 0 0
behind, translucent         | specularColor=0,0,0 I=0,0,1 transparency=1 transparencyValue=.5 translucencyValue=.25 | 0 0 0 1 .03 .0117188 .0021875
the viewer's side of a back | specularColor=0,0,0 I=0,0,1            | 0    0 0 -1         .15 .0625 .0125
)")) {
        Ward w(line.settings);
        w.bend(line.want[0]);
        w.host.addLight(test::vec3(line.want, 1), {1, 0.5f, 0.25f}, {1, 1, 0.5f}, 0.5f);
        expectNear(w.shade(), test::vec3(line.want, 4), line.why, 2e-4);
    }
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
    // White, without lobe, lit by 1; the baked occlusion, unbound, is full.
    for (test::Line const& line : test::table(R"(
half a surface                            |                                                             | .5
occluded in full, whatever the cut-out    | ambientOcclusionMode=1                                      | 0
a quarter of the light, a quarter opaque  | ambientOcclusionMode=1 transparency=1 transparencyValue=.75 | .09375
additional colour, its amount unused      | diffuseColor=0,0,0 additionalColor=.3,0,0 additionalAmount=.5 | .15
with its map, clamped                     | diffuseColor=0,0,0 additionalColor=.3,0,0 additionalAmount=.5 additionalMapEnable=1 additionalMap=3,0,0,0 | .075
)")) {
        Ward w("diffuseColor=1,1,1 reflectivity=0 cutoutMapEnable=1 cutoutMap=.5,0,0,1 "
               + line.settings);
        w.host.addLight({0, 0, 1}, kWhite);
        EXPECT_FLOAT_EQ(w.shade().x, line.want[0]) << line.why;
    }
}

TEST(Ward, AsksTheHostInOrderAndTellsTheWeights)
{
    // z of the second vector; category or spread; importance. Half of what the reflectivity leaves
    // of the diffuse layer goes to the transparency; its filter is (0.8, 0.75, 0.7). Ambient and
    // indirect light are 1 each. Behind, 0.6 * 0.25 * 0.5 * 0.8 of the light comes through
    // diffused, 0.8 * 0.75 * 0.5 straight.
    constexpr char const* kFront =
        "traceThrough -0.8 0.5, getLightSamples 1 0, traceSpecular 0.8 0.3 0.45, "
        "traceRefraction -0.868 0.2 0.2, ambientLight 1, indirectDiffuse 1 0.15, occlusion 1 0.3, "
        "occlusion 1 1, traceThrough -0.8 1, ";
    constexpr char const* kBehind =
        "traceThrough 0.8 0.5, getLightSamples -1 0, getLightSamples 1 0, "
        "traceRefraction 0.747 0.2 0.3, ambientLight -1, indirectDiffuse -1 0.15, "
        "occlusion -1 0.3, ambientLight 1, indirectDiffuse 1 0.06, occlusion 1 0.12, "
        "occlusion -1 1, traceThrough 0.8 1, ";
    for (bool const far : {false, true}) {
        Ward w("transparency=1 usingRaytracedAO=1 usePrecalcAO=0 transparencyValue=.5 "
               "translucencyValue=.25 reflectGlossyValue=.3 refractGlossyValue=.2 "
               "maskingColor=.5,0,0 cutoutMapEnable=1 cutoutMap=.5,0,0,1");
        w.host.onAmbient = w.host.onIndirect = [](Vec3f, Vec3f) { return kWhite; };
        w.state.I = {0.6f, 0, far ? 0.8f : -0.8f};
        w.state.incomingIor = 1.1f;
        w.state.beyondIor = 1.2f;
        w.shade();
        std::ostringstream asked;
        asked.precision(3);
        for (test::Call const& call : w.host.calls) {
            asked << call.service << ' ' << call.vectors.at(1).z;
            for (float const scalar : call.scalars)
                asked << ' ' << scalar;
            asked << ", ";
        }
        EXPECT_EQ(asked.str(), far ? kBehind : kFront);
    }
}

TEST(Ward, RaysFollowNormalsMediaAndGlossiness)
{
    // Slope of the bump; direction; spread, or the category of lights.
    for (test::Line const& line : test::table(R"(
traceSpecular    | I=.6,0,-.8                      | 0    .6 0 .8            0
traceSpecular    | reflectGlossyValue=.3           | .5   -.8 0 .6           .3
traceSpecular    |                                 | 1.5  -.9987492 0 .05    0
traceRefraction  | I=.6,0,-.8 ior=1.5              | 0    .4 0 -.9165151     0
traceRefraction  | I=.70710678,0,.70710678 ior=1.5 | 0    .7071068 0 -.7071068 0
traceRefraction  | ior=0                           | 0    0 0 1              0
traceRefraction  | ior=1 refractGlossyMapEnable=1 refractGlossyMap=.25,0,0,1 refractGlossyAmount=2  | 0  0 0 -1  .0678168
traceRefraction  | ior=1 refractGlossyMapEnable=1 refractGlossyMap=.01,0,0,1 refractGlossyAmount=2  | 0  0 0 -1  .7319334
traceRefraction  | ior=1 refractGlossyMapEnable=1 refractGlossyMap=.009,0,0,1 | 0  0 0 -1  1
traceRefraction  | ior=1 refractGlossyMapEnable=1 refractGlossyMap=7,0,0,1 refractGlossyValue=.5    | 0  0 0 -1  0
getLightSamples  | I=-.9848078,0,-.1736482 normal1AsShadingNormal=1 | .8390996 -.1564345 0 .9876883 0
getLightSamples  | I=-.9993908,0,-.0348995 normal1AsShadingNormal=1 | .05 -.006096 0 .9999814 0
)")) { // the last: seen at 80 and 88 degrees, bent by 40 and 2.9 the other way, turned back to 89
        Ward w("transparency=1 transparencyValue=.5 " + line.settings);
        w.bend(line.want[0]);
        w.shade();
        int found = 0;
        for (test::Call const& call : w.host.calls)
            if (line.why.starts_with(call.service)) {
                ++found;
                expectNear(call.vectors.at(1), test::vec3(line.want, 1), line.why + line.settings,
                           1e-3);
                EXPECT_NEAR(call.scalars.at(0), line.want.at(4), 1e-5f) << line.settings;
            }
        EXPECT_EQ(found, 1) << line.why << line.settings;
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

TEST(Ward, SampleTurnsRandomNumbersIntoDirections)
{
    // Type; direction; lobe where its colour is 1; 1/density; random numbers. Widths 0.2 and 0.4,
    // half vectors by atan2(0.4 sin, 0.2 cos) and Gaussian slopes, the cosine lobe by the
    // concentric map, all in double.
    for (test::Line const& line : test::table(R"(
glossy, first quadrant    | | 4  .783404 .266502 .561475   .742096  1.29555  .1 .5
second                    | | 4  .444672 .427582 .787045   .626795  1.47433  .35 .5
third                     | | 4  .455493 -.209981 .865121  .896764  1.09042  .6 .25
of the mixture, fourth    | | 2  .834752 -.341115 .432237  .422896  3.40839  .6 .9 .75
on the tangent            | | 2  .826857 0 .562413         .741477  2.15197  .6 0 .5
diffuse, middle           | | 2  0 0 1                     .0691483 5.06758  .5 .5 .5
right of it               | | 2  .724444 .194114 .661438   1.02164  1.5963   0 .875 .625
above                     | | 2  .194114 .724444 .661438   .0428012 7.49325  0 .625 .875
left                      | | 2  -.724444 -.194114 .661438 0        9.49928  0 .125 .375
below                     | | 2  -.194114 -.724444 .661438 .00018331 9.48661 0 .375 .125
along the surface         | I=1,0,0 | 0  0 0 0  0 0  0 .5 .5
mirrored into it          | I=.70710678,0,-.70710678 | 0  0 0 0  0 0  .9 0 .9999
the same, glossy alone    | I=.70710678,0,-.70710678 | 0  0 0 0  0 0  0 .9999
nothing but the lobe: 0 still takes the other's direction | diffuseColor=0,0,0 | 2  .724444 .194114 .661438  1.02164  .959366  0 .875 .625
without a density that has an inverse | diffuseColor=0,0,0 roughValue=.01 | 0  0 0 0  0 0  0 .125 .375
of no width               | roughValue=0 | 0  0 0 0  0 0  .6 .5
)")) {
        SCOPED_TRACE(line.why);
        Ward w("anisotropyValue=2 I=.6,0,-.8 " + line.settings);
        w.host.randoms.assign(line.want.begin() + 6, line.want.end());
        bool const mixture = w.host.randoms.size() == 3;
        w.state.allowReflection[0] = 0;
        w.state.allowReflection[1] = mixture; // the third switch counts nothing
        w.material().sample(&w.host, w.state);
        ASSERT_EQ(float(w.state.sampleType), line.want[0]);
        if (w.state.sampleType == kSampleNone)
            continue;
        float const diffuse = line.settings.find("diffuse") == std::string::npos && mixture;
        EXPECT_EQ(w.host.randomCalls, mixture ? 3 : 2);
        expectNear(w.state.sampleDirection, test::vec3(line.want, 1), "direction");
        EXPECT_NEAR(w.state.sampleCosine, line.want[3], 1e-5f);
        EXPECT_NEAR(w.state.outBrdf.x, 0.45f * line.want[4] + 0.0954930f * diffuse, 2e-5f);
        EXPECT_NEAR(w.state.outBrdf.z, 0.35f * line.want[4] + 0.0636620f * diffuse, 2e-5f);
        EXPECT_NEAR(w.state.sampleInvPdf / line.want[5], 1, 1e-4f);
    }
}

/// Weights add up to what `transfer` integrates to, densities to solid angles, and the value of a
/// sample is that of `transfer`.
TEST(Ward, SamplesFollowTheirDensityAndTransfer)
{
    constexpr int kDraws = 20000, kGrid = 200;
    constexpr double kPi = 3.14159265358979;
    for (float const width : {0.15f, 0.6f})
        for (float const cosI : {0.95f, 0.25f})
            for (bool const mixture : {false, true}) {
                SCOPED_TRACE(testing::Message() << width << " " << cosI << " " << mixture);
                Ward w(mixture ? "anisotropyValue=2 anisoRotationValue=.4"
                               : "anisotropyValue=2 anisoRotationValue=.4 diffuseColor=0,0,0");
                w.set("u_roughValue", width);
                std::memset(w.state.allowReflection, mixture, 3);
                float const r = std::sqrt(1 - cosI * cosI);
                w.state.I = {-0.8f * r, -0.6f * r, -cosI};
                double want = 0;
                for (int i = 0; i < kGrid * kGrid; ++i) {
                    double const z2 = (i % kGrid + 0.5) / kGrid, s = std::sqrt(1 - z2);
                    double const phi = 2 * kPi * (i / kGrid) / kGrid;
                    test::Vec3d const l(s * std::cos(phi), s * std::sin(phi), std::sqrt(z2));
                    want += double(w.transfer(test::toFloat(l)).x) * kPi / (kGrid * kGrid);
                }
                // Weight; then cosine, and cosine times x^2 and y^2, over the hemisphere.
                double const wanted[] = {want, kPi, kPi / 4, kPi / 4};
                double sum[4] = {}, squares[4] = {};
                test::Random random;
                w.host.randoms.resize(mixture ? 3 : 2);
                for (int i = 0; i < kDraws; ++i) {
                    for (float& u : w.host.randoms)
                        u = random.in(0, 1);
                    w.material().sample(&w.host, w.state);
                    if (w.state.sampleType == kSampleNone)
                        continue;
                    Vec3f const d = w.state.sampleDirection, value = w.state.outBrdf;
                    double const k = double(w.state.sampleInvPdf) * double(w.state.sampleCosine);
                    double const terms[] = {k * double(value.x), k, k * double(d.x * d.x),
                                            k * double(d.y * d.y)};
                    for (int t = 0; t < 4; ++t) {
                        sum[t] += terms[t] / kDraws;
                        squares[t] += terms[t] * terms[t] / kDraws;
                    }
                    EXPECT_NEAR(std::sqrt(d.z) * (w.transfer(d).x - value.x), 0, 2e-3f);
                }
                for (int t = 0; t < (mixture ? 4 : 1); ++t) { // alone, the lobe leaves parts out
                    double const error = std::sqrt((squares[t] - sum[t] * sum[t]) / kDraws);
                    EXPECT_NEAR(sum[t], wanted[t], 4 * error + 3e-3 * wanted[t]) << t;
                }
            }
}

} // namespace
} // namespace zsi
