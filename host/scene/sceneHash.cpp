// SPDX-License-Identifier: Apache-2.0
#include "scene/sceneHash.h"

#include "texture/textureStore.h"

#include <OpenImageIO/hash.h>
#include <fstream>
#include <map>

namespace zsi::host {
namespace {

/// Collects what is hashed. Only values without padding are taken as they lie in memory.
class Digest {
public:
    explicit Digest(TextureStore const* textures)
        : textures_(textures)
    {
    }
    std::string result() { return sha_.digest(); }

    template <class T>
    void add(std::vector<T> const& values)
    {
        add(values.size());
        sha_.append(values.data(), values.size() * sizeof(T));
    }
    void add(std::string const& text)
    {
        add(text.size());
        sha_.append(text.data(), text.size());
    }
    template <class... T>
    void add(T const&... values)
    {
        (sha_.append(&values, sizeof(T)), ...);
    }

    void add(Shader const& shader)
    {
        add(shader.className());
        for (Parameter const& p : shader.parameters())
            addParameter(p);
    }
    void operator()(ShaderLight const& l)
    {
        add(l.shader);
        add(l.position, l.axis, l.radius);
    }
    void operator()(PointLight const& l)
    {
        add(l.position, l.color, l.radius);
        add(l.axis, l.innerAngle, l.angle);
    }
    void operator()(SunLight const& l) { add(l.direction, l.color, l.angle); }
    void operator()(SurfaceLight const& l) { add(l.instance, l.emission); }

private:
    template <class T>
    void addField(Parameter const& p)
    {
        add(*static_cast<T const*>(p.field));
    }
    void addParameter(Parameter const& p)
    {
        switch (p.type) {
        case ParameterType::Bool:
            return addField<bool>(p);
        case ParameterType::Int:
            return addField<int>(p);
        case ParameterType::Float:
            return addField<float>(p);
        case ParameterType::Vec2f:
            return addField<Vec2f>(p);
        case ParameterType::Vec3f:
            return addField<Vec3f>(p);
        case ParameterType::Vec4f:
            return addField<Vec4f>(p);
        case ParameterType::Mat3f:
            return addField<Mat3f>(p);
        case ParameterType::Mat4f:
            return addField<Mat4f>(p);
        case ParameterType::Texture1D:
            return addTexture(static_cast<TextureSampler1D const*>(p.field)->texture);
        case ParameterType::Texture2D:
            return addTexture(static_cast<TextureSampler2D const*>(p.field)->texture);
        case ParameterType::TextureCube:
            return addTexture(static_cast<TextureSamplerCube const*>(p.field)->texture);
        }
    }
    void addTexture(void const* texture)
    {
        TextureOrigin const origin =
            textures_ && texture ? textures_->origin(texture) : TextureOrigin();
        add(texture != nullptr);
        add(origin.treatment);
        if (origin.file.empty())
            return;
        auto const [found, isNew] = files_.try_emplace(origin.file.string());
        if (isNew)
            found->second = fileHash(origin.file);
        add(found->second);
    }
    static std::string fileHash(std::filesystem::path const& file)
    {
        std::ifstream in(file, std::ios::binary);
        OIIO::SHA1 sha;
        std::vector<char> part(1 << 20);
        while (in.read(part.data(), static_cast<std::streamsize>(part.size())), in.gcount() > 0)
            sha.append(part.data(), static_cast<std::size_t>(in.gcount()));
        return sha.digest();
    }

    TextureStore const* textures_;
    OIIO::SHA1 sha_;
    std::map<std::string, std::string> files_; ///< hashes
};

} // namespace

std::string sceneHash(Scene const& scene)
{
    Digest digest(scene.textures.get());
    Camera const& c = scene.camera;
    digest.add(c.position, c.target, c.up, c.verticalFov, c.lensRadius, c.focusDistance);
    digest.add(scene.film.width, scene.film.height);
    Settings const& s = scene.settings;
    digest.add(s.maxDepth, s.occlusionSamples, s.indirectSamples, s.occlusionDistance, s.ambient,
               s.sampleClamp, s.seed);
    digest.add(s.integrator);
    for (Mesh const& mesh : scene.meshes) {
        digest.add(mesh.positions);
        digest.add(mesh.normals);
        digest.add(mesh.uv);
        digest.add(mesh.uv1);
        digest.add(mesh.tangents);
        digest.add(mesh.bitangents);
        digest.add(mesh.colors);
        digest.add(mesh.triangles);
    }
    for (Shader const& material : scene.materials)
        digest.add(material);
    for (Instance const& i : scene.instances)
        digest.add(i.mesh, i.material, i.objectToWorld, i.light);
    for (Light const& light : scene.lights)
        std::visit(digest, light);
    digest.add(scene.environmentVisible);
    if (scene.environment)
        digest.add(*scene.environment);
    return digest.result();
}

} // namespace zsi::host
