// SPDX-License-Identifier: Apache-2.0
#include "integrate/integrators.h"

#include "base/error.h"
#include "base/names.h"
#include "integrate/pathIntegrator.h"
#include "integrate/shadeIntegrator.h"

namespace zsi::host {
namespace {

struct Entry {
    char const* name;
    std::unique_ptr<Integrator> (*make)(PreparedScene const&);
};

template <class T>
std::unique_ptr<Integrator> make(PreparedScene const& scene)
{
    return std::make_unique<T>(scene);
}

// A new integrator is a file of its own and a line here.
constexpr Entry kIntegrators[] = {
    {"shade", make<ShadeIntegrator>},
    {"path", make<PathIntegrator>},
};

} // namespace

std::vector<std::string> const& integratorNames()
{
    static std::vector<std::string> const names = [] {
        std::vector<std::string> result;
        for (Entry const& entry : kIntegrators)
            result.emplace_back(entry.name);
        return result;
    }();
    return names;
}

std::unique_ptr<Integrator> makeIntegrator(std::string const& name, PreparedScene const& scene)
{
    for (Entry const& entry : kIntegrators)
        if (name == entry.name)
            return entry.make(scene);
    throw InputError(printable(name) + ": unknown integrator"
                     + suggestion(name, integratorNames()));
}

} // namespace zsi::host
