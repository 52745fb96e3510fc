// Arbitrary bytes as a playlist or cue sheet; the first byte selects the kind.
#include "media/Playlist.h"

#include <cstdint>
#include <cstdlib>
#include <fstream>
#include <unistd.h>

namespace fs = std::filesystem;

namespace {

void require(bool condition) {
    if (!condition) std::abort();
}

// A folder in memory, so that nothing but the playlist can be found in it.
const fs::path& getFolder() {
    static const fs::path folder = [] {
        char name[] = "/dev/shm/tonewright-fuzz-XXXXXX";
        require(::mkdtemp(name) != nullptr);
        static const fs::path kept = name;
        std::atexit([] { fs::remove_all(kept); });
        return kept;
    }();
    return folder;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    static constexpr const char* kNames[] = {"list.cue", "list.m3u", "list.m3u8", "list.pls"};
    if (size == 0) return 0;
    const fs::path file = getFolder() / kNames[data[0] % std::size(kNames)];
    std::ofstream(file, std::ios::binary).write(reinterpret_cast<const char*>(data + 1), size - 1);
    for (const host::SPlayItem& item : host::listItems({file}, {"wav"}, false)) {
        require(item.track >= 0 && item.begin >= 0);
        // A track of a cue sheet that can be played has a range, and whatever cannot has a reason.
        require(!item.failure.empty() || !item.end || *item.end > item.begin);
        require(!item.failure.empty() || !item.file.empty());
    }
    fs::remove(file);
    return 0;
}
