// SPDX-License-Identifier: Apache-2.0
/// Reads meshes from files.
#pragma once

#include "scene/scene.h"

#include <filesystem>

namespace zsi::host {

/// Reads an OBJ, PLY, STL, glTF or GLB file as one mesh: polygons as triangles, the nodes of the
/// file at their places, points and lines left out. Arrays that the file has for some parts only
/// are filled for the others; what it does not have at all stays empty. v runs upwards.
/// `parts` are the nodes, each as often as it has materials, in the file's order.
/// Throws InputError that names the file when it is missing, of another kind, or broken.
/// `furtherFiles`: gets the names of others that it led to.
Mesh readMeshFile(std::filesystem::path const& file,
                  std::vector<std::string>* furtherFiles = nullptr);

/// Files of this name have y up by their format's rules.
bool isYUp(std::filesystem::path const& file);

/// Turns a mesh that has y up, so that it has z up and faces -y where it faced +z.
void turnYUp(Mesh& mesh);

} // namespace zsi::host
