#include "tonewright/NormalizeHandler.h"

#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"
#include "sonora2/plugins/CompanionLibrary.h"

#include <cmath>
#include <memory>
#include <new>

namespace tonewright {

using sonora2::common::requireFunction;

namespace {

constexpr double kFullScale = 32767.0; // of the library's linear values

struct SAnalysatorEnd {
    void operator()(TONEWRIGHT_Analysator* analysator) const { analysator->operations->destroy(analysator); }
};

} // namespace

CNormalizeHandler::CNormalizeHandler()
    : m_library(sonora2::common::loadCompanionLibrary("audiotools")),
      m_create(requireFunction<decltype(createNormalizeAnalysator)>(m_library, "createNormalizeAnalysator")),
      m_convert(requireFunction<decltype(convertDeltaDBValue)>(m_library, "convertDeltaDBValue")) {}

CNormalizeHandler::~CNormalizeHandler() = default;

double CNormalizeHandler::findGain(sonora2::common::IAudioSource& source, double targetLevel,
                                   const std::function<bool(double)>& goesOn) const {
    // Before the format is queried, which some sources know only once they are open.
    if (!source.isOpened()) source.open();
    const std::unique_ptr<TONEWRIGHT_Analysator, SAnalysatorEnd> analysator(m_create());
    if (!analysator) throw std::bad_alloc();
    const auto& operations = *analysator->operations;
    const int channels = source.getChannelCount(), bytes = source.getBytesPerSample(),
              rate = source.getSampleRate();
    operations.initialise(analysator.get(), channels, bytes, rate);
    const double duration = source.getDuration();
    while (!source.isEOF()) {
        const P<sonora2::audio::IAudioChunk> chunk = source.getNextAudioChunk();
        if (!chunk) break;
        // Sources of unknown length have the duration 0.
        if (!goesOn(duration > 0.0 ? chunk->getTimestamp() / duration : 0.0)) break;
        operations.analyse(analysator.get(), chunk->getData(), chunk->getSize());
    }
    const double level = operations.result(analysator.get());
    if (std::isnan(level))
        throw peru::CError(peru::localize("tonewright.Normalize.format",
                                          "The loudness of %CHANNELS% channels with %BYTES% bytes per sample "
                                          "at %RATE% Hz cannot be measured",
                                          {{"%CHANNELS%", peru::format("%d", channels)},
                                           {"%BYTES%", peru::format("%d", bytes)},
                                           {"%RATE%", peru::format("%d", rate)}}));
    return m_convert(targetLevel - level) / kFullScale;
}

} // namespace tonewright
