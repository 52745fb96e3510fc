#include "wxjng/MngStream.h"

#include "peru/gui/ImageLimits.h"
#include "wxjng/Chunks.h"

#include <algorithm>
#include <array>

namespace wxjng {

namespace {

constexpr uint32_t kForever = 0x7FFFFFFF;
constexpr int64_t kMaximalSteps = 100'000; // chunks, repeated by loops
constexpr size_t kMaximalDepth = 16;       // of nested loops

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
    explicit CChecker(SMngStream& stream) : m_stream(stream) { m_stream.bytes = kMngSignature; }

    void add(const SChunk& chunk) {
        if (std::find(kUsed.begin(), kUsed.end(), chunk.type) == kUsed.end()) return;
        const bool isFirst = m_stream.width == 0;
        if (isFirst != (chunk.type == "MHDR")) failDamaged("mng");
        m_steps += m_factor;
        if (m_steps > kMaximalSteps) failDamaged("mng");
        if (isFirst) return addHeader(chunk);
        if (chunk.type == "TERM") return readEnd(chunk);
        if (chunk.type == "LOOP") return startLoop(chunk);
        if (chunk.type == "ENDL") endLoop(chunk);
        if (chunk.type == "MEND" && (m_isInPicture || !m_loops.empty())) failDamaged("mng");
        if (startsPicture(chunk.type)) startPicture(chunk);
        if (chunk.type == "IEND" && !std::exchange(m_isInPicture, false)) failDamaged("mng");
        copy(chunk);
    }

private:
    struct SLoop {
        uint8_t level;
        int64_t outerFactor;
    };

    void copy(const SChunk& chunk) { m_stream.bytes += makeChunk(chunk.type, chunk.data); }

    void addHeader(const SChunk& chunk) {
        if (chunk.data.size() != 28) failDamaged("mng");
        const uint32_t width = readBigEndian(chunk.data, 0), height = readBigEndian(chunk.data, 4);
        peru::gui::checkImageSize(width, height);
        m_stream.width = static_cast<int>(width);
        m_stream.height = static_cast<int>(height);
        copy(chunk);
        // Repeat, then show the last frame; without delay; twice.
        m_stream.bytes += makeChunk("TERM", std::string("\3\0", 2) + makeBigEndian(0) + makeBigEndian(2));
    }

    void readEnd(const SChunk& chunk) {
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
        if (chunk.data.size() < 5 || m_isInPicture || m_loops.size() >= kMaximalDepth) failDamaged("mng");
        const auto level = static_cast<uint8_t>(chunk.data[0]);
        uint32_t count = readBigEndian(chunk.data, 1);
        // A loop without end, which some programs write around all frames, is one of the whole animation.
        if (count >= kMaximalSteps && m_loops.empty()) {
            setLoops(count);
            count = 1;
        }
        m_loops.push_back({level, m_factor});
        m_factor = std::min(m_factor * std::max<int64_t>(count, 1), kMaximalSteps + 1);
        copy({"LOOP", std::string(1, static_cast<char>(level)) + makeBigEndian(count)});
    }

    void endLoop(const SChunk& chunk) {
        if (chunk.data.size() != 1 || m_isInPicture || m_loops.empty() ||
            m_loops.back().level != static_cast<uint8_t>(chunk.data[0]))
            failDamaged("mng");
        m_factor = m_loops.back().outerFactor;
        m_loops.pop_back();
    }

    SMngStream& m_stream;
    std::vector<SLoop> m_loops;
    int64_t m_factor = 1; // how often the current chunk is processed
    int64_t m_steps = 0;
    bool m_isInPicture = false;
};

} // namespace

SMngStream prepareMng(std::string_view bytes) {
    SMngStream stream;
    CChecker checker(stream);
    for (const SChunk& chunk : readChunks(bytes, kMngSignature, "MEND", "mng")) checker.add(chunk);
    return stream;
}

} // namespace wxjng
