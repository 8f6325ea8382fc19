// SPDX-License-Identifier: Apache-2.0
#include "base/replacedFile.h"

#include "base/error.h"

#include <array>
#include <atomic>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <fmt/format.h>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

namespace zsi::host {
namespace {

/// Names of files being written, for `removeAll`; more at once than are ever written.
std::array<std::atomic<char const*>, 16> openFiles{};
static_assert(std::atomic<char const*>::is_always_lock_free);

void remember(char const* name)
{
    for (auto& slot : openFiles) {
        char const* free = nullptr;
        if (slot.compare_exchange_strong(free, name))
            return;
    }
}

void forget(char const* name)
{
    for (auto& slot : openFiles) {
        char const* expected = name;
        if (slot.compare_exchange_strong(expected, nullptr))
            return;
    }
}

std::filesystem::path behindLinks(std::filesystem::path file)
{
    std::error_code error;
    for (int links = 0; links < 40 && std::filesystem::is_symlink(file, error); ++links) {
        std::filesystem::path const target = std::filesystem::read_symlink(file, error);
        file = target.is_absolute() ? target : file.parent_path() / target;
    }
    return file;
}

} // namespace

ReplacedFile::ReplacedFile(std::filesystem::path const& file)
    : name_(file)
{
    struct stat there = {};
    bool const exists = stat(file.c_str(), &there) == 0;
    if (exists && S_ISDIR(there.st_mode))
        throw InputError(name_.string() + ": cannot be written: it is a folder");
    if (exists && !S_ISREG(there.st_mode)) {
        // By its own name: what /dev/stdout leads to has no other one.
        descriptor_ = open(file.c_str(), O_WRONLY | O_CLOEXEC);
        if (descriptor_ < 0)
            fail(errno);
        return;
    }
    goal_ = behindLinks(file);
    if (exists && access(goal_.c_str(), W_OK) != 0)
        fail(errno);
    createTemporary();
    mode_t const mask = umask(0);
    umask(mask);
    if (exists && fchown(descriptor_, there.st_uid, there.st_gid) != 0)
        there.st_mode &= 0777u; // not ours to give away, and then not with its owner's rights
    fchmod(descriptor_, exists ? there.st_mode & 07777 : 0666 & ~mask);
}

ReplacedFile::~ReplacedFile()
{
    if (descriptor_ >= 0)
        close(descriptor_);
    if (!temporary_.empty()) {
        unlink(temporary_.c_str());
        forget(temporary_.c_str());
    }
}

void ReplacedFile::createTemporary()
{
    do {
        forget(temporary_.c_str());
        std::uint64_t random = 0;
        if (getentropy(&random, sizeof(random)) != 0)
            fail(errno);
        // A name of its own length, however long the goal's is; remembered before it is there, so
        // that no signal finds it without.
        temporary_ = goal_.parent_path() / fmt::format(".zsi-{:016x}", random);
        remember(temporary_.c_str());
        descriptor_ = open(temporary_.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600);
    } while (descriptor_ < 0 && errno == EEXIST);
    if (descriptor_ >= 0)
        return;
    int const error = errno;
    forget(temporary_.c_str());
    temporary_.clear();
    fail(error);
}

void ReplacedFile::write(std::span<unsigned char const> bytes)
{
    while (!bytes.empty()) {
        ssize_t const n = ::write(descriptor_, bytes.data(), bytes.size());
        if (n < 0 && errno != EINTR)
            fail(errno);
        bytes = bytes.subspan(n > 0 ? static_cast<std::size_t>(n) : 0);
    }
}

void ReplacedFile::commit()
{
    if (close(std::exchange(descriptor_, -1)) != 0) // some disks tell only now
        fail(errno);
    if (temporary_.empty())
        return;
    if (rename(temporary_.c_str(), goal_.c_str()) != 0)
        fail(errno);
    forget(temporary_.c_str());
    temporary_.clear();
}

void ReplacedFile::check(std::filesystem::path const& file)
{
    // Opening a pipe would wait for its reader, and closing it again would end him.
    struct stat there = {};
    if (stat(file.c_str(), &there) == 0 && !S_ISREG(there.st_mode) && !S_ISDIR(there.st_mode)) {
        if (access(file.c_str(), W_OK) != 0)
            throw InputError(file.string() + ": cannot be written: " + std::strerror(errno));
        return;
    }
    ReplacedFile const tried(file);
}

void ReplacedFile::removeAll() noexcept
{
    for (auto const& slot : openFiles)
        if (char const* const name = slot.load())
            unlink(name);
}

void ReplacedFile::fail(int error) const
{
    throw InputError(name_.string() + ": cannot be written: " + std::strerror(error));
}

} // namespace zsi::host
