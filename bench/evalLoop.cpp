// SPDX-License-Identifier: Apache-2.0
// A plain loop of `transfer` of the Ward material over directions, as a program in C++ would have
// it; tests/python/eval_cost.py sets it beside the same number of calls from numpy.
//   usage: eval_loop CALLS   writes processor nanoseconds of a call
#include "loadedShader.h"
#include "neutralHost.h"

#include <cmath>
#include <ctime>
#include <random>

int main(int argc, char** argv)
{
    std::size_t const calls = argc > 1 ? std::strtoull(argv[1], nullptr, 10) : 1000000;
    bench::LoadedShader shader(dlopen(ZSI_SHADER_LIBRARY, RTLD_NOW), "corvid_Mtl_Ward");
    shader.set("u_roughValue", 0.2f);
    std::vector<zsi::Vec3f> wi(calls), wo(calls);
    std::mt19937 random;
    std::uniform_real_distribution<float> unit(0.05f, 1.0f);
    for (auto* all : {&wi, &wo})
        for (zsi::Vec3f& d : *all) {
            float const z = unit(random), phi = 6.2831853f * unit(random);
            float const r = std::sqrt(1.0f - z * z);
            d = {r * std::cos(phi), r * std::sin(phi), z};
        }

    bench::NeutralHost host(0);
    zsi::ShadeState state = bench::neutralRecord();
    zsi::Vec3f const tangent{1, 0, 0};
    std::memcpy(state.attributes + shader.attributeOffset("tangent"), &tangent, sizeof tangent);
    std::clock_t const begun = std::clock();
    std::vector<zsi::Vec3f> values(calls);
    for (std::size_t i = 0; i < calls; ++i) {
        state.I = {-wi[i].x, -wi[i].y, -wi[i].z};
        state.sampleDirection = wo[i];
        shader.material()->transfer(&host, state);
        values[i] = state.outBrdf;
    }
    double const seconds = static_cast<double>(std::clock() - begun) / CLOCKS_PER_SEC;
    float sum = 0;
    for (zsi::Vec3f const& v : values)
        sum += v.x;
    std::printf("%.3f\n", seconds * 1e9 / static_cast<double>(calls));
    return std::isfinite(sum) ? 0 : 1;
}
