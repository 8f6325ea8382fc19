// SPDX-License-Identifier: Apache-2.0
/// Every entry point of every class of the library against a neutral in-memory host, ns per call.
/// Parameters are at their defaults (unset matrices: identity), textures answer with a constant.
#include "exports/catalogue.h"
#include "loadedShader.h"
#include "neutralHost.h"

#include <benchmark/benchmark.h>
#include <memory>
#include <string>
#include <vector>

namespace {

#define ZSI_NAME(Class) #Class,
constexpr char const* kClasses[] = {ZSI_CATALOGUE(ZSI_NAME)};
#undef ZSI_NAME

struct Entry {
    int bit;
    char const* name;
    void (*call)(bench::LoadedShader const&, zsi::IShaderAPI*, zsi::ShadeState&);
};
constexpr Entry kEntries[] = {
    {zsi::kShade, "shade", [](auto& s, auto* api, auto& r) { s.material()->shade(api, r); }},
    {zsi::kTransmission, "transmission",
     [](auto& s, auto* api, auto& r) { s.material()->transmission(api, r); }},
    {zsi::kTransfer, "transfer",
     [](auto& s, auto* api, auto& r) { s.material()->transfer(api, r); }},
    {zsi::kSample, "sample", [](auto& s, auto* api, auto& r) { s.material()->sample(api, r); }},
    {zsi::kIllumination, "illumination",
     [](auto& s, auto* api, auto& r) { s.light()->illumination(api, r); }},
    {zsi::kEnvironmentShade, "shade",
     [](auto& s, auto* api, auto& r) { s.environment()->shade(api, r); }},
};

} // namespace

int main(int argc, char** argv)
{
    void* const library = dlopen(ZSI_SHADER_LIBRARY, RTLD_NOW | RTLD_LOCAL);
    if (!library) {
        std::fprintf(stderr, "bench: %s\n", dlerror());
        return 1;
    }
    std::vector<std::unique_ptr<bench::LoadedShader>> shaders;
    for (char const* name : kClasses) {
        shaders.push_back(std::make_unique<bench::LoadedShader>(library, name));
        bench::LoadedShader& shader = *shaders.back();
        shader.identities();
        for (Entry const& e : kEntries) {
            if (!(shader.entryPoints() & e.bit))
                continue;
            benchmark::RegisterBenchmark((std::string(name) + "/" + e.name).c_str(),
                                         [&shader, &e](benchmark::State& run) {
                                             float const u[3] = {0.3f, 0.6f, 0.2f};
                                             bench::NeutralHost host;
                                             host.u = u;
                                             zsi::ShadeState state = bench::neutralRecord();
                                             state.I = {0.6f, 0, -0.8f};
                                             state.sampleDirection = {0, 0.6f, 0.8f};
                                             for (auto _ : run) {
                                                 e.call(shader, &host, state);
                                                 benchmark::ClobberMemory();
                                             }
                                         });
        }
    }
    benchmark::Initialize(&argc, argv);
    benchmark::RunSpecifiedBenchmarks();
}
