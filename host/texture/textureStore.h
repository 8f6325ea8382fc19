/// Textures from image files, as shaders see them.
#pragma once

#include <filesystem>
#include <memory>
#include <zsi/zsi.h>

namespace zsi::host {

enum class ColorSpace {
    Auto, ///< sRGB for 8-bit colour files, linear for float files
    Linear,
    Srgb,
};

/// Owns every texture of a scene; the same file asked for twice is one object. Thread-safe look-ups
/// through a shared texture cache. All `load` operations throw InputError when the file is missing
/// or is no image.
class TextureStore {
public:
    TextureStore();
    ~TextureStore();

    /// v runs upwards: (0, 0) is the lower left corner of the picture. Wraps periodically.
    HostTexture2D const* load2D(std::filesystem::path const& file, ColorSpace space);
    /// A ramp along u at the middle row; clamps.
    HostTexture1D const* load1D(std::filesystem::path const& file, ColorSpace space);
    /// An environment from a latitude-longitude picture; the cube's y axis is up. `blur` is the
    /// half-angle in radians over which the picture is prefiltered (0: none; pi/2 with a cosine
    /// weight gives irradiance / pi, see `irradiance`).
    HostTextureCube const* loadCube(std::filesystem::path const& file, ColorSpace space,
                                    float blur = 0.0f);
    /// The same picture convolved with the cosine lobe, divided by pi: what a white diffuse surface
    /// facing a direction shows.
    HostTextureCube const* loadIrradiance(std::filesystem::path const& file, ColorSpace space);

private:
    struct Impl;
    std::unique_ptr<Impl> impl_;
};

} // namespace zsi::host
