#include "texture/latLong.h"

#include <algorithm>
#include <cmath>
#include <zsi/vecmath.h>

namespace zsi::host {
namespace {

constexpr float kPi = 3.14159265f;
constexpr double kPiD = 3.14159265358979324;

/// Uniform cubic B-spline: never negative, so that bright spots get no dark rims, and smooth where
/// a mirror magnifies the picture.
struct SplineWeights {
    float w[4];

    explicit SplineWeights(float t)
    {
        float const s = 1.0f - t, t2 = t * t, t3 = t2 * t;
        w[0] = s * s * s / 6.0f;
        w[1] = (3.0f * t3 - 6.0f * t2 + 4.0f) / 6.0f;
        w[2] = (-3.0f * t3 + 3.0f * t2 + 3.0f * t + 1.0f) / 6.0f;
        w[3] = t3 / 6.0f;
    }
};

int wrapped(int i, int n)
{
    int const r = i % n;
    return r < 0 ? r + n : r;
}

/// Share of [a, b) in texel i.
double overlap(double a, double b, int i)
{
    return std::max(0.0, std::min(b, i + 1.0) - std::max(a, static_cast<double>(i)));
}

struct Sum {
    double c[4] = {};
    double weight = 0;

    void add(Vec4f const& v, double w)
    {
        c[0] += w * static_cast<double>(v.x);
        c[1] += w * static_cast<double>(v.y);
        c[2] += w * static_cast<double>(v.z);
        c[3] += w * static_cast<double>(v.w);
        weight += w;
    }
    Vec4f mean() const
    {
        auto const m = [&](int i) { return static_cast<float>(c[i] / weight); };
        return weight > 0 ? Vec4f(m(0), m(1), m(2), m(3)) : Vec4f(0, 0, 0, 1);
    }
};

} // namespace

Vec4f& LatLong::at(int x, int y)
{
    return texels[static_cast<std::size_t>(y) * static_cast<std::size_t>(width)
                  + static_cast<std::size_t>(x)];
}

Vec4f const& LatLong::at(int x, int y) const { return const_cast<LatLong&>(*this).at(x, y); }

Vec3f LatLong::direction(float column, float row) const
{
    float const phi = (column / static_cast<float>(width) - 0.5f) * 2.0f * kPi;
    float const theta = row / static_cast<float>(height) * kPi;
    return {std::sin(theta) * std::sin(phi), std::cos(theta), -std::sin(theta) * std::cos(phi)};
}

Vec4f LatLong::lookup(Vec3f d) const
{
    // Scaled first, so that no square leaves the range of a float.
    float const largest = maxOf(std::fabs(d.x), maxOf(std::fabs(d.y), std::fabs(d.z)));
    d = largest > 0.0f ? d / largest : Vec3f(0, 1, 0);
    float const across = std::sqrt(d.x * d.x + d.z * d.z);
    float const column = (0.5f + std::atan2(d.x, -d.z) / (2.0f * kPi)) * static_cast<float>(width);
    float const row = std::atan2(across, d.y) / kPi * static_cast<float>(height);

    float const left = std::floor(column - 0.5f), top = std::floor(row - 0.5f);
    SplineWeights const wx(column - 0.5f - left), wy(row - 0.5f - top);
    Vec4f sum{0, 0, 0, 0};
    for (int j = 0; j < 4; ++j) {
        int y = static_cast<int>(top) - 1 + j;
        int x = static_cast<int>(left) - 1;
        // Over a pole the picture goes on downwards on the other side.
        if (y < 0 || y >= height) {
            y = y < 0 ? -1 - y : 2 * height - 1 - y;
            x += width / 2;
        }
        y = std::clamp(y, 0, height - 1);
        for (int i = 0; i < 4; ++i)
            sum = sum + at(wrapped(x + i, width), y) * (wx.w[i] * wy.w[j]);
    }
    return sum;
}

void evenOutPoles(LatLong& picture)
{
    int const w = picture.width;
    for (int y = 0; y < picture.height; ++y) {
        double const sine = std::sin((y + 0.5) / picture.height * kPiD);
        bool const atPole = y == 0 || y == picture.height - 1;
        double const span = atPole ? w : std::min<double>(w, 1.0 / sine);
        if (span < 1.05)
            continue;
        // Mean over `span` texels around each, from running sums of the row laid out three times.
        std::vector<Sum> before(static_cast<std::size_t>(3 * w) + 1);
        for (int i = 0; i < 3 * w; ++i) {
            Sum next = before[static_cast<std::size_t>(i)];
            next.add(picture.at(i % w, y), 1.0);
            before[static_cast<std::size_t>(i) + 1] = next;
        }
        auto const upTo = [&](double x) { // integral over [0, x)
            auto const i = static_cast<std::size_t>(x);
            Sum s = before[i];
            s.add(picture.at(static_cast<int>(i) % w, y), x - static_cast<double>(i));
            return s;
        };
        std::vector<Vec4f> row(static_cast<std::size_t>(w));
        for (int x = 0; x < w; ++x) {
            double const centre = w + x + 0.5;
            Sum const a = upTo(centre - span / 2), b = upTo(centre + span / 2);
            Sum s;
            for (int c = 0; c < 4; ++c)
                s.c[c] = b.c[c] - a.c[c];
            s.weight = b.weight - a.weight;
            row[static_cast<std::size_t>(x)] = s.mean();
        }
        if (atPole)
            std::fill(row.begin(), row.end(), row[0]);
        std::copy(row.begin(), row.end(), &picture.at(0, y));
    }
}

LatLong reduced(LatLong const& picture, int width)
{
    if (picture.width <= width)
        return picture;
    LatLong small(width, std::max(1, width / 2));
    double const sx = static_cast<double>(picture.width) / small.width;
    double const sy = static_cast<double>(picture.height) / small.height;
    for (int y = 0; y < small.height; ++y)
        for (int x = 0; x < small.width; ++x) {
            Sum sum;
            for (int j = static_cast<int>(y * sy); j < picture.height && j < (y + 1) * sy; ++j) {
                double const sine = std::sin((j + 0.5) / picture.height * kPiD);
                double const wy = overlap(y * sy, (y + 1) * sy, j) * sine;
                for (int i = static_cast<int>(x * sx); i < picture.width && i < (x + 1) * sx; ++i)
                    sum.add(picture.at(i, j), wy * overlap(x * sx, (x + 1) * sx, i));
            }
            small.at(x, y) = sum.mean();
        }
    return small;
}

LatLong blurred(LatLong const& picture, float halfAngle)
{
    double const angle = std::clamp(static_cast<double>(halfAngle), 0.0, kPiD / 2);
    if (angle < 2 * kPiD / picture.width)
        return picture; // less than a texel
    // Six source texels to the half-angle resolve the weight, three resolve the result.
    LatLong const source = reduced(picture, std::max(64, static_cast<int>(12 * kPiD / angle)));
    int const width = std::min(picture.width, std::max(64, static_cast<int>(6 * kPiD / angle)));
    LatLong result(width, std::max(1, width / 2));

    double const cosLimit = std::cos(angle);
    for (int y = 0; y < result.height; ++y) {
        double const theta = (y + 0.5) / result.height * kPiD;
        int const first =
            std::max(0, static_cast<int>(std::floor((theta - angle) / kPiD * source.height)));
        int const last =
            std::min(source.height - 1, static_cast<int>((theta + angle) / kPiD * source.height));
        for (int x = 0; x < result.width; ++x) {
            double const column = (x + 0.5) / result.width * source.width;
            Sum sum;
            for (int j = first; j <= last; ++j) {
                double const t = (j + 0.5) / source.height * kPiD;
                double const cc = std::cos(theta) * std::cos(t), ss = std::sin(theta) * std::sin(t);
                // cosine of the angle between = cc + ss cos(difference of longitudes)
                double const reach = std::acos(std::clamp((cosLimit - cc) / ss, -1.0, 1.0));
                double const columns = reach / (2 * kPiD) * source.width;
                int const from = static_cast<int>(std::floor(column - columns));
                int const count = std::min(source.width, static_cast<int>(2 * columns) + 2);
                for (int i = 0; i < count; ++i) {
                    double const dphi = (from + i + 0.5 - column) / source.width * 2 * kPiD;
                    double const weight = cc + ss * std::cos(dphi) - cosLimit;
                    if (weight > 0)
                        sum.add(source.at(wrapped(from + i, source.width), j),
                                weight * std::sin(t));
                }
            }
            result.at(x, y) = sum.mean();
        }
    }
    return result;
}

} // namespace zsi::host
