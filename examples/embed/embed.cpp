// SPDX-License-Identifier: Apache-2.0
// The host library in a program of one's own; docs/host.md explains it.
//   embed SHADER_FOLDER PICTURE
#include "base/error.h"
#include "film/imageFile.h"
#include "plugin/shaderLibrary.h"
#include "render/render.h"

#include <cstdio>

namespace {

using namespace zsi;

host::Mesh square(float half)
{
    host::Mesh mesh;
    mesh.positions = {{-half, -half, 0}, {half, -half, 0}, {half, half, 0}, {-half, half, 0}};
    mesh.normals.assign(4, {0, 0, 1});
    mesh.uv = {{0, 0}, {1, 0}, {1, 1}, {0, 1}};
    mesh.tangents.assign(4, {1, 0, 0});
    mesh.bitangents.assign(4, {0, 1, 0});
    mesh.triangles = {{0, 1, 2}, {0, 2, 3}};
    return mesh;
}

host::Scene makeScene(host::ShaderLibraries const& libraries)
{
    host::Scene scene;
    scene.film.width = 160;
    scene.film.height = 120;
    scene.settings.samples = 16;
    scene.camera.position = {0, -4, 3};

    host::Shader plaster = libraries.create("corvid_Mtl_Ward");
    plaster.set("u_diffuseColor", Vec3f(0.7f, 0.6f, 0.5f));
    plaster.set("u_brdf00Reflectivity", 0.0f);
    plaster.set("u_brdf90Reflectivity", 0.0f);
    scene.materials.push_back(std::move(plaster));
    scene.meshes.push_back(square(1));

    Mat4f lifted = Mat4f::identity();
    lifted.m[14] = 0.3f; // z: points are row vectors
    Mat4f small = lifted;
    small.m[0] = small.m[5] = 0.4f;
    scene.instances = {{0, 0, Mat4f::identity()}, {0, 0, small}};

    host::ShaderLight lamp{libraries.create("voPointLight"), {1, -1, 4}};
    lamp.radius = 0.1f;
    lamp.shader.set("color", Vec3f(1, 1, 1));
    lamp.shader.set("attenuationFactors", Vec3f(20, 2, 0));
    scene.lights.push_back(std::move(lamp));
    return scene;
}

} // namespace

int main(int argc, char** argv)
try {
    if (argc != 3) {
        std::fputs("usage: embed SHADER_FOLDER PICTURE\n", stderr);
        return 2;
    }
    host::ShaderLibraries libraries;
    for (std::string const& leftOut : libraries.loadDirectory(argv[1]))
        std::fprintf(stderr, "%s\n", leftOut.c_str());

    host::Scene const scene = makeScene(libraries);
    host::RenderOptions options;
    options.progress = [](zsi::host::RenderStatus const& status) {
        std::printf("\r%3.0f%%", status.done * 100);
    };
    host::RenderReport report;
    host::Picture const picture = host::render(scene, options, &report);
    host::writePicture(argv[2], picture, host::screenView(scene.film));
    std::printf("\n%d x %d, %.2f s\n", picture.width(), picture.height(), report.seconds);
    return 0;
} catch (zsi::host::InputError const& error) {
    std::fprintf(stderr, "embed: %s\n", error.what());
    return 1;
}
