// SPDX-License-Identifier: Apache-2.0
/// Textures from image files, as shaders see them.
#pragma once

#include "texture/pictureFile.h"
#include "texture/pictureTreatment.h"

#include <filesystem>
#include <memory>
#include <string>
#include <vector>
#include <zsi/zsi.h>

namespace zsi::host {

struct TextureOptions {
    /// Bytes of pictures in memory at a time. What is beyond lies in scratch files in $TMPDIR, else
    /// in /var/tmp.
    std::size_t cacheBytes = std::size_t(128) << 20;
};

/// What a texture was made of.
struct TextureOrigin {
    std::filesystem::path file; ///< empty for a texture of another origin
    std::string treatment; ///< how it was read and what was made of it
};

/// Owns every texture of a scene; the same file asked for twice is one object. Look-ups may come
/// from any number of threads. All `load` operations read the file to its end and throw InputError
/// that names it when it is missing, no picture, damaged or cut short.
class TextureStore {
public:
    explicit TextureStore(TextureOptions const& options = {});
    ~TextureStore();

    /// v runs upwards: (0, 0) is the lower left corner of the picture. Wraps periodically; reads
    /// smaller levels under a TextureFootprint.
    HostTexture2D const* load2D(std::filesystem::path const& file, ColorSpace space)
    {
        return load2D(PictureSource{file}, space, {});
    }
    /// The same of what `treatment` makes of it.
    HostTexture2D const* load2D(PictureSource const& source, ColorSpace space,
                                PictureTreatment const& treatment);
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

    TextureOrigin origin(void const* texture) const;

    /// For a user whose pictures did not fit: what to do about it. Empty while all is well.
    std::vector<std::string> warnings() const;

private:
    struct Impl;
    std::unique_ptr<Impl> impl_;
};

} // namespace zsi::host
