// SPDX-License-Identifier: Apache-2.0
#include "model/gltfPictures.h"

#include "base/error.h"
#include "json/jsonText.h"

#include <algorithm>
#include <cctype>
#include <cmath>
#include <fmt/format.h>

namespace zsi::host {
namespace {

constexpr std::size_t kSteps = 256;

} // namespace

std::string nameFrom(std::filesystem::path const& folder, std::filesystem::path const& file)
{
    namespace fs = std::filesystem;
    fs::path const whole = fs::absolute(file).lexically_normal();
    fs::path const from = fs::absolute(folder / "x").lexically_normal().parent_path();
    fs::path const relative = whole.lexically_relative(from);
    return relative.empty() ? whole.string() : relative.string();
}

PictureSource pictureSource(std::shared_ptr<GltfFile const> const& file, std::size_t index)
{
    if (std::filesystem::path const own = file->imageFile(index); !own.empty())
        return {own};
    return {file->file(), fmt::format("images[{}]", index),
            [=] { return file->imageBytes(index); }};
}

std::filesystem::path GltfPictures::fileOf(GltfTexture const& texture) const
{
    return texture.ownFile.empty() ? file_->imageFile(texture.image) : texture.ownFile;
}

PictureSource GltfPictures::source(GltfTexture const& texture) const
{
    return texture.ownFile.empty() ? pictureSource(file_, texture.image)
                                   : PictureSource{texture.ownFile};
}

std::string GltfPictures::embeddedName(std::size_t image)
{
    auto const [name, isNew] = names_.try_emplace(image);
    if (!isNew)
        return name->second;
    JsonReader const entry = file_->element("images", image);
    auto const given = entry.find("name");
    std::string stem;
    for (char const c : given ? given->toString() : std::string())
        if (stem.size() < 40)
            stem += std::isalnum(static_cast<unsigned char>(c)) || c == '-' ? c : '_';
    Bytes const bytes = file_->imageBytes(image);
    std::string_view const ending = pictureEnding(bytes);
    if (ending.empty())
        entry.fail("expected PNG, JPEG or WebP");
    name->second =
        fmt::format("{}/{}{}{}{}", places_.embedded, image, stem.empty() ? "" : "_", stem, ending);
    embedded_[name->second] = image;
    return name->second;
}

JsonValue GltfPictures::value(GltfTexture const& texture, Values values,
                              std::vector<JsonMember> treatment)
{
    std::vector<JsonMember> members;
    if (std::filesystem::path const own = fileOf(texture); !own.empty()) {
        members.push_back({"texture", jsonOf(nameFrom(places_.folder, own))});
    } else if (!places_.embedded.empty()) {
        members.push_back({"texture", jsonOf(embeddedName(texture.image))});
    } else {
        members.push_back({"texture", jsonOf(nameFrom(places_.folder, file_->file()))});
        members.push_back({"image", jsonOf(static_cast<int>(texture.image))});
    }
    members.push_back({"colorSpace", jsonOf(values == Values::Colors ? "srgb" : "linear")});
    for (JsonMember& member : treatment)
        members.push_back(std::move(member));
    if (texture.wrap.kind != JsonValue::Kind::Null)
        members.push_back({"wrap", texture.wrap});
    return jsonObject(std::move(members));
}

GltfPictures::Statistics const& GltfPictures::statistics(GltfTexture const& texture)
{
    PictureSource const from = source(texture);
    auto const [found, isNew] = statistics_.try_emplace(from.name());
    if (!isNew)
        return found->second;
    PictureFile picture(from, ColorSpace::Linear);
    for (auto& channel : found->second.histogram)
        channel.assign(kSteps, 0.0f);
    double const each = 1.0 / (double(picture.width()) * picture.height());
    std::array<std::vector<double>, 4> sums;
    for (auto& channel : sums)
        channel.assign(kSteps, 0.0);
    picture.readLinear([&](int, Vec4f const* texels) {
        for (int x = 0; x < picture.width(); ++x) {
            float const values[] = {texels[x].x, texels[x].y, texels[x].z, texels[x].w};
            for (std::size_t c = 0; c < 4; ++c)
                sums[c][static_cast<std::size_t>(std::lround(clamp01(values[c]) * 255.0f))] += each;
        }
    });
    for (std::size_t c = 0; c < 4; ++c)
        std::transform(sums[c].begin(), sums[c].end(), found->second.histogram[c].begin(),
                       [](double v) { return static_cast<float>(v); });
    return found->second;
}

float GltfPictures::shareAbove(GltfTexture const& texture, int channel, float least)
{
    auto const& histogram = statistics(texture).histogram[static_cast<std::size_t>(channel)];
    float share = 0;
    for (std::size_t i = 0; i < kSteps; ++i)
        if (static_cast<float>(i) / 255.0f >= least)
            share += histogram[i];
    return share;
}

float GltfPictures::mean(GltfTexture const& texture, int channel)
{
    auto const& histogram = statistics(texture).histogram[static_cast<std::size_t>(channel)];
    float mean = 0;
    for (std::size_t i = 0; i < kSteps; ++i)
        mean += histogram[i] * static_cast<float>(i) / 255.0f;
    return mean;
}

Vec3f GltfPictures::meanColor(GltfTexture const& texture)
{
    // The histograms are of codes: IEC 61966-2-1 makes them linear.
    auto const linear = [](float c) {
        return c <= 0.04045f ? c / 12.92f : std::pow((c + 0.055f) / 1.055f, 2.4f);
    };
    auto const& channels = statistics(texture).histogram;
    std::array<float, 3> mean{};
    for (std::size_t c = 0; c < 3; ++c)
        for (std::size_t i = 0; i < kSteps; ++i)
            mean[c] += channels[c][i] * linear(static_cast<float>(i) / 255.0f);
    return {mean[0], mean[1], mean[2]};
}

JsonValue transformValue(GltfTexture const& texture)
{
    if (!texture.isTransformed)
        return jsonObject({{"scale", jsonOf(1)}});
    float const* const m = texture.transform.m;
    return jsonArray(
        {jsonOf(std::span(m, 3)), jsonOf(std::span(m + 3, 3)), jsonOf(std::span(m + 6, 3))});
}

} // namespace zsi::host
