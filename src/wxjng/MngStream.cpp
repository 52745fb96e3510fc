#include "wxjng/MngStream.h"

#include "peru/gui/ImageLimits.h"
#include "wxjng/Chunks.h"

#include <algorithm>
#include <array>
#include <utility>
#include <vector>

namespace wxjng {

namespace {

constexpr uint32_t kForever = 0x7FFFFFFF;
constexpr uint32_t kMaximalCount = 100'000; // of a loop; others are taken as endless
constexpr size_t kMaximalBytes = 64 << 20;  // beyond the file, for loops that are written out
constexpr size_t kMaximalDepth = 16;        // of nested loops

// What the library processes: everything else is metadata, or adapts colours.
constexpr std::array<std::string_view, 37> kUsed = {
    "MHDR", "MEND", "LOOP", "ENDL", "DEFI", "BASI", "CLON", "PAST", "DISC", "BACK", "FRAM", "MOVE", "CLIP",
    "SHOW", "SAVE", "SEEK", "DHDR", "PROM", "IPNG", "PPLT", "IJNG", "DROP", "DBYK", "ORDR", "MAGN", "nEED",
    "IHDR", "PLTE", "IDAT", "IEND", "tRNS", "JHDR", "JDAT", "JDAA", "JSEP", "JdAA", "TERM"};

bool startsPicture(std::string_view type) {
    return type == "IHDR" || type == "JHDR" || type == "BASI" || type == "DHDR";
}

class CChecker {
public:
    CChecker(SMngStream& stream, size_t fileBytes)
        : m_stream(stream), m_maximalBytes(fileBytes + kMaximalBytes) {
        m_loops.push_back({0, 1, std::string(kMngSignature)}); // the whole file
    }

    void add(const SChunk& chunk) {
        if (std::find(kUsed.begin(), kUsed.end(), chunk.type) == kUsed.end()) return;
        const bool isFirst = m_stream.width == 0;
        if (isFirst != (chunk.type == "MHDR")) failDamaged("mng");
        if (isFirst) return addHeader(chunk);
        if (chunk.type == "TERM") return readRepetition(chunk);
        if (chunk.type == "LOOP") return startLoop(chunk);
        if (chunk.type == "ENDL") return endLoop(chunk);
        if (chunk.type == "MEND") return finish();
        if (chunk.type == "FRAM" && !chunk.data.empty() && chunk.data[0] != 0) m_framing = chunk.data[0];
        if (startsPicture(chunk.type)) startPicture(chunk);
        if (chunk.type == "IEND" && !std::exchange(m_isInPicture, false)) failDamaged("mng");
        copy(chunk.type, chunk.data);
    }

private:
    struct SLoop {
        char level;
        uint32_t count;
        std::string body;
    };

    void copy(std::string_view type, std::string_view data) { m_loops.back().body += makeChunk(type, data); }

    void addHeader(const SChunk& chunk) {
        if (chunk.data.size() != 28) failDamaged("mng");
        const uint32_t width = readBigEndian(chunk.data, 0), height = readBigEndian(chunk.data, 4);
        peru::gui::checkImageSize(width, height);
        m_stream.width = static_cast<int>(width);
        m_stream.height = static_cast<int>(height);
        m_ticks = readBigEndian(chunk.data, 8);
        copy(chunk.type, chunk.data);
    }

    void readRepetition(const SChunk& chunk) {
        constexpr char kRepeat = 3;
        if (chunk.data.empty()) failDamaged("mng");
        if (chunk.data[0] != kRepeat) return;
        if (chunk.data.size() != 10) failDamaged("mng");
        setLoops(readBigEndian(chunk.data, 6));
    }

    void setLoops(uint32_t count) {
        m_stream.loops = count >= kForever ? 0 : static_cast<int>(std::max(count, 1u));
    }

    void startPicture(const SChunk& chunk) {
        if (m_isInPicture) failDamaged("mng");
        m_isInPicture = true;
        if (chunk.type == "DHDR") return; // changes an earlier picture, whose size bounds it
        if (chunk.data.size() < 13) failDamaged("mng");
        peru::gui::checkImageSize(readBigEndian(chunk.data, 0), readBigEndian(chunk.data, 4));
    }

    void startLoop(const SChunk& chunk) {
        if (chunk.data.size() < 5 || m_isInPicture || m_loops.size() > kMaximalDepth) failDamaged("mng");
        uint32_t count = readBigEndian(chunk.data, 1);
        // A loop without end, which some programs write around all frames, is one of the whole animation.
        if (count > kMaximalCount) setLoops(std::exchange(count, 1));
        m_loops.push_back({chunk.data[0], count, {}});
    }

    void endLoop(const SChunk& chunk) {
        if (chunk.data.size() != 1 || m_isInPicture || m_loops.size() < 2 ||
            m_loops.back().level != chunk.data[0])
            failDamaged("mng");
        const SLoop loop = std::move(m_loops.back());
        m_loops.pop_back();
        std::string& outer = m_loops.back().body;
        if (outer.size() + loop.body.size() * loop.count > m_maximalBytes) failDamaged("mng");
        if (!loop.body.empty())
            for (uint32_t i = 0; i < loop.count; ++i) outer += loop.body;
    }

    void finish() {
        if (m_isInPicture || m_loops.size() != 1) failDamaged("mng");
        m_stream.end = m_loops[0].body.size();
        if (m_ticks > 0) addInvisiblePicture();
        copy("MEND", {});
        m_stream.bytes = std::move(m_loops[0].body);
    }

    void addInvisiblePicture() {
        constexpr char kLayers = 2, kLayersOverBackground = 4; // a frame ends with the next chunk of its kind
        if (m_framing == kLayers || m_framing == kLayersOverBackground) copy("FRAM", {});
        copy("DEFI", std::string(12, '\0')); // shown at the origin
        copy("IHDR", makeBigEndian(1) + makeBigEndian(1) + std::string("\x08\x06\0\0\0", 5));
        copy("IDAT", std::string_view("\x78\xda\x63\x60\x00\x02\x00\x00\x05\x00\x01", 11)); // transparent
        copy("IEND", {});
    }

    SMngStream& m_stream;
    const size_t m_maximalBytes;
    std::vector<SLoop> m_loops;
    uint32_t m_ticks = 0; // per second; without them there is one frame
    char m_framing = 1;
    bool m_isInPicture = false;
};

} // namespace

SMngStream prepareMng(std::string_view bytes) {
    SMngStream stream;
    CChecker checker(stream, bytes.size());
    for (const SChunk& chunk : readChunks(bytes, kMngSignature, "MEND", "mng")) checker.add(chunk);
    return stream;
}

} // namespace wxjng
