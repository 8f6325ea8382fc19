// The zsi command as a user meets it.
#include "support/hostScene.h"
#include "support/temporaryFolder.h"
#include "texture/textureStore.h"

#include <chrono>
#include <csignal>
#include <cstdlib>
#include <fstream>
#include <gtest/gtest.h>
#include <iterator>
#include <nlohmann/json.hpp>
#include <set>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

namespace zsi::test {
namespace {

namespace fs = std::filesystem;
using Json = nlohmann::json;

std::string content(fs::path const& file)
{
    std::ifstream in(file, std::ios::binary);
    return {std::istreambuf_iterator<char>(in), {}};
}

bool contains(std::string const& text, std::string const& part)
{
    return text.find(part) != std::string::npos;
}

/// Runs the command in a folder of its own that holds a scene: a ball before a card that fills
/// the picture and shows (0.5, 0.25, 1).
class Command : public testing::Test {
protected:
    Command()
    {
        folder_.write("scene.json", R"({
          "camera": {"position": [0, -3, 0], "target": [0, 0, 0]},
          "film": {"width": 32, "height": 24}, "settings": {"samples": 4},
          "meshes": {"card": {"plane": {"size": [9, 9]}}, "ball": {"sphere": {"radius": 0.5}}},
          "materials": {
            "flat": {"class": "corvid_Mtl_Unlit", "parameters": {"diffuseColor": [0.5, 0.25, 1]}},
            "lilac": {"class": "corvid_Mtl_Solid"}},
          "instances": {
            "card": {"mesh": "card", "material": "flat",
                     "transform": {"rotate": [1, 0, 0, 90], "translate": [0, 2, 0]}},
            "ball": {"mesh": "ball", "material": "lilac", "transform": {"translate": [0, 1, 0]}}}})");
        folder_.write("broken.json", "{\"camera\": 3}");
        fs::create_directory(path("folder.png"));
        before_ = files();
    }

    struct Result {
        int status;
        std::string out, err;
    };
    /// `setup`: shell text that stands before the command, such as an environment variable.
    Result zsi(std::string const& arguments, std::string const& setup = "") const
    {
        std::string const line = "cd '" + folder_.path.string() + "' && " + setup
            + " '" ZSI_COMMAND "' " + arguments + " >'" + path("out", streams_) + "' 2>'"
            + path("err", streams_) + "'";
        int const status = std::system(line.c_str());
        return {WIFEXITED(status) ? WEXITSTATUS(status) : -1, content(streams_.path / "out"),
                content(streams_.path / "err")};
    }
    std::string path(std::string const& name) const { return path(name, folder_); }
    std::set<std::string> files() const
    {
        std::set<std::string> names;
        for (auto const& entry : fs::directory_iterator(folder_.path))
            names.insert(entry.path().filename());
        return names;
    }
    void expectError(std::string const& arguments, int status,
                     std::vector<std::string> const& parts, std::string const& setup = "") const
    {
        Result const r = zsi(arguments, setup);
        EXPECT_EQ(r.status, status) << arguments;
        EXPECT_EQ(r.out, "") << arguments;
        EXPECT_TRUE(r.err.starts_with("zsi: ") && r.err.find('\n') == r.err.size() - 1) << r.err;
        for (std::string const& part : parts)
            EXPECT_TRUE(contains(r.err, part)) << '"' << part << "\" in: " << r.err;
        EXPECT_EQ(files(), before_) << arguments;
    }

    TemporaryFolder folder_;
    std::set<std::string> before_;

private:
    static std::string path(std::string const& name, TemporaryFolder const& folder)
    {
        return folder.path / name;
    }
    TemporaryFolder streams_;
};

Json defaultOf(host::Parameter const& p)
{
    using enum host::ParameterType;
    auto const floats = [&](std::size_t n) {
        auto const* const f = static_cast<float const*>(p.field);
        return Json(std::vector<float>(f, f + n));
    };
    switch (p.type) {
    case Bool:
        return *static_cast<bool const*>(p.field);
    case Int:
        return *static_cast<int const*>(p.field);
    case Float:
        return *static_cast<float const*>(p.field);
    case Vec2f:
        return floats(2);
    case Vec3f:
        return floats(3);
    case Vec4f:
        return floats(4);
    default:
        return nullptr; // textures are empty; no matrix of the library has a default
    }
}

/// Numbers of a description as the floats that they stand for.
Json asFloats(Json value)
{
    if (value.is_number_float())
        return value.get<float>();
    if (value.is_structured())
        for (Json& item : value)
            item = asFloats(item);
    return value;
}

TEST_F(Command, InfoTellsWhatTheLibraryRegisters)
{
    host::ShaderLibraries const& library = SceneBuilder::library();
    Json const list = Json::parse(zsi("info --json").out).at("classes");
    std::string const text = zsi("info").out;
    ASSERT_EQ(list.size(), library.classNames().size());
    for (Json const& entry : list) {
        host::Shader const shader = library.create(entry.at("name").get<std::string>());
        char const* const kinds[] = {"material", "light", "environment"};
        EXPECT_EQ(entry.at("kind"), kinds[shader.kind()]) << shader.className();
        EXPECT_TRUE(contains(text, shader.className() + ' ')) << shader.className();
    }
    // Of each kind, and between them every type of parameter.
    for (char const* name : {"BackgroundGeometry", "corvid_Env_Default", "corvid_Mtl_Ward_f05db29e",
                             "corvid_Mtl_Dielectric", "voSpotLight"}) {
        host::Shader const shader = library.create(name);
        Json const described = Json::parse(zsi(std::string("info --json ") + name).out);
        Json const& parameters = described.at("parameters");
        ASSERT_EQ(parameters.size(), shader.parameters().size()) << name;
        for (std::size_t i = 0; i < parameters.size(); ++i) {
            host::Parameter const& p = shader.parameters()[i];
            EXPECT_EQ(asFloats(parameters[i]),
                      Json({{"name", p.name},
                            {"type", host::typeName(p.type)},
                            {"meaning", p.meaning},
                            {"hasDefault", p.hasDefault},
                            {"default", p.hasDefault ? defaultOf(p) : Json()}}))
                << name;
        }
        Json attributes = Json::array();
        for (host::Attribute const& a : shader.attributes()) {
            char const* const types[] = {"Vec2f", "Vec3f", "Vec4f"};
            attributes.push_back(
                {{"name", a.name}, {"type", types[a.kind - 1]}, {"offset", a.offset}});
        }
        EXPECT_EQ(described.at("attributes"), attributes) << name;
    }

    std::string const spot = zsi("info voSpotLight").out;
    for (char const* part : {"voSpotLight: light", "entry points: illumination",
                             "color               Vec3f  (0.1, 1, 0.5)  ", "no vertex attributes"})
        EXPECT_TRUE(contains(spot, part)) << part << " in: " << spot;
    std::string const mirror = zsi("info corvid_Mtl_Mirror").out;
    for (char const* part : {"maskingUVMatrix          Mat3f      none        UV transform",
                             "vtxcolor  Vec4f  offset 8"})
        EXPECT_TRUE(contains(mirror, part)) << part << " in: " << mirror;
}

TEST_F(Command, AnotherLibraryComesByOptionOrEnvironment)
{
    std::string const tiny = ZSI_FIXTURE_DIR "/tinyShaders";
    std::string const old = ZSI_FIXTURE_DIR "/oldShaders";
    // A class whose object cannot be made has nothing to show, but keeps no other away.
    for (Result const& r :
         {zsi("info TinyMaterial --shader-path " + tiny),
          zsi("info TinyMaterial", "ZSI_SHADER_PATH=" + tiny),
          zsi("--shader-path " + tiny + " info TinyMaterial", "ZSI_SHADER_PATH=/nowhere")}) {
        EXPECT_EQ(r.status, 0) << r.err;
        EXPECT_TRUE(contains(r.out, "entry points: shade, transmission")) << r.out;
        EXPECT_TRUE(contains(r.out, "tint      Vec3f        none")) << r.out;
    }
    Result const r = zsi("info --shader-path " + tiny);
    EXPECT_EQ(r.status, 0) << r.err;
    EXPECT_TRUE(contains(r.out, "TinyLight") && contains(r.err, "warning: Broken")) << r.err;
    expectError("info --shader-path " + old, 1, {"version 2700", "version 2722"});
    expectError("info --shader-path /nowhere", 1, {"/nowhere", "No such file"});
}

TEST_F(Command, RendersEveryFormatAndOptionsOverrideTheScene)
{
    host::TextureStore pictures;
    for (char const* name : {"a.exr", "a.hdr", "a.png", "a.jpg"}) {
        Result const r = zsi(std::string("render scene.json -o ") + name);
        EXPECT_EQ(r.status, 0) << r.err;
        EXPECT_EQ(r.err, "") << "quiet in a pipe";
        EXPECT_TRUE(r.out.starts_with(std::string(name) + ": 32x24, 4 samples")
                    && contains(r.out, " 0 non-finite"))
            << r.out;
        Vec2f const corner{0.1f, 0.1f}, middle{0.5f, 0.5f};
        Vec4f c{0, 0, 0, 0}, m{0, 0, 0, 0};
        HostTexture2D const* const picture = pictures.load2D(path(name), host::ColorSpace::Auto);
        picture->lookup(&c, &corner);
        picture->lookup(&m, &middle);
        EXPECT_NEAR(c.x, 0.5f, 0.01f) << name;
        EXPECT_NEAR(c.y, 0.25f, 0.01f) << name;
        EXPECT_NEAR(c.z, 1.0f, 0.01f) << name;
        EXPECT_NEAR(m.y, 0.58f, 0.02f) << name << ": the ball is lilac";
    }
    std::string const whole = content(path("a.exr"));
    for (char const* options : {"--threads 1", "--threads 3 --samples 4", "--size 32x24"}) {
        EXPECT_EQ(zsi(std::string("render -o b.exr scene.json ") + options).status, 0);
        EXPECT_EQ(content(path("b.exr")), whole) << options;
    }
    zsi("render -o b.exr scene.json --seed 77");
    EXPECT_NE(content(path("b.exr")), whole);
    Result const r = zsi("render scene.json -o b.exr --size 64x50 --crop 10,20,33,50 --samples 2");
    EXPECT_TRUE(r.out.starts_with("b.exr: 23x30, 2 samples")) << r.out;
    EXPECT_EQ(files().size(), before_.size() + 5) << "nothing but the pictures";
}

TEST_F(Command, BadCallsEndInOneLineAndLeaveNothing)
{
    expectError("", 2, {"info or render"});
    expectError("rendr scene.json", 2, {"rendr", "did you mean render?"});
    expectError("info corvid_Mtl_Miror", 1, {"corvid_Mtl_Miror", "did you mean corvid_Mtl_Mirror"});
    expectError("info --jsn", 2, {"--jsn", "--json"});
    expectError("info a b", 2, {"unexpected argument"});
    expectError("render scene.json", 2, {"--output is required"});
    expectError("--threads 2 render scene.json -o a.png", 2, {"behind the subcommand"});
    for (auto const& [options, part] : std::initializer_list<std::pair<char const*, char const*>>{
             {"--sample 4", "did you mean --samples?"},
             {"--samples 0", "--samples"},
             {"--samples many", "--samples"},
             {"--threads -1", "--threads"},
             {"--seed 4294967296", "--seed"},
             {"--seed 1.5", "--seed"},
             {"--size 10", "WIDTHxHEIGHT"},
             {"--size 0x10", "--size 0x10"},
             {"--size 10x10x", "--size"},
             {"--crop 0,0,8", "X0,Y0,X1,Y1"},
             {"--crop 5,5,5,9", "--crop"},
             {"--crop 0,0,33,24", "32x24"}})
        expectError(std::string("render scene.json -o a.png ") + options, 2, {part});
    expectError("render missing.json -o a.png", 1, {"missing.json", "no such file"});
    expectError("render folder.png -o a.png", 1, {"folder.png", "expected a scene file"});
    expectError("render broken.json -o a.png", 1, {"broken.json", "camera"});
    expectError("render scene.json -o a.tiff", 1, {"a.tiff", ".exr"});
    expectError("render scene.json -o no/where.png", 1, {"no/where.png", "No such file"});
    expectError("render scene.json -o folder.png", 1, {"folder"});
    // Before the scene is looked at, since that may take long.
    expectError("render missing.json -o /proc/a.png", 1, {"/proc/a.png: cannot be written"});
    for (char const* name : {"a.exr", "a.hdr", "a.png", "a.jpg"})
        expectError(std::string("render scene.json --size 400x300 -o ") + name, 1,
                    {name, "cannot be written", "too large"}, "trap '' XFSZ; ulimit -f 4;");
}

TEST_F(Command, CtrlCLeavesNothing)
{
    pid_t const child = fork();
    if (child == 0) {
        if (chdir(folder_.path.c_str()) == 0 && freopen("/dev/null", "w", stderr))
            execl(ZSI_COMMAND, "zsi", "render", "scene.json", "-o", "a.png", "--samples", "1000000",
                  nullptr);
        _exit(99);
    }
    // The early check of the output proves that signals are caught by now.
    std::this_thread::sleep_for(std::chrono::milliseconds(1500));
    kill(child, SIGINT);
    int status = 0;
    waitpid(child, &status, 0);
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 130) << status;
    EXPECT_EQ(files(), before_);
}

} // namespace
} // namespace zsi::test
