#include "media/NamePattern.h"

#include "base/Translation.h"

#include <algorithm>
#include <set>
#include <stdexcept>
#include <utility>

namespace host {

namespace fs = std::filesystem;

namespace {

constexpr size_t kLongestName = 255; // bytes of a file name on the usual file systems

struct SField {
    const char* name;
    const char* missing; // what replaces an empty text
};

constexpr SField kFields[] = {{"artist", "Unknown Artist"},
                              {"album-artist", "Unknown Artist"},
                              {"album", "Unknown Album"},
                              {"title", "Unknown Title"},
                              {"track", "00"},
                              {"year", "Unknown Year"},
                              {"genre", "Unknown Genre"},
                              {"comment", ""},
                              {"name", "Unknown Name"}};

const SField* findField(std::string_view name) {
    const auto* found = std::find_if(std::begin(kFields), std::end(kFields),
                                     [&](const SField& field) { return field.name == name; });
    return found == std::end(kFields) ? nullptr : found;
}

bool isDigits(std::string_view text) {
    return !text.empty() && text.find_first_not_of("0123456789") == std::string_view::npos;
}

bool isFreeText(const std::string& field) {
    return field != "track" && field != "year";
}

std::string trim(std::string text, const char* start, const char* end) {
    text.erase(text.find_last_not_of(end) + 1);
    text.erase(0, text.find_first_not_of(start));
    return text;
}

// As far as the text can be a part of a file name anywhere in it.
std::string clean(std::string_view text) {
    std::string result;
    for (size_t i = 0; i < text.size(); ++i) {
        const auto c = static_cast<unsigned char>(text[i]);
        const auto next = static_cast<unsigned char>(i + 1 < text.size() ? text[i + 1] : 0);
        const bool isLongControl = c == 0xC2 && next >= 0x80 && next < 0xA0;
        if (isLongControl) ++i;
        result += isLongControl || c < 0x20 || c == 0x7F ? ' ' : c == '/' ? '-' : text[i];
    }
    return trim(std::move(result), " ", " ");
}

std::string getText(const CNamePattern::Fields& fields, const std::string& name) {
    const auto found = fields.find(name);
    if (found == fields.end()) return "";
    return clean(name == "track" ? found->second.substr(0, found->second.find('/')) : found->second);
}

std::string expandField(const CNamePattern::Fields& fields, const std::string& name) {
    std::string text = getText(fields, name);
    if (name == "track" && isDigits(text) && text.size() < 2) text.insert(0, "0");
    if (name == "year" && text.size() > 4 && isDigits(std::string_view(text).substr(0, 4)) && text[4] == '-')
        text.resize(4);
    // Dots alone would leave nothing of a part.
    const auto isMissing = [](const std::string& value) {
        return value.find_first_not_of(". ") == std::string::npos;
    };
    if (isMissing(text) && name == "title") text = getText(fields, "name");
    if (isMissing(text) && name == "album-artist") text = getText(fields, "artist");
    return isMissing(text) ? findField(name)->missing : text;
}

// Cuts between characters of UTF-8.
void cut(std::string& text, size_t size) {
    if (text.size() <= size) return;
    while (size > 0 && (text[size] & 0xC0) == 0x80) --size;
    text.resize(size);
}

std::string trimZeros(const std::string& digits) {
    const size_t start = digits.find_first_not_of('0');
    return start == std::string::npos ? "0" : digits.substr(start);
}

} // namespace

std::string CNamePattern::describeFields() {
    std::string list;
    for (const SField& field : kFields) list += std::string(list.empty() ? "%" : ", %") + field.name + "%";
    return list;
}

CNamePattern::CNamePattern(const std::string& text) : m_parts(1) {
    const auto addText = [this](char c) {
        Part& part = m_parts.back();
        if (part.empty() || part.back().isField) part.push_back({false, ""});
        part.back().text += c;
    };
    bool hasField = false;
    for (size_t i = 0; i < text.size(); ++i) {
        const auto c = static_cast<unsigned char>(text[i]);
        if (c < 0x20 || c == 0x7F)
            throw std::invalid_argument(tr("host.Pattern.control", "has control characters"));
        if (text[i] == '/') {
            m_parts.emplace_back();
        } else if (text[i] != '%') {
            addText(text[i]);
        } else if (text.compare(i, 2, "%%") == 0) {
            addText('%');
            ++i;
        } else {
            const size_t end = text.find('%', i + 1);
            const std::string name = text.substr(i + 1, end == std::string::npos ? end : end - i - 1);
            if (end == std::string::npos || !findField(name))
                throw std::invalid_argument(tr(
                    "host.Pattern.unknown", "has no field %NAME%; known are %LIST%, and %% is a percent sign",
                    {{"%NAME%", text.substr(i, name.size() + 2)}, {"%LIST%", describeFields()}}));
            m_parts.back().push_back({true, name});
            hasField = true;
            i = end;
        }
    }
    if (!hasField)
        throw std::invalid_argument(
            tr("host.Pattern.noField", "needs a field: %LIST%", {{"%LIST%", describeFields()}}));
    for (const Part& part : m_parts)
        if (part.empty() || (part.size() == 1 && !part[0].isField && trim(part[0].text, ". ", ". ").empty()))
            throw std::invalid_argument(
                tr("host.Pattern.relative", "must be a relative path without empty parts, '.' and '..'"));
}

fs::path CNamePattern::expand(const Fields& fields, const std::string& extension) const {
    fs::path path;
    for (const Part& part : m_parts) {
        const std::string& end = &part == &m_parts.back() ? extension : std::string();
        std::string name;
        for (const SPiece& piece : part) name += piece.isField ? expandField(fields, piece.text) : piece.text;
        name = trim(std::move(name), ". ", ". ");
        cut(name, kLongestName - std::min(end.size(), kLongestName));
        name = trim(std::move(name), "", ". ");
        path /= (name.empty() ? "Unknown" : name) + end;
    }
    return path;
}

bool CNamePattern::canMatch() const {
    for (const Part& part : m_parts)
        for (size_t i = 1; i < part.size(); ++i)
            if (part[i - 1].isField && part[i].isField && isFreeText(part[i - 1].text) &&
                isFreeText(part[i].text))
                return false;
    return true;
}

namespace {

// Finds the division of one part's name.
template <class Part> class CMatcher {
public:
    CMatcher(const Part& part, const std::string& name) : m_part(part), m_name(name), m_texts(part.size()) {}

    // The texts of the pieces; empty if the name does not match.
    std::vector<std::string> run() { return matchFrom(0, 0) ? m_texts : std::vector<std::string>(); }

private:
    bool matchFrom(size_t piece, size_t start) {
        if (piece == m_part.size()) return start == m_name.size();
        if (m_failed.count({piece, start}) > 0) return false;
        const auto& [isField, text] = m_part[piece];
        const size_t left = m_name.size() - start;
        const auto matches = [&](size_t size) {
            m_texts[piece] = m_name.substr(start, size);
            return matchFrom(piece + 1, start + size);
        };
        bool found = false;
        if (!isField) {
            found = m_name.compare(start, text.size(), text) == 0 && matches(text.size());
        } else if (text == "year") {
            found = left >= 4 && isDigits(m_name.substr(start, 4)) && matches(4);
        } else if (text == "track") {
            const size_t end = m_name.find_first_not_of("0123456789", start);
            for (size_t size = std::min(end, m_name.size()) - start; size > 0 && !found; --size)
                found = matches(size);
        } else {
            for (size_t size = 1; size <= left && !found; ++size) found = matches(size);
        }
        if (!found) m_failed.insert({piece, start});
        return found;
    }

    const Part& m_part;
    const std::string& m_name;
    std::vector<std::string> m_texts;
    std::set<std::pair<size_t, size_t>> m_failed; // bounds the time for any pattern and name
};

} // namespace

std::optional<CNamePattern::Fields> CNamePattern::match(const fs::path& file) const {
    Fields fields;
    fs::path rest = file.parent_path() / file.stem();
    for (auto part = m_parts.rbegin(); part != m_parts.rend(); ++part, rest = rest.parent_path()) {
        const std::string name = rest.filename().native();
        const std::vector<std::string> texts = CMatcher(*part, name).run();
        if (texts.empty()) return std::nullopt;
        for (size_t i = 0; i < texts.size(); ++i) {
            const auto& [isField, field] = (*part)[i];
            if (!isField || field == "name") continue;
            const std::string text = field == "track" ? trimZeros(texts[i]) : trim(texts[i], " ", " ");
            if (text.empty() || fields.try_emplace(field, text).first->second != text) return std::nullopt;
        }
    }
    return fields;
}

} // namespace host
