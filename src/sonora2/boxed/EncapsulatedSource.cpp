#include "sonora2/boxed/EncapsulatedSource.h"

#include "peru/strings/StringFormat.h"
#include "sonora2/plugins/ParameterRecord.h"

#include <algorithm>
#include <utility>

namespace sonora2::common {

namespace {

// Runs start small, so that the first chunk after a skip arrives soon.
constexpr int kFirstRun = 1;
constexpr int kSecondRun = 32 * 1024;
constexpr int kLongestRun = 128 * 1024; // bytes; what a pipe takes without waiting for its reader

} // namespace

CEncapsulatedSource::CEncapsulatedSource(const P<ISonoraContext>& context, const P<peru::IString>& pluginName,
                                         const P<peru::IURI>& uri, int types, const SSourceParams* params)
    : TBoxedMedia(context, pluginName, uri), m_types(types), m_params(receiveRecord(params)),
      m_prefetch([this](const std::function<void()>& locked, P<ISonoraPicture>& picture) {
          return fetchPicture(locked, picture);
      }) {}

CEncapsulatedSource::~CEncapsulatedSource() {
    m_prefetch.stop();
}

bool CEncapsulatedSource::prepare() {
    const peru::CMutexLock lock(m_guard);
    if (m_client && !hasFailed()) return true;
    m_isApplied = false;
    forgetChunks();
    return createIn("tryCreateSource", [this](CSonoraPluginClient& plugin) {
        return P<CSourceClient>(plugin.tryCreateSource(m_uri, m_types, true, &m_params));
    });
}

bool CEncapsulatedSource::isOpened() {
    const peru::CMutexLock lock(m_guard);
    return m_client && m_state->isOpened;
}

void CEncapsulatedSource::applySettings(CSourceClient& client) {
    const auto call = [&client](const P<peru::CRemoteFunction>& proc) { client.call(proc); };
    if (m_salvage) {
        const auto proc = peru::make<SRemoteFacets::setSalvageFunction>();
        proc->bSalvage->setValue(*m_salvage);
        call(proc);
    }
    if (m_preventClipping) {
        const auto proc = peru::make<SRemoteFacets::setClippingPreventionFunction>();
        proc->bPrevent->setValue(*m_preventClipping);
        call(proc);
    }
    if (m_deliveredFormat) {
        const auto proc = peru::make<SRemoteFacets::setDeliveredFormatFunction>();
        proc->nSampleRate->setValue((*m_deliveredFormat)[0]);
        proc->nChannelCount->setValue((*m_deliveredFormat)[1]);
        proc->nBytesPerSample->setValue((*m_deliveredFormat)[2]);
        call(proc);
    }
    if (m_audioStream) client.setAudioStream(*m_audioStream);
    if (m_startTime != 0.0) client.setStartTime(m_startTime);
    if (m_maxWidth != 0 || m_maxHeight != 0) client.setMaxSize(m_maxWidth, m_maxHeight);
}

void CEncapsulatedSource::open() {
    const peru::CMutexLock lock(m_guard);
    if (!prepare())
        throw CSonoraError(peru::format("could not create source \"%s\" in slave", m_uri->getAsString()));
    if (!m_isApplied) {
        forgetChunks();
        changeLocked("open", [this](CSourceClient& client) {
            applySettings(client);
            client.open();
        });
        m_isApplied = true;
    } else {
        changeLocked("open", [](CSourceClient& client) { client.open(); });
    }
    if (!m_state->isOpened)
        throw CSonoraError(peru::format("source could not be created \"%s\"", m_uri->getAsString()));
    if (has(kFacetVideo) && m_context->getSwitchB()) m_prefetch.start();
}

void CEncapsulatedSource::close() {
    m_prefetch.stop();
    const peru::CMutexLock lock(m_guard);
    forgetChunks();
    m_isApplied = false;
    m_frameDuration = 0.0;
    if (hasFailed()) drop();
    if (m_client) changeLocked("close", [](CSourceClient& client) { client.close(); });
}

void CEncapsulatedSource::skipToTime(double fTimestamp) {
    change("skipToTime", [&](CSourceClient& client) {
        forgetChunks();
        m_prefetch.clear();
        client.skipToTime(fTimestamp);
    });
}

double CEncapsulatedSource::getDuration() {
    const peru::CMutexLock lock(m_guard);
    return m_client ? m_state->duration : 0.0;
}

int CEncapsulatedSource::getBufferStatus() {
    return forward("getBufferStatus", [](CSourceClient& client) { return client.getBufferStatus(); });
}

bool CEncapsulatedSource::isEOF() {
    if (m_prefetch.isRunning() && !m_prefetch.isAtEnd()) return false;
    const peru::CMutexLock lock(m_guard);
    if (!m_client || !m_chunks.empty() || m_chunkFailure) return false;
    if (!has(kFacetVideo)) return m_state->isEOF;
    return forward("isEOF", [](CSourceClient& client) { return client.isEOF(); });
}

void CEncapsulatedSource::setStartTime(double fStartTime) {
    change("setStartTime", [&](CSourceClient& client) {
        forgetChunks();
        m_prefetch.clear();
        client.setStartTime(fStartTime);
    });
    const peru::CMutexLock lock(m_guard);
    m_startTime = fStartTime;
}

double CEncapsulatedSource::getStartTime() {
    const peru::CMutexLock lock(m_guard);
    return m_startTime;
}

// --- Sound ---

void CEncapsulatedSource::forgetChunks() {
    m_chunks.clear();
    m_chunkFailure = nullptr;
    m_runBytes = kFirstRun;
}

// Sets the slave's source back to the first chunk that the caller has not seen.
void CEncapsulatedSource::returnChunks(CSourceClient& client) {
    if (!m_chunks.empty() && m_chunks.front()) client.skipToTime(m_chunks.front()->getTimestamp());
    forgetChunks();
}

void CEncapsulatedSource::fetchChunks() {
    const P<audio::CAudioRun> run =
        m_slave->call("getNextAudioChunk", [this] { return m_client->getNextAudioChunks(m_runBytes); });
    m_runBytes = std::clamp(m_runBytes * 2, kSecondRun, kLongestRun);
    m_chunks.assign(run->chunks.begin(), run->chunks.end());
    m_state->isEOF = run->isEOF;
    m_state->duration = run->duration;
    if (!run->failure->isEmpty()) m_chunkFailure = run->failure;
    replay(run->log);
}

P<audio::IAudioChunk> CEncapsulatedSource::getNextAudioChunk() {
    checkSlave();
    const peru::CMutexLock lock(m_guard);
    if (!m_client || !has(kFacetAudio)) return nullptr;
    if (m_chunks.empty() && !m_chunkFailure) fetchChunks();
    if (m_chunks.empty()) {
        if (m_chunkFailure) throw CSonoraError(std::exchange(m_chunkFailure, nullptr));
        return nullptr;
    }
    P<audio::IAudioChunk> chunk = std::move(m_chunks.front());
    m_chunks.pop_front();
    return chunk;
}

P<audio::IAudioStreamInfos> CEncapsulatedSource::getAudioStreamInfos() {
    return forward("getAudioStreamInfos", [](CSourceClient& client) { return client.getAudioStreamInfos(); });
}

void CEncapsulatedSource::setAudioStream(int nAudioIndex) {
    change("setAudioStream", [&](CSourceClient& client) {
        returnChunks(client);
        client.setAudioStream(nAudioIndex);
    });
    const peru::CMutexLock lock(m_guard);
    m_audioStream = nAudioIndex;
}

int CEncapsulatedSource::getSampleRate() {
    const peru::CMutexLock lock(m_guard);
    return m_client ? m_state->sampleRate : 0;
}

int CEncapsulatedSource::getChannelCount() {
    const peru::CMutexLock lock(m_guard);
    return m_client ? m_state->channelCount : 0;
}

int CEncapsulatedSource::getBytesPerSample() {
    const peru::CMutexLock lock(m_guard);
    return m_client ? m_state->bytesPerSample : 0;
}

// --- Video ---

template <class Call> auto CEncapsulatedSource::forwardVideo(const char* operation, Call call) {
    return forward(operation, [&](CSourceClient& client) {
        return has(kFacetVideo) ? call(client) : decltype(call(client))();
    });
}

void CEncapsulatedSource::setMaxSize(int nWidth, int nHeight) {
    {
        const peru::CMutexLock lock(m_guard);
        m_maxWidth = nWidth;
        m_maxHeight = nHeight;
        if (!has(kFacetVideo)) return;
    }
    change("setMaxSize", [&](CSourceClient& client) { client.setMaxSize(nWidth, nHeight); });
}

int CEncapsulatedSource::getWidth() {
    return forwardVideo("getWidth", [](CSourceClient& client) { return client.getWidth(); });
}

int CEncapsulatedSource::getHeight() {
    return forwardVideo("getHeight", [](CSourceClient& client) { return client.getHeight(); });
}

// On the prefetching thread.
CPicturePrefetch::EFetched CEncapsulatedSource::fetchPicture(const std::function<void()>& locked,
                                                             P<ISonoraPicture>& picture) {
    const peru::CMutexLock lock(m_guard);
    locked();
    if (!m_client) return CPicturePrefetch::EFetched::end;
    const bool isEnd = m_slave->call("getNextPicture", [&] {
        if (m_client->isEOF()) return true;
        picture = m_client->getNextPicture();
        return false;
    });
    return isEnd ? CPicturePrefetch::EFetched::end : CPicturePrefetch::EFetched::picture;
}

double CEncapsulatedSource::peekNextPictureTimestamp() {
    if (m_prefetch.isRunning())
        if (const P<ISonoraPicture> picture = m_prefetch.peek()) return picture->getTimestamp();
    return forwardVideo("peekNextPictureTimestamp",
                        [](CSourceClient& client) { return client.peekNextPictureTimestamp(); });
}

P<ISonoraPicture> CEncapsulatedSource::getNextPicture() {
    if (!m_prefetch.isRunning())
        return forwardVideo("getNextPicture", [](CSourceClient& client) { return client.getNextPicture(); });
    checkSlave();
    return m_prefetch.take();
}

int CEncapsulatedSource::getPixelAspectNum() {
    return forwardVideo("getPixelAspectNum",
                        [](CSourceClient& client) { return client.getPixelAspectNum(); });
}

int CEncapsulatedSource::getPixelAspectDen() {
    return forwardVideo("getPixelAspectDen",
                        [](CSourceClient& client) { return client.getPixelAspectDen(); });
}

double CEncapsulatedSource::getFrameDuration() {
    const peru::CMutexLock lock(m_guard);
    if (m_frameDuration <= 0.0)
        m_frameDuration =
            forwardVideo("getFrameDuration", [](CSourceClient& client) { return client.getFrameDuration(); });
    return m_frameDuration;
}

int CEncapsulatedSource::getFrameRateNum() {
    return forwardVideo("getFrameRateNum", [](CSourceClient& client) { return client.getFrameRateNum(); });
}

int CEncapsulatedSource::getFrameRateDen() {
    return forwardVideo("getFrameRateDen", [](CSourceClient& client) { return client.getFrameRateDen(); });
}

} // namespace sonora2::common
