// SPDX-License-Identifier: Apache-2.0
/// Values between Python and the host: what a scene file could say becomes a JSON value, so that it
/// is read, checked and complained of as in a file.
#pragma once

#include "plugin/shader.h"
#include "json/jsonReader.h"

#include <pybind11/numpy.h>
#include <pybind11/pybind11.h>
#include <span>
#include <string>

namespace zsi::python {

namespace py = pybind11;

/// Row-major floats: taken as they are where they are such, else converted once.
using Floats = py::array_t<float, py::array::c_style | py::array::forcecast>;

/// Numbers, strings, paths, sequences, mappings and numpy's values. `origin`: what messages begin
/// with. Throws InputError for anything else.
host::JsonValue toJson(py::handle value, std::string const& origin);
/// {key: value}, for readers of objects.
host::JsonValue toJson(std::string const& key, host::JsonValue value);

py::object toPython(float v); ///< the shortest decimal that reads back as the same float
py::object toPython(Vec3f v); ///< read-only array of shape (3,)
py::object toPython(Mat4f const& m); ///< read-only, shape (4, 4)
/// A parameter's value; textures: whether there is one.
py::object toPython(host::Parameter const& parameter);

/// The rows of an array of shape (N, 3), or of one of shape (3,). `name`: for messages. Throws
/// InputError for another shape.
std::span<Vec3f const> rows3(Floats const& array, char const* name);

} // namespace zsi::python
