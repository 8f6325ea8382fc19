// SPDX-License-Identifier: Apache-2.0
#include "film/cryptomatte.h"

#include <bit>
#include <cstring>
#include <fmt/format.h>
#include <nlohmann/json.hpp>

namespace zsi::host {
namespace {

std::uint32_t idBits(std::string_view name)
{
    std::uint32_t hash = murmurHash3(name);
    std::uint32_t const exponent = hash >> 23 & 255;
    if (exponent == 0 || exponent == 255)
        hash ^= 1u << 23;
    return hash;
}

} // namespace

std::uint32_t murmurHash3(std::string_view text)
{
    auto const mixed = [](std::uint32_t k) { return std::rotl(k * 0xcc9e2d51u, 15) * 0x1b873593u; };
    std::uint32_t h = 0;
    std::size_t i = 0;
    for (; i + 4 <= text.size(); i += 4) {
        std::uint32_t k;
        std::memcpy(&k, text.data() + i, 4);
        h = std::rotl(h ^ mixed(k), 13) * 5 + 0xe6546b64u;
    }
    std::uint32_t tail = 0;
    for (std::size_t k = text.size(); k-- > i;)
        tail = tail << 8 | static_cast<unsigned char>(text[k]);
    h ^= mixed(tail);
    h ^= static_cast<std::uint32_t>(text.size());
    h = (h ^ h >> 16) * 0x85ebca6bu;
    h = (h ^ h >> 13) * 0xc2b2ae35u;
    return h ^ h >> 16;
}

float cryptomatteId(std::string_view name) { return std::bit_cast<float>(idBits(name)); }

std::vector<std::string> cryptomatteLayers(std::string const& name)
{
    std::vector<std::string> names;
    for (std::size_t i = 0; i < kCryptomatteRanks / 2; ++i)
        names.push_back(fmt::format("{}{:02}", name, i));
    return names;
}

std::vector<Attachment> cryptomatteHeader(std::string const& name,
                                          std::vector<std::string> const& names)
{
    nlohmann::json manifest = nlohmann::json::object();
    for (std::string const& known : names)
        manifest[known] = fmt::format("{:08x}", idBits(known));
    std::string const key =
        fmt::format("cryptomatte/{:.7}/", fmt::format("{:08x}", murmurHash3(name)));
    return {{key + "name", name},
            {key + "hash", "MurmurHash3_32"},
            {key + "conversion", "uint32_to_float32"},
            {key + "manifest",
             manifest.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace)}};
}

} // namespace zsi::host
