// SPDX-License-Identifier: Apache-2.0
#include "texture/textureStore.h"

#include "base/activity.h"

#include "texture/heightsOfNormals.h"
#include "texture/latLong.h"
#include "texture/textureFootprint.h"
#include "texture/textureProbe.h"

#include <algorithm>
#include <cmath>
#include <map>
#include <system_error>
#include <zsi/vecmath.h>

namespace zsi::host {
namespace {

class Texture2D final : public HostTexture2D {
public:
    Texture2D(TiledPicture picture, std::array<EdgeMode, 2> edges)
        : picture_(std::move(picture))
        , edges_(edges)
    {
        picture_.clampEdges(edges[0] != EdgeMode::Repeat, edges[1] != EdgeMode::Repeat);
    }
    void reserved0() override { }
    void reserved1() override { }

    void lookup(Vec4f* result, Vec2f const* uv) const override
    {
        Doing const looking(Activity::Textures);
        if (TextureProbe* const probe = TextureProbe::current()) [[unlikely]]
            *result = probe->texel();
        else if (std::isfinite(uv->x) && std::isfinite(uv->y))
            *result = picture_.filtered(TextureFootprint::width(), within(uv->x, edges_[0]),
                                        1.0f - within(uv->y, edges_[1]));
    }

private:
    /// 0..1.
    static float within(float x, EdgeMode edge)
    {
        if (edge == EdgeMode::Repeat) [[likely]]
            return fract(x);
        return edge == EdgeMode::Clamp ? clamp01(x)
                                       : std::fabs(2.0f * fract(0.5f * x + 0.5f) - 1.0f);
    }

    TiledPicture picture_;
    std::array<EdgeMode, 2> edges_;
};

class Texture1D final : public HostTexture1D {
public:
    explicit Texture1D(std::vector<Vec4f> ramp)
        : ramp_(std::move(ramp))
    {
    }
    void reserved0() override { }
    void reserved1() override { }

    void lookup(Vec4f* result, float const* u) const override
    {
        if (!std::isfinite(*u))
            return;
        auto const last = static_cast<float>(ramp_.size() - 1);
        float const x = clamp(*u * static_cast<float>(ramp_.size()) - 0.5f, 0.0f, last);
        auto const i = static_cast<std::size_t>(x);
        float const t = x - static_cast<float>(i);
        std::size_t const next = i + 1 < ramp_.size() ? i + 1 : i;
        *result = ramp_[i] * (1.0f - t) + ramp_[next] * t;
    }

private:
    std::vector<Vec4f> ramp_;
};

class TextureCube final : public HostTextureCube {
public:
    explicit TextureCube(TiledPicture picture)
        : picture_(std::move(picture))
    {
    }
    void reserved0() override { }
    void reserved1() override { }

    void lookup(Vec4f* result, Vec3f const* d) const override
    {
        Doing const looking(Activity::Textures);
        if (std::isfinite(d->x) && std::isfinite(d->y) && std::isfinite(d->z))
            *result = lookupLatLong(picture_, *d);
    }

private:
    TiledPicture picture_;
};

/// Of what a treatment makes: one channel where all are alike, finer than codes of 8 bits where
/// values change.
TexelFormat treatedFormat(PictureFile const& picture, PictureTreatment const& treatment)
{
    TexelFormat const& from = picture.format();
    TexelFormat format;
    bool const keeps = treatment.keepsValues() && !from.srgb;
    // Differences of heights side by side are small beside the heights.
    format.type = treatment.fromNormals          ? TexelType::Float
        : keeps || from.type == TexelType::Float ? from.type
                                                 : TexelType::Half;
    bool const isGrey =
        std::ranges::all_of(treatment.curve, [](Vec3f c) { return c.x == c.y && c.y == c.z; });
    bool const allAlike = (treatment.channel >= 0 || treatment.fromNormals) && isGrey
        && treatment.factor
            == std::array{treatment.factor[0], treatment.factor[0], treatment.factor[0],
                          treatment.factor[0]};
    format.channels = allAlike ? 1 : 4;
    return format;
}

void addTreatedRow(PictureFile const& picture, PictureTreatment const& treatment,
                   TexelFormat const& format, int y, Vec4f const* texels,
                   TiledPictureWriter& writer)
{
    std::vector<float> values;
    float const v = 1.0f - (static_cast<float>(y) + 0.5f) / static_cast<float>(picture.height());
    for (int x = 0; x < picture.width(); ++x) {
        float const u = (static_cast<float>(x) + 0.5f) / static_cast<float>(picture.width());
        Vec4f const made = treatment.applied(texels[x], {u, v});
        float const channels[] = {made.x, made.y, made.z, made.w};
        values.insert(values.end(), channels, channels + format.channels);
    }
    writer.addLinearRow(values.data());
}

void writeHeights(PictureFile& picture, PictureTreatment const& treatment,
                  TexelFormat const& format, TiledPictureWriter& writer)
{
    std::vector<Vec3f> normals;
    picture.readLinear([&](int, Vec4f const* texels) {
        for (int x = 0; x < picture.width(); ++x)
            normals.push_back(rgb(texels[x]));
    });
    std::vector<float> const heights = heightsOfNormals(normals, picture.width(), picture.height());
    std::vector<Vec4f> row;
    for (int y = 0; y < picture.height(); ++y) {
        auto const first = heights.begin() + std::ptrdiff_t(y) * picture.width();
        row.clear();
        for (auto h = first; h != first + picture.width(); ++h)
            row.emplace_back(*h, *h, *h, 1.0f);
        addTreatedRow(picture, treatment, format, y, row.data(), writer);
    }
}

/// Writes rows of an environment, evened out, as three or four channels.
class CubeWriter {
public:
    CubeWriter(TexelType type, bool alpha, int width, int height, TileMemory& memory)
        : channels_(alpha ? 4 : 3)
        , width_(width)
        , height_(height)
        , writer_({type, channels_, false, alpha ? 3 : -1}, width, height, false, memory)
        , row_(static_cast<std::size_t>(width))
    {
    }
    void addRow(int y, Vec4f const* texels)
    {
        std::copy_n(texels, row_.size(), row_.begin());
        evenOutRow(row_.data(), y, width_, height_);
        values_.clear();
        for (Vec4f const& v : row_) {
            values_.insert(values_.end(), {v.x, v.y, v.z});
            if (channels_ == 4)
                values_.push_back(v.w);
        }
        writer_.addLinearRow(values_.data());
    }
    TiledPicture finish() { return writer_.finish(); }

private:
    int channels_, width_, height_;
    TiledPictureWriter writer_;
    std::vector<Vec4f> row_;
    std::vector<float> values_;
};

TiledPicture blurredCube(PictureFile& picture, float blur, TileMemory& memory)
{
    LatLongReduction reduction(picture.width(), picture.height(),
                               blurSourceWidth(blur, picture.width()));
    picture.readLinear([&](int y, Vec4f const* texels) { reduction.addRow(y, texels); });
    LatLong const result = blurred(reduction.result(), blur);
    CubeWriter writer(TexelType::Float, true, result.width, result.height, memory);
    for (int y = 0; y < result.height; ++y)
        writer.addRow(y, result.row(y));
    return writer.finish();
}

TiledPicture sharpCube(PictureFile& picture, TileMemory& memory)
{
    // Means of neighbours have finer steps than codes of 8 bits.
    bool const isFloat = picture.format().type == TexelType::Float;
    CubeWriter writer(isFloat ? TexelType::Float : TexelType::Half,
                      picture.format().channels % 2 == 0, picture.width(), picture.height(),
                      memory);
    picture.readLinear([&](int y, Vec4f const* texels) { writer.addRow(y, texels); });
    return writer.finish();
}

} // namespace

struct TextureStore::Impl {
    explicit Impl(TextureOptions const& options)
        : memory(options.cacheBytes)
    {
    }

    TileMemory memory; // before the textures, whose tiles lie in it

    template <class Texture>
    using Kept = std::map<std::string, std::unique_ptr<Texture>>;
    Kept<Texture2D> textures2D;
    Kept<Texture1D> textures1D;
    Kept<TextureCube> cubes;
    std::map<void const*, TextureOrigin> origins;

    template <class Texture, class Make>
    Texture const* keep(Kept<Texture>& kept, PictureSource const& source, ColorSpace space,
                        std::string const& variant, Make&& make)
    {
        std::string const file = source.file.string();
        std::string const key = file + '|' + source.part + '|'
            + std::to_string(static_cast<int>(space)) + '|' + variant;
        auto const found = kept.find(key);
        if (found != kept.end())
            return found->second.get();
        PictureFile picture(source, space);
        try {
            Texture const* const made = kept.emplace(key, make(picture)).first->second.get();
            origins[made] = {source.file, key.substr(file.size())};
            return made;
        } catch (std::system_error const& error) {
            picture.fail(error.what());
        } catch (std::bad_alloc const&) {
            picture.fail("out of memory");
        }
    }
};

TextureStore::TextureStore(TextureOptions const& options)
    : impl_(std::make_unique<Impl>(options))
{
}

TextureStore::~TextureStore() = default;

HostTexture2D const* TextureStore::load2D(PictureSource const& source, ColorSpace space,
                                          PictureTreatment const& treatment)
{
    auto const make = [&](PictureFile& picture) {
        bool const asItIs = treatment.channel < 0 && treatment.keepsValues();
        TexelFormat const format = asItIs ? picture.format() : treatedFormat(picture, treatment);
        TiledPictureWriter writer(format, picture.width(), picture.height(), true, impl_->memory);
        if (asItIs)
            picture.readRows([&](int, std::byte const* texels) { writer.addRow(texels); });
        else if (treatment.fromNormals)
            writeHeights(picture, treatment, format, writer);
        else
            picture.readLinear([&](int y, Vec4f const* texels) {
                addTreatedRow(picture, treatment, format, y, texels, writer);
            });
        return std::make_unique<Texture2D>(writer.finish(), treatment.edges);
    };
    PictureTreatment keyed = treatment;
    if (treatment.weight)
        keyed.weightKey =
            origin(treatment.weight).file.string() + origin(treatment.weight).treatment;
    return impl_->keep(impl_->textures2D, source, space, keyed.key(), make);
}

HostTexture1D const* TextureStore::load1D(std::filesystem::path const& file, ColorSpace space)
{
    return impl_->keep(impl_->textures1D, PictureSource{file}, space, "",
                       [&](PictureFile& picture) {
                           std::vector<Vec4f> ramp;
                           picture.readLinear([&](int y, Vec4f const* texels) {
                               if (y == picture.height() / 2)
                                   ramp.assign(texels, texels + picture.width());
                           });
                           return std::make_unique<Texture1D>(std::move(ramp));
                       });
}

HostTextureCube const* TextureStore::loadCube(std::filesystem::path const& file, ColorSpace space,
                                              float blur)
{
    return impl_->keep(
        impl_->cubes, PictureSource{file}, space, std::to_string(blur), [&](PictureFile& picture) {
            return std::make_unique<TextureCube>(blurShows(blur, picture.width())
                                                     ? blurredCube(picture, blur, impl_->memory)
                                                     : sharpCube(picture, impl_->memory));
        });
}

HostTextureCube const* TextureStore::loadIrradiance(std::filesystem::path const& file,
                                                    ColorSpace space)
{
    return loadCube(file, space, 1.57079633f);
}

TextureOrigin TextureStore::origin(void const* texture) const
{
    auto const found = impl_->origins.find(texture);
    return found == impl_->origins.end() ? TextureOrigin() : found->second;
}

std::vector<std::string> TextureStore::warnings() const
{
    std::size_t const overflow = impl_->memory.overflow();
    if (overflow == 0)
        return {};
    return {"textures take " + std::to_string((overflow >> 20) + 1)
            + " MB beyond their limit: no room for a scratch file in "
            + TileMemory::scratchFolder().string()
            + "; set TMPDIR to a folder on a disk with room"};
}

} // namespace zsi::host
