// SPDX-License-Identifier: Apache-2.0
// Sessions, pictures and their files.
#include "base/error.h"
#include "denoise/denoise.h"
#include "film/imageFile.h"
#include "render/merging.h"
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

    /// A share of the scene's picture as the bytes of a unit's file.
    py::bytes renderUnit(host::UnitOrigin const& origin, std::array<int, 6> const& place,
                         int threads, py::object const& tell)
    {
        Rendering const here(*data_, data_->edit().settings);
        auto const bytes = interruptibly(tell, [&](Progress& progress) {
            prepare(progress);
            host::RenderJob job;
            job.threads = threads;
            job.cancel = &progress.cancel;
            job.progress = [&](double done) { progress.done = done; };
            auto const unit = host::renderUnit(*session_, origin, unitOf(place), job);
            return unit ? host::unitBytes(*unit) : std::vector<unsigned char>();
        });
        return py::bytes(reinterpret_cast<char const*>(bytes.data()), bytes.size());
    }

private:
    static host::RenderUnit unitOf(std::array<int, 6> const& p)
    {
        return {{p[0], p[1], p[2], p[3]},
                {static_cast<std::uint32_t>(p[4]), static_cast<std::uint32_t>(p[5])}};
    }

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

std::vector<std::array<int, 6>> missingOf(host::Merging const& merging)
{
    std::vector<std::array<int, 6>> boxes;
    for (host::RenderUnit const& u : merging.missing())
        boxes.push_back({u.pixels.x0, u.pixels.y0, u.pixels.x1, u.pixels.y1,
                         static_cast<int>(u.samples.begin), static_cast<int>(u.samples.end)});
    return boxes;
}

/// `read`: gives the unit.
template <class Read>
void add(host::Merging& merging, std::string const& name, Read const& read)
{
    py::gil_scoped_release unlocked;
    merging.add(name, read());
}

Picture pictureSoFar(host::Merging const& merging)
{
    if (merging.units() == 0)
        throw InputError("there is no unit yet");
    py::gil_scoped_release unlocked;
    return std::make_shared<host::Picture>(merging.picture());
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
        .def("render", &Session::render)
        .def("render_unit", &Session::renderUnit);
    py::class_<host::UnitOrigin>(m, "UnitOrigin")
        .def_readonly("scene", &host::UnitOrigin::scene)
        .def_readonly("samples", &host::UnitOrigin::samples)
        .def_property_readonly("window",
                               [](host::UnitOrigin const& o) {
                                   return py::make_tuple(o.window.x0, o.window.y0, o.window.x1,
                                                         o.window.y1);
                               })
        .def_property_readonly("view",
                               [](host::UnitOrigin const& o) { return o.development.view; });
    m.def("unit_origin", [](SceneData const& data) {
        py::gil_scoped_release unlocked;
        return host::unitOriginOf(data.scene());
    });
    py::class_<host::Merging>(m, "Merging")
        .def(py::init<host::UnitOrigin>())
        .def("add",
             [](host::Merging& merging, std::string const& name, std::string_view bytes) {
                 add(merging, name, [&] {
                     return host::readUnit(
                         name,
                         {reinterpret_cast<unsigned char const*>(bytes.data()), bytes.size()});
                 });
             })
        .def("add_file",
             [](host::Merging& merging, std::string const& file) {
                 add(merging, file, [&] { return host::readUnit(file); });
             })
        .def("missing", missingOf)
        .def("missing_text", &host::Merging::missingText)
        .def("picture", pictureSoFar)
        .def_property_readonly("missing_samples", &host::Merging::missingSamples)
        .def_property_readonly("units", &host::Merging::units)
        .def_property_readonly("rays", &host::Merging::rays)
        .def_property_readonly("non_finite", &host::Merging::nonFinite)
        .def_property_readonly(
            "samples", [](host::Merging const& merging) { return merging.film().meanSamples(); });
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
