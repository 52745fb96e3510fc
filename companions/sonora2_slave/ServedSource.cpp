#include "peru/IInterfaceQuery.h"
#include "sonora2/boxed/AudioChunkRemote.h"
#include "sonora2/boxed/ISourceServer.h"
#include "sonora2/media/IClippingPrevention.h"
#include "sonora2/media/IFloatSamples.h"
#include "sonora2/media/IMediaDescription.h"
#include "sonora2/media/ISalvage.h"
#include "sonora2/pictures/SonoraPictureRemote.h"
#include "sonora2_slave/ServedMedia.h"

#include <string>

namespace slave {

using namespace sonora2::common;
using peru::interfaceCast;
using peru::IRemote;
using Server = ISourceServer;

namespace {

// The error of a call as text; empty if there was none.
template <class Call> P<peru::IString> getFailure(const Call& call) {
    const auto failures = peru::make<CFailures>();
    try {
        guarded("getNextAudioChunk", call);
    } catch (const peru::CException& exception) {
        failures->keep(exception);
    } catch (const std::exception& exception) {
        failures->keep(peru::CError(exception.what()));
    }
    return failures->take();
}

int32_t getFacets(const P<ISource>& source) {
    return (interfaceCast<IVideoSource>(source) ? kFacetVideo : 0) |
           (interfaceCast<IAudioSource>(source) ? kFacetAudio : 0) |
           (interfaceCast<IFloatSamples>(source) ? kFacetFloatSamples : 0) |
           (interfaceCast<IMediaDescription>(source) ? kFacetMediaDescription : 0) |
           (interfaceCast<ISalvage>(source) ? kFacetSalvage : 0) |
           (interfaceCast<IClippingPrevention>(source) ? kFacetClippingPrevention : 0);
}

void serveAny(IRemote& remote, const P<ISource>& source, const P<CFailures>& failures) {
    addVoid<Server::openProc>(remote, failures, "open", [=](auto&) { source->open(); });
    addVoid<Server::closeProc>(remote, failures, "close", [=](auto&) { source->close(); });
    addVoid<Server::skipToTimeProc>(remote, failures, "skipToTime", [=](Server::skipToTimeProc& proc) {
        source->skipToTime(proc.fTimestamp->getValue());
    });
    addVoid<Server::setStartTimeProc>(remote, failures, "setStartTime", [=](Server::setStartTimeProc& proc) {
        source->setStartTime(proc.fStartTime->getValue());
    });
    addFunction<Server::isOpenedFunction>(remote, "isOpened",
                                          [=](auto& proc) { proc.result->setValue(source->isOpened()); });
    addFunction<Server::getDurationFunction>(
        remote, "getDuration", [=](auto& proc) { proc.result->setValue(source->getDuration()); });
    addFunction<Server::getBufferStatusFunction>(
        remote, "getBufferStatus", [=](auto& proc) { proc.result->setValue(source->getBufferStatus()); });
    addFunction<Server::isEOFFunction>(remote, "isEOF",
                                       [=](auto& proc) { proc.result->setValue(source->isEOF()); });
    addFunction<Server::getStartTimeFunction>(
        remote, "getStartTime", [=](auto& proc) { proc.result->setValue(source->getStartTime()); });
    addFunction<Server::getURIFunction>(remote, "getURI",
                                        [=](auto& proc) { proc.result->setValue(source->getURI()); });
    addFunction<Server::getPluginNameFunction>(
        remote, "getPluginName", [=](auto& proc) { proc.result->setValue(source->getPluginName()); });
}

void serveVideo(IRemote& remote, const P<IVideoSource>& video, const P<CFailures>& failures,
                const P<peru::IMemoryManager>& memory) {
    addVoid<Server::setMaxSizeProc>(remote, failures, "setMaxSize", [=](Server::setMaxSizeProc& proc) {
        video->setMaxSize(proc.nWidth->getValue(), proc.nHeight->getValue());
    });
    addFunction<Server::getWidthFunction>(remote, "getWidth",
                                          [=](auto& proc) { proc.result->setValue(video->getWidth()); });
    addFunction<Server::getHeightFunction>(remote, "getHeight",
                                           [=](auto& proc) { proc.result->setValue(video->getHeight()); });
    addFunction<Server::peekNextPictureTimestampFunction>(
        remote, "peekNextPictureTimestamp",
        [=](auto& proc) { proc.result->setValue(video->peekNextPictureTimestamp()); });
    addFunction<Server::getNextPictureFunction>(remote, "getNextPicture", [=](auto& proc) {
        const P<ISonoraPicture> picture = video->getNextPicture();
        proc.result->setValue(picture ? peru::make<CSonoraPictureRemote>(memory, picture) : nullptr);
    });
    addFunction<Server::getPixelAspectNumFunction>(
        remote, "getPixelAspectNum", [=](auto& proc) { proc.result->setValue(video->getPixelAspectNum()); });
    addFunction<Server::getPixelAspectDenFunction>(
        remote, "getPixelAspectDen", [=](auto& proc) { proc.result->setValue(video->getPixelAspectDen()); });
    addFunction<Server::getFrameDurationFunction>(
        remote, "getFrameDuration", [=](auto& proc) { proc.result->setValue(video->getFrameDuration()); });
    addFunction<Server::getFrameRateNumFunction>(
        remote, "getFrameRateNum", [=](auto& proc) { proc.result->setValue(video->getFrameRateNum()); });
    addFunction<Server::getFrameRateDenFunction>(
        remote, "getFrameRateDen", [=](auto& proc) { proc.result->setValue(video->getFrameRateDen()); });
}

void serveAudio(IRemote& remote, const P<IAudioSource>& audio, const P<CFailures>& failures,
                const P<peru::IMemoryManager>& memory, const P<CSlaveLog>& log) {
    addFunction<Server::getAudioStreamInfosFunction>(remote, "getAudioStreamInfos", [=](auto& proc) {
        proc.result->setValue(audio->getAudioStreamInfos());
    });
    addVoid<Server::setAudioStreamProc>(
        remote, failures, "setAudioStream",
        [=](Server::setAudioStreamProc& proc) { audio->setAudioStream(proc.nAudioIndex->getValue()); });
    addFunction<Server::getNextAudioChunkFunction>(remote, "getNextAudioChunk", [=](auto& proc) {
        proc.result->setValue(
            peru::make<sonora2::audio::CAudioChunkRemote>(memory, audio->getNextAudioChunk()));
    });
    addFunction<Server::getNextAudioChunksFunction>(
        remote, "getNextAudioChunk", [=](Server::getNextAudioChunksFunction& proc) {
            const auto run = peru::make<sonora2::audio::CAudioRun>(memory);
            run->failure = getFailure([&] {
                int64_t bytes = 0;
                while (bytes < proc.nMaxBytes->getValue() && run->chunks.size() < run->kMostChunks) {
                    if (!run->chunks.empty() && audio->isEOF()) break;
                    run->chunks.push_back(audio->getNextAudioChunk());
                    if (!run->chunks.back()) break;
                    bytes += run->chunks.back()->getSize();
                }
            });
            run->isEOF = audio->isEOF();
            run->duration = audio->getDuration();
            run->log = log->take();
            proc.result->setValue(run);
        });
    addFunction<Server::getSampleRateFunction>(
        remote, "getSampleRate", [=](auto& proc) { proc.result->setValue(audio->getSampleRate()); });
    addFunction<Server::getChannelCountFunction>(
        remote, "getChannelCount", [=](auto& proc) { proc.result->setValue(audio->getChannelCount()); });
    addFunction<Server::getBytesPerSampleFunction>(
        remote, "getBytesPerSample", [=](auto& proc) { proc.result->setValue(audio->getBytesPerSample()); });
}

// The optional interfaces; those that the source does not have stay unknown procedures.
void serveFacets(IRemote& remote, const P<ISource>& source) {
    if (const auto floats = interfaceCast<IFloatSamples>(source)) {
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
    if (const auto salvage = interfaceCast<ISalvage>(source)) {
        addFunction<SRemoteFacets::setSalvageFunction>(remote, "setSalvage",
                                                       [=](SRemoteFacets::setSalvageFunction& proc) {
                                                           salvage->setSalvage(proc.bSalvage->getValue());
                                                           proc.result->setValue(true);
                                                       });
        addFunction<SRemoteFacets::getSalvageFunction>(
            remote, "getSalvage", [=](auto& proc) { proc.result->setValue(salvage->getSalvage()); });
    }
    if (const auto clipping = interfaceCast<IClippingPrevention>(source)) {
        addFunction<SRemoteFacets::setClippingPreventionFunction>(
            remote, "setClippingPrevention", [=](SRemoteFacets::setClippingPreventionFunction& proc) {
                clipping->setClippingPrevention(proc.bPrevent->getValue());
                proc.result->setValue(true);
            });
        addFunction<SRemoteFacets::getClippingPreventionFunction>(
            remote, "getClippingPrevention",
            [=](auto& proc) { proc.result->setValue(clipping->getClippingPrevention()); });
    }
    if (const auto media = interfaceCast<IMediaDescription>(source)) {
        addFunction<SRemoteFacets::getMediaDescriptionFunction>(
            remote, "getMediaDescription", [=](auto& proc) {
                const auto description = peru::make<CRemoteMediaDescription>();
                description->codecName = media->getCodecName();
                description->bitRate = media->getBitRate();
                description->sampleRate = media->getOwnSampleRate();
                description->channelCount = media->getOwnChannelCount();
                description->bytesPerSample = media->getOwnBytesPerSample();
                proc.result->setValue(description);
            });
        addFunction<SRemoteFacets::setDeliveredFormatFunction>(
            remote, "setDeliveredFormat", [=](SRemoteFacets::setDeliveredFormatFunction& proc) {
                media->setDeliveredFormat(proc.nSampleRate->getValue(), proc.nChannelCount->getValue(),
                                          proc.nBytesPerSample->getValue());
                proc.result->setValue(true);
            });
        addFunction<SRemoteFacets::takeWarningsFunction>(
            remote, "takeWarnings", [=](auto& proc) { proc.result->setValue(media->takeWarnings()); });
    }
}

} // namespace

void serveSource(IRemote& remote, const P<ISource>& source, const P<peru::IMemoryManager>& memory,
                 const P<CSlaveLog>& log) {
    const auto failures = peru::make<CFailures>();
    const auto audio = interfaceCast<IAudioSource>(source);
    serveAny(remote, source, failures);
    if (const auto video = interfaceCast<IVideoSource>(source)) serveVideo(remote, video, failures, memory);
    if (audio) serveAudio(remote, audio, failures, memory, log);
    serveFacets(remote, source);
    addFunction<getStateFunction>(remote, "getState", [=, facets = getFacets(source)](auto& proc) {
        const auto state = peru::make<CRemoteMediaState>();
        state->isOpened = source->isOpened();
        state->isEOF = source->isEOF();
        state->facets = facets;
        state->duration = source->getDuration();
        state->startTime = source->getStartTime();
        if (audio) {
            state->sampleRate = audio->getSampleRate();
            state->channelCount = audio->getChannelCount();
            state->bytesPerSample = audio->getBytesPerSample();
        }
        state->failure = failures->take();
        state->log = log->take();
        proc.result->setValue(state);
    });
}

} // namespace slave
