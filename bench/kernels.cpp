/// The library's entry points on the inputs of the floors, with the settings that the bounds in
/// docs/performance.md are stated for.
#include "harness.h"
#include "loadedShader.h"
#include "neutralHost.h"

#include <memory>

namespace bench {
namespace {

using zsi::ShadeState;
using zsi::Vec3f;

Vec3f vec(V3 v) { return {v.x, v.y, v.z}; }
float sum(Vec3f v) { return v.x + v.y + v.z; }

/// One class with its settings, a host and a record. The record is filled inside the timed call,
/// as the floors' is.
struct Setup {
    LoadedShader shader;
    NeutralHost host;
    ShadeState state = neutralRecord();
    long tangent;

    Setup(void* library, char const* className, int lights = 4)
        : shader(library, className)
        , host(lights)
        , tangent(shader.attributeOffset("tangent"))
    {
        shader.identities();
    }
    ShadeState& fill(Item const& i, V3 direction)
    {
        state.I = vec(i.woW * -1);
        state.N = state.Ng = vec(i.n);
        if (tangent >= 0)
            std::memcpy(state.attributes + tangent, &i.t, sizeof i.t);
        state.sampleDirection = vec(direction);
        host.u = i.u;
        return state;
    }
};

/// Registers a loop over one entry point; `configure` sets parameters.
template <class Configure, class Call>
void kernel(void* library, char const* name, char const* className, Configure configure, Call call,
            int lights = 4)
{
    auto const setup = std::make_shared<Setup>(library, className, lights);
    configure(setup->shader);
    add(name, [setup, call](Item const* it, int n) {
        return each(it, n, [&](Item const& i) -> float { return call(*setup, i); });
    });
}

constexpr auto kDefaults = [](LoadedShader&) {};

constexpr auto kTransferReflect = [](Setup& s, Item const& i) {
    ShadeState& r = s.fill(i, i.wiW);
    s.shader.material()->transfer(&s.host, r);
    return r.sampleCosine + sum(r.outBrdf);
};
constexpr auto kTransferBoth = [](Setup& s, Item const& i) {
    ShadeState& r = s.fill(i, i.wtW);
    s.shader.material()->transfer(&s.host, r);
    return r.outBrdf.x;
};
constexpr auto kSample = [](Setup& s, Item const& i) {
    ShadeState& r = s.fill(i, i.wiW);
    s.shader.material()->sample(&s.host, r);
    return r.sampleInvPdf + r.sampleDirection.x + sum(r.outBrdf);
};
constexpr auto kShade = [](Setup& s, Item const& i) {
    ShadeState& r = s.fill(i, i.wiW);
    s.shader.material()->shade(&s.host, r);
    return r.Ci.x + r.Ci.y + r.Ci.z;
};
constexpr auto kIlluminate = [](Setup& s, Item const& i) {
    s.state.lightToPoint = vec(i.woW);
    s.state.lightAxis = vec(i.n);
    s.state.lightDistance = 100 * i.u[0];
    s.shader.light()->illumination(&s.host, s.state);
    return sum(s.state.lightColor);
};

void registerLightsAndEnvironments(void* library)
{
    auto const attenuated = [](LoadedShader& s) {
        s.set("attenuationFactors", Vec3f(100, 2, 3.5f));
        if (s.has("cosPenumbra"))
            s.set("cosPenumbra", 0.3f).set("cosUmbra", 0.9f);
    };
    kernel(library, "zsi.pointLight.illumination", "voPointLight", attenuated, kIlluminate);
    kernel(library, "zsi.spotLight.illumination", "voSpotLight", attenuated, kIlluminate);

    static ConstantTexture<Vec3f> const cube;
    auto const graded = [](LoadedShader& s) {
        s.field<zsi::TextureSamplerCube>("diffuseCube").texture = &cube;
        s.set("diffuseIBLContrast", zsi::Vec2f(0.5f, 1.2f)).set("diffuseIBLGainMode", 2);
        s.set("diffuseIBLGain", Vec3f(1.1f, 1, 0.9f)).set("diffuseIBLSaturation", 0.8f);
    };
    auto const ray = [](std::uint32_t rayType) {
        return [rayType](Setup& s, Item const& i) {
            s.state.I = vec(i.woW);
            s.state.rayType = rayType;
            s.shader.environment()->shade(&s.host, s.state);
            return s.state.Ci.x + s.state.Ci.y + s.state.Ci.z;
        };
    };
    kernel(library, "zsi.environment.graded", "corvid_Env_Default", graded, ray(zsi::kRayDiffuse));
    kernel(library, "zsi.environment.flat", "corvid_Env_Default", graded, ray(zsi::kRayCamera));
}

} // namespace

void registerLibrary(char const* sharedObject)
{
    void* const library = dlopen(sharedObject, RTLD_NOW | RTLD_LOCAL);
    if (!library) {
        std::fprintf(stderr, "bench: %s\n", dlerror());
        std::exit(1);
    }
    registerLightsAndEnvironments(library);
}

} // namespace bench
