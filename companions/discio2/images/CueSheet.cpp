#include "CueSheet.h"
#include "ImageLayout.h"

#include <algorithm>
#include <charconv>

namespace discio {

namespace {

std::string toCapitals(std::string text) {
    for (char& c : text)
        if (c >= 'a' && c <= 'z') c = static_cast<char>(c - 'a' + 'A');
    return text;
}

// Words of a line; those in quotation marks may contain spaces.
std::vector<std::string> split(std::string_view line) {
    std::vector<std::string> words;
    for (size_t i = 0; i < line.size();) {
        if (line[i] == ' ' || line[i] == '\t') {
            ++i;
            continue;
        }
        const bool isQuoted = line[i] == '"';
        const size_t start = isQuoted ? i + 1 : i;
        const size_t end = std::min(line.find_first_of(isQuoted ? "\"" : " \t", start), line.size());
        words.emplace_back(line.substr(start, end - start));
        i = isQuoted ? end + 1 : end;
    }
    return words;
}

constexpr std::pair<const char*, int> kTexts[] = {
    {"TITLE", DISCIO_TEXT_TITLE},
    {"PERFORMER", DISCIO_TEXT_PERFORMER},
    {"SONGWRITER", DISCIO_TEXT_SONGWRITER},
    {"COMPOSER", DISCIO_TEXT_COMPOSER},
    {"ARRANGER", DISCIO_TEXT_ARRANGER},
    {"MESSAGE", DISCIO_TEXT_MESSAGE},
    {"DISC_ID", DISCIO_TEXT_DISC_ID},
    {"GENRE", DISCIO_TEXT_GENRE},
    {"ISRC", DISCIO_TEXT_CODE},
    {"CATALOG", DISCIO_TEXT_CODE},
};

class CParser {
public:
    explicit CParser(const std::string& path) : m_path(path) {}

    SCueSheet parse(std::string_view text) {
        while (!text.empty()) {
            const size_t end = std::min(text.find_first_of("\r\n"), text.size());
            ++m_line;
            parseLine(split(text.substr(0, end)));
            const bool isPair = text.substr(end).starts_with("\r\n");
            text.remove_prefix(std::min(text.size(), end + (isPair ? 2 : 1)));
        }
        return std::move(m_sheet);
    }

private:
    [[noreturn]] void refuse(const char* reason) const {
        throw CDiscError(DISCIO_ERROR_UNSUPPORTED_FORMAT,
                         m_path + ", line " + std::to_string(m_line) + ": " + reason);
    }

    int toNumber(const std::string& text) const {
        int number = -1;
        const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
        if (error != std::errc() || end != text.data() + text.size() || number < 0 || number > kMaxTracks)
            refuse("a number from 0 to 99 is expected");
        return number;
    }

    int32_t toTime(const std::string& text) const {
        const int32_t time = parseTime(text);
        if (time < 0) refuse("a time in the form MM:SS:FF is expected");
        return time;
    }

    SCueTrack& requireTrack() {
        if (m_sheet.tracks.empty()) refuse("there is no TRACK before");
        return m_sheet.tracks.back();
    }

    void parseLine(std::vector<std::string> words) {
        if (words.empty()) return;
        const std::string command = toCapitals(words[0]);
        if (command == "REM") return;
        words.resize(std::max<size_t>(words.size(), 3));
        if (command == "FILE") {
            m_sheet.files.push_back({words[1], toCapitals(words[2])});
        } else if (command == "TRACK") {
            SCueTrack track;
            track.number = toNumber(words[1]);
            track.mode = toCapitals(words[2]);
            m_sheet.tracks.push_back(track);
        } else if (command == "INDEX") {
            if (m_sheet.files.empty()) refuse("there is no FILE before");
            requireTrack().indices.push_back(
                {toNumber(words[1]), static_cast<int>(m_sheet.files.size()) - 1, toTime(words[2])});
        } else if (command == "PREGAP") {
            requireTrack().pregap = toTime(words[1]);
        } else if (command == "POSTGAP") {
            requireTrack().postgap = toTime(words[1]);
        } else if (command == "CDTEXTFILE") {
            m_sheet.textFile = words[1];
        } else {
            Texts& texts = m_sheet.tracks.empty() ? m_sheet.texts : m_sheet.tracks.back().texts;
            for (const auto& [name, index] : kTexts)
                if (command == name) texts[static_cast<size_t>(index)] = words[1];
        }
    }

    std::string m_path;
    int m_line = 0;
    SCueSheet m_sheet;
};

} // namespace

SCueSheet parseCueSheet(std::string_view bytes, const std::string& path) {
    return CParser(path).parse(toUTF8Text(bytes));
}

} // namespace discio
