// SPDX-License-Identifier: Apache-2.0
// A process of its own: it replaces the global allocation operators that the library uses.
#include "support/steadyHost.h"

#include <atomic>
#include <cstdlib>
#include <gtest/gtest.h>
#include <new>

namespace {

std::atomic<int> allocations{0};
std::atomic<int> live{0};
std::atomic<std::size_t> lastSize{0};
std::atomic<bool> memoryIsOut{false};

void* allocate(std::size_t size)
{
    if (memoryIsOut)
        return nullptr;
    ++allocations;
    ++live;
    lastSize = size;
    return std::malloc(size ? size : 1);
}

void release(void* p)
{
    live -= p != nullptr;
    std::free(p);
}

} // namespace

void* operator new(std::size_t size)
{
    if (void* p = allocate(size))
        return p;
    throw std::bad_alloc();
}
void* operator new(std::size_t size, std::nothrow_t const&) noexcept { return allocate(size); }
void operator delete(void* p) noexcept { release(p); }
void operator delete(void* p, std::size_t) noexcept { release(p); }
void operator delete(void* p, std::nothrow_t const&) noexcept { release(p); }

namespace zsi {
namespace {

test::Library const& library() { return test::Library::instance(); }

TEST(Allocation, CreateMakesOneObjectOfTheParametersAndReportsWhenMemoryIsOut)
{
    for (std::string const& name : library().classes) {
        auto const create = library().function<CreateShaderFunction>(name + "_create");
        int const before = allocations, liveBefore = live;
        IShaderBase* const shader = create();
        std::size_t const size = lastSize;
        EXPECT_EQ(allocations - before, 1) << name;

        auto const* end = reinterpret_cast<unsigned char*>(shader) + sizeof(void*);
        for (test::Registered const& row : test::RecordingManager(*shader).rows)
            end = row.field ? row.field + row.size : end;
        auto const used = static_cast<std::size_t>(end - reinterpret_cast<unsigned char*>(shader));
        EXPECT_EQ(size, (used + sizeof(void*) - 1) / sizeof(void*) * sizeof(void*))
            << name << " holds more than its parameters";

        delete shader;
        EXPECT_EQ(live, liveBefore) << name;
        memoryIsOut = true;
        IShaderBase* const none = create();
        memoryIsOut = false;
        EXPECT_EQ(none, nullptr) << name;
    }
}

TEST(Allocation, ShadingAllocatesNothing)
{
    for (std::string const& name : library().classes) {
        auto const shader = library().create(name);
        test::RecordingManager const registered(*shader);
        for (unsigned round = 0; round < 100; ++round) {
            test::Supply supply(round, false);
            test::fillParameters(registered, supply, false);
            ShadeState state = test::fillRecord(supply);
            test::SteadyHost host(round, false);
            for (test::EntryPointCall const& e : test::kEntryPoints) {
                if (e.kind != shader->getType())
                    continue;
                int const before = allocations;
                e.call(*shader, &host, state);
                ASSERT_EQ(allocations, before) << name << " " << e.name;
            }
        }
    }
}

} // namespace
} // namespace zsi
