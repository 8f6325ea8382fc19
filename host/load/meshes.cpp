// SPDX-License-Identifier: Apache-2.0
#include "load/meshes.h"

#include "base/error.h"
#include "load/placing.h"
#include "mesh/meshCompletion.h"
#include "mesh/meshFile.h"
#include "mesh/meshShapes.h"
#include "model/gltfMesh.h"

#include <fmt/format.h>

namespace zsi::host {
namespace {

constexpr int kMostSegments = 4096;

/// A mesh of those in a glTF file.
Mesh readOneMesh(JsonReader const& index, std::filesystem::path const& file, Scene& scene)
{
    if (!isYUp(file))
        index.fail("only glTF and GLB files have meshes by number");
    std::shared_ptr<GltfFile const> const model = GltfFile::open(file);
    for (std::filesystem::path const& further : model->bufferFiles())
        scene.furtherFiles.push_back(further.string());
    return readGltfMesh(*model, model->indexOf("meshes", index));
}

Mesh readMeshFromFile(JsonReader const& reader, Scene& scene)
{
    reader.expectKeys({"file", "mesh", "up", "normals"});
    JsonReader const name = reader.at("file");
    std::filesystem::path const file = name.toFile();
    auto const one = reader.find("mesh");
    Mesh mesh;
    try {
        mesh = one ? readOneMesh(*one, file, scene) : readMeshFile(file, &scene.furtherFiles);
    } catch (InputError const& error) {
        name.fail(error.what());
    }
    auto const up = reader.find("up");
    if (up ? up->toChoice({"y", "z"}) == 0 : isYUp(file))
        turnYUp(mesh);
    NormalSource source = NormalSource::File;
    if (auto const normals = reader.find("normals")) {
        constexpr NormalSource kSources[] = {NormalSource::File, NormalSource::Smooth,
                                             NormalSource::Flat};
        source = kSources[normals->toChoice({"file", "smooth", "flat"})];
    }
    std::vector<std::string> repairs;
    completeMesh(mesh, source, repairs);
    for (std::string const& repair : repairs)
        scene.warnings.push_back(fmt::format("{}: {}: {}", name.place(), file.string(), repair));
    if (mesh.triangles.empty())
        name.fail(file.string() + ": has no triangles that can be seen");
    return mesh;
}

} // namespace

Mesh readMesh(JsonReader const& reader, Scene& scene)
{
    std::vector<std::string> const kinds{"file", "sphere", "box", "plane", "sweep"};
    if (!reader.isObject())
        reader.failExpected("an object");
    if (reader.find("file") && !reader.find("sphere") && !reader.find("box")
        && !reader.find("plane") && !reader.find("sweep"))
        return readMeshFromFile(reader, scene);
    reader.expectKeys({"sphere", "box", "plane", "sweep", "file"});
    JsonReader const shape = reader.onlyOf(kinds);
    if (reader.find("sphere")) {
        shape.expectKeys({"radius", "segments"});
        auto const radius = shape.find("radius"), segments = shape.find("segments");
        return sphereMesh(radius ? radius->toPositive() : 1.0f,
                          segments ? segments->toInt(3, kMostSegments) : 64);
    }
    if (reader.find("sweep")) {
        shape.expectKeys({"size", "radius"});
        std::vector<float> const s = readSize(shape, 3);
        float const most = minOf(s[1], s[2]);
        auto const radius = shape.find("radius");
        float const r = radius ? radius->toPositive() : 0.5f * most;
        if (r > most)
            radius->failExpected("no more than the depth and the height");
        return sweepMesh({s[0], s[1], s[2]}, r);
    }
    shape.expectKeys({"size"});
    if (reader.find("box")) {
        std::vector<float> const s = readSize(shape, 3);
        return boxMesh({s[0], s[1], s[2]});
    }
    std::vector<float> const s = readSize(shape, 2);
    return planeMesh({s[0], s[1]});
}

} // namespace zsi::host
