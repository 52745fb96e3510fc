#include "tonewright/exports/PcmStream.h"

#include "peru/IInstanceWrapper.h"
#include "peru/IInterfaceQuery.h"
#include "peru/strings/LocalizedFormat.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/encoding/SampleReader.h"
#include "tonewright/exports/AppReference.h"
#include "tonewright/exports/Barrier.h"

#include <cstring>
#include <limits>

namespace tonewright::exports {

namespace {

using sonora2::common::CSampleReader;
using sonora2::common::IAudioSource;

// Runs the body with the reader behind the user data, or returns `failure`.
template <class R, class Body> R withReader(void* user, R failure, Body&& body) {
    return barrier<R>(failure, [&]() -> R {
        peru::CMutexLock lock(requireApp()->getServiceLock());
        if (!user) return failure;
        const P<CSampleReader> reader =
            peru::interfaceCast<CSampleReader>(static_cast<peru::CInstanceWrapper*>(user)->getObject());
        return reader ? static_cast<R>(body(*reader)) : failure;
    });
}

// Empty while the application is not started: a disc may be released after its end.
P<peru::IMutex> findServiceLock() noexcept {
    try {
        return requireApp()->getServiceLock();
    } catch (...) {
        return nullptr;
    }
}

int64_t countFrames(IAudioSource& source) {
    const double frames = source.getDuration() * source.getSampleRate();
    if (!(frames >= 0.0 && frames < static_cast<double>(std::numeric_limits<int64_t>::max()))) return -1;
    // A duration is a quotient, whose product with the rate may miss the whole number from below.
    return static_cast<int64_t>(frames + 1e-6);
}

// The library does not ask for the width of the samples.
void open(IAudioSource& source) {
    if (!source.isOpened()) source.open();
    if (const int bytes = source.getBytesPerSample(); bytes != 2)
        throw sonora2::common::CSonoraError(
            peru::format({"tonewright.PcmStream.width",
                          "The source has %d bytes per sample, but a track of an audio CD has 2"},
                         bytes));
}

// At the end of the source the destination is filled with silence, so that a track is never shorter than the
// length that it announced.
int32_t read(CSampleReader& reader, void* pcm, int32_t frames, int32_t* delivered) {
    IAudioSource& source = *reader.getSource();
    if (!pcm || !delivered || frames < 0 || !source.isOpened() || source.getBytesPerSample() != 2) return 0;
    const size_t frameBytes = static_cast<size_t>(source.getChannelCount()) * sizeof(int16_t);
    if (const P<sonora2::audio::IAudioChunk> chunk = reader.getSamples(frames)) {
        std::memcpy(pcm, chunk->getData(), chunk->getSize());
        *delivered = static_cast<int32_t>(chunk->getSize() / frameBytes);
    } else {
        std::memset(pcm, 0, frameBytes * static_cast<size_t>(frames));
        *delivered = frames;
    }
    return 1;
}

} // namespace

const DISCIO_PCMAudioStreamFuncs kSampleReaderFuncs{
    .getLength =
        [](void* user) {
            return withReader(user, -1.0, [](CSampleReader& r) { return r.getSource()->getDuration(); });
        },
    .reserved = nullptr,
    .open =
        [](void* user) {
            return withReader<int32_t>(user, 0, [](CSampleReader& r) {
                exports::open(*r.getSource());
                return 1;
            });
        },
    // Also drops what was read ahead, which would otherwise come first after the next open.
    .close =
        [](void* user) {
            withReader(user, 0, [](CSampleReader& r) {
                r.reset();
                return 1;
            });
        },
    .getChannelCount =
        [](void* user) {
            return withReader<int32_t>(user, -1,
                                       [](CSampleReader& r) { return r.getSource()->getChannelCount(); });
        },
    .getSampleRate =
        [](void* user) {
            return withReader<int32_t>(user, -1,
                                       [](CSampleReader& r) { return r.getSource()->getSampleRate(); });
        },
    .getFrameCount =
        [](void* user) {
            return withReader<int64_t>(user, -1,
                                       [](CSampleReader& r) { return countFrames(*r.getSource()); });
        },
    // A closed source would look as if it were at its end.
    .rewind =
        [](void* user) {
            return withReader<int32_t>(user, 0, [](CSampleReader& r) {
                const bool wasOpened = r.getSource()->isOpened();
                r.reset();
                if (wasOpened) r.getSource()->open();
                return 1;
            });
        },
    .flush = [](void*) {}, // the reader writes nothing
    .canSeek = [](void*) { return int32_t{0}; },
    .read =
        [](void* user, void* pcm, int32_t frames, int32_t* delivered) {
            if (delivered) *delivered = 0;
            return withReader<int32_t>(
                user, 0, [&](CSampleReader& r) { return exports::read(r, pcm, frames, delivered); });
        },
    .getRepairs = [](void*) { return int64_t{-1}; },
    .seek = [](void*, int64_t) { return int32_t{0}; },
    .getPosition =
        [](void* user) {
            return withReader<int64_t>(user, -1, [](CSampleReader& r) { return r.getPosition(); });
        },
    .end = // nobody uses the stream any more
    [](void* user) {
        barrier([&] {
            const P<peru::IMutex> lock = findServiceLock();
            if (lock) lock->lock();
            static_cast<peru::CInstanceWrapper*>(user)->destroy();
            if (lock) lock->unlock();
        });
    },
};

} // namespace tonewright::exports
