#include "film/imageFile.h"

#include "base/error.h"

#include <OpenImageIO/filesystem.h>
#include <OpenImageIO/imageio.h>
#include <algorithm>
#include <cctype>
#include <cerrno>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <fcntl.h>
#include <fmt/format.h>
#include <unistd.h>
#include <utility>
#include <zsi/vecmath.h>

namespace zsi::host {
namespace {

/// IEC 61966-2-1, to the nearest of 256 steps; NaN becomes 0.
std::uint8_t encodeSrgb(float linear)
{
    if (!(linear > 0.0f))
        return 0;
    if (linear >= 1.0f)
        return 255;
    float const v =
        linear <= 0.0031308f ? 12.92f * linear : 1.055f * std::pow(linear, 1.0f / 2.4f) - 0.055f;
    return static_cast<std::uint8_t>(std::lround(v * 255.0f));
}

std::uint8_t encodeLinear(float v)
{
    return !(v > 0.0f) ? std::uint8_t(0)
                       : static_cast<std::uint8_t>(std::lround(minOf(v, 1.0f) * 255.0f));
}

struct Encoding {
    int channels;
    OIIO::TypeDesc type;
};

Encoding encodingOf(std::filesystem::path const& file)
{
    std::string extension = file.extension().string();
    std::transform(extension.begin(), extension.end(), extension.begin(),
                   [](unsigned char c) { return static_cast<char>(std::tolower(c)); });
    if (extension == ".exr")
        return {4, OIIO::TypeDesc::FLOAT};
    if (extension == ".hdr")
        return {3, OIIO::TypeDesc::FLOAT};
    if (extension == ".png")
        return {4, OIIO::TypeDesc::UINT8};
    if (extension == ".jpg" || extension == ".jpeg")
        return {3, OIIO::TypeDesc::UINT8};
    throw InputError(file.string()
                     + ": unknown kind of picture; expected .exr, .hdr, .png, .jpg or .jpeg");
}

[[noreturn]] void fail(std::filesystem::path const& file, std::string const& why)
{
    throw InputError(file.string() + ": cannot be written: " + why);
}

/// A file beside the one that it may become, removed on the way out otherwise.
class TemporaryFile {
public:
    /// Throws InputError when there can be no such file.
    explicit TemporaryFile(std::filesystem::path const& goal)
        : goal_(goal)
        , path_(
              goal.parent_path()
              / fmt::format(".{}.{}{}", goal.stem().string(), getpid(), goal.extension().string()))
        , descriptor_(open(path_.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0666))
    {
        if (descriptor_ < 0)
            fail(goal_, std::strerror(errno));
    }
    TemporaryFile(TemporaryFile const&) = delete;
    TemporaryFile& operator=(TemporaryFile const&) = delete;
    ~TemporaryFile()
    {
        if (descriptor_ >= 0)
            close(descriptor_);
        if (!path_.empty())
            unlink(path_.c_str());
    }

    void write(std::vector<unsigned char> const& bytes) const
    {
        for (std::size_t done = 0; done < bytes.size();) {
            ssize_t const n = ::write(descriptor_, bytes.data() + done, bytes.size() - done);
            if (n < 0 && errno != EINTR)
                fail(goal_, std::strerror(errno));
            done += n > 0 ? static_cast<std::size_t>(n) : 0;
        }
    }

    void becomeGoal()
    {
        int const closed = close(std::exchange(descriptor_, -1)); // some disks tell only now
        if (closed != 0 || rename(path_.c_str(), goal_.c_str()) != 0)
            fail(goal_, std::strerror(errno));
        path_.clear();
    }

private:
    std::filesystem::path const& goal_;
    std::filesystem::path path_;
    int descriptor_;
};

/// The bytes of the file. Made in memory, since some encoders do not notice a full disk and one
/// ends the program over it.
std::vector<unsigned char> encode(std::filesystem::path const& file, Picture const& picture,
                                  float exposure, Encoding const& encoding)
{
    std::vector<unsigned char> result;
    OIIO::Filesystem::IOVecOutput memory(result);
    auto const output = OIIO::ImageOutput::create(file.string());
    if (!output || !output->set_ioproxy(&memory))
        fail(file, OIIO::geterror());
    OIIO::ImageSpec spec(picture.width, picture.height, encoding.channels, encoding.type);
    bool const encoded = encoding.type == OIIO::TypeDesc::UINT8;
    spec.attribute("oiio:ColorSpace", encoded ? "sRGB" : "Linear");
    spec.attribute("Software", "zsi");
    spec.attribute("DateTime", ""); // the same picture is the same file
    if (encoded)
        spec.attribute("oiio:UnassociatedAlpha", 1); // colours go out as they are
    if (file.extension() == ".exr")
        spec.attribute("compression", "zip");
    spec.attribute("CompressionQuality", 95);
    if (!output->open(file.string(), spec))
        fail(file, output->geterror());

    auto const pixels =
        static_cast<std::size_t>(picture.width) * static_cast<std::size_t>(picture.height);
    auto const channels = static_cast<std::size_t>(encoding.channels);
    bool written;
    if (encoded) {
        float const gain = std::exp2(exposure);
        std::vector<std::uint8_t> bytes(pixels * channels);
        for (std::size_t i = 0; i < pixels; ++i)
            for (std::size_t c = 0; c < channels; ++c) {
                float const v = picture.rgba[i * 4 + c];
                bytes[i * channels + c] = c == 3 ? encodeLinear(v) : encodeSrgb(v * gain);
            }
        written = output->write_image(OIIO::TypeDesc::UINT8, bytes.data());
    } else {
        written = output->write_image(OIIO::TypeDesc::FLOAT, picture.rgba.data(),
                                      static_cast<OIIO::stride_t>(4 * sizeof(float)));
    }
    bool const closed = output->close();
    if (!written || !closed)
        fail(file, output->geterror());
    return result;
}

} // namespace

void checkPictureFile(std::filesystem::path const& file)
{
    encodingOf(file);
    std::error_code ignored;
    if (std::filesystem::is_directory(file, ignored))
        fail(file, "it is a folder");
    if (std::filesystem::exists(file, ignored) && access(file.c_str(), W_OK) != 0)
        fail(file, std::strerror(errno));
    TemporaryFile const temporary(file);
}

void writePicture(std::filesystem::path const& file, Picture const& picture, float exposure)
{
    Encoding const encoding = encodingOf(file);
    if (picture.width <= 0 || picture.height <= 0)
        throw InputError(file.string() + ": the picture is empty");
    TemporaryFile temporary(file);
    temporary.write(encode(file, picture, exposure, encoding));
    temporary.becomeGoal();
}

} // namespace zsi::host
