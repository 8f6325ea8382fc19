// SPDX-License-Identifier: Apache-2.0
/// Pictures of a glTF file as the texture values of a scene.
#pragma once

#include "model/gltfTexture.h"
#include "texture/pictureFile.h"

#include <map>
#include <set>

namespace zsi::host {

/// Where a scene finds pictures that lie in the model.
struct PicturePlaces {
    std::filesystem::path folder; ///< that names in the scene start in
    /// Not empty: embedded pictures become files in this folder, a name below `folder`; else the
    /// scene names them by model and number.
    std::string embedded;
};

class GltfPictures {
public:
    /// Of a model whose pictures are all files of their own.
    explicit GltfPictures(PicturePlaces const& places)
        : places_(places)
    {
    }
    GltfPictures(std::shared_ptr<GltfFile const> file, PicturePlaces const& places)
        : file_(std::move(file))
        , places_(places)
    {
    }

    enum class Values { Colors, Numbers };
    /// {"texture": ..., "colorSpace": ..., and of `treatment` what is not as it is by default}.
    JsonValue value(GltfTexture const& texture, Values values,
                    std::vector<JsonMember> treatment = {});

    /// Share of the picture's texels whose channel, linear, is `least` or more.
    float shareAbove(GltfTexture const& texture, int channel, float least);
    /// Mean of the channel, linear.
    float mean(GltfTexture const& texture, int channel);

    /// Of an sRGB picture; linear.
    Vec3f meanColor(GltfTexture const& texture);

    /// Names, below `folder`, of embedded pictures that values name, and their numbers.
    std::map<std::string, std::size_t> const& embedded() const { return embedded_; }

private:
    struct Statistics {
        std::array<std::vector<float>, 4> histogram; ///< shares of 256 steps of each channel
    };
    Statistics const& statistics(GltfTexture const& texture);
    PictureSource source(GltfTexture const& texture) const;
    std::filesystem::path fileOf(GltfTexture const& texture) const; ///< empty: embedded
    std::string embeddedName(std::size_t image);

    std::shared_ptr<GltfFile const> file_;
    PicturePlaces const& places_;
    std::map<std::string, std::size_t> embedded_;
    std::map<std::size_t, std::string> names_;
    std::map<std::string, Statistics> statistics_; ///< by the picture's name
};

/// Picture `index` of a glTF file: in it, or a file of its own.
PictureSource pictureSource(std::shared_ptr<GltfFile const> const& file, std::size_t index);

/// The rows of a transform of texture coordinates, for a Mat3f parameter.
JsonValue transformValue(GltfTexture const& texture);

/// `file` as a scene in `folder` names it.
std::string nameFrom(std::filesystem::path const& folder, std::filesystem::path const& file);

} // namespace zsi::host
