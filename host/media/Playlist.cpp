#include "media/Playlist.h"

#include "base/Text.h"
#include "base/Translation.h"
#include "media/WebAddress.h"

#include <algorithm>
#include <cctype>
#include <cerrno>
#include <charconv>
#include <cstring>
#include <fstream>
#include <map>
#include <sstream>
#include <stdexcept>
#include <string_view>
#include <tonewright/host.h>
#include <utility>

namespace host {

namespace fs = std::filesystem;

namespace {

constexpr uintmax_t kMostBytes = 16 << 20; // of a playlist
constexpr size_t kMostItems = 1'000'000;   // playlists that name each other can multiply
constexpr size_t kMostLevels = 32;

std::string toLower(std::string text) {
    std::transform(text.begin(), text.end(), text.begin(), [](unsigned char c) { return std::tolower(c); });
    return text;
}

std::string extensionOf(const fs::path& file) {
    const std::string extension = file.extension();
    return extension.empty() ? "" : toLower(extension.substr(1));
}

std::string_view trim(std::string_view text) {
    const size_t first = text.find_first_not_of(" \t\r\n");
    if (first == std::string_view::npos) return {};
    return text.substr(first, text.find_last_not_of(" \t\r\n") - first + 1);
}

// Text that is not UTF-8 is taken for Latin-1.
std::string fromLatin1(std::string_view text) {
    std::string utf8;
    for (const char c : text) {
        const auto code = static_cast<unsigned char>(c);
        if (code < 0x80) {
            utf8 += c;
        } else {
            utf8 += static_cast<char>(0xC0 | code >> 6);
            utf8 += static_cast<char>(0x80 | (code & 0x3F));
        }
    }
    return utf8;
}

std::string toText(std::string_view bytes) {
    std::string text(bytes);
    return toUTF16(text) ? text : fromLatin1(text);
}

// "9.wav" before "10.wav"; the case of letters decides only between names that are otherwise equal.
bool isBefore(const std::string& a, const std::string& b) {
    const auto isDigit = [](const std::string& text, size_t at) {
        return at < text.size() && std::isdigit(static_cast<unsigned char>(text[at])) != 0;
    };
    size_t i = 0, k = 0;
    while (i < a.size() && k < b.size()) {
        if (isDigit(a, i) && isDigit(b, k)) {
            const auto takeNumber = [&isDigit](const std::string& text, size_t& at) {
                while (isDigit(text, at + 1) && text[at] == '0') ++at;
                const size_t start = at;
                while (isDigit(text, at)) ++at;
                return text.substr(start, at - start);
            };
            const std::string left = takeNumber(a, i), right = takeNumber(b, k);
            if (left.size() != right.size()) return left.size() < right.size();
            if (left != right) return left < right;
        } else {
            const int left = std::tolower(static_cast<unsigned char>(a[i++]));
            const int right = std::tolower(static_cast<unsigned char>(b[k++]));
            if (left != right) return left < right;
        }
    }
    if (i < a.size() || k < b.size()) return i == a.size();
    return a < b;
}

std::string readText(const fs::path& file) {
    std::error_code error;
    if (!fs::is_regular_file(file, error))
        throw std::runtime_error(error ? error.message() : tr("host.notRegular", "Is not a regular file"));
    if (fs::file_size(file, error) > kMostBytes)
        throw std::runtime_error(tr("host.Playlist.tooLarge", "Is too large for a playlist"));
    std::ifstream in(file, std::ios::binary);
    std::ostringstream text;
    text << in.rdbuf();
    if (!in) throw std::runtime_error(std::strerror(errno));
    std::string bytes = text.str();
    if (bytes.starts_with("\xEF\xBB\xBF")) bytes.erase(0, 3);
    return bytes;
}

std::vector<std::string_view> splitLines(std::string_view text) {
    std::vector<std::string_view> lines;
    while (!text.empty()) {
        const size_t end = text.find_first_of("\r\n");
        const std::string_view line = trim(text.substr(0, end));
        if (!line.empty()) lines.push_back(line);
        text.remove_prefix(end == std::string_view::npos ? text.size() : end + 1);
    }
    return lines;
}

struct SEntry {
    std::string_view location;
    std::string title;
};

std::vector<SEntry> parseM3u(std::string_view text) {
    std::vector<SEntry> entries;
    std::string title;
    for (const std::string_view line : splitLines(text)) {
        if (!line.starts_with('#')) {
            entries.push_back({line, std::exchange(title, {})});
        } else if (line.starts_with("#EXTINF:")) {
            const size_t comma = line.find(',');
            title = comma == std::string_view::npos ? "" : toText(trim(line.substr(comma + 1)));
        }
    }
    return entries;
}

std::vector<SEntry> parsePls(std::string_view text) {
    std::map<unsigned, SEntry> entries; // by their numbers
    for (const std::string_view line : splitLines(text)) {
        const size_t equals = line.find('=');
        if (equals == std::string_view::npos) continue;
        const std::string key = toLower(std::string(trim(line.substr(0, equals))));
        const std::string_view value = trim(line.substr(equals + 1));
        const size_t digits = std::min(key.find_first_of("0123456789"), key.size());
        unsigned number = 0;
        if (std::from_chars(key.data() + digits, key.data() + key.size(), number).ec != std::errc()) continue;
        if (key.substr(0, digits) == "file") entries[number].location = value;
        if (key.substr(0, digits) == "title") entries[number].title = toText(value);
    }
    std::vector<SEntry> result;
    for (const auto& [number, entry] : entries)
        if (!entry.location.empty()) result.push_back(entry);
    return result;
}

struct SCueTrack {
    std::string_view file;
    int number = 0;
    int64_t begin = -1; // frames; negative: not stated
    bool isAudio = false;
    std::string title;
};

// The first word, or the text in quotes; removed from the line.
std::string_view takeWord(std::string_view& line) {
    line = trim(line);
    const bool isQuoted = line.starts_with('"');
    if (isQuoted) line.remove_prefix(1);
    const size_t end = std::min(isQuoted ? line.find('"') : line.find_first_of(" \t"), line.size());
    const std::string_view word = line.substr(0, end);
    line.remove_prefix(std::min(end + 1, line.size()));
    return word;
}

// MM:SS:FF; minutes may have more digits.
int64_t parseCueTime(std::string_view text) {
    int64_t parts[3] = {};
    const char *at = text.data(), *const end = at + text.size();
    for (int i = 0; i < 3; ++i) {
        const auto [next, error] = std::from_chars(at, end, parts[i]);
        if (error != std::errc() || parts[i] < 0 || parts[i] > 100'000'000 || (i < 2) != (next != end) ||
            (i < 2 && *next != ':'))
            throw std::runtime_error(tr("host.Playlist.time", "The time %TEXT% is invalid",
                                        {{"%TEXT%", toPrintable(toText(text))}}));
        at = next + 1;
    }
    if (parts[1] >= 60 || parts[2] >= kCueFrames)
        throw std::runtime_error(
            tr("host.Playlist.time", "The time %TEXT% is invalid", {{"%TEXT%", toPrintable(toText(text))}}));
    return (parts[0] * 60 + parts[1]) * kCueFrames + parts[2];
}

// A track begins at its index 1; a pause before it belongs to the track before.
std::vector<SCueTrack> parseCue(std::string_view text) {
    std::vector<SCueTrack> tracks;
    std::string_view file;
    for (std::string_view line : splitLines(text)) {
        const std::string command = toLower(std::string(takeWord(line)));
        if (command == "file") {
            line = trim(line);
            // A name without quotes may contain blanks; the last word is the type.
            file = line.starts_with('"') ? takeWord(line) : trim(line.substr(0, line.find_last_of(" \t")));
        } else if (command == "track") {
            SCueTrack track;
            const std::string_view number = takeWord(line);
            std::from_chars(number.data(), number.data() + number.size(), track.number);
            track.isAudio = toLower(std::string(trim(line))) == "audio";
            tracks.push_back(track);
        } else if (command == "title" && !tracks.empty()) {
            tracks.back().title = toText(takeWord(line));
        } else if (command == "index" && !tracks.empty()) {
            int number = -1;
            const std::string_view word = takeWord(line);
            std::from_chars(word.data(), word.data() + word.size(), number);
            if (number != 1) continue;
            tracks.back().file = file;
            tracks.back().begin = parseCueTime(trim(line));
        }
    }
    return tracks;
}

class CLister {
public:
    CLister(const std::set<std::string>& extensions, bool isRecursive)
        : m_extensions(extensions), m_isRecursive(isRecursive) {}

    void add(const fs::path& input, const std::string& title = {});
    std::vector<SPlayItem> takeItems() { return std::move(m_items); }

private:
    // Lists a folder or a playlist, unless that is under way already further up.
    template <class List> void enter(const fs::path& place, List list);
    void addFile(const fs::path& file, const std::string& title, const std::string& failure = {});
    void addFolder(const fs::path& folder);
    void addEntries(const fs::path& playlist, const std::vector<SEntry>& entries);
    void addCue(const fs::path& sheet);

    const std::set<std::string>& m_extensions;
    const bool m_isRecursive;
    std::vector<fs::path> m_under; // folders and playlists that are being listed
    std::vector<SPlayItem> m_items;
};

// The file that an entry of a playlist names. Writers disagree about the encoding and about separators, so
// the first reading that exists is taken.
fs::path resolve(const fs::path& playlist, std::string_view location) {
    const std::string bytes(location);
    const size_t colon = bytes.find(':');
    const std::string scheme = toLower(bytes.substr(0, colon));
    if (colon != std::string::npos && scheme == "file") {
        const std::optional<std::u16string> uri = toUTF16(bytes);
        char* const path = uri ? TONEWRIGHT_Host_URIToPath(uri->c_str()) : nullptr;
        if (!path) throw std::runtime_error(tr("host.Playlist.address", "The address is invalid"));
        const fs::path file = path;
        TONEWRIGHT_Host_Free(path);
        return file;
    }
    if (isWebAddress(bytes)) return bytes;
    if (colon != std::string::npos && bytes.compare(colon, 3, "://") == 0)
        throw std::runtime_error(tr("host.Playlist.onlyHttp", "Only files and http addresses can be played"));
    const fs::path folder = playlist.parent_path();
    const std::string text = toText(bytes);
    std::error_code none;
    for (std::string name : {bytes, text}) {
        if (fs::exists(folder / name, none)) return folder / name;
        std::replace(name.begin(), name.end(), '\\', '/');
        if (fs::exists(folder / name, none)) return folder / name;
    }
    return folder / text;
}

void CLister::addFile(const fs::path& file, const std::string& title, const std::string& failure) {
    if (m_items.size() >= kMostItems)
        throw std::length_error(tr("host.Playlist.tooMany", "The playlists have too many entries"));
    SPlayItem item;
    item.file = item.name = file;
    item.title = title;
    item.failure = failure;
    m_items.push_back(std::move(item));
}

template <class List> void CLister::enter(const fs::path& place, List list) {
    std::error_code error;
    fs::path real = fs::canonical(place, error);
    if (error) return addFile(place, {}, error.message());
    if (std::find(m_under.begin(), m_under.end(), real) != m_under.end())
        return addFile(place, {}, tr("host.Playlist.itself", "Contains itself"));
    if (m_under.size() >= kMostLevels)
        return addFile(place, {}, tr("host.Playlist.nested", "Is nested too deeply"));
    m_under.push_back(std::move(real));
    try {
        list();
    } catch (const std::runtime_error& failure) {
        addFile(place, {}, failure.what());
    }
    m_under.pop_back();
}

void CLister::add(const fs::path& input, const std::string& title) {
    if (isWebAddress(input)) return addFile(input, title);
    std::error_code none;
    const std::string extension = extensionOf(input);
    if (fs::is_directory(input, none))
        enter(input, [&] { addFolder(input); });
    else if (extension == "m3u" || extension == "m3u8")
        enter(input, [&] { addEntries(input, parseM3u(readText(input))); });
    else if (extension == "pls")
        enter(input, [&] { addEntries(input, parsePls(readText(input))); });
    else if (extension == "cue")
        enter(input, [&] { addCue(input); });
    else
        addFile(input, title);
}

// Files come before the folders beside them. Hidden ones are left out.
void CLister::addFolder(const fs::path& folder) {
    std::vector<std::string> files, folders;
    std::error_code error, none;
    for (fs::directory_iterator entry(folder, error); !error && entry != fs::directory_iterator();
         entry.increment(error)) {
        const std::string name = entry->path().filename();
        if (name.starts_with('.')) continue;
        if (entry->is_directory(none))
            folders.push_back(name);
        else if (m_extensions.count(extensionOf(name)) != 0)
            files.push_back(name);
    }
    if (error) throw std::runtime_error(error.message());
    std::sort(files.begin(), files.end(), isBefore);
    std::sort(folders.begin(), folders.end(), isBefore);
    for (const std::string& name : files) addFile(folder / name, {});
    const bool isTop = m_under.size() == 1;
    const size_t before = m_items.size() - files.size();
    if (m_isRecursive)
        for (const std::string& name : folders) enter(folder / name, [&] { addFolder(folder / name); });
    if (isTop && m_items.size() == before)
        throw std::runtime_error(tr("host.Playlist.noFiles", "The folder has no sound files"));
}

void CLister::addEntries(const fs::path& playlist, const std::vector<SEntry>& entries) {
    if (entries.empty()) throw std::runtime_error(tr("host.Playlist.empty", "The playlist is empty"));
    for (const SEntry& entry : entries) {
        try {
            add(resolve(playlist, entry.location), entry.title);
        } catch (const std::runtime_error& failure) {
            addFile(fs::path(toText(entry.location)), entry.title, failure.what());
        }
    }
}

void CLister::addCue(const fs::path& sheet) {
    const std::string text = readText(sheet);
    const std::vector<SCueTrack> tracks = parseCue(text);
    const size_t before = m_items.size();
    for (size_t i = 0; i < tracks.size(); ++i) {
        const SCueTrack& track = tracks[i];
        if (!track.isAudio) continue;
        addFile(sheet, track.title);
        SPlayItem& item = m_items.back();
        item.track = track.number;
        if (track.begin < 0 || track.file.empty()) {
            item.failure = tr("host.Playlist.noBeginning", "Track %NUMBER% has no beginning",
                              {{"%NUMBER%", std::to_string(track.number)}});
            continue;
        }
        try {
            item.file = resolve(sheet, track.file);
        } catch (const std::runtime_error& failure) {
            item.failure = failure.what();
            continue;
        }
        item.begin = track.begin;
        const bool isFollowed =
            i + 1 < tracks.size() && tracks[i + 1].begin >= 0 && tracks[i + 1].file == track.file;
        if (!isFollowed) continue;
        item.end = tracks[i + 1].begin;
        if (*item.end <= item.begin)
            item.failure = tr("host.Playlist.endsEarly", "Track %NUMBER% ends before it begins",
                              {{"%NUMBER%", std::to_string(track.number)}});
    }
    if (m_items.size() == before)
        throw std::runtime_error(tr("host.Playlist.noTracks", "The cue sheet has no tracks"));
}

} // namespace

std::vector<SPlayItem> listItems(const std::vector<fs::path>& inputs, const std::set<std::string>& extensions,
                                 bool isRecursive) {
    CLister lister(extensions, isRecursive);
    for (const fs::path& input : inputs) lister.add(input);
    return lister.takeItems();
}

} // namespace host
