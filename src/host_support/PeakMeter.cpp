#include "host_support/PeakMeter.h"

#include "peru/Errors.h"

#include <algorithm>
#include <new>
#include <utility>

namespace tonewright::host_support {

namespace {

constexpr size_t kLeadFrames = 64; // see forgetAnalysatorPeaks()
constexpr size_t kPartBytes = 512 * 1024;
constexpr size_t kWaitingPerThread = 2;

} // namespace

CPeakMeter::CPeakMeter(const P<CAudioTools>& tools, const SAnalysedFormat& format, int helpers)
    : m_tools(tools), m_format(format),
      m_leadBytes(kLeadFrames * static_cast<size_t>(format.channels * format.bytesPerSample)),
      m_partBytes(std::max(kPartBytes / m_leadBytes, size_t{1}) * m_leadBytes) {
    const int flags = TONEWRIGHT_ANALYSATOR_PEAKS | (format.isFloat ? TONEWRIGHT_ANALYSATOR_FLOAT : 0);
    for (int i = 0; i <= helpers; ++i) {
        m_analysators.emplace_back(m_tools->create(flags));
        if (!m_analysators.back()) throw std::bad_alloc();
    }
    startHelpers(helpers);
}

CPeakMeter::~CPeakMeter() {
    {
        std::lock_guard lock(m_mutex);
        m_waiting.clear();
        m_isEnding = true;
    }
    m_changed.notify_all();
    for (const P<peru::IThread>& thread : m_threads) thread->wait();
}

void CPeakMeter::startHelpers(int count) {
    m_helpers.reserve(static_cast<size_t>(count));
    try {
        for (int i = 1; i <= count; ++i) {
            m_helpers.push_back({this, m_analysators[static_cast<size_t>(i)].get()});
            peru::SThreadBody body;
            body.function = [](peru::IBase*, void* argument) {
                const auto* helper = static_cast<SHelper*>(argument);
                helper->meter->help(helper->analysator);
            };
            body.argument = &m_helpers.back();
            m_threads.push_back(peru::getThreadManager()->createThread(body));
        }
    } catch (const peru::CException&) {
        // No more threads available: the existing ones do all the work.
    }
}

void CPeakMeter::add(const uint8_t* bytes, size_t count) {
    std::vector<uint8_t>& filling = m_filling.bytes;
    filling.insert(filling.end(), bytes, bytes + count);
    while (filling.size() - m_filling.lead >= m_partBytes) cut(m_partBytes);
}

void CPeakMeter::cut(size_t bytes) {
    const size_t end = m_filling.lead + bytes, lead = std::min(end, m_leadBytes);
    SPart next;
    next.lead = lead;
    next.bytes.reserve(m_leadBytes + 2 * m_partBytes);
    next.bytes.assign(m_filling.bytes.begin() + static_cast<ptrdiff_t>(end - lead), m_filling.bytes.end());
    m_filling.bytes.resize(end);
    {
        std::unique_lock lock(m_mutex);
        m_waiting.push_back(std::exchange(m_filling, std::move(next)));
        const size_t most = kWaitingPerThread * m_threads.size();
        if (m_waiting.size() > most) measureNext(lock, m_analysators.front().get());
    }
    m_changed.notify_one();
}

void CPeakMeter::measureNext(std::unique_lock<std::mutex>& lock, TONEWRIGHT_Analysator* analysator) {
    const SPart part = std::move(m_waiting.front());
    m_waiting.pop_front();
    lock.unlock();
    const auto& operations = *analysator->operations;
    operations.initialise(analysator, m_format.channels, m_format.bytesPerSample, m_format.rate);
    operations.analyse(analysator, part.bytes.data(), static_cast<int64_t>(part.lead));
    double samplePeak = 0.0, truePeak = 0.0;
    bool isMeasured = m_tools->forgetPeaks(analysator) != 0;
    operations.analyse(analysator, part.bytes.data() + part.lead,
                       static_cast<int64_t>(part.bytes.size() - part.lead));
    isMeasured = isMeasured && m_tools->getPeaks(analysator, &samplePeak, &truePeak) != 0;
    lock.lock();
    m_isFailed = m_isFailed || !isMeasured;
    m_samplePeak = std::max(m_samplePeak, samplePeak);
    m_truePeak = std::max(m_truePeak, truePeak);
}

void CPeakMeter::help(TONEWRIGHT_Analysator* analysator) {
    std::unique_lock lock(m_mutex);
    while (true) {
        m_changed.wait(lock, [this] { return m_isEnding || !m_waiting.empty(); });
        if (m_waiting.empty()) return;
        measureNext(lock, analysator);
    }
}

void CPeakMeter::finish(double& samplePeak, double& truePeak) {
    cut(m_filling.bytes.size() - m_filling.lead);
    {
        std::unique_lock lock(m_mutex);
        m_isEnding = true;
        m_changed.notify_all();
        while (!m_waiting.empty()) measureNext(lock, m_analysators.front().get());
    }
    for (const P<peru::IThread>& thread : m_threads) thread->wait();
    if (m_isFailed) throw std::bad_alloc();
    samplePeak = m_samplePeak;
    truePeak = m_truePeak;
}

} // namespace tonewright::host_support
