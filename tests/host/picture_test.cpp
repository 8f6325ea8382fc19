// SPDX-License-Identifier: Apache-2.0
// From a scene file to picture files.
#include "film/imageFile.h"
#include "load/loadScene.h"
#include "render/render.h"
#include "support/hostLibraries.h"
#include "support/inputError.h"
#include "support/record.h"
#include "support/temporaryFolder.h"
#include "texture/textureStore.h"

#include <OpenImageIO/imageio.h>
#include <cmath>
#include <csignal>
#include <fstream>
#include <gtest/gtest.h>
#include <random>
#include <sys/resource.h>

namespace zsi::host {
namespace {

namespace fs = std::filesystem;
using test::errorOf;
using test::expectContains;

TEST(PictureFile, EveryFormatShowsTheScene)
{
    test::TemporaryFolder const folder;
    fs::path const scenePath = fs::path(ZSI_SOURCE_DIR) / "tests/data/scenes/card.json";
    Scene const scene = loadScene(scenePath, test::libraries());
    Picture const picture = render(scene);
    TextureStore pictures;
    for (char const* name : {"a.exr", "a.hdr", "a.png", "a.jpg"}) {
        writePicture(folder.path / name, picture, {.view = "plain"});
        HostTexture2D const* const file = pictures.load2D(folder.path / name, ColorSpace::Auto);
        struct Place {
            Vec2f uv; ///< from the bottom left
            Vec3f want;
            float tolerance;
        };
        Vec3f const card{0.5f, 0.25f, 1}, lilac{0.68f, 0.57f, 0.68f};
        for (Place const& place :
             {Place{{0.25f, 0.75f}, lilac, 0.05f}, Place{{0.75f, 0.75f}, card, 0.01f},
              Place{{0.25f, 0.25f}, card, 0.01f}}) {
            Vec4f seen{0, 0, 0, 0};
            file->lookup(&seen, &place.uv);
            EXPECT_TRUE(test::near(rgb(seen), place.want, double(place.tolerance))) << name;
        }
    }
}

TEST(PictureFile, ACropKeepsItsPlaceAndLayersTheirNames)
{
    test::TemporaryFolder const folder;
    Picture picture{40, 30, {8, 5, 10, 6}, {{"beauty", {"R", "G", "B", "A"}, {}}}};
    picture.layers[0].values = {1, 2, 3, 1, 4, 5, 6, 1};
    picture.layers.push_back({"depth", {"Z"}, {7, 9}});
    writePicture(folder.path / "a.exr", picture, {});
    auto const file = OIIO::ImageInput::open((folder.path / "a.exr").string());
    ASSERT_TRUE(file);
    OIIO::ImageSpec const& s = file->spec();
    EXPECT_TRUE(s.x == 8 && s.y == 5 && s.width == 2 && s.height == 1);
    EXPECT_TRUE(s.full_x == 0 && s.full_y == 0 && s.full_width == 40 && s.full_height == 30);
    std::vector<float> values(10);
    int const depth = s.channelindex("depth.Z"), green = s.channelindex("G");
    ASSERT_TRUE(file->read_image(0, 0, 0, -1, OIIO::TypeDesc::FLOAT, values.data()) && depth >= 0
                && green >= 0);
    EXPECT_EQ(values[static_cast<std::size_t>(5 + depth)], 9);
    EXPECT_EQ(values[static_cast<std::size_t>(5 + green)], 5);
    float primaries[8] = {};
    ASSERT_TRUE(
        s.getattribute("chromaticities", OIIO::TypeDesc(OIIO::TypeDesc::FLOAT, 8), primaries));
    EXPECT_EQ(primaries[0], 0.64f);
}

TEST(PictureFile, ScreensShowLightThroughAToneCurveOrAColourConfig)
{
    auto const shown = [](ScreenView const& view, Vec3f light) {
        std::array<float, 3> rgb{light.x, light.y, light.z};
        screenTransform(view)(rgb);
        return Vec3f(rgb[0], rgb[1], rgb[2]);
    };
    // Middle grey is 0.4614 in sRGB; the default leaves it there, and orders what lies beyond 1
    // without turning the hue.
    EXPECT_NEAR(shown({.view = "plain"}, {0.18f, 4, -1}).x, 0.4614f, 1e-4f);
    EXPECT_EQ(shown({}, {0.18f, 0.7f, 0}), shown({.view = "plain"}, {0.18f, 0.7f, 0}));
    EXPECT_EQ(shown({.exposure = -1}, {0.36f, 0, 0}), shown({}, {0.18f, 0, 0}));
    EXPECT_GT(shown({}, {3, 3, 3}).x, shown({}, {1, 1, 1}).x + 0.02f);
    Vec3f const orange = shown({}, {3, 0.9f, 0.3f});
    EXPECT_GT(orange.x, orange.y + 0.2f);
    EXPECT_GT(orange.y, orange.z + 0.05f) << "not clipped to yellow";
    // Filmic: grey stays grey, a bright red fades.
    Vec3f const grey = shown({.view = "filmic"}, {0.18f, 0.18f, 0.18f});
    EXPECT_NEAR(grey.x, 0.5f, 0.01f) << "the pivot of the curve";
    EXPECT_NEAR(grey.x, grey.z, 0.005f);
    EXPECT_GT(shown({.view = "filmic"}, {8, 0.1f, 0.1f}).y, 0.3f);
    for (std::string const& view : toneCurveNames()) {
        Vec3f const odd = shown({.view = view}, {NAN, INFINITY, -INFINITY});
        EXPECT_TRUE(odd.x >= 0 && odd.y > 0.5f && odd.y <= 1 && odd.z >= 0) << view;
    }

    // The config's working space has other primaries than the picture.
    test::TemporaryFolder const folder;
    std::string const config = folder.path / "config.ocio";
    std::ofstream(config) << R"(ocio_profile_version: 2
roles: {default: other, scene_linear: other}
displays:
  Screen:
    - !<View> {name: Half, colorspace: half}
  Print:
    - !<View> {name: Swapped, colorspace: other}
colorspaces:
  - !<ColorSpace> {name: other}
  - !<ColorSpace>
    name: lin_rec709
    to_scene_reference: !<MatrixTransform> {matrix: [0, 1, 0, 0, 1, 0, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1]}
  - !<ColorSpace>
    name: half
    from_scene_reference: !<MatrixTransform> {matrix: [0.5, 0, 0, 0, 0, 0.5, 0, 0, 0, 0, 0.5, 0, 0, 0, 0, 1]}
)";
    auto const near = [](Vec3f a, Vec3f b) { return length(a - b) < 1e-5f; };
    Vec3f const light{0.2f, 0.6f, 4};
    EXPECT_TRUE(near(shown({.ocioConfig = config}, light), {0.3f, 0.1f, 1}));
    EXPECT_TRUE(
        near(shown({.view = "Print/Swapped", .ocioConfig = config}, light), {0.6f, 0.2f, 1}));
    EXPECT_EQ(shown({.view = "neutral", .ocioConfig = config}, light), shown({}, light));
    expectContains(errorOf([&] { screenTransform({.view = "Hlf", .ocioConfig = config}); }),
                   {"config.ocio", "\"Hlf\"", "did you mean Half?"});
    expectContains(errorOf([&] { screenTransform({.view = "Half"}); }), {"neutral", "filmic"});
    std::string const missing = folder.path / "missing.ocio";
    expectContains(errorOf([&] { screenTransform({.ocioConfig = missing}); }), {"missing.ocio"});
}

TEST(PictureFile, WhatCannotBeWrittenLeavesNothing)
{
    test::TemporaryFolder const folder;
    fs::create_directory(folder.path / "folder.png");
    struct Case {
        char const* name;
        std::vector<std::string> message;
    };
    for (Case const& c : {Case{"a.tiff", {"a.tiff", ".exr"}},
                          Case{"no/where.png", {"no/where.png", "No such file"}},
                          Case{"folder.png", {"folder.png", "is a folder"}}})
        expectContains(errorOf([&] { checkPictureFile(folder.path / c.name); }), c.message);

    // A file may have four kilobytes; pixels that do not compress.
    std::mt19937 random;
    Picture picture{100, 75, {0, 0, 100, 75}, {{"beauty", {"R", "G", "B", "A"}, {}}}};
    picture.layers[0].values.resize(100 * 75 * 4);
    for (float& v : picture.layers[0].values)
        v = static_cast<float>(random() >> 8) * 0x1p-24f;
    auto const before = std::signal(SIGXFSZ, SIG_IGN);
    rlimit limit;
    getrlimit(RLIMIT_FSIZE, &limit);
    rlimit const small{4096, limit.rlim_max};
    for (char const* name : {"a.exr", "a.hdr", "a.png", "a.jpg"}) {
        setrlimit(RLIMIT_FSIZE, &small);
        std::string const error = errorOf([&] { writePicture(folder.path / name, picture, {}); });
        setrlimit(RLIMIT_FSIZE, &limit);
        expectContains(error, {name, "cannot be written", "too large"});
    }
    std::signal(SIGXFSZ, before);
    EXPECT_EQ(std::distance(fs::directory_iterator(folder.path), {}), 1) << "the folder alone";
}

} // namespace
} // namespace zsi::host
