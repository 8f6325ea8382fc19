// SPDX-License-Identifier: Apache-2.0
/// The host's registration interface: what a shader tells about itself in `registerShader`.
#pragma once

#include <zsi/texture.h>
#include <zsi/types.h>

namespace zsi {

class IShaderBase;

/// Bits of the mask that `declareEntryPoints` receives.
enum EntryPoint : int {
    kShade = 1,
    kTransmission = 2,
    kTransfer = 4,
    kSample = 8,
    kIllumination = 32,
    kEnvironmentShade = 64,
};

/// Kinds of vertex attribute; the value tells the delivered type.
enum AttributeKind : int {
    kAttributeVec2f = 1,
    kAttributeVec3f = 2,
    kAttributeVec4f = 3,
};

/// A shader calls `declareEntryPoints` once and first, then one operation per parameter in the
/// order of its fields, with `registerAttribute` where the shader declares its attributes.
/// Field addresses stay valid for the life of the shader. Names are literals.
///
/// The order of declaration is the layout; additions go to the end.
class IShaderManager {
public:
    virtual void declareEntryPoints(IShaderBase* shader, int mask) = 0;
    virtual void registerBool(IShaderBase* shader, char const* name, bool* field) = 0;
    virtual void registerInt(IShaderBase* shader, char const* name, int* field) = 0;
    virtual void registerFloat(IShaderBase* shader, char const* name, float* field) = 0;
    virtual void registerVec2f(IShaderBase* shader, char const* name, Vec2f* field) = 0;
    virtual void registerVec3f(IShaderBase* shader, char const* name, Vec3f* field) = 0;
    virtual void registerVec4f(IShaderBase* shader, char const* name, Vec4f* field) = 0;
    virtual void registerMat3f(IShaderBase* shader, char const* name, Mat3f* field) = 0;
    virtual void registerMat4f(IShaderBase* shader, char const* name, Mat4f* field) = 0;
    virtual void registerTexture1D(IShaderBase* shader, char const* name,
                                   TextureSampler1D* field) = 0;
    virtual void registerTexture2D(IShaderBase* shader, char const* name,
                                   TextureSampler2D* field) = 0;
    virtual void registerTextureCube(IShaderBase* shader, char const* name,
                                     TextureSamplerCube* field) = 0;
    /// The host delivers the attribute at this byte offset of `ShadeState::attributes`.
    virtual void registerAttribute(IShaderBase* shader, int kind, char const* name,
                                   long offset) = 0;

protected:
    ~IShaderManager() = default; // owned by the host, never deleted through this class
};

} // namespace zsi
