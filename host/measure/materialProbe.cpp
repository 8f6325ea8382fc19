// SPDX-License-Identifier: Apache-2.0
#include "measure/materialProbe.h"

#include "base/error.h"
#include "base/hash.h"
#include "measure/bareServices.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>
#include <tbb/blocked_range.h>
#include <tbb/parallel_for.h>
#include <tbb/parallel_reduce.h>
#include <tbb/task_arena.h>
#include <zsi/vecmath.h>

namespace zsi::host {
namespace {

constexpr double kPi = 3.14159265358979323846;
constexpr std::size_t kGrain = 2048; ///< calls that are worth a task

MaterialShader const& materialOf(Shader const& shader)
{
    if (!shader.material())
        throw InputError(shader.className() + ": is no material");
    return *shader.material();
}

/// Index of the medium behind the surface; 1 for a material that bounds none.
float mediumOf(Shader const& shader)
{
    for (char const* name : {"u_ior", "refractiveIndex"})
        if (Parameter const* p = shader.find(name); p && p->type == ParameterType::Float)
            return *static_cast<float const*>(p->field);
    return 1.0f;
}

void fillAttributes(Shader const& shader, ShadeState& state)
{
    for (Attribute const& a : shader.attributes()) {
        Vec4f value{1, 1, 1, 1};
        if (a.kind == kAttributeVec2f)
            value = {0.5f, 0.5f, 0, 0};
        else if (a.kind == kAttributeVec3f)
            value = a.name == "bitangent" ? Vec4f(0, 1, 0, 0) : Vec4f(1, 0, 0, 0);
        std::memcpy(state.attributes + a.offset, &value,
                    sizeof(float) * static_cast<std::size_t>(a.kind + 1));
    }
}

template <class Work>
void onArena(int threads, Work const& work)
{
    tbb::task_arena(threads > 0 ? threads : tbb::task_arena::automatic).execute(work);
}

/// work(begin, end) over all of [0, count).
template <class Work>
void inParallel(std::size_t count, std::size_t grain, int threads, Work const& work)
{
    onArena(threads, [&] {
        tbb::parallel_for(tbb::blocked_range<std::size_t>(0, count, grain),
                          [&](auto const& range) { work(range.begin(), range.end()); });
    });
}

} // namespace

/// One thread's calls of the material.
class MaterialProbe::Call {
public:
    Call(MaterialProbe const& probe, std::uint32_t seed, std::size_t direction = 0)
        : material_(probe.material_)
        , sampler_(seed, static_cast<int>(direction), 0)
        , medium_(mediumOf(probe.shader_))
    {
        std::memset(static_cast<void*>(&state_), 0, sizeof state_);
        state_.N = state_.Ng = state_.Nref = {0, 0, 1};
        state_.objectToWorld = Mat4f::identity();
        state_.rayType = kRayCamera;
        state_.maxRayDepth = 64;
        std::fill_n(state_.allowReflection, 3, std::uint8_t(1));
        std::fill_n(state_.allowTransmission, 3, std::uint8_t(1));
        fillAttributes(probe.shader_, state_);
    }

    void see(Vec3f wi)
    {
        state_.E = wi;
        state_.I = -wi;
        state_.incomingIor = wi.z < 0.0f ? medium_ : 1.0f;
        state_.beyondIor = wi.z < 0.0f ? 1.0f : medium_;
    }
    Vec3f evaluate(std::uint32_t index, Vec3f wo, bool withCosine)
    {
        sampler_.start(index);
        state_.sampleDirection = wo;
        state_.outBrdf = {0, 0, 0};
        state_.sampleCosine = 0.0f;
        material_.transfer(&services_, state_);
        float const cosine = std::fabs(wo.z);
        if (!withCosine && !(cosine > 0.0f))
            return {0, 0, 0};
        return state_.outBrdf * (withCosine ? state_.sampleCosine : state_.sampleCosine / cosine);
    }
    /// False where the material declines.
    bool draw(Vec3f wi, std::uint32_t index)
    {
        sampler_.start(index);
        see(wi);
        state_.sampleType = kSampleNone;
        state_.outBrdf = {0, 0, 0};
        state_.sampleCosine = state_.sampleInvPdf = 0.0f;
        material_.sample(&services_, state_);
        return state_.sampleType != kSampleNone;
    }
    /// From now on numbers that have nothing to do with those of other seeds.
    void reseed(std::uint32_t seed) { sampler_ = Sampler(seed, 0, 0); }
    Vec3f show(std::uint32_t index, LightSample* light)
    {
        sampler_.start(index);
        services_.light = light;
        state_.Ci = {0, 0, 0, 1};
        state_.discardHit = 0;
        material_.shade(&services_, state_);
        services_.light = nullptr;
        constexpr float kNone = std::numeric_limits<float>::quiet_NaN();
        return state_.discardHit ? Vec3f(kNone, kNone, kNone) : rgb(state_.Ci);
    }
    ShadeState const& drawn() const { return state_; }
    void writeTo(DrawnDirections const& out, std::size_t i, bool taken) const
    {
        out.direction[i] = taken ? state_.sampleDirection : Vec3f(0, 0, 0);
        out.weight[i] = taken ? weight() : Vec3f(0, 0, 0);
        out.density[i] = taken ? 1.0f / state_.sampleInvPdf : 0.0f;
        out.type[i] = state_.sampleType;
    }
    Vec3f weight() const { return state_.outBrdf * (state_.sampleCosine * state_.sampleInvPdf); }

private:
    MaterialShader const& material_;
    Sampler sampler_;
    BareServices services_{sampler_};
    float medium_;
    ShadeState state_;
};

MaterialProbe::MaterialProbe(Shader const& shader)
    : shader_(shader)
    , material_(materialOf(shader))
{
}

void MaterialProbe::need(int entryPoint, char const* name) const
{
    if (!(shader_.entryPoints() & entryPoint))
        throw InputError(shader_.className() + ": has no entry point " + name
                         + "; it cannot be measured without a scene");
}

void MaterialProbe::evaluate(std::span<Vec3f const> wi, std::span<Vec3f const> wo, bool withCosine,
                             std::span<Vec3f> values, int threads) const
{
    need(kTransfer, "transfer");
    inParallel(values.size(), kGrain, threads, [&](std::size_t begin, std::size_t end) {
        Call call(*this, 0);
        for (std::size_t i = begin; i < end; ++i) {
            call.see(wi[wi.size() == 1 ? 0 : i]);
            values[i] = call.evaluate(static_cast<std::uint32_t>(i), wo[wo.size() == 1 ? 0 : i],
                                      withCosine);
        }
    });
}

void MaterialProbe::sample(std::span<Vec3f const> wi, std::uint32_t seed,
                           DrawnDirections const& out, int threads) const
{
    need(kSample, "sample");
    if (wi.empty())
        return;
    std::size_t const draws = out.direction.size() / wi.size();
    inParallel(wi.size() * draws, kGrain, threads, [&](std::size_t begin, std::size_t end) {
        for (std::size_t i = begin; i < end;) {
            std::size_t const direction = i / draws;
            Call call(*this, seed, direction);
            for (; i < std::min(end, (direction + 1) * draws); ++i) {
                bool const taken = call.draw(wi[direction], static_cast<std::uint32_t>(i % draws));
                call.writeTo(out, i, taken);
            }
        }
    });
}

void MaterialProbe::sampleApart(Vec3f wi, std::uint32_t seed, DrawnDirections const& out,
                                int threads) const
{
    need(kSample, "sample");
    inParallel(out.direction.size(), kGrain, threads, [&](std::size_t begin, std::size_t end) {
        Call call(*this, seed);
        for (std::size_t i = begin; i < end; ++i) {
            call.reseed(hashCombine(seed, static_cast<std::uint32_t>(i)));
            call.writeTo(out, i, call.draw(wi, 0));
        }
    });
}

void MaterialProbe::lit(std::span<Vec3f const> wi, std::span<Vec3f const> wo,
                        std::span<Vec3f> values, int threads) const
{
    need(kShade, "shade");
    inParallel(values.size(), kGrain, threads, [&](std::size_t begin, std::size_t end) {
        Call call(*this, 0);
        LightSample light = {};
        constexpr float kDim = 1.0f / 128.0f;
        light.color = {kDim, kDim, kDim};
        light.shadow = {1, 1, 1};
        for (std::size_t i = begin; i < end; ++i) {
            call.see(wi[wi.size() == 1 ? 0 : i]);
            light.L = wo[wo.size() == 1 ? 0 : i];
            auto const index = static_cast<std::uint32_t>(i);
            Vec3f const dark = call.show(index, nullptr);
            values[i] = (call.show(index, &light) - dark) * (1.0f / kDim);
        }
    });
}

void MaterialProbe::albedo(std::span<float const> theta, std::uint32_t draws, std::uint32_t seed,
                           std::span<Vec3f> values, int threads) const
{
    need(kSample, "sample");
    inParallel(theta.size(), 1, threads, [&](std::size_t begin, std::size_t end) {
        for (std::size_t i = begin; i < end; ++i) {
            Call call(*this, seed, i);
            Vec3f const wi{std::sin(theta[i]), 0, std::cos(theta[i])};
            double sum[3] = {};
            for (std::uint32_t j = 0; j < draws; ++j)
                if (call.draw(wi, j)) {
                    Vec3f const w = call.weight();
                    sum[0] += static_cast<double>(w.x);
                    sum[1] += static_cast<double>(w.y);
                    sum[2] += static_cast<double>(w.z);
                }
            auto const mean = [&](int c) { return static_cast<float>(sum[c] / draws); };
            values[i] = {mean(0), mean(1), mean(2)};
        }
    });
}

SphereHistogram MaterialProbe::histogram(Vec3f wi, std::uint32_t draws, std::uint32_t seed,
                                         int rows, int columns, int threads) const
{
    need(kSample, "sample");
    struct Counts {
        std::vector<double> draws, area;
        double declined = 0;
    };
    auto const cells = static_cast<std::size_t>(rows) * static_cast<std::size_t>(columns);
    auto const cellOf = [&](Vec3f d) {
        double const height = std::clamp(static_cast<double>(d.z), -1.0, 1.0);
        double const turn =
            std::atan2(static_cast<double>(d.y), static_cast<double>(d.x)) / (2 * kPi);
        int const row = std::min(static_cast<int>((1 - height) / 2 * rows), rows - 1);
        int const column =
            std::min(static_cast<int>((turn - std::floor(turn)) * columns), columns - 1);
        return static_cast<std::size_t>(row) * static_cast<std::size_t>(columns)
            + static_cast<std::size_t>(column);
    };
    auto const count = [&](auto const& range, Counts counts) {
        counts.draws.resize(cells);
        counts.area.resize(cells);
        Call call(*this, seed);
        for (std::uint32_t j = range.begin(); j != range.end(); ++j) {
            if (!call.draw(wi, j)) {
                ++counts.declined;
                continue;
            }
            std::size_t const cell = cellOf(call.drawn().sampleDirection);
            ++counts.draws[cell];
            counts.area[cell] += static_cast<double>(call.drawn().sampleInvPdf);
        }
        return counts;
    };
    auto const together = [&](Counts a, Counts const& b) {
        if (a.draws.empty())
            return b;
        for (std::size_t i = 0; i < b.draws.size(); ++i) {
            a.draws[i] += b.draws[i];
            a.area[i] += b.area[i];
        }
        a.declined += b.declined;
        return a;
    };
    Counts all;
    onArena(threads, [&] { // always split alike, so that sums do not depend on threads
        all = tbb::parallel_deterministic_reduce(
            tbb::blocked_range<std::uint32_t>(0, draws, 1u << 16), Counts(), count, together);
    });
    SphereHistogram histogram{rows, columns, std::vector<float>(cells), std::vector<float>(cells),
                              all.declined / draws};
    double const whole = draws * 4 * kPi / static_cast<double>(cells);
    for (std::size_t i = 0; i < all.draws.size(); ++i) {
        histogram.density[i] = static_cast<float>(all.draws[i] / whole);
        histogram.coverage[i] = static_cast<float>(all.area[i] / whole);
    }
    return histogram;
}

} // namespace zsi::host
