// SPDX-License-Identifier: Apache-2.0
#include "view/studio.h"

#include "base/error.h"
#include "base/names.h"
#include "denoise/denoise.h"
#include "film/screenTransform.h"
#include "integrate/integrators.h"
#include "integrate/layers.h"
#include "render/render.h"

#include <chrono>
#include <cmath>
#include <fmt/format.h>

namespace zsi::view {
namespace {

using Clock = std::chrono::steady_clock;
constexpr auto kFrameInterval = std::chrono::milliseconds(200);
constexpr std::uint32_t kFirstDenoised = 4; ///< samples
constexpr int kMostPixels = 4096 * 2304;

} // namespace

Studio::Studio(OpenedScene const& opened, host::ShaderSource const& shaders, StudioOptions options)
    : shaders_(shaders)
    , options_(std::move(options))
    , file_(opened.file)
    , document_(toJson(opened.document, opened.file.parent_path()))
    , live_(opened.document, opened.file, shaders, {})
    , preview_(live_)
{
    warnings_ = opened.warnings;
    warnings_.insert(warnings_.end(), live_.scene().warnings.begin(), live_.scene().warnings.end());
    for (std::string const& omission : live_.session().omissions())
        warnings_.push_back(live_.scene().file + ": " + omission);
    host::screenTransform(host::screenView(live_.scene().film)); // refuses an unknown view
    live_.setSize(live_.documentWidth(), live_.documentHeight());
    preview_.restart();
}

Studio::~Studio()
{
    stopDenoising_ = stopAnswers_ = true;
    {
        std::lock_guard const locked(lock_);
        stop_ = true;
        cancel_ = true;
    }
    wake_.notify_one();
    if (thread_.joinable())
        thread_.join();
}

void Studio::start(Audience& audience)
{
    audience_ = &audience;
    thread_ = std::thread([this] { run(); });
}

void Studio::post(std::function<void()> command, bool changesScene)
{
    {
        std::lock_guard const locked(lock_);
        queue_.push_back(std::move(command));
        (changesScene ? cancel_ : pause_) = true;
    }
    wake_.notify_one();
}

void Studio::run()
{
    for (;;) {
        std::deque<std::function<void()>> commands;
        {
            std::unique_lock locked(lock_);
            bool const idle = (isPaused_ || preview_.isDone()) && !turntable_ && !denoising_;
            if (idle)
                wake_.wait(locked, [&] { return stop_ || !queue_.empty(); });
            if (stop_)
                return;
            commands.swap(queue_);
            cancel_ = pause_ = false;
        }
        for (auto const& command : commands)
            command();
        try {
            render();
        } catch (std::exception const& error) {
            isPaused_ = true; // it would happen again
            turntable_.reset();
            audience_->tell(kAllPages, {{"type", "error"}, {"message", error.what()}});
        }
    }
}

void Studio::render()
{
    if (told_ != preview_.generation())
        tellFrame(true);
    if (turntable_) {
        turntable_->step(live_, cancel_);
        audience_->tell(
            kAllPages, {{"type", "progress"}, {"what", "turntable"}, {"done", turntable_->done()}});
        if (turntable_->isDone()) {
            turntablePictures_ = std::move(turntable_->pictures());
            turntable_.reset();
            Json frames = Json::array();
            for (std::size_t i = 0; i < turntablePictures_.size(); ++i)
                frames.push_back(fmt::format("/turntable/{}.png", i));
            audience_->tell(kAllPages, {{"type", "turntable"}, {"frames", frames}});
        }
        return;
    }
    bool const wasDone = preview_.isDone() || isPaused_;
    std::vector<LayerUpdate> updates =
        isPaused_ ? preview_.updates() : preview_.step(cancel_, pause_);
    denoiseWhenDue();
    if (!updates.empty())
        audience_->show(std::move(updates));
    tellFrame(!wasDone && preview_.isDone());
    if (wasDone && denoising_ && !cancel_ && !pause_) // nothing else to do meanwhile
        denoising_->result.wait_for(std::chrono::milliseconds(20));
}

void Studio::tellFrame(bool always)
{
    auto const time = Clock::now();
    if (!always && time - lastFrame_ < kFrameInterval)
        return;
    lastFrame_ = time;
    told_ = preview_.generation();
    host::Scene const& scene = live_.scene();
    audience_->tell(kAllPages,
                    {{"type", "frame"},
                     {"generation", preview_.generation()},
                     {"width", preview_.film().frameWidth()},
                     {"height", preview_.film().frameHeight()},
                     {"samples", preview_.samples()},
                     {"target", scene.settings.samples},
                     {"noise", preview_.noise() >= 0 ? Json(preview_.noise()) : Json()},
                     {"seconds", preview_.seconds()},
                     {"state",
                      isPaused_               ? "paused"
                          : preview_.isDone() ? "done"
                                              : "rendering"},
                     {"raysPerSecond", preview_.raysPerSecond()}});
}

/// The preview goes on while the noise is taken out of what there is: at 4, 16, 64 ... samples and
/// at the end.
void Studio::denoiseWhenDue()
{
    if (denoising_
        && denoising_->result.wait_for(std::chrono::seconds(0)) == std::future_status::ready) {
        std::optional<host::Layer> layer = denoising_->result.get();
        if (layer && denoise_ && denoising_->generation == preview_.generation()) {
            preview_.showDenoised(std::move(*layer));
            denoisedAt_ = denoising_->samples;
        }
        denoising_.reset();
        if (isPaused_ || preview_.isDone())
            audience_->show(preview_.updates());
    }
    std::uint32_t const samples = preview_.samples();
    bool const isDue = preview_.isDone() ? samples > denoisedAt_
                                         : samples >= std::max(kFirstDenoised, 4 * denoisedAt_);
    if (!denoise_ || denoising_ || !isDue || samples < 2
        || preview_.film().layers().front().half.empty())
        return;
    stopDenoising_ = false;
    denoising_ = Denoising{
        preview_.generation(), samples,
        std::async(std::launch::async,
                   [this, halves = std::array{preview_.film().half(0), preview_.film().half(1)}] {
                       host::DenoiseOptions options;
                       options.cancel = &stopDenoising_;
                       return host::denoised(halves, options);
                   })};
}

void Studio::restart()
{
    stopDenoising_ = true;
    if (denoising_)
        denoising_->result.wait();
    denoising_.reset();
    denoisedAt_ = 0;
    turntable_.reset();
    preview_.restart();
}

void Studio::join(PageId page)
{
    post(
        [this, page] {
            layerOf_[page] = "beauty";
            std::vector<host::Shader> classes;
            for (std::string const& name : shaders_.classNames())
                classes.push_back(shaders_.create(name));
            Json layers = {"beauty"};
            for (std::string const& name : host::layerNames())
                if (name != "halves")
                    layers.push_back(name);
            audience_->tell(page,
                            {{"type", "hello"},
                             {"version", options_.version},
                             {"scene", file_.filename().string()},
                             {"classes", options_.listClasses(classes)["classes"]},
                             {"layers", layers},
                             {"views", host::toneCurveNames()},
                             {"canSave", !options_.saveFolder.empty()},
                             {"integrators", host::integratorNames()}});
            tellScene(page, warnings_);
            tellFrame(true);
        },
        false);
}

void Studio::leave(PageId page)
{
    post(
        [this, page] {
            if (layerOf_.erase(page))
                layersChanged();
        },
        false);
}

void Studio::layersChanged()
{
    std::set<std::string> layers;
    for (auto const& [page, layer] : layerOf_)
        layers.insert(layer);
    if (preview_.wantLayers(layers, denoise_))
        restart();
}

void Studio::receive(PageId page, std::string const& text, std::function<void()> const& handled)
{
    Json message;
    try {
        constexpr int kMostLevels = 32;
        message = Json::parse(text, [](int depth, Json::parse_event_t, Json&) {
            if (depth > kMostLevels)
                throw host::InputError("the message is nested too deeply");
            return true;
        });
        if (!message.is_object() || !message.value("type", Json()).is_string())
            throw host::InputError("expected an object with a \"type\"");
    } catch (std::exception const& error) {
        post(
            [this, page, handled, why = std::string(error.what())] {
                audience_->tell(page, {{"type", "error"}, {"message", host::printable(why)}});
                handled();
            },
            false);
        return;
    }
    std::string const type = message["type"];
    bool const asks = type == "pick" || type == "inspect" || type == "class" || type == "keep"
        || type == "compare" || type == "save";
    post(
        [this, page, message = std::move(message), handled] {
            try {
                handle(page, message);
            } catch (host::InputError const& error) {
                Json told = {{"type", "error"}, {"message", error.what()}};
                if (message.contains("path"))
                    told["path"] = message["path"];
                if (message.contains("id"))
                    told["id"] = message["id"];
                audience_->tell(page, told);
            } catch (Json::exception const&) {
                audience_->tell(page,
                                {{"type", "error"},
                                 {"message",
                                  "a key of the message is missing or of the "
                                  "wrong type: "
                                      + message["type"].get<std::string>()}});
            }
            handled();
        },
        !asks);
}

void Studio::handle(PageId page, Json const& message)
{
    std::string const type = message["type"];
    std::string const group = message.contains("group")
        ? fmt::format("{}/{}", page, message["group"].dump())
        : std::string();
    auto const slot = [&] {
        std::string name = message.at("slot");
        if (name != "a" && name != "b")
            throw host::InputError("slot: expected \"a\" or \"b\"");
        return name;
    };
    if (type == "set" || type == "replace") {
        edit(page, {{message.at("path"), message.at("value")}}, group);
    } else if (type == "setMany") {
        std::vector<Edit> edits;
        for (Json const& one : message.at("edits"))
            edits.push_back({one.at("path"), one.at("value")});
        edit(page, edits, group);
    } else if (type == "camera") {
        std::vector<Edit> edits;
        for (char const* key : {"position", "target", "up", "fov", "focusDistance", "lensRadius"})
            if (message.contains(key))
                edits.push_back({std::string("camera.") + key, message[key]});
        edit(page, edits, group);
    } else if (type == "undo" || type == "redo") {
        undo(page, type == "redo");
    } else if (type == "view") {
        setView(message);
    } else if (type == "layer") {
        std::string const name = message.at("name");
        host::chooseLayers(name == "beauty" ? std::vector<std::string>{}
                                            : std::vector<std::string>{name});
        layerOf_[page] = name;
        layersChanged();
    } else if (type == "denoise") {
        denoise_ = message.at("on");
        if (!denoise_)
            preview_.showNoisy();
        denoisedAt_ = 0;
        layersChanged();
    } else if (type == "pause") {
        isPaused_ = message.at("on");
        tellFrame(true);
    } else if (type == "pick") {
        pick(page, message);
    } else if (type == "inspect") {
        inspect(page, message);
    } else if (type == "keep") {
        keep(slot());
    } else if (type == "compare") {
        compare(page, message);
    } else if (type == "restore") {
        auto const kept = slots_.find(slot());
        if (kept == slots_.end())
            throw host::InputError("restore: nothing was kept there");
        Json after = kept->second.document;
        goTo(page, after, [&] { document_.commit(after, "restore", {}); });
    } else if (type == "class") {
        Json answer = classJson(message.at("name"));
        answer["type"] = "class";
        audience_->tell(page, answer);
    } else if (type == "save") {
        save(page, message.at("path"));
    } else if (type == "turntable") {
        turntable_.emplace(message.at("frames").get<int>(), message.at("samples").get<int>());
    } else if (type == "cancel") {
        turntable_.reset();
    } else {
        throw host::InputError(fmt::format("unknown message \"{}\"", host::printable(type)));
    }
}

void Studio::setView(Json const& message)
{
    int const width = message.at("width"), height = message.at("height");
    if (width < 16 || height < 16 || width > 16384 || height > 16384)
        throw host::InputError("view: expected a width and height from 16 to 16384");
    double w = width, h = height;
    if (!message.value("free", false)) {
        double const by = std::min(w / live_.documentWidth(), h / live_.documentHeight());
        w = by * live_.documentWidth();
        h = by * live_.documentHeight();
    }
    double const fit = std::min(1.0, std::sqrt(kMostPixels / (w * h)));
    int const to[] = {std::max(1, static_cast<int>(std::lround(w * fit))),
                      std::max(1, static_cast<int>(std::lround(h * fit)))};
    host::FilmSettings const& film = live_.scene().film;
    if (film.width == to[0] && film.height == to[1])
        return;
    live_.setSize(to[0], to[1]);
    restart();
}

Json Studio::classJson(std::string const& name) const
{
    return options_.describeClass(shaders_.create(name));
}

} // namespace zsi::view
