// SPDX-License-Identifier: Apache-2.0
#include "mesh/meshFile.h"

#include "base/error.h"
#include "mesh/meshFileCheck.h"
#include "mesh/meshJoin.h"

#include <algorithm>
#include <assimp/DefaultIOSystem.h>
#include <assimp/Importer.hpp>
#include <assimp/config.h>
#include <assimp/material.h>
#include <assimp/postprocess.h>
#include <assimp/scene.h>
#include <cctype>
#include <fmt/format.h>
#include <set>

namespace zsi::host {

namespace {

std::string extensionOf(std::filesystem::path const& file)
{
    std::string extension = file.extension().string();
    for (char& c : extension)
        c = static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    return extension;
}

/// Whether every face has corners: the importer ends the program over one that has none.
bool facesHaveCorners(aiScene const& scene)
{
    for (unsigned i = 0; i < scene.mNumMeshes; ++i) {
        aiMesh const& mesh = *scene.mMeshes[i];
        if (!std::all_of(mesh.mFaces, mesh.mFaces + mesh.mNumFaces,
                         [](aiFace const& face) { return face.mNumIndices > 0; }))
            return false;
    }
    return true;
}

Vec3f toVec3f(aiVector3D const& v) { return {v.x, v.y, v.z}; }

std::vector<Vec3f> transformed(aiVector3D const* values, unsigned count, aiMatrix3x3 const& matrix)
{
    std::vector<Vec3f> result;
    for (unsigned i = 0; values && i < count; ++i)
        result.push_back(toVec3f(matrix * values[i]));
    return result;
}

std::vector<Vec2f> toUv(aiVector3D const* values, unsigned count)
{
    std::vector<Vec2f> result;
    for (unsigned i = 0; values && i < count; ++i)
        result.emplace_back(values[i].x, values[i].y);
    return result;
}

Mesh toMesh(aiMesh const& part, aiMatrix4x4 const& toWorld)
{
    aiMatrix3x3 const linear(toWorld);
    bool const mirrored = linear.Determinant() < 0.0f;
    aiMatrix3x3 normalMatrix(linear);
    normalMatrix.Inverse().Transpose(); // not finite for a flattened part, which has no area

    Mesh mesh;
    for (unsigned i = 0; i < part.mNumVertices; ++i)
        mesh.positions.push_back(toVec3f(toWorld * part.mVertices[i]));
    mesh.normals = transformed(part.mNormals, part.mNumVertices, normalMatrix);
    mesh.tangents = transformed(part.mTangents, part.mNumVertices, linear);
    mesh.bitangents = transformed(part.mBitangents, part.mNumVertices, linear);
    mesh.uv = toUv(part.mTextureCoords[0], part.mNumVertices);
    mesh.uv1 = toUv(part.mTextureCoords[1], part.mNumVertices);
    if (aiColor4D const* const colors = part.mColors[0])
        for (unsigned i = 0; i < part.mNumVertices; ++i)
            mesh.colors.emplace_back(colors[i].r, colors[i].g, colors[i].b, colors[i].a);
    for (unsigned i = 0; i < part.mNumFaces; ++i)
        if (aiFace const& face = part.mFaces[i]; face.mNumIndices == 3) {
            unsigned const* const corner = face.mIndices;
            // A mirror turns faces inside out.
            mesh.triangles.push_back(
                {corner[0], corner[mirrored ? 2 : 1], corner[mirrored ? 1 : 2]});
        }
    return mesh;
}

/// The meshes of all nodes at their places.
std::vector<Mesh> placedParts(aiScene const& scene)
{
    std::vector<Mesh> parts;
    std::vector<std::pair<aiNode const*, aiMatrix4x4>> open{{scene.mRootNode, {}}};
    while (!open.empty()) {
        auto const [node, parentToWorld] = open.back();
        open.pop_back();
        aiMatrix4x4 const toWorld = parentToWorld * node->mTransformation;
        for (unsigned i = 0; i < node->mNumMeshes; ++i)
            if (Mesh part = toMesh(*scene.mMeshes[node->mMeshes[i]], toWorld);
                !part.triangles.empty()) {
                aiMaterial const& material =
                    *scene.mMaterials[scene.mMeshes[node->mMeshes[i]]->mMaterialIndex];
                part.parts = {{node->mName.C_Str(), material.GetName().C_Str()}};
                parts.push_back(std::move(part));
            }
        for (unsigned i = node->mNumChildren; i-- > 0;) // the first child is taken next
            open.emplace_back(node->mChildren[i], toWorld);
    }
    return parts;
}

/// Tells which files the importer opens beside the first.
class ToldFiles final : public Assimp::DefaultIOSystem {
public:
    ToldFiles(std::string first, std::vector<std::string>* further)
        : first_(std::move(first))
        , further_(further)
    {
    }
    Assimp::IOStream* Open(char const* file, char const* mode) override
    {
        Assimp::IOStream* const stream = DefaultIOSystem::Open(file, mode);
        if (stream && further_ && first_ != file)
            further_->push_back(file);
        return stream;
    }

private:
    std::string first_;
    std::vector<std::string>* further_;
};

} // namespace

Mesh readMeshFile(std::filesystem::path const& file, std::vector<std::string>* furtherFiles)
{
    static std::set<std::string> const kKnown{".obj", ".ply", ".stl", ".gltf", ".glb"};
    std::error_code failed;
    if (!std::filesystem::is_regular_file(file, failed))
        throw InputError(file.string() + ": no such file");
    if (!kKnown.contains(extensionOf(file)))
        throw InputError(file.string()
                         + ": expected a mesh file (.obj, .ply, .stl, .gltf or .glb)");
    if (extensionOf(file) == ".ply")
        checkPly(file);
    if (extensionOf(file) == ".stl")
        checkStl(file);
    if (extensionOf(file) == ".obj")
        checkObj(file);
    Assimp::Importer importer;
    importer.SetIOHandler(new ToldFiles(file.string(), furtherFiles)); // is the importer's now
    importer.SetPropertyInteger(AI_CONFIG_PP_SBP_REMOVE,
                                aiPrimitiveType_POINT | aiPrimitiveType_LINE);
    aiScene const* scene = importer.ReadFile(file.string(), aiProcess_ValidateDataStructure);
    if (scene && !facesHaveCorners(*scene))
        throw InputError(file.string() + ": has a face without corners, or ends before its faces");
    if (scene)
        scene = importer.ApplyPostProcessing(aiProcess_Triangulate | aiProcess_SortByPType
                                             | aiProcess_JoinIdenticalVertices);
    if (!scene || !scene->mRootNode)
        throw InputError(fmt::format("{}: cannot be read as a mesh: {}", file.string(),
                                     importer.GetErrorString()));
    std::vector<Mesh> parts = placedParts(*scene);
    return joined(parts);
}

bool isYUp(std::filesystem::path const& file)
{
    return extensionOf(file) == ".gltf" || extensionOf(file) == ".glb";
}

void turnYUp(Mesh& mesh)
{
    for (auto* const array : {&mesh.positions, &mesh.normals, &mesh.tangents, &mesh.bitangents})
        for (Vec3f& v : *array)
            v = {v.x, -v.z, v.y};
}

} // namespace zsi::host
