// SPDX-License-Identifier: Apache-2.0
/// glTF 2.0 files, text or binary: their JSON, and bytes where they are asked for.
/// Khronos Group, "glTF 2.0", ISO/IEC 12113:2022.
#pragma once

#include "json/jsonReader.h"

#include <cstdint>
#include <map>
#include <memory>
#include <mutex>

namespace zsi::host {

using Bytes = std::vector<unsigned char>;

/// All operations throw InputError with the file and the place in its JSON, such as
/// "car.glb: nodes[3].mesh: ...".
class GltfFile {
public:
    /// Reads the JSON, and no data yet. Refuses other versions, and files that need an extension
    /// that is not known here.
    explicit GltfFile(std::filesystem::path const& file);

    /// The same of a file that was opened before and has not changed since is the same object:
    /// of the last few files.
    static std::shared_ptr<GltfFile const> open(std::filesystem::path const& file);

    std::filesystem::path const& file() const { return file_; }
    JsonReader root() const { return JsonReader(json_); }

    std::size_t count(char const* section) const; ///< of a list of the file, such as "nodes"
    JsonReader element(char const* section, std::size_t index) const; ///< index < count
    /// The element that an index somewhere in the file means; refuses one that is out of range.
    JsonReader element(char const* section, JsonReader const& index) const;
    std::size_t indexOf(char const* section, JsonReader const& index) const;

    /// Bytes of a buffer view, from `offset` in it on.
    Bytes viewBytes(JsonReader const& view, std::uint64_t offset, std::uint64_t length) const;
    Bytes viewBytes(JsonReader const& view) const;

    /// A picture's bytes, which lie in the file or in a `data:` address; empty where the picture is
    /// a file of its own.
    Bytes imageBytes(std::size_t index) const;
    /// The picture's own file; empty where it has none.
    std::filesystem::path imageFile(std::size_t index) const;

    /// Files beside this one that its buffers lie in.
    std::vector<std::filesystem::path> bufferFiles() const;

private:
    Bytes bufferBytes(JsonReader const& buffer, std::uint64_t offset, std::uint64_t length) const;
    std::filesystem::path besides(JsonReader const& uri) const;

    std::filesystem::path file_;
    JsonValue json_;
    std::uint64_t binaryStart_ = 0, binaryLength_ = 0; ///< of a GLB's second chunk
    mutable std::mutex decoding_;
    mutable std::map<std::string const*, Bytes> decoded_; ///< `data:` addresses
};

/// What files may need or use: what is read, and what is left out with a word of its own.
bool isKnownExtension(std::string_view name);

} // namespace zsi::host
