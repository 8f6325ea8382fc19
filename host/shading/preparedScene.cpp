// SPDX-License-Identifier: Apache-2.0
#include "shading/preparedScene.h"

#include "sampling/directions.h"
#include "shading/lobeProbe.h"
#include "shading/shadingContext.h"
#include "texture/textureProbe.h"

#include <array>
#include <cmath>
#include <cstring>
#include <string_view>

namespace zsi::host {
namespace {

struct KnownAttribute {
    std::string_view name;
    int kind;
    PreparedMaterial::Source source;
};

constexpr KnownAttribute kKnownAttributes[] = {
    {"uv", kAttributeVec2f, PreparedMaterial::Source::Uv},
    {"uv1", kAttributeVec2f, PreparedMaterial::Source::Uv1},
    {"tangent", kAttributeVec3f, PreparedMaterial::Source::Tangent},
    {"bitangent", kAttributeVec3f, PreparedMaterial::Source::Bitangent},
    {"vtxcolor", kAttributeVec4f, PreparedMaterial::Source::Color},
};

std::size_t sizeOf(int kind)
{
    return kind == kAttributeVec2f ? sizeof(Vec2f)
        : kind == kAttributeVec3f  ? sizeof(Vec3f)
                                   : sizeof(Vec4f);
}

PreparedMaterial prepare(Shader const& shader)
{
    PreparedMaterial material{};
    material.shader = shader.material();
    material.entryPoints = shader.entryPoints();
    // The contract has no other place where a material tells the index of its medium.
    for (char const* name : {"u_ior", "refractiveIndex"})
        if (Parameter const* p = shader.find(name); p && p->type == ParameterType::Float)
            material.ior = static_cast<float const*>(p->field);
    for (Attribute const& attribute : shader.attributes())
        for (KnownAttribute const& known : kKnownAttributes) {
            auto const offset = static_cast<std::size_t>(attribute.offset);
            bool const fits = attribute.offset >= 0
                && offset + sizeOf(attribute.kind) <= sizeof(ShadeState::attributes);
            if (fits && attribute.name == known.name && attribute.kind == known.kind)
                material.attributes.push_back({known.source, offset});
        }
    return material;
}

} // namespace

namespace {

/// Asks shaders of a scene while nothing is rendered.
class Inquiry final : public RadianceSource {
public:
    explicit Inquiry(PreparedScene const& scene)
        : context(scene, *this)
    {
        context.start(sampler, 0, 0);
    }
    Vec4f radiance(PathRay) override { return {0, 0, 0, 0}; }

    Sampler sampler{0, 0, 0};
    ShadingContext context;
};

} // namespace

PreparedScene::PreparedScene(Scene const& scene, BuildProgress const& progress)
    : scene_(scene)
    , rays_(scene, progress)
    , lights_(scene)
{
    for (Shader const& shader : scene_.materials)
        materials_.push_back(prepare(shader));
    environmentChanged();
}

void PreparedScene::examineMaterials()
{
    constexpr std::uint32_t kCalls = 64;
    Inquiry inquiry(*this);
    skiesAgree_ = true;
    for (std::uint32_t i = 0; i < kCalls && environment() && skiesAgree_; ++i) {
        inquiry.sampler.start(i);
        Vec2f const u = inquiry.sampler.next2D();
        Vec3f const d = around({0, 0, 1}, 2.0f * u.x - 1.0f, u.y);
        skiesAgree_ = inquiry.context.sky(kRayReflection, d) == inquiry.context.sky(kRayDiffuse, d);
    }
    for (PreparedMaterial& material : materials_) {
        if (!material.scatters())
            continue;
        ShadingContext::Findings findings;
        {
            TextureProbe const noPictures;
            for (std::uint32_t i = 0; i < kCalls; ++i) {
                inquiry.sampler.start(i);
                inquiry.context.examine(material, findings);
            }
        }
        using Asked = ShadingContext::Asked;
        material.mixes = findings.mixes;
        unsigned const asked = findings.front.asked | findings.back.asked;
        bool const emits = findings.front.emits || findings.back.emits;
        material.continuesPaths = findings.mixes && !(emits && !(asked & Asked::kIndirect));
        material.transmits = findings.transmits;
        material.occludesLights = asked & Asked::kOcclusion;
        bool const hasAmbient = !(scene_.settings.ambient == Vec3f(0, 0, 0));
        auto const showsMore = [&](ShadingContext::Findings::Side const& side) {
            return side.emits || ((side.asked & Asked::kAmbient) && hasAmbient)
                || (!findings.transmits && (side.asked & (Asked::kStraight | Asked::kBeyond)));
        };
        material.showsMoreInFront = showsMore(findings.front);
        material.showsMoreBehind = showsMore(findings.back);

        material.ofGathered = material.ofOthers = {};
        material.perAlbedo = 1.0f;
        if (!material.mixes)
            continue;
        std::uint32_t draw = 0;
        auto const record = [&](std::uint32_t rayType) {
            inquiry.sampler.start(draw++);
            return inquiry.context.trialRecord(material, rayType);
        };
        material.perAlbedo = 1.0f / meanWeight(material, inquiry.context, record);
        if (!environment())
            continue;
        material.ofOthers = probeLobes(material, kRayReflection, inquiry.context, record);
        material.ofGathered = probeLobes(material, kRayDiffuse, inquiry.context, record);
    }
}

bool PreparedScene::listsSky(PreparedMaterial const& material, std::uint32_t rayType) const
{
    SharedLobes const& lobes = rayType == kRayDiffuse ? material.ofGathered : material.ofOthers;
    return lobes.same && (!lobes.gathers || skiesAgree_) && !sky(kRayReflection).isEmpty();
}

void PreparedScene::environmentChanged() { skies_ = std::make_unique<Sky[]>(2); }

DirectionMap const& PreparedScene::sky(std::uint32_t rayType) const
{
    std::uint32_t const seenBy = rayType == kRayDiffuse ? kRayDiffuse : kRayReflection;
    Sky& sky = skies_[seenBy == kRayDiffuse];
    std::call_once(sky.made, [&] {
        if (!environment())
            return;
        Inquiry inquiry(*this);
        sky.map =
            DirectionMap([&](Vec3f d) { return maxComponent(inquiry.context.sky(seenBy, d)); });
    });
    return sky.map;
}

void PreparedScene::materialChanged(std::size_t index)
{
    bool const wasClear = (materials_[index].entryPoints & kTransmission) != 0;
    materials_[index] = prepare(scene_.materials[index]);
    if (((materials_[index].entryPoints & kTransmission) != 0) != wasClear)
        rays_.rebuildInstances({});
}

void PreparedScene::instancesChanged(BuildProgress const& progress)
{
    rays_.rebuildInstances(progress);
    lightsChanged();
}

void PreparedScene::meshesChanged(BuildProgress const& progress)
{
    rays_ = RayScene(scene_, progress);
    lightsChanged();
}

struct PreparedScene::Triangle {
    Mesh const& mesh;
    std::array<std::uint32_t, 3> const& corner;
    std::array<Vec3f, 3> edge; ///< world space, from each corner to the next
};

PreparedScene::Triangle PreparedScene::triangleOf(SurfacePoint const& s) const
{
    Instance const& instance = scene_.instances[s.instance];
    Mesh const& mesh = scene_.meshes[static_cast<std::size_t>(instance.mesh)];
    Triangle t{mesh, mesh.triangles[s.triangle], {}};
    for (std::size_t i = 0; i < 3; ++i)
        t.edge[i] =
            transformDirection(instance.objectToWorld,
                               mesh.positions[t.corner[(i + 1) % 3]] - mesh.positions[t.corner[i]]);
    return t;
}

float PreparedScene::uvDensity(SurfacePoint const& s) const
{
    Triangle const t = triangleOf(s);
    float const area = length(cross(t.edge[0], t.edge[1]));
    auto const density = [&](std::vector<Vec2f> const& uv) {
        Vec2f const a = uv[t.corner[1]] - uv[t.corner[0]], b = uv[t.corner[2]] - uv[t.corner[0]];
        return std::sqrt(std::fabs(a.x * b.y - a.y * b.x) / area);
    };
    float slowest = t.mesh.uv.empty() ? 0.0f : density(t.mesh.uv);
    if (!t.mesh.uv1.empty())
        slowest = minOf(slowest, density(t.mesh.uv1));
    return std::isfinite(slowest) ? slowest : 0.0f;
}

float PreparedScene::curvature(SurfacePoint const& s) const
{
    Triangle const t = triangleOf(s);
    if (t.mesh.normals.empty())
        return 0.0f;
    Mat4f const& toWorld = scene_.instances[s.instance].objectToWorld;
    float turn = 0.0f, size = 0.0f;
    for (std::size_t i = 0; i < 3; ++i) {
        // Turned as directions are: exact where the instance is not stretched.
        Vec3f const change = transformDirection(
            toWorld, t.mesh.normals[t.corner[(i + 1) % 3]] - t.mesh.normals[t.corner[i]]);
        Vec3f const along = t.mesh.positions[t.corner[(i + 1) % 3]] - t.mesh.positions[t.corner[i]];
        turn += dot(change, t.edge[i]);
        size += length(t.edge[i]) * length(t.edge[i]) * length(t.edge[i])
            / maxOf(length(along), 1e-30f);
    }
    float const k = turn / size;
    return std::isfinite(k) ? k : 0.0f;
}

void PreparedScene::fillAttributes(SurfacePoint const& s, PreparedMaterial const& material,
                                   ShadeState& state) const
{
    if (material.attributes.empty())
        return;
    Mesh const& mesh = scene_.meshes[static_cast<std::size_t>(scene_.instances[s.instance].mesh)];
    auto const& corner = mesh.triangles[s.triangle];
    float const w = 1.0f - s.u - s.v;
    auto const deliver = [&](auto const& values, auto missing, std::size_t offset) {
        auto const value = values.empty()
            ? missing
            : values[corner[0]] * w + values[corner[1]] * s.u + values[corner[2]] * s.v;
        std::memcpy(state.attributes + offset, &value, sizeof(value));
    };
    for (PreparedMaterial::Slot const& slot : material.attributes)
        switch (slot.source) {
        case PreparedMaterial::Source::Uv:
            deliver(mesh.uv, Vec2f(0, 0), slot.offset);
            break;
        case PreparedMaterial::Source::Uv1:
            deliver(mesh.uv1.empty() ? mesh.uv : mesh.uv1, Vec2f(0, 0), slot.offset);
            break;
        case PreparedMaterial::Source::Tangent:
            deliver(mesh.tangents, Vec3f(0, 0, 0), slot.offset);
            break;
        case PreparedMaterial::Source::Bitangent:
            deliver(mesh.bitangents, Vec3f(0, 0, 0), slot.offset);
            break;
        case PreparedMaterial::Source::Color:
            deliver(mesh.colors, Vec4f(1, 1, 1, 1), slot.offset);
            break;
        }
}

} // namespace zsi::host
