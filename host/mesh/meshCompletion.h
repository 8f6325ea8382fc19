// SPDX-License-Identifier: Apache-2.0
/// Fills in what a mesh lacks and takes out what rays cannot meet.
#pragma once

#include "scene/scene.h"

#include <string>
#include <vector>

namespace zsi::host {

enum class NormalSource {
    File, ///< as they are; smooth where missing
    Smooth, ///< computed anew: corners at one place share a normal
    Flat, ///< of the faces
};

/// Cleans and completes a mesh that has positions, triangles and whichever of the other arrays.
/// Triangles with corners that are not finite or do not exist, and those without area, go, with
/// the vertices that only they had. Normals are made unit; smooth ones are the mean of the faces
/// around a place weighted by their angle there (Thuermer and Wuethrich 1998, "Computing Vertex
/// Normals from Polygonal Facets"). uv come from `projectUv`; tangents and bitangents from uv, made
/// square to the normal, horizontal where uv give none.
/// Appends to `warnings` one line for each kind of repair. The mesh may be empty afterwards.
void completeMesh(Mesh& mesh, NormalSource source, std::vector<std::string>& warnings);

/// A mesh for each of `mesh.parts`, without triangles where none are left of it.
std::vector<Mesh> partsOf(Mesh const& mesh);

/// uv by box projection: each triangle along the axis of object space that its normal is nearest
/// to, one uv unit to an object unit; seen from outside, u to the right and v along +z, or along
/// +y for faces up or down. Vertices that lie between sides are split.
void projectUv(Mesh& mesh);

} // namespace zsi::host
