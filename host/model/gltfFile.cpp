// SPDX-License-Identifier: Apache-2.0
#include "model/gltfFile.h"

#include "base/error.h"
#include "base/names.h"
#include "json/jsonText.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <deque>
#include <fmt/format.h>
#include <fstream>

namespace zsi::host {
namespace {

namespace fs = std::filesystem;

constexpr std::string_view kKnownExtensions[] = {
    "EXT_mesh_gpu_instancing",
    "EXT_texture_webp",
    "KHR_lights_punctual",
    "KHR_materials_anisotropy",
    "KHR_materials_clearcoat",
    "KHR_materials_dispersion",
    "KHR_materials_emissive_strength",
    "KHR_materials_ior",
    "KHR_materials_iridescence",
    "KHR_materials_pbrSpecularGlossiness",
    "KHR_materials_sheen",
    "KHR_materials_specular",
    "KHR_materials_transmission",
    "KHR_materials_unlit",
    "KHR_materials_variants",
    "KHR_materials_volume",
    "KHR_mesh_quantization",
    "KHR_texture_transform",
};

std::uint64_t sizeOf(fs::path const& file)
{
    std::error_code failed;
    if (!fs::is_regular_file(file, failed))
        throw InputError(file.string() + ": no such file");
    return fs::file_size(file);
}

Bytes readPart(fs::path const& file, std::uint64_t start, std::uint64_t length)
{
    Bytes bytes(static_cast<std::size_t>(length));
    std::ifstream in(file, std::ios::binary);
    in.seekg(static_cast<std::streamoff>(start));
    if (!in.read(reinterpret_cast<char*>(bytes.data()), static_cast<std::streamsize>(length)))
        throw InputError(file.string() + ": cannot be read, or ends early");
    return bytes;
}

std::uint32_t word(Bytes const& bytes, std::size_t at)
{
    return std::uint32_t(bytes[at]) | std::uint32_t(bytes[at + 1]) << 8
        | std::uint32_t(bytes[at + 2]) << 16 | std::uint32_t(bytes[at + 3]) << 24;
}

constexpr std::uint32_t kMagic = 0x46546C67, kJsonChunk = 0x4E4F534A, kBinaryChunk = 0x004E4942;

struct Chunk {
    std::uint64_t start, length;
    std::uint32_t type;
};

Chunk chunkAt(fs::path const& file, std::uint64_t at, std::uint64_t end)
{
    if (at + 8 > end)
        throw InputError(
            fmt::format("{}: ends early: expected a chunk at byte {}", file.string(), at));
    Bytes const head = readPart(file, at, 8);
    Chunk const chunk{at + 8, word(head, 0), word(head, 4)};
    if (chunk.start + chunk.length > end)
        throw InputError(
            fmt::format("{}: ends early: the chunk at byte {} has {} bytes, the file {}",
                        file.string(), at, chunk.length, end));
    return chunk;
}

std::string asText(Bytes const& bytes) { return {bytes.begin(), bytes.end()}; }

/// RFC 4648; nothing where it is none.
std::optional<Bytes> fromBase64(std::string_view text)
{
    static constexpr std::string_view kDigits =
        "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    std::array<int, 256> values{};
    values.fill(-1);
    for (std::size_t i = 0; i < kDigits.size(); ++i)
        values[static_cast<unsigned char>(kDigits[i])] = static_cast<int>(i);
    while (text.ends_with('='))
        text.remove_suffix(1);
    Bytes bytes;
    bytes.reserve(text.size() * 3 / 4);
    std::uint32_t bits = 0;
    int count = 0;
    for (char const c : text) {
        int const value = values[static_cast<unsigned char>(c)];
        if (value < 0)
            return {};
        bits = bits << 6 | static_cast<std::uint32_t>(value);
        if ((count += 6) >= 8) {
            count -= 8;
            bytes.push_back(static_cast<unsigned char>(bits >> count));
        }
    }
    return bytes;
}

int hexDigit(char c)
{
    return c >= '0' && c <= '9' ? c - '0'
        : c >= 'a' && c <= 'f'  ? c - 'a' + 10
        : c >= 'A' && c <= 'F'  ? c - 'A' + 10
                                : -1;
}

/// RFC 3986: %20 and the like.
std::string unescaped(std::string const& uri)
{
    std::string text;
    for (std::size_t i = 0; i < uri.size(); ++i) {
        int const high = i + 2 < uri.size() && uri[i] == '%' ? hexDigit(uri[i + 1]) : -1;
        int const low = high >= 0 ? hexDigit(uri[i + 2]) : -1;
        if (low >= 0) {
            text += static_cast<char>(high * 16 + low);
            i += 2;
        } else {
            text += uri[i];
        }
    }
    return text;
}

bool isData(std::string const& uri) { return uri.starts_with("data:"); }

/// What a data: address holds.
Bytes dataOf(JsonReader const& uri)
{
    std::string_view const text = uri.toString();
    std::size_t const comma = text.find(',');
    auto bytes = comma != std::string_view::npos && text.substr(0, comma).ends_with(";base64")
        ? fromBase64(text.substr(comma + 1))
        : std::nullopt;
    if (!bytes)
        uri.fail("expected a data: address in base64");
    return std::move(*bytes);
}

std::uint64_t offsetOf(JsonReader const& reader)
{
    auto const offset = reader.find("byteOffset");
    return offset ? offset->toUint32() : 0;
}

} // namespace

bool isKnownExtension(std::string_view name)
{
    return std::ranges::find(kKnownExtensions, name) != std::end(kKnownExtensions);
}

GltfFile::GltfFile(fs::path const& file)
    : file_(file)
{
    std::uint64_t const size = sizeOf(file);
    bool const isBinary = size >= 4 && word(readPart(file, 0, 4), 0) == kMagic;
    if (isBinary) {
        if (size < 12)
            throw InputError(file.string() + ": ends early: its header has 12 bytes");
        Bytes const head = readPart(file, 0, 12);
        if (word(head, 4) != 2)
            throw InputError(fmt::format("{}: expected binary glTF of version 2, got version {}",
                                         file.string(), word(head, 4)));
        if (word(head, 8) > size)
            throw InputError(fmt::format("{}: ends early: it says to have {} bytes and has {}",
                                         file.string(), word(head, 8), size));
        std::uint64_t const end = word(head, 8);
        Chunk const first = chunkAt(file, 12, end);
        if (first.type != kJsonChunk)
            throw InputError(file.string() + ": expected JSON in its first chunk");
        json_ = parseJson(asText(readPart(file, first.start, first.length)), file);
        setOrigin(json_, file); // a chunk of one line has no lines to name
        std::uint64_t const next = first.start + (first.length + 3) / 4 * 4;
        if (next < end) {
            Chunk const second = chunkAt(file, next, end);
            if (second.type == kBinaryChunk) {
                binaryStart_ = second.start;
                binaryLength_ = second.length;
            }
        }
    } else {
        json_ = readJson(file);
    }
    JsonReader const version = root().at("asset").at("version");
    if (!version.toString().starts_with("2."))
        version.failExpected("glTF of version 2");
    if (auto const required = root().find("extensionsRequired"))
        for (JsonReader const& name : required->items())
            if (!isKnownExtension(name.toString()))
                name.fail(fmt::format("the file needs the extension {}, which is not known here",
                                      printable(name.toString())));
}

std::shared_ptr<GltfFile const> GltfFile::open(fs::path const& file)
{
    struct Opened {
        fs::path name;
        std::uint64_t size;
        fs::file_time_type time;
        std::shared_ptr<GltfFile const> file;
    };
    static std::mutex mutex;
    static std::deque<Opened> last;
    constexpr std::size_t kKept = 4;
    std::uint64_t const size = sizeOf(file);
    fs::file_time_type const time = fs::last_write_time(file);
    std::lock_guard const lock(mutex);
    for (Opened const& opened : last)
        if (opened.name == file && opened.size == size && opened.time == time)
            return opened.file;
    last.push_front({file, size, time, std::make_shared<GltfFile const>(file)});
    if (last.size() > kKept)
        last.pop_back();
    return last.front().file;
}

std::size_t GltfFile::count(char const* section) const
{
    auto const list = root().find(section);
    if (list && list->kind() != JsonValue::Kind::Array)
        list->failExpected("an array");
    return list ? list->value().items.size() : 0;
}

JsonReader GltfFile::element(char const* section, std::size_t index) const
{
    return JsonReader(json_.find(section)->items[index], fmt::format("{}[{}]", section, index));
}

std::size_t GltfFile::indexOf(char const* section, JsonReader const& index) const
{
    std::size_t const all = count(section);
    std::uint32_t const i = index.toUint32();
    if (i >= all)
        index.fail(fmt::format("there is no {}[{}]; the file has {}", section, i, all));
    return i;
}

JsonReader GltfFile::element(char const* section, JsonReader const& index) const
{
    return element(section, indexOf(section, index));
}

Bytes GltfFile::viewBytes(JsonReader const& view, std::uint64_t offset, std::uint64_t length) const
{
    std::uint64_t const has = view.at("byteLength").toUint32();
    if (offset + length > has)
        view.fail(fmt::format("has {} bytes; {} are needed from byte {} on", has, length, offset));
    return bufferBytes(element("buffers", view.at("buffer")), offsetOf(view) + offset, length);
}

Bytes GltfFile::viewBytes(JsonReader const& view) const
{
    return viewBytes(view, 0, view.at("byteLength").toUint32());
}

Bytes GltfFile::bufferBytes(JsonReader const& buffer, std::uint64_t offset,
                            std::uint64_t length) const
{
    auto const check = [&](std::uint64_t has, std::string const& where) {
        if (offset + length > has)
            buffer.fail(fmt::format("{} has {} bytes; {} are needed from byte {} on", where, has,
                                    length, offset));
    };
    check(buffer.at("byteLength").toUint32(), "it");
    auto const uri = buffer.find("uri");
    if (!uri) {
        check(binaryLength_, "the file's binary chunk");
        return readPart(file_, binaryStart_ + offset, length);
    }
    if (!isData(uri->toString())) {
        fs::path const file = besides(*uri);
        try {
            check(sizeOf(file), file.string());
        } catch (InputError const& error) {
            if (fs::exists(file))
                throw;
            uri->fail(error.what());
        }
        return readPart(file, offset, length);
    }
    std::lock_guard const lock(decoding_);
    std::string const* const text = &uri->toString();
    auto found = decoded_.find(text);
    if (found == decoded_.end()) {
        found = decoded_.emplace(text, dataOf(*uri)).first;
    }
    check(found->second.size(), "its data: address");
    auto const first = found->second.begin() + static_cast<std::ptrdiff_t>(offset);
    return {first, first + static_cast<std::ptrdiff_t>(length)};
}

fs::path GltfFile::besides(JsonReader const& uri) const
{
    std::string const name = unescaped(uri.toString());
    if (name.empty() || name.find('\0') != std::string::npos
        || name.find("://") != std::string::npos)
        uri.failExpected("the name of a file, or a data: address");
    return (file_.parent_path() / name).lexically_normal();
}

Bytes GltfFile::imageBytes(std::size_t index) const
{
    JsonReader const image = element("images", index);
    if (auto const view = image.find("bufferView"))
        return viewBytes(element("bufferViews", *view));
    JsonReader const uri = image.at("uri");
    return isData(uri.toString()) ? dataOf(uri) : Bytes();
}

fs::path GltfFile::imageFile(std::size_t index) const
{
    JsonReader const image = element("images", index);
    if (image.find("bufferView") || isData(image.at("uri").toString()))
        return {};
    return besides(image.at("uri"));
}

std::vector<fs::path> GltfFile::bufferFiles() const
{
    std::vector<fs::path> files;
    for (std::size_t i = 0; i < count("buffers"); ++i)
        if (auto const uri = element("buffers", i).find("uri"); uri && !isData(uri->toString()))
            files.push_back(besides(*uri));
    return files;
}

} // namespace zsi::host
