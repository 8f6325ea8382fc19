// SPDX-License-Identifier: Apache-2.0
/// The integrators by name.
#pragma once

#include "integrate/integrator.h"

#include <memory>
#include <string>
#include <vector>

namespace zsi::host {

std::vector<std::string> const& integratorNames(); ///< the first is the default

/// A new integrator for one thread; `scene` must outlive it. Throws InputError for an unknown name.
std::unique_ptr<Integrator> makeIntegrator(std::string const& name, PreparedScene const& scene);

/// What the integrator does not show of materials that instances have: a line for each of them,
/// "materials.NAME: ...". Throws InputError for an unknown name.
std::vector<std::string> omissions(std::string const& name, PreparedScene const& scene);

} // namespace zsi::host
