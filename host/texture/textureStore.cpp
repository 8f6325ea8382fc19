#include "texture/textureStore.h"

#include "base/error.h"
#include "texture/latLong.h"
#include "texture/linearInput.h"

#include <OpenImageIO/imagecache.h>
#include <OpenImageIO/texture.h>
#include <cmath>
#include <map>
#include <zsi/vecmath.h>

namespace zsi::host {
namespace {

struct TextureSystemDeleter {
    void operator()(OIIO::TextureSystem* system) const { OIIO::TextureSystem::destroy(system); }
};
using TextureSystemPtr = std::unique_ptr<OIIO::TextureSystem, TextureSystemDeleter>;

TextureSystemPtr newTextureSystem()
{
    TextureSystemPtr system(OIIO::TextureSystem::create(false));
    system->attribute("max_memory_MB", 1024.0f);
    system->attribute("autotile", 64);
    return system;
}

/// Channels of a file as RGBA: grey is repeated, alpha is 1 where there is none.
Vec4f toRgba(float const* c, int channels)
{
    switch (channels) {
    case 1:
        return {c[0], c[0], c[0], 1.0f};
    case 2:
        return {c[0], c[0], c[0], c[1]};
    case 3:
        return {c[0], c[1], c[2], 1.0f};
    default:
        return {c[0], c[1], c[2], c[3]};
    }
}

class Texture2D final : public HostTexture2D {
public:
    Texture2D(OIIO::TextureSystem& system, OIIO::TextureSystem::TextureHandle* handle, int channels)
        : system_(system)
        , handle_(handle)
        , channels_(channels < 4 ? channels : 4)
    {
    }
    void reserved0() override { }
    void reserved1() override { }

    void lookup(Vec4f* result, Vec2f const* uv) const override
    {
        if (!std::isfinite(uv->x) || !std::isfinite(uv->y))
            return;
        OIIO::TextureOpt options;
        options.swrap = options.twrap = OIIO::TextureOpt::WrapPeriodic;
        options.interpmode = OIIO::TextureOpt::InterpBilinear;
        options.mipmode = OIIO::TextureOpt::MipModeNoMIP;
        float texel[4] = {0, 0, 0, 1};
        // The contract hands no footprint down; samples of the pixel do the filtering.
        if (system_.texture(handle_, system_.get_perthread_info(), options, fract(uv->x),
                            1.0f - fract(uv->y), 0, 0, 0, 0, channels_, texel))
            *result = toRgba(texel, channels_);
    }

private:
    OIIO::TextureSystem& system_;
    OIIO::TextureSystem::TextureHandle* handle_;
    int channels_;
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
    explicit TextureCube(LatLong picture)
        : picture_(std::move(picture))
    {
    }
    void reserved0() override { }
    void reserved1() override { }

    void lookup(Vec4f* result, Vec3f const* d) const override
    {
        if (std::isfinite(d->x) && std::isfinite(d->y) && std::isfinite(d->z))
            *result = picture_.lookup(*d);
    }

private:
    LatLong picture_;
};

bool isSrgb(OIIO::ImageSpec const& spec, ColorSpace space)
{
    return space == ColorSpace::Srgb
        || (space == ColorSpace::Auto && spec.format == OIIO::TypeDesc::UINT8);
}

[[noreturn]] void fail(std::filesystem::path const& file, std::string const& why)
{
    throw InputError(file.string() + ": cannot be read as a picture: " + why);
}

/// Whether the file is to be decoded from sRGB. Throws InputError when it is no picture.
bool probe(std::filesystem::path const& file, ColorSpace space)
{
    if (!std::filesystem::exists(file))
        throw InputError(file.string() + ": no such file");
    auto const input = OIIO::ImageInput::open(file.string());
    if (!input)
        fail(file, OIIO::geterror());
    OIIO::ImageSpec const& spec = input->spec();
    if (spec.width < 1 || spec.height < 1 || spec.nchannels < 1 || spec.depth > 1 || spec.deep)
        fail(file, "expected a flat picture");
    return isSrgb(spec, space);
}

LatLong readPicture(std::filesystem::path const& file, ColorSpace space)
{
    LinearInput input(probe(file, space));
    OIIO::ImageSpec spec;
    if (!input.open(file.string(), spec))
        fail(file, input.geterror());
    LatLong picture(spec.width, spec.height);
    std::vector<float> row(static_cast<std::size_t>(spec.width)
                           * static_cast<std::size_t>(spec.nchannels));
    for (int y = 0; y < spec.height; ++y) {
        if (!input.read_native_scanline(0, 0, spec.y + y, spec.z, row.data()))
            fail(file, input.geterror());
        for (int x = 0; x < spec.width; ++x)
            picture.at(x, y) =
                toRgba(row.data() + std::ptrdiff_t(x) * spec.nchannels, spec.nchannels);
    }
    return picture;
}

} // namespace

struct TextureStore::Impl {
    // One cache for each way of reading, so that a file may be used both ways.
    TextureSystemPtr linear = newTextureSystem();
    TextureSystemPtr srgb = newTextureSystem();

    template <class Texture>
    using Kept = std::map<std::string, std::unique_ptr<Texture>>;
    Kept<Texture2D> textures2D;
    Kept<Texture1D> textures1D;
    Kept<TextureCube> cubes;

    template <class Texture, class Make>
    Texture const* keep(Kept<Texture>& kept, std::filesystem::path const& file, ColorSpace space,
                        std::string const& variant, Make&& make)
    {
        std::string const key =
            file.string() + '|' + std::to_string(static_cast<int>(space)) + '|' + variant;
        auto const found = kept.find(key);
        if (found != kept.end())
            return found->second.get();
        return kept.emplace(key, make()).first->second.get();
    }
};

TextureStore::TextureStore()
    : impl_(std::make_unique<Impl>())
{
}

TextureStore::~TextureStore() = default;

HostTexture2D const* TextureStore::load2D(std::filesystem::path const& file, ColorSpace space)
{
    return impl_->keep(impl_->textures2D, file, space, "", [&] {
        bool const srgb = probe(file, space);
        OIIO::TextureSystem& system = srgb ? *impl_->srgb : *impl_->linear;
        OIIO::ustring const name(file.string());
        // A cache of its own per way of reading: each file has one reader.
        OIIO::ImageCache* const cache = system.imagecache();
        cache->add_file(name, srgb ? LinearInput::createSrgb : LinearInput::createLinear);
        OIIO::ImageSpec spec;
        OIIO::TextureSystem::TextureHandle* const handle = system.get_texture_handle(name);
        if (!handle || !cache->get_imagespec(name, spec))
            fail(file, system.geterror());
        return std::make_unique<Texture2D>(system, handle, spec.nchannels);
    });
}

HostTexture1D const* TextureStore::load1D(std::filesystem::path const& file, ColorSpace space)
{
    return impl_->keep(impl_->textures1D, file, space, "", [&] {
        LatLong const picture = readPicture(file, space);
        std::vector<Vec4f> ramp(static_cast<std::size_t>(picture.width));
        for (int x = 0; x < picture.width; ++x)
            ramp[static_cast<std::size_t>(x)] = picture.at(x, picture.height / 2);
        return std::make_unique<Texture1D>(std::move(ramp));
    });
}

HostTextureCube const* TextureStore::loadCube(std::filesystem::path const& file, ColorSpace space,
                                              float blur)
{
    return impl_->keep(impl_->cubes, file, space, std::to_string(blur), [&] {
        LatLong picture = readPicture(file, space);
        if (blur > 0.0f)
            picture = blurred(picture, blur);
        evenOutPoles(picture);
        return std::make_unique<TextureCube>(std::move(picture));
    });
}

HostTextureCube const* TextureStore::loadIrradiance(std::filesystem::path const& file,
                                                    ColorSpace space)
{
    return loadCube(file, space, 1.57079633f);
}

} // namespace zsi::host
