// SPDX-License-Identifier: Apache-2.0
#include "render/progressive.h"

#include "base/grid.h"
#include "film/noise.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <optional>

namespace zsi::host {
namespace {

/// Samples between two looks at the noise; a tile's side.
constexpr std::uint32_t kBlock = 16;
constexpr int kTile = 16;
/// Units of work in a pass where nothing has to be decided between blocks.
constexpr std::size_t kUnits = 4096;
/// Checkpoints and previews take at most these shares of the time.
constexpr double kCheckpointShare = 1.0 / 40, kPreviewShare = 1.0 / 10;

double now()
{
    return std::chrono::duration<double>(std::chrono::steady_clock::now().time_since_epoch())
        .count();
}

/// The end of the block in which sample `n` is. The first ones are short, so that there soon is a
/// picture of all pixels.
std::uint32_t blockEnd(std::uint32_t n)
{
    return n < 1 ? 1 : n < 4 ? 4 : (n / kBlock + 1) * kBlock;
}

class Progressive {
public:
    Progressive(Session& session, Film& film, RenderOptions const& options)
        : session_(session)
        , film_(film)
        , options_(options)
        , settings_(session.scene().settings)
        , samples_(static_cast<std::uint32_t>(std::max(0, settings_.samples)))
        , across_((film.window().width() + kTile - 1) / kTile)
        , down_((film.window().height() + kTile - 1) / kTile)
        , tiles_(cellCount(across_, down_))
    {
    }

    RenderReport run()
    {
        if (!options_.checkpoint.empty()) {
            checkpoint_.emplace(options_.checkpoint, session_.scene());
            checkpoint_->read(film_, tiles_);
            checkpointDue_ = now() + options_.checkpointSeconds;
        }
        double const begin = now();
        previewDue_ = begin + options_.previewSeconds;
        end_ = options_.seconds > 0 ? begin + options_.seconds : 0;
        while (!stopped() && pass()) { }
        if (checkpoint_)
            checkpoint_->write(film_, tiles_);
        report_.seconds = now() - begin;
        report_.complete = remaining().second == 0;
        report_.noise = noise_;
        return report_;
    }

private:
    bool isAdaptive() const { return settings_.noise > 0.0f; }
    bool isCancelled() const { return options_.cancel && options_.cancel->load(); }
    bool isPreviewDue() const { return options_.preview && now() >= previewDue_; }
    bool timeIsOver() const { return end_ > 0 && now() >= end_; }
    bool stopped() const { return isCancelled() || timeIsOver(); }
    bool isDone(TileState const& tile) const { return tile.isGood || tile.next >= samples_; }

    /// The least of the tiles' next samples, and how many tiles are to go on; (samples, 0) at the
    /// end.
    std::pair<std::uint32_t, std::size_t> remaining() const
    {
        std::pair<std::uint32_t, std::size_t> least{samples_, 0};
        for (TileState const& tile : tiles_)
            if (!isDone(tile)) {
                least.first = std::min(least.first, tile.next);
                ++least.second;
            }
        return least;
    }

    Window pixels(std::size_t tile) const
    {
        int const x = static_cast<int>(tile) % across_, y = static_cast<int>(tile) / across_;
        int const left = film_.window().x0 + x * kTile, top = film_.window().y0 + y * kTile;
        return intersection({left, top, left + kTile, top + kTile}, film_.window());
    }

    /// The next samples of all tiles that are not done: of one block where it is to be looked at
    /// afterwards, else of as many as make enough units of work. False when nothing is left.
    bool pass()
    {
        auto const left = remaining();
        std::uint32_t const begin = left.first;
        std::size_t const active = left.second;
        if (active == 0)
            return false;
        std::uint32_t end = std::min(blockEnd(begin), samples_);
        if (!isAdaptive() && begin >= kBlock)
            end = static_cast<std::uint32_t>(
                std::min<std::size_t>(samples_, end + kBlock * (kUnits / active)));
        units_.clear();
        tileOf_.clear();
        for (std::uint32_t from = begin; from < end; from = std::min(blockEnd(from), end))
            for (std::size_t t = 0; t < tiles_.size(); ++t) {
                TileState const& tile = tiles_[t];
                std::uint32_t const first = std::max(from, tile.next);
                std::uint32_t const last = std::min(blockEnd(from), end);
                if (isDone(tile) || first >= last
                    || std::ranges::any_of(
                        tile.ahead, [&](SampleRange const& range) { return range.begin == first; }))
                    continue;
                units_.push_back({pixels(t), {first, last}});
                tileOf_.push_back(t);
            }
        pause_ = false;
        RenderJob job;
        job.threads = options_.threads;
        job.cancel = options_.cancel;
        job.pause = &pause_;
        job.progress = [&](double share) { tell(begin, end, share); };
        std::vector<char> done(units_.size());
        add(session_.render(film_, units_, done, job));
        note(done);
        if (isAdaptive() && remaining().first >= end && end % kBlock == 0)
            judge();
        if (checkpoint_ && now() >= checkpointDue_)
            keep();
        if (isPreviewDue() && !stopped() && remaining().second > 0)
            show();
        return true;
    }

    /// Called while a pass runs.
    void tell(std::uint32_t begin, std::uint32_t end, double share)
    {
        if (timeIsOver() || (checkpoint_ && now() >= checkpointDue_)
            || (begin > 0 && isPreviewDue())) // not before every pixel has a sample
            pause_ = true;
        if (!options_.progress)
            return;
        double const at = begin + share * (end - begin);
        double done = at / samples_;
        if (noise_ > 0) // falls with the root of the samples
            done = std::max(done,
                            at / judgedAt_
                                * std::pow(static_cast<double>(settings_.noise) / noise_, 2.0));
        if (end_ > 0)
            done = std::max(done, 1 - (end_ - now()) / options_.seconds);
        told_ = std::max(told_, std::min(done, 1.0)); // a pass that was cut short begins lower
        options_.progress({told_, at, noise_});
    }

    void add(RenderReport const& part)
    {
        report_.nonFinite += part.nonFinite;
        report_.surfaces += part.surfaces;
        report_.rays.add(part.rays);
        report_.nonFiniteOf.resize(std::max(report_.nonFiniteOf.size(), part.nonFiniteOf.size()));
        for (std::size_t i = 0; i < part.nonFiniteOf.size(); ++i)
            report_.nonFiniteOf[i] += part.nonFiniteOf[i];
    }

    /// Units come by rising sample in each tile.
    void note(std::vector<char> const& done)
    {
        for (std::size_t i = 0; i < units_.size(); ++i)
            if (done[i]) {
                TileState& tile = tiles_[tileOf_[i]];
                if (units_[i].samples.begin == tile.next)
                    tile.next = units_[i].samples.end;
                else
                    tile.ahead.push_back(units_[i].samples);
                while (!tile.ahead.empty() && tile.ahead.front().begin == tile.next) {
                    tile.next = tile.ahead.front().end;
                    tile.ahead.erase(tile.ahead.begin());
                }
            }
    }

    /// A tile is good when the noise of itself and of its neighbours is low: a tile alone may have
    /// met nothing yet of what its neighbours have.
    void judge()
    {
        std::vector<double> noise(tiles_.size());
        double all = 0;
        for (std::size_t t = 0; t < tiles_.size(); ++t) {
            noise[t] = squaredNoise(film_, pixels(t));
            all += noise[t];
        }
        for (std::size_t t = 0; t < tiles_.size(); ++t) {
            int const x = static_cast<int>(t) % across_, y = static_cast<int>(t) / across_;
            double around = 0, count = 0;
            for (int ny = std::max(0, y - 1); ny < std::min(down_, y + 2); ++ny)
                for (int nx = std::max(0, x - 1); nx < std::min(across_, x + 2); ++nx) {
                    around += noise[cellIndex(nx, ny, across_)];
                    ++count;
                }
            double const limit = static_cast<double>(settings_.noise);
            tiles_[t].isGood = tiles_[t].isGood || (noise[t] + around / count) / 2 <= limit * limit;
        }
        noise_ = std::sqrt(all / static_cast<double>(tiles_.size()));
        judgedAt_ = 0;
        for (TileState const& tile : tiles_)
            judgedAt_ = std::max(judgedAt_, static_cast<double>(tile.next));
    }

    void keep()
    {
        double const begin = now();
        checkpoint_->write(film_, tiles_);
        double const took = now() - begin;
        checkpointDue_ = now() + std::max(options_.checkpointSeconds, took / kCheckpointShare);
    }

    void show()
    {
        double const begin = now();
        options_.preview(film_);
        double const took = now() - begin;
        previewDue_ = now() + std::max(options_.previewSeconds, took / kPreviewShare);
    }

    Session& session_;
    Film& film_;
    RenderOptions const& options_;
    Settings const& settings_;
    std::uint32_t samples_;
    int across_, down_;
    std::vector<TileState> tiles_;
    std::vector<RenderUnit> units_; ///< of the running pass
    std::vector<std::size_t> tileOf_; ///< each unit's
    std::atomic<bool> pause_ = false;
    std::optional<Checkpoint> checkpoint_;
    double checkpointDue_ = 0, previewDue_ = 0, end_ = 0; ///< clock time
    double noise_ = -1, judgedAt_ = 1, told_ = 0;
    RenderReport report_;
};

} // namespace

RenderReport renderProgressively(Session& session, Film& film, RenderOptions const& options)
{
    return Progressive(session, film, options).run();
}

} // namespace zsi::host
