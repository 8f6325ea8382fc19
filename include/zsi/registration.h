// SPDX-License-Identifier: Apache-2.0
/// Optional help for a host author: whatever type a parameter has, one function hears of it.
/// Standard library only.
#pragma once

#include <array>
#include <cstddef>
#include <tuple>
#include <type_traits>
#include <zsi/shaderManager.h>

namespace zsi {

/// Every type that a parameter can have, in the order of the manager's operations.
using ParameterTypes = std::tuple<bool, int, float, Vec2f, Vec3f, Vec4f, Mat3f, Mat4f,
                                  TextureSampler1D, TextureSampler2D, TextureSamplerCube>;

/// What people read for them.
inline constexpr std::array<char const*, std::tuple_size_v<ParameterTypes>> kParameterTypeNames{
    "bool",  "int",   "float",     "Vec2f",     "Vec3f",      "Vec4f",
    "Mat3f", "Mat4f", "texture1D", "texture2D", "textureCube"};

/// Place of T in both.
template <class T, std::size_t I = 0>
constexpr std::size_t parameterTypeIndex()
{
    if constexpr (std::is_same_v<T, std::tuple_element_t<I, ParameterTypes>>)
        return I;
    else
        return parameterTypeIndex<T, I + 1>();
}

/// A manager that hands every parameter to a function of the class that derives from it:
///   class Recorder final : public GenericManager<Recorder> {
///   public:
///       template <class T>
///       void parameter(IShaderBase* shader, char const* name, T* field);
///       // and overrides of declareEntryPoints and registerAttribute
///   };
template <class Derived>
class GenericManager : public IShaderManager {
public:
    void registerBool(IShaderBase* s, char const* name, bool* f) override { hear(s, name, f); }
    void registerInt(IShaderBase* s, char const* name, int* f) override { hear(s, name, f); }
    void registerFloat(IShaderBase* s, char const* name, float* f) override { hear(s, name, f); }
    void registerVec2f(IShaderBase* s, char const* name, Vec2f* f) override { hear(s, name, f); }
    void registerVec3f(IShaderBase* s, char const* name, Vec3f* f) override { hear(s, name, f); }
    void registerVec4f(IShaderBase* s, char const* name, Vec4f* f) override { hear(s, name, f); }
    void registerMat3f(IShaderBase* s, char const* name, Mat3f* f) override { hear(s, name, f); }
    void registerMat4f(IShaderBase* s, char const* name, Mat4f* f) override { hear(s, name, f); }
    void registerTexture1D(IShaderBase* s, char const* name, TextureSampler1D* f) override
    {
        hear(s, name, f);
    }
    void registerTexture2D(IShaderBase* s, char const* name, TextureSampler2D* f) override
    {
        hear(s, name, f);
    }
    void registerTextureCube(IShaderBase* s, char const* name, TextureSamplerCube* f) override
    {
        hear(s, name, f);
    }

protected:
    ~GenericManager() = default;

private:
    template <class T>
    void hear(IShaderBase* shader, char const* name, T* field)
    {
        static_cast<Derived&>(*this).parameter(shader, name, field);
    }
};

} // namespace zsi
