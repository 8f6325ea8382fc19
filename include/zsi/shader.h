// SPDX-License-Identifier: Apache-2.0
/// Shader classes as the host sees them, and the two functions that a library exports per class.
#pragma once

#include <zsi/shadeState.h>
#include <zsi/shaderApi.h>
#include <zsi/shaderManager.h>

namespace zsi {

/// The interface version of this header; every `<Class>_getAPIVersion` returns it.
inline constexpr int kApiVersion = 2722;

/// `IShaderBase::getType()`.
enum ShaderKind : int {
    kMaterial = 0,
    kLight = 1,
    kEnvironment = 2,
};

/// A shader object: its vtable link and its parameter block, nothing else.
///
/// The host calls `registerShader` once, writes parameters through the registered addresses (or
/// `copy`), then calls entry points from any number of threads, each call with its own record,
/// and at last deletes the object through this destructor.
class IShaderBase {
public:
    virtual ~IShaderBase() = default;
    /// Declares entry points, parameters and attributes, in order.
    virtual void registerShader(IShaderManager* manager) = 0;
    /// Copies every parameter from `other`, which must be of the same class.
    virtual void copy(IShaderBase const* other) = 0;
    virtual int getVersion() const = 0;
    virtual int getType() const = 0; ///< a `ShaderKind`

protected:
    IShaderBase() = default;
    IShaderBase(IShaderBase const&) = default;
    IShaderBase& operator=(IShaderBase const&) = default;
};

/// A surface. Optional entry points do nothing here; a class declares those it overrides.
class MaterialShader : public IShaderBase {
public:
    int getVersion() const override { return 1; }
    int getType() const override { return kMaterial; }
    /// Colour of the hit towards the viewer into `Ci`, or `discardHit`.
    virtual void shade(IShaderAPI* api, ShadeState& state) const = 0;
    /// What a shadow ray keeps, into `transmissionColor`.
    virtual void transmission(IShaderAPI*, ShadeState&) const { }
    /// Scattering value for `sampleDirection`, into `outBrdf` and `sampleCosine`.
    virtual void transfer(IShaderAPI*, ShadeState&) const { }
    /// A direction to go on with, into the sampling results.
    virtual void sample(IShaderAPI*, ShadeState&) const { }
    virtual void specularity(IShaderAPI*, ShadeState&) const { }
};

/// A light.
class LightShader : public IShaderBase {
public:
    int getVersion() const override { return 1; }
    int getType() const override { return kLight; }
    /// Light at `P` into `lightColor` and `lightShadow`; writes nothing where it gives none.
    virtual void illumination(IShaderAPI* api, ShadeState& state) const = 0;
};

/// What rays see that leave the scene.
class EnvironmentShader : public IShaderBase {
public:
    int getVersion() const override { return 1; }
    int getType() const override { return kEnvironment; }
    /// Colour along `I` into `Ci`.
    virtual void shade(IShaderAPI* api, ShadeState& state) const = 0;
};

/// `<Class>_create`: a new shader with its defaults, or null when memory runs out.
using CreateShaderFunction = IShaderBase* (*)();
/// `<Class>_getAPIVersion`: `kApiVersion` of the header that the class was built against.
using GetApiVersionFunction = int (*)();

} // namespace zsi
