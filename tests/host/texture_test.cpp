// SPDX-License-Identifier: Apache-2.0
// Textures against what their files hold, computed here.
#include "support/inputError.h"
#include "support/record.h"
#include "support/temporaryFolder.h"
#include "texture/textureFootprint.h"
#include "texture/textureStore.h"

#include <atomic>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <gtest/gtest.h>
#include <iterator>
#include <random>
#include <thread>
#include <unistd.h>

namespace zsi::host {
namespace {

namespace fs = std::filesystem;
using test::errorOf;
using test::expectContains;

/// A picture of any values, in [0, 1], as a file of 8 or 16 bits in the folder.
struct Values {
    int width, height, bits;
    std::vector<int> codes; ///< RGB from the top

    Values(int width_, int height_, int bits_, auto&& code)
        : width(width_)
        , height(height_)
        , bits(bits_)
    {
        for (int i = 0; i < width * height * 3; ++i)
            codes.push_back(code(i) & ((1 << bits) - 1));
    }
    double code(int x, int y, int channel) const
    {
        int const column = (x % width + width) % width, row = (y % height + height) % height;
        return codes[static_cast<std::size_t>((row * width + column) * 3 + channel)]
            / ((1 << bits) - 1.0);
    }
    double linear(int x, int y, int channel) const
    {
        double const v = code(x, y, channel);
        return v <= 0.04045 ? v / 12.92 : std::pow((v + 0.055) / 1.055, 2.4);
    }
    void write(fs::path const& ppm) const
    {
        std::ofstream out(ppm, std::ios::binary);
        out << "P6 " << width << ' ' << height << ' ' << ((1 << bits) - 1) << '\n';
        for (int const v : codes) {
            if (bits == 16)
                out.put(static_cast<char>(v >> 8));
            out.put(static_cast<char>(v));
        }
    }
};

int anyCode(int i) { return static_cast<int>((static_cast<unsigned>(i) + 1) * 2654435761u >> 13); }

/// Files of the folder made from one, each with options of oiiotool.
using Conversions = std::vector<std::pair<std::string, std::string>>;
void convert(fs::path const& from, Conversions const& files)
{
    std::string command = "oiiotool";
    for (auto const& [name, options] : files)
        command +=
            ' ' + from.string() + ' ' + options + " -o " + (from.parent_path() / name).string();
    ASSERT_EQ(std::system(command.c_str()), 0) << command;
}

Vec4f lookup(auto const* texture, auto const& at)
{
    Vec4f result{-1, -1, -1, -1};
    texture->lookup(&result, &at);
    return result;
}

TEST(Texture, FilesCutAnywhereAreRefusedByName)
{
    test::TemporaryFolder const folder;
    Values(90, 70, 16, anyCode).write(folder.path / "all.ppm");
    Conversions const files{
        {"a.png", "-d uint8"},
        {"deep.png", "-d uint16"},
        {"a.jpg", "-d uint8"},
        {"progressive.jpg", "-d uint8 --attrib jpeg:progressive 1"},
        {"a.exr", "-d half"},
        {"plain.exr", "-d float --compression none"},
        {"tiled.exr", "-d half --tile 32 32"},
        {"a.tif", "-d uint8"},
        {"plain.tif", "-d uint16 --compression none"},
        {"tiled.tif", "-d uint8 --tile 32 32"},
        {"a.hdr", ""},
        {"a.bmp", "-d uint8"},
    };
    convert(folder.path / "all.ppm", files);
    for (auto const& [name, options] : files) {
        SCOPED_TRACE(name);
        fs::path const whole = folder.path / name;
        EXPECT_EQ(errorOf([&] { TextureStore().load2D(whole, ColorSpace::Auto); }), "no error");
        std::size_t const size = fs::file_size(whole);
        fs::path const cut = folder.path / ("cut-" + name);
        for (std::size_t i = 0; i < 60; ++i) {
            fs::copy_file(whole, cut, fs::copy_options::overwrite_existing);
            fs::resize_file(cut, i < 40 ? size * i / 40 : size - (i - 39));
            TextureStore store;
            std::string const error = errorOf([&] {
                if (i % 3 == 0)
                    store.load1D(cut, ColorSpace::Auto);
                else if (i % 3 == 1)
                    store.loadCube(cut, ColorSpace::Auto, i % 2 ? 1.0f : 0.0f);
                else
                    store.load2D(cut, ColorSpace::Auto);
            });
            expectContains(error, {cut.string(), "cannot be read"});
        }
    }
}

TEST(Texture, LookUpsAreBilinearInLinearLight)
{
    test::TemporaryFolder const folder;
    for (int const bits : {8, 16})
        for (auto const& [width, height] : {std::pair(150, 67), std::pair(1, 3)}) {
            Values const values(width, height, bits, anyCode);
            values.write(folder.path / "a.ppm");
            convert(folder.path / "a.ppm",
                    {{"a.png", ""}, {"a.tif", "--scanline"}, {"tiled.tif", "--tile 16 32"}});
            for (char const* const name : {"a.png", "a.tif", "tiled.tif", "a.ppm"}) {
                SCOPED_TRACE(std::string(name) + ' ' + std::to_string(bits));
                fs::path const file = folder.path / name;
                TextureStore store;
                auto const* const encoded = store.load2D(file, ColorSpace::Auto);
                auto const* const plain = store.load2D(file, ColorSpace::Linear);
                EXPECT_NE(encoded, plain);
                EXPECT_EQ(encoded, store.load2D(file, ColorSpace::Auto));
                std::mt19937 random;
                for (int i = 0; i < 300; ++i) {
                    auto const u = static_cast<float>(random() % 3000) / 1000.0f - 1.0f;
                    auto const v = static_cast<float>(random() % 3000) / 1000.0f - 1.0f;
                    double const x = double(u) * width - 0.5, y = (1.0 - double(v)) * height - 0.5;
                    int const x0 = static_cast<int>(std::floor(x));
                    int const y0 = static_cast<int>(std::floor(y));
                    double want[2] = {};
                    for (int const j : {0, 1})
                        for (int const k : {0, 1}) {
                            double const weight =
                                (1 - std::fabs(x - x0 - k)) * (1 - std::fabs(y - y0 - j));
                            want[0] += weight * values.linear(x0 + k, y0 + j, 1);
                            want[1] += weight * values.code(x0 + k, y0 + j, 1);
                        }
                    // Coordinates are floats: 2^-22 of the width, times a contrast of 1. The
                    // reader of 16-bit PPM is off by one code here and there.
                    float const tolerance =
                        4e-7f * static_cast<float>(width) + 2e-6f + (bits == 16 ? 2.4f / 65535 : 0);
                    EXPECT_NEAR(lookup(encoded, Vec2f(u, v)).y, want[0], tolerance);
                    EXPECT_NEAR(lookup(plain, Vec2f(u, v)).y, want[1], tolerance);
                    EXPECT_EQ(lookup(plain, Vec2f(u, v)).w, 1.0f);
                }
            }
        }
}

TEST(Texture, ChannelsAndWindowsOfFloatFiles)
{
    test::TemporaryFolder const folder;
    { // Red, green and blue of texel i from the top left are i, i + 1/4 and i + 1/2.
        std::ofstream out(folder.path / "a.pfm", std::ios::binary);
        out << "PF 4 2 -1\n";
        for (int const i : {4, 5, 6, 7, 0, 1, 2, 3})
            for (float const v : {0.0f, 0.25f, i == 0 ? NAN : 0.5f}) {
                float const value = static_cast<float>(i) + v;
                out.write(reinterpret_cast<char const*>(&value), sizeof value);
            }
    }
    struct Case {
        char const* options;
        Vec4f want[2]; ///< of the first texel and the sixth, which is in row 1, column 1
    };
    Case const cases[] = {
        Case{"-d float --ch R,G,B,A=0.75", {{0, 0.25f, 0, 0.75f}, {5, 5.25f, 5.5f, 0.75f}}},
        Case{"-d half --tile 16 16", {{0, 0.25f, 0, 1}, {5, 5.25f, 5.5f, 1}}},
        Case{"--ch G,A=0.75", {{0.25f, 0.25f, 0.25f, 0.75f}, {5.25f, 5.25f, 5.25f, 0.75f}}},
        Case{"--ch G", {{0.25f, 0.25f, 0.25f, 1}, {5.25f, 5.25f, 5.25f, 1}}},
        // The data window is smaller than the picture, or reaches out of it.
        Case{"--ch R,G,B,A=0.75 --crop 2x1+1+1", {{0, 0, 0, 0}, {5, 5.25f, 5.5f, 0.75f}}},
        Case{"--fullsize 5x3-1-1", {{0, 0, 0, 1}, {0, 0.25f, 0, 1}}},
        Case{"--fullsize 2x2+1+0", {{1, 1.25f, 1.5f, 1}, {6, 6.25f, 6.5f, 1}}},
    };
    Conversions files;
    for (Case const& c : cases)
        files.emplace_back(std::to_string(files.size()) + ".exr", c.options);
    convert(folder.path / "a.pfm", files);
    TextureStore store;
    for (std::size_t k = 0; k < files.size(); ++k) {
        Case const& c = cases[k];
        SCOPED_TRACE(c.options);
        auto const* const texture = store.load2D(folder.path / files[k].first, ColorSpace::Auto);
        std::string const options = c.options;
        Vec2f const size = options.find("5x3") != options.npos ? Vec2f(5, 3)
            : options.find("2x2") != options.npos              ? Vec2f(2, 2)
                                                               : Vec2f(4, 2);
        for (int const i : {0, 1}) {
            auto const at = static_cast<float>(i) + 0.5f;
            Vec4f const seen = lookup(texture, Vec2f(at / size.x, 1 - at / size.y));
            EXPECT_TRUE(test::near(seen, c.want[i], 1e-5)) << i;
        }
    }
}

// What damaged headers say would take gigabytes.
TEST(Texture, FramesFarBeyondTheirPixelsAreRefused)
{
    test::TemporaryFolder const folder;
    Values(4, 2, 16, anyCode).write(folder.path / "all.ppm");
    Conversions const files{{"long.exr", "--fullsize 200000x2"},
                            {"empty.exr", "--fullsize 40000x30000"}};
    convert(folder.path / "all.ppm", files);
    for (auto const& [name, options] : files) {
        fs::path const file = folder.path / name;
        std::string const error = errorOf([&] { TextureStore().load2D(file, ColorSpace::Auto); });
        expectContains(error, {file.string(), "expected "});
    }
}

// Whoever believes such a header shows what lies in memory, or takes gigabytes of it.
TEST(Texture, EntriesOfHeadersThatDoNotFitTheirBlocksAreRefused)
{
    test::TemporaryFolder const folder;
    Values(90, 70, 16, anyCode).write(folder.path / "all.ppm");
    convert(folder.path / "all.ppm",
            {{"tiled.exr", "-d half --tile 32 32"}, {"rows.exr", "-d half"}});
    struct {
        char const *name, *attribute;
        std::size_t byte; ///< of its value
        char value;
    } const damages[] = {{"tiled.exr", "tiles", 3, 64},
                         {"tiled.exr", "tiles", 2, 64},
                         {"tiled.exr", "tiles", 5, 8},
                         {"rows.exr", "dataWindow", 9, 4}};
    for (auto const& [name, attribute, byte, value] : damages) {
        SCOPED_TRACE(std::string(name) + " " + std::to_string(byte));
        std::ifstream whole(folder.path / name, std::ios::binary);
        std::string bytes(std::istreambuf_iterator<char>(whole), {});
        // Name, type and size of the value stand before it.
        std::size_t const type = bytes.find(attribute) + std::strlen(attribute) + 1;
        bytes.at(bytes.find('\0', type) + 1 + 4 + byte) = value;
        fs::path const file = folder.write("damaged.exr", bytes);
        std::string const error = errorOf([&] { TextureStore().load2D(file, ColorSpace::Auto); });
        expectContains(error, {file.string(), "header"});
    }
}

/// TMPDIR while it lives.
struct ScratchFolder {
    explicit ScratchFolder(fs::path const& folder) { setenv("TMPDIR", folder.c_str(), 1); }
    ~ScratchFolder() { unsetenv("TMPDIR"); }
};

/// Of files, in the memory of this process.
std::size_t mappedBytes()
{
    std::size_t total, resident, shared;
    std::ifstream("/proc/self/statm") >> total >> resident >> shared;
    return shared * static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
}

TEST(Texture, ALimitOfMemoryChangesNothingThatIsSeen)
{
    test::TemporaryFolder const folder;
    fs::path const file = folder.path / "a.ppm", scratch = folder.path / "scratch";
    fs::create_directory(scratch);
    Values(2000, 1400, 8, anyCode).write(file); // 13 MB of tiles
    TextureStore roomy({.cacheBytes = 64 << 20});
    auto const* const want = roomy.load2D(file, ColorSpace::Auto);
    struct Case {
        fs::path scratch;
        std::size_t limit, warnings;
    };
    for (Case const& c : {Case{scratch, 0, 0}, Case{scratch, 1000000, 0},
                          Case{folder.path / "missing", 1000000, 1}}) {
        ScratchFolder const set(c.scratch);
        TextureStore store({.cacheBytes = c.limit});
        auto const* const texture = store.load2D(file, ColorSpace::Auto);
        std::size_t const before = mappedBytes();
        EXPECT_EQ(store.warnings().size(), c.warnings);
        EXPECT_TRUE(fs::is_empty(scratch)) << "a program that is killed leaves nothing";
        std::atomic<int> wrong = 0;
        std::vector<std::jthread> threads;
        for (unsigned t = 0; t < 3; ++t)
            threads.emplace_back([&, t] {
                std::mt19937 random(t);
                for (int i = 0; i < 20000; ++i) {
                    Vec2f const uv(static_cast<float>(random()) * 0x1p-32f,
                                   static_cast<float>(random()) * 0x1p-32f);
                    TextureFootprint const footprint(i % 2 ? 0.004f : 0.0f);
                    Vec4f const a = lookup(texture, uv), b = lookup(want, uv);
                    wrong += a.x != b.x || a.y != b.y || a.z != b.z;
                }
            });
        threads.clear();
        EXPECT_EQ(wrong, 0);
        EXPECT_LT(mappedBytes(), before + 4000000) << "of 13 MB";
    }
}

TEST(Texture, AFootprintAveragesLight)
{
    test::TemporaryFolder const folder;
    // Black and white by turns: half the light, which is not the mean of the codes.
    for (auto const& [width, height, bits] :
         {std::tuple(128, 64, 8), std::tuple(101, 75, 8), std::tuple(101, 75, 16)}) {
        SCOPED_TRACE(width);
        Values const values(width, height, bits,
                            [w = width](int i) { return (i / 3 % w + i / 3 / w) % 2 ? -1 : 0; });
        double mean = 0;
        for (int y = 0; y < height; ++y)
            for (int x = 0; x < width; ++x)
                mean += values.linear(x, y, 0) / (width * height);
        values.write(folder.path / "a.ppm");
        TextureStore store;
        auto const* const texture = store.load2D(folder.path / "a.ppm", ColorSpace::Auto);
        Vec2f const at(0.3f, 0.6f);
        float const sharp = lookup(texture, at).x;
        {
            TextureFootprint const wide(1.0f);
            EXPECT_NEAR(lookup(texture, at).x, mean, 0.005) << "codes of 8 bits";
            {
                TextureFootprint const texel(1.0f / static_cast<float>(width));
                EXPECT_EQ(lookup(texture, at).x, sharp);
            }
            EXPECT_NEAR(lookup(texture, at).x, mean, 0.005) << "a scope ends";
        }
        EXPECT_EQ(lookup(texture, at).x, sharp);
        // Over one level after the other the contrast falls; of a ramp the place stays.
        Values const ramp(width, height, bits, [w = width, white = (1 << bits) - 1](int i) {
            return white * (i / 3 % w) / (w - 1);
        });
        ramp.write(folder.path / "b.ppm");
        auto const* const slope = store.load2D(folder.path / "b.ppm", ColorSpace::Linear);
        for (float const texels : {1.5f, 2.0f, 3.0f, 6.0f, 8.0f}) {
            TextureFootprint const footprint(texels / static_cast<float>(width));
            EXPECT_NEAR(lookup(slope, Vec2f(0.5f, 0.5f)).x, 0.5f, 0.006f) << texels;
            EXPECT_NEAR(lookup(slope, Vec2f(0.25f, 0.5f)).x, 0.25f, 0.011f) << texels;
        }
    }
}

TEST(Texture, AFootprintPicksTheLevelOfItsWidth)
{
    test::TemporaryFolder const folder;
    // Stripes two texels wide: whole texels of level 1, grey in level 2.
    Values(128, 64, 8, [](int i) { return i / 6 % 2 ? -1 : 0; }).write(folder.path / "a.ppm");
    TextureStore store;
    auto const* const texture = store.load2D(folder.path / "a.ppm", ColorSpace::Linear);
    auto const contrast = [&](float texels) {
        TextureFootprint const footprint(texels / 90.509668f); // the root of 128 x 64
        return lookup(texture, Vec2f(3 / 128.0f, 0.5f)).x
            - lookup(texture, Vec2f(1 / 128.0f, 0.5f)).x;
    };
    EXPECT_NEAR(contrast(2), 1, 1e-5);
    EXPECT_NEAR(contrast(2.8284271f), 0.5, 1e-5) << "half way between levels";
    EXPECT_NEAR(contrast(4), 0, 1e-5);
}

TEST(TextureCube, BlursKeepTheLightAndTheDirections)
{
    test::TemporaryFolder const folder;
    // Light from above, +y, alone; wide enough that it is reduced first.
    Values const sky(1000, 500, 8, [](int i) { return i < 1000 * 250 * 3 ? 255 : 0; });
    sky.write(folder.path / "a.ppm");
    TextureStore store;
    auto const* const irradiance = store.loadIrradiance(folder.path / "a.ppm", ColorSpace::Auto);
    auto const* const blurred = store.loadCube(folder.path / "a.ppm", ColorSpace::Auto, 0.1f);
    auto const* const sharp = store.loadCube(folder.path / "a.ppm", ColorSpace::Auto);
    for (int i = 0; i <= 16; ++i) {
        double const angle = i * 3.14159265 / 16, around = i * 2.4;
        Vec3f const d(static_cast<float>(7 * std::sin(angle) * std::cos(around)),
                      static_cast<float>(7 * std::cos(angle)),
                      static_cast<float>(7 * std::sin(angle) * std::sin(around)));
        EXPECT_NEAR(lookup(irradiance, d).x, (1 + std::cos(angle)) / 2, 0.01) << i;
        float const want = i < 8 ? 1.0f : i > 8 ? 0.0f : 0.5f;
        EXPECT_NEAR(lookup(blurred, d).x, want, i == 8 ? 0.01f : 1e-4f) << i;
        EXPECT_NEAR(lookup(sharp, d).x, want, i == 8 ? 0.01f : 1e-4f) << i;
    }
    // A blur of 30 degrees leaves half of the light on the horizon, and reaches 15 degrees up.
    auto const* const wide = store.loadCube(folder.path / "a.ppm", ColorSpace::Auto, 0.5235988f);
    EXPECT_NEAR(lookup(wide, Vec3f(1, 0, 0)).x, 0.5f, 0.02f);
    EXPECT_NEAR(lookup(wide, Vec3f(1, 0.26f, 0)).x, 0.8f, 0.18f);
    EXPECT_NEAR(lookup(wide, Vec3f(1, 0.84f, 0)).x, 1, 0.02f);
    // The middle column lies towards -z, +x to the right of it.
    Values const spot(64, 32, 8, [](int i) {
        int const x = i / 3 % 64, y = i / 3 / 64;
        return y >= 14 && y < 18 && x >= 46 && x < 50 ? 255 : 0;
    });
    spot.write(folder.path / "b.ppm");
    for (float const blur : {0.0f, 0.3f}) {
        auto const* const cube = store.loadCube(folder.path / "b.ppm", ColorSpace::Auto, blur);
        EXPECT_GT(lookup(cube, Vec3f(1, 0, 0)).x, 0.3f);
        for (Vec3f const& dark : {Vec3f(-1, 0, 0), Vec3f(0, 1, 0), Vec3f(0, 0, 1)})
            EXPECT_LT(lookup(cube, dark).x, 1e-3f);
    }
}

} // namespace
} // namespace zsi::host
