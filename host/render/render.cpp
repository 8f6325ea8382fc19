#include "render/render.h"

#include "integrate/tracer.h"
#include "render/cameraRays.h"
#include "sampling/pixelFilter.h"

#include <algorithm>
#include <array>
#include <chrono>
#include <mutex>
#include <optional>
#include <tbb/blocked_range.h>
#include <tbb/enumerable_thread_specific.h>
#include <tbb/global_control.h>
#include <tbb/parallel_for.h>
#include <tbb/task_arena.h>

namespace zsi::host {
namespace {

constexpr int kTile = 16;

struct Window {
    int x0, y0, x1, y1;
};

Window windowOf(Film const& film)
{
    Window w{0, 0, film.width, film.height};
    if (film.crop) {
        auto const& c = *film.crop;
        w = {std::max(0, c[0]), std::max(0, c[1]), std::min(film.width, c[2]),
             std::min(film.height, c[3])};
    }
    return w;
}

/// Mean of a pixel's samples; what is not finite is left out.
class PixelRenderer {
public:
    explicit PixelRenderer(Scene const& scene)
        : settings_(scene.settings)
        , camera_(scene.camera, scene.film)
    {
    }

    Vec4f operator()(Tracer& tracer, int x, int y) const
    {
        Sampler sampler(settings_.seed, x, y);
        // Double: finite samples never add up to an infinite pixel.
        std::array<double, 4> sum{};
        int count = 0;
        for (int i = 0; i < settings_.samples; ++i) {
            sampler.start(static_cast<std::uint32_t>(i));
            Vec2f const offset = filter_.offset(sampler.next2D());
            float const rasterX = static_cast<float>(x) + 0.5f + offset.x;
            float const rasterY = static_cast<float>(y) + 0.5f + offset.y;
            Vec3f origin, direction;
            camera_.ray(rasterX, rasterY, sampler.next2D(), origin, direction);
            Vec4f sample;
            if (!tracer.cameraSample(origin, direction, rasterX, rasterY, sampler, sample))
                continue;
            sample = limited(sample);
            sum[0] += static_cast<double>(sample.x);
            sum[1] += static_cast<double>(sample.y);
            sum[2] += static_cast<double>(sample.z);
            sum[3] += static_cast<double>(sample.w);
            ++count;
        }
        auto const mean = [&](double s) { return static_cast<float>(s / std::max(count, 1)); };
        return {mean(sum[0]), mean(sum[1]), mean(sum[2]), mean(sum[3])};
    }

private:
    Vec4f limited(Vec4f sample) const
    {
        float const brightest = maxComponent(rgb(sample));
        if (!(settings_.sampleClamp > 0.0f) || brightest <= settings_.sampleClamp)
            return sample;
        return withAlpha(rgb(sample) * (settings_.sampleClamp / brightest), sample.w);
    }

    Settings const& settings_;
    CameraRays camera_;
    PixelFilter filter_;
};

} // namespace

Picture render(Scene const& scene, RenderOptions const& options, RenderReport* report)
{
    auto const begin = std::chrono::steady_clock::now();
    PreparedScene const prepared(scene);
    PixelRenderer const pixel(scene);
    Window const w = windowOf(scene.film);
    Picture picture;
    picture.width = std::max(0, w.x1 - w.x0);
    picture.height = std::max(0, w.y1 - w.y0);
    auto const width = static_cast<std::size_t>(picture.width);
    picture.rgba.assign(width * static_cast<std::size_t>(picture.height) * 4, 0.0f);

    int const tilesX = (picture.width + kTile - 1) / kTile;
    int const tiles = tilesX * ((picture.height + kTile - 1) / kTile);
    tbb::enumerable_thread_specific<Tracer> tracers([&] { return Tracer(prepared); });
    std::mutex progressMutex;
    int done = 0;
    auto const cancelled = [&] { return options.cancel && *options.cancel; };

    // Every pixel depends on its own position and the seed alone, never on the order of tiles.
    auto const renderTile = [&](int tile) {
        Tracer& tracer = tracers.local();
        int const left = tile % tilesX * kTile, top = tile / tilesX * kTile;
        for (int y = top; y < std::min(top + kTile, picture.height); ++y)
            for (int x = left; x < std::min(left + kTile, picture.width); ++x) {
                if (cancelled())
                    return;
                Vec4f const c = pixel(tracer, w.x0 + x, w.y0 + y);
                float* const out =
                    &picture
                         .rgba[(static_cast<std::size_t>(y) * width + static_cast<std::size_t>(x))
                               * 4];
                out[0] = c.x;
                out[1] = c.y;
                out[2] = c.z;
                out[3] = scene.film.alpha ? c.w : 1.0f;
            }
        if (options.progress) {
            std::lock_guard const lock(progressMutex);
            options.progress(static_cast<double>(++done) / tiles);
        }
    };
    // Without it an arena gets no more threads than there are processors.
    std::optional<tbb::global_control> control;
    if (options.threads > 0)
        control.emplace(tbb::global_control::max_allowed_parallelism,
                        static_cast<std::size_t>(options.threads));
    tbb::task_arena arena(options.threads > 0 ? options.threads : tbb::task_arena::automatic);
    arena.execute([&] {
        tbb::parallel_for(tbb::blocked_range<int>(0, tiles, 1), [&](auto const& range) {
            for (int tile = range.begin(); tile != range.end(); ++tile)
                renderTile(tile);
        });
    });

    if (report) {
        *report = {};
        for (Tracer const& tracer : tracers) {
            report->nonFinite += tracer.nonFinite();
            report->rays += tracer.rays();
        }
        report->seconds =
            std::chrono::duration<double>(std::chrono::steady_clock::now() - begin).count();
    }
    return picture;
}

} // namespace zsi::host
