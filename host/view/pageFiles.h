// SPDX-License-Identifier: Apache-2.0
/// The files of the page, part of the program.
#pragma once

#include <span>
#include <string_view>

namespace zsi::view {

struct PageFile {
    std::string_view name; ///< "index.html", "app.js", ...
    std::string_view bytes;
};

/// Empty in a build without the page. Made by cmake/embed.cmake.
std::span<PageFile const> pageFiles();

} // namespace zsi::view
