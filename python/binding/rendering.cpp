// SPDX-License-Identifier: Apache-2.0
// Sessions, pictures and their files.
#include "base/error.h"
#include "denoise/denoise.h"
#include "film/imageFile.h"
#include "render/render.h"
#include "render/session.h"
#include "sceneData.h"

#include <atomic>
#include <fmt/format.h>
#include <future>
#include <pybind11/stl.h>

namespace zsi::python {
namespace {

using host::InputError;
using Picture = std::shared_ptr<host::Picture>;

/// What a running work and who waits for it tell each other.
struct Progress {
    std::atomic<bool> cancel{false};
    std::atomic<double> done{0};
};

/// work(progress) on another thread. This one meanwhile sees to signals and to `tell`, which are
/// heard on it alone; what they raise ends the work.
template <class Work>
auto interruptibly(py::object const& tell, Work const& work)
{
    constexpr std::chrono::milliseconds kPause(20);
    Progress progress;
    auto result = std::async(std::launch::async, [&] { return work(progress); });
    try {
        double told = -1;
        for (bool running = true; running;) {
            {
                py::gil_scoped_release unlocked;
                running = result.wait_for(kPause) != std::future_status::ready;
            }
            if (PyErr_CheckSignals() != 0)
                throw py::error_already_set();
            if (double const done = progress.done; !tell.is_none() && done != told)
                tell(told = done);
        }
    } catch (...) {
        progress.cancel = true;
        py::gil_scoped_release unlocked;
        result.wait();
        throw;
    }
    return result.get();
}

/// A session that notices by itself what was edited.
class Session {
public:
    explicit Session(std::shared_ptr<SceneData> data)
        : data_(std::move(data))
    {
    }

    py::tuple render(std::optional<int> samples, double seconds, int threads,
                     py::object const& tell)
    {
        if (samples.value_or(1) < 1)
            throw InputError(fmt::format("samples: expected a number above 0, got {}", *samples));
        if (threads < 0)
            throw InputError(fmt::format("threads: expected 0 or more, got {}", threads));
        host::Settings& settings = data_->edit().settings; // not while another session renders
        Rendering const here(*data_, settings);
        settings.samples = samples.value_or(settings.samples);
        host::Scene const& scene = data_->scene();
        host::RenderReport report;
        double taken = 0;
        auto const picture =
            std::make_shared<host::Picture>(interruptibly(tell, [&](Progress& progress) {
                prepare(progress);
                host::Film film = session_->newFilm();
                host::RenderOptions options;
                options.threads = threads;
                options.seconds = seconds;
                options.cancel = &progress.cancel;
                options.progress = [&](host::RenderStatus const& s) { progress.done = s.done; };
                report = host::renderProgressively(*session_, film, options);
                taken = film.meanSamples();
                return host::developed(film, scene);
            }));
        py::dict told;
        told["samples"] = taken;
        told["noise"] = report.noise < 0 ? py::object(py::none()) : py::float_(report.noise);
        told["rays"] = report.rays.sum();
        told["surfaces"] = report.surfaces;
        told["nonFinite"] = report.nonFinite;
        told["seconds"] = report.seconds;
        return py::make_tuple(picture, told, host::screenView(scene.film));
    }

private:
    /// Keeps edits away, and the scene's own settings for afterwards.
    struct Rendering {
        Rendering(SceneData& d, host::Settings& s)
            : data(d)
            , settings(s)
            , before(s)
        {
            ++data.renderings;
        }
        ~Rendering()
        {
            settings = before;
            --data.renderings;
        }
        Rendering(Rendering const&) = delete;
        Rendering& operator=(Rendering const&) = delete;
        SceneData& data;
        host::Settings& settings;
        host::Settings const before;
    };

    void prepare(Progress const& progress)
    {
        auto const go = [&](double) { return !progress.cancel; };
        SceneData::Edits const now = data_->edits;
        if (!session_ || now.things != seen_.things) {
            session_.reset();
            session_.emplace(data_->scene(), go);
        } else {
            if (now.instances != seen_.instances) {
                // Half built structures are of no use.
                SceneData::Edits const none{-1, -1, -1, -1};
                seen_ = none;
                session_->instancesChanged(go);
            } else if (now.lights != seen_.lights) {
                session_->lightsChanged();
            }
            if (now.environment != seen_.environment)
                session_->environmentChanged();
        }
        seen_ = now;
    }

    std::shared_ptr<SceneData> data_;
    std::optional<host::Session> session_;
    SceneData::Edits seen_;
};

host::Layer const& layerOf(host::Picture const& picture, std::string const& name)
{
    if (host::Layer const* const layer = picture.find(name))
        return *layer;
    std::string known;
    for (host::Layer const& layer : picture.layers)
        known += (known.empty() ? "" : ", ") + layer.name;
    throw py::key_error(fmt::format("{}: the picture has the layers {}", name, known));
}

/// The layer's own values, which stay with the picture.
py::array_t<float> valuesOf(Picture const& picture, std::string const& name)
{
    host::Layer const& layer = layerOf(*picture, name);
    return py::array_t<float>(
        std::vector<py::ssize_t>{picture->height(), picture->width(),
                                 static_cast<py::ssize_t>(layer.channels.size())},
        layer.values.data(), py::cast(picture));
}

Picture denoise(Picture const& picture, int threads, py::object const& tell)
{
    return std::make_shared<host::Picture>(interruptibly(tell, [&](Progress& progress) {
        host::DenoiseOptions options;
        options.threads = threads;
        options.cancel = &progress.cancel;
        options.progress = [&](double done) { progress.done = done; };
        return host::denoised(*picture, options).value_or(host::Picture());
    }));
}

Picture pictureOf(std::vector<std::tuple<std::string, std::vector<std::string>, Floats>> const& all)
{
    auto picture = std::make_shared<host::Picture>();
    for (auto const& [name, channels, values] : all) {
        if (values.ndim() != 3 || values.shape(2) != static_cast<py::ssize_t>(channels.size()))
            throw InputError(fmt::format("{}: expected an array of shape (height, width, {}), "
                                         "got {}",
                                         name, channels.size(),
                                         py::str(values.attr("shape")).cast<std::string>()));
        auto const height = static_cast<int>(values.shape(0));
        auto const width = static_cast<int>(values.shape(1));
        if (picture->layers.empty()) {
            picture->frameWidth = width;
            picture->frameHeight = height;
            picture->window = {0, 0, width, height};
        } else if (width != picture->width() || height != picture->height()) {
            throw InputError(fmt::format("{}: expected {} x {} pixels as the first layer has, got "
                                         "{} x {}",
                                         name, picture->width(), picture->height(), width, height));
        }
        picture->layers.push_back({name, channels, {values.data(), values.data() + values.size()}});
    }
    return picture;
}

/// Signals of the screen, (height, width, 3), 0..1.
py::array_t<float> toScreen(Picture const& picture, host::ScreenView const& view)
{
    py::array_t<float> screen({picture->height(), picture->width(), 3});
    float* out = screen.mutable_data();
    std::vector<float> const& rgba = picture->rgba();
    for (std::size_t i = 0; i < rgba.size(); i += 4)
        out = std::copy_n(&rgba[i], 3, out);
    host::screenTransform(view)({screen.mutable_data(), static_cast<std::size_t>(screen.size())});
    return screen;
}

} // namespace

void bindRendering(py::module_& m)
{
    py::class_<Session>(m, "Session")
        .def(py::init<std::shared_ptr<SceneData>>())
        .def("render", &Session::render);
    py::class_<host::Picture, Picture>(m, "Picture")
        .def(py::init(&pictureOf))
        .def_property_readonly("layers",
                               [](host::Picture const& p) {
                                   std::vector<std::string> names;
                                   for (host::Layer const& layer : p.layers)
                                       names.push_back(layer.name);
                                   return names;
                               })
        .def_property_readonly(
            "frame", [](host::Picture const& p) { return std::pair(p.frameWidth, p.frameHeight); })
        .def_property_readonly("window",
                               [](host::Picture const& p) {
                                   return py::make_tuple(p.window.x0, p.window.y0, p.window.x1,
                                                         p.window.y1);
                               })
        .def("channels",
             [](host::Picture const& p, std::string const& name) {
                 return layerOf(p, name).channels;
             })
        .def("values", valuesOf);
    using host::ScreenView;
    using py::arg;
    py::class_<ScreenView>(m, "ScreenView")
        .def(py::init<float, bool, std::string, std::string>(), arg("exposure"), arg("alpha"),
             arg("view"), arg("ocio_config"))
        .def_readonly("exposure", &ScreenView::exposure)
        .def_readonly("alpha", &ScreenView::alpha)
        .def_readonly("view", &ScreenView::view)
        .def_readonly("ocio_config", &ScreenView::ocioConfig);
    m.def("write", [](std::string const& file, Picture const& picture, ScreenView const& view) {
        py::gil_scoped_release unlocked;
        host::writePicture(file, *picture, view);
    });
    m.def("read", [](std::string const& file) {
        py::gil_scoped_release unlocked;
        return std::make_shared<host::Picture>(host::readPicture(file));
    });
    m.def("denoise", denoise);
    m.def("to_screen", toScreen);
}

} // namespace zsi::python
