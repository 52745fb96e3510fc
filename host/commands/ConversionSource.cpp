#include "commands/ConversionSource.h"

#include "base/Text.h"
#include "base/Translation.h"
#include "library/Failure.h"
#include "media/Loudness.h"

#include <algorithm>
#include <stdexcept>
#include <tonewright/host.h>

namespace host {

namespace {

constexpr int kWidest = 4; // bytes per sample

} // namespace

CConversionSource::CConversionSource(const std::filesystem::path& input, const std::filesystem::path& target,
                                     const SConvertOptions& options)
    : m_input(input), m_options(options), m_sound(openSoundFile(input)), m_samples(chooseSamples(target)) {}

// The preferred format first, then those that most targets can hold. Values set by the user never change.
std::vector<SSampleFormat> CConversionSource::listCandidates() const {
    const SSampleFormat& own = m_sound.samples;
    std::vector<SSampleFormat> candidates;
    const auto add = [&](int rate, int channels, int bytes) {
        const SSampleFormat candidate{m_options.rate.value_or(rate), m_options.channels.value_or(channels),
                                      m_options.bits ? *m_options.bits / 8 : bytes};
        if (std::find(candidates.begin(), candidates.end(), candidate) == candidates.end())
            candidates.push_back(candidate);
    };
    // Rates that a limited codec may accept: the next higher ones first, a lower one only if there are none.
    std::vector<int> rates{own.rate};
    for (int rate : {8000, 11025, 16000, 22050, 32000, 44100, 48000})
        if (rate > own.rate) rates.push_back(rate);
    if (rates.size() == 1) rates.push_back(own.rate % 11025 == 0 ? 44100 : 48000);
    for (int rate : rates)
        for (int channels : {own.channels, 2, 1})
            for (int bytes : {own.bytesPerSample, 3, 2})
                if (channels <= own.channels && bytes <= std::max(own.bytesPerSample, 2))
                    add(rate, channels, bytes);
    return candidates;
}

SSampleFormat CConversionSource::chooseSamples(const std::filesystem::path& target) const {
    const std::u16string uri = toURI(target);
    const std::vector<SSampleFormat> candidates = listCandidates();
    const auto fits = [&](const SSampleFormat& samples) {
        return TONEWRIGHT_Host_CanWrite(uri.c_str(), samples.rate, samples.channels,
                                        samples.bytesPerSample) == 1;
    };
    const auto found = std::find_if(candidates.begin(), candidates.end(), fits);
    return found == candidates.end() ? candidates.front() : *found;
}

void CConversionSource::deliver() {
    const SSampleFormat& own = m_sound.samples;
    SSampleFormat wanted = m_samples;
    const bool resamples = wanted.rate != own.rate || wanted.channels != own.channels;
    if (m_options.loudness) wanted.bytesPerSample = resamples ? kWidest : own.bytesPerSample;
    clearFailure();
    // A width that the user asks for means integers, also where the target could hold floating point.
    if ((wanted != own || (m_options.bits && !m_options.loudness)) &&
        TONEWRIGHT_Host_SetSourceFormat(m_sound.source.get(), wanted.rate, wanted.channels,
                                        wanted.bytesPerSample) != 1)
        throw std::runtime_error(
            takeFailure(tr("host.inconvertible", "Cannot be converted from %FROM% to %TO%",
                           {{"%FROM%", describe(own)}, {"%TO%", describe(wanted)}}),
                        m_input));
    if (m_options.salvage) TONEWRIGHT_Host_SetSalvage(m_sound.source.get(), 1);
    // A change of the rate results in integers, which would clip before the gain.
    if (m_options.preventClipping || (m_options.loudness && resamples))
        TONEWRIGHT_Host_SetClippingPrevention(m_sound.source.get(), 1);
}

CHandle CConversionSource::measure(const std::function<void(double)>& progress) const {
    return measureLoudness(m_sound.source, m_input, progress);
}

CHandle CConversionSource::createGainSource(double decibels) const {
    const bool isOwnWidth = m_samples == m_sound.samples && !m_options.bits;
    clearFailure();
    CHandle source(TONEWRIGHT_Host_CreateGainSource(m_sound.source.get(), toFactor(decibels),
                                                    isOwnWidth ? 0 : m_samples.bytesPerSample));
    if (!source)
        throw std::runtime_error(takeFailure(tr("host.unreadable", "The file cannot be read"), m_input));
    return source;
}

} // namespace host
