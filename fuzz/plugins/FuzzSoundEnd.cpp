// Treats arbitrary bytes as an MPEG file: its sound must end within the file, and the same file without what
// follows the sound must have the same end.
#include "FuzzedStream.h"
#include "sonora2_decmpa/SoundEnd.h"

using namespace sonora2::plugins;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    std::string bytes(reinterpret_cast<const char*>(data), size);
    const InputFile file = openBytes(bytes);
    const int64_t end = findSoundEnd(file.get());
    require(end >= 0 && end <= static_cast<int64_t>(size) && std::ftell(file.get()) == 0);
    for (const int64_t start : {int64_t{0}, end / 2, end}) {
        const int64_t behind = skipTags(file.get(), start);
        require(behind >= start && skipTags(file.get(), behind) == behind);
    }
    std::string sound = bytes.substr(0, static_cast<size_t>(end));
    require(findSoundEnd(openBytes(sound).get()) <= end);
    return 0;
}
