// SPDX-License-Identifier: Apache-2.0
/// A shader from the loaded library with its parameters by name: all that a benchmark needs.
#pragma once

#include <cstdio>
#include <cstdlib>
#include <dlfcn.h>
#include <map>
#include <memory>
#include <string>
#include <vector>
#include <zsi/registration.h>
#include <zsi/zsi.h>

namespace bench {

class LoadedShader final : zsi::GenericManager<LoadedShader> {
public:
    LoadedShader(void* library, std::string const& className)
    {
        auto const create = reinterpret_cast<zsi::CreateShaderFunction>(
            dlsym(library, (className + "_create").c_str()));
        if (!create) {
            std::fprintf(stderr, "bench: the library has no %s\n", className.c_str());
            std::exit(1);
        }
        object_.reset(create());
        object_->registerShader(this);
    }

    /// T must be the registered type.
    template <class T>
    LoadedShader& set(std::string const& name, T const& value)
    {
        auto const field = fields_.find(name);
        if (field == fields_.end()) {
            std::fprintf(stderr, "bench: no parameter %s\n", name.c_str());
            std::exit(1);
        }
        *static_cast<T*>(field->second) = value;
        return *this;
    }
    template <class T>
    T& field(std::string const& name)
    {
        return *static_cast<T*>(fields_.at(name));
    }
    bool has(std::string const& name) const { return fields_.count(name) != 0; }
    long attributeOffset(std::string const& name) const
    {
        auto const a = attributes_.find(name);
        return a == attributes_.end() ? -1 : a->second;
    }
    int entryPoints() const { return mask_; }
    /// Unset matrices become the identity, so that no transform degenerates.
    void identities()
    {
        for (zsi::Mat3f* m : matrices3_)
            *m = zsi::Mat3f::identity();
        for (zsi::Mat4f* m : matrices4_)
            *m = zsi::Mat4f::identity();
    }

    zsi::MaterialShader const* material() const
    {
        return static_cast<zsi::MaterialShader*>(object_.get());
    }
    zsi::LightShader const* light() const { return static_cast<zsi::LightShader*>(object_.get()); }
    zsi::EnvironmentShader const* environment() const
    {
        return static_cast<zsi::EnvironmentShader*>(object_.get());
    }

private:
    friend zsi::GenericManager<LoadedShader>;
    void declareEntryPoints(zsi::IShaderBase*, int mask) override { mask_ = mask; }
    void registerAttribute(zsi::IShaderBase*, int, char const* name, long offset) override
    {
        attributes_[name] = offset;
    }
    template <class T>
    void parameter(zsi::IShaderBase*, char const* name, T* field)
    {
        fields_[name] = field;
        if constexpr (std::is_same_v<T, zsi::Mat3f>)
            matrices3_.push_back(field);
        if constexpr (std::is_same_v<T, zsi::Mat4f>)
            matrices4_.push_back(field);
    }

    std::unique_ptr<zsi::IShaderBase> object_;
    int mask_ = 0;
    std::map<std::string, void*> fields_;
    std::map<std::string, long> attributes_;
    std::vector<zsi::Mat3f*> matrices3_;
    std::vector<zsi::Mat4f*> matrices4_;
};

} // namespace bench
