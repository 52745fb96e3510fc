// C++ access to the objects behind the front's handles, for libraries beside it: callbacks that carry user
// data, and what the exports do not offer. An interface cast on the object of a handle finds these
// interfaces.
#pragma once

#include "peru/media/IAudioOutDevice.h"
#include "sonora2/media/IAudioSource.h"

#include <functional>

namespace tonewright {

using peru::P;

#define TONEWRIGHT_TARGET __attribute__((visibility("default")))

// Progress functions work beside the callbacks set through the exports: both are called, and each may stop
// the job. Any thread may exchange a function, also while a job runs; a call already under way still
// completes on the old function. An empty function removes it. No lock is held during a call. Functions run
// on the thread that the export documents for its callback, and an exception from one has the effect
// documented there.

// On the handle of an encoder.
class TONEWRIGHT_TARGET IEncoderProgressTarget : public virtual peru::IBase {
public:
    // False stops the job, which then keeps what was written.
    virtual void setProgressFunction(std::function<bool(double fraction)> function) = 0;
    // Stops the running job at its next progress report and discards its result: an existing target keeps its
    // content, a new file is removed. The job ends normally. Any thread, and from a progress function; has no
    // effect while no job runs.
    virtual void stopAndDiscard() = 0;
};

// On the handle of a player.
class TONEWRIGHT_TARGET IPlayerProgressTarget : public virtual peru::IBase {
public:
    virtual void
    setProgressFunction(std::function<void(double duration, double position, int32_t state)> function) = 0;
};

// On the handle of a recording source.
class TONEWRIGHT_TARGET IRecordingTarget : public virtual peru::IBase {
public:
    virtual void setProgressFunction(std::function<bool(double position)> function) = 0; // false ends it
    virtual void setLevelFunction(std::function<void(double left, double right)> function) = 0;
};

// On the handle of a player. Any thread, and from its progress function.
class TONEWRIGHT_TARGET IPlayerControl : public virtual peru::IBase {
public:
    // Continues at another time of the source that is heard, playing or paused; queued sound is dropped. On a
    // stopped player it sets where the next play begins. Throws CInvalidArgError for NaN, and what the source
    // throws.
    virtual void seek(double seconds) = 0;
    // Factor on the samples, effective at once; 1.0 leaves them unchanged. Throws CInvalidArgError unless it
    // is finite and not negative.
    virtual void setVolume(double factor) = 0;
    virtual double getVolume() = 0;
    // Exchanges the output device of a stopped player. A source that the player opened itself is opened anew
    // if the device does not support its format; otherwise that is a CError. Throws CError while playing.
    virtual void setDevice(const P<peru::media::IAudioOutDevice>& device) = 0;
    // Plays the source after the current and all queued ones, without a gap. False, and no effect, if its
    // format differs from the current one. Sources that fail to open are logged and skipped. To be called
    // before the last second of the current source is heard; the first call after the source has been read
    // to its end drops the queued sound and continues from the position that is heard.
    virtual bool enqueue(const P<sonora2::common::IAudioSource>& source) = 0;
    // How many queued sources have begun to be heard. Duration and position in progress reports are those of
    // the source that is heard.
    virtual int32_t getSourceIndex() = 0;
};

} // namespace tonewright
