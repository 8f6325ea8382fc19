// SPDX-License-Identifier: Apache-2.0
// The zsi command as a user meets it: what it hands on and how it ends. What the parts below it
// make of their input is tested there.
#include "film/imageFile.h"
#include "load/loadScene.h"
#include "render/render.h"
#include "support/hostLibraries.h"
#include "support/inputError.h"
#include "support/temporaryFolder.h"

#include <array>
#include <chrono>
#include <csignal>
#include <cstdlib>
#include <fstream>
#include <gtest/gtest.h>
#include <iterator>
#include <nlohmann/json.hpp>
#include <pty.h>
#include <set>
#include <sstream>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

namespace zsi::test {
namespace {

namespace fs = std::filesystem;
using Json = nlohmann::json;

std::string const kTiny = ZSI_FIXTURE_DIR "/tinyShaders";

std::string content(fs::path const& file)
{
    std::ifstream in(file, std::ios::binary);
    return {std::istreambuf_iterator<char>(in), {}};
}

/// RFC 4648.
std::string base64(std::string const& bytes)
{
    static char const* const kDigits =
        "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    std::string text;
    for (std::size_t i = 0; i < bytes.size(); i += 3) {
        unsigned bits = 0;
        for (std::size_t k = 0; k < 3; ++k)
            bits =
                bits << 8 | (i + k < bytes.size() ? static_cast<unsigned char>(bytes[i + k]) : 0u);
        for (std::size_t k = 0; k < 4; ++k)
            text += i + k <= bytes.size() ? kDigits[bits >> (18 - 6 * k) & 63] : '=';
    }
    return text;
}

/// Runs the command in a folder of its own that holds a scene.
class Command : public testing::Test {
protected:
    Command()
    {
        fs::copy_file(fs::path(ZSI_SOURCE_DIR) / "tests/data/scenes/card.json",
                      folder_.path / "scene.json");
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
            + " '" ZSI_COMMAND "' " + arguments + " >'" + streams_.path.string() + "/out' 2>'"
            + streams_.path.string() + "/err'";
        int const status = std::system(line.c_str());
        return {WIFEXITED(status) ? WEXITSTATUS(status) : -1, content(streams_.path / "out"),
                content(streams_.path / "err")};
    }
    std::set<std::string> files() const
    {
        std::set<std::string> names;
        for (auto const& entry : fs::directory_iterator(folder_.path))
            names.insert(entry.path().filename());
        return names;
    }

    TemporaryFolder folder_;
    std::set<std::string> before_;

private:
    TemporaryFolder streams_;
};

TEST_F(Command, InfoTellsWhatTheLibrariesRegister)
{
    Json const list = Json::parse(zsi("info --json").out).at("classes");
    EXPECT_EQ(list.size() + 3, libraries().classNames().size()) << "all but the tests' own three";
    for (Json const& entry : list) {
        host::Shader const shader = libraries().create(entry.at("name").get<std::string>());
        char const* const kinds[] = {"material", "light", "environment"};
        EXPECT_EQ(entry.at("kind"), kinds[shader.kind()]) << shader.className();
    }

    EXPECT_EQ(Json::parse(zsi("info --json TinyMaterial", "ZSI_SHADER_PATH=" + kTiny).out),
              Json::parse(content(ZSI_SOURCE_DIR "/tests/data/tinyMaterial.json")));

    expectContains(zsi("info voSpotLight").out,
                   {"voSpotLight: light\nSpot light: ", "entry points: illumination",
                    "cosPenumbra         float  0.9            0 .. 1      cosine",
                    "no vertex attributes"});
    expectContains(
        zsi("--shader-path " + kTiny + " info TinyMaterial", "ZSI_SHADER_PATH=/nowhere").out,
        {"entry points: shade, transmission", " [look]\n  amount    float        0.1 ",
         "0 .. 2 by 0.5  how much\n [others]", "  linear RGB\n",
         "read with count 2 to 5, map or ramp\n", "vtxcolor  Vec4f  8\n"});
    // A word finds the classes that are about it.
    std::string const found = zsi("info CRYSTAL --shader-path " + kTiny).out;
    EXPECT_EQ(found, "  TinyMaterial  material  A material of one colour.\n");
    // A class whose object cannot be made has nothing to show, but keeps no other away.
    Result const all = zsi("info --shader-path " + kTiny);
    EXPECT_EQ(all.status, 0);
    expectContains(all.out, {"TinyMaterial ", "TinyLight "});
    expectContains(all.err, {"warning: Broken"});
}

TEST_F(Command, RendersTheSceneAndOptionsOverrideIt)
{
    host::Scene scene = host::loadScene(folder_.path / "scene.json", libraries());
    auto const expected = [&] {
        host::writePicture(folder_.path / "want.png", host::render(scene), {});
        return content(folder_.path / "want.png");
    };
    Result const plain = zsi("render scene.json -o a.png");
    EXPECT_EQ(plain.status, 0);
    EXPECT_EQ(plain.err, "") << "quiet in a pipe";
    expectContains(plain.out, {"a.png: 32x32, 4 samples", " 0 non-finite"});
    EXPECT_EQ(content(folder_.path / "a.png"), expected());

    Result const other = zsi("render -o b.png scene.json --size 64x50 --crop 10,20,33,50 "
                             "--samples 2 --seed 77 --threads 3");
    expectContains(other.out, {"b.png: 23x30, 2 samples"});
    scene.film.width = 64;
    scene.film.height = 50;
    scene.film.crop = {10, 20, 33, 50};
    scene.settings.samples = 2;
    scene.settings.seed = 77;
    EXPECT_EQ(content(folder_.path / "b.png"), expected());
    Result const piped = zsi("render - -q -o c.exr --set film.width=40 "
                             "--integrator path --layers depth --texture-cache 64 <scene.json");
    EXPECT_EQ(piped.out + piped.err, "");
    scene = host::loadScene(folder_.path / "scene.json", libraries(), {{"film.width=40"}});
    scene.settings.integrator = "path";
    scene.film.layers = {"depth"};
    host::writePicture(folder_.path / "want.exr", host::render(scene), {});
    EXPECT_TRUE(content(folder_.path / "c.exr") == content(folder_.path / "want.exr"));
    EXPECT_EQ(files().size(), before_.size() + 5) << "nothing but the pictures";
}

TEST_F(Command, AModelRendersAsTheSceneThatItConvertsTo)
{
    // A triangle whose picture lies in the file, in base64.
    std::string const png = content(ZSI_SOURCE_DIR "/assets/textures/checker.png");
    folder_.write("model.gltf",
                  R"({"asset": {"version": "2.0"}, "scenes": [{"nodes": [0]}],
      "nodes": [{"mesh": 0}], "materials": [{"pbrMetallicRoughness": {"metallicFactor": 0,
        "baseColorFactor": [1, 0.5, 0.5, 1], "baseColorTexture": {"index": 0}},
        "extensions": {"KHR_materials_sheen": {}}}],
      "textures": [{"source": 0}], "images": [{"uri": "data:image/png;base64,)"
                      + base64(png) + R"("}],
      "meshes": [{"primitives": [{"attributes": {"POSITION": 0}, "material": 0}]}],
      "accessors": [{"bufferView": 0, "componentType": 5121, "count": 3, "type": "VEC3"}],
      "bufferViews": [{"buffer": 0, "byteLength": 9}],
      "buffers": [{"byteLength": 9, "uri": "data:application/octet-stream;base64,AAAAAQAAAAEA"}]})");
    std::string const small = " -o picture.png --quiet --size 30x20 --samples 2";
    Result const direct = zsi("render model.gltf -o picture.png --size 30x20 --samples 2");
    ASSERT_EQ(direct.status, 0) << direct.err;
    EXPECT_EQ(
        direct.err,
        "zsi: warning: model.gltf: sheen has no counterpart and is left out (materials[0])\n");
    std::string const picture = content(folder_.path / "picture.png");
    fs::create_directory(folder_.path / "sub");
    for (std::string const name : {"converted", "sub/converted"}) {
        EXPECT_EQ(zsi("convert model.gltf " + name + ".json --quiet").err, "");
        EXPECT_EQ(content(folder_.path / (name + "_pictures/0.png")), png);
        fs::remove(folder_.path / "picture.png");
        EXPECT_EQ(zsi("render " + name + ".json" + small).err, "");
        EXPECT_EQ(content(folder_.path / "picture.png"), picture) << name;
    }
    EXPECT_EQ(zsi("render model.gltf" + small + " --set materials=null").status, 1);
    expectContains(zsi("convert scene.json x.json").err, {"scene.json: expected a model"});
    expectContains(zsi("convert model.gltf /no/such/x.json").err,
                   {"/no/such/x.json: cannot be written"});
    EXPECT_EQ(zsi("convert model.gltf x.txt").status, 2);
}

TEST_F(Command, DenoisesAfterRenderingOrLater)
{
    std::string const render = "render scene.json --layers halves,depth,objectId --samples 5 ";
    zsi(render + "-o noisy.exr");
    Result const later = zsi("denoise noisy.exr -o later.exr");
    expectContains(later.out, {"later.exr: 32x32, denoised"});
    zsi(render + "--denoise --threads 3 -o now.exr");
    // The same file: the other layers and their texts have come through as well.
    EXPECT_TRUE(content(folder_.path / "later.exr") == content(folder_.path / "now.exr"));
    EXPECT_FALSE(content(folder_.path / "later.exr") == content(folder_.path / "noisy.exr"));
    zsi("render scene.json -o plain.exr");
    Result const plain = zsi("denoise plain.exr -o nothing.png");
    EXPECT_EQ(plain.status, 1);
    expectContains(plain.err, {"plain.exr", "halfA", "--layers halves"});
    EXPECT_FALSE(fs::exists(folder_.path / "nothing.png"));
}

TEST_F(Command, UnitsOfFoldersAndListsMergeToTheBytesOfOneRender)
{
    std::string const options = "scene.json --set film.exposure=1 --layers halves ";
    zsi("render " + options + "-o want.exr");
    zsi("render scene.json --set film.exposure=1 -o want.png --denoise --view plain");
    fs::create_directory(folder_.path / "units");
    char const* const places[] = {"--window 0,0,32,9 ", "--window 0,9,32,32 --samples 0:1 ",
                                  "--window 0,9,32,32 --samples 1:4 "};
    std::string list;
    for (char const* place : places) {
        std::string const name = "units/" + std::to_string(list.size() / 12) + ".exr";
        EXPECT_EQ(zsi("render-unit -q " + options + place + "-o " + name).err, "");
        list += name + '\n';
    }
    std::ofstream(folder_.path / "list") << list;
    Result const merged = zsi("merge units -o got.exr");
    expectContains(merged.out, {"got.exr: 32x32, 4 samples a pixel, 3 units, ", " rays"});
    EXPECT_TRUE(content(folder_.path / "got.exr") == content(folder_.path / "want.exr"));
    zsi("merge --list - -q -o got.png --denoise --view plain --threads 1 <list");
    EXPECT_TRUE(content(folder_.path / "got.png") == content(folder_.path / "want.png"));

    fs::remove(folder_.path / "units" / "0.exr");
    Result const lacking = zsi("merge units -o part.exr");
    EXPECT_EQ(lacking.status, 1);
    EXPECT_EQ(lacking.err,
              "zsi: missing: samples 0 to 4 of 0,0,32,9 (--partial takes what there is)\n");
    fs::resize_file(folder_.path / "units" / "1.exr", 3000);
    EXPECT_EQ(zsi("merge units --partial -o /proc/a.exr").status, 1);
    EXPECT_FALSE(fs::exists(folder_.path / "part.exr"));
    Result const partial = zsi("merge units --partial -o part.exr");
    EXPECT_EQ(partial.status, 0);
    expectContains(partial.err, {"warning: units/1.exr: ", "left out"});
    expectContains(partial.out, {"1 units", "missing: samples 0 to 4 of 0,0,32,9; samples 0 to 1"});
}

TEST_F(Command, LabWritesFiguresAndChecksFailByExitStatus)
{
    std::string const library = " --shader-path " ZSI_FIXTURE_DIR "/labShaders";
    Result const r =
        zsi("lab Lambert color=1,0.5,0.25 -o a/b --draws 2048 --angles 0,40" + library);
    EXPECT_EQ(r.status, 0) << r.err;
    EXPECT_EQ(r.err, "");
    Json const summary = Json::parse(content(folder_.path / "a/b/lab.json"));
    for (Json const& name : summary.at("files"))
        EXPECT_FALSE(content(folder_.path / "a/b" / name.get<std::string>()).empty()) << name;
    EXPECT_EQ(summary.at("density").size(), 2u);
    EXPECT_EQ(content(folder_.path / "a/b/slice.png").substr(1, 3), "PNG");
    EXPECT_TRUE(content(folder_.path / "a/b/lobe.csv").starts_with("material,incident_deg,"));
    fs::remove_all(folder_.path / "a");

    Result const right = zsi("lab --check" + library);
    EXPECT_EQ(right.status, 0) << right.out;
    expectContains(right.out, {"ok     Lambert  density: chi-square "});
    Result const wrong = zsi("lab --check -q Lambert Lambert defect=2" + library);
    EXPECT_EQ(wrong.status, 1);
    EXPECT_TRUE(wrong.out.starts_with("FAIL   Lambert defect=2  density: ")) << wrong.out;
    EXPECT_EQ(wrong.out.find('\n'), wrong.out.size() - 1) << wrong.out;
    EXPECT_EQ(files(), before_);
}

TEST_F(Command, ProgressFitsTheTerminal)
{
    for (unsigned short const columns : std::array<unsigned short, 2>{30, 100}) {
        winsize const size{24, columns, 0, 0};
        int terminal = -1;
        pid_t const child = forkpty(&terminal, nullptr, nullptr, &size);
        if (child == 0) {
            if (chdir(folder_.path.c_str()) == 0)
                execl(ZSI_COMMAND, "zsi", "render", "scene.json", "-o", "/dev/null", "-o", "a.png",
                      "--size", "400x400", nullptr);
            _exit(99);
        }
        std::string all;
        char part[4096];
        for (ssize_t n; (n = read(terminal, part, sizeof(part))) > 0;)
            all.append(part, static_cast<std::size_t>(n));
        waitpid(child, nullptr, 0);
        close(terminal);
        EXPECT_NE(all.find("rendering "), std::string::npos) << all;
        EXPECT_EQ(all.find("rendering [") != std::string::npos, columns == 100);
        std::istringstream lines(all.substr(0, all.find("a.png:")));
        for (std::string line; std::getline(lines, line, '\r');)
            EXPECT_LT(line.substr(0, line.find('\033')).size(), columns) << line;
    }
}

TEST_F(Command, ProgramsFollowTheRenderByLinesAndPreviews)
{
    zsi("render scene.json -o want.exr --samples 200 --size 200x200");
    Result const r = zsi("render scene.json -q -o a.exr --samples 200 --size 200x200 --progress "
                         "--preview-every 0.001",
                         "{ timeout 60 sh -c 'until [ -s seen.exr ]; do cp a.exr seen.exr; done' "
                         "2>/dev/null & } ;");
    ASSERT_EQ(r.status, 0) << r.err;
    EXPECT_TRUE(content(folder_.path / "a.exr") == content(folder_.path / "want.exr"));
    EXPECT_EQ(host::readPicture(folder_.path / "seen.exr").width(), 200);
    EXPECT_FALSE(content(folder_.path / "seen.exr") == content(folder_.path / "want.exr"));
    std::istringstream lines(r.err);
    double last = 0;
    int rendering = 0;
    for (std::string line, name, word, what; std::getline(lines, line);) {
        std::istringstream words(line);
        double share = -1;
        words >> name >> word >> share >> what;
        EXPECT_EQ(name + word, "zsi:progress") << line;
        if (what != "rendering,")
            continue;
        ++rendering;
        EXPECT_GE(share, last) << line;
        EXPECT_LE(share, 1.0) << line;
        last = share;
    }
    EXPECT_GT(rendering, 0) << r.err;
}

TEST_F(Command, BadCallsEndInOneLineAndLeaveNothing)
{
    struct Call {
        std::string arguments;
        int status;
        std::vector<std::string> parts;
    };
    std::string const render = "render scene.json -o a.png ";
    Call const calls[] = {
        {"", 2, {"info, render, view, convert, denoise, schema"}},
        {"view absent.json", 1, {"absent.json"}},
        {"view scene.json --bind nowhere", 1, {"cannot listen on nowhere"}},
        {"rendr scene.json", 2, {"rendr", "did you mean render?"}},
        {"info a b", 2, {"unexpected argument"}},
        {"--threads 2 render scene.json -o a.png", 2, {"behind the subcommand"}},
        {render + "--sample 4", 2, {"did you mean --samples?"}},
        {render + "--samples 0", 2, {"--samples"}},
        {render + "--seed 4294967296", 2, {"--seed"}},
        {render + "--size 0x10", 2, {"--size 0x10", "WIDTHxHEIGHT"}},
        {render + "--size 10x10x", 2, {"--size"}},
        {render + "--crop 5,5,5,9", 2, {"--crop", "X0,Y0,X1,Y1"}},
        {render + "--crop 0,0,33,24", 2, {"32x32"}},
        {render + "--integrator pth", 2, {"--integrator pth", "did you mean path?"}},
        {render + "--view neutrl", 1, {"\"neutrl\"", "expected neutral"}},
        {render + "--ocio none.ocio", 1, {"none.ocio"}},
        {render + "--layers depth", 2, {"--layers", "expected an .exr"}},
        {render + "--set film.width=0", 1, {"--set: film.width: expected"}},
        {"render-unit scene.json -o a.exr --samples 4:4", 2, {"--samples 4:4", "A:B"}},
        {"render-unit scene.json -o a.exr --samples 0:9", 1, {"0 to 9", "has 4"}},
        {"render-unit scene.json -o a.png", 2, {".exr"}},
        {"merge -o a.exr", 2, {"no units"}},
        {"merge . -o a.exr", 1, {".: has no .exr files"}},
        {"merge scene.json -o a.exr", 1, {"scene.json"}},
        {"lab -o a", 2, {"--merl FILE"}},
        {"lab corvid_Mtl_Metal", 2, {"--output"}},
        {"lab corvid_Mtl_Metl -o a", 1, {"did you mean corvid_Mtl_Metal"}},
        {"lab corvid_Mtl_Metal --angles 90 -o a", 2, {"--angles"}},
        {"lab corvid_Mtl_Metal --merl scene.json -o a", 1, {"scene.json: expected a MERL table"}},
        {"lab corvid_Mtl_Metal -o scene.json", 1, {"scene.json: no folder"}},
        {"lab corvid_Mtl_Metal -o /proc", 1, {"/proc/lab.json: cannot be written"}},
        {"info --shader-path " ZSI_FIXTURE_DIR "/oldShaders", 1, {"version 2700", "version 2722"}},
        // Before the scene is looked at, since that may take long.
        {"render missing.json -o /proc/a.png", 1, {"/proc/a.png: cannot be written"}},
    };
    for (Call const& call : calls) {
        Result const r = zsi(call.arguments);
        EXPECT_EQ(r.status, call.status) << call.arguments;
        EXPECT_EQ(r.out, "") << call.arguments;
        EXPECT_TRUE(r.err.starts_with("zsi: ") && r.err.find('\n') == r.err.size() - 1) << r.err;
        expectContains(r.err, call.parts);
        EXPECT_EQ(files(), before_) << call.arguments;
    }
}

TEST_F(Command, TheOutputIsWhatTheNameLeadsTo)
{
    zsi("render scene.json -o want.png");
    std::string const want = content(folder_.path / "want.png");
    auto const at = [&](char const* name) { return folder_.path / name; };
    std::ofstream(at("old.png")) << "old";
    fs::permissions(at("old.png"), fs::perms(0640));
    fs::create_symlink("old.png", at("link.png"));
    fs::create_symlink("/dev/stdout", at("stdout.png"));
    std::string const longName = std::string(251, 'a') + ".png";
    zsi("render scene.json -o link.png");
    EXPECT_TRUE(fs::is_symlink(at("link.png")));
    EXPECT_EQ(content(at("old.png")), want);
    EXPECT_EQ(fs::status(at("old.png")).permissions(), fs::perms(0640));
    EXPECT_TRUE(zsi("render scene.json -o stdout.png").out.starts_with(want));
    zsi("render scene.json -o " + longName);
    EXPECT_EQ(content(folder_.path / longName), want);
    zsi("render scene.json -o pipe.png", "mkfifo pipe.png; cat pipe.png >copy & ");
    std::system("sleep 0.2"); // until the reader has written what it read
    EXPECT_EQ(content(at("copy")), want);

    before_ = files();
    // 4 kB are less than this picture.
    Result const full =
        zsi("render scene.json -o a.hdr --size 400x400 --samples 1", "ulimit -f 8;");
    EXPECT_EQ(full.status, 1);
    EXPECT_EQ(full.err, "zsi: a.hdr: cannot be written: File too large\n");
    EXPECT_EQ(files(), before_);
}

#ifndef __SANITIZE_ADDRESS__ // reserves more than any limit
TEST_F(Command, WithLittleMemoryThereIsThePictureOrOneLine)
{
    zsi("render scene.json -o want.png");
    int told = 0;
    // Where the libraries under the host start up, where devices are made, and where it is enough.
    for (int const megabytes : {470, 490, 540, 600, 620, 640, 900}) {
        fs::remove(folder_.path / "a.png");
        Result const r = zsi("render scene.json -o a.png",
                             "ulimit -v " + std::to_string(megabytes * 1024) + ";");
        SCOPED_TRACE(std::to_string(megabytes) + " MB: " + r.err);
        if (r.status == 0) {
            EXPECT_EQ(content(folder_.path / "a.png"), content(folder_.path / "want.png"));
            continue;
        }
        ++told;
        EXPECT_TRUE(r.status == 1 && r.err.starts_with("zsi: ")) << r.status;
        EXPECT_EQ(r.err.find('\n'), r.err.size() - 1);
        EXPECT_FALSE(fs::exists(folder_.path / "a.png"));
    }
    EXPECT_TRUE(told > 0 && told < 7) << told;
}
#endif

TEST_F(Command, WhatIsStoppedIsWrittenAndWhatIsKilledGoesOn)
{
    std::vector<char const*> call{
        ZSI_COMMAND, "render",   "scene.json",         "-o", "a.exr", "--samples",
        "3000",      "--resume", "--checkpoint-every", "0",  nullptr};
    /// Sends the signal after the render has kept its state `delay` ago; the status of the end.
    auto const stopped = [&](int signal, int delay) {
        fs::path const state = folder_.path / "a.exr.checkpoint";
        std::string const before = content(state);
        pid_t const child = fork();
        if (child == 0) {
            if (chdir(folder_.path.c_str()) == 0 && freopen("err", "w", stderr)
                && freopen("/dev/null", "w", stdout))
                execv(ZSI_COMMAND, const_cast<char* const*>(call.data()));
            _exit(99);
        }
        int status = 0;
        while (content(state) == before && waitpid(child, &status, WNOHANG) == 0)
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        std::this_thread::sleep_for(std::chrono::milliseconds(delay));
        kill(child, signal);
        waitpid(child, &status, 0);
        return status;
    };
    zsi("render scene.json -o want.exr --samples 3000");
    for (int const delay : {0, 7, 20, 3, 50}) {
        int const status = stopped(SIGKILL, delay);
        EXPECT_TRUE(WIFSIGNALED(status)) << "ended by itself before it was killed";
    }
    EXPECT_FALSE(fs::exists(folder_.path / "a.exr"));
    int const status = stopped(SIGINT, 5);
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 130) << status;
    expectContains(content(folder_.path / "err"), {"zsi: interrupted; a.exr has ", " samples"});
    EXPECT_TRUE(fs::exists(folder_.path / "a.exr"));
    EXPECT_EQ(zsi("render scene.json -o a.exr --samples 3000 --resume").status, 0);
    EXPECT_TRUE(content(folder_.path / "a.exr") == content(folder_.path / "want.exr"));
    EXPECT_FALSE(fs::exists(folder_.path / "a.exr.checkpoint"));
}

} // namespace
} // namespace zsi::test
