#include "peru/threads/AlternateStack.h"

#include <csignal>
#include <sys/mman.h>

namespace peru {

namespace {

constexpr size_t kSize = 128 * 1024; // only the pages that are used take memory
constexpr size_t kLeastSize = 64 * 1024;

void setStack(void* memory, size_t size) {
    stack_t stack = {};
    stack.ss_sp = memory;
    stack.ss_size = size;
    stack.ss_flags = memory ? 0 : SS_DISABLE;
    ::sigaltstack(&stack, nullptr);
}

} // namespace

CAlternateStack::CAlternateStack() noexcept {
    stack_t current = {};
    if (::sigaltstack(nullptr, &current) != 0) return;
    const bool hasStack = !(current.ss_flags & SS_DISABLE);
    if (hasStack && current.ss_size >= kLeastSize) return;
    void* memory =
        ::mmap(nullptr, kSize, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS | MAP_STACK, -1, 0);
    if (memory == MAP_FAILED) return;
    m_memory = memory;
    if (hasStack) m_previous = current.ss_sp, m_previousSize = current.ss_size;
    setStack(m_memory, kSize);
}

CAlternateStack::~CAlternateStack() {
    if (!m_memory) return;
    stack_t current = {};
    // Somebody else may have set another one since.
    if (::sigaltstack(nullptr, &current) != 0 || current.ss_sp != m_memory) return;
    setStack(m_previous, m_previousSize);
    ::munmap(m_memory, kSize);
}

void CAlternateStack::useForCurrentThread() noexcept {
    thread_local CAlternateStack stack;
    static_cast<void>(stack);
}

} // namespace peru
