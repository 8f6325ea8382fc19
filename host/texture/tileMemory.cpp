// SPDX-License-Identifier: Apache-2.0
#include "texture/tileMemory.h"

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <string>
#include <sys/mman.h>
#include <system_error>
#include <unistd.h>
#include <utility>

namespace zsi::host {
namespace {

/// A file without a name in `folder`, -1 where there can be none.
int openUnnamed(std::filesystem::path const& folder)
{
    int const file = open(folder.c_str(), O_TMPFILE | O_RDWR | O_CLOEXEC, 0600);
    if (file >= 0 || (errno != EOPNOTSUPP && errno != EISDIR))
        return file;
    std::string name = folder / "zsi-XXXXXX"; // a file system that knows only files with names
    int const named = mkostemp(name.data(), O_CLOEXEC);
    if (named >= 0)
        unlink(name.c_str());
    return named;
}

[[noreturn]] void failed(char const* what)
{
    throw std::system_error(errno, std::generic_category(), what);
}

} // namespace

TileBlock::TileBlock(TileMemory& memory, std::size_t size)
    : memory_(memory)
    , size_(size)
{
}

TileBlock::~TileBlock()
{
    if (file_ >= 0)
        close(file_);
    if (!windows_)
        return;
    std::lock_guard const lock(memory_.mutex_);
    std::erase(memory_.scratch_, this);
    munmap(data_, size_);
}

bool TileBlock::openScratch(std::filesystem::path const& folder)
{
    file_ = openUnnamed(folder);
    // Room for all of it now: a page without room on the disk would end the program later.
    if (file_ >= 0 && posix_fallocate(file_, 0, static_cast<off_t>(size_)) != 0)
        close(std::exchange(file_, -1));
    return file_ >= 0;
}

void TileBlock::write(std::size_t offset, std::byte const* data, std::size_t size)
{
    if (bytes_) {
        std::memcpy(bytes_.get() + offset, data, size);
        return;
    }
    // In pieces of a window: the kernel keeps together, and maps in, what comes in one.
    constexpr std::size_t kWindow = std::size_t(1) << kWindowBits;
    while (size > 0) {
        ssize_t const n = pwrite(file_, data, std::min(size, kWindow), static_cast<off_t>(offset));
        if (n < 0 && errno != EINTR)
            failed("scratch file");
        auto const done = static_cast<std::size_t>(std::max<ssize_t>(n, 0));
        data += done, offset += done, size -= done;
    }
}

void TileBlock::seal()
{
    if (bytes_) {
        data_ = bytes_.get();
        return;
    }
    void* const map = mmap(nullptr, size_, PROT_READ, MAP_SHARED, file_, 0);
    if (map == MAP_FAILED)
        failed("scratch file");
    close(std::exchange(file_, -1));
    data_ = static_cast<std::byte*>(map);
    lead_ = reinterpret_cast<std::uintptr_t>(map) & ((std::uintptr_t(1) << kWindowBits) - 1);
    windows_ = std::make_unique<Window[]>(windowCount());
    std::lock_guard const lock(memory_.mutex_);
    memory_.scratch_.push_back(this);
}

void TileBlock::firstTouch(Window& window) const
{
    if (window.exchange(true, std::memory_order_relaxed))
        return;
    ++memory_.touched_;
    if (memory_.isFull())
        memory_.dropPages();
}

void TileBlock::dropPages()
{
    // Readers go on meanwhile: what they touch comes back from the file, at worst counted twice.
    for (std::size_t i = 0; i < windowCount(); ++i)
        windows_[i].store(false, std::memory_order_relaxed);
    madvise(data_, size_, MADV_DONTNEED);
}

bool TileMemory::isFull() const
{
    return touched_ << TileBlock::kWindowBits > limit_ - std::min(limit_, held_);
}

void TileMemory::dropPages()
{
    // Who comes meanwhile waits: else all of a picture might be touched while this goes on, and
    // nothing be touched first afterwards.
    std::lock_guard const lock(mutex_);
    if (!isFull())
        return;
    touched_ = 0;
    for (TileBlock* const block : scratch_)
        block->dropPages();
}

std::filesystem::path TileMemory::scratchFolder()
{
    char const* const folder = std::getenv("TMPDIR");
    return folder && *folder ? folder : "/var/tmp";
}

std::unique_ptr<TileBlock> TileMemory::allocate(std::size_t size)
{
    std::unique_ptr<TileBlock> block(new TileBlock(*this, size));
    bool const fits = held_ + size <= limit_ / 2;
    if (fits || !block->openScratch(scratchFolder())) {
        block->bytes_.reset(new std::byte[size]);
        held_ += size;
        overflow_ += fits ? 0 : size;
    }
    return block;
}

} // namespace zsi::host
