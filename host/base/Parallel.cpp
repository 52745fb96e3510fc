#include "base/Parallel.h"

#include "base/Cancel.h"

#include <algorithm>
#include <atomic>
#include <system_error>
#include <thread>
#include <vector>

namespace host {

void runParallel(size_t count, int threads, const std::function<void(size_t)>& work) {
    std::atomic<size_t> next{0};
    const auto loop = [&] {
        for (size_t i; !isCancelled() && (i = next++) < count;) work(i);
    };
    std::vector<std::thread> others;
    try {
        for (size_t i = 1; i < std::min(static_cast<size_t>(threads), count); ++i) others.emplace_back(loop);
    } catch (const std::system_error&) {
        // No more threads available: the existing ones do all the work.
    }
    loop();
    for (std::thread& thread : others) thread.join();
}

} // namespace host
