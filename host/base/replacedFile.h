// SPDX-License-Identifier: Apache-2.0
/// Writing a file so that nothing half-written is ever seen.
#pragma once

#include <filesystem>
#include <span>

namespace zsi::host {

/// A file to be written as a whole. A regular file, or one that is not there yet, is written beside
/// its place and renamed, keeps its mode and its owner, and a link to it stays a link; a pipe or a
/// device is written to as it is. All operations throw InputError, "FILE: cannot be written: why".
class ReplacedFile {
public:
    /// Opens; throws when there can be no such file.
    explicit ReplacedFile(std::filesystem::path const& file);
    ~ReplacedFile(); ///< leaves nothing behind unless committed
    ReplacedFile(ReplacedFile const&) = delete;
    ReplacedFile& operator=(ReplacedFile const&) = delete;

    void write(std::span<unsigned char const> bytes);
    void commit();

    /// Whether the file could be written; leaves nothing behind.
    static void check(std::filesystem::path const& file);

    /// Removes what any thread is writing at the moment. Async-signal-safe: for a handler that ends
    /// the process at once.
    static void removeAll() noexcept;

private:
    void createTemporary();
    [[noreturn]] void fail(int error) const;

    std::filesystem::path name_; ///< as the user said it, for messages
    std::filesystem::path goal_; ///< behind all links
    std::filesystem::path temporary_; ///< empty: `goal_` itself is open
    int descriptor_ = -1;
};

} // namespace zsi::host
