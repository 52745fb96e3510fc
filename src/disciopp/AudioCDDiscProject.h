// The project of an audio CD.
#pragma once

#include "disciopp/ProjectBase.h"

namespace disciopp {

inline constexpr const char* kVirtualAudioScheme = "discioppvirtualdiscaudiocd";

class DISCIOPP_API CAudioCDDiscProject : public CProjectBase,
                                         public IAudioCDProject,
                                         public TVirtualDisc<IAudioCDDisc> {
public:
    CAudioCDDiscProject(); // an empty one; throws CDISCIOPPException

    void insertTrack(const DISCIO_PCMAudioStreamFuncs& funcs, void* user, int32_t place) override;

    int32_t getSegmentCount() override { return m_audio->getSegmentCount(); }
    P<peru::IString> getText(int32_t segment, int32_t text) override {
        return m_audio->getText(segment, text);
    }
    Handle<DISCIO_PCMAudioStream> createStream(int32_t segment) override {
        return m_audio->createStream(segment);
    }

    // The disc of the living project with that root; empty if there is none. Any thread.
    static P<IAudioCDDisc> findDisc(const P<peru::IURI>& root);

protected:
    ~CAudioCDDiscProject() override;

    IAudioCDDisc& disc() override { return *m_audio; }

private:
    const P<IAudioCDDisc> m_audio; // the virtual disc
};

} // namespace disciopp
