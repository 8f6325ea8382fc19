// SPDX-License-Identifier: Apache-2.0
#include "film/imageFile.h"

#include "base/error.h"
#include "base/replacedFile.h"
#include "texture/exrCheck.h"

#include <OpenImageIO/filesystem.h>
#include <OpenImageIO/imageio.h>
#include <algorithm>
#include <cctype>
#include <cmath>
#include <zsi/vecmath.h>

namespace zsi::host {
namespace {

/// To the nearest of 256 steps; NaN becomes 0.
std::uint8_t quantised(float v)
{
    return !(v > 0.0f) ? std::uint8_t(0)
                       : static_cast<std::uint8_t>(std::lround(minOf(v, 1.0f) * 255.0f));
}

enum class Kind { Exr, Hdr, Png, Jpeg };

Kind kindOf(std::filesystem::path const& file)
{
    std::string extension = file.extension().string();
    std::transform(extension.begin(), extension.end(), extension.begin(),
                   [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
    if (extension == ".exr")
        return Kind::Exr;
    if (extension == ".hdr")
        return Kind::Hdr;
    if (extension == ".png")
        return Kind::Png;
    if (extension == ".jpg" || extension == ".jpeg")
        return Kind::Jpeg;
    throw InputError(file.string()
                     + ": unknown kind of picture; expected .exr, .hdr, .png, .jpg or .jpeg");
}

[[noreturn]] void fail(std::filesystem::path const& file, std::string const& why)
{
    throw InputError(file.string() + ": cannot be written: "
                     + (why.empty() ? "the encoder fails without a reason" : why));
}

/// The layers as one row of channels a pixel, named as EXR files name them: those of the first
/// layer plainly, the others "layer.channel".
struct Channels {
    std::vector<std::string> names;
    std::vector<float> values;
};

Channels interleaved(Picture const& picture)
{
    Channels all;
    for (Layer const& layer : picture.layers)
        for (std::string const& channel : layer.channels)
            all.names.push_back(&layer == &picture.layers.front() ? channel
                                                                  : layer.name + '.' + channel);
    auto const pixels =
        static_cast<std::size_t>(picture.width()) * static_cast<std::size_t>(picture.height());
    all.values.reserve(pixels * all.names.size());
    for (std::size_t i = 0; i < pixels; ++i)
        for (Layer const& layer : picture.layers) {
            std::size_t const n = layer.channels.size();
            auto const from = layer.values.begin() + static_cast<std::ptrdiff_t>(i * n);
            all.values.insert(all.values.end(), from, from + static_cast<std::ptrdiff_t>(n));
        }
    return all;
}

std::vector<std::uint8_t> encoded(Picture const& picture, std::size_t channels,
                                  ScreenView const& view)
{
    std::vector<float> const& rgba = picture.rgba();
    std::size_t const pixels = rgba.size() / 4;
    std::vector<float> rgb(pixels * 3);
    for (std::size_t i = 0; i < pixels; ++i)
        std::copy_n(&rgba[i * 4], 3, &rgb[i * 3]);
    screenTransform(view)(rgb);
    std::vector<std::uint8_t> bytes(pixels * channels);
    for (std::size_t i = 0; i < pixels; ++i)
        for (std::size_t c = 0; c < channels; ++c)
            bytes[i * channels + c] = quantised(c == 3 ? rgba[i * 4 + 3] : rgb[i * 3 + c]);
    return bytes;
}

/// The bytes of the file. Made in memory, since some encoders do not notice a full disk and one
/// ends the program over it.
std::vector<unsigned char> encode(std::filesystem::path const& file, Picture const& picture,
                                  ScreenView const& view, Kind kind)
{
    std::vector<unsigned char> result;
    OIIO::Filesystem::IOVecOutput memory(result);
    auto const output = OIIO::ImageOutput::create(file.filename().string());
    if (!output || !output->set_ioproxy(&memory))
        fail(file, OIIO::geterror());
    bool const screen = kind == Kind::Png || kind == Kind::Jpeg;
    Channels const all = kind == Kind::Exr ? interleaved(picture) : Channels();
    int const channels = kind == Kind::Exr ? static_cast<int>(all.names.size())
        : kind == Kind::Png && view.alpha  ? 4
                                           : 3;
    OIIO::ImageSpec spec(picture.width(), picture.height(), channels,
                         screen ? OIIO::TypeDesc::UINT8 : OIIO::TypeDesc::FLOAT);
    spec.attribute("oiio:ColorSpace", screen ? "sRGB" : "Linear");
    spec.attribute("Software", "zsi");
    spec.attribute("DateTime", ""); // the same picture is the same file
    spec.attribute("oiio:UnassociatedAlpha", 1); // colours go out as they are
    spec.attribute("CompressionQuality", 95);
    if (kind == Kind::Exr) {
        spec.channelnames = all.names;
        spec.attribute("compression", "zip");
        // Rec. 709: x and y of red, green, blue and white.
        constexpr float kPrimaries[8] = {0.64f, 0.33f, 0.3f, 0.6f, 0.15f, 0.06f, 0.3127f, 0.329f};
        spec.attribute("chromaticities", OIIO::TypeDesc(OIIO::TypeDesc::FLOAT, 8), kPrimaries);
        // The data window lies where the crop was in the whole picture.
        spec.x = picture.window.x0;
        spec.y = picture.window.y0;
        spec.full_x = spec.full_y = 0;
        spec.full_width = picture.frameWidth;
        spec.full_height = picture.frameHeight;
        spec.erase_attribute("oiio:UnassociatedAlpha");
        for (Attachment const& attachment : picture.attachments)
            spec.attribute(attachment.name, attachment.text);
    }
    if (!output->open(file.filename().string(), spec))
        fail(file, output->geterror());
    bool written;
    if (kind == Kind::Exr)
        written = output->write_image(OIIO::TypeDesc::FLOAT, all.values.data());
    else if (screen)
        written =
            output->write_image(OIIO::TypeDesc::UINT8,
                                encoded(picture, static_cast<std::size_t>(channels), view).data());
    else
        written = output->write_image(OIIO::TypeDesc::FLOAT, picture.rgba().data(),
                                      static_cast<OIIO::stride_t>(4 * sizeof(float)));
    bool const closed = output->close();
    if (!written || !closed)
        fail(file, output->geterror());
    return result;
}

} // namespace

bool keepsLayers(std::filesystem::path const& file) { return kindOf(file) == Kind::Exr; }

void checkPictureFile(std::filesystem::path const& file)
{
    kindOf(file);
    ReplacedFile::check(file);
}

std::vector<unsigned char> encodePicture(std::filesystem::path const& file, Picture const& picture,
                                         ScreenView const& view)
{
    Kind const kind = kindOf(file);
    if (picture.width() <= 0 || picture.height() <= 0)
        throw InputError(file.string() + ": the picture is empty");
    return encode(file, picture, view, kind);
}

void writePicture(std::filesystem::path const& file, Picture const& picture, ScreenView const& view)
{
    kindOf(file);
    ReplacedFile goal(file);
    goal.write(encodePicture(file, picture, view));
    goal.commit();
}

Picture readPicture(std::filesystem::path const& file)
{
    auto const bad = [&](std::string const& why) -> InputError {
        return InputError(file.string() + ": " + why);
    };
    if (kindOf(file) != Kind::Exr)
        throw bad("has no layers; expected an .exr file");
    if (std::string const wrong = whatIsWrongWithExr(file); !wrong.empty())
        throw bad(wrong);
    auto const input = OIIO::ImageInput::open(file.string());
    if (!input)
        throw bad(OIIO::geterror());
    OIIO::ImageSpec const& spec = input->spec();
    if (spec.deep || spec.depth > 1)
        throw bad("expected a flat picture");
    auto const channels = static_cast<std::size_t>(spec.nchannels);
    auto const pixels =
        static_cast<std::size_t>(spec.width) * static_cast<std::size_t>(spec.height);
    std::vector<float> values(pixels * channels);
    if (!input->read_image(0, 0, 0, -1, OIIO::TypeDesc::FLOAT, values.data()))
        throw bad(input->geterror());
    Picture picture{spec.full_width,
                    spec.full_height,
                    {spec.x, spec.y, spec.x + spec.width, spec.y + spec.height},
                    {{"beauty", {}, {}}}};
    std::vector<std::vector<std::size_t>> from(1); // each layer's channels in the file
    for (std::size_t c = 0; c < channels; ++c) {
        std::string const& name = spec.channelnames[c];
        std::size_t const dot = name.rfind('.');
        std::string const layer = dot == std::string::npos ? "beauty" : name.substr(0, dot);
        std::size_t l = 0;
        while (l < picture.layers.size() && picture.layers[l].name != layer)
            ++l;
        if (l == picture.layers.size()) {
            picture.layers.push_back({layer, {}, {}});
            from.emplace_back();
        }
        picture.layers[l].channels.push_back(dot == std::string::npos ? name
                                                                      : name.substr(dot + 1));
        from[l].push_back(c);
    }
    if (picture.layers.front().channels != std::vector<std::string>{"R", "G", "B", "A"})
        throw bad("expected the channels R, G, B and A");
    for (std::size_t l = 0; l < from.size(); ++l) {
        picture.layers[l].values.reserve(pixels * from[l].size());
        for (std::size_t i = 0; i < pixels; ++i)
            for (std::size_t c : from[l])
                picture.layers[l].values.push_back(values[i * channels + c]);
    }
    // Those of layers have a slash; the others tell of the file itself.
    for (OIIO::ParamValue const& line : spec.extra_attribs)
        if (line.type() == OIIO::TypeDesc::STRING && line.name().find('/') != std::string::npos)
            picture.attachments.push_back({line.name().string(), line.get_string()});
    return picture;
}

} // namespace zsi::host
