// SPDX-License-Identifier: Apache-2.0
/// The shader libraries that tests of the host use.
#pragma once

#include "plugin/shaderLibrary.h"

namespace zsi::test {

/// The project's library, and the tests' own with a parameter of each type.
inline host::ShaderLibraries const& libraries()
{
    static host::ShaderLibraries const loaded = [] {
        host::ShaderLibraries l;
        l.load(ZSI_SHADER_LIBRARY);
        l.load(ZSI_FIXTURE_DIR "/tinyShaders/tinyShaders.so");
        return l;
    }();
    return loaded;
}

/// What a shader's field holds.
template <class Value>
Value value(host::Shader const& shader, char const* name)
{
    return *static_cast<Value const*>(shader.find(name)->field);
}

} // namespace zsi::test
