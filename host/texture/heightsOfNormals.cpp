// SPDX-License-Identifier: Apache-2.0
#include "texture/heightsOfNormals.h"

#include <OpenImageIO/imagebuf.h>
#include <OpenImageIO/imagebufalgo.h>
#include <complex>
#include <numbers>

namespace zsi::host {
namespace {

using Complex = std::complex<float>;

/// Steeper slopes than this count as this: texels that lie on their side have none.
constexpr float kSteepest = 20.0f;

/// Spectrum of one number of each texel.
std::vector<Complex> spectrum(std::vector<float> const& values, int width, int height)
{
    OIIO::ImageBuf picture(OIIO::ImageSpec(width, height, 1, OIIO::TypeDesc::FLOAT));
    picture.set_pixels(OIIO::ROI(0, width, 0, height), OIIO::TypeDesc::FLOAT, values.data());
    OIIO::ImageBuf const transformed = OIIO::ImageBufAlgo::fft(picture);
    std::vector<Complex> result(values.size());
    transformed.get_pixels(OIIO::ROI(0, width, 0, height, 0, 1, 0, 2), OIIO::TypeDesc::FLOAT,
                           result.data());
    return result;
}

/// Of the wave that index `i` of `count` stands for: per picture, times 2 pi.
float frequency(int i, int count)
{
    constexpr auto kTurn = static_cast<float>(2 * std::numbers::pi);
    return kTurn * static_cast<float>(2 * i > count ? i - count : i);
}

} // namespace

std::vector<float> heightsOfNormals(std::vector<Vec3f> const& normals, int width, int height)
{
    std::vector<float> across(normals.size()), down(normals.size());
    for (std::size_t i = 0; i < normals.size(); ++i) {
        Vec3f const n(2 * normals[i].x - 1, 2 * normals[i].y - 1, 2 * normals[i].z - 1);
        auto const slope = [&](float along) {
            float const s = along / (n.z > 1e-4f ? n.z : 1e-4f);
            return s < -kSteepest ? -kSteepest : s > kSteepest ? kSteepest : s;
        };
        across[i] = -slope(n.x);
        down[i] = slope(n.y); // rows run downwards
    }
    std::vector<Complex> const p = spectrum(across, width, height),
                               q = spectrum(down, width, height);
    std::vector<Complex> heights(p.size());
    for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x) {
            float const u = frequency(x, width), v = frequency(y, height);
            float const sum = u * u + v * v;
            auto const i = static_cast<std::size_t>(y) * static_cast<std::size_t>(width)
                + static_cast<std::size_t>(x);
            if (sum > 0.0f)
                heights[i] = Complex(0, -1) * (p[i] * u + q[i] * v) / sum;
        }
    OIIO::ImageBuf waves(OIIO::ImageSpec(width, height, 2, OIIO::TypeDesc::FLOAT));
    waves.set_pixels(OIIO::ROI(0, width, 0, height, 0, 1, 0, 2), OIIO::TypeDesc::FLOAT,
                     heights.data());
    OIIO::ImageBuf const back = OIIO::ImageBufAlgo::ifft(waves);
    std::vector<float> result(normals.size());
    back.get_pixels(OIIO::ROI(0, width, 0, height, 0, 1, 0, 1), OIIO::TypeDesc::FLOAT,
                    result.data());
    return result;
}

} // namespace zsi::host
