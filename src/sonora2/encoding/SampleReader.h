// Cuts a source's chunks into blocks of a requested length.
#pragma once

#include "peru/streams/BufferedIOStream.h"
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/media/IAudioSource.h"

namespace sonora2::common {

// One thread at a time.
class SONORA2_API CSampleReader : public peru::CObject {
public:
    // Queries the source's sample format; a closed source is opened for that and closed again. Throws
    // CSonoraError if the format is invalid.
    CSampleReader(const P<ISonoraContext>& context, const P<IAudioSource>& source);
    ~CSampleReader() override;

    bool hasSamples(); // false for a closed source
    // Returns `frames` frames; fewer only at the end of the source, and an empty handle when none are left.
    // The timestamp counts the frames delivered, independently of the source's own timestamps. Throws
    // CSonoraError if the source returns no chunk before its end.
    P<audio::IAudioChunk> getSamples(int frames);
    void reset(); // closes the source and restarts the time line
    int64_t getPosition() const { return m_position; }

    const P<IAudioSource>& getSource() const { return m_source; }

private:
    int m_frameBytes = 0;
    P<IAudioSource> m_source;
    P<peru::CBufferedIOStream> m_buffer;
    P<ISonoraContext> m_context;
    // Frames delivered since the last reset. The source's own timestamps are ignored: some decoders restart
    // them after a skip, and an encoder needs a time line without gaps.
    int64_t m_position = 0;
};

} // namespace sonora2::common
