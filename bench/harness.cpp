// SPDX-License-Identifier: Apache-2.0
#include "harness.h"

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <vector>
#if __has_include(<valgrind/callgrind.h>)
#include <valgrind/callgrind.h>
#define BENCH_CALLGRIND 1
#endif

namespace bench {

float toWorld[9] = {0, 1, 0, -1, 0, 0, 0, 0, 1};

namespace {

constexpr int kItems = 4096;
constexpr int kRounds = 15;

struct Kernel {
    std::string name;
    Loop loop;
};
std::vector<Kernel> g_kernels;

std::uint32_t g_rng = 12345;
float uniform()
{
    g_rng = g_rng * 1664525u + 1013904223u;
    std::uint32_t x = g_rng;
    x ^= x >> 16;
    x *= 0x7feb352du;
    x ^= x >> 15;
    return static_cast<float>(x >> 8) * (1.f / 16777216);
}
V3 upward()
{
    float const z = 0.02f + 0.98f * uniform(), r = std::sqrt(1 - z * z), p = 6.283185f * uniform();
    return {r * std::cos(p), r * std::sin(p), z};
}
std::vector<Item> makeItems()
{
    std::vector<Item> items(kItems);
    for (Item& i : items) {
        i.wo = upward();
        i.wi = upward();
        i.wt = upward();
        if (uniform() < 0.5f)
            i.wt.z = -i.wt.z;
        for (float& u : i.u)
            u = uniform();
        i.n = upward();
        if (uniform() < 0.5f)
            i.n.z = -i.n.z;
        i.t = upward();
        Frame const f = frame(toWorld, i.n, i.t);
        i.woW = f.out(i.wo);
        i.wiW = f.out(i.wi);
        i.wtW = f.out(i.wt);
    }
    return items;
}

double now()
{
    return std::chrono::duration<double, std::nano>(
               std::chrono::steady_clock::now().time_since_epoch())
        .count();
}

void time(std::vector<Item> const& items, double passNs)
{
    float volatile sink = 0;
    std::vector<int> passes;
    for (Kernel& k : g_kernels) { // calibrate
        double best = 1e30;
        for (int r = 0; r < 3; ++r) {
            double const t = now();
            sink = sink + k.loop(items.data(), kItems);
            best = std::min(best, now() - t);
        }
        passes.push_back(std::max(1, static_cast<int>(passNs / best)));
    }
    std::vector<std::vector<double>> ns(g_kernels.size());
    for (int r = 0; r < kRounds; ++r)
        for (std::size_t j = 0; j < g_kernels.size(); ++j) {
            double const t = now();
            for (int p = 0; p < passes[j]; ++p)
                sink = sink + g_kernels[j].loop(items.data(), kItems);
            ns[j].push_back((now() - t) / (double(passes[j]) * kItems));
        }
    std::printf("%-50s %9s %9s %9s %11s  ns/call\n", "kernel", "median", "min", "max",
                "mean value");
    for (std::size_t j = 0; j < g_kernels.size(); ++j) {
        std::sort(ns[j].begin(), ns[j].end());
        // A floor and the kernel of the same model, at the same setting, agree in what they return.
        double const mean = double(g_kernels[j].loop(items.data(), kItems)) / kItems;
        std::printf("%-50s %9.2f %9.2f %9.2f %11.4g\n", g_kernels[j].name.c_str(),
                    ns[j][kRounds / 2], ns[j].front(), ns[j].back(), mean);
    }
}

} // namespace

void add(std::string name, Loop loop) { g_kernels.push_back({std::move(name), std::move(loop)}); }

} // namespace bench

int main(int argc, char** argv)
{
    using namespace bench;
    std::string const filter = argc > 1 ? argv[1] : "";
    double const passNs = argc > 2 ? std::atof(argv[2]) * 1e6 : 10e6;

    registerFloors();
    registerLibrary(ZSI_SHADER_LIBRARY);
    std::erase_if(g_kernels, [&](Kernel const& k) { return k.name.find(filter) == k.name.npos; });
    auto const items = makeItems();

#ifdef BENCH_CALLGRIND
    if (RUNNING_ON_VALGRIND) {
        float volatile sink = 0;
        for (Kernel& k :
             g_kernels) { // one dump a kernel: exactly one pass, caches and branches warm
            sink = sink + k.loop(items.data(), kItems);
            CALLGRIND_ZERO_STATS;
            sink = sink + k.loop(items.data(), kItems);
            CALLGRIND_DUMP_STATS_AT(k.name.c_str());
        }
        return 0;
    }
#endif
    time(items, passNs);
}
