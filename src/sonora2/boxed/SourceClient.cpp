#include "sonora2/boxed/SourceClient.h"

#include "sonora2/boxed/AudioChunkRemote.h"
#include "sonora2/boxed/BoxedSettings.h"
#include "sonora2/media/AudioStreamInfos.h"
#include "sonora2/pictures/SonoraPictureRemote.h"

namespace sonora2::common {

CSourceClient::CSourceClient(const P<peru::IInStream>& in, const P<peru::IOutStream>& out,
                             const P<ISonoraContext>& context, uint32_t deadline)
    : CRemoteStreamClient(in, out), m_context(context) {
    setDeadline(deadline);
    setLimits(kLargestAnswer, kLongestAnswerText);
}

CSourceClient::~CSourceClient() = default;

P<CRemoteMediaState> CSourceClient::getState() {
    const auto state = peru::make<CRemoteMediaState>();
    callReturningObject(peru::make<getStateFunction>(), state);
    return state;
}

P<audio::CAudioRun> CSourceClient::getNextAudioChunks(int maxBytes) {
    const auto proc = peru::make<getNextAudioChunksFunction>();
    proc->nMaxBytes->setValue(maxBytes);
    const auto run = peru::make<audio::CAudioRun>(m_context->getMemoryManager());
    callReturningObject(proc, run);
    return run;
}

P<ISonoraPicture> CSourceClient::getNextPicture() {
    const auto picture = peru::make<CSonoraPictureRemote>(m_context->getMemoryManager());
    callReturningObject(peru::make<getNextPictureFunction>(), picture);
    return picture->getPicture();
}

P<audio::IAudioStreamInfos> CSourceClient::getAudioStreamInfos() {
    const auto infos = peru::make<audio::CAudioStreamInfos>();
    if (!callReturningObject(peru::make<getAudioStreamInfosFunction>(), infos)) return nullptr;
    return infos;
}

P<audio::IAudioChunk> CSourceClient::getNextAudioChunk() {
    const auto chunk = peru::make<audio::CAudioChunkRemote>(m_context->getMemoryManager());
    callReturningObject(peru::make<getNextAudioChunkFunction>(), chunk);
    return chunk->getChunk();
}

P<peru::IString> CSourceClient::getLog() {
    return callReturningString(peru::make<getLogFunction>());
}

bool CSourceClient::isOpened() {
    return callReturningBool(peru::make<isOpenedFunction>());
}

void CSourceClient::open() {
    call(peru::make<openProc>());
}

void CSourceClient::close() {
    call(peru::make<closeProc>());
}

void CSourceClient::skipToTime(double fTimestamp) {
    const auto proc = peru::make<skipToTimeProc>();
    proc->fTimestamp->setValue(fTimestamp);
    call(proc);
}

double CSourceClient::getDuration() {
    return callReturningDouble(peru::make<getDurationFunction>());
}

int CSourceClient::getBufferStatus() {
    return callReturningInt(peru::make<getBufferStatusFunction>());
}

bool CSourceClient::isEOF() {
    return callReturningBool(peru::make<isEOFFunction>());
}

void CSourceClient::setStartTime(double fStartTime) {
    const auto proc = peru::make<setStartTimeProc>();
    proc->fStartTime->setValue(fStartTime);
    call(proc);
}

double CSourceClient::getStartTime() {
    return callReturningDouble(peru::make<getStartTimeFunction>());
}

P<peru::IURI> CSourceClient::getURI() {
    return callReturningURI(peru::make<getURIFunction>());
}

P<peru::IString> CSourceClient::getPluginName() {
    return callReturningString(peru::make<getPluginNameFunction>());
}

void CSourceClient::setMaxSize(int nWidth, int nHeight) {
    const auto proc = peru::make<setMaxSizeProc>();
    proc->nWidth->setValue(nWidth);
    proc->nHeight->setValue(nHeight);
    call(proc);
}

int CSourceClient::getWidth() {
    return callReturningInt(peru::make<getWidthFunction>());
}

int CSourceClient::getHeight() {
    return callReturningInt(peru::make<getHeightFunction>());
}

double CSourceClient::peekNextPictureTimestamp() {
    return callReturningDouble(peru::make<peekNextPictureTimestampFunction>());
}

int CSourceClient::getPixelAspectNum() {
    return callReturningInt(peru::make<getPixelAspectNumFunction>());
}

int CSourceClient::getPixelAspectDen() {
    return callReturningInt(peru::make<getPixelAspectDenFunction>());
}

double CSourceClient::getFrameDuration() {
    return callReturningDouble(peru::make<getFrameDurationFunction>());
}

int CSourceClient::getFrameRateNum() {
    return callReturningInt(peru::make<getFrameRateNumFunction>());
}

int CSourceClient::getFrameRateDen() {
    return callReturningInt(peru::make<getFrameRateDenFunction>());
}

int CSourceClient::getSampleRate() {
    return callReturningInt(peru::make<getSampleRateFunction>());
}

int CSourceClient::getChannelCount() {
    return callReturningInt(peru::make<getChannelCountFunction>());
}

int CSourceClient::getBytesPerSample() {
    return callReturningInt(peru::make<getBytesPerSampleFunction>());
}

void CSourceClient::setAudioStream(int nAudioIndex) {
    const auto proc = peru::make<setAudioStreamProc>();
    proc->nAudioIndex->setValue(nAudioIndex);
    call(proc);
}

} // namespace sonora2::common
