// SPDX-License-Identifier: Apache-2.0
// The compiled half of the package zsi; what users see stands in its Python half.
#include "base/error.h"
#include "sceneData.h"

#include <cstring>

namespace py = pybind11;

PYBIND11_MODULE(_core, m)
{
    static PyObject* errorType = nullptr;
    auto error = py::exception<zsi::host::InputError>(m, "Error", PyExc_ValueError);
    error.doc() = "Bad input: the message names the place and what was expected.";
    errorType = error.ptr(); // the module holds it
    py::register_exception_translator([](std::exception_ptr thrown) {
        try {
            if (thrown)
                std::rethrow_exception(thrown);
        } catch (zsi::host::InputError const& e) {
            // Quotes from damaged files and names of files may be no UTF-8.
            auto const text = py::reinterpret_steal<py::object>(PyUnicode_DecodeUTF8(
                e.what(), static_cast<py::ssize_t>(std::strlen(e.what())), "backslashreplace"));
            PyErr_SetObject(errorType, text.ptr());
        }
    });
    zsi::python::bindMaterials(m);
    zsi::python::bindScenes(m);
    zsi::python::bindRendering(m);
    m.attr("version") = ZSI_VERSION;
}
