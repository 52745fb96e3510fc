// Treats arbitrary bytes as a WAV or CAF file: patches must be inside of the file, and a patched file
// must not need another one.
#include "FuzzedStream.h"
#include "sonora2_wav/CodecName.h"
#include "sonora2_wav/MissingSize.h"

#include <algorithm>

using namespace sonora2::plugins;
using namespace sonora2::plugins::wav;

namespace {

void checkPatch(std::string bytes, SPatch (*find)(std::FILE*)) {
    const InputFile file = openBytes(bytes);
    const SPatch patch = find(file.get());
    require(std::ftell(file.get()) == 0 && patch.size <= patch.bytes.size());
    if (patch.size == 0) return;
    require(patch.offset >= 8 &&
            patch.offset + static_cast<int64_t>(patch.size) <= static_cast<int64_t>(bytes.size()));
    std::copy_n(patch.bytes.begin(), patch.size, bytes.begin() + patch.offset);
    require(find(openBytes(bytes).get()).size == 0);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    std::string bytes(reinterpret_cast<const char*>(data), size);
    checkPatch(bytes, findMissingSize);
    checkPatch(bytes, findMissingWidth);
    const std::string codec = readUnsupportedCodec(openBytes(bytes).get(), true);
    require(codec.size() < 64 && std::ranges::all_of(codec, [](char c) { return c >= ' ' && c <= '~'; }));
    return 0;
}
