// SPDX-License-Identifier: Apache-2.0
/// The shared object as a host sees it: its dynamic symbols, and shaders made through them.
#pragma once

#include <cstdint>
#include <dlfcn.h>
#include <fstream>
#include <memory>
#include <set>
#include <stdexcept>
#include <string>
#include <vector>
#include <zsi/registration.h>
#include <zsi/zsi.h>

namespace zsi::test {

/// The loaded library; stays loaded for the life of the process.
class Library {
public:
    static Library const& instance()
    {
        static Library const library;
        return library;
    }

    std::set<std::string> classes; ///< as the catalogue lists them

    std::unique_ptr<IShaderBase> create(std::string const& name) const
    {
        return std::unique_ptr<IShaderBase>(function<CreateShaderFunction>(name + "_create")());
    }
    int apiVersion(std::string const& name) const
    {
        return function<GetApiVersionFunction>(name + "_getAPIVersion")();
    }
    template <class F>
    F function(std::string const& name) const
    {
        void* const f = dlsym(handle_, name.c_str());
        if (!f)
            throw std::runtime_error("the library has no " + name);
        return reinterpret_cast<F>(f);
    }

private:
    void* handle_ = dlopen(ZSI_SHADER_LIBRARY, RTLD_NOW | RTLD_LOCAL);

    Library()
    {
        if (!handle_)
            throw std::runtime_error(dlerror());
        std::ifstream catalogue(ZSI_SOURCE_DIR "/tests/data/catalogue.txt");
        for (std::string line; std::getline(catalogue, line);)
            if (line.starts_with("class "))
                classes.insert(line.substr(6, line.find(' ', 6) - 6));
    }
};

/// One call of `registerShader`, in order.
struct Registered {
    std::string type; ///< of a parameter, or "attribute"
    std::string name;
    unsigned char* field; ///< null for an attribute
    std::size_t size;
    std::size_t alignment;
    int kind;
    long offset;
};

/// A manager that writes down what a shader registers.
class RecordingManager final : public GenericManager<RecordingManager> {
public:
    std::vector<int> masks;
    std::vector<Registered> rows;
    bool maskFirst = false; ///< `declareEntryPoints` came before every other call
    bool sameShader = true; ///< every call named the same shader

    explicit RecordingManager(IShaderBase& shader)
        : shader_(&shader)
    {
        shader.registerShader(this);
    }

    void declareEntryPoints(IShaderBase* s, int mask) override
    {
        sameShader = sameShader && s == shader_;
        maskFirst = masks.empty() && rows.empty();
        masks.push_back(mask);
    }
    void registerAttribute(IShaderBase* s, int kind, char const* name, long offset) override
    {
        sameShader = sameShader && s == shader_;
        rows.push_back({"attribute", name, nullptr, 0, 0, kind, offset});
    }
    template <class T>
    void parameter(IShaderBase* s, char const* name, T* field)
    {
        sameShader = sameShader && s == shader_;
        rows.push_back({kParameterTypeNames[parameterTypeIndex<T>()], name,
                        reinterpret_cast<unsigned char*>(field), sizeof(T), alignof(T), 0, 0});
    }

private:
    IShaderBase* shader_;
};

/// An entry point: its bit in the mask, the kind of class that has it, and how to call it.
struct EntryPointCall {
    char const* name;
    int bit; ///< 16 would be `specularity`, which no class declares
    int kind;
    void (*call)(IShaderBase const&, IShaderAPI*, ShadeState&);
};
template <class Shader, void (Shader::*entryPoint)(IShaderAPI*, ShadeState&) const>
void callOn(IShaderBase const& shader, IShaderAPI* api, ShadeState& state)
{
    (static_cast<Shader const&>(shader).*entryPoint)(api, state);
}
inline constexpr EntryPointCall kEntryPoints[] = {
    {"shade", 1, 0, callOn<MaterialShader, &MaterialShader::shade>},
    {"transmission", 2, 0, callOn<MaterialShader, &MaterialShader::transmission>},
    {"transfer", 4, 0, callOn<MaterialShader, &MaterialShader::transfer>},
    {"sample", 8, 0, callOn<MaterialShader, &MaterialShader::sample>},
    {"specularity", 16, 0, callOn<MaterialShader, &MaterialShader::specularity>},
    {"illumination", 32, 1, callOn<LightShader, &LightShader::illumination>},
    {"environment shade", 64, 2, callOn<EnvironmentShader, &EnvironmentShader::shade>},
};

} // namespace zsi::test
