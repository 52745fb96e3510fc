// The optional interfaces of a source in a slave.
#include "sonora2/boxed/EncapsulatedSource.h"

#include "sonora2/media/IClippingPrevention.h"
#include "sonora2/media/IFloatSamples.h"
#include "sonora2/media/IMediaDescription.h"
#include "sonora2/media/ISalvage.h"

namespace sonora2::common {

class CEncapsulatedSource::CFloatSamples : public peru::CObject, public IFloatSamples {
public:
    explicit CFloatSamples(CEncapsulatedSource* source) : m_source(P<CEncapsulatedSource>::share(source)) {}

    bool canUseFloat(int bytesPerSample) override {
        return m_source->forward("canUseFloat", [&](CSourceClient& client) {
            const auto proc = peru::make<SRemoteFacets::canUseFloatFunction>();
            proc->nBytesPerSample->setValue(bytesPerSample);
            return client.callReturningBool(proc);
        });
    }
    void useFloat(int bytesPerSample) override {
        m_source->change("useFloat", [&](CSourceClient& client) {
            m_source->returnChunks(client); // the samples continue at the same frame
            const auto proc = peru::make<SRemoteFacets::useFloatFunction>();
            proc->nBytesPerSample->setValue(bytesPerSample);
            client.call(proc);
        });
    }

private:
    P<CEncapsulatedSource> m_source;
};

class CEncapsulatedSource::CMediaDescription : public peru::CObject, public IMediaDescription {
public:
    explicit CMediaDescription(CEncapsulatedSource* source)
        : m_source(P<CEncapsulatedSource>::share(source)) {}

    P<peru::IString> getCodecName() override { return fetch()->codecName; }
    int64_t getBitRate() override { return fetch()->bitRate; }
    int getOwnSampleRate() override { return fetch()->sampleRate; }
    int getOwnChannelCount() override { return fetch()->channelCount; }
    int getOwnBytesPerSample() override { return fetch()->bytesPerSample; }
    void setDeliveredFormat(int sampleRate, int channelCount, int bytesPerSample) override {
        m_source->change("setDeliveredFormat", [&](CSourceClient& client) {
            const auto proc = peru::make<SRemoteFacets::setDeliveredFormatFunction>();
            proc->nSampleRate->setValue(sampleRate);
            proc->nChannelCount->setValue(channelCount);
            proc->nBytesPerSample->setValue(bytesPerSample);
            m_source->returnChunks(client);
            client.call(proc);
        });
        const peru::CMutexLock lock(m_source->m_guard);
        m_source->m_deliveredFormat = {sampleRate, channelCount, bytesPerSample};
    }
    P<peru::IString> takeWarnings() override {
        const P<peru::IString> warnings = m_source->forward("takeWarnings", [](CSourceClient& client) {
            return client.callReturningString(peru::make<SRemoteFacets::takeWarningsFunction>());
        });
        return warnings ? warnings : peru::CString::empty();
    }

private:
    P<CRemoteMediaDescription> fetch() {
        const auto description = peru::make<CRemoteMediaDescription>();
        m_source->forward("getMediaDescription", [&](CSourceClient& client) {
            client.callReturningObject(peru::make<SRemoteFacets::getMediaDescriptionFunction>(), description);
        });
        return description;
    }

    P<CEncapsulatedSource> m_source;
};

class CEncapsulatedSource::CSalvage : public peru::CObject, public ISalvage {
public:
    explicit CSalvage(CEncapsulatedSource* source) : m_source(P<CEncapsulatedSource>::share(source)) {}

    void setSalvage(bool salvage) override {
        m_source->change("setSalvage", [&](CSourceClient& client) {
            m_source->returnChunks(client);
            const auto proc = peru::make<SRemoteFacets::setSalvageFunction>();
            proc->bSalvage->setValue(salvage);
            client.call(proc);
        });
        const peru::CMutexLock lock(m_source->m_guard);
        m_source->m_salvage = salvage;
    }
    bool getSalvage() override {
        return m_source->forward("getSalvage", [](CSourceClient& client) {
            return client.callReturningBool(peru::make<SRemoteFacets::getSalvageFunction>());
        });
    }

private:
    P<CEncapsulatedSource> m_source;
};

class CEncapsulatedSource::CClippingPrevention : public peru::CObject, public IClippingPrevention {
public:
    explicit CClippingPrevention(CEncapsulatedSource* source)
        : m_source(P<CEncapsulatedSource>::share(source)) {}

    void setClippingPrevention(bool prevent) override {
        m_source->change("setClippingPrevention", [&](CSourceClient& client) {
            m_source->returnChunks(client);
            const auto proc = peru::make<SRemoteFacets::setClippingPreventionFunction>();
            proc->bPrevent->setValue(prevent);
            client.call(proc);
        });
        const peru::CMutexLock lock(m_source->m_guard);
        m_source->m_preventClipping = prevent;
    }
    bool getClippingPrevention() override {
        return m_source->forward("getClippingPrevention", [](CSourceClient& client) {
            return client.callReturningBool(peru::make<SRemoteFacets::getClippingPreventionFunction>());
        });
    }

private:
    P<CEncapsulatedSource> m_source;
};

peru::SInterfaceQueryResult CEncapsulatedSource::queryInterface(const std::type_info& wanted) {
    const peru::CMutexLock lock(m_guard);
    if (!m_client) return {};
    if (wanted == typeid(IFloatSamples) && has(kFacetFloatSamples))
        return {nullptr, {peru::make<CFloatSamples>(this)}};
    if (wanted == typeid(IMediaDescription) && has(kFacetMediaDescription))
        return {nullptr, {peru::make<CMediaDescription>(this)}};
    if (wanted == typeid(ISalvage) && has(kFacetSalvage)) return {nullptr, {peru::make<CSalvage>(this)}};
    if (wanted == typeid(IClippingPrevention) && has(kFacetClippingPrevention))
        return {nullptr, {peru::make<CClippingPrevention>(this)}};
    return {};
}

} // namespace sonora2::common
