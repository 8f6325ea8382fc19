// SPDX-License-Identifier: Apache-2.0
#include "view/thumbnail.h"

#include "base/error.h"
#include "film/screenTransform.h"
#include "texture/exrCheck.h"

#include <OpenImageIO/imagebufalgo.h>
#include <algorithm>
#include <array>
#include <cmath>

namespace zsi::view {

ShownPicture thumbnailOf(host::PictureSource const& source, int size)
{
    if (std::string const wrong = source.bytes ? "" : host::whatIsWrongWithExr(source.file);
        !wrong.empty())
        throw host::InputError(source.name() + ": " + wrong);
    std::vector<unsigned char> const bytes =
        source.bytes ? source.bytes() : std::vector<unsigned char>();
    OIIO::Filesystem::IOMemReader memory(bytes.data(), bytes.size());
    std::string const name =
        source.bytes ? "part" + std::string(host::pictureEnding(bytes)) : source.file.string();
    OIIO::ImageBuf picture(name, 0, 0, nullptr, nullptr, source.bytes ? &memory : nullptr);
    if (!picture.read(0, 0, true, OIIO::TypeDesc::FLOAT))
        throw host::InputError(source.name() + ": " + picture.geterror());
    // Integers are signals of a screen already; floating-point numbers are light.
    bool const isLight =
        picture.file_format_name() == "openexr" || picture.file_format_name() == "hdr";
    OIIO::ImageSpec const& spec = picture.spec();
    double const by = std::min(1.0, size / static_cast<double>(std::max(spec.width, spec.height)));
    auto const side = [&](int pixels) {
        return std::max(1, static_cast<int>(std::lround(pixels * by)));
    };
    ShownPicture shown{side(spec.width), side(spec.height), {}};
    OIIO::ImageBuf const small = OIIO::ImageBufAlgo::resize(
        picture, "box", 0.0f, OIIO::ROI(0, shown.width, 0, shown.height, 0, 1, 0, spec.nchannels));
    if (small.has_error())
        throw host::InputError(source.name() + ": " + small.geterror());
    std::array<float, 4> pixel{};
    for (int y = 0; y < shown.height; ++y)
        for (int x = 0; x < shown.width; ++x) {
            small.getpixel(x, y, pixel.data(), std::min(4, spec.nchannels));
            if (spec.nchannels < 3)
                pixel[1] = pixel[2] = pixel[0];
            if (isLight)
                host::screenTransform({})(std::span(pixel).first(3));
            for (std::size_t c = 0; c < 3; ++c)
                shown.rgba.push_back(static_cast<std::uint8_t>(
                    std::lround(255.0f * std::clamp(pixel[c], 0.0f, 1.0f))));
            shown.rgba.push_back(255);
        }
    return shown;
}

} // namespace zsi::view
