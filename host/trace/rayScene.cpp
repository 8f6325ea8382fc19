// SPDX-License-Identifier: Apache-2.0
#include "trace/rayScene.h"

#include "base/activity.h"
#include "base/error.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstring>
#include <embree3/rtcore.h>
#include <new>
#include <tbb/task_arena.h>

namespace zsi::host {
namespace {

using DeviceHandle = std::unique_ptr<RTCDeviceTy, decltype(&rtcReleaseDevice)>;
using SceneHandle = std::unique_ptr<RTCSceneTy, decltype(&rtcReleaseScene)>;
using GeometryHandle = std::unique_ptr<RTCGeometryTy, decltype(&rtcReleaseGeometry)>;

struct PreparedInstance {
    Mesh const* mesh;
    Mat4f toWorld;
    Mat3f normalToWorld; ///< for `transformDirection`; the inverse transposed
    float mirrored; ///< -1 where it turns left to right, else 1
};

/// Inverse transposed of the 3x3 part, up to a positive factor: its cofactors, with the sign of
/// the determinant so that mirrored instances keep their outside. False when it has no inverse.
bool normalMatrix(Mat4f const& a, Mat3f& result, float& mirrored)
{
    Vec3f const r0{a.m[0], a.m[1], a.m[2]}, r1{a.m[4], a.m[5], a.m[6]}, r2{a.m[8], a.m[9], a.m[10]};
    Vec3f c0 = cross(r1, r2), c1 = cross(r2, r0), c2 = cross(r0, r1);
    float const determinant = dot(r0, c0);
    if (!std::isfinite(determinant) || determinant == 0.0f)
        return false;
    float const s = mirrored = determinant < 0.0f ? -1.0f : 1.0f;
    c0 = c0 * s, c1 = c1 * s, c2 = c2 * s;
    result = {c0.x, c0.y, c0.z, c1.x, c1.y, c1.z, c2.x, c2.y, c2.z};
    return true;
}

/// Outside of this range tracing ends the program.
bool isTraceable(Ray const& ray)
{
    auto const inside = [](Vec3f v) {
        return std::fabs(v.x) < 1.8e18f && std::fabs(v.y) < 1.8e18f && std::fabs(v.z) < 1.8e18f;
    };
    return inside(ray.origin) && inside(ray.direction) && ray.tMax >= 0.0f;
}

RTCRayHit embreeRay(Ray const& ray)
{
    RTCRayHit r;
    r.ray.org_x = ray.origin.x;
    r.ray.org_y = ray.origin.y;
    r.ray.org_z = ray.origin.z;
    r.ray.dir_x = ray.direction.x;
    r.ray.dir_y = ray.direction.y;
    r.ray.dir_z = ray.direction.z;
    r.ray.tnear = 0.0f;
    r.ray.tfar = ray.tMax;
    r.ray.time = 0.0f;
    r.ray.mask = ~0u;
    r.ray.id = 0;
    r.ray.flags = 0;
    r.hit.geomID = RTC_INVALID_GEOMETRY_ID;
    r.hit.instID[0] = RTC_INVALID_GEOMETRY_ID;
    return r;
}

/// What goes wrong while structures are built, and who may end it. Embree reports both by calling
/// back and by null results; `check` turns them into exceptions.
class Build {
public:
    Build(RTCDevice device, BuildProgress const& progress, double triangles)
        : device_(device)
        , progress_(progress)
        , triangles_(triangles)
    {
    }

    SceneHandle newScene() const
    {
        SceneHandle scene(rtcNewScene(device_), rtcReleaseScene);
        check(scene != nullptr);
        // Watertight at shared edges; the quality build is repaid by every ray.
        rtcSetSceneFlags(scene.get(), RTC_SCENE_FLAG_ROBUST);
        rtcSetSceneBuildQuality(scene.get(), RTC_BUILD_QUALITY_HIGH);
        return scene;
    }

    GeometryHandle newGeometry(RTCGeometryType type) const
    {
        GeometryHandle geometry(rtcNewGeometry(device_, type), rtcReleaseGeometry);
        check(geometry != nullptr);
        return geometry;
    }

    /// A copy of `data` that Embree owns and pads, so that the mesh may lie in memory as it likes.
    template <class Element>
    void copyToBuffer(RTCGeometry geometry, RTCBufferType type, RTCFormat format,
                      std::vector<Element> const& data) const
    {
        void* const buffer =
            rtcSetNewGeometryBuffer(geometry, type, 0, format, sizeof(Element), data.size());
        check(buffer != nullptr);
        std::memcpy(buffer, data.data(), data.size() * sizeof(Element));
    }

    /// `triangles` lie below the scene.
    void commit(RTCScene scene, std::size_t triangles)
    {
        share_ = static_cast<double>(triangles) / std::max(1.0, triangles_);
        rtcSetSceneProgressMonitorFunction(scene, onProgress, this);
        rtcCommitScene(scene);
        rtcSetSceneProgressMonitorFunction(scene, nullptr, nullptr);
        if (cancelled_) {
            rtcGetDeviceError(device_); // forgets it
            throw Cancelled();
        }
        check(true);
        done_ += share_;
    }

    void check(bool result) const
    {
        switch (rtcGetDeviceError(device_)) {
        case RTC_ERROR_NONE:
            if (result)
                return;
            [[fallthrough]];
        case RTC_ERROR_OUT_OF_MEMORY:
            throw std::bad_alloc();
        case RTC_ERROR_CANCELLED:
            throw Cancelled();
        default:
            throw InputError("the acceleration structure cannot be built");
        }
    }

private:
    static bool onProgress(void* self, double done)
    {
        auto& build = *static_cast<Build*>(self);
        if (build.progress_
            && !build.progress_(minOf(1.0f, static_cast<float>(build.done_ + build.share_ * done))))
            build.cancelled_ = true;
        return !build.cancelled_;
    }

    RTCDevice device_;
    BuildProgress const& progress_;
    double triangles_; ///< of all scenes to be committed
    double done_ = 0, share_ = 0;
    bool cancelled_ = false;
};

SceneHandle buildMesh(Build& build, Mesh const& mesh)
{
    SceneHandle scene = build.newScene();
    if (!mesh.triangles.empty()) {
        GeometryHandle const geometry = build.newGeometry(RTC_GEOMETRY_TYPE_TRIANGLE);
        build.copyToBuffer(geometry.get(), RTC_BUFFER_TYPE_VERTEX, RTC_FORMAT_FLOAT3,
                           mesh.positions);
        build.copyToBuffer(geometry.get(), RTC_BUFFER_TYPE_INDEX, RTC_FORMAT_UINT3, mesh.triangles);
        rtcCommitGeometry(geometry.get());
        rtcAttachGeometry(scene.get(), geometry.get());
        build.check(true);
    }
    build.commit(scene.get(), mesh.triangles.size());
    return scene;
}

template <class Value>
Value interpolate(std::vector<Value> const& values, std::array<std::uint32_t, 3> const& corner,
                  float u, float v)
{
    return values[corner[0]] * (1.0f - u - v) + values[corner[1]] * u + values[corner[2]] * v;
}

} // namespace

struct RayScene::Impl {
    Scene const& scene;
    DeviceHandle device;
    std::vector<SceneHandle> meshes;
    SceneHandle all, opaque, clear;
    std::vector<PreparedInstance> instances;

    explicit Impl(Scene const& scene_)
        : scene(scene_)
        , device(rtcNewDevice(nullptr), rtcReleaseDevice)
        , all(nullptr, rtcReleaseScene)
        , opaque(nullptr, rtcReleaseScene)
        , clear(nullptr, rtcReleaseScene)
    {
        if (!device && rtcGetDeviceError(nullptr) == RTC_ERROR_OUT_OF_MEMORY)
            throw std::bad_alloc();
        if (!device)
            throw InputError("the ray tracing device cannot be created");
    }

    RTCScene visible(Visibility v) const
    {
        return (v == Visibility::All ? all : v == Visibility::Clear ? clear : opaque).get();
    }

    void buildMeshes(BuildProgress const& progress)
    {
        double triangles = 0;
        for (Mesh const& mesh : scene.meshes)
            triangles += static_cast<double>(mesh.triangles.size());
        Build build(device.get(), progress, triangles);
        for (Mesh const& mesh : scene.meshes)
            meshes.push_back(buildMesh(build, mesh));
    }

    void buildInstances(BuildProgress const& progress)
    {
        Build build(device.get(), progress, 3.0 * static_cast<double>(scene.instances.size()));
        all = build.newScene();
        opaque = build.newScene();
        clear = build.newScene();
        instances.clear();
        for (std::size_t i = 0; i < scene.instances.size(); ++i) {
            Instance const& instance = scene.instances[i];
            PreparedInstance prepared{&scene.meshes[static_cast<std::size_t>(instance.mesh)],
                                      instance.objectToWorld, Mat3f::identity(), 1.0f};
            // A flattened instance has no inside and no inverse; rays do not meet it.
            if (normalMatrix(instance.objectToWorld, prepared.normalToWorld, prepared.mirrored))
                attach(build, instance, static_cast<std::uint32_t>(i));
            instances.push_back(prepared);
        }
        for (RTCScene const s : {all.get(), opaque.get(), clear.get()})
            build.commit(s, scene.instances.size());
    }

    void attach(Build& build, Instance const& instance, std::uint32_t index)
    {
        GeometryHandle const geometry = build.newGeometry(RTC_GEOMETRY_TYPE_INSTANCE);
        rtcSetGeometryInstancedScene(geometry.get(),
                                     meshes[static_cast<std::size_t>(instance.mesh)].get());
        rtcSetGeometryTransform(geometry.get(), 0, RTC_FORMAT_FLOAT4X4_COLUMN_MAJOR,
                                instance.objectToWorld.m);
        rtcCommitGeometry(geometry.get());
        bool const isClear = instance.light < 0
            && (scene.materials[static_cast<std::size_t>(instance.material)].entryPoints()
                & kTransmission)
                != 0;
        rtcAttachGeometryByID(all.get(), geometry.get(), index);
        rtcAttachGeometryByID(isClear ? clear.get() : opaque.get(), geometry.get(), index);
        build.check(true);
    }
};

RayScene::RayScene(Scene const& scene, BuildProgress const& progress)
    : impl_(std::make_unique<Impl>(scene))
{
    // One thread builds: the structure, and with it the order of equal hits, is repeatable. The
    // device itself would limit the threads of the whole program, not of the build alone.
    tbb::task_arena(1).execute([&] {
        impl_->buildMeshes(progress);
        impl_->buildInstances(progress);
    });
}

RayScene::~RayScene() = default;
RayScene::RayScene(RayScene&&) noexcept = default;
RayScene& RayScene::operator=(RayScene&&) noexcept = default;

void RayScene::rebuildInstances(BuildProgress const& progress)
{
    tbb::task_arena(1).execute([&] { impl_->buildInstances(progress); });
}

bool RayScene::intersect(Ray const& ray, Visibility visible, Hit& hit) const
{
    Doing const tracing(Activity::Tracing);
    if (!isTraceable(ray))
        return false;
    RTCRayHit r = embreeRay(ray);
    RTCIntersectContext context;
    rtcInitIntersectContext(&context);
    context.flags = RTC_INTERSECT_CONTEXT_FLAG_INCOHERENT;
    rtcIntersect1(impl_->visible(visible), &context, &r);
    if (r.hit.geomID == RTC_INVALID_GEOMETRY_ID)
        return false;
    hit = {r.ray.tfar, r.hit.instID[0], r.hit.primID, r.hit.u, r.hit.v};
    return true;
}

bool RayScene::occluded(Ray const& ray, Visibility visible) const
{
    Doing const tracing(Activity::Tracing);
    if (!isTraceable(ray))
        return false;
    RTCRayHit r = embreeRay(ray);
    RTCIntersectContext context;
    rtcInitIntersectContext(&context);
    context.flags = RTC_INTERSECT_CONTEXT_FLAG_INCOHERENT;
    rtcOccluded1(impl_->visible(visible), &context, &r.ray);
    return r.ray.tfar < 0.0f;
}

SurfacePoint RayScene::surface(Hit const& hit) const
{
    PreparedInstance const& instance = impl_->instances[hit.instance];
    Mesh const& mesh = *instance.mesh;
    auto const& corner = mesh.triangles[hit.triangle];

    SurfacePoint s;
    s.instance = hit.instance;
    s.triangle = hit.triangle;
    s.u = hit.u;
    s.v = hit.v;
    // From the corners, not along the ray: the error does not grow with the ray's length.
    s.objectP = interpolate(mesh.positions, corner, hit.u, hit.v);
    s.P = transformPoint(instance.toWorld, s.objectP);
    Vec3f const* const p = mesh.positions.data();
    Vec3f const face = cross(p[corner[1]] - p[corner[0]], p[corner[2]] - p[corner[0]]);
    s.Ng = normalize(transformDirection(instance.normalToWorld, face));

    if (mesh.normals.empty()) {
        s.Ng = s.Ng * instance.mirrored;
        s.N = s.Ng;
        s.objectN = normalize(face);
        return s;
    }
    Vec3f const* const n = mesh.normals.data();
    if (dot(face, n[corner[0]] + n[corner[1]] + n[corner[2]]) < 0.0f)
        s.Ng = -s.Ng;
    s.objectN = normalize(interpolate(mesh.normals, corner, hit.u, hit.v));
    s.N = normalize(transformDirection(instance.normalToWorld, s.objectN));
    if (!(dot(s.N, s.N) > 0.5f)) // opposite normals cancel out
        s.N = s.Ng;
    if (!(dot(s.Ng, s.Ng) > 0.5f)) // a sliver whose area is too small for a float
        s.Ng = s.N;
    return s;
}

Vec3f RayScene::smoothPoint(SurfacePoint const& s) const
{
    PreparedInstance const& instance = impl_->instances[s.instance];
    Mesh const& mesh = *instance.mesh;
    if (mesh.normals.empty())
        return s.P;
    auto const& corner = mesh.triangles[s.triangle];
    float const weight[3] = {1.0f - s.u - s.v, s.u, s.v};
    // The mean of the projections of P onto the corners' tangent planes, as far as P lies below
    // them.
    Vec3f rise{0, 0, 0};
    for (std::size_t i = 0; i < 3; ++i) {
        Vec3f const normal =
            normalize(transformDirection(instance.normalToWorld, mesh.normals[corner[i]]));
        Vec3f const way = s.P - transformPoint(instance.toWorld, mesh.positions[corner[i]]);
        rise += normal * (-minOf(0.0f, dot(way, normal)) * weight[i]);
    }
    return s.P + rise;
}

Vec3f offsetPoint(Vec3f P, Vec3f n)
{
    // Near the origin a fixed step, elsewhere a step of 256 units in the last place.
    constexpr float kNear = 1.0f / 32.0f, kStep = 1.0f / 65536.0f, kUnits = 256.0f;
    auto const move = [](float p, float d) {
        if (std::fabs(p) < kNear)
            return p + kStep * d;
        auto const units = static_cast<std::int32_t>(kUnits * d);
        return std::bit_cast<float>(std::bit_cast<std::int32_t>(p) + (p < 0.0f ? -units : units));
    };
    return {move(P.x, n.x), move(P.y, n.y), move(P.z, n.z)};
}

} // namespace zsi::host
