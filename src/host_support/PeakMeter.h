// Measures peaks on several threads.
#pragma once

#include "host_support/AudioTools.h"
#include "peru/threads/IThreadManager.h"

#include <condition_variable>
#include <deque>
#include <mutex>
#include <vector>

namespace tonewright::host_support {

// The sound is cut into parts of some seconds, which helper threads measure. The peaks are those of a single
// measurement. All functions are called by one thread, which takes parts itself when the helpers fall behind;
// the destructor drops parts that have not been measured.
class CPeakMeter {
public:
    // The library has forgetPeaks.
    CPeakMeter(const P<CAudioTools>& tools, const SAnalysedFormat& format, int helpers);
    ~CPeakMeter();
    CPeakMeter(const CPeakMeter&) = delete;
    CPeakMeter& operator=(const CPeakMeter&) = delete;

    void add(const uint8_t* bytes, size_t count);
    // Waits for all parts. Throws std::bad_alloc if one could not be measured.
    void finish(double& samplePeak, double& truePeak);

private:
    struct SPart {
        std::vector<uint8_t> bytes;
        size_t lead = 0; // bytes of the part before at the beginning
    };
    struct SHelper {
        CPeakMeter* meter;
        TONEWRIGHT_Analysator* analysator;
    };

    void startHelpers(int count);
    void cut(size_t bytes); // behind the lead
    void help(TONEWRIGHT_Analysator* analysator);
    // With the lock, which is not held meanwhile.
    void measureNext(std::unique_lock<std::mutex>& lock, TONEWRIGHT_Analysator* analysator);

    const P<CAudioTools> m_tools;
    const SAnalysedFormat m_format;
    const size_t m_leadBytes;
    const size_t m_partBytes;
    std::vector<Analysator> m_analysators; // of the caller and the helpers
    std::vector<SHelper> m_helpers;
    std::vector<P<peru::IThread>> m_threads;
    SPart m_filling;

    std::mutex m_mutex; // guards everything below
    std::condition_variable m_changed;
    std::deque<SPart> m_waiting;
    bool m_isEnding = false; // no more parts follow
    bool m_isFailed = false;
    double m_samplePeak = 0.0;
    double m_truePeak = 0.0;
};

} // namespace tonewright::host_support
