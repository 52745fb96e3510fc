#include "peru/media/posix/AudioDevice.h"

#include "peru/media/DeviceNames.h"
#include "peru/media/Errors.h"
#include "peru/media/FormatSearch.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <pthread.h>

namespace peru::media::posix {

namespace {

constexpr int kStartAttempts = 3;

const PaHostApiInfo& getHostApiInfo(PaHostApiIndex index) {
    if (const PaHostApiInfo* info = Pa_GetHostApiInfo(index)) return *info;
    throw CMediaException(
        localize("peru.media.CAudioDevice.NoMediaApi", "Could not get media api from host hostapi"));
}

// 0 for a width that the engine or this library does not support.
PaSampleFormat findSampleFormat(int32_t bitsPerSample) {
    switch (bitsPerSample) {
    case 8:
        return paInt8;
    case 16:
        return paInt16;
    case 24:
        return paInt24;
    default:
        return 0;
    }
}

} // namespace

int32_t check(int32_t result) {
    if (result < 0) throw CPortaudioException(result);
    return result;
}

CCallbackScope::CCallbackScope() {
    pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &m_oldState);
}

CCallbackScope::~CCallbackScope() {
    pthread_setcancelstate(m_oldState, nullptr);
}

CAudioDevice::CAudioDevice(const P<IPosixSystem>& system, int32_t index, EDirection direction)
    : m_streamMutex(getMutexFactory()->createMutex()), m_system(system), m_index(index),
      m_direction(direction), m_engineIndex(index), m_generation(system->getGeneration()) {
    const PaDeviceInfo* info = Pa_GetDeviceInfo(index);
    if (!info)
        throw CMediaException(localize("peru.media.CAudioDevice.NoHostInfo", "Could not retrieve host info"));
    const bool isOut = direction == EDirection::out;
    m_name = CString::fromUTF8(info->name);
    const PaHostApiInfo& hostApi = getHostApiInfo(info->hostApi);
    m_hostApi = getHostApiName(hostApi.type);
    m_hostApiDisplayName = media::getHostApiDisplayName(hostApi.type, hostApi.name);
    m_isDefault = index == (isOut ? Pa_GetDefaultOutputDevice() : Pa_GetDefaultInputDevice());
    m_maxChannelCount = isOut ? info->maxOutputChannels : info->maxInputChannels;
    m_defaultSampleRate = static_cast<int32_t>(info->defaultSampleRate);
    m_latency = isOut ? info->defaultLowOutputLatency : info->defaultLowInputLatency;
}

CAudioDevice::~CAudioDevice() = default;

P<IString> CAudioDevice::getId() const {
    return format("%d", m_index);
}

P<IString> CAudioDevice::getListName() const {
    return getDeviceListName(m_index, m_name, m_hostApi, m_isDefault);
}

void CAudioDevice::setGain(double gain) {
    if (!std::isfinite(gain))
        throw CMediaException(
            localize("peru.media.CAudioDevice.BadGain", "The gain of a sound device must be a number"));
    m_gain = gain;
}

int32_t CAudioDevice::findIndex() const {
    if (m_generation == m_system->getGeneration()) return m_engineIndex;
    const int32_t count = Pa_GetDeviceCount();
    for (int32_t index = 0; index < count; ++index) {
        const PaDeviceInfo* info = Pa_GetDeviceInfo(index);
        const PaHostApiInfo* hostApi = info ? Pa_GetHostApiInfo(info->hostApi) : nullptr;
        if (!hostApi || !m_name->equals(CString::fromUTF8(info->name)) ||
            !m_hostApiDisplayName->equals(media::getHostApiDisplayName(hostApi->type, hostApi->name)))
            continue;
        if ((m_direction == EDirection::out ? info->maxOutputChannels : info->maxInputChannels) == 0)
            continue;
        m_engineIndex = index;
        m_generation = m_system->getGeneration();
        return index;
    }
    throwGone();
}

PaStreamParameters CAudioDevice::getParameters(const CAudioFormat& format) const {
    PaStreamParameters parameters{};
    parameters.device = findIndex();
    parameters.channelCount = format.getChannelCount();
    parameters.sampleFormat = findSampleFormat(format.getBitsPerSample());
    parameters.suggestedLatency = m_latency;
    return parameters;
}

bool CAudioDevice::isTaken(const CAudioFormat& format, int32_t& failure) const {
    const bool isOut = m_direction == EDirection::out;
    CMutexLock lock(m_system->getEngineMutex());
    const PaStreamParameters parameters = getParameters(format);
    const PaError result = Pa_IsFormatSupported(isOut ? nullptr : &parameters, isOut ? &parameters : nullptr,
                                                format.getSampleRate());
    const bool isAboutFormat = result == paInvalidSampleRate || result == paInvalidChannelCount ||
                               result == paSampleFormatNotSupported;
    if (result < 0 && !isAboutFormat) failure = result;
    return result == paFormatIsSupported;
}

P<CAudioFormat> CAudioDevice::getFormat(int32_t sampleRate, int32_t bytesPerSample, int32_t channelCount) {
    // Any width that is out of range must still give an unsupported number of bits.
    const int64_t bits = std::clamp<int64_t>(int64_t{bytesPerSample} * 8, std::numeric_limits<int32_t>::min(),
                                             std::numeric_limits<int32_t>::max());
    const P<CAudioFormat> wanted = make<CAudioFormat>(sampleRate, channelCount, static_cast<int32_t>(bits));
    if (!findSampleFormat(wanted->getBitsPerSample())) return wanted;
    int32_t failure = paNoError;
    P<CAudioFormat> nearest =
        findNearestFormat(wanted, m_maxChannelCount, m_defaultSampleRate,
                          [&](const CAudioFormat& candidate) { return isTaken(candidate, failure); });
    // No format is supported because the device cannot be reached at all.
    if (!nearest) check(failure);
    return nearest;
}

bool CAudioDevice::isOpened() const {
    CMutexLock lock(m_streamMutex);
    return m_stream != nullptr;
}

int32_t CAudioDevice::getStatus() const {
    CMutexLock lock(m_streamMutex);
    return m_state == kDeviceRunning && m_stream && Pa_IsStreamActive(m_stream) == 1 ? kDeviceRunning
                                                                                     : kDeviceIdle;
}

void CAudioDevice::openStream(const P<CAudioFormat>& audioFormat, PaStreamCallback* callback, void* self) {
    if (!audioFormat)
        throw CMediaException(
            localize("peru.media.CAudioDevice.NoFormat", "The sound device was given no format"));
    if (!findSampleFormat(audioFormat->getBitsPerSample()))
        throw CMediaException(
            format(localize("peru.media.CAudioDevice.BitsNotSupported", "%d Bits are not supported"),
                   audioFormat->getBitsPerSample()));
    // The engine would return the same error, but also print to standard error.
    if (audioFormat->getChannelCount() > m_maxChannelCount) check(paInvalidChannelCount);
    m_format = audioFormat;
    m_bytesPerFrame = audioFormat->getBytesPerFrame();
    m_started = false;
    const bool isOut = m_direction == EDirection::out;
    CMutexLock lock(m_system->getEngineMutex());
    const PaStreamParameters parameters = getParameters(*audioFormat);
    PaStream* stream = nullptr;
    // Neither clipping nor dithering: the samples must pass through unchanged.
    check(Pa_OpenStream(&stream, isOut ? nullptr : &parameters, isOut ? &parameters : nullptr,
                        audioFormat->getSampleRate(), paFramesPerBufferUnspecified, paClipOff | paDitherOff,
                        callback, self));
    m_system->countStream(1);
    m_stream = stream;
}

void CAudioDevice::startStream() {
    // Set first: the first callback comes before the call returns.
    m_state = kDeviceRunning;
    PaError result = Pa_StartStream(m_stream);
    // The engine waits one second for its thread to start, which is too short on a busy machine.
    for (int i = 1; result == paTimedOut && i < kStartAttempts; ++i) result = Pa_StartStream(m_stream);
    if (result < 0) {
        m_state = kDeviceIdle;
        check(result);
    }
    m_started = true;
}

void CAudioDevice::closeStream(PaStream* stream) {
    CMutexLock lock(m_system->getEngineMutex());
    m_system->countStream(-1); // it is released even if closing fails
    check(Pa_CloseStream(stream));
}

bool CAudioDevice::hasGone() const {
    return m_started && Pa_IsStreamActive(m_stream) != 1;
}

void CAudioDevice::throwGone() const {
    throw CMediaException(localize("peru.media.CAudioDevice.Gone",
                                   "The sound device '%NAME%' is not available any more",
                                   {{"%NAME%", m_name}}));
}

void CAudioDevice::requireOpened() const {
    if (!m_stream)
        throw CMediaException(
            localize("peru.media.CAudioDevice.NotOpened", "The sound device is not opened"));
}

} // namespace peru::media::posix
