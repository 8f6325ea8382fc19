// SPDX-License-Identifier: Apache-2.0
/// What one scalar call costs at the very least, for the arithmetic that the formulas ask for:
/// hand-written kernels that the library's stand beside.
#include "harness.h"
#include "materials/physical/shared/facetLossTable.h"

#include <algorithm>
#include <cstring>

namespace bench {
namespace {

constexpr float kPi = 3.14159265f, k4Pi = 12.566372f, kInvPi = 0.3183099f;

// ---- single operations, one call each -------------------------------------------

BENCH_NOINLINE float f_empty(Item const& i) { return i.u[0]; }
BENCH_NOINLINE float f_powf(Item const& i) { return powf(i.u[0], 0.5f + 4 * i.u[1]); }
BENCH_NOINLINE float f_expf(Item const& i) { return expf(-10 * i.u[0]); }
BENCH_NOINLINE float f_logsincos(Item const& i)
{
    float s, c;
    sincosf(6.283185f * i.u[1], &s, &c);
    return logf(1 - i.u[0]) + s * c;
}
BENCH_NOINLINE float f_sqrtdiv(Item const& i) { return std::sqrt(i.u[0]) / (1 + i.u[1]); }

struct Service {
    virtual ~Service() = default;
    virtual V3 get(V3 const* p, V3 const* q) = 0;
};
struct ServiceA final : Service {
    V3 get(V3 const* p, V3 const* q) override { return {p->x, q->y, p->z}; }
};
struct ServiceB final : Service {
    V3 get(V3 const* p, V3 const* q) override { return {q->x, p->y, q->z}; }
};
ServiceA g_serviceA;
ServiceB g_serviceB; // a second class behind the pointer: the call stays virtual
Service* volatile g_service = &g_serviceB;
BENCH_NOINLINE float f_virtual(Item const& i) { return sum(g_service->get(&i.wo, &i.wi)); }

// ---- Ward ------------------------------------------------------------------------

struct Ward {
    float ax = 0.1f, anisotropy = 2.5f;
    V3 diffuse = {0.6f, 0.5f, 0.4f}, specular = {0.9f, 0.8f, 0.7f};
    float r0 = 0.05f, r90 = 1.0f, curve = 5.0f, reflectivity = 0.8f;
};
// The lobe alone: v (v.z < 0) and l (l.z > 0) already local, colours already known.
BENCH_NOINLINE V3 ward_eval(Ward const& w, V3 v, V3 l)
{
    float ax = w.ax, ay = ax * w.anisotropy;
    V3 h = l - v;
    float a = h.x / ax, b = h.y / ay;
    float g = expf(-(a * a + b * b) / (h.z * h.z)) / (std::sqrt(-v.z * l.z) * k4Pi * ax * ay);
    return w.diffuse * kInvPi + w.specular * g;
}
// The lobe's direction, value and density alone.
BENCH_NOINLINE float ward_sample(Ward const& w, V3 v, float u1, float u2, V3& r, V3& value)
{
    float ax = w.ax, ay = ax * w.anisotropy, s, c;
    sincosf(6.283185f * u1, &s, &c);
    float q = (ay * s) / (ax * c);
    float c2 = std::min(1.f, 1 / (q * q + 1)), s2 = 1 - c2;
    float hx = std::copysign(std::sqrt(c2), c), hy = std::copysign(std::sqrt(s2), s);
    float ct2 = std::min(1.f, 1 / (-logf(1 - u2) / (c2 / (ax * ax) + s2 / (ay * ay)) + 1));
    float ct = std::sqrt(ct2), st = std::sqrt(1 - ct2);
    V3 h = {hx * st, hy * st, ct};
    float vh = dot(v, h);
    r = v - h * (2 * vh);
    if (!(r.z > 0))
        return 0;
    float norm = k4Pi * ax * ay;
    value = w.diffuse * kInvPi + w.specular * ((1 - u2) / (std::sqrt(-v.z * r.z) * norm));
    return (1 - u2) / (ct * ct2 * -vh * norm);
}

inline void wardColours(Ward const& w, float cosTheta, V3& d, V3& s)
{
    float f =
        clamp01(w.r0 + powf(1 - clamp01(cosTheta), w.curve) * (w.r90 - w.r0)) * w.reflectivity;
    s = w.specular * f;
    d = w.diffuse * (1 - f);
}
// The whole road of an untextured, opaque `transfer`: frame, both directions to local,
// reflectivity curve (one powf), lobe (one expf).
inline float wardTransfer(Ward const& w, float const* m, V3 I, V3 N, V3 tangent, V3 dir, V3& out)
{
    Frame f = frame(m, N, tangent);
    V3 v = f.in(I), l = f.in(dir);
    if (!(l.z > 0 && v.z < 0)) {
        out = {0, 0, 0};
        return 0;
    }
    V3 d, s;
    wardColours(w, -v.z, d, s);
    float ax = w.ax, ay = ax * w.anisotropy;
    V3 h = l - v;
    float a = h.x / ax, b = h.y / ay;
    float g = expf(-(a * a + b * b) / (h.z * h.z)) / (std::sqrt(-v.z * l.z) * k4Pi * ax * ay);
    out = d * kInvPi + s * g;
    return dot(N, dir);
}
// The whole road of an untextured, opaque mixture `sample`.
template <class Random> // rnd.one() picks the lobe, rnd.two(a, b) the direction
inline float wardSample(Ward const& w, float const* m, V3 I, V3 N, V3 tangent, Random&& rnd,
                        V3& dir, V3& out)
{
    Frame f = frame(m, N, tangent);
    V3 v = f.in(I), l, d, s;
    if (v.z >= 0)
        return 0;
    wardColours(w, -v.z, d, s);
    float ax = w.ax, ay = ax * w.anisotropy, norm = k4Pi * ax * ay, pdfG, u1, u2;
    bool diffuse = rnd.one() <= 0.5f;
    rnd.two(u1, u2);
    if (diffuse) {
        float a = 2 * u1 - 1, b = 2 * u2 - 1, r, phi, sn, cs;
        if (a * a > b * b)
            r = a, phi = (kPi / 4) * (b / a);
        else
            r = b, phi = b == 0 ? 0 : (kPi / 4) * (2 - a / b);
        r -= 1e-6f;
        sincosf(phi, &sn, &cs);
        l = {r * cs, r * sn, std::sqrt(1 - r * r)};
        V3 h = normalized(l - v);
        float p = h.x / ax, q = h.y / ay, e = expf(-(p * p + q * q) / (h.z * h.z));
        out = s * (e / (std::sqrt(-v.z * l.z) * norm)) + d * kInvPi;
        pdfG = e / (-dot(v, h) * norm * h.z * h.z * h.z);
    } else {
        float sn, cs;
        sincosf(6.283185f * u1, &sn, &cs);
        float q = (ay * sn) / (ax * cs);
        float c2 = std::min(1.f, 1 / (q * q + 1)), s2 = 1 - c2;
        float ct2 = std::min(1.f, 1 / (-logf(1 - u2) / (c2 / (ax * ax) + s2 / (ay * ay)) + 1));
        float ct = std::sqrt(ct2), st = std::sqrt(1 - ct2);
        V3 h = {std::copysign(std::sqrt(c2), cs) * st, std::copysign(std::sqrt(s2), sn) * st, ct};
        float vh = dot(v, h);
        l = v - h * (2 * vh);
        if (l.z < 0)
            return 0;
        out = d * kInvPi + s * ((1 - u2) / (std::sqrt(-v.z * l.z) * norm));
        pdfG = (1 - u2) / (ct * ct2 * -vh * norm);
    }
    dir = f.out(l);
    if (dot(N, dir) < 0)
        return 0;
    float pdf = l.z * kInvPi * 0.5f + 0.5f * pdfG;
    return pdf > 0 ? 1 / pdf : 0;
}
struct Given {
    float const* u;
    float one() const { return u[0]; }
    void two(float& a, float& b) const { a = u[1], b = u[2]; }
};
BENCH_NOINLINE float ward_transfer_world(Ward const& w, float const* m, V3 I, V3 N, V3 tangent,
                                         V3 dir, V3& out)
{
    return wardTransfer(w, m, I, N, tangent, dir, out);
}
BENCH_NOINLINE float ward_sample_world(Ward const& w, float const* m, V3 I, V3 N, V3 tangent,
                                       float const* u, V3& dir, V3& out)
{
    return wardSample(w, m, I, N, tangent, Given{u}, dir, out);
}

// ---- GGX dielectric ----------------------------------------------------------------

struct Glass {
    float r0 = 0.1f, rough = 0.2f, ior = 1.52f;
};
inline float schlick(float r0, float c)
{
    float k = 1 - clamp01(c), k2 = k * k;
    return clamp01(r0 + k2 * k2 * k * (1 - r0));
}
inline float tan2(float z) { return (1 - z * z) / (z * z); }
inline float g1(float a2, float z) { return 2 / (1 + std::sqrt(1 + a2 * tan2(z))); }
inline float ggxD(float a2, float z)
{
    float z2 = z * z, k = tan2(z) + a2;
    return a2 / (z2 * z2 * kPi * k * k);
}
// vw.z > 0; l on either side: reflection or transmission, as the side says.
inline float glassEval(Glass const& g, V3 vw, V3 l)
{
    float F = schlick(g.r0, vw.z), a2 = g.rough * g.rough;
    if (l.z > 0) {
        V3 h = normalized(vw + l);
        return F * g1(a2, vw.z) * g1(a2, l.z) * ggxD(a2, h.z) / (4 * vw.z * l.z);
    }
    V3 h = normalized((vw + l * g.ior) * -1);
    if (h.z < 0)
        h = h * -1;
    float ih = dot(vw, h), oh = dot(l, h);
    if (!(ih > 0 && oh < 0))
        return 0;
    float k = ih + g.ior * oh;
    return (1 - F) * g1(a2, vw.z) * g1(a2, l.z) * ggxD(a2, h.z) * (g.ior * g.ior) * ih * -oh
        / (vw.z * -l.z * k * k);
}
template <class Random>
inline float glassSample(Glass const& g, V3 vw, Random&& rnd, V3& d)
{
    float F = schlick(g.r0, vw.z), a2 = g.rough * g.rough, eta = 1 / g.ior;
    V3 m = {0, 0, 1};
    bool smooth = g.rough < 0.01f;
    if (!smooth) {
        float u1, u2;
        rnd.two(u1, u2);
        float t2 = a2 * u1 / (1 - u1), c = 1 / std::sqrt(1 + t2),
              s = std::sqrt(std::max(0.f, 1 - c * c));
        float sn, cs;
        sincosf(6.283185f * u2, &sn, &cs);
        m = {s * cs, s * sn, c};
    }
    float c = dot(vw, m);
    if (c < 0)
        return 0;
    if (F < rnd.one()) {
        float k = (c * c - 1) * eta * eta + 1;
        d = k >= 0 ? normalized(m * (eta * c - std::sqrt(k)) - vw * eta) : m * (2 * c) - vw;
    } else
        d = m * (2 * c) - vw;
    if (smooth)
        return 1;
    float w = c * g1(a2, vw.z) * g1(a2, d.z) / (vw.z * m.z);
    return w < 0 ? 0.f : w > 4 ? 4.f : w;
}
BENCH_NOINLINE float glass_eval(Glass const& g, V3 vw, V3 l) { return glassEval(g, vw, l); }
BENCH_NOINLINE float glass_sample(Glass const& g, V3 vw, float const* u, V3& d)
{
    return glassSample(g, vw, Given{u}, d);
}
BENCH_NOINLINE float glass_transfer_world(Glass const& g, float const* m, V3 I, V3 N, V3 tangent,
                                          V3 dir)
{
    Frame f = frame(m, N, tangent);
    return glassEval(g, f.in(I * -1), f.in(dir));
}
BENCH_NOINLINE float glass_sample_world(Glass const& g, float const* m, V3 I, V3 N, V3 tangent,
                                        float const* u, V3& dir)
{
    Frame f = frame(m, N, tangent);
    V3 d = {0, 0, 0};
    float w = glassSample(g, f.in(I * -1), Given{u}, d);
    dir = f.out(d);
    return w;
}

// ---- anisotropic GGX metal -------------------------------------------------------------

// Conductor Fresnel, height-correlated masking, and the light that bounces further from the
// library's tables of what one bounce loses.
struct Metal {
    float rough = 0.3f, anisotropy = 1;
    V3 r0 = {0.95f, 0.64f, 0.54f}, edge = {1, 0.9f, 0.8f};
};
inline V3 notBelow0(V3 a) { return {std::max(a.x, 0.f), std::max(a.y, 0.f), std::max(a.z, 0.f)}; }
inline float lerp(float a, float b, float t) { return a + t * (b - a); }
inline float pow5(float k)
{
    float k2 = k * k;
    return k2 * k2 * k;
}
struct MetalSeen { // a metal from the direction v
    float ax, ay, a2, least2, uneven, width, power, stretchedV, lossV, broad;
    int widthNode, powerNode;
    V3 v, r0, bump, further;

    MetalSeen(Metal const& m, V3 v_)
        : ax(std::min(std::max(m.rough, 0.001f), 1.f))
        , ay(std::min(std::max(ax * m.anisotropy, 0.001f), 1.f))
        , a2(0.5f * (ax * ax + ay * ay))
        , least2(std::min(ax * ax, ay * ay))
        , uneven(ax == ay ? 0 : 1 - least2 / a2)
        , v(v_)
        , r0(m.r0)
    {
        constexpr float c = 1 / 7.f, k = (6 / 7.f) * (6 / 7.f) * (6 / 7.f) * (6 / 7.f) * (6 / 7.f);
        V3 one = {1, 1, 1};
        bump = (r0 * (1 - k) + one * k) * (one - m.edge) * (1 / (c * (1 - c) * k));
        width = a2 * 10.4f / (a2 + 0.3f);
        widthNode = std::min(static_cast<int>(width), 7);
        width -= static_cast<float>(widthNode);
        int bits;
        std::memcpy(&bits, &a2, sizeof bits);
        powerNode = (bits >> 22) - 2 * (127 + zsi::kFirstPower);
        power = static_cast<float>(bits & 0x3fffff) * 0x1p-22f;
        stretchedV = stretched(v);
        lossV = loss(v, stretchedV);
        float lost = mean(0);
        if (uneven != 0)
            lost += uneven * (mean(1) + uneven * mean(2));
        lost *= a2;
        V3 average = notBelow0(r0 * (20 / 21.f) + one * (1 / 21.f) - bump * (1 / 126.f));
        V3 rest = one - average * lost;
        V3 F2 = average * average * (1 - lost);
        further = {F2.x / rest.x, F2.y / rest.y, F2.z / rest.z};
        broad = lossV * kInvPi / lost;
    }
    float mean(int column) const
    {
        return lerp(zsi::kMeanFacetLoss[powerNode][column],
                    zsi::kMeanFacetLoss[powerNode + 1][column], power);
    }
    float stretched(V3 w) const
    {
        float x = ax * w.x, y = ay * w.y;
        return std::sqrt(x * x + y * y + w.z * w.z);
    }
    float loss(V3 w, float stretch) const
    {
        float k = 1 / stretch, t = w.z * k * 16;
        int node = std::min(static_cast<int>(t), 15);
        t -= static_cast<float>(node);
        float const* p = zsi::kFacetLoss[widthNode][node];
        auto term = [&](int i) {
            return lerp(lerp(p[i], p[i + 3], t), lerp(p[i + 51], p[i + 54], t), width);
        };
        float sum = term(0);
        if (uneven != 0)
            sum += uneven * (term(1) + term(2) * (least2 * (1 - w.z * w.z) * (k * k)));
        return std::max(sum, 0.f);
    }
    V3 fresnel(float c) const
    {
        float k = pow5(1 - c);
        return notBelow0(r0 * (1 - k) + V3{k, k, k} - bump * (c * (1 - c) * k));
    }
    // density: of facets whose normal is the half vector of v and l
    V3 value(V3 l, float& density) const
    {
        V3 h = v + l;
        float hh = dot(h, h), x = h.x / ax, y = h.y / ay, r = hh / (x * x + y * y + h.z * h.z);
        density = r * r / (kPi * ax * ay);
        float stretchedL = stretched(l);
        float once = density * (0.5f / (v.z * stretchedL + l.z * stretchedV));
        V3 single = fresnel(std::min(0.5f * std::sqrt(hh), 1.f)) * once;
        return single + further * (broad * loss(l, stretchedL));
    }
    float sample(float pick, float u1, float u2, V3& l, V3& out) const
    {
        float s, c;
        sincosf(6.283185f * u1, &s, &c);
        if (pick < lossV) {
            float z2 = a2 * (std::exp(u2 * mean(3)) - 1), r = std::sqrt(std::max(0.f, 1 - z2));
            l = {r * c, r * s, std::sqrt(z2)};
        } else {
            float k = 1 / stretchedV, vz = v.z * k, z = (1 - u2) * (1 + vz) - vz;
            float r = std::sqrt(std::max(0.f, 1 - z * z));
            V3 h = {(r * c + ax * v.x * k) * ax, (r * s + ay * v.y * k) * ay, z + vz};
            l = h * (2 * dot(v, h) / dot(h, h)) - v;
            if (!(l.z > 0))
                return 0;
        }
        float density;
        out = value(l, density);
        return (1 - lossV) * density / (2 * (v.z + stretchedV))
            + lossV * l.z * kInvPi / ((l.z * l.z + a2) * mean(3));
    }
};

// ---- the same roads through the library's kind of entry point ---------------------------
// A virtual call that reads its inputs from one big record and writes its results there;
// random numbers and light come from virtual host services. This is the floor of an entry
// point; the record is filled by the caller, inside the timed call.

struct Light {
    V3 L, color, shadow;
    Light const* next;
};
struct Host {
    float const* u = nullptr;
    Light const* lights = nullptr;
    virtual ~Host() = default;
    virtual Light const* lightList(V3 const*, V3 const*) { return lights; }
    virtual V3 ambient(V3 const*, V3 const*) { return {0.1f, 0.1f, 0.1f}; }
    virtual V3 indirect(V3 const*, V3 const*, float k) { return {0.1f * k, 0.2f, 0.3f}; }
    virtual V3 occlusion(V3 const* p, V3 const*, float) { return {0.9f, p->x, 0.9f}; }
    virtual V3 specular(V3 const*, V3 const* d, float, float) { return {d->x, 0.5f, 0.5f}; }
    virtual float random() { return u[0]; }
    virtual void random2(float* a, float* b) { *a = u[1], *b = u[2]; }
};
struct Record {
    V3 E, I, P, N, Ng;
    char host1[120];
    float toWorld[9];
    char host2[120];
    V3 Ci, direction, brdf;
    float cosine, invPdf;
    unsigned type;
    char host3[100];
    V3 tangent;
};
struct HostRandom {
    Host* h;
    float one() const { return h->random(); }
    void two(float& a, float& b) const { h->random2(&a, &b); }
};
struct Entry {
    virtual ~Entry() = default;
    virtual void shade(Host*, Record&) const { }
    virtual void transfer(Host*, Record&) const = 0;
    virtual void sample(Host*, Record&) const = 0;
};
struct WardEntry final : Entry {
    Ward w;
    void transfer(Host*, Record& r) const override
    {
        r.cosine = wardTransfer(w, r.toWorld, r.I, r.N, r.tangent, r.direction, r.brdf);
    }
    void sample(Host* h, Record& r) const override
    {
        r.invPdf =
            wardSample(w, r.toWorld, r.I, r.N, r.tangent, HostRandom{h}, r.direction, r.brdf);
        r.type = r.invPdf > 0 ? 2 : 0;
    }
    // light loop, mirror reflection and indirect light of an untextured opaque surface
    void shade(Host* h, Record& r) const override
    {
        Frame f = frame(r.toWorld, r.N, r.tangent);
        V3 v = f.in(r.I), d, s, lit = {0, 0, 0};
        wardColours(w, -v.z, d, s);
        float ax = w.ax, ay = ax * w.anisotropy;
        for (Light const* l = h->lightList(&r.P, &r.N); l; l = l->next) {
            V3 c = l->color * l->shadow, o = f.in(l->L);
            float t = (o.z - 0.05f) / 0.2f;
            if (!(t > 0))
                continue;
            t = t > 1 ? 1 : t;
            V3 b = d * kInvPi;
            if (v.z < 0) {
                V3 k = o - v;
                float x = k.x / ax, y = k.y / ay;
                b = b
                    + s
                        * (expf(-(x * x + y * y) / (k.z * k.z))
                           / (std::sqrt(-v.z * o.z) * k4Pi * ax * ay));
            }
            lit = lit + b * c * (t * t * (3 - 2 * t));
        }
        V3 R = r.I - r.N * (2 * dot(r.I, r.N));
        float k = std::max(d.x, std::max(d.y, d.z));
        V3 mirror = h->specular(&r.P, &R, 0, 1) * s;
        V3 around = d * (h->ambient(&r.P, &r.N) + h->indirect(&r.P, &r.N, k));
        r.Ci = lit + mirror + around * h->occlusion(&r.P, &r.N, k);
    }
};
struct GlassEntry final : Entry {
    Glass g;
    void transfer(Host*, Record& r) const override
    {
        Frame f = frame(r.toWorld, r.N, r.tangent);
        V3 l = f.in(r.direction);
        float k = glassEval(g, f.in(r.I * -1), l);
        r.brdf = {k, k, k};
        r.cosine = std::fabs(l.z);
    }
    void sample(Host* h, Record& r) const override
    {
        Frame f = frame(r.toWorld, r.N, r.tangent);
        V3 d = {0, 0, 0};
        float w = glassSample(g, f.in(r.I * -1), HostRandom{h}, d);
        r.direction = f.out(d);
        r.brdf = {w, w, w};
        r.cosine = r.invPdf = 1;
        r.type = w > 0 ? 16 : 0;
    }
};

struct MetalEntry final : Entry {
    Metal m;
    void transfer(Host*, Record& r) const override
    {
        Frame f = frame(r.toWorld, r.N, r.tangent);
        V3 v = f.in(r.I * -1), l = f.in(r.direction);
        r.cosine = 0;
        r.brdf = {0, 0, 0};
        if (!(v.z > 0 && l.z > 0))
            return;
        float ignored;
        r.brdf = MetalSeen(m, v).value(l, ignored);
        r.cosine = l.z;
    }
    void sample(Host* h, Record& r) const override
    {
        Frame f = frame(r.toWorld, r.N, r.tangent);
        V3 v = f.in(r.I * -1);
        r.type = 0;
        if (!(v.z > 0))
            return;
        float u1, u2, pick = h->random();
        h->random2(&u1, &u2);
        V3 l;
        float pdf = MetalSeen(m, v).sample(pick, u1, u2, l, r.brdf);
        if (!(pdf > 0))
            return;
        r.direction = f.out(l);
        r.cosine = l.z;
        r.invPdf = 1 / pdf;
        r.type = 2;
    }
};

// ---- lights and environment ---------------------------------------------------------

struct Spot {
    V3 color = {0.1f, 1.f, 0.5f}, attenuation = {100, 2, 3.5f};
    float cosPenumbra = 0.3f, cosUmbra = 0.9f;
};
BENCH_NOINLINE V3 spot(Spot const& l, V3 toPoint, V3 axis, float d)
{
    float c = clamp01(dot(toPoint, axis));
    if (l.cosPenumbra > c)
        return {0, 0, 0};
    float k = 1;
    if (l.cosUmbra > c) {
        float s = clamp01((c - l.cosPenumbra) / (l.cosUmbra - l.cosPenumbra));
        k = s * s * (3 - s - s);
    }
    float f = clamp01(1 - powf(d / l.attenuation.x, l.attenuation.y)) * powf(c, l.attenuation.z);
    return l.color * (k * f);
}
struct Grade {
    float m[9] = {0, 1, 0, -1, 0, 0, 0, 0, 1};
    V3 lum = {0.2125f, 0.7154f, 0.0721f}, gain = {1.1f, 1.f, 0.9f};
    float pivot = 0.5f, amount = 1.2f, saturation = 0.8f;
};
BENCH_NOINLINE V3 environment(Grade const& g, V3 I, V3 texel)
{
    float const* m = g.m;
    V3 v = {m[0] * I.x + m[1] * I.y + m[2] * I.z, m[3] * I.x + m[4] * I.y + m[5] * I.z,
            m[6] * I.x + m[7] * I.y + m[8] * I.z};
    V3 c = g_service->get(&v, &texel);
    float o = g.pivot * (1 - g.amount);
    c = c * g.amount + V3{o, o, o};
    c = g.gain * dot(c, g.lum);
    float k = dot(g.lum, c) * (1 - g.saturation);
    return c * g.saturation + V3{k, k, k};
}

} // namespace

// Parameters: visible from other translation units, so that no value is folded into the code.
Ward g_ward;
Glass g_glass, g_glassSmooth = {0.1f, 0.0004f, 1.52f};
Spot g_spot;
Grade g_grade;
WardEntry g_wardEntry;
GlassEntry g_glassEntry;
MetalEntry g_metalEntry, g_brushedEntry;
Entry *g_entryWard = &g_wardEntry, *g_entryGlass = &g_glassEntry, *g_entryMetal = &g_metalEntry,
      *g_entryBrushed = &g_brushedEntry;
Light g_lights[4] = {{{0, 0, 1}, {1, 0.9f, 0.8f}, {1, 1, 1}, &g_lights[1]},
                     {{0.6f, 0, 0.8f}, {0.5f, 0.9f, 0.8f}, {1, 1, 1}, &g_lights[2]},
                     {{0, -0.8f, 0.6f}, {1, 0.4f, 0.8f}, {0.5f, 1, 1}, &g_lights[3]},
                     {{-0.6f, 0.64f, 0.48f}, {1, 0.9f, 0.3f}, {1, 0.7f, 1}, nullptr}};
Host g_hostObject;
Host* g_host = &g_hostObject;
Record g_record;

namespace {

Record& fill(Item const& i, V3 dir)
{
    Record& r = g_record;
    r.I = i.woW * -1;
    r.N = i.n;
    r.tangent = i.t;
    r.direction = dir;
    g_host->u = i.u;
    return r;
}

} // namespace

void registerFloors()
{
    g_service = &g_serviceA;
    std::memcpy(g_record.toWorld, toWorld, sizeof toWorld);
    g_host->lights = g_lights;
    g_brushedEntry.m.anisotropy = 2.5f;
#define FLOOR(NAME, EXPR) \
    add("floor." NAME,    \
        [](Item const* it, int n) { return each(it, n, [](Item const& i) -> float { EXPR }); })
    FLOOR("empty_call", return f_empty(i););
    FLOOR("powf", return f_powf(i););
    FLOOR("expf", return f_expf(i););
    FLOOR("logf+sincosf", return f_logsincos(i););
    FLOOR("sqrtf+div", return f_sqrtdiv(i););
    FLOOR("virtual_vec3f", return f_virtual(i););
    FLOOR("ward_eval_local", return sum(ward_eval(g_ward, i.wo * -1, i.wi)););
    FLOOR("ward_sample_local", V3 r; V3 v{};
          float p = ward_sample(g_ward, i.wo * -1, i.u[0], i.u[1], r, v); return p + r.x + v.x;);
    FLOOR("ward_transfer_world", V3 o;
          float c = ward_transfer_world(g_ward, toWorld, i.woW * -1, i.n, i.t, i.wiW, o);
          return c + sum(o););
    FLOOR("ward_sample_world", V3 d{}; V3 o{};
          float p = ward_sample_world(g_ward, toWorld, i.woW * -1, i.n, i.t, i.u, d, o);
          return p + d.x + sum(o););
    FLOOR("ggx_dielectric_eval_local", return glass_eval(g_glass, i.wo, i.wt););
    FLOOR("ggx_dielectric_sample_local", V3 d{}; float w = glass_sample(g_glass, i.wo, i.u, d);
          return w + d.x;);
    FLOOR("smooth_dielectric_sample_local", V3 d{};
          float w = glass_sample(g_glassSmooth, i.wo, i.u, d); return w + d.x;);
    FLOOR("ggx_dielectric_transfer_world",
          return glass_transfer_world(g_glass, toWorld, i.woW * -1, i.n, i.t, i.wtW););
    FLOOR("ggx_dielectric_sample_world", V3 d;
          float w = glass_sample_world(g_glass, toWorld, i.woW * -1, i.n, i.t, i.u, d);
          return w + d.x;);
    FLOOR("ward_transfer_entry", Record& r = fill(i, i.wiW); g_entryWard->transfer(g_host, r);
          return r.cosine + sum(r.brdf););
    FLOOR("ward_sample_entry", Record& r = fill(i, i.wiW); g_entryWard->sample(g_host, r);
          return r.invPdf + r.direction.x + sum(r.brdf););
    FLOOR("ward_shade_4lights_entry", Record& r = fill(i, i.wiW); g_entryWard->shade(g_host, r);
          return sum(r.Ci););
    FLOOR("ggx_dielectric_transfer_entry", Record& r = fill(i, i.wtW);
          g_entryGlass->transfer(g_host, r); return r.brdf.x;);
    FLOOR("ggx_dielectric_sample_entry", Record& r = fill(i, i.wtW);
          g_entryGlass->sample(g_host, r); return r.brdf.x + r.direction.x;);
    FLOOR("metal_transfer_entry", Record& r = fill(i, i.wiW); g_entryMetal->transfer(g_host, r);
          return r.cosine + sum(r.brdf););
    FLOOR("metal_sample_entry", Record& r = fill(i, i.wiW); g_entryMetal->sample(g_host, r);
          return r.invPdf + r.direction.x + sum(r.brdf););
    FLOOR("metal_brushed_transfer_entry", Record& r = fill(i, i.wiW);
          g_entryBrushed->transfer(g_host, r); return r.cosine + sum(r.brdf););
    FLOOR("metal_brushed_sample_entry", Record& r = fill(i, i.wiW);
          g_entryBrushed->sample(g_host, r); return r.invPdf + r.direction.x + sum(r.brdf););
    FLOOR("spot_light", return sum(spot(g_spot, i.woW, i.n, 100 * i.u[0])););
    FLOOR("environment_grading", return sum(environment(g_grade, i.woW, i.n)););
#undef FLOOR
}

} // namespace bench
