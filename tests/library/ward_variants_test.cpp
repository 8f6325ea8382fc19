// The nine Ward variants through the loaded library: their networks against an oracle that knows
// them by parameter names only, and their shading against the Ward material.
#include "support/networkOracle.h"
#include "support/record.h"
#include "support/steadyHost.h"

#include <gtest/gtest.h>

namespace zsi {
namespace {

test::Library const& library() { return test::Library::instance(); }

std::vector<std::string> variants()
{
    std::vector<std::string> names;
    for (std::string const& name : library().classes)
        if (name.starts_with("corvid_Mtl_Ward_"))
            names.push_back(name);
    EXPECT_EQ(names.size(), 9u);
    return names;
}

/// The texture of a parameter, as the oracle knows it.
class NamedTexture final : public HostTexture2D {
public:
    explicit NamedTexture(std::string name)
        : name_(std::move(name))
    {
    }
    void reserved0() override { }
    void reserved1() override { }
    void lookup(Vec4f* result, Vec2f const* at) const override
    {
        test::Rgba const c = test::NetworkOracle::texel(name_, double(at->x), double(at->y));
        *result = {float(c[0]), float(c[1]), float(c[2]), float(c[3])};
    }

private:
    std::string name_;
};

/// A variant with its network switched on and filled with values at which every parameter counts.
struct Wired {
    std::unique_ptr<IShaderBase> shader;
    test::RecordingManager rows;
    std::map<std::string, test::Registered> byName;
    std::vector<std::unique_ptr<NamedTexture>> textures;
    bool diffuse = false, normal0 = false, cutout = false;

    explicit Wired(std::string const& name)
        : shader(library().create(name))
        , rows(*shader)
    {
        constexpr Mat4f kXform(0.83f, 0.21f, -0.17f, 0, -0.23f, 0.91f, 0.31f, 0, 0.12f, 0.07f,
                               0.77f, 0, 0.03f, 0.05f, -0.11f, 1);
        std::map<std::string, float> const numbers{{"type", 1},
                                                   {"size", 0.7f},
                                                   {"thresholdLow", 0.1f},
                                                   {"thresholdHigh", 0.9f},
                                                   {"levels", 2.4f},
                                                   {"phase", 0.3f},
                                                   {"amount", 0.8f},
                                                   {"isCube", 0},
                                                   {"verticalCount", 5.3f},
                                                   {"horizontalCount", 3.4f},
                                                   {"colorVariance", 0.4f},
                                                   {"fadeVariance", 0.3f},
                                                   {"horizontalGap", 0.08f},
                                                   {"verticalGap", 0.11f},
                                                   {"edgeRoughness", 9},
                                                   {"randomSeed", 3},
                                                   {"lineShift", 0.1f},
                                                   {"randomShift", 0.6f},
                                                   {"changeRow", 0.6f},
                                                   {"perRow", 3},
                                                   {"useColumnEdit", 1},
                                                   {"useRowEdit", 1},
                                                   {"changeColumn", 0.7f},
                                                   {"perColumn", 2},
                                                   {"holes", 1},
                                                   {"brickHeight", 1.2f},
                                                   {"brickWidth", 0.9f},
                                                   {"repeatX", 1},
                                                   {"repeatY", 1}};
        for (test::Registered const& row : rows.rows) {
            byName.emplace(row.name, row);
            if (row.type == "Mat3f")
                set(row.name, Mat3f(0.9f, 0.1f, 0, -0.2f, 0.8f, 0, 0.05f, 0.02f, 1));
            if (!row.name.starts_with("_ward_"))
                continue;
            diffuse = diffuse || row.name.starts_with("_ward_diffuse_color");
            normal0 = normal0 || row.name.starts_with("_ward_normal0_map");
            cutout = cutout || row.name.starts_with("_ward_cutout_map");
            if (row.type == "Mat4f")
                set(row.name, kXform);
            else if (row.type == "Vec4f")
                set(row.name,
                    row.name.ends_with("color1") ? Vec4f(0.1f, 0.7f, 0.3f, 0.2f)
                                                 : Vec4f(0.8f, 0.2f, 0.5f, 0.9f));
            else if (row.type == "Texture2D")
                set(row.name,
                    textures.emplace_back(std::make_unique<NamedTexture>(row.name)).get());
            else
                number(row.name, numbers.at(row.name.substr(row.name.rfind('_') + 1)));
        }
        number("u_reflectivity", 0);
        number("u_cosineUsesBump", 1);
        number("u_diffuseMapEnable", diffuse);
        number("u_normal0MapEnable", normal0);
        number("u_cutoutMapEnable", cutout);
        number("u_normal0Amount", 40);
        number("u_cutoutAmount", 0.7f);
        number("u_diffuseAmount", 0.123f); // not applied to a network
        set("u_diffuseColor", Vec3f(0.3f, 0.4f, 0.5f));
    }

    template <class T>
    void set(std::string const& name, T const& value)
    {
        std::memcpy(byName.at(name).field, &value, sizeof value);
    }
    void number(std::string const& name, float value)
    {
        std::string const& type = byName.at(name).type;
        if (type == "bool")
            set(name, value != 0.0f);
        else if (type == "int")
            set(name, static_cast<int>(value));
        else
            set(name, value);
    }

    /// Diffuse reflectance, cosine against the bumped normal, and what a shadow ray keeps.
    std::array<float, 5> evaluate(ShadeState state) const
    {
        test::ScriptedHost host;
        test::giveNoise(host);
        auto const& material = static_cast<MaterialShader const&>(*shader);
        material.transfer(&host, state);
        material.transmission(&host, state);
        Vec3f const albedo = state.outBrdf * 3.14159265f;
        return {albedo.x, albedo.y, albedo.z, state.sampleCosine, state.transmissionColor.x};
    }
};

constexpr Vec3f kLight(0.36f, 0.48f, 0.8f);

ShadeState site(test::Random& random)
{
    ShadeState s = test::plainHit();
    s.P = {random.in(-2, 2), random.in(-2, 2), 0};
    s.E = {s.P.x, s.P.y, 1};
    s.Pref = {random.in(-2, 2), random.in(-2, 2), random.in(-2, 2)};
    s.Nref = random.unit();
    s.sampleDirection = kLight;
    test::setAttribute(s, 0, Vec3f(0, 1, 0));
    test::setAttribute(s, 12, Vec3f(1, 0, 0));
    test::setAttribute(s, 24, Vec2f(random.in(-1, 2), random.in(-1, 2)));
    return s;
}

/// What `Wired::evaluate` should give.
std::array<double, 5> expected(test::NetworkOracle& oracle, Wired const& w, ShadeState const& s)
{
    std::vector<double> uv(2);
    auto const at = [&](char const* transform, double du, double dv, Vec3f step) {
        Vec2f raw;
        std::memcpy(&raw, s.attributes + 24, sizeof raw);
        std::vector<double> const m = transform ? oracle.values.at(transform)
                                                : std::vector<double>{1, 0, 0, 0, 1, 0, 0, 0, 1};
        oracle.uv[0] = m[0] * double(raw.x) + m[3] * double(raw.y) + m[6] + du;
        oracle.uv[1] = m[1] * double(raw.x) + m[4] * double(raw.y) + m[7] + dv;
        float const* p = &s.Pref.x;
        float const* n = &s.Nref.x;
        for (int i = 0; i < 3; ++i) {
            oracle.position[i] = double(p[i]) + 0.001 * double((&step.x)[i]);
            oracle.normal[i] = double(n[i]);
        }
    };
    std::array<double, 5> want{0.3f, 0.4f, 0.5f, double(kLight.z), 0};
    if (w.diffuse) {
        at(nullptr, 0, 0, {0, 0, 0});
        test::Rgba const c = oracle.evaluate("_ward_diffuse_color").value();
        bool const fade = oracle.values.at("u_imageFadeEnable").at(0) == 1;
        double const f = fade ? c[3] * oracle.values.at("u_imageFade").at(0) : 1;
        for (std::size_t i = 0; i < 3; ++i)
            want[i] = want[i] * (1 - f) + c[i] * f;
    }
    if (w.normal0) {
        auto const height = [&](double du, double dv, Vec3f step) {
            at("u_normal0Transform", du, dv, step);
            test::Rgba const c = oracle.evaluate("_ward_normal0_map").value();
            return c[0] + c[1] + c[2];
        };
        double const h = height(0, 0, {0, 0, 0});
        double const du = h - height(0.001, 0, {1, 0, 0}), dv = h - height(0, 0.001, {0, 1, 0});
        double const steepest = std::max(std::fabs(du), std::fabs(dv));
        double const k = steepest < 1e-5 ? 0 : oracle.values.at("u_normal0Amount").at(0) * 3.33;
        double const cosine =
            (du * k * double(kLight.x) + dv * k * double(kLight.y) + double(kLight.z))
            / std::sqrt(k * k * (du * du + dv * dv) + 1);
        want[3] = std::max(cosine, 0.0);
        if (want[3] == 0)
            want[0] = want[1] = want[2] = 0; // below the bumped horizon
        oracle.ambiguous =
            oracle.ambiguous || std::fabs(cosine) < 1e-2 || std::fabs(steepest - 1e-5) < 1e-6;
    }
    if (w.cutout) {
        at("u_cutoutTransform", 0, 0, {0, 0, 0});
        double const c = oracle.evaluate("_ward_cutout_map").value()[0];
        want[4] = 1 - c * oracle.values.at("u_cutoutAmount").at(0);
    }
    return want;
}

TEST(WardVariants, NetworksGiveWhatTheirParameterNamesSay)
{
    for (std::string const& name : variants()) {
        SCOPED_TRACE(name);
        Wired w(name);
        test::Random random;
        int compared = 0;
        for (int round = 0; round < 400; ++round) {
            // Other noise types, box projection and the alpha of the network take their turns.
            for (auto const& [parameter, row] : w.byName) {
                if (parameter.ends_with("_Noise_type"))
                    w.number(parameter, static_cast<float>(round % 4));
                if (parameter.ends_with("_isCube"))
                    w.number(parameter, static_cast<float>(round / 4 % 2));
            }
            w.number("u_imageFadeEnable", static_cast<float>(round / 8 % 2));
            w.number("u_imageFade", 0.6f);
            test::NetworkOracle oracle;
            oracle.read(w.rows);
            ShadeState const s = site(random);
            auto const want = expected(oracle, w, s);
            if (oracle.ambiguous)
                continue;
            ++compared;
            auto const got = w.evaluate(s);
            // A difference of two heights up to 3 is good to 5e-7; the amount scales it by 133.
            for (std::size_t i = 0; i < 5; ++i)
                ASSERT_NEAR(double(got[i]), want[i], i == 3 ? 2e-4 : 1e-4)
                    << "result " << i << " of round " << round;
        }
        EXPECT_GT(compared, 200);
    }
}

TEST(WardVariants, NetworksTurnAndGrowWithTheirObject)
{
    // Row by row, twice as large: x to y, y to z, z to x.
    Mat4f const turned(0, 2, 0, 0, 0, 0, 2, 0, 2, 0, 0, 0, 0, 0, 0, 1);
    for (std::string const& name : variants()) {
        Wired const w(name);
        test::Random random;
        for (int i = 0; i < 100; ++i) {
            ShadeState const s = site(random);
            ShadeState t = s;
            t.objectToWorld = turned;
            for (Vec3f ShadeState::*v :
                 {&ShadeState::E, &ShadeState::P, &ShadeState::I, &ShadeState::N, &ShadeState::Ng,
                  &ShadeState::sampleDirection})
                t.*v = transformDirection(turned, s.*v);
            for (Vec3f ShadeState::*v :
                 {&ShadeState::I, &ShadeState::N, &ShadeState::Ng, &ShadeState::sampleDirection})
                t.*v = normalize(t.*v);
            auto const want = w.evaluate(s), got = w.evaluate(t);
            for (std::size_t k = 0; k < want.size(); ++k)
                EXPECT_NEAR(got[k], want[k], 1e-3f) << name << " result " << k;
        }
    }
}

TEST(WardVariants, EqualTheWardMaterialWhereTheirNetworkIsOff)
{
    struct Attribute {
        std::size_t ward, variant, size;
    };
    constexpr Attribute kAttributes[] = {
        {0, 32, 8}, {8, 40, 16}, {24, 0, 12}, {36, 12, 12}, {48, 24, 8}};
    for (std::string const& name : variants())
        for (unsigned round = 0; round < 150; ++round) {
            SCOPED_TRACE(name + " round " + std::to_string(round));
            auto const ward = library().create("corvid_Mtl_Ward");
            test::RecordingManager const wardRows(*ward);
            test::Supply supply(round, false);
            test::fillParameters(wardRows, supply, false);
            Wired variant(name);
            for (test::Registered const& row : wardRows.rows) {
                bool const off = (row.name == "u_diffuseMapEnable" && variant.diffuse)
                    || (row.name == "u_normal0MapEnable" && variant.normal0)
                    || (row.name == "u_cutoutMapEnable" && variant.cutout);
                if (off)
                    *row.field = 0;
                if (row.field)
                    std::memcpy(variant.byName.at(row.name).field, row.field, row.size);
            }
            ShadeState const request = test::fillRecord(supply);
            for (test::EntryPointCall const& e : test::kEntryPoints) {
                if (e.kind != kMaterial)
                    continue;
                ShadeState a = request, b = request;
                for (Attribute const& at : kAttributes)
                    std::memcpy(b.attributes + at.variant, a.attributes + at.ward, at.size);
                test::SteadyHost hostA(round, false), hostB(round, false);
                e.call(*ward, &hostA, a);
                e.call(*variant.shader, &hostB, b);
                ASSERT_EQ(std::memcmp(&a, &b, offsetof(ShadeState, attributes)), 0) << e.name;
            }
        }
}

} // namespace
} // namespace zsi
