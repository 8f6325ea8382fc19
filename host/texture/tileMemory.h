// SPDX-License-Identifier: Apache-2.0
/// Where tiles lie: in memory as long as they fit under a limit, in scratch files beyond it.
#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <memory>
#include <mutex>
#include <vector>

namespace zsi::host {

class TileMemory;

/// Bytes of one picture: written, sealed, then read by any number of threads.
class TileBlock {
public:
    ~TileBlock();
    TileBlock(TileBlock const&) = delete;
    TileBlock& operator=(TileBlock const&) = delete;

    /// Throws std::system_error where the disk fails.
    void write(std::size_t offset, std::byte const* data, std::size_t size);
    void seal();

    std::byte const* read(std::size_t offset) const
    {
        if (windows_) {
            Window& window = windows_[(offset + lead_) >> kWindowBits];
            if (!window.load(std::memory_order_relaxed))
                firstTouch(window);
        }
        return data_ + offset;
    }

private:
    friend class TileMemory;
    /// The kernel maps in this much around a fault, at multiples of it.
    static constexpr int kWindowBits = 16;
    using Window = std::atomic<bool>;

    TileBlock(TileMemory& memory, std::size_t size);
    bool openScratch(std::filesystem::path const& folder);
    void firstTouch(Window& window) const;
    void dropPages();
    std::size_t windowCount() const { return ((size_ + lead_) >> kWindowBits) + 1; }

    TileMemory& memory_;
    std::size_t size_;
    std::unique_ptr<std::byte[]> bytes_; ///< null: in a scratch file
    int file_ = -1; ///< until sealed
    std::byte* data_ = nullptr;
    std::size_t lead_ = 0; ///< of `data_` over the window that it begins in
    std::unique_ptr<Window[]> windows_; ///< of a scratch file: whether counted as in memory
};

/// Makes blocks and keeps what all of them hold in memory under a limit. Scratch files have no name
/// and vanish with the program. The system's page cache stands behind them: to drop a page and take
/// it up again costs about a microsecond while the machine has memory to spare.
class TileMemory {
public:
    explicit TileMemory(std::size_t limit)
        : limit_(limit)
    {
    }

    /// Half of the limit is for blocks that stay in memory, so that the rest has room to turn over.
    /// Where the disk has no room, a block is in memory all the same, and `overflow` grows.
    std::unique_ptr<TileBlock> allocate(std::size_t size);

    std::size_t overflow() const { return overflow_; } ///< bytes held beyond the limit
    static std::filesystem::path scratchFolder(); ///< $TMPDIR, else /var/tmp: on a disk

private:
    friend class TileBlock;
    bool isFull() const;
    void dropPages();

    std::size_t limit_;
    std::size_t held_ = 0; ///< bytes of blocks that stay in memory
    std::size_t overflow_ = 0;
    std::atomic<std::size_t> touched_{0}; ///< windows of scratch files
    std::mutex mutex_; ///< for what follows
    std::vector<TileBlock*> scratch_;
};

} // namespace zsi::host
