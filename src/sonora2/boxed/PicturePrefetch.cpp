#include "sonora2/boxed/PicturePrefetch.h"

#include "peru/Errors.h"

namespace sonora2::common {

namespace {

constexpr size_t kMostPictures = 3;
constexpr uint32_t kIdleWait = 1000;    // milliseconds
constexpr uint32_t kPictureWait = 5000; // milliseconds

class CWork : public peru::CObject, public peru::IAction {
public:
    explicit CWork(std::function<void()> body) : m_body(std::move(body)) {}
    void run() override { m_body(); }

private:
    std::function<void()> m_body;
};

} // namespace

CPicturePrefetch::CPicturePrefetch(Fetch fetch)
    : m_fetch(std::move(fetch)), m_mutex(peru::getMutexFactory()->createMutex()),
      m_stop(peru::getSignalFactory()->createSignal()),
      m_moreWanted(peru::getSignalFactory()->createSignal()) {}

CPicturePrefetch::~CPicturePrefetch() {
    stop();
}

void CPicturePrefetch::start() {
    if (m_running) return;
    clear();
    m_stop->reset();
    m_running = true;
    try {
        m_thread =
            peru::getThreadManager()->createThread(P<peru::IAction>(peru::make<CWork>([this] { work(); })));
    } catch (...) {
        m_running = false; // pictures are fetched when they are wanted
        throw;
    }
}

void CPicturePrefetch::stop() {
    if (!m_thread) return;
    m_running = false;
    m_stop->set();
    m_moreWanted->set();
    m_thread->wait();
    m_thread = nullptr;
    clear();
}

void CPicturePrefetch::clear() {
    {
        const peru::CMutexLock lock(m_mutex);
        m_pictures.clear();
        m_isAtEnd = false;
        m_failure = nullptr;
        ++m_generation;
    }
    m_moreWanted->set();
}

bool CPicturePrefetch::isAtEnd() const {
    if (isPending()) return false;
    const peru::CMutexLock lock(m_mutex);
    return m_pictures.empty() && m_isAtEnd;
}

void CPicturePrefetch::work() {
    while (m_running && !m_stop->wait(0)) {
        m_moreWanted->wait(kIdleWait);
        if (m_stop->wait(0)) return;
        bool isFull;
        uint64_t generation;
        {
            const peru::CMutexLock lock(m_mutex);
            generation = m_generation;
            isFull = m_pictures.size() >= kMostPictures || m_isAtEnd || m_failure;
            // Otherwise a request that arrives just as the wait ends would be lost.
            if (isFull) m_moreWanted->reset();
        }
        if (isFull) continue;
        P<peru::CException> failure;
        try {
            P<ISonoraPicture> picture;
            const auto locked = [&] {
                const peru::CMutexLock lock(m_mutex);
                generation = m_generation;
            };
            const bool isEnd = m_fetch(locked, picture) == EFetched::end;
            append(picture, generation, isEnd);
        } catch (const peru::CException& exception) {
            failure = exception.clone();
        } catch (const std::exception&) {
            failure = peru::CError("std::exception in CEncapsulatedSource", "CEncapsulatedSource").clone();
        } catch (...) {
            failure = peru::CError("unknown exception in buffering thread").clone();
        }
        if (!failure) continue;
        const peru::CMutexLock lock(m_mutex);
        if (generation == m_generation) m_failure = failure; // not one from before a change of the position
    }
}

void CPicturePrefetch::append(const P<ISonoraPicture>& picture, uint64_t generation, bool isEnd) {
    const peru::CMutexLock lock(m_mutex);
    if (generation != m_generation) return; // from before a change of the position
    m_isAtEnd = isEnd;
    if (!isEnd) m_pictures.push_back(picture);
    if (m_pictures.size() >= kMostPictures) m_moreWanted->reset();
}

bool CPicturePrefetch::isPending() const {
    for (uint32_t waited = 0;; ++waited) {
        {
            const peru::CMutexLock lock(m_mutex);
            if (!m_pictures.empty() || m_isAtEnd || m_failure) return false;
        }
        if (waited == kPictureWait) return true;
        peru::getThreadManager()->sleep(1);
    }
}

void CPicturePrefetch::waitForPicture() {
    if (isPending()) throw peru::CError("CEncapsulatedSource: timeout while prefetching image");
    const peru::CMutexLock lock(m_mutex);
    if (m_pictures.empty() && m_failure) m_failure->raise();
}

P<ISonoraPicture> CPicturePrefetch::take() {
    waitForPicture();
    P<ISonoraPicture> picture;
    {
        const peru::CMutexLock lock(m_mutex);
        if (m_pictures.empty()) return nullptr;
        picture = m_pictures.front();
        m_pictures.pop_front();
    }
    m_moreWanted->set();
    return picture;
}

P<ISonoraPicture> CPicturePrefetch::peek() {
    waitForPicture();
    const peru::CMutexLock lock(m_mutex);
    return m_pictures.empty() ? nullptr : m_pictures.front();
}

} // namespace sonora2::common
