#include "freedb/FreeDBRecord.h"

#include "freedb/FreeDBDiscInfo.h"

#include <algorithm>
#include <charconv>
#include <optional>

namespace freedb {

using peru::CString;

namespace {

constexpr std::string_view kSeparator = " / ";
constexpr std::string_view kTrackTitle = "TTITLE", kTrackNotes = "EXTT";

std::string_view trim(std::string_view text) {
    const size_t first = text.find_first_not_of(" \t");
    if (first == std::string_view::npos) return {};
    return text.substr(first, text.find_last_not_of(" \t") - first + 1);
}

// "\n", "\t" and "\\" stand for a line end, a tab and a backslash.
std::string unescape(std::string_view text) {
    std::string result;
    for (size_t i = 0; i < text.size(); ++i) {
        const char next = text[i] == '\\' && i + 1 < text.size() ? text[i + 1] : '\0';
        const char meant = next == 'n' ? '\n' : next == 't' ? '\t' : next == '\\' ? '\\' : '\0';
        result += meant ? meant : text[i];
        if (meant) ++i;
    }
    return result;
}

std::string toTitle(std::string text) {
    std::replace_if(
        text.begin(), text.end(), [](char c) { return c == '\n' || c == '\t'; }, ' ');
    return std::string(trim(text));
}

// The number of the track that a key names: "TTITLE0" is the first one.
std::optional<size_t> getTrack(std::string_view key, std::string_view name) {
    if (!key.starts_with(name)) return std::nullopt;
    key.remove_prefix(name.size());
    size_t number = 0;
    const auto [stop, error] = std::from_chars(key.data(), key.data() + key.size(), number);
    if (error != std::errc() || stop != key.data() + key.size() || number >= CFreeDBDiscInfo::kMostTracks)
        return std::nullopt;
    return number;
}

struct SParts {
    std::string artist;
    std::string title;
};

// A text without a separator is a title.
SParts split(const std::string& text) {
    const size_t at = text.find(kSeparator);
    if (at == std::string::npos) return {"", text};
    return {std::string(trim(text.substr(0, at))), std::string(trim(text.substr(at + kSeparator.size())))};
}

// Whether the titles of tracks name their artists: always on discs of various artists, otherwise only if all
// of several titles have that form, since a slash may also be part of a title.
bool isCompilation(const std::string& artist, const std::vector<std::string>& titles) {
    std::string lower;
    for (const char c : artist) lower += static_cast<char>(c >= 'A' && c <= 'Z' ? c | 0x20 : c);
    for (const char* various : {"various", "various artists", "various artist", "va", "v.a.", "v/a"})
        if (lower == various) return true;
    return titles.size() > 1 && std::all_of(titles.begin(), titles.end(), [](const std::string& title) {
               return title.find(kSeparator) != std::string::npos;
           });
}

} // namespace

// A value that is longer than a line continues in another line with the same key; a character of several
// bytes, or the blanks around a word, may be split between them.
void CFreeDBRecord::addLine(std::string_view line) {
    if (line.starts_with('#')) return;
    const size_t equals = line.find('=');
    if (equals == std::string_view::npos) return;
    m_values[std::string(trim(line.substr(0, equals)))] += line.substr(equals + 1);
}

P<CAudioCDInfo> CFreeDBRecord::build(const CTextDecoder& decoder) const {
    const P<CAudioCDInfo> info = peru::make<CAudioCDInfo>();
    std::vector<std::string> titles;
    bool isNamed = false;
    const auto requireTrack = [&](size_t track) {
        while (info->tracks.size() <= track) info->tracks.push_back(peru::make<CAudioTrackInfo>());
        titles.resize(info->tracks.size());
    };
    SParts album;
    for (const auto& [key, bytes] : m_values) {
        const std::string value = unescape(trim(decoder.decode(bytes)));
        const P<peru::IString> text = CString::fromUTF8(toTitle(value));
        if (key == "DTITLE") {
            album = split(toTitle(value));
            isNamed = true;
        } else if (key == "DYEAR") {
            info->year = text;
        } else if (key == "DGENRE") {
            info->genre = text;
        } else if (key == "EXTD") {
            info->extended = CString::fromUTF8(value);
        } else if (const auto named = getTrack(key, kTrackTitle)) {
            requireTrack(*named);
            titles[*named] = toTitle(value);
            isNamed = true;
        } else if (const auto noted = getTrack(key, kTrackNotes)) {
            requireTrack(*noted);
            info->tracks[*noted]->extended = CString::fromUTF8(value);
        }
    }
    if (!isNamed) return nullptr;
    info->artist = CString::fromUTF8(album.artist);
    info->title = CString::fromUTF8(album.title);
    const bool splits = isCompilation(album.artist, titles);
    for (size_t i = 0; i < titles.size(); ++i) {
        const SParts parts = splits ? split(titles[i]) : SParts{"", titles[i]};
        info->tracks[i]->artist = CString::fromUTF8(parts.artist);
        info->tracks[i]->title = CString::fromUTF8(parts.title);
    }
    return info;
}

} // namespace freedb
