/// Reading image files as linear light.
#pragma once

#include <OpenImageIO/imageio.h>
#include <memory>
#include <string>
#include <vector>

namespace zsi::host {

/// An image file as linear float: 8-bit sRGB decoded, alpha not multiplied in, values that are not
/// finite as 0. As a reader under a texture cache it makes all filtering happen in linear light.
class LinearInput final : public OIIO::ImageInput {
public:
    explicit LinearInput(bool srgb)
        : srgb_(srgb)
    {
    }
    static OIIO::ImageInput* createLinear() { return new LinearInput(false); }
    static OIIO::ImageInput* createSrgb() { return new LinearInput(true); }

    char const* format_name() const override { return "linear"; }
    bool open(std::string const& name, OIIO::ImageSpec& spec) override;
    bool open(std::string const& name, OIIO::ImageSpec& spec,
              OIIO::ImageSpec const& config) override;
    bool close() override;
    bool seek_subimage(int subimage, int miplevel) override;
    int current_subimage() const override { return 0; }
    int current_miplevel() const override { return 0; }
    bool read_native_scanline(int subimage, int miplevel, int y, int z, void* data) override;

private:
    bool readRow(int y, float* row);

    bool srgb_;
    std::unique_ptr<OIIO::ImageInput> file_;
    std::vector<float> band_; ///< of a tiled file: the row of tiles last read
    int bandTop_ = -1; ///< row at its top, -1: none
};

/// IEC 61966-2-1.
float decodeSrgb(float encoded);

} // namespace zsi::host
