// SPDX-License-Identifier: Apache-2.0
// The compiled half of the package zsi; what users see stands in its Python half.
#include "base/error.h"
#include "sceneData.h"

PYBIND11_MODULE(_core, m)
{
    pybind11::register_exception<zsi::host::InputError>(m, "Error", PyExc_ValueError).doc() =
        "Bad input: the message names the place and what was expected.";
    zsi::python::bindMaterials(m);
    zsi::python::bindScenes(m);
    zsi::python::bindRendering(m);
    m.attr("version") = ZSI_VERSION;
}
