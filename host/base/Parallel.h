// Spreads work over several threads.
#pragma once

#include <cstddef>
#include <functional>

namespace host {

// Calls `work` for each number below `count`, in their order, on this thread and as many others as make
// `threads`. Ctrl-C skips those that are left. `work` must not throw.
void runParallel(size_t count, int threads, const std::function<void(size_t)>& work);

} // namespace host
