// SPDX-License-Identifier: Apache-2.0
// Shader classes and the measuring of materials.
#include "base/error.h"
#include "cmd/classText.h"
#include "measure/materialProbe.h"
#include "sceneData.h"

#include <fmt/format.h>
#include <fmt/ranges.h>
#include <nlohmann/json.hpp>
#include <pybind11/stl.h>

namespace zsi::python {
namespace {

using host::InputError;
using host::MaterialProbe;
using Shape = std::vector<py::ssize_t>;

std::span<Vec3f> rowsOf(py::array_t<float>& array)
{
    return {reinterpret_cast<Vec3f*>(array.mutable_data()),
            static_cast<std::size_t>(array.size()) / 3};
}

template <class T>
std::span<T> all(py::array_t<T>& array)
{
    return {array.mutable_data(), static_cast<std::size_t>(array.size())};
}

int positive(int value, char const* name)
{
    if (value < 1)
        throw InputError(fmt::format("{}: expected a number above 0, got {}", name, value));
    return value;
}

/// The caller's array for results, as it is.
py::array_t<float> ownedBy(py::array const& out, Shape const& shape)
{
    bool const fits = py::isinstance<py::array_t<float, py::array::c_style>>(out) && out.writeable()
        && Shape(out.shape(), out.shape() + out.ndim()) == shape;
    if (!fits)
        throw InputError(fmt::format("out: expected a writable float32 array in C order of shape "
                                     "({})",
                                     fmt::join(shape, ", ")));
    return py::reinterpret_borrow<py::array_t<float>>(out);
}

py::array_t<float> evaluate(ShaderOfScene const& self, Floats const& wi, Floats const& wo,
                            bool cosine, int threads, std::optional<py::array> const& out)
{
    std::span<Vec3f const> const in = rows3(wi, "wi"), away = rows3(wo, "wo");
    if (in.size() != away.size() && wi.ndim() == 2 && wo.ndim() == 2)
        throw InputError(fmt::format("wo: expected as many directions as wi has, {}, got {}",
                                     in.size(), away.size()));
    bool const single = wi.ndim() == 1 && wo.ndim() == 1;
    auto const count = static_cast<py::ssize_t>(wi.ndim() == 2 ? in.size() : away.size());
    Shape const shape = single ? Shape{3} : Shape{count, 3};
    auto values = out ? ownedBy(*out, shape) : py::array_t<float>(shape);
    std::span<Vec3f> const rows = rowsOf(values);
    MaterialProbe const probe(self.shader());
    py::gil_scoped_release unlocked;
    probe.evaluate(in, away, cosine, rows, threads);
    return values;
}

py::tuple sample(ShaderOfScene const& self, Floats const& wi, int n, std::uint32_t seed,
                 int threads)
{
    std::span<Vec3f const> const in = rows3(wi, "wi");
    Shape shape{positive(n, "n")};
    if (wi.ndim() == 2)
        shape.insert(shape.begin(), wi.shape(0));
    py::array_t<float> density(shape);
    py::array_t<std::uint32_t> type(shape);
    shape.push_back(3);
    py::array_t<float> direction(shape), weight(shape);
    host::DrawnDirections const drawn{rowsOf(direction), rowsOf(weight), all(density), all(type)};
    MaterialProbe const probe(self.shader());
    {
        py::gil_scoped_release unlocked;
        probe.sample(in, seed, drawn, threads);
    }
    return py::make_tuple(direction, weight, density, type);
}

py::array_t<float> albedo(ShaderOfScene const& self, Floats const& theta, int n, std::uint32_t seed,
                          int threads)
{
    Shape shape(theta.shape(), theta.shape() + theta.ndim());
    shape.push_back(3);
    py::array_t<float> values(shape);
    std::span<float const> const angles{theta.data(), static_cast<std::size_t>(theta.size())};
    std::span<Vec3f> const rows = rowsOf(values);
    auto const draws = static_cast<std::uint32_t>(positive(n, "n"));
    MaterialProbe const probe(self.shader());
    py::gil_scoped_release unlocked;
    probe.albedo(angles, draws, seed, rows, threads);
    return values;
}

py::tuple histogram(ShaderOfScene const& self, Floats const& wi, int n, int rows, int columns,
                    std::uint32_t seed, int threads)
{
    std::span<Vec3f const> const in = rows3(wi, "wi");
    if (in.size() != 1)
        throw InputError("wi: expected one direction, an array of shape (3,)");
    auto const draws = static_cast<std::uint32_t>(positive(n, "n"));
    positive(rows, "rows");
    positive(columns, "columns");
    MaterialProbe const probe(self.shader());
    host::SphereHistogram h;
    {
        py::gil_scoped_release unlocked;
        h = probe.histogram(in[0], draws, seed, rows, columns, threads);
    }
    Shape const shape{rows, columns};
    return py::make_tuple(py::array_t<float>(shape, h.density.data()),
                          py::array_t<float>(shape, h.coverage.data()), h.declined);
}

ShaderOfScene createMaterial(std::string const& className)
{
    auto const data = std::make_shared<SceneData>();
    host::Shader shader = libraries().create(className);
    if (!shader.material())
        throw InputError(className + ": is no material");
    data->edit().materials.push_back(std::move(shader));
    return {data, kMaterial};
}

} // namespace

void bindMaterials(py::module_& m)
{
    m.def("load_shaders",
          [](std::string const& folder) { return libraries().loadDirectory(folder); });
    m.def("class_names", [] { return libraries().classNames(); });
    m.def("class_json",
          [](std::string const& name) { return cmd::classJson(libraries().create(name)).dump(); });
    m.def("class_text",
          [](std::string const& name) { return cmd::classText(libraries().create(name)); });
    m.def("material", createMaterial);

    using py::arg;
    py::class_<ShaderOfScene>(m, "Shader")
        .def_property_readonly("class_name",
                               [](ShaderOfScene const& s) { return s.shader().className(); })
        .def("get",
             [](ShaderOfScene const& s, std::string const& name) {
                 host::Parameter const* const p = s.shader().find(name);
                 if (!p) // tells the nearest names
                     const_cast<host::Shader&>(s.shader()).set(name, 0);
                 return toPython(*p);
             })
        .def("set", &ShaderOfScene::set)
        .def("eval", evaluate, arg("wi"), arg("wo"), arg("cosine"), arg("threads"), arg("out"))
        .def("sample", sample, arg("wi"), arg("n"), arg("seed"), arg("threads"))
        .def("albedo", albedo, arg("theta"), arg("n"), arg("seed"), arg("threads"))
        .def("histogram", histogram, arg("wi"), arg("n"), arg("rows"), arg("columns"), arg("seed"),
             arg("threads"));
}

} // namespace zsi::python
