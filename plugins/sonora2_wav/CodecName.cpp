#include "sonora2_wav/CodecName.h"

#include "sonora2_wav/Chunks.h"

#include <algorithm>
#include <array>

namespace sonora2::plugins::wav {

namespace {

struct SName {
    const char* id;
    const char* name;
};
constexpr std::array kNames{
    SName{"ima4", "IMA ADPCM"},
    SName{"aac ", "AAC"},
    SName{"ac-3", "AC-3"},
    SName{"opus", "Opus"},
    SName{"QDM2", "QDesign Music 2"},
    SName{"0x0022", "TrueSpeech"},
    SName{"0x00ff", "AAC"},
    SName{"0x0161", "Windows Media Audio"},
    SName{"0x0162", "Windows Media Audio Professional"},
    SName{"0x2000", "AC-3"},
    SName{"0x2001", "DTS"},
};

std::string readId(std::FILE* file) {
    const std::string start = readAt(file, 0, 12);
    if (start.starts_with("caff")) {
        const SChunk description = findCAFChunk(file, "desc");
        return description.id.empty() ? std::string() : readAt(file, description.body + 8, 4);
    }
    if (!start.ends_with("WAVE")) return {};
    const bool bigEndian = start.starts_with("RIFX");
    const SChunk format = findChunk(file, "fmt ", bigEndian);
    if (format.size < 0) return {};
    const std::string tag = readAt(file, format.body, 2);
    if (tag.empty()) return {};
    std::array<char, 8> hex{};
    std::snprintf(hex.data(), hex.size(), "0x%04x", static_cast<unsigned>(toNumber(tag, bigEndian)));
    return hex.data();
}

} // namespace

std::string readUnsupportedCodec(std::FILE* file, bool any) {
    std::string id = readId(file);
    const auto found = std::ranges::find(kNames, id, &SName::id);
    const bool isPrintable = std::ranges::all_of(id, [](char c) { return c >= ' ' && c <= '~'; });
    if (found != kNames.end()) return std::string(found->name) + " (" + id + ")";
    return any && isPrintable ? id : std::string();
}

} // namespace sonora2::plugins::wav
