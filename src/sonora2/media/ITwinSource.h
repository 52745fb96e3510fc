// Reading parts of a file on several threads.
#pragma once

#include "sonora2/media/IAudioSource.h"

namespace sonora2::common {

// Optional; found by an interface cast on a source. Frames are those that the source delivers, counted from
// the beginning of the file, whatever its start time. Only while the source is open.
class SONORA2_API ITwinSource : public virtual peru::IBase {
public:
    virtual int64_t getFrame() = 0; // the next one
    virtual int64_t getFrameCount() = 0;
    virtual void skipToFrame(int64_t frame) = 0;
    // Another source of the same frames, open, for one other thread, which also decodes. Its start time is 0,
    // it supports this interface, and its warnings do not reach the log. Empty if the file's frames could
    // differ from those of an uninterrupted run. May throw.
    virtual P<IAudioSource> createTwin() = 0;
};

} // namespace sonora2::common
