#include "tonewright/AudioToolsHandler.h"

#include "peru/GlobalObjFactory.h"
#include "sonora2/plugins/CompanionLibrary.h"
#include "tonewright/Quietly.h"
#include "tonewright/audiotools.h"

#include <new>

namespace audiotoolshandler {

namespace {

class CEqualizer : public peru::CObject, public sonora2::audio::IAudioEqualizer {
public:
    // Adopts the equalizer.
    CEqualizer(const P<peru::IDynamicLibrary>& library, TONEWRIGHT_Equalizer* equalizer)
        : m_library(library), m_equalizer(equalizer) {}
    ~CEqualizer() override { m_equalizer->operations->destroy(m_equalizer); }
    CEqualizer(const CEqualizer&) = delete;
    CEqualizer& operator=(const CEqualizer&) = delete;

    void configure(int sampleRate, int bytesPerSample, int channelCount) override {
        m_equalizer->operations->configure(m_equalizer, sampleRate, bytesPerSample, channelCount);
    }
    void select(int preset) override { m_equalizer->operations->select(m_equalizer, preset); }
    void process(uint8_t* samples, int64_t bytes) override {
        m_equalizer->operations->process(m_equalizer, samples, bytes);
    }

private:
    const P<peru::IDynamicLibrary> m_library; // holds the equalizer's code
    TONEWRIGHT_Equalizer* const m_equalizer;
};

} // namespace

CAudioToolsHandler::CAudioToolsHandler() : m_library(sonora2::common::loadCompanionLibrary("audiotools")) {}
CAudioToolsHandler::~CAudioToolsHandler() = default;

P<CAudioToolsHandler> CAudioToolsHandler::get() {
    static const peru::CGlobalObjFactory::SKey kKey;
    return peru::CGlobalObjFactory::get<CAudioToolsHandler>(
        kKey, [] { return P<CAudioToolsHandler>(new CAudioToolsHandler); });
}

P<sonora2::audio::IAudioEqualizer> CAudioToolsHandler::createEqualizer() {
    const auto create =
        sonora2::common::requireFunction<decltype(::createEqualizer)>(m_library, "createEqualizer");
    TONEWRIGHT_Equalizer* const equalizer = create();
    if (!equalizer) throw std::bad_alloc();
    return peru::make<CEqualizer>(m_library, equalizer);
}

P<sonora2::audio::IAudioToolsHandler> findAudioToolsHandler() {
    P<sonora2::audio::IAudioToolsHandler> handler;
    tonewright::quietly("findAudioToolsHandler", [&] { handler = CAudioToolsHandler::get(); });
    return handler;
}

} // namespace audiotoolshandler
