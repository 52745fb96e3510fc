#include "sonora2/boxed/EncapsulatedFormat.h"

#include "peru/strings/StringFormat.h"
#include "sonora2/boxed/BoxedSettings.h"
#include "sonora2/context/LoggedCall.h"
#include "sonora2/media/IDiscardable.h"
#include "sonora2/media/IFloatSamples.h"
#include "sonora2/media/IFormatSettings.h"
#include "sonora2/plugins/ParameterRecord.h"

#include <algorithm>
#include <limits>

namespace sonora2::common {

namespace {

// How long an error of writing may stay unnoticed. Asking more often would make the two processes wait for
// each other instead of working at the same time.
constexpr std::chrono::milliseconds kCheckInterval{250};

// Extends the deadline while a file is completed.
class CPatience {
public:
    CPatience(const P<CSlaveHandler>& slave, const P<CFormatClient>& client)
        : m_slave(slave), m_client(client), m_deadline(slave->getDeadline()) {
        constexpr uint64_t kMost = std::numeric_limits<int32_t>::max();
        set(static_cast<uint32_t>(std::min(kMost, uint64_t{m_deadline} * kCloseDeadlineFactor)));
    }
    ~CPatience() { set(m_deadline); }
    CPatience(const CPatience&) = delete;
    CPatience& operator=(const CPatience&) = delete;

private:
    void set(uint32_t milliseconds) {
        m_slave->setDeadline(milliseconds);
        m_client->setDeadline(milliseconds);
    }

    P<CSlaveHandler> m_slave;
    P<CFormatClient> m_client;
    uint32_t m_deadline;
};

} // namespace

CEncapsulatedFormat::CEncapsulatedFormat(const P<ISonoraContext>& context, const P<peru::IString>& pluginName,
                                         const P<peru::IURI>& uri, int types, const SFormatParams* params)
    : TBoxedMedia(context, pluginName, uri), m_types(types), m_params(receiveRecord(params)) {}

CEncapsulatedFormat::~CEncapsulatedFormat() {
    callLogged(nullptr, [this] {
        if (m_client && m_state->isOpened && !hasFailed()) close();
    });
}

bool CEncapsulatedFormat::prepare() {
    const peru::CMutexLock lock(m_guard);
    if (m_client && !hasFailed()) return true;
    m_isApplied = false;
    return createIn("tryCreateFormat", [this](CSonoraPluginClient& plugin) {
        return P<CFormatClient>(plugin.tryCreateFormat(m_uri, m_types, true, &m_params));
    });
}

bool CEncapsulatedFormat::isOpened() {
    const peru::CMutexLock lock(m_guard);
    return m_client && m_state->isOpened;
}

void CEncapsulatedFormat::applySettings(CFormatClient& client) {
    if (m_quality) client.setAudioQuality(*m_quality);
    if (m_bitRate) client.setAudioBitRate((*m_bitRate)[0], (*m_bitRate)[1], (*m_bitRate)[2]);
}

void CEncapsulatedFormat::open() {
    const peru::CMutexLock lock(m_guard);
    const bool wasOpened = isOpened() && !hasFailed();
    if (!prepare())
        throw CSonoraError(peru::format("could not create format \"%s\" in slave", m_uri->getAsString()));
    if (!wasOpened) m_output.expect(m_uri);
    try {
        changeLocked("open", [this](CFormatClient& client) {
            if (!m_isApplied) applySettings(client);
            client.open();
        });
    } catch (...) {
        // An opening that has failed leaves nothing behind, and nobody will ask for that.
        if (hasFailed())
            m_output.remove();
        else if (!wasOpened)
            m_output.forget();
        throw;
    }
    m_isApplied = true;
    if (!m_state->isOpened)
        throw CSonoraError(peru::format("format could not be created \"%s\"", m_uri->getAsString()));
    if (!wasOpened) m_output.opened();
    m_lastCheck = std::chrono::steady_clock::now();
}

void CEncapsulatedFormat::close() {
    const peru::CMutexLock lock(m_guard);
    if (!m_client) return;
    const bool wasOpened = m_state->isOpened;
    if (hasFailed()) {
        const P<CSlaveHandler> slave = m_slave;
        m_client = nullptr; // closed now, even though not as intended
        if (wasOpened) slave->checkForSlaveError();
        return;
    }
    const CPatience patience(m_slave, m_client);
    changeLocked("close", [](CFormatClient& client) { client.close(); });
    m_output.forget();
}

void CEncapsulatedFormat::discard() noexcept {
    const peru::CMutexLock lock(m_guard);
    const bool isDone = m_client && !hasFailed() && callLogged(nullptr, [this] {
                            changeLocked("discard", [](CFormatClient& client) {
                                client.call(peru::make<SRemoteFacets::discardFunction>());
                            });
                        });
    if (isDone) {
        m_output.forget();
        return;
    }
    m_output.remove();
    m_client = nullptr;
}

int64_t CEncapsulatedFormat::getEstimatedSizeBytes(double fDuration) {
    return forward("getEstimatedSizeBytes",
                   [&](CFormatClient& client) { return client.getEstimatedSizeBytes(fDuration); });
}

// --- Sound ---

int CEncapsulatedFormat::getSampleRate() {
    const peru::CMutexLock lock(m_guard);
    return m_client ? m_state->sampleRate : m_params.nSampleRate;
}

int CEncapsulatedFormat::getChannelCount() {
    const peru::CMutexLock lock(m_guard);
    return m_client ? m_state->channelCount : m_params.nChannelCount;
}

int CEncapsulatedFormat::getBytesPerSample() {
    const peru::CMutexLock lock(m_guard);
    return m_client ? m_state->bytesPerSample : m_params.nBytesPerSample;
}

void CEncapsulatedFormat::setAudioQuality(double fQuality) {
    change("setAudioQuality", [&](CFormatClient& client) { client.setAudioQuality(fQuality); });
    const peru::CMutexLock lock(m_guard);
    m_quality = fQuality;
}

void CEncapsulatedFormat::setAudioBitRate(int nNominal, int nMin, int nMax) {
    change("setAudioBitRate", [&](CFormatClient& client) { client.setAudioBitRate(nNominal, nMin, nMax); });
    const peru::CMutexLock lock(m_guard);
    m_bitRate = {nNominal, nMin, nMax};
}

template <class Write> void CEncapsulatedFormat::write(const char* operation, bool isDoubtful, Write write) {
    checkSlave();
    const peru::CMutexLock lock(m_guard);
    if (!m_client) return;
    const auto now = std::chrono::steady_clock::now();
    if (isDoubtful || !m_state->isOpened || now - m_lastCheck >= kCheckInterval) {
        changeLocked(operation, write);
        m_lastCheck = now;
    } else {
        m_slave->call(operation, [&] { write(*m_client); });
    }
}

void CEncapsulatedFormat::writeAudioChunk(const P<audio::IAudioChunk>& pAudioChunk) {
    const int frameBytes = getChannelCount() * getBytesPerSample();
    const bool isWhole =
        pAudioChunk && frameBytes > 0 && pAudioChunk->getSize() % static_cast<uint32_t>(frameBytes) == 0;
    write("writeAudioChunk", !isWhole, [&](CFormatClient& client) { client.writeAudioChunk(pAudioChunk); });
}

// --- Video ---

CEncapsulatedFormat::SFormatParams CEncapsulatedFormat::getVideoParameter() {
    return forward("getVideoParameter", [this](CFormatClient& client) {
        return has(kFacetVideo) ? client.getVideoParameter() : SFormatParams();
    });
}

void CEncapsulatedFormat::writeFrame(const P<ISonoraPicture>& pPicture) {
    write("writeFrame", false, [&](CFormatClient& client) {
        if (has(kFacetVideo)) client.writeFrame(pPicture);
    });
}

int CEncapsulatedFormat::getWantedImageType() {
    return forward("getWantedImageType", [this](CFormatClient& client) {
        return has(kFacetVideo) ? client.getWantedImageType() : 0;
    });
}

// --- The optional interfaces ---

class CEncapsulatedFormat::CDiscardable : public peru::CObject, public IDiscardable {
public:
    explicit CDiscardable(CEncapsulatedFormat* format) : m_format(P<CEncapsulatedFormat>::share(format)) {}
    void discard() noexcept override { m_format->discard(); }

private:
    P<CEncapsulatedFormat> m_format;
};

class CEncapsulatedFormat::CFloatSamples : public peru::CObject, public IFloatSamples {
public:
    explicit CFloatSamples(CEncapsulatedFormat* format) : m_format(P<CEncapsulatedFormat>::share(format)) {}

    bool canUseFloat(int bytesPerSample) override {
        return m_format->forward("canUseFloat", [&](CFormatClient& client) {
            const auto proc = peru::make<SRemoteFacets::canUseFloatFunction>();
            proc->nBytesPerSample->setValue(bytesPerSample);
            return client.callReturningBool(proc);
        });
    }
    void useFloat(int bytesPerSample) override {
        m_format->change("useFloat", [&](CFormatClient& client) {
            const auto proc = peru::make<SRemoteFacets::useFloatFunction>();
            proc->nBytesPerSample->setValue(bytesPerSample);
            client.call(proc);
        });
    }

private:
    P<CEncapsulatedFormat> m_format;
};

class CEncapsulatedFormat::CFormatSettings : public peru::CObject, public IFormatSettings {
public:
    explicit CFormatSettings(uint32_t usedSettings) : m_usedSettings(usedSettings) {}
    uint32_t getUsedSettings() override { return m_usedSettings; }

private:
    uint32_t m_usedSettings;
};

peru::SInterfaceQueryResult CEncapsulatedFormat::queryInterface(const std::type_info& wanted) {
    const peru::CMutexLock lock(m_guard);
    // Also after a failure, which may have closed it.
    if (wanted == typeid(IDiscardable) && has(kFacetDiscardable))
        return {nullptr, {peru::make<CDiscardable>(this)}};
    if (!m_client) return {};
    if (wanted == typeid(IFloatSamples) && has(kFacetFloatSamples))
        return {nullptr, {peru::make<CFloatSamples>(this)}};
    if (wanted == typeid(IFormatSettings) && has(kFacetFormatSettings))
        return {nullptr, {peru::make<CFormatSettings>(m_state->usedSettings)}};
    return {};
}

} // namespace sonora2::common
