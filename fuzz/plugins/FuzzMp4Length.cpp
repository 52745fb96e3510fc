// Treats arbitrary bytes as an MPEG-4 file: boxes of any size must neither hang nor overflow.
#include "FuzzedStream.h"
#include "codecs/Mp4Length.h"

using namespace sonora2::plugins;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    std::string bytes(reinterpret_cast<const char*>(data), size);
    const InputFile file = openBytes(bytes);
    for (const int track : {0, 1}) {
        const int64_t duration = av::readMediaDuration(file.get(), track);
        require(duration >= 0 && duration < (int64_t{1} << 40));
    }
    return 0;
}
