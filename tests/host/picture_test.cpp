// SPDX-License-Identifier: Apache-2.0
// From a scene file to picture files.
#include "film/imageFile.h"
#include "load/loadScene.h"
#include "render/render.h"
#include "support/hostLibraries.h"
#include "support/inputError.h"
#include "support/temporaryFolder.h"
#include "texture/textureStore.h"

#include <OpenImageIO/imageio.h>
#include <csignal>
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
        writePicture(folder.path / name, picture, {scene.film.exposure});
        HostTexture2D const* const file = pictures.load2D(folder.path / name, ColorSpace::Auto);
        struct Place {
            Vec2f uv; ///< from the bottom left
            Vec3f want;
            float tolerance;
        };
        Vec3f const card{0.5f, 0.25f, 1}, lilac{0.69f, 0.58f, 0.69f};
        for (Place const& place :
             {Place{{0.25f, 0.75f}, lilac, 0.02f}, Place{{0.75f, 0.75f}, card, 0.01f},
              Place{{0.25f, 0.25f}, card, 0.01f}}) {
            Vec4f seen{0, 0, 0, 0};
            file->lookup(&seen, &place.uv);
            EXPECT_NEAR(seen.x, place.want.x, place.tolerance) << name;
            EXPECT_NEAR(seen.y, place.want.y, place.tolerance) << name;
            EXPECT_NEAR(seen.z, place.want.z, place.tolerance) << name;
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
