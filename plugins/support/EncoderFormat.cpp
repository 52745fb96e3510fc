#include "support/EncoderFormat.h"

#include <algorithm>
#include <cmath>
#include <utility>

namespace sonora2::plugins {

namespace {

constexpr auto kUpdate = std::chrono::milliseconds(500);

} // namespace

CEncoderFormat::CEncoderFormat(const P<peru::IString>& pluginName, const SMediaFile& file,
                               EncoderFactory makeEncoder, const SPcmFormat& format)
    : m_pluginName(pluginName), m_file(file), m_makeEncoder(makeEncoder), m_estimator(makeEncoder(file)),
      m_integerFormat(format) {
    m_settings.format = format;
}

CEncoderFormat::~CEncoderFormat() {
    try {
        CEncoderFormat::close();
    } catch (...) {
        // Callers that need the error call close().
    }
}

void CEncoderFormat::open() {
    if (isOpened()) return;
    std::unique_ptr<COutputFile> output;
    auto encoder = m_makeEncoder(m_file);
    try {
        output = std::make_unique<COutputFile>(m_file);
        encoder->open(*output, m_settings);
    } catch (...) {
        encoder.reset();
        if (output) output->discard();
        m_settings.format = m_integerFormat;
        throw;
    }
    m_share = std::make_unique<peru::CThreadShare>();
    m_output = std::move(output);
    m_encoder = std::move(encoder);
    m_updated = std::chrono::steady_clock::now();
    m_failed = false;
}

void CEncoderFormat::close() {
    const std::unique_ptr<peru::CThreadShare> share = std::move(m_share);
    const std::unique_ptr<COutputFile> output = std::move(m_output);
    const std::unique_ptr<IEncoder> encoder = std::move(m_encoder);
    m_settings.format = m_integerFormat;
    // The failed write has already been reported, and the rest cannot be completed.
    if (!output || m_failed) return;
    try {
        encoder->finish();
        output->close();
    } catch (...) {
        output->discard();
        throw;
    }
}

void CEncoderFormat::discard() noexcept {
    m_encoder.reset();
    if (m_output) m_output->discard();
    m_output.reset();
    m_share.reset();
    m_settings.format = m_integerFormat;
}

int64_t CEncoderFormat::getEstimatedSizeBytes(double fDuration) {
    if (!(fDuration > 0.0)) fDuration = 0.0;
    return m_estimator->estimateBytes(fDuration, m_settings);
}

void CEncoderFormat::setAudioQuality(double fQuality) {
    requireClosed(
        {"sonora2.CEncoderFormat.qualityFixed", "the quality cannot be changed while %s is being written"});
    if (std::isnan(fQuality))
        fail({"sonora2.CEncoderFormat.qualityNotANumber", "the quality for %s is not a number"},
             m_file.getDisplayName());
    m_settings.quality = std::clamp(fQuality, 0.0, 1.0);
}

void CEncoderFormat::setAudioBitRate(int nNominal, int nMin, int nMax) {
    requireClosed(
        {"sonora2.CEncoderFormat.bitRateFixed", "the bit rate cannot be changed while %s is being written"});
    if (nNominal < 0 || nMin < 0 || nMax < 0 || (nMax > 0 && (nMin > nMax || nNominal > nMax)) ||
        (nNominal > 0 && nMin > nNominal))
        fail({"sonora2.CEncoderFormat.bitRatesContradict",
              "the bit rates %d (at least %d, at most %d) for %s contradict each other"},
             nNominal, nMin, nMax, m_file.getDisplayName());
    m_settings.nominalBitRate = nNominal;
    m_settings.minBitRate = nMin;
    m_settings.maxBitRate = nMax;
}

void CEncoderFormat::writeAudioChunk(const P<audio::IAudioChunk>& pAudioChunk) {
    if (!isOpened())
        fail({"sonora2.CEncoderFormat.notOpened", "%s is not opened for writing"}, m_file.getDisplayName());
    if (m_failed) {
        m_output->throwFailure();
        fail({"sonora2.CEncoderFormat.failedBefore", "%s cannot be written on after a failure"},
             m_file.getDisplayName());
    }
    if (!pAudioChunk || pAudioChunk->getSize() == 0) return;
    const uint32_t frameBytes = static_cast<uint32_t>(m_settings.format.frameBytes());
    const uint32_t size = pAudioChunk->getSize();
    if (size % frameBytes != 0)
        fail({"sonora2.CEncoderFormat.noWholeFrames",
              "%d bytes of audio for %s are not whole frames of %d bytes"},
             size, m_file.getDisplayName(), frameBytes);
    try {
        m_encoder->write(pAudioChunk->getData(), static_cast<int>(size / frameBytes));
        m_output->throwFailure();
        if (const auto now = std::chrono::steady_clock::now();
            m_output->growsInPlace() && now - m_updated >= kUpdate) {
            m_updated = now;
            m_encoder->update();
            m_output->flush();
        }
    } catch (...) {
        m_failed = true;
        throw;
    }
}

bool CEncoderFormat::canUseFloat(int bytesPerSample) {
    // Narrower integers have been asked for.
    if (m_integerFormat.bytesPerSample != 4 || (bytesPerSample != 4 && bytesPerSample != 8)) return false;
    return m_estimator->holdsFloat({m_integerFormat.rate, m_integerFormat.channels, bytesPerSample, true});
}

void CEncoderFormat::useFloat(int bytesPerSample) {
    requireClosed({"sonora2.CEncoderFormat.formatFixed",
                   "the sample format cannot be changed while %s is being written"});
    if (!canUseFloat(bytesPerSample))
        fail({"sonora2.CEncoderFormat.noFloat", "%s cannot hold floating-point samples of %d bits"},
             m_file.getDisplayName(), bytesPerSample * 8);
    m_settings.format = {m_integerFormat.rate, m_integerFormat.channels, bytesPerSample, true};
}

void CEncoderFormat::requireClosed(const peru::SLocalizedText& text) const {
    if (m_output) fail(text, m_file.getDisplayName());
}

} // namespace sonora2::plugins
