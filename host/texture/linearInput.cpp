#include "texture/linearInput.h"

#include <algorithm>
#include <cmath>

namespace zsi::host {

float decodeSrgb(float encoded)
{
    return encoded <= 0.04045f ? encoded / 12.92f : std::pow((encoded + 0.055f) / 1.055f, 2.4f);
}

bool LinearInput::open(std::string const& name, OIIO::ImageSpec& spec)
{
    OIIO::ImageSpec config;
    config.attribute("oiio:UnassociatedAlpha", 1);
    file_ = OIIO::ImageInput::open(name, &config);
    if (!file_) {
        errorfmt("{}", OIIO::geterror());
        return false;
    }
    m_spec = file_->spec();
    m_spec.set_format(OIIO::TypeDesc::FLOAT);
    m_spec.tile_width = m_spec.tile_height = m_spec.tile_depth = 0; // the cache tiles
    m_spec.attribute("oiio:ColorSpace", "Linear");
    spec = m_spec;
    return true;
}

bool LinearInput::open(std::string const& name, OIIO::ImageSpec& spec, OIIO::ImageSpec const&)
{
    return open(name, spec);
}

bool LinearInput::close()
{
    bool const closed = !file_ || file_->close();
    file_.reset();
    return closed;
}

bool LinearInput::seek_subimage(int subimage, int miplevel)
{
    return file_ && subimage == 0 && miplevel == 0; // smaller levels are made from the first
}

bool LinearInput::readRow(int y, float* row)
{
    OIIO::ImageSpec const& spec = file_->spec();
    if (spec.tile_width == 0)
        return file_->read_scanline(y, spec.z, OIIO::TypeDesc::FLOAT, row);

    int const top = spec.y + (y - spec.y) / spec.tile_height * spec.tile_height;
    auto const rowSize =
        static_cast<std::size_t>(spec.width) * static_cast<std::size_t>(spec.nchannels);
    if (top != bandTop_) {
        band_.resize(rowSize * static_cast<std::size_t>(spec.tile_height));
        int const bottom = std::min(top + spec.tile_height, spec.y + spec.height);
        bandTop_ = -1;
        if (!file_->read_tiles(0, 0, spec.x, spec.x + spec.width, top, bottom, spec.z, spec.z + 1,
                               0, spec.nchannels, OIIO::TypeDesc::FLOAT, band_.data()))
            return false;
        bandTop_ = top;
    }
    auto const from = band_.begin() + static_cast<std::ptrdiff_t>(rowSize) * (y - top);
    std::copy_n(from, rowSize, row);
    return true;
}

bool LinearInput::read_native_scanline(int, int, int y, int, void* data)
{
    auto* const values = static_cast<float*>(data);
    if (!readRow(y, values)) {
        errorfmt("{}", file_->geterror());
        return false;
    }
    for (int x = 0; x < m_spec.width; ++x)
        for (int c = 0; c < m_spec.nchannels; ++c) {
            float& v = values[x * m_spec.nchannels + c];
            if (!std::isfinite(v))
                v = 0.0f;
            else if (srgb_ && c != m_spec.alpha_channel)
                v = decodeSrgb(v);
        }
    return true;
}

} // namespace zsi::host
