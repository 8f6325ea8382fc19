// SPDX-License-Identifier: Apache-2.0
#include "texture/exrCheck.h"

#include <algorithm>
#include <cstdint>
#include <openexr.h>

namespace zsi::host {
namespace {

constexpr std::int64_t kMostSide = 1 << 17; ///< readers refuse more by themselves
constexpr std::int64_t kMostTexels = 1 << 20; ///< of a tile of a smaller picture

bool failed(exr_result_t result) { return result != EXR_ERR_SUCCESS; }

/// Unpacks a block without giving its values to anyone.
bool unpacks(exr_context_t file, exr_chunk_info_t const& block)
{
    if (block.compression == EXR_COMPRESSION_NONE)
        return block.packed_size == block.unpacked_size;
    // Not known to this half of the library; the other half is strict about it.
    if (block.compression == EXR_COMPRESSION_DWAA || block.compression == EXR_COMPRESSION_DWAB)
        return true;
    exr_decode_pipeline_t decoding{};
    if (failed(exr_decoding_initialize(file, 0, &block, &decoding)))
        return false;
    bool done = !failed(exr_decoding_choose_default_routines(file, 0, &decoding));
    decoding.unpack_and_convert_fn = nullptr;
    done = done && !failed(exr_decoding_run(file, 0, &decoding));
    exr_decoding_destroy(file, &decoding);
    return done;
}

std::string whatIsWrong(exr_context_t file)
{
    exr_storage_t storage;
    exr_attr_box2i_t window;
    if (failed(exr_get_storage(file, 0, &storage)) || failed(exr_get_data_window(file, 0, &window)))
        return "its header is damaged";
    if (storage != EXR_STORAGE_SCANLINE && storage != EXR_STORAGE_TILED)
        return {};
    std::int64_t const width = std::int64_t(window.max.x) - window.min.x + 1;
    std::int64_t const height = std::int64_t(window.max.y) - window.min.y + 1;
    if (std::max(width, height) > kMostSide)
        return {};
    exr_chunk_info_t first;
    exr_result_t found;
    if (storage == EXR_STORAGE_TILED) {
        std::uint32_t across, down;
        if (failed(exr_get_tile_descriptor(file, 0, &across, &down, nullptr, nullptr)))
            return "its header is damaged";
        if (std::max(across, down) > kMostSide
            || std::int64_t(across) * down > std::max(kMostTexels, width * height))
            return "damaged header, expected tiles no larger than the picture";
        found = exr_read_tile_chunk_info(file, 0, 0, 0, 0, 0, &first);
    } else {
        found = exr_read_scanline_chunk_info(file, 0, window.min.y, &first);
    }
    return failed(found) || !unpacks(file, first)
        ? "its first block is not of the size that its header says"
        : "";
}

} // namespace

std::string whatIsWrongWithExr(std::filesystem::path const& file)
{
    exr_context_initializer_t how = EXR_DEFAULT_CONTEXT_INITIALIZER;
    how.error_handler_fn = [](exr_const_context_t, exr_result_t, char const*) {}; // be quiet
    if (failed(exr_test_file_header(file.c_str(), &how)))
        return {};
    exr_context_t context = nullptr;
    if (failed(exr_start_read(&context, file.c_str(), &how)))
        return "its header is damaged";
    std::string wrong = whatIsWrong(context);
    exr_finish(&context);
    return wrong;
}

} // namespace zsi::host
