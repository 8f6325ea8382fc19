// SPDX-License-Identifier: Apache-2.0
// zsi schema: what a scene file may hold, for editors.
#include "cmd/classText.h"
#include "cmd/command.h"
#include "integrate/integrators.h"
#include "integrate/layers.h"

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

namespace zsi::cmd {
namespace {

/// All but what the loaded libraries offer. null takes out what an included file has; what an
/// included file may have is not required.
char const* const kFormat = R"json({
"$schema": "https://json-schema.org/draft/2020-12/schema",
"title": "zsi scene",
"type": "object",
"additionalProperties": false,
"properties": {
  "$schema": {"type": "string", "description": "this schema, for editors"},
  "include": {"type": "string", "description": "scene file that this one is put over"},
  "camera": {"type": ["object", "null"], "additionalProperties": false, "properties": {
    "position": {"$ref": "#/$defs/Vec3f", "description": "where it stands"},
    "target": {"$ref": "#/$defs/Vec3f", "description": "what is in the middle of the picture"},
    "up": {"$ref": "#/$defs/Vec3f", "description": "points upwards in the picture"},
    "fov": {"type": "number", "exclusiveMinimum": 0, "exclusiveMaximum": 180, "default": 40,
            "description": "vertical opening, degrees"},
    "lensRadius": {"type": "number", "minimum": 0, "default": 0, "description": "0 is a pinhole"},
    "focusDistance": {"type": "number", "minimum": 0, "default": 0,
                      "description": "0: the distance to the target"}}},
  "film": {"type": ["object", "null"], "additionalProperties": false, "properties": {
    "width": {"type": "integer", "minimum": 1, "maximum": 32768, "default": 640},
    "height": {"type": "integer", "minimum": 1, "maximum": 32768, "default": 360},
    "exposure": {"type": "number", "minimum": -64, "maximum": 64, "default": 0,
                 "description": "stops, for 8-bit files"},
    "view": {"type": "string", "description": "how colours become 8 bits (docs/scene-format.md)"},
    "alpha": {"type": "boolean", "description": "with the alpha of the shaders, or opaque"},
    "crop": {"type": "array", "items": {"type": "integer", "minimum": 0}, "minItems": 4, "maxItems": 4,
             "description": "x0, y0, x1, y1 in pixels from the upper left, the end exclusive"},
    "layers": {"type": "array", "items": {}, "description": "layers of an .exr beside the beauty"}}},
  "settings": {"type": ["object", "null"], "additionalProperties": false, "properties": {
    "samples": {"type": "integer", "minimum": 1, "maximum": 1048576, "default": 64,
                "description": "per pixel, at most"},
    "noise": {"type": "number", "minimum": 0, "default": 0,
              "description": "above 0: where it is lower, no more samples"},
    "maxDepth": {"type": "integer", "minimum": 0, "maximum": 1000, "default": 64,
                 "description": "rays one after another"},
    "occlusionSamples": {"type": "integer", "minimum": 1, "maximum": 4096, "default": 4},
    "indirectSamples": {"type": "integer", "minimum": 1, "maximum": 4096, "default": 1},
    "occlusionDistance": {"type": "number", "minimum": 0, "default": 0,
                          "description": "how far occlusion rays reach; 0: unlimited"},
    "ambient": {"$ref": "#/$defs/Vec3f", "description": "for materials that ask for ambient light"},
    "sampleClamp": {"type": "number", "minimum": 0, "default": 0,
                    "description": "brightest channel of a sample; 0: no limit"},
    "seed": {"type": "integer", "minimum": 0, "maximum": 4294967295, "default": 1},
    "integrator": {}}},
  "meshes": {"type": ["object", "null"], "additionalProperties": {"$ref": "#/$defs/mesh"}},
  "materials": {"type": ["object", "null"], "additionalProperties": {"$ref": "#/$defs/material"}},
  "instances": {"type": ["object", "null"], "additionalProperties": {"$ref": "#/$defs/instance"}},
  "lights": {"type": ["object", "null"], "additionalProperties": {"$ref": "#/$defs/light"}},
  "environment": {"$ref": "#/$defs/environment"}},
"$defs": {
  "bool": {"type": ["boolean", "null"]},
  "int": {"type": ["integer", "null"]},
  "float": {"type": ["number", "null"]},
  "Vec2f": {"type": ["array", "null"], "items": {"type": "number"}, "minItems": 2, "maxItems": 2},
  "Vec3f": {"type": ["array", "null"], "items": {"type": "number"}, "minItems": 3, "maxItems": 3},
  "Vec4f": {"type": ["array", "null"], "items": {"type": "number"}, "minItems": 4, "maxItems": 4},
  "colorSpace": {"enum": ["auto", "linear", "srgb"], "default": "auto"},
  "texture1D": {"$ref": "#/$defs/texture2D"},
  "texture2D": {"type": ["object", "null"], "additionalProperties": false, "required": ["texture"],
    "properties": {"texture": {"type": "string"}, "colorSpace": {"$ref": "#/$defs/colorSpace"},
      "image": {"type": "integer", "minimum": 0, "description": "a picture in the glTF or GLB file that texture names"},
      "channel": {"enum": ["r", "g", "b", "a"], "description": "this one in all"},
      "factor": {"anyOf": [{"type": "number"}, {"$ref": "#/$defs/numbers"}], "default": 1,
                 "description": "multiplies linear values"},
      "power": {"type": "number", "exclusiveMinimum": 0, "default": 1, "description": "2 squares"},
      "from": {"enum": ["values", "normals"], "default": "values", "description": "heights of a normal map"},
      "curve": {"$ref": "#/$defs/matrix", "description": "values or colours over 0 to 1 at even steps"},
      "weight": {"$ref": "#/$defs/texture2D", "description": "how much counts against ground"},
      "ground": {"type": "number", "default": 0},
      "threshold": {"type": "number", "minimum": 0, "description": "1 from here on, else 0"},
      "wrap": {"anyOf": [{"$ref": "#/$defs/wrap"},
                         {"type": "array", "items": {"$ref": "#/$defs/wrap"}, "minItems": 2, "maxItems": 2}],
               "default": "repeat"}}},
  "wrap": {"enum": ["repeat", "clamp", "mirror"]},
  "textureCube": {"type": ["object", "null"], "additionalProperties": false, "required": ["cube"],
    "properties": {"cube": {"type": "string", "description": "latitude-longitude picture"},
      "colorSpace": {"$ref": "#/$defs/colorSpace"},
      "blur": {"type": "number", "minimum": 0, "maximum": 90, "description": "degrees"},
      "irradiance": {"type": "boolean"}}},
  "numbers": {"type": "array", "items": {"type": "number"}},
  "matrix": {"type": "array", "items": {"anyOf": [{"type": "number"}, {"$ref": "#/$defs/numbers"}]}},
  "transform": {"type": "object", "additionalProperties": false, "properties": {
    "scale": {"anyOf": [{"type": "number"}, {"$ref": "#/$defs/numbers"}]},
    "rotate": {"anyOf": [{"type": "number"}, {"$ref": "#/$defs/matrix"}],
               "description": "x, y, z, degrees, or an array of such; of a picture, degrees"},
    "translate": {"$ref": "#/$defs/numbers"}}},
  "Mat3f": {"anyOf": [{"type": "null"}, {"$ref": "#/$defs/transform"}, {"$ref": "#/$defs/matrix"}]},
  "Mat4f": {"anyOf": [{"type": "null"}, {"$ref": "#/$defs/transform"}, {"$ref": "#/$defs/matrix"}]},
  "size": {"anyOf": [{"type": "number", "exclusiveMinimum": 0}, {"$ref": "#/$defs/numbers"}], "default": 1},
  "mesh": {"type": ["object", "null"], "additionalProperties": false, "properties": {
    "file": {"type": "string", "description": "OBJ, PLY, STL, glTF or GLB"},
    "mesh": {"type": "integer", "minimum": 0, "description": "one mesh of a glTF or GLB file"},
    "up": {"enum": ["y", "z"]},
    "normals": {"enum": ["file", "smooth", "flat"], "default": "file"},
    "sphere": {"type": "object", "additionalProperties": false, "properties": {
      "radius": {"type": "number", "exclusiveMinimum": 0, "default": 1},
      "segments": {"type": "integer", "minimum": 3, "maximum": 4096, "default": 64}}},
    "box": {"type": "object", "additionalProperties": false,
            "properties": {"size": {"$ref": "#/$defs/size"}}},
    "plane": {"type": "object", "additionalProperties": false,
              "properties": {"size": {"$ref": "#/$defs/size"}}},
    "sweep": {"type": "object", "additionalProperties": false,
              "properties": {"size": {"$ref": "#/$defs/size"},
                             "radius": {"type": "number", "exclusiveMinimum": 0}}}}},
  "instance": {"type": ["object", "null"], "additionalProperties": false, "properties": {
    "mesh": {"type": "string"},
    "material": {"type": ["string", "null"]},
    "materials": {"type": ["object", "null"], "additionalProperties": {"type": "string"},
                  "description": "materials of the scene by the names of a file's parts; * for others"},
    "transform": {"$ref": "#/$defs/Mat4f"}}},
  "light": {"type": ["object", "null"], "additionalProperties": false, "properties": {
    "kind": {"enum": ["point", "spot", "sun", "rectangle", "disc", "mesh"]},
    "class": {}, "parameters": {"type": "object"},
    "position": {"$ref": "#/$defs/Vec3f"},
    "target": {"$ref": "#/$defs/Vec3f"}, "axis": {"$ref": "#/$defs/Vec3f"}, "up": {"$ref": "#/$defs/Vec3f"},
    "direction": {"$ref": "#/$defs/Vec3f", "description": "towards the sun"},
    "angle": {"type": "number", "minimum": 0, "maximum": 360, "description": "across, degrees; a sun's is 0.53 by default, a spot's 45"},
    "innerAngle": {"type": "number", "minimum": 0, "maximum": 360, "description": "of a spot's full light, degrees"},
    "radius": {"type": "number", "minimum": 0}, "size": {"$ref": "#/$defs/size"},
    "color": {"$ref": "#/$defs/Vec3f"}, "emission": {"$ref": "#/$defs/Vec3f"},
    "mesh": {"type": "string"}, "transform": {"$ref": "#/$defs/Mat4f"}}},
  "environment": {"type": ["object", "null"], "additionalProperties": false, "properties": {
    "class": {}, "parameters": {"type": "object"},
    "visible": {"type": "boolean"},
    "file": {"type": "string", "description": "latitude-longitude picture"},
    "colorSpace": {"$ref": "#/$defs/colorSpace"},
    "rotate": {"type": "number", "description": "degrees around z"},
    "intensity": {"anyOf": [{"type": "number", "minimum": 0}, {"$ref": "#/$defs/Vec3f"}]},
    "diffuseBlur": {"type": "number", "minimum": 0, "maximum": 90},
    "background": {"$ref": "#/$defs/Vec3f"}}},
  "material": {"type": ["object", "null"], "additionalProperties": false, "properties": {
    "class": {}, "parameters": {"type": "object"}}}
}})json";

/// The parameters of a class, each of its type, with what the library says of it.
Json parametersOf(host::Shader const& shader)
{
    Json properties = Json::object();
    for (host::Parameter const& p : shader.parameters()) {
        Json property{{"$ref", std::string("#/$defs/") + host::typeName(p.type)}};
        if (!p.about.meaning.empty())
            property["description"] = p.about.meaning;
        if (Json value = defaultJson(p); !value.is_null())
            property["default"] = std::move(value);
        properties[p.name] = std::move(property);
    }
    return {{"type", "object"},
            {"additionalProperties", false},
            {"description", shader.summary()},
            {"properties", std::move(properties)}};
}

Json sceneSchema(host::ShaderLibraries const& libraries)
{
    Json schema = Json::parse(kFormat);
    Json& defs = schema["$defs"];
    schema["properties"]["settings"]["properties"]["integrator"]["enum"] = host::integratorNames();
    schema["properties"]["film"]["properties"]["layers"]["items"]["enum"] = host::layerNames();
    for (std::string const& name : libraries.classNames()) {
        host::Shader const shader = libraries.create(name);
        constexpr char const* kSections[] = {"material", "light", "environment"}; // by kind
        Json& section = defs[kSections[shader.kind()]];
        section["properties"]["class"]["enum"].push_back(name);
        section["allOf"].push_back(
            {{"if",
              {{"properties", {{"class", {{"const", name}}}}},
               {"required", Json::array({"class"})}}},
             {"then", {{"properties", {{"parameters", {{"$ref", "#/$defs/" + name}}}}}}}});
        defs[name] = parametersOf(shader);
    }
    return schema;
}

} // namespace

Subcommand addSchema(CLI::App& app, std::string const& shaderPath)
{
    CLI::App* const command = app.add_subcommand(
        "schema", "Write a JSON Schema of scene files with the classes of the shader libraries");
    return {command, [&shaderPath] {
                print(sceneSchema(loadLibraries(shaderPath)).dump(1) + '\n');
                return 0;
            }};
}

} // namespace zsi::cmd
