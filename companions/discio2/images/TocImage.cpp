// Images with a table of contents in the text form of disc-at-once recorders.
#include "LayoutBuilder.h"

#include <algorithm>
#include <charconv>
#include <map>

namespace discio {

namespace {

constexpr size_t kMaxSheetBytes = 1 << 20;
constexpr int64_t kSampleBytes = 4; // a frame of both channels
constexpr int64_t kMaxOffset = int64_t{1} << 50;

struct SToken {
    std::string text;
    bool isQuoted = false;
};

// Words, texts in quotation marks and braces; comments start with "//".
std::vector<SToken> tokenize(const std::string& text) {
    std::vector<SToken> tokens;
    for (size_t i = 0; i < text.size();) {
        const char c = text[i];
        if (std::string_view(" \t\r\n,").find(c) != std::string_view::npos) {
            ++i;
        } else if (text.compare(i, 2, "//") == 0) {
            i = std::min(text.find('\n', i), text.size());
        } else if (c == '{' || c == '}') {
            tokens.push_back({std::string(1, c)});
            ++i;
        } else if (c == '"') {
            SToken token{"", true};
            for (++i; i < text.size() && text[i] != '"'; ++i) {
                if (text[i] != '\\' || i + 1 >= text.size()) {
                    token.text += text[i];
                    continue;
                }
                int value = 0;
                const auto [end, error] = std::from_chars(
                    text.data() + i + 1, text.data() + std::min(i + 4, text.size()), value, 8);
                if (error == std::errc()) {
                    token.text += static_cast<char>(value);
                    i = static_cast<size_t>(end - text.data()) - 1;
                } else {
                    token.text += text[++i];
                }
            }
            ++i;
            tokens.push_back(token);
        } else {
            const size_t end = std::min(text.find_first_of(" \t\r\n,{}\"", i), text.size());
            tokens.push_back({text.substr(i, end - i)});
            i = end;
        }
    }
    return tokens;
}

const std::map<std::string, ESectorForm, std::less<>> kModes{
    {"AUDIO", ESectorForm::audio},
    {"MODE1", ESectorForm::data},
    {"MODE1_RAW", ESectorForm::raw},
    {"MODE2_FORM1", ESectorForm::data},
    {"MODE2_FORM_MIX", ESectorForm::withSubheader},
    {"MODE2", ESectorForm::withSubheader},
    {"MODE2_RAW", ESectorForm::raw},
};
const std::map<std::string, int, std::less<>> kTexts{
    {"TITLE", DISCIO_TEXT_TITLE},
    {"PERFORMER", DISCIO_TEXT_PERFORMER},
    {"SONGWRITER", DISCIO_TEXT_SONGWRITER},
    {"COMPOSER", DISCIO_TEXT_COMPOSER},
    {"ARRANGER", DISCIO_TEXT_ARRANGER},
    {"MESSAGE", DISCIO_TEXT_MESSAGE},
    {"DISC_ID", DISCIO_TEXT_DISC_ID},
    {"UPC_EAN", DISCIO_TEXT_CODE},
    {"ISRC", DISCIO_TEXT_CODE},
    {"CATALOG", DISCIO_TEXT_CODE},
};

class CTocImage {
public:
    explicit CTocImage(const std::string& path)
        : m_path(path), m_tokens(tokenize(CImageFile(path).readAll(kMaxSheetBytes))) {}

    SImageLayout read() {
        while (m_next < m_tokens.size()) readStatement(take());
        endTrack();
        return m_builder.finish();
    }

private:
    [[noreturn]] void refuse(const std::string& reason) const {
        throw CDiscError(DISCIO_ERROR_UNSUPPORTED_FORMAT, m_path + ": " + reason);
    }
    const SToken& take() {
        static const SToken kNone;
        return m_next < m_tokens.size() ? m_tokens[m_next++] : kNone;
    }
    Texts& getTexts() {
        STableOfContents& contents = m_builder.getContents();
        return contents.tracks.empty() ? contents.texts : contents.tracks.back().texts;
    }

    void readStatement(const SToken& token) {
        if (token.isQuoted) return;
        const std::string& word = token.text;
        if (word == "TRACK") {
            startTrack(take().text);
        } else if (word == "CD_TEXT") {
            readTexts();
        } else if (word == "CATALOG" || word == "ISRC") {
            getTexts()[DISCIO_TEXT_CODE] = toUTF8Text(take().text);
        } else if (word == "FILE" || word == "AUDIOFILE") {
            readAudioFile();
        } else if (word == "DATAFILE") {
            readDataFile();
        } else if (word == "SILENCE" || word == "ZERO") {
            while (m_next < m_tokens.size() && !isLength(m_tokens[m_next])) ++m_next; // a mode
            appendSilence();
        } else if (word == "PREGAP") {
            requireTrack();
            appendSilence();
            m_start = m_builder.getNext();
        } else if (word == "START") {
            requireTrack();
            m_start = m_next < m_tokens.size() && isLength(m_tokens[m_next])
                          ? m_trackBegin + toSectors(takeLength())
                          : m_builder.getNext();
        } else if (word == "INDEX") {
            take();
        }
    }

    void requireTrack() const {
        if (m_trackBegin < 0) refuse("there is no TRACK before its content");
    }

    void startTrack(const std::string& mode) {
        endTrack();
        const auto found = kModes.find(mode);
        if (found == kModes.end()) refuse("the mode " + mode + " is not supported");
        m_form = found->second;
        STrack track;
        track.number = static_cast<int>(m_builder.getContents().tracks.size()) + 1;
        track.isAudio = isAudioForm(m_form);
        m_builder.getContents().tracks.push_back(track);
        m_trackBegin = m_start = m_builder.getNext();
    }

    void endTrack() {
        if (m_trackBegin < 0) return;
        STrack& track = m_builder.getContents().tracks.back();
        track.start = m_start;
        track.pregap = m_start - m_trackBegin + (track.number == 1 ? kLeadInSectors : 0);
    }

    // The texts of the first language.
    void readTexts() {
        int depth = 0;
        bool isFirst = true, isMap = false;
        do {
            const SToken& token = take();
            if (!token.isQuoted && token.text == "{") {
                ++depth;
            } else if (!token.isQuoted && token.text == "}") {
                --depth;
                if (depth == 1 && !isMap) isFirst = false;
                isMap = false;
            } else if (token.text == "LANGUAGE_MAP") {
                isMap = true;
            } else if (!token.isQuoted && isFirst && depth == 2 && m_next < m_tokens.size() &&
                       m_tokens[m_next].isQuoted) {
                const auto found = kTexts.find(token.text);
                if (found != kTexts.end())
                    getTexts()[static_cast<size_t>(found->second)] = toUTF8Text(take().text);
            }
        } while (depth > 0 && m_next < m_tokens.size());
    }

    static bool isLength(const SToken& token) {
        return !token.isQuoted && !token.text.empty() && token.text[0] >= '0' && token.text[0] <= '9';
    }

    // In frames: a time, or a number of frames.
    int64_t takeLength() {
        const std::string& text = take().text;
        const int32_t blocks = parseTime(text);
        if (blocks >= 0) return int64_t{blocks} * kFramesPerSector;
        int64_t frames = -1;
        const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), frames);
        if (error != std::errc() || end != text.data() + text.size() || frames < 0 || frames > INT32_MAX)
            refuse("a time or a length is expected instead of " + text);
        return frames;
    }
    static int32_t toSectors(int64_t frames) {
        return static_cast<int32_t>((frames + kFramesPerSector - 1) / kFramesPerSector);
    }

    void appendSilence() {
        requireTrack();
        m_builder.append(ESectorForm::silence, toSectors(takeLength()));
    }

    int64_t takeOffset() {
        if (m_next >= m_tokens.size() || m_tokens[m_next].text[0] != '#') return 0;
        const std::string text = take().text.substr(1);
        int64_t offset = 0;
        const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), offset);
        if (error != std::errc() || end != text.data() + text.size() || offset < 0 || offset > kMaxOffset)
            refuse("an offset is invalid");
        return offset;
    }

    void readAudioFile() {
        requireTrack();
        const int file = m_builder.openFile(resolveName(m_path, take().text));
        const CImageFile& opened = m_builder.getFile(file);
        // Raw samples are big-endian unless they are marked.
        ESectorForm form = ESectorForm::audioSwapped;
        if (m_next < m_tokens.size() && m_tokens[m_next].text == "SWAP") {
            form = ESectorForm::audio;
            take();
        }
        int64_t offset = takeOffset();
        int64_t available = opened.getSize();
        char head[4];
        if (opened.read(0, head, 4) == 4 && std::string_view(head, 4) == "RIFF") {
            const SWaveData data = findWaveData(opened);
            form = ESectorForm::audio;
            offset += data.offset;
            available = data.offset + data.bytes;
        }
        const int64_t skipped = m_next < m_tokens.size() && isLength(m_tokens[m_next]) ? takeLength() : 0;
        offset += skipped * kSampleBytes;
        int64_t bytes = available - offset;
        if (m_next < m_tokens.size() && isLength(m_tokens[m_next])) {
            const int64_t wanted = takeLength() * kSampleBytes;
            if (wanted > 0 && wanted > bytes) refuse(opened.getPath() + " is shorter than its tracks");
            if (wanted > 0) bytes = wanted;
        }
        appendBytes(form, file, offset, bytes);
    }

    void readDataFile() {
        requireTrack();
        const int file = m_builder.openFile(resolveName(m_path, take().text));
        const CImageFile& opened = m_builder.getFile(file);
        const int64_t offset = takeOffset();
        int64_t bytes = opened.getSize() - offset;
        if (m_next < m_tokens.size() && isLength(m_tokens[m_next])) {
            const int32_t blocks = parseTime(m_tokens[m_next].text);
            const int64_t wanted = blocks >= 0 ? int64_t{blocks} * getSectorBytes(m_form) : takeLength();
            if (blocks >= 0) take();
            if (wanted > bytes) refuse(opened.getPath() + " is shorter than its tracks");
            bytes = wanted;
        }
        appendBytes(m_form, file, offset, bytes);
    }

    void appendBytes(ESectorForm form, int file, int64_t offset, int64_t bytes) {
        if (isAudioForm(form) != m_builder.getContents().tracks.back().isAudio)
            refuse("a data track has audio");
        const int64_t size = getSectorBytes(form);
        if (bytes < 0 || bytes / size >= INT32_MAX)
            refuse(m_builder.getFile(file).getPath() + " is shorter than its tracks");
        m_builder.append(form, static_cast<int32_t>((bytes + size - 1) / size), file, offset, bytes);
    }

    std::string m_path;
    std::vector<SToken> m_tokens;
    size_t m_next = 0;
    CLayoutBuilder m_builder;
    ESectorForm m_form = ESectorForm::audio;
    int32_t m_trackBegin = -1; // block where the current track's pregap starts
    int32_t m_start = 0;
};

} // namespace

SImageLayout readTocImage(const std::string& path) {
    return CTocImage(path).read();
}

} // namespace discio
