#include "peru/IInterfaceQuery.h"
#include "sonora2/boxed/AudioChunkRemote.h"
#include "sonora2/boxed/IFormatServer.h"
#include "sonora2/media/IDiscardable.h"
#include "sonora2/media/IFloatSamples.h"
#include "sonora2/media/IFormatSettings.h"
#include "sonora2/pictures/SonoraPictureRemote.h"
#include "sonora2_slave/ServedMedia.h"

namespace slave {

using namespace sonora2::common;
using peru::interfaceCast;
using peru::IRemote;
using Server = IFormatServer;

namespace {

int32_t getFacets(const P<IFormat>& format) {
    return (interfaceCast<IVideoFormat>(format) ? kFacetVideo : 0) |
           (interfaceCast<IAudioFormat>(format) ? kFacetAudio : 0) |
           (interfaceCast<IFloatSamples>(format) ? kFacetFloatSamples : 0) |
           (interfaceCast<IDiscardable>(format) ? kFacetDiscardable : 0) |
           (interfaceCast<IFormatSettings>(format) ? kFacetFormatSettings : 0);
}

void serveAny(IRemote& remote, const P<IFormat>& format, const P<CFailures>& failures) {
    addVoid<Server::openProc>(remote, failures, "open", [=](auto&) { format->open(); });
    addVoid<Server::closeProc>(remote, failures, "close", [=](auto&) { format->close(); });
    addFunction<Server::isOpenedFunction>(remote, "isOpened",
                                          [=](auto& proc) { proc.result->setValue(format->isOpened()); });
    addFunction<Server::getURIFunction>(remote, "getURI",
                                        [=](auto& proc) { proc.result->setValue(format->getURI()); });
    addFunction<Server::getPluginNameFunction>(
        remote, "getPluginName", [=](auto& proc) { proc.result->setValue(format->getPluginName()); });
    addFunction<Server::getEstimatedSizeBytesFunction>(
        remote, "getEstimatedSizeBytes", [=](Server::getEstimatedSizeBytesFunction& proc) {
            proc.result->setValue(format->getEstimatedSizeBytes(proc.fDuration->getValue()));
        });
}

void serveVideo(IRemote& remote, const P<IVideoFormat>& video, const P<CFailures>& failures,
                const P<peru::IMemoryManager>& memory) {
    addFunction<Server::getVideoParameterFunction>(
        remote, "getVideoParameter", [=](auto& proc) { proc.result->setValue(video->getVideoParameter()); });
    addFunction<Server::getWantedImageTypeFunction>(remote, "getWantedImageType", [=](auto& proc) {
        proc.result->setValue(video->getWantedImageType());
    });
    const P<peru::CRemoteProc> write =
        serveVoid<Server::writeFrameProc>(failures, "writeFrame", [=](auto& proc) {
            const auto picture = peru::tryCast<CSonoraPictureRemote>(proc.pPicture->getValue());
            video->writeFrame(picture ? picture->getPicture() : nullptr);
        });
    static_cast<Server::writeFrameProc&>(*write).pPicture->setTarget(
        peru::make<CSonoraPictureRemote>(memory));
    remote.addProc(write);
}

void serveAudio(IRemote& remote, const P<IAudioFormat>& audio, const P<CFailures>& failures,
                const P<peru::IMemoryManager>& memory) {
    addFunction<Server::getSampleRateFunction>(
        remote, "getSampleRate", [=](auto& proc) { proc.result->setValue(audio->getSampleRate()); });
    addFunction<Server::getChannelCountFunction>(
        remote, "getChannelCount", [=](auto& proc) { proc.result->setValue(audio->getChannelCount()); });
    addFunction<Server::getBytesPerSampleFunction>(
        remote, "getBytesPerSample", [=](auto& proc) { proc.result->setValue(audio->getBytesPerSample()); });
    addVoid<Server::setAudioQualityProc>(
        remote, failures, "setAudioQuality",
        [=](Server::setAudioQualityProc& proc) { audio->setAudioQuality(proc.fQuality->getValue()); });
    addVoid<Server::setAudioBitRateProc>(
        remote, failures, "setAudioBitRate", [=](Server::setAudioBitRateProc& proc) {
            audio->setAudioBitRate(proc.nNominal->getValue(), proc.nMin->getValue(), proc.nMax->getValue());
        });
    const P<peru::CRemoteProc> write =
        serveVoid<Server::writeAudioChunkProc>(failures, "writeAudioChunk", [=](auto& proc) {
            const auto chunk = peru::tryCast<sonora2::audio::CAudioChunkRemote>(proc.pAudioChunk->getValue());
            audio->writeAudioChunk(chunk ? chunk->getChunk() : nullptr);
        });
    static_cast<Server::writeAudioChunkProc&>(*write).pAudioChunk->setTarget(
        peru::make<sonora2::audio::CAudioChunkRemote>(memory));
    remote.addProc(write);
}

// The optional interfaces; those that the format does not have stay unknown procedures.
void serveFacets(IRemote& remote, const P<IFormat>& format) {
    if (const auto floats = interfaceCast<IFloatSamples>(format)) {
        addFunction<SRemoteFacets::canUseFloatFunction>(
            remote, "canUseFloat", [=](SRemoteFacets::canUseFloatFunction& proc) {
                proc.result->setValue(floats->canUseFloat(proc.nBytesPerSample->getValue()));
            });
        addFunction<SRemoteFacets::useFloatFunction>(remote, "useFloat",
                                                     [=](SRemoteFacets::useFloatFunction& proc) {
                                                         floats->useFloat(proc.nBytesPerSample->getValue());
                                                         proc.result->setValue(true);
                                                     });
    }
    if (const auto discardable = interfaceCast<IDiscardable>(format))
        addFunction<SRemoteFacets::discardFunction>(remote, "discard", [=](auto& proc) {
            discardable->discard();
            proc.result->setValue(true);
        });
}

} // namespace

void serveFormat(IRemote& remote, const P<IFormat>& format, const P<peru::IMemoryManager>& memory,
                 const P<CSlaveLog>& log) {
    const auto failures = peru::make<CFailures>();
    const auto audio = interfaceCast<IAudioFormat>(format);
    const auto settings = interfaceCast<IFormatSettings>(format);
    serveAny(remote, format, failures);
    if (const auto video = interfaceCast<IVideoFormat>(format)) serveVideo(remote, video, failures, memory);
    if (audio) serveAudio(remote, audio, failures, memory);
    serveFacets(remote, format);
    addFunction<getStateFunction>(remote, "getState", [=, facets = getFacets(format)](auto& proc) {
        const auto state = peru::make<CRemoteMediaState>();
        state->isOpened = format->isOpened();
        state->facets = facets;
        if (audio) {
            state->sampleRate = audio->getSampleRate();
            state->channelCount = audio->getChannelCount();
            state->bytesPerSample = audio->getBytesPerSample();
        }
        if (settings) state->usedSettings = settings->getUsedSettings();
        state->failure = failures->take();
        state->log = log->take();
        proc.result->setValue(state);
    });
}

} // namespace slave
