// Projects for the tests.
#pragma once

#include "discio2/DiscSupport.h"

#include <cstring>
#include <vector>

namespace tests {

// A source in memory whose reading can be made to end early or to fail.
struct SSource {
    std::string pcm;
    size_t frames = 0;    // announced
    int64_t failsAt = -1; // frame
    int32_t channels = 2, rate = 44100;
    int32_t canOpen = 1, canRewind = 1, canSeek = 0, seeks = 1; // what the functions return
    int32_t surplus = 0;                                        // of frames that are said to be delivered
    int rewinds = 0;
    size_t position = 0;
    int opened = 0;
    int ended = 0;

    explicit SSource(const std::string& samples = {}) : pcm(samples), frames(samples.size() / 4) {}

    static const DISCIO_PCMAudioStreamFuncs& getFuncs() {
        static const auto get = [](void* user) -> SSource& { return *static_cast<SSource*>(user); };
        static const DISCIO_PCMAudioStreamFuncs s_funcs{
            [](void* user) { return static_cast<double>(get(user).frames) / 44100; },
            nullptr,
            [](void* user) {
                get(user).opened += get(user).canOpen;
                return get(user).canOpen;
            },
            [](void* user) { --get(user).opened; },
            [](void* user) { return get(user).channels; },
            [](void* user) { return get(user).rate; },
            [](void* user) { return static_cast<int64_t>(get(user).frames); },
            [](void* user) {
                get(user).position = 0;
                ++get(user).rewinds;
                return get(user).canRewind;
            },
            [](void*) {},
            [](void* user) { return get(user).canSeek; },
            [](void* user, void* pcm, int32_t frames, int32_t* delivered) {
                SSource& own = get(user);
                if (own.failsAt >= 0 &&
                    own.position / 4 + static_cast<size_t>(frames) > static_cast<size_t>(own.failsAt))
                    return int32_t{0};
                const size_t bytes =
                    std::min({static_cast<size_t>(frames) * 4, own.pcm.size() - own.position, size_t{1000}});
                std::memcpy(pcm, own.pcm.data() + own.position, bytes);
                own.position += bytes;
                *delivered = static_cast<int32_t>(bytes / 4) + own.surplus;
                return int32_t{1};
            },
            [](void*) { return int64_t{-1}; },
            [](void* user, int64_t frame) {
                get(user).position = std::min(static_cast<size_t>(frame) * 4, get(user).pcm.size());
                return get(user).seeks;
            },
            [](void* user) { return static_cast<int64_t>(get(user).position / 4); },
            [](void* user) { ++get(user).ended; },
        };
        return s_funcs;
    }
};

struct SProject {
    explicit SProject(bool isAudio)
        : library(DISCIO_Create()), project(isAudio ? DISCIO_CreateAudioCDProject(library.get())
                                                    : DISCIO_CreateDataDiscProject(library.get())),
          disc(DISCIO_ProjectGetVirtualDisc(project.get())) {}

    int32_t insert(SSource& source, int32_t place = -1) const {
        const Discio<DISCIO_PCMAudioStream> stream(
            DISCIO_CreatePCMAudioStreamFromFuncs(library.get(), &SSource::getFuncs(), &source));
        return DISCIO_DiscAudioInsertSegmentPCMAudioStream(disc.get(), stream.get(), place);
    }
    int32_t write(const std::string& path, const DISCIO_WriteOptions* options = nullptr) const {
        return DISCIO_ProjectWriteImageW(project.get(), wide(path).c_str(), options);
    }

    Discio<DISCIO_Library> library;
    Discio<DISCIO_Project> project;
    Discio<DISCIO_Disc> disc;
};

} // namespace tests
