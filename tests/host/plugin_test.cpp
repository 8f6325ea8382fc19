// SPDX-License-Identifier: Apache-2.0
#include "plugin/shaderLibrary.h"
#include "plugin/symbolTable.h"
#include "support/hostLibraries.h"
#include "support/inputError.h"
#include "support/temporaryFolder.h"

#include <cstdlib>
#include <fstream>
#include <gtest/gtest.h>
#include <random>

namespace zsi::host {
namespace {

namespace fs = std::filesystem;
using test::errorOf;
using test::expectContains;
using test::libraries;
using test::value;

fs::path fixture(std::string const& name)
{
    return fs::path(ZSI_FIXTURE_DIR) / name / (name + ".so");
}

std::string content(fs::path const& file)
{
    std::ifstream in(file, std::ios::binary);
    return {std::istreambuf_iterator<char>(in), {}};
}

TEST(Plugin, EveryNumberOfTheLibraryHasASliderAroundItsDefault)
{
    ShaderLibraries own;
    own.load(ZSI_SHADER_LIBRARY);
    for (std::string const& name : own.classNames()) {
        Shader const shader = own.create(name);
        EXPECT_TRUE(shader.summary().ends_with('.')) << name;
        for (Parameter const& p : shader.parameters()) {
            bool const isFloat = p.type == ParameterType::Float;
            EXPECT_EQ(p.about.slider.has_value(), isFloat || p.type == ParameterType::Int)
                << name << ' ' << p.name;
            if (!p.about.slider)
                continue;
            float const value = isFloat ? *static_cast<float*>(p.field)
                                        : static_cast<float>(*static_cast<int*>(p.field));
            auto const minimum = static_cast<float>(p.about.slider->minimum);
            auto const maximum = static_cast<float>(p.about.slider->maximum);
            EXPECT_LT(minimum, maximum) << name << ' ' << p.name;
            EXPECT_TRUE(!p.about.hasDefault || (value >= minimum && value <= maximum))
                << name << ' ' << p.name;
        }
    }
}

TEST(Plugin, ObjectsOutliveTheirLibraries)
{
    // A file of its own, which nothing else keeps loaded.
    test::TemporaryFolder const folder;
    fs::copy_file(fixture("tinyShaders"), folder.path / "own.so");
    auto libraries = std::make_unique<ShaderLibraries>();
    libraries->load(folder.path / "own.so");
    Shader first = libraries->create("TinyMaterial");
    Shader second = libraries->create("TinyLight");
    libraries.reset();
    second = std::move(first);
    ShadeState state;
    second.material()->shade(nullptr, state);
    EXPECT_EQ(state.Ci.y, 0.2f);
}

TEST(Plugin, WritesValuesByNameAndType)
{
    Shader shader = libraries().create("TinyMaterial");
    auto const* const texture = reinterpret_cast<HostTexture2D const*>(&shader);
    shader.set("flag", false);
    shader.set("count", -7);
    shader.set("amount", 2);
    shader.set("tint", Vec3f(4, 5, 6));
    shader.set("matrix", Mat4f::identity());
    shader.set("map", texture);
    EXPECT_FALSE(value<bool>(shader, "flag"));
    EXPECT_EQ(value<int>(shader, "count"), -7);
    EXPECT_EQ(value<float>(shader, "amount"), 2.0f);
    EXPECT_EQ(value<Vec3f>(shader, "tint"), Vec3f(4, 5, 6));
    EXPECT_EQ(value<Mat4f>(shader, "matrix").m[15], 1.0f);
    EXPECT_EQ(value<TextureSampler2D>(shader, "map").texture, texture);
    EXPECT_EQ(value<TextureSampler2D>(shader, "map").index, -1);
    // Neighbours of the written fields keep their defaults.
    EXPECT_EQ(value<Vec2f>(shader, "pair").y, 2.0f);
    EXPECT_EQ(value<Vec4f>(shader, "quad").x, 1.0f);

    expectContains(errorOf([&] { shader.set("amuont", 1.0f); }),
                   {"amuont", "TinyMaterial", "did you mean amount?"});
    expectContains(errorOf([&] { shader.set("count", 1.5f); }), {"count", "int", "float"});
    expectContains(errorOf([&] { shader.set("cube", texture); }), {"textureCube", "texture2D"});
}

TEST(Plugin, BadLibrariesAreTurnedAway)
{
    test::TemporaryFolder folder;
    std::string foreign = content(fixture("tinyShaders"));
    foreign[18] = static_cast<char>(0xb7); // the machine of its header: AArch64
    struct Case {
        fs::path file;
        std::vector<std::string> message;
    };
    Case const cases[] = {
        {fixture("oldShaders"), {"oldShaders.so", "2700", std::to_string(kApiVersion)}},
        {fixture("noShaders"), {"noShaders.so", "no shader classes"}},
        {folder.write("text.so", "this is a text file\n"), {"text.so", "not a shared object"}},
        {folder.write("empty.so", ""), {"empty.so", "not a shared object"}},
        {folder.write("foreign.so", foreign), {"foreign.so", "for this machine"}},
        {folder.path / "missing.so", {"missing.so", "no such file"}},
        {folder.path, {"no such file"}},
    };
    for (Case const& c : cases) {
        ShaderLibraries libraries;
        expectContains(errorOf([&] { libraries.load(c.file); }), c.message);
        EXPECT_TRUE(libraries.classNames().empty()) << c.file;
    }

    expectContains(errorOf([&] { libraries().create("Broken"); }), {"Broken", "could not create"});
    expectContains(errorOf([&] { libraries().create("tinymateral"); }), {"mean TinyMaterial?"});
    ShaderLibraries stray;
    stray.load(fixture("strayShaders"));
    expectContains(errorOf([&] { stray.create("TinyMaterial"); }), {"vtxcolor", "56"});
}

TEST(Plugin, ADirectoryLoadsWhatItCan)
{
    test::TemporaryFolder folder;
    ShaderLibraries libraries;
    expectContains(errorOf([&] { libraries.loadDirectory(folder.path); }), {"no usable"});
    expectContains(errorOf([&] { libraries.loadDirectory(folder.path / "none"); }),
                   {"cannot open"});
    folder.write("a.so", "text");
    folder.write("notes.txt", "text");
    expectContains(errorOf([&] { libraries.loadDirectory(folder.path); }), {"no usable", "a.so"});
    fs::copy_file(fixture("tinyShaders"), folder.path / "b.so");
    std::vector<std::string> const leftOut = libraries.loadDirectory(folder.path);
    ASSERT_EQ(leftOut.size(), 1u);
    expectContains(leftOut[0], {"a.so"});
    EXPECT_TRUE(libraries.has("TinyMaterial"));

    folder.write("b.json", "{\"TinyMaterial\": {\"parameters\": {\"amount\": 3}}}");
    expectContains(errorOf([&] { libraries.load(folder.path / "b.so"); }), {"b.json"});
}

/// Damaged files: cut short anywhere, or with bytes overwritten. No crash, and either an error or
/// names; what memory checkers say counts too.
TEST(Plugin, ReadsDamagedSharedObjects)
{
    std::string const good = content(fixture("tinyShaders"));
    ASSERT_GT(good.size(), 1000u);
    test::TemporaryFolder folder;
    std::mt19937 random(7);
    int errors = 0;
    for (int round = 0; round < 150; ++round) {
        std::string bad = good;
        if (round % 2) {
            bad.resize(random() % good.size());
        } else {
            // The header, and the section table at the end.
            for (int k = 0; k < 8; ++k) {
                std::size_t const back = random() % 2400;
                bad[back < 64 ? back : bad.size() - back] = static_cast<char>(random());
            }
        }
        fs::path const file = folder.write("bad.so", bad);
        errors += errorOf([&] { exportedFunctions(file); }) != "no error";
    }
    EXPECT_GT(errors, 75);
}

TEST(Names, NearOnesFirst)
{
    std::vector<std::string> const names{"u_ior", "u_roughMapTransform", "u_roughValue", "u_color",
                                         "corvid_Mtl_Solid"};
    struct Case {
        char const* typed;
        std::vector<std::string> want;
    };
    Case const cases[] = {
        {"u_iro", {"u_ior"}},
        {"U_IOR", {"u_ior"}},
        {"u_colour", {"u_color"}},
        {"Solid", {"corvid_Mtl_Solid"}},
        {"u_roughness", {"u_roughValue"}},
        {"zzz", {}},
        {"", {}},
    };
    for (Case const& c : cases)
        EXPECT_EQ(nearestNames(c.typed, names), c.want) << c.typed;
    EXPECT_TRUE(nearestNames(std::string(1000000, 'a'), names).empty());
    EXPECT_EQ(printable("a\x1b[31m\n"), "a\\x1b[31m\\x0a");
}

TEST(Plugin, LooksWhereItIsTold)
{
    ::setenv("ZSI_SHADER_PATH", "/one::/two", 1);
    EXPECT_EQ(shaderDirectories(""), (std::vector<fs::path>{"/one", "/two"}));
    EXPECT_EQ(shaderDirectories("/three"), (std::vector<fs::path>{"/three"}));
    ::unsetenv("ZSI_SHADER_PATH");
    fs::path const program = fs::read_symlink("/proc/self/exe");
    EXPECT_EQ(shaderDirectories(""), (std::vector<fs::path>{program.parent_path() / "shaders"}));
}

} // namespace
} // namespace zsi::host
