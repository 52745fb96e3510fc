// Cuts what a source delivers into blocks of a wanted length.
#pragma once

#include "peru/streams/BufferedIOStream.h"
#include "sonora2/context/ISonoraContext.h"
#include "sonora2/media/IAudioSource.h"

namespace sonora2::common {

// One thread at a time.
class SONORA2_API CSampleReader : public peru::CObject {
public:
    // Asks the source for its sample format; a closed source is opened for that and closed again.
    // Throws CSonoraError when the source tells none.
    CSampleReader(const P<ISonoraContext>& context, const P<IAudioSource>& source);
    ~CSampleReader() override;

    bool hasSamples(); // never for a closed source
    // `frames` frames; fewer only at the end of the source, and an empty handle when nothing is left.
    // The timestamp counts the frames that were delivered, whatever the source's own chunks say.
    // Throws CSonoraError when the source gives no chunk although it is not at its end.
    P<audio::IAudioChunk> getSamples(int frames);
    void reset(); // closes the source and starts the time line again
    int64_t getPosition() const { return m_position; }

private:
    int m_frameBytes = 0;
    P<IAudioSource> m_source;
    P<peru::CBufferedIOStream> m_buffer;
    P<ISonoraContext> m_context;
    // Frames delivered since the last reset. The source's timestamps are dropped: after a skip some decoders
    // restart them, and an encoder needs a time line without holes.
    int64_t m_position = 0;
};

} // namespace sonora2::common
