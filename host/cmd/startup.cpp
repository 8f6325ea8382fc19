// SPDX-License-Identifier: Apache-2.0
// What the libraries under the host need before they run: some start threads and allocate as they
// are loaded, and end the program when they cannot.
#include <algorithm>
#include <array>
#include <pthread.h>
#include <string_view>
#include <sys/mman.h>
#include <unistd.h>

namespace {

constexpr std::size_t kMemory = std::size_t(128) << 20; ///< twice what starting takes
constexpr std::size_t kThreads = 5; ///< as many as a logger among them starts

[[noreturn]] void giveUp(std::string_view message)
{
    if (write(STDERR_FILENO, message.data(), message.size()) < 0)
        _exit(2); // nowhere to tell it
    _exit(1);
}

void checkResources()
{
    void* const memory =
        mmap(nullptr, kMemory, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
    if (memory == MAP_FAILED)
        giveUp("zsi: out of memory\n");
    munmap(memory, kMemory);

    // All at once: each waits until the last one is there.
    pthread_mutex_t gate = PTHREAD_MUTEX_INITIALIZER;
    pthread_mutex_lock(&gate);
    std::array<pthread_t, kThreads> threads;
    auto const wait = [](void* mutex) -> void* {
        pthread_mutex_lock(static_cast<pthread_mutex_t*>(mutex));
        pthread_mutex_unlock(static_cast<pthread_mutex_t*>(mutex));
        return nullptr;
    };
    std::size_t started = 0;
    while (started < kThreads && pthread_create(&threads[started], nullptr, wait, &gate) == 0)
        ++started;
    pthread_mutex_unlock(&gate);
    std::for_each(threads.begin(), threads.begin() + started,
                  [](pthread_t thread) { pthread_join(thread, nullptr); });
    if (started < kThreads)
        giveUp("zsi: no more threads can be started (ulimit -u, ulimit -v)\n");
}

// Called before any library's own initialisation.
[[gnu::section(".preinit_array"), gnu::used]] void (*const beforeLibraries)() = checkResources;

} // namespace
