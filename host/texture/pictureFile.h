// SPDX-License-Identifier: Apache-2.0
/// Reading image files, row by row and to the end.
#pragma once

#include "texture/texelFormat.h"

#include <OpenImageIO/filesystem.h>
#include <OpenImageIO/imageio.h>
#include <filesystem>
#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace zsi::host {

enum class ColorSpace {
    Auto, ///< sRGB for files of integers, linear for files of floating-point numbers
    Linear,
    Srgb,
};

/// The ending of names of PNG, JPEG and WebP files, by a file's first bytes; empty for others.
std::string_view pictureEnding(std::vector<unsigned char> const& bytes);

/// Where a picture is: a file, or a part of one.
struct PictureSource {
    std::filesystem::path file;
    std::string part = {}; ///< what the file calls it, such as "images[2]"
    /// Gives the bytes of the part, which are those of a PNG, JPEG or WebP file.
    std::function<std::vector<unsigned char>()> bytes = {};

    std::string name() const { return part.empty() ? file.string() : file.string() + ": " + part; }
};

/// An image file, open. All operations throw InputError that names the file.
class PictureFile {
public:
    PictureFile(PictureSource const& source, ColorSpace space);
    PictureFile(std::filesystem::path const& file, ColorSpace space)
        : PictureFile(PictureSource{file}, space)
    {
    }

    int width() const { return spec_.full_width; }
    int height() const { return spec_.full_height; }
    /// At most 4 channels, at the depth of the file; alpha is not multiplied in.
    TexelFormat const& format() const { return format_; }

    /// Every row from the top, `y` rising. What the file's data window leaves out is 0, and so is
    /// what is not finite. Throws when the file is damaged or ends early, wherever that is.
    using Row = std::function<void(int y, std::byte const* texels)>;
    void readRows(Row const& row);
    /// The same as linear RGBA.
    void readLinear(std::function<void(int y, Vec4f const* texels)> const& row);

    [[noreturn]] void fail(std::string const& why) const;

private:
    void open(OIIO::ImageSpec const& config);
    void readBand(int top, int bottom, std::byte* texels);

    PictureSource source_;
    std::vector<unsigned char> bytes_; ///< of a part
    std::unique_ptr<OIIO::Filesystem::IOMemReader> memory_; ///< outlives `input_`
    std::unique_ptr<OIIO::ImageInput> input_;
    OIIO::ImageSpec spec_;
    OIIO::TypeDesc type_;
    TexelFormat format_;
};

} // namespace zsi::host
