// SPDX-License-Identifier: Apache-2.0
#include "texture/pictureFile.h"

#include "base/error.h"
#include "texture/exrCheck.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <fstream>
#include <sstream>
#include <tuple>
#include <vector>

namespace zsi::host {
namespace {

constexpr int kBandRows = 64; ///< of files in rows, which readers take faster by the dozen

/// The type that a file's values are kept in.
std::pair<TexelType, OIIO::TypeDesc> keptAs(OIIO::TypeDesc const& type)
{
    switch (type.basetype) {
    case OIIO::TypeDesc::UINT8:
        return {TexelType::UInt8, OIIO::TypeDesc::UINT8};
    case OIIO::TypeDesc::UINT16:
        return {TexelType::UInt16, OIIO::TypeDesc::UINT16};
    case OIIO::TypeDesc::HALF:
        return {TexelType::Half, OIIO::TypeDesc::HALF};
    default:
        return {TexelType::Float, OIIO::TypeDesc::FLOAT};
    }
}

void replaceNonFinite(TexelType type, std::byte* values, std::size_t count)
{
    auto const replace = [&]<class T>(T exponent) {
        for (std::size_t i = 0; i < count; ++i) {
            T bits;
            std::memcpy(&bits, values + i * sizeof(T), sizeof(T));
            if ((bits & exponent) == exponent)
                std::memset(values + i * sizeof(T), 0, sizeof(T));
        }
    };
    if (type == TexelType::Half)
        replace(std::uint16_t(0x7c00));
    else if (type == TexelType::Float)
        replace(std::uint32_t(0x7f800000));
}

/// Whether a PNG's blocks follow one another to the last: its reader leaves off after the pixels.
bool endsWhole(std::istream& in)
{
    in.seekg(8);
    for (std::array<unsigned char, 8> head; in.read(reinterpret_cast<char*>(head.data()), 8);) {
        std::uint32_t size = 0;
        for (std::size_t i = 0; i < 4; ++i)
            size = size << 8 | head[i];
        if (std::memcmp(head.data() + 4, "IEND", 4) == 0)
            return static_cast<bool>(in.read(reinterpret_cast<char*>(head.data()), 4));
        in.seekg(std::streamoff(size) + 4, std::ios::cur); // over data and check sum
    }
    return false;
}

/// What readers say of a file without having lost any of its pixels.
bool isHarmless(std::string const& error)
{
    return error.find("extraneous bytes before marker") != std::string::npos
        || error.find("Invalid SOS parameters for sequential JPEG") != std::string::npos;
}

} // namespace

std::string_view pictureEnding(std::vector<unsigned char> const& bytes)
{
    auto const has = [&](std::size_t at, std::string_view mark) {
        return bytes.size() >= at + mark.size()
            && std::memcmp(bytes.data() + at, mark.data(), mark.size()) == 0;
    };
    return has(0, "\x89PNG")               ? ".png"
        : has(0, "\xff\xd8\xff")           ? ".jpg"
        : has(0, "RIFF") && has(8, "WEBP") ? ".webp"
                                           : "";
}

void PictureFile::open(OIIO::ImageSpec const& config)
{
    if (!source_.bytes) {
        if (std::string const wrong = whatIsWrongWithExr(source_.file); !wrong.empty())
            fail(wrong);
        input_ = OIIO::ImageInput::open(source_.file.string(), &config);
        return;
    }
    bytes_ = source_.bytes();
    std::string_view const ending = pictureEnding(bytes_);
    if (ending.empty())
        fail("expected PNG, JPEG or WebP");
    memory_ = std::make_unique<OIIO::Filesystem::IOMemReader>(bytes_.data(), bytes_.size());
    OIIO::ImageSpec own = config;
    OIIO::Filesystem::IOProxy* proxy = memory_.get();
    own.attribute("oiio:ioproxy", OIIO::TypeDesc::PTR, &proxy);
    input_ = OIIO::ImageInput::open("part" + std::string(ending), &own);
}

PictureFile::PictureFile(PictureSource const& source, ColorSpace space)
    : source_(source)
{
    std::error_code ignored;
    if (!std::filesystem::exists(source.file, ignored))
        throw InputError(source.file.string() + ": no such file");
    OIIO::ImageSpec config;
    config.attribute("oiio:UnassociatedAlpha", 1);
    open(config);
    if (!input_)
        fail(OIIO::geterror());
    spec_ = input_->spec();
    if (spec_.width < 1 || spec_.height < 1 || spec_.nchannels < 1 || spec_.depth > 1 || spec_.deep)
        fail("expected a flat picture");
    if (spec_.full_width < 1 || spec_.full_height < 1) {
        spec_.full_x = spec_.x, spec_.full_width = spec_.width;
        spec_.full_y = spec_.y, spec_.full_height = spec_.height;
    }
    // Bounds that a damaged header passes seldom, before memory is taken for what it says.
    constexpr std::int64_t kMostSide = 1 << 17, kMostTexels = std::int64_t(1) << 31;
    constexpr std::int64_t kMostBlank = 1 << 26; ///< around the data of a small picture
    auto const texels = std::int64_t(spec_.full_width) * spec_.full_height;
    auto const held = std::int64_t(spec_.width) * spec_.height;
    if (std::max({spec_.full_width, spec_.full_height, spec_.width, spec_.height}) > kMostSide
        || texels > kMostTexels)
        fail("expected no more than 2^17 texels a side and 2^31 in all");
    if (texels > std::max(kMostBlank, 64 * held))
        fail("expected pixels in more than a small part of its frame");
    std::tie(format_.type, type_) = keptAs(spec_.format);
    format_.channels = std::min(spec_.nchannels, 4);
    format_.srgb = space == ColorSpace::Srgb
        || (space == ColorSpace::Auto && !spec_.format.is_floating_point());
    format_.alphaChannel = spec_.alpha_channel;
}

void PictureFile::fail(std::string const& why) const
{
    std::string const line = why.substr(0, why.find('\n'));
    throw InputError(source_.name() + ": cannot be read as a picture: "
                     + (line.empty() ? "it is damaged or ends early" : line));
}

void PictureFile::readBand(int top, int bottom, std::byte* texels)
{
    int const left = spec_.x, right = spec_.x + spec_.width;
    bool const read = spec_.tile_width > 0
        ? input_->read_tiles(0, 0, left, right, top, bottom, spec_.z, spec_.z + 1, 0,
                             format_.channels, type_, texels)
        : input_->read_scanlines(0, 0, top, bottom, spec_.z, 0, format_.channels, type_, texels);
    // Some readers fill in what is missing and only speak of it.
    std::string const error = input_->geterror();
    if (!read || (!error.empty() && !isHarmless(error)))
        fail(error);
}

void PictureFile::readRows(Row const& row)
{
    std::size_t const texel = format_.bytes();
    std::size_t const rowBytes = static_cast<std::size_t>(spec_.width) * texel;
    int const bandRows = spec_.tile_width > 0 ? spec_.tile_height : kBandRows;
    std::vector<std::byte> band(rowBytes
                                * static_cast<std::size_t>(std::min(bandRows, spec_.height)));

    // The data window's columns and rows at their place in the picture.
    std::int64_t const shift = std::int64_t(spec_.x) - spec_.full_x;
    auto const from = static_cast<std::size_t>(std::max<std::int64_t>(0, -shift));
    auto const to =
        static_cast<std::size_t>(std::clamp<std::int64_t>(width() - shift, 0, spec_.width));
    auto const goal = static_cast<std::size_t>(std::max<std::int64_t>(0, shift));
    std::vector<std::byte> whole(static_cast<std::size_t>(width()) * texel);
    std::vector<std::byte> const blank(whole.size());
    int next = 0;
    for (int top = 0; top < spec_.height; top += bandRows) {
        int const bottom = std::min(top + bandRows, spec_.height);
        readBand(spec_.y + top, spec_.y + bottom, band.data());
        replaceNonFinite(format_.type, band.data(), band.size() / format_.channelBytes());
        for (int r = top; r < bottom; ++r) {
            std::int64_t const y = std::int64_t(r) + spec_.y - spec_.full_y;
            if (y < 0 || y >= height())
                continue;
            while (next < y)
                row(next++, blank.data());
            std::byte const* texels = band.data() + static_cast<std::size_t>(r - top) * rowBytes;
            if (shift != 0 || width() != spec_.width) {
                if (from < to)
                    std::memcpy(whole.data() + goal * texel, texels + from * texel,
                                (to - from) * texel);
                texels = whole.data();
            }
            row(next++, texels);
        }
    }
    while (next < height())
        row(next++, blank.data());
    if (std::string_view(input_->format_name()) == "png") {
        std::ifstream file(source_.file, std::ios::binary);
        std::istringstream part(std::string(bytes_.begin(), bytes_.end()));
        if (!endsWhole(memory_ ? static_cast<std::istream&>(part) : file))
            fail("the file ends early");
    }
}

void PictureFile::readLinear(std::function<void(int y, Vec4f const* texels)> const& row)
{
    TexelCodec const codec(format_);
    std::vector<Vec4f> linear(static_cast<std::size_t>(width()));
    readRows([&](int y, std::byte const* texels) {
        for (std::size_t x = 0; x < linear.size(); ++x)
            linear[x] = codec.read(texels + x * format_.bytes());
        row(y, linear.data());
    });
}

} // namespace zsi::host
