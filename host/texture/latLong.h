// SPDX-License-Identifier: Apache-2.0
/// Latitude-longitude pictures as functions of direction.
#pragma once

#include "texture/tiledPicture.h"

#include <vector>

namespace zsi::host {

/// Linear RGBA over the sphere. Rows run from the zenith (+y) to the nadir, columns once around
/// to the right: with +y up, the middle column lies towards -z and +x is to the right of it.
struct LatLong {
    int width = 0;
    int height = 0;
    std::vector<Vec4f> texels;

    LatLong(int width_, int height_)
        : width(width_)
        , height(height_)
        , texels(static_cast<std::size_t>(width_) * static_cast<std::size_t>(height_))
    {
    }
    Vec4f* row(int y) { return texels.data() + std::ptrdiff_t(y) * width; }
    Vec4f const* row(int y) const { return texels.data() + std::ptrdiff_t(y) * width; }
};

/// Level 0 of `picture` towards `d`, of any length: cubic B-spline over texels, around the date
/// line and over the poles. Finite for finite `d`; zero length counts as up.
Vec4f lookupLatLong(TiledPicture const& picture, Vec3f d);

/// Averages neighbours of row `y` where it is shorter than the equator, so that texels cover about
/// the same angle in every direction and the poles have one value: no pinch, no seam.
void evenOutRow(Vec4f* row, int y, int width, int height);

/// A picture that rows of another come into, each of its texels the mean over its solid angle: so a
/// large picture is never in memory whole.
class LatLongReduction {
public:
    LatLongReduction(int width, int height, int reducedWidth);

    void addRow(int y, Vec4f const* texels); ///< y rises from 0 without gap
    LatLong const& result() const { return result_; }

private:
    int width_, height_;
    LatLong result_;
    std::vector<Vec4f> narrow_;
    std::vector<double> sums_;
    double weight_ = 0;
};

/// Whether a blur of this angle, in radians, changes a picture of this width.
bool blurShows(float halfAngle, int width);
/// The width that a picture is best reduced to before it is blurred; even.
int blurSourceWidth(float halfAngle, int width);
/// `source`, of even width, averaged around every direction with a weight linear in the cosine that
/// falls to 0 at `halfAngle`, (0, pi/2], at half the size. At pi/2 the weight is the cosine itself:
/// irradiance / pi.
LatLong blurred(LatLong const& source, float halfAngle);

} // namespace zsi::host
