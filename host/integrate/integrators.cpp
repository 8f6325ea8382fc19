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
    /// What it does not show of a material; null where it shows all.
    char const* (*omits)(PreparedMaterial const&);
};

template <class T>
std::unique_ptr<Integrator> make(PreparedScene const& scene)
{
    return std::make_unique<T>(scene);
}

char const* nothing(PreparedMaterial const&) { return nullptr; }

char const* omittedByPaths(PreparedMaterial const& material)
{
    return material.continuesPaths && material.occludesLights
        ? "paths do not darken the light of lamps by occlusion"
        : nullptr;
}

// A new integrator is a file of its own and a line here.
constexpr Entry kIntegrators[] = {
    {"shade", make<ShadeIntegrator>, nothing},
    {"path", make<PathIntegrator>, omittedByPaths},
};

Entry const& entryOf(std::string const& name)
{
    for (Entry const& entry : kIntegrators)
        if (name == entry.name)
            return entry;
    throw InputError(printable(name) + ": unknown integrator"
                     + suggestion(name, integratorNames()));
}

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
    return entryOf(name).make(scene);
}

std::vector<std::string> omissions(std::string const& name, PreparedScene const& scene)
{
    Entry const& entry = entryOf(name);
    std::vector<bool> used(scene.materials().size());
    for (Instance const& instance : scene.scene().instances)
        if (instance.light < 0)
            used[static_cast<std::size_t>(instance.material)] = true;
    std::vector<std::string> lines;
    for (std::size_t i = 0; i < used.size(); ++i)
        if (char const* const omitted = used[i] ? entry.omits(scene.materials()[i]) : nullptr) {
            auto const& names = scene.scene().materialNames;
            lines.push_back("materials." + (i < names.size() ? names[i] : std::to_string(i)) + ": "
                            + omitted);
        }
    return lines;
}

} // namespace zsi::host
