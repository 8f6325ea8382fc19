// SPDX-License-Identifier: Apache-2.0
/// The library's entry points on the inputs of the floors, with the settings that the bounds in
/// docs/performance.md are stated for.
#include "harness.h"
#include "loadedShader.h"
#include "neutralHost.h"

#include <memory>
#include <string>

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

    Setup(void* library, char const* className, int lights)
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
void kernel(void* library, std::string const& name, std::string const& className,
            Configure configure, Call call, int lights = 4)
{
    auto const setup = std::make_shared<Setup>(library, className.c_str(), lights);
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
/// All lights stand where the item's `wi` points, so that almost none is below the horizon.
constexpr auto kShadeLit = [](Setup& s, Item const& i) {
    ShadeState& r = s.fill(i, i.wiW);
    s.host.aimLights(r.sampleDirection);
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

void registerPhysical(void* library)
{
    auto const tinted = [](LoadedShader& s) { s.set("u_tintColor", Vec3f(0.9f, 0.8f, 0.7f)); };
    kernel(library, "zsi.mirror.sample", "corvid_Mtl_Mirror", tinted, kSample);
    kernel(library, "zsi.glazing.sample", "corvid_Mtl_Glazing", kDefaults, kSample);

    auto const rough = [](LoadedShader& s) { s.set("u_roughValue", 0.2f); };
    kernel(library, "zsi.dielectricRough.transfer", "corvid_Mtl_Dielectric", rough, kTransferBoth);
    kernel(library, "zsi.dielectricRough.sample", "corvid_Mtl_Dielectric", rough, kSample);
    kernel(library, "zsi.dielectricSmooth.sample", "corvid_Mtl_Dielectric", kDefaults, kSample);

    auto const satin = [](LoadedShader& s) {
        s.set("u_reflectColor", Vec3f(0.95f, 0.64f, 0.54f))
            .set("u_edgeColor", Vec3f(1, 0.9f, 0.8f));
        s.set("u_roughValue", 0.3f);
    };
    auto const brushed = [=](LoadedShader& s) {
        satin(s);
        s.set("u_anisotropyValue", 2.5f);
    };
    kernel(library, "zsi.metal.transfer", "corvid_Mtl_Metal", satin, kTransferReflect);
    kernel(library, "zsi.metal.sample", "corvid_Mtl_Metal", satin, kSample);
    kernel(library, "zsi.metalBrushed.transfer", "corvid_Mtl_Metal", brushed, kTransferReflect);
    kernel(library, "zsi.metalBrushed.sample", "corvid_Mtl_Metal", brushed, kSample);
}

void registerWard(void* library)
{
    auto const satin = [](LoadedShader& s) {
        s.set("u_diffuseColor", Vec3f(0.6f, 0.5f, 0.4f));
        s.set("u_specularColor", Vec3f(0.9f, 0.8f, 0.7f));
        s.set("u_roughValue", 0.1f).set("u_anisotropyValue", 2.5f);
        s.set("u_brdf00Reflectivity", 0.05f).set("u_brdf90Reflectivity", 1.0f);
        s.set("u_brdfCurvePower", 5.0f).set("u_reflectivity", 0.8f);
    };
    auto const all = [&](std::string const& name, std::string const& className) {
        kernel(library, name + ".transfer", className, satin, kTransferReflect);
        kernel(library, name + ".sample", className, satin, kSample);
        kernel(library, name + ".shade", className, satin, kShade);
    };
    all("zsi.ward", "corvid_Mtl_Ward");
    kernel(library, "zsi.ward.shade4lit", "corvid_Mtl_Ward", satin, kShadeLit, 4);
    kernel(library, "zsi.ward.shade5lit", "corvid_Mtl_Ward", satin, kShadeLit, 5);
    for (char const* variant : {"120b7820", "33632204", "5592d496", "5ba0bfff", "82261344",
                                "aa598cb4", "b9aac246", "ccb3a2e6", "f05db29e"})
        all(std::string("zsi.ward_") + variant, std::string("corvid_Mtl_Ward_") + variant);
}

/// Without bounds, at their defaults.
void registerUnbounded(void* library)
{
    for (char const* name : {"corvid_Mtl_MetallicPaint", "MarlowLegacy", "XRite"}) {
        std::string const prefix = std::string("zsi.") + name;
        kernel(library, prefix + ".shade", name, kDefaults, kShade);
        kernel(library, prefix + ".transfer", name, kDefaults, kTransferReflect);
        kernel(library, prefix + ".sample", name, kDefaults, kSample);
    }
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
    registerPhysical(library);
    registerWard(library);
    registerUnbounded(library);
}

} // namespace bench
