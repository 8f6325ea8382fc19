// SPDX-License-Identifier: Apache-2.0
/// Reading image files, row by row and to the end.
#pragma once

#include "texture/texelFormat.h"

#include <OpenImageIO/imageio.h>
#include <filesystem>
#include <functional>
#include <memory>
#include <string>

namespace zsi::host {

enum class ColorSpace {
    Auto, ///< sRGB for files of integers, linear for files of floating-point numbers
    Linear,
    Srgb,
};

/// An image file, open. All operations throw InputError that names the file.
class PictureFile {
public:
    PictureFile(std::filesystem::path const& file, ColorSpace space);

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
    void readBand(int top, int bottom, std::byte* texels);

    std::filesystem::path path_;
    std::unique_ptr<OIIO::ImageInput> input_;
    OIIO::ImageSpec spec_;
    OIIO::TypeDesc type_;
    TexelFormat format_;
};

} // namespace zsi::host
