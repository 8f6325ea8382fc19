// SPDX-License-Identifier: Apache-2.0
// Pictures as they go over the wire.
#include "base/error.h"
#include "view/preview.h"

#include <OpenImageIO/filesystem.h>
#include <OpenImageIO/imageio.h>
#include <algorithm>

namespace zsi::view {
namespace {

constexpr std::uint32_t kMagic = 0x4C49545A; ///< "ZTIL"
constexpr int kRaw = 0, kPng = 1;

void put(std::string& to, std::uint32_t value, int bytes)
{
    for (int i = 0; i < bytes; ++i)
        to.push_back(static_cast<char>((value >> (8 * i)) & 255u));
}

std::string header(ShownPicture const& picture, int y, int rows, std::uint32_t generation,
                   std::uint32_t samples, int kind, int encoding, std::size_t payload)
{
    std::string to;
    to.reserve(32 + payload);
    put(to, kMagic, 4);
    put(to, generation, 4);
    for (int const v : {0, y, picture.width, rows, picture.width, picture.height})
        put(to, static_cast<std::uint32_t>(v), 2);
    put(to, samples, 4);
    put(to, static_cast<std::uint32_t>(kind), 1);
    put(to, static_cast<std::uint32_t>(encoding), 1);
    put(to, 0, 2);
    put(to, static_cast<std::uint32_t>(payload), 4);
    return to;
}

} // namespace

Band makeBand(ShownPicture const& picture, int y, int rows, std::uint32_t generation,
              std::uint32_t samples, int kind)
{
    std::string message =
        header(picture, y, rows, generation, samples, kind, kRaw, picture.rgba.size());
    message.append(picture.rgba.begin(), picture.rgba.end());
    return std::make_shared<std::string const>(std::move(message));
}

Band makePngBand(ShownPicture const& picture, std::uint32_t generation, int kind)
{
    std::string const png = pngOf(picture);
    return std::make_shared<std::string const>(
        header(picture, 0, picture.height, generation, 0, kind, kPng, png.size()) + png);
}

std::string pngOf(ShownPicture const& picture)
{
    std::vector<unsigned char> bytes;
    OIIO::Filesystem::IOVecOutput memory(bytes);
    auto const output = OIIO::ImageOutput::create("picture.png");
    OIIO::ImageSpec spec(picture.width, picture.height, 3, OIIO::TypeDesc::UINT8);
    spec.attribute("oiio:ColorSpace", "sRGB");
    spec.attribute("png:compressionLevel", 1);
    if (!output || !output->set_ioproxy(&memory) || !output->open("picture.png", spec)
        || !output->write_image(OIIO::TypeDesc::UINT8, picture.rgba.data(), 4) || !output->close())
        throw host::InputError("the picture cannot be encoded as PNG");
    return {bytes.begin(), bytes.end()};
}

} // namespace zsi::view
