/// The Ward surface in double precision: angles and normalised half vectors in the place of the
/// library's slopes and shortcuts, and no function of the library but the texture lookup.
#pragma once

#include "materials/ward/corvid_Mtl_Ward.h"

#include <cmath>

// Single-precision inputs meet double-precision arithmetic all over, on purpose.
#pragma GCC diagnostic ignored "-Wdouble-promotion"

namespace zsi::test {

struct D3 {
    double x = 0, y = 0, z = 0;

    D3() = default;
    D3(double x_, double y_, double z_)
        : x(x_)
        , y(y_)
        , z(z_)
    {
    }
    D3(Vec3f v)
        : D3(v.x, v.y, v.z)
    {
    }
    explicit D3(double grey)
        : D3(grey, grey, grey)
    {
    }
    D3 operator+(D3 o) const { return {x + o.x, y + o.y, z + o.z}; }
    D3 operator-(D3 o) const { return {x - o.x, y - o.y, z - o.z}; }
    D3 operator*(D3 o) const { return {x * o.x, y * o.y, z * o.z}; }
    D3 operator*(double k) const { return {x * k, y * k, z * k}; }
    D3 operator-() const { return *this * -1; }
    double dot(D3 o) const { return x * o.x + y * o.y + z * o.z; }
    D3 cross(D3 o) const { return {y * o.z - z * o.y, z * o.x - x * o.z, x * o.y - y * o.x}; }
    D3 unit() const { return *this * (1 / std::sqrt(dot(*this))); }
    double max() const { return std::fmax(x, std::fmax(y, z)); }
    Vec3f single() const
    {
        return {static_cast<float>(x), static_cast<float>(y), static_cast<float>(z)};
    }
};

struct WardOracle {
    static constexpr double kPi = 3.14159265358979323846;
    corvid_Mtl_Ward const& m;
    ShadeState const& s;
    double side; ///< of the viewer: +1 in front
    D3 Nf, T, B, N;
    D3 v; ///< towards the viewer, local
    double ax, ay;

    struct Colors {
        D3 diffuse, specular, transmit, filter{1};
    };
    struct Drawn {
        std::uint32_t type = 0;
        D3 direction, brdf;
        double cosine = 0, invPdf = 0;
    };

    WardOracle(corvid_Mtl_Ward const& material, ShadeState const& state)
        : m(material)
        , s(state)
        , side(D3(s.I).dot(s.Ng) < 0 ? 1 : -1)
        , Nf(D3(s.N) * side)
        , N(Nf)
    {
        D3 const t = corvid_Mtl_Ward::attribute_tangent(s);
        auto const* o = s.objectToWorld.m;
        T = {o[0] * t.x + o[4] * t.y + o[8] * t.z, o[1] * t.x + o[5] * t.y + o[9] * t.z,
             o[2] * t.x + o[6] * t.y + o[10] * t.z};
        square();
        if (m.u_normal0MapEnable)
            bump(m.u_normal0Map, m.u_normal0Transform,
                 m.u_normal0Amount
                     * scalar(m.u_normal0AmountMapEnable, m.u_normal0AmountMap,
                              m.u_normal0AmountTransform, 1, 1));
        if (m.u_normal1MapEnable)
            bump(m.u_normal1Map, m.u_normal1Transform, m.u_normal1Amount);
        double const turn =
            scalar(m.u_anisoRotationMapEnable, m.u_anisoRotationMap, m.u_anisoRotationTransform,
                   m.u_anisoRotationAmount, m.u_anisoRotationValue);
        D3 const T0 = T;
        T = T0 * std::cos(turn) + B * std::sin(turn);
        B = N.cross(T);
        v = -local(s.I);

        ax = m.u_roughValue;
        if (m.u_roughMapEnable) {
            double const x =
                1 - unitRange(texel(m.u_roughMap, m.u_roughTransform).x * m.u_roughAmount);
            ax = x < 0.5  ? 1.11078 * x * x - 0.225494 * x + 0.0505339
                : x < 0.9 ? 24.1745 * x * x * x - 45.6128 * x * x + 28.605 * x - 5.72202
                          : 3 * x - 2;
        }
        ay = ax
            * scalar(m.u_anisotropyMapEnable, m.u_anisotropyMap, m.u_anisotropyTransform,
                     m.u_anisotropyAmount, m.u_anisotropyValue);
    }

    static double unitRange(double t) { return std::fmin(1, std::fmax(0, t)); }
    static D3 unitRange(D3 c) { return {unitRange(c.x), unitRange(c.y), unitRange(c.z)}; }
    D3 local(D3 d) const { return {T.dot(d), B.dot(d), N.dot(d)}; }
    D3 world(D3 d) const { return T * d.x + B * d.y + N * d.z; }

    Vec4f texel(TextureSampler2D const& map, Mat3f const& t, Vec2f step = {0, 0}) const
    {
        Vec2f const uv = corvid_Mtl_Ward::attribute_uv(s);
        return map.lookup({t.m[0] * uv.x + t.m[3] * uv.y + t.m[6] + step.x,
                           t.m[1] * uv.x + t.m[4] * uv.y + t.m[7] + step.y});
    }
    double scalar(bool on, TextureSampler2D const& map, Mat3f const& t, double amount,
                  double plain) const
    {
        return on ? texel(map, t).x * amount : plain;
    }
    void square()
    {
        T = (T - N * T.dot(N)).unit();
        B = N.cross(T).unit();
    }
    void bump(TextureSampler2D const& map, Mat3f const& t, double amount)
    {
        auto const height = [&](float du, float dv) {
            Vec4f const c = texel(map, t, {du, dv});
            return double(c.x) + c.y + c.z;
        };
        double const h = height(0, 0);
        N = (N + (T * (h - height(0.001f, 0)) + B * (h - height(0, 0.001f))) * (3.33 * amount))
                .unit();
        square();
    }

    /// Colours of the lobes; `fresnel`: the reflectivity curve applies.
    Colors colors(bool front, bool fresnel, double cosTheta) const
    {
        Colors c;
        c.specular = m.u_specularColor;
        if (m.u_specularMapEnable) {
            Vec4f const t = texel(m.u_specularMap, m.u_specularTransform);
            c.specular = unitRange(D3(t.x, t.y, t.z) * m.u_specularAmount);
        }
        D3 const plain = m.u_diffuseColor;
        c.diffuse = plain;
        if (m.u_diffuseMapEnable) {
            Vec4f const t = texel(m.u_diffuseMap, m.u_diffuseTransform);
            double const f = m.u_imageFadeEnable == 1 ? double(t.w) * m.u_imageFade : 1;
            c.diffuse = plain * (1 - f) + D3(t.x, t.y, t.z) * (m.u_diffuseAmount * f);
        }
        if (m.u_imageFadeEnable > 1) {
            D3 fade(m.u_imageFadeEnable == 4 ? 0.595125 : 0.0);
            if (m.u_imageFadeEnable == 2) {
                Vec4f const t = texel(m.u_imageFadeMap, m.u_imageFadeTransform);
                fade = D3(t.x, t.y, t.z) * m.u_imageFadeAmount;
            } else if (m.u_imageFadeEnable == 3) {
                fade = m.u_imageFadeColor;
            }
            auto const mix = [w = double(m.u_imageFade)](double a, double b) {
                double const overlay = a < 0.5 ? 2 * a * b : 2 * (a + b - a * b) - 1;
                return ((1 - w) * a + w * overlay) * (1 - w + w * b);
            };
            c.diffuse = {mix(c.diffuse.x, fade.x), mix(c.diffuse.y, fade.y),
                         mix(c.diffuse.z, fade.z)};
        }
        double const r0 =
            scalar(m.u_brdf00ReflectMapEnable, m.u_brdf00ReflectMap, m.u_brdf00ReflectTransform,
                   m.u_brdf00ReflectAmount, m.u_brdf00Reflectivity);
        double const r90 =
            scalar(m.u_brdf90ReflectMapEnable, m.u_brdf90ReflectMap, m.u_brdf90ReflectTransform,
                   m.u_brdf90ReflectAmount, m.u_brdf90Reflectivity);
        double const k = std::pow(1 - unitRange(cosTheta), double(m.u_brdfCurvePower));
        double const F =
            front || fresnel ? unitRange(r0 * (1 - k) + r90 * k) * m.u_reflectivity : 0;
        if (m.u_isMetal) {
            double const Y = D3(0.212671, 0.71516, 0.072169).dot(c.specular);
            c.specular = c.specular * c.diffuse;
            c.diffuse = c.diffuse * (1 - Y * F);
        }
        c.specular = c.specular * F;
        c.diffuse = c.diffuse * (1 - F);
        if (!m.u_transparency) {
            c.diffuse = c.diffuse * (front ? 1 : 0);
            return c;
        }
        double tr = m.u_transparencyValue;
        if (m.u_transparencyMapEnable)
            tr += m.u_transparencyFade
                * (texel(m.u_transparencyMap, m.u_transparencyTransform).x * m.u_transparencyAmount
                   - tr);
        double const tl = front
            ? 0
            : scalar(m.u_translucencyMapEnable, m.u_translucencyMap, m.u_translucencyTransform,
                     m.u_translucencyAmount, m.u_translucencyValue);
        c.filter = plain * (1 - tr) + D3(tr);
        c.diffuse = c.diffuse * (front ? 1 - tr : tl * tr);
        c.transmit = c.filter * ((1 - F) * (1 - tl) * tr);
        return c;
    }
    Colors front() const { return colors(true, false, v.z); }

    /// exp(-tan^2(theta_h) (cos^2(phi_h)/ax^2 + sin^2(phi_h)/ay^2)) of a unit half vector.
    double gauss(D3 h) const
    {
        double const phi = std::atan2(h.y, h.x), tan = std::tan(std::acos(std::fmin(1, h.z)));
        return std::exp(-tan * tan * spread(phi));
    }
    double spread(double phi) const
    {
        return std::pow(std::cos(phi) / ax, 2) + std::pow(std::sin(phi) / ay, 2);
    }
    double glossy(D3 l) const
    {
        return gauss((l + v).unit()) / (4 * kPi * ax * ay * std::sqrt(v.z * l.z));
    }
    /// Density of the mirrored direction for half vectors that follow the lobe:
    /// p(h) = gauss / (pi ax ay cos^3), |dh/dl| = 1 / (4 v.h).
    double glossyDensity(D3 l) const
    {
        D3 const h = (l + v).unit();
        return gauss(h) / (kPi * ax * ay * std::pow(h.z, 3)) / (4 * v.dot(h));
    }
    double cosine(D3 direction) const
    {
        return m.u_cosineUsesBump ? N.dot(direction) : Nf.dot(direction);
    }

    /// cos = 0 where there is no value.
    D3 transfer(D3 direction, double& cos) const
    {
        D3 const l = local(direction);
        cos = l.z > 0 && v.z > 0 ? std::fmax(0, cosine(direction)) : 0;
        if (cos == 0)
            return {};
        Colors const c = front();
        return c.diffuse * (1 / kPi) + c.specular * glossy(l);
    }

    Drawn sample(double lobe, double u1, double u2) const
    {
        Drawn d;
        Colors const c = front();
        bool const glossyOnly = !s.allowReflection[0] && !s.allowReflection[1];
        double const pd = glossyOnly || c.diffuse.max() == 0 ? 0 : c.specular.max() == 0 ? 1 : 0.5;
        D3 l;
        if (v.z <= 0)
            return d;
        if (!glossyOnly && lobe <= pd) {
            double const a = 2 * u1 - 1, b = 2 * u2 - 1;
            bool const wide = std::fabs(a) > std::fabs(b);
            double const r = std::fmax(std::fabs(a), std::fabs(b)) - 1e-6;
            double const phi = (wide ? kPi / 4 * b / a : kPi / 2 - kPi / 4 * a / b)
                + ((wide ? a : b) < 0 ? kPi : 0);
            l = {r * std::cos(phi), r * std::sin(phi), std::sqrt(1 - r * r)};
        } else {
            double const phi = std::atan2(ay * std::sin(2 * kPi * u1), ax * std::cos(2 * kPi * u1));
            double const theta = std::atan(std::sqrt(-std::log(1 - u2) / spread(phi)));
            D3 const h(std::sin(theta) * std::cos(phi), std::sin(theta) * std::sin(phi),
                       std::cos(theta));
            l = h * (2 * v.dot(h)) - v;
            if (l.z < 0)
                return d;
        }
        d.direction = world(l);
        d.cosine = cosine(d.direction);
        d.brdf = c.specular * glossy(l) + c.diffuse * (glossyOnly ? 0 : 1 / kPi);
        double const pdf = pd * l.z / kPi + (1 - pd) * glossyDensity(l);
        d.invPdf = 1 / pdf;
        d.type = glossyOnly ? 4 : d.cosine < 0 ? 0 : 2;
        return d;
    }

    D3 transmission() const
    {
        D3 result;
        if (m.u_cutoutMapEnable)
            result = D3(1 - texel(m.u_cutoutMap, m.u_cutoutTransform).x * m.u_cutoutAmount);
        if (m.u_transparency)
            result = colors(side > 0, true, -D3(s.N).dot(s.I)).transmit;
        return result;
    }
};

} // namespace zsi::test
