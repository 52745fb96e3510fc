#include "sonora2/boxed/FormatClient.h"

#include "sonora2/boxed/AudioChunkRemote.h"
#include "sonora2/boxed/BoxedSettings.h"
#include "sonora2/pictures/SonoraPictureRemote.h"

namespace sonora2::common {

CFormatClient::CFormatClient(const P<peru::IInStream>& in, const P<peru::IOutStream>& out,
                             const P<ISonoraContext>& context, uint32_t deadline)
    : CRemoteStreamClient(in, out), m_context(context) {
    setDeadline(deadline);
    setLimits(kLargestAnswer, kLongestAnswerText);
}

CFormatClient::~CFormatClient() = default;

P<CRemoteMediaState> CFormatClient::getState() {
    const auto state = peru::make<CRemoteMediaState>();
    callReturningObject(peru::make<getStateFunction>(), state);
    return state;
}

int64_t CFormatClient::getEstimatedSizeBytes(double fDuration) {
    const auto proc = peru::make<getEstimatedSizeBytesFunction>();
    proc->fDuration->setValue(fDuration);
    return callReturningInt64(proc);
}

ISonoraPlugin::SFormatParams CFormatClient::getVideoParameter() {
    const auto proc = peru::make<getVideoParameterFunction>();
    call(proc);
    return proc->result->getValue();
}

void CFormatClient::writeFrame(const P<ISonoraPicture>& pPicture) {
    const auto proc = peru::make<writeFrameProc>();
    if (pPicture)
        proc->pPicture->setValue(peru::make<CSonoraPictureRemote>(m_context->getMemoryManager(), pPicture));
    call(proc);
}

void CFormatClient::writeAudioChunk(const P<audio::IAudioChunk>& pAudioChunk) {
    const auto proc = peru::make<writeAudioChunkProc>();
    proc->pAudioChunk->setValue(
        peru::make<audio::CAudioChunkRemote>(m_context->getMemoryManager(), pAudioChunk));
    call(proc);
}

P<peru::IString> CFormatClient::getLog() {
    return callReturningString(peru::make<getLogFunction>());
}

bool CFormatClient::isOpened() {
    return callReturningBool(peru::make<isOpenedFunction>());
}

void CFormatClient::open() {
    call(peru::make<openProc>());
}

void CFormatClient::close() {
    call(peru::make<closeProc>());
}

P<peru::IURI> CFormatClient::getURI() {
    return callReturningURI(peru::make<getURIFunction>());
}

P<peru::IString> CFormatClient::getPluginName() {
    return callReturningString(peru::make<getPluginNameFunction>());
}

int CFormatClient::getWantedImageType() {
    return callReturningInt(peru::make<getWantedImageTypeFunction>());
}

int CFormatClient::getSampleRate() {
    return callReturningInt(peru::make<getSampleRateFunction>());
}

int CFormatClient::getChannelCount() {
    return callReturningInt(peru::make<getChannelCountFunction>());
}

int CFormatClient::getBytesPerSample() {
    return callReturningInt(peru::make<getBytesPerSampleFunction>());
}

void CFormatClient::setAudioQuality(double fQuality) {
    const auto proc = peru::make<setAudioQualityProc>();
    proc->fQuality->setValue(fQuality);
    call(proc);
}

void CFormatClient::setAudioBitRate(int nNominal, int nMin, int nMax) {
    const auto proc = peru::make<setAudioBitRateProc>();
    proc->nNominal->setValue(nNominal);
    proc->nMin->setValue(nMin);
    proc->nMax->setValue(nMax);
    call(proc);
}

} // namespace sonora2::common
