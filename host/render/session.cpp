// SPDX-License-Identifier: Apache-2.0
#include "render/session.h"

#include "base/activity.h"
#include "base/hash.h"
#include "base/threads.h"
#include "film/cryptomatte.h"
#include "integrate/integrators.h"
#include "integrate/layers.h"
#include "render/cameraRays.h"
#include "sampling/pixelFilter.h"

#include <algorithm>
#include <array>
#include <chrono>
#include <mutex>

namespace zsi::host {
namespace {

/// Pixels and samples of a unit of work: large enough that handing it out costs nothing, small
/// enough that the last ones end together.
constexpr int kTile = 16;
constexpr std::uint32_t kSamples = 16;

/// One rendering of a job: hands out units of work and adds their samples to the film.
class Rendering {
public:
    /// `unitAt`: the units of work by their number, below `units`.
    Rendering(PreparedScene const& scene, Film& film, RenderJob const& job,
              std::function<RenderUnit(std::int64_t)> unitAt, std::int64_t units,
              std::span<char> done)
        : scene_(scene)
        , film_(film)
        , job_(job)
        , settings_(scene.scene().settings)
        , camera_(scene.scene().camera, scene.scene().film)
        , unitAt_(std::move(unitAt))
        , units_(units)
        , isDone_(done)
    {
        for (LayerFormat const& format : film.layers()) {
            LayerKind const* const kind = kindOf(format);
            layers_.push_back(kind ? kind->values : nullptr);
            wants_.parts |= kind && kind->wants.parts;
            wants_.feature |= kind && kind->wants.feature;
        }
        if (std::ranges::any_of(film.layers(), [](LayerFormat const& format) {
                return format.value == LayerFormat::Value::Ids;
            })) {
            ObjectNames const names = objectNames(scene.scene());
            for (std::string const& name : names.shaders)
                shaderIds_.push_back(cryptomatteId(name));
            for (std::string const& name : names.objects)
                objectIds_.push_back(cryptomatteId(name));
        }
    }

    /// Works until nothing is left; for one thread.
    void work()
    {
        auto const integrator = makeIntegrator(settings_.integrator, scene_);
        WatchedThread const watched;
        try {
            std::int64_t unit;
            while (!cancelled() && !paused() && (unit = next_++) < units_)
                render(*integrator, unit);
        } catch (...) {
            next_ = units_; // nothing more for the others
            throw;
        }
        std::lock_guard const lock(reportLock_);
        report_.rays.add(integrator->context().rays());
        report_.nonFinite += integrator->context().nonFinite();
        auto const& counts = integrator->context().nonFiniteOf();
        report_.nonFiniteOf.resize(counts.size());
        for (std::size_t i = 0; i < counts.size(); ++i)
            report_.nonFiniteOf[i] += counts[i];
    }

    RenderReport report() const
    {
        RenderReport report = report_;
        report.complete = done_ == units_;
        return report;
    }

private:
    bool cancelled() const { return job_.cancel && job_.cancel->load(std::memory_order_relaxed); }

    bool paused() const { return job_.pause && job_.pause->load(std::memory_order_relaxed); }
    /// Units of the same pixels have the same lock.
    std::mutex& lockOf(Window const& pixels)
    {
        std::uint32_t const at = hashCombine(static_cast<std::uint32_t>(pixels.x0),
                                             static_cast<std::uint32_t>(pixels.y0));
        return tileLocks_[at % tileLocks_.size()];
    }

    void render(Integrator& integrator, std::int64_t unit)
    {
        auto const [pixels, samples] = unitAt_(unit);
        std::uint64_t surfaces = 0;
        Film part(film_.frameWidth(), film_.frameHeight(), pixels, film_.layers());
        for (int y = pixels.y0; y < pixels.y1; ++y)
            for (int x = pixels.x0; x < pixels.x1; ++x)
                if (!render(integrator, x, y, samples, part, surfaces))
                    return;
        {
            std::lock_guard const lock(lockOf(pixels));
            film_.add(part);
        }
        std::lock_guard const lock(reportLock_);
        ++done_;
        if (!isDone_.empty())
            isDone_[static_cast<std::size_t>(unit)] = 1;
        report_.surfaces += surfaces;
        if (job_.tileDone) {
            std::lock_guard const tileLock(lockOf(pixels));
            job_.tileDone(pixels, samples);
        }
        if (job_.progress)
            job_.progress(static_cast<double>(done_) / static_cast<double>(units_));
    }

    /// False when the job was cancelled meanwhile.
    bool render(Integrator& integrator, int x, int y, SampleRange samples, Film& part,
                std::uint64_t& surfaces) const
    {
        Sampler sampler(settings_.seed, x, y);
        for (std::uint32_t i = samples.begin; i < samples.end; ++i) {
            if (cancelled())
                return false;
            sampler.start(i);
            Vec2f const offset = filter_.offset(sampler.next2D());
            float const rasterX = static_cast<float>(x) + 0.5f + offset.x;
            float const rasterY = static_cast<float>(y) + 0.5f + offset.y;
            Vec3f origin, direction;
            camera_.ray(rasterX, rasterY, sampler.next2D(), origin, direction);
            CameraSample sample =
                integrator.sample(origin, direction, rasterX, rasterY, sampler, wants_);
            surfaces += sample.surface != nullptr;
            if (!sample.isFinite)
                continue;
            limit(sample);
            if (sample.surface && !shaderIds_.empty()) {
                sample.shaderId = shaderIds_[sample.surface->instance];
                sample.objectId = objectIds_[sample.surface->instance];
            }
            for (std::size_t layer = 0; layer < layers_.size(); ++layer) {
                std::array<float, 4> values;
                if (layers_[layer] && layers_[layer](sample, values.data()))
                    part.add(x, y, layer,
                             std::span(values).first(
                                 std::max<std::size_t>(1, film_.layers()[layer].channels.size())),
                             i);
            }
        }
        return true;
    }

    void limit(CameraSample& sample) const
    {
        float const brightest = maxComponent(rgb(sample.color));
        if (!(settings_.sampleClamp > 0.0f) || brightest <= settings_.sampleClamp)
            return;
        float const kept = settings_.sampleClamp / brightest;
        sample.color = withAlpha(rgb(sample.color) * kept, sample.color.w);
        sample.parts = sample.parts * Vec3f(kept, kept, kept);
    }

    PreparedScene const& scene_;
    Film& film_;
    RenderJob const& job_;
    Settings const& settings_;
    CameraRays camera_;
    PixelFilter filter_;
    std::function<RenderUnit(std::int64_t)> unitAt_;
    std::int64_t units_;
    std::span<char> isDone_;
    std::vector<bool (*)(CameraSample const&, float*)> layers_;
    SampleWants wants_;
    std::vector<float> shaderIds_, objectIds_; ///< of each instance
    std::array<std::mutex, 256> tileLocks_;
    std::atomic<std::int64_t> next_{0};
    std::mutex reportLock_;
    std::int64_t done_ = 0;
    RenderReport report_;
};

} // namespace

Window windowOf(FilmSettings const& film)
{
    Window const frame{0, 0, film.width, film.height};
    if (!film.crop)
        return frame;
    auto const& c = *film.crop;
    return intersection(frame, {c[0], c[1], c[2], c[3]});
}

Session::Session(Scene const& scene, BuildProgress const& progress)
    : prepared_(scene, progress)
{
}

std::vector<std::string> Session::omissions()
{
    prepared_.examineMaterials();
    return host::omissions(scene().settings.integrator, prepared_);
}

Film Session::newFilm() const { return newFilm(windowOf(scene().film)); }

Film Session::newFilm(Window const& window) const
{
    FilmSettings const& film = scene().film;
    return Film(film.width, film.height, window,
                chooseLayers(film.layers, scene().settings.noise > 0.0f));
}

ObjectNames objectNames(Scene const& scene)
{
    ObjectNames names;
    for (std::size_t i = 0; i < scene.instances.size(); ++i) {
        Instance const& instance = scene.instances[i];
        auto const material = static_cast<std::size_t>(instance.material);
        names.shaders.push_back(instance.light >= 0 ? "light"
                                    : material < scene.materialNames.size()
                                    ? scene.materialNames[material]
                                    : "material " + std::to_string(material));
        names.objects.push_back(i < scene.instanceNames.size() ? scene.instanceNames[i]
                                                               : "instance " + std::to_string(i));
    }
    return names;
}

namespace {

RenderReport run(Rendering& rendering, RenderJob const& job)
{
    auto const begin = std::chrono::steady_clock::now();
    onThreads(job.threads, [&] { rendering.work(); });
    RenderReport report = rendering.report();
    report.seconds =
        std::chrono::duration<double>(std::chrono::steady_clock::now() - begin).count();
    return report;
}

} // namespace

RenderReport Session::render(Film& film, RenderJob const& job)
{
    // All tiles for the first samples, then all for the next.
    Window const window = intersection(job.window, film.window());
    std::int64_t const across = (window.width() + kTile - 1) / kTile;
    std::int64_t const tiles = across * ((window.height() + kTile - 1) / kTile);
    auto const unitAt = [=, samples = job.samples](std::int64_t unit) -> RenderUnit {
        std::uint32_t const first =
            samples.begin + static_cast<std::uint32_t>(unit / tiles) * kSamples;
        int const left = window.x0 + static_cast<int>(unit % tiles % across) * kTile;
        int const top = window.y0 + static_cast<int>(unit % tiles / across) * kTile;
        return {intersection({left, top, left + kTile, top + kTile}, window),
                {first, std::min(first + kSamples, samples.end)}};
    };
    prepared_.examineMaterials();
    std::int64_t const units =
        tiles * ((job.samples.end - job.samples.begin + kSamples - 1) / kSamples);
    Rendering rendering(prepared_, film, job, unitAt, units, {});
    return run(rendering, job);
}

RenderReport Session::render(Film& film, std::span<RenderUnit const> units, std::span<char> done,
                             RenderJob const& job)
{
    prepared_.examineMaterials();
    Rendering rendering(
        prepared_, film, job,
        [units](std::int64_t unit) { return units[static_cast<std::size_t>(unit)]; },
        static_cast<std::int64_t>(units.size()), done);
    return run(rendering, job);
}

} // namespace zsi::host
