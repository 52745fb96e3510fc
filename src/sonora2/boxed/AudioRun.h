// Several chunks that cross the pipe in one answer.
#pragma once

#include "peru/Object.h"
#include "sonora2/media/IAudioChunk.h"

#include <vector>

namespace sonora2::audio {

// What consecutive calls of getNextAudioChunk return, with the state of the source after the last one.
class SONORA2_API CAudioRun : public peru::CObject, public virtual peru::ISerializable {
public:
    static constexpr size_t kMostChunks = 64;

    explicit CAudioRun(const P<peru::IMemoryManager>& memoryManager);
    ~CAudioRun() override;

    std::vector<P<IAudioChunk>> chunks; // the last one may be empty, as the source has returned it
    bool isEOF = false;
    double duration = 0.0;
    P<peru::IString> failure = peru::CString::empty(); // of the call after the last chunk
    P<peru::IString> log = peru::CString::empty();     // as for getLog

    // Reading throws CRemoteException if more chunks are stated than a run has.
    void writeTo(const P<peru::IDataOutStream>& stream) const override;
    void readFrom(const P<peru::IDataInStream>& stream) override;

private:
    P<peru::IMemoryManager> m_memoryManager;
};

} // namespace sonora2::audio
