// SPDX-License-Identifier: Apache-2.0
#include "model/gltfAccessor.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <fmt/format.h>
#include <fmt/ranges.h>
#include <limits>

namespace zsi::host {
namespace {

enum ComponentType {
    kByte = 5120,
    kUnsignedByte = 5121,
    kShort = 5122,
    kUnsignedShort = 5123,
    kUnsignedInt = 5125,
    kFloat = 5126,
};

/// Of accessors that no bytes of the file bound.
constexpr std::uint32_t kMostMade = 1 << 24;

std::size_t bytesOf(int type)
{
    switch (type) {
    case kByte:
    case kUnsignedByte:
        return 1;
    case kShort:
    case kUnsignedShort:
        return 2;
    default:
        return 4;
    }
}

int componentType(JsonReader const& reader)
{
    JsonReader const type = reader.at("componentType");
    int const value = type.toInt(0, std::numeric_limits<int>::max());
    if (value < kByte || value > kFloat || value == 5124)
        type.failExpected("5120, 5121, 5122, 5123, 5125 or 5126");
    return value;
}

template <class T>
T load(unsigned char const* from)
{
    T value;
    std::memcpy(&value, from, sizeof value);
    return value;
}

float component(unsigned char const* at, int type, bool normalized)
{
    switch (type) {
    case kByte:
        return normalized ? std::max(static_cast<float>(load<std::int8_t>(at)) / 127.0f, -1.0f)
                          : static_cast<float>(load<std::int8_t>(at));
    case kUnsignedByte:
        return static_cast<float>(*at) / (normalized ? 255.0f : 1.0f);
    case kShort:
        return normalized ? std::max(static_cast<float>(load<std::int16_t>(at)) / 32767.0f, -1.0f)
                          : static_cast<float>(load<std::int16_t>(at));
    case kUnsignedShort:
        return static_cast<float>(load<std::uint16_t>(at)) / (normalized ? 65535.0f : 1.0f);
    case kUnsignedInt:
        return static_cast<float>(load<std::uint32_t>(at));
    default:
        return load<float>(at);
    }
}

std::uint32_t whole(unsigned char const* at, int type)
{
    switch (type) {
    case kUnsignedByte:
        return *at;
    case kUnsignedShort:
        return load<std::uint16_t>(at);
    default:
        return load<std::uint32_t>(at);
    }
}

/// `each(number, bytes)` of `count` elements of `size` bytes, `stride` apart in the view.
template <class Each>
void forElements(GltfFile const& file, JsonReader const& place, std::size_t count, std::size_t size,
                 Each&& each)
{
    if (count == 0)
        return;
    JsonReader const view = file.element("bufferViews", place.at("bufferView"));
    std::size_t stride = size;
    if (auto const given = view.find("byteStride")) {
        stride = static_cast<std::size_t>(given->toInt(1, 252));
        if (stride < size)
            given->fail(fmt::format("elements of {} bytes lie {} apart", size, stride));
    }
    auto const offset = place.find("byteOffset");
    Bytes const bytes =
        file.viewBytes(view, offset ? offset->toUint32() : 0, stride * (count - 1) + size);
    for (std::size_t i = 0; i < count; ++i)
        each(i, bytes.data() + i * stride);
}

std::uint32_t countOf(JsonReader const& accessor)
{
    JsonReader const count = accessor.at("count");
    std::uint32_t const value = count.toUint32();
    if (!accessor.find("bufferView") && value > kMostMade)
        count.failExpected(fmt::format("at most {} without a buffer view", kMostMade));
    return value;
}

/// Replaces what an accessor's `sparse` says.
void replaceSparse(GltfFile const& file, JsonReader const& sparse, int type, bool normalized,
                   AccessorValues& into)
{
    std::uint32_t const count = sparse.at("count").toUint32();
    if (count > into.count)
        sparse.at("count").failExpected(fmt::format("at most {}, as the accessor has", into.count));
    JsonReader const indices = sparse.at("indices");
    int const indexType = componentType(indices);
    std::vector<std::size_t> places(count);
    forElements(file, indices, count, bytesOf(indexType),
                [&](std::size_t i, unsigned char const* at) {
                    places[i] = whole(at, indexType);
                    if (places[i] >= into.count)
                        indices.fail(fmt::format("element {} is out of range; the accessor has {}",
                                                 places[i], into.count));
                });
    std::size_t const size = bytesOf(type);
    forElements(file, sparse.at("values"), count, size * into.components,
                [&](std::size_t i, unsigned char const* at) {
                    for (std::size_t c = 0; c < into.components; ++c)
                        into.values[places[i] * into.components + c] =
                            component(at + c * size, type, normalized);
                });
}

} // namespace

AccessorValues readAccessor(GltfFile const& file, JsonReader const& index,
                            std::initializer_list<std::size_t> components)
{
    static std::vector<std::string> const kTypes{"SCALAR", "VEC2", "VEC3", "VEC4"};
    JsonReader const accessor = file.element("accessors", index);
    int const type = componentType(accessor);
    auto const normalized = accessor.find("normalized");
    bool const isNormalized = normalized && normalized->toBool();
    AccessorValues read;
    read.count = countOf(accessor);
    read.components = accessor.at("type").toChoice(kTypes) + 1;
    if (std::ranges::find(components, read.components) == components.end()) {
        std::vector<std::string> wanted;
        for (std::size_t const c : components)
            wanted.push_back(kTypes[c - 1]);
        accessor.at("type").failExpected(
            fmt::format("{} for {}", fmt::join(wanted, " or "), index.path()));
    }
    std::size_t const size = bytesOf(type);
    // Memory follows bytes that are there: the first look at them tells.
    if (accessor.find("bufferView")) {
        forElements(file, accessor, read.count, size * read.components,
                    [&](std::size_t i, unsigned char const* at) {
                        if (i == 0)
                            read.values.reserve(read.count * read.components);
                        for (std::size_t c = 0; c < read.components; ++c)
                            read.values.push_back(component(at + c * size, type, isNormalized));
                    });
    } else {
        read.values.assign(read.count * read.components, 0.0f);
    }
    if (auto const sparse = accessor.find("sparse"))
        replaceSparse(file, *sparse, type, isNormalized, read);
    return read;
}

std::vector<std::uint32_t> readIndices(GltfFile const& file, JsonReader const& index)
{
    JsonReader const accessor = file.element("accessors", index);
    int const type = componentType(accessor);
    if (type != kUnsignedByte && type != kUnsignedShort && type != kUnsignedInt)
        accessor.at("componentType").failExpected("5121, 5123 or 5125 for indices");
    if (accessor.at("type").toString() != "SCALAR")
        accessor.at("type").failExpected("\"SCALAR\" for indices");
    std::uint32_t const count = countOf(accessor);
    std::vector<std::uint32_t> indices;
    forElements(file, accessor, count, bytesOf(type),
                [&](std::size_t, unsigned char const* at) { indices.push_back(whole(at, type)); });
    return indices;
}

} // namespace zsi::host
