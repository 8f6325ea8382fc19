/// Latitude-longitude pictures as functions of direction.
#pragma once

#include <vector>
#include <zsi/types.h>

namespace zsi::host {

/// Linear RGBA over the sphere. Rows run from the zenith (+y) to the nadir, columns once around
/// to the right: with +y up, the middle column lies towards -z and +x is to the right of it.
struct LatLong {
    int width = 0;
    int height = 0;
    std::vector<Vec4f> texels;

    LatLong() = default;
    LatLong(int width_, int height_)
        : width(width_)
        , height(height_)
        , texels(static_cast<std::size_t>(width_) * static_cast<std::size_t>(height_))
    {
    }
    Vec4f& at(int x, int y);
    Vec4f const& at(int x, int y) const;

    /// Unit direction of a place in the picture; column and row count from the upper left corner,
    /// texel centres at halves.
    Vec3f direction(float column, float row) const;

    /// Value towards `d`, of any length: cubic B-spline over texels, around the date line and over
    /// the poles. Finite for finite `d`; zero length counts as up.
    Vec4f lookup(Vec3f d) const;
};

/// Averages neighbours of a row where it is shorter than the equator, so that texels cover about
/// the same angle in every direction and the poles have one value: no pinch, no seam.
void evenOutPoles(LatLong& picture);

/// A picture of the same light no wider than `width`: each texel the mean over its solid angle.
LatLong reduced(LatLong const& picture, int width);

/// The picture averaged around every direction, with a weight linear in the cosine that falls to 0
/// at `halfAngle` radians, (0, pi/2]. At pi/2 that is the cosine itself: irradiance / pi.
LatLong blurred(LatLong const& picture, float halfAngle);

} // namespace zsi::host
