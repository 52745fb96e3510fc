// Images whose table of contents follows the sectors as a list of chunks.
#include "CdText.h"
#include "LayoutBuilder.h"

#include <cstring>
#include <string_view>

namespace discio {

namespace {

constexpr size_t kMaxChunk = 1 << 20;

// Big-endian numbers of a chunk. Throws CDiscError past its end.
class CBytes {
public:
    CBytes(std::string_view bytes, const std::string& path) : m_bytes(bytes), m_path(path) {}

    std::string_view take(size_t count) {
        if (count > m_bytes.size())
            throw CDiscError(DISCIO_ERROR_UNSUPPORTED_FORMAT, m_path + ": its table of contents is damaged");
        const std::string_view taken = m_bytes.substr(0, count);
        m_bytes.remove_prefix(count);
        return taken;
    }
    int64_t number(size_t count) {
        uint64_t value = 0;
        for (const char c : take(count)) value = value << 8 | static_cast<uint8_t>(c);
        return static_cast<int64_t>(value);
    }
    size_t left() const { return m_bytes.size(); }

private:
    std::string_view m_bytes;
    const std::string& m_path;
};

class CNrgImage {
public:
    explicit CNrgImage(const std::string& path) : m_path(path), m_file(m_builder.openFile(path)) {}

    SImageLayout read() {
        const CImageFile& file = m_builder.getFile(m_file);
        for (int64_t offset = findChunks(); offset > 0 && offset < file.getSize();) {
            char head[8];
            if (file.read(offset, head, sizeof head) < sizeof head) break;
            const std::string_view id(head, 4);
            const int64_t size = CBytes({head + 4, 4}, m_path).number(4);
            if (id == "END!") break;
            offset += static_cast<int64_t>(sizeof head);
            if (size > static_cast<int64_t>(kMaxChunk)) refuse("its table of contents is damaged");
            std::string content(static_cast<size_t>(size), '\0');
            content.resize(file.read(offset, content.data(), content.size()));
            readChunk(id, content);
            offset += size;
        }
        addCdText(m_texts, m_builder.getContents());
        return m_builder.finish();
    }

private:
    [[noreturn]] void refuse(const char* reason) const {
        throw CDiscError(DISCIO_ERROR_UNSUPPORTED_FORMAT, m_path + ": " + reason);
    }

    int64_t findChunks() const {
        const CImageFile& file = m_builder.getFile(m_file);
        char end[12];
        if (file.getSize() >= 12 && file.read(file.getSize() - 12, end, 12) == 12) {
            if (std::memcmp(end, "NER5", 4) == 0) return CBytes({end + 4, 8}, m_path).number(8);
            if (std::memcmp(end + 4, "NERO", 4) == 0) return CBytes({end + 8, 4}, m_path).number(4);
        }
        refuse("it has no table of contents");
    }

    void readChunk(std::string_view id, std::string_view content) {
        if (id == "CDTX") {
            m_texts = content;
        } else if (id == "DAOX" || id == "DAOI" || id == "ETN2" || id == "ETNF") {
            if (!m_builder.getContents().tracks.empty()) refuse("several sessions are not supported");
            CBytes bytes(content, m_path);
            if (id[0] == 'D')
                readDiscAtOnce(bytes, id == "DAOX" ? 8 : 4);
            else
                readTrackAtOnce(bytes, id == "ETN2" ? 8 : 4);
        }
    }

    void readDiscAtOnce(CBytes& bytes, size_t width) {
        bytes.take(4);
        m_builder.getContents().texts[DISCIO_TEXT_CODE] = toText(bytes.take(13));
        bytes.take(5);
        while (bytes.left() >= 18 + 3 * width) {
            const std::string code = toText(bytes.take(12));
            const int64_t size = bytes.number(2);
            const int64_t mode = bytes.number(1);
            bytes.take(3);
            const int64_t pregap = bytes.number(width);
            const int64_t start = bytes.number(width);
            const int64_t end = bytes.number(width);
            addTrack(getForm(mode, size), pregap, start, end, code);
        }
    }

    void readTrackAtOnce(CBytes& bytes, size_t width) {
        while (bytes.left() >= 2 * width + 8) {
            const int64_t start = bytes.number(width);
            const int64_t length = bytes.number(width);
            const int64_t mode = bytes.number(4);
            bytes.take(4); // the block where it starts
            bytes.take(std::min<size_t>(bytes.left(), width == 8 ? 8 : 4));
            if (length < 0 || start < 0 || length > INT64_MAX - start)
                refuse("its table of contents is damaged");
            addTrack(getForm(mode, 0), start, start, start + length, "");
        }
    }

    ESectorForm getForm(int64_t mode, int64_t size) const {
        static constexpr std::pair<int, ESectorForm> kModes[] = {
            {0, ESectorForm::data},          {2, ESectorForm::data},
            {3, ESectorForm::withSubheader}, {5, ESectorForm::raw},
            {6, ESectorForm::raw},           {7, ESectorForm::audio},
            {0xF, ESectorForm::rawWithSub},  {0x10, ESectorForm::audioWithSub},
            {0x11, ESectorForm::rawWithSub}};
        for (const auto& [code, form] : kModes)
            if (code == mode && (size == 0 || size == getSectorBytes(form))) return form;
        refuse("a track has an unknown mode");
    }

    // Offsets in the file.
    void addTrack(ESectorForm form, int64_t pregap, int64_t start, int64_t end, const std::string& code) {
        const int64_t size = getSectorBytes(form);
        const int64_t fileSize = m_builder.getFile(m_file).getSize();
        if (pregap < 0 || start < pregap || end < start || end > fileSize || (start - pregap) % size != 0)
            refuse("its table of contents is damaged");
        STrack track;
        const bool isFirst = m_builder.getContents().tracks.empty();
        track.number = static_cast<int>(m_builder.getContents().tracks.size()) + 1;
        track.isAudio = isAudioForm(form);
        track.texts[DISCIO_TEXT_CODE] = code;
        // The file contains the pause before the first track.
        if (isFirst) pregap = std::min(start, pregap + kLeadInSectors * size);
        const int32_t before = m_builder.getNext();
        append(form, pregap, start);
        track.start = m_builder.getNext();
        track.pregap = track.start - before + (isFirst ? kLeadInSectors : 0);
        append(form, start, end);
        m_builder.getContents().tracks.push_back(track);
    }

    void append(ESectorForm form, int64_t from, int64_t to) {
        const int64_t size = getSectorBytes(form);
        const int64_t count = (to - from + size - 1) / size;
        if (count > INT32_MAX) refuse("it is larger than any disc");
        m_builder.append(form, static_cast<int32_t>(count), m_file, from, to - from);
    }

    static std::string toText(std::string_view bytes) {
        return toUTF8Text(bytes.substr(0, std::min(bytes.find('\0'), bytes.size())));
    }

    std::string m_path;
    CLayoutBuilder m_builder;
    int m_file;
    std::string m_texts;
};

} // namespace

SImageLayout readNrgImage(const std::string& path) {
    return CNrgImage(path).read();
}

} // namespace discio
