// SPDX-License-Identifier: Apache-2.0
// A host of one sphere, one distant light and a sky: loads a material, sets a parameter, shades.
//   tinyHost LIBRARY CLASS PICTURE.ppm PARAMETER NUMBER...
#include <array>
#include <cstdlib>
#include <cstring>
#include <deque>
#include <dlfcn.h>
#include <fstream>
#include <iostream>
#include <map>
#include <memory>
#include <random>
#include <zsi/registration.h>
#include <zsi/vecmath.h>
#include <zsi/zsi.h>

using namespace zsi;
using std::floor;
using V = Vec3f const*;
constexpr int kSize = 256, kSamples = 16, kMaxDepth = 6;

/// What a shader registers. Parameters made of floats can be set; matrices come without a default.
struct Manager final : GenericManager<Manager> {
    std::map<std::string, std::pair<float*, int>> floats; ///< field and count
    std::map<std::string, std::pair<long, int>> vertex; ///< attributes: offset and kind
    void declareEntryPoints(IShaderBase*, int) override { } // every material can shade
    template <class T>
    void parameter(IShaderBase*, char const* n, T* f)
    {
        if constexpr (std::is_same_v<T, Mat3f> || std::is_same_v<T, Mat4f>)
            *f = T::identity();
        else if constexpr (std::is_same_v<T, float>)
            floats[n] = {f, 1};
        else if constexpr (requires { f->x; })
            floats[n] = {&f->x, static_cast<int>(sizeof(T) / sizeof(float))};
    }
    void registerAttribute(IShaderBase*, int k, char const* n, long o) override
    {
        vertex[n] = {o, k};
    }
};

struct Host final : IShaderAPI {
    MaterialShader const* material = nullptr;
    Manager registered;
    std::deque<LightSample> lights; // stay in place until the camera ray's call is over
    std::minstd_rand engine;
    std::normal_distribution<float> normal;
    unsigned depth = 0;

    /// Colour along a ray: the unit sphere around the origin, or the sky.
    Vec3f trace(Vec3f E, Vec3f direction, unsigned type = kRayReflection)
    {
        Vec3f const I = normalize(direction);
        float const t = hit(E, I);
        if (t < 0 || depth == kMaxDepth)
            return mix({0.3f, 0.28f, 0.25f}, {0.45f, 0.6f, 0.85f}, clamp01(0.5f + 0.5f * I.z));
        ShadeState s{}; // results start neutral
        s.Ci.w = s.incomingIor = s.beyondIor = 1;
        s.E = E;
        s.I = I;
        s.P = s.N = s.Ng = s.Pref = s.Nref = normalize(E + I * t);
        s.imageHeight = kSize;
        s.objectToWorld = Mat4f::identity();
        s.rayType = type;
        s.rayDepth = depth;
        s.maxRayDepth = kMaxDepth;
        Vec3f const tangent = normalize(cross({0, 0, 1}, s.N)), bitangent = cross(s.N, tangent);
        for (auto const& [name, place] : registered.vertex) {
            Vec4f value(1, 1, 1, 1); // vertex colour
            if (place.second == kAttributeVec2f)
                value = {std::atan2(s.N.y, s.N.x), std::asin(s.N.z), 0, 0};
            else if (place.second == kAttributeVec3f)
                value = withAlpha(name == "tangent" ? tangent : bitangent, 0);
            std::memcpy(s.attributes + place.first, &value, 4 + 4 * std::size_t(place.second));
        }
        ++depth;
        material->shade(this, s);
        if (--depth == 0)
            lights.clear();
        return s.discardHit ? trace(s.P, I, type) : rgb(s.Ci);
    }
    static float hit(Vec3f E, Vec3f D) ///< in lengths of D; negative: none
    {
        float const a = dot(D, D), b = dot(E, D), root = std::sqrt(b * b - a * (dot(E, E) - 1));
        float const t = (-b - root > 1e-3f * a ? -b - root : -b + root) / a;
        return t > 1e-3f ? t : -1;
    }
    /// Uniform over the sphere.
    Vec3f unit() { return normalize({normal(engine), normal(engine), normal(engine)}); }
    /// A number in [0, 1) for each integer cell, joined smoothly from the given axis on.
    static float noise(std::array<float, 4> p, unsigned axis = 0)
    {
        if (axis == 4)
            return fract(43758.5f * std::sin(13 * p[0] + 78 * p[1] + 37.7f * p[2] + 4.6f * p[3]));
        float const t = fract(p[axis]);
        p[axis] -= t;
        float const low = noise(p, axis + 1), high = (p[axis] += 1, noise(p, axis + 1));
        return low + (high - low) * t * t * (3 - 2 * t);
    }
    static float cell(Vec3f p, float w) { return noise({floor(p.x), floor(p.y), floor(p.z), w}); }

    LightSample* getLightSamples(int, V P, V N) override
    {
        Vec3f const L = normalize({-0.5f, -0.7f, 0.6f}), shadow = grey(hit(*P, L) < 0);
        LightSample const light{L, {}, {1, 0.97f, 0.9f}, shadow, dot(L, *N), 0, nullptr};
        return light.weight > 0 ? &lights.emplace_back(light) : nullptr;
    }
    Vec3f ambientLight(V, V) override { return grey(0); } // the sky is all there is
    Vec3f shadowTransmission(V a, V b) override { return grey(std::fabs(hit(*a, *b - *a)) >= 1); }
    Vec3f traceContinue(int t, V o, V d, float) override { return trace(*o, *d, unsigned(t)); }
    Vec3f traceReflection(V o, V d, float) override { return trace(*o, *d); }
    Vec4f traceThrough(V P, V I, float) override { return withAlpha(trace(*P, *I, kRayCamera), 1); }
    Vec3f traceSpecular(V o, V d, float s, float) override { return trace(*o, *d + s * unit()); }
    Vec3f traceRefraction(V o, V d, float s, float i) override { return traceSpecular(o, d, s, i); }
    Vec3f occlusion(V P, V N, float) override { return grey(dot(*P, *N) > 0); }
    Vec3f indirectDiffuse(V P, V N, float) override { return trace(*P, *N + unit(), kRayDiffuse); }
    float random() override { return float(engine() >> 7) * 0x1p-24f; }
    Vec2f random2D() override { return {random(), random()}; }
    float cellNoise1D(float x) override { return cell({x, 0, 0}, 0); }
    float noise2D(Vec2f const* p) override { return noise({p->x, p->y}); }
    float noise3DPoint(V p) override { return 2 * noise({p->x, p->y, p->z}) - 1; }
    float noise3D(Vec4f const* p) override { return noise({p->x, p->y, p->z, p->w}); }
    float noise3DRecord(V p) override { return noise({p->x, p->y, p->z}); }
    Vec3f cellNoise3D(V p) override { return {cell(*p, 0), cell(*p, 1), cell(*p, 2)}; }
};

int main(int argc, char** argv)
{
    auto const need = [](bool condition, char const* otherwise) {
        if (!condition)
            std::exit((std::cerr << "tinyHost: " << otherwise << '\n', 1));
    };
    need(argc > 5, "usage: tinyHost LIBRARY CLASS PICTURE.ppm PARAMETER NUMBER...");
    std::string const name = argv[2];
    void* const library = dlopen(argv[1], RTLD_NOW);
    need(library, dlerror());
    auto const version = GetApiVersionFunction(dlsym(library, (name + "_getAPIVersion").c_str()));
    auto const create = CreateShaderFunction(dlsym(library, (name + "_create").c_str()));
    need(version && create && version() == kApiVersion, "no such class of this interface version");
    std::unique_ptr<IShaderBase> const shader(create());
    need(shader && shader->getType() == kMaterial, "not a material");
    Host host;
    host.material = static_cast<MaterialShader const*>(shader.get());
    shader->registerShader(&host.registered);
    auto const [field, count] = host.registered.floats[argv[4]];
    need(field && argc == 5 + count, "no parameter of this name made of so many floats");
    for (int k = 0; k < count; ++k)
        field[k] = std::strtof(argv[5 + k], nullptr);

    std::ofstream picture(argv[3], std::ios::binary);
    picture << "P6\n" << kSize << ' ' << kSize << "\n255\n";
    for (float row = 0; row < kSize; row += 1.0f / kSize) { // its fraction is the column
        Vec3f sum{0, 0, 0};
        Vec3f const pixel(fract(row) - 0.5f, 2, 0.5f - floor(row) / kSize);
        for (int k = 0; k < kSamples; ++k)
            sum += host.trace({0, -5, 0}, pixel + host.unit() * (1.0f / kSize), kRayCamera);
        for (float const c : {sum.x, sum.y, sum.z})
            picture.put(char(std::lround(255 * std::pow(clamp01(c / kSamples), 1 / 2.2f))));
    }
    need(bool(picture.flush()), "cannot write the picture");
}
