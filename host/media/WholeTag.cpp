#include "media/WholeTag.h"

#include "base/Text.h"
#include "base/Translation.h"
#include "library/Failure.h"
#include "media/FileTag.h"
#include "media/SoundFile.h"

#include <algorithm>
#include <cctype>
#include <stdexcept>

namespace host {

namespace fs = std::filesystem;

namespace {

struct SKey {
    const char* name; // on the command line
    const char* key;
    const char* other; // a second name in Vorbis comments, which counts first if it is a comment
};

constexpr SKey kKeys[] = {{"title", "TITLE", nullptr},          {"artist", "ARTIST", nullptr},
                          {"album", "ALBUM", nullptr},          {"album-artist", "ALBUMARTIST", nullptr},
                          {"track", "TRACKNUMBER", "TRACKNUM"}, {"year", "DATE", "YEAR"},
                          {"genre", "GENRE", nullptr},          {"comment", "COMMENT", "DESCRIPTION"}};

bool isWave(const fs::path& file) {
    return hasExtension(file, {".wav"});
}

std::string readText(const SWholeTag& tag, const SKey& key, bool hasOthers) {
    const std::string other = hasOthers && key.other ? tag.getFirst(key.other) : "";
    const std::string text = tag.getFirst(key.key);
    const bool otherFirst = std::string_view(key.name) == "comment";
    return (text.empty() || otherFirst) && !other.empty() ? other : text;
}

} // namespace

bool hasExtension(const fs::path& file, std::initializer_list<std::string_view> extensions) {
    std::string extension = file.extension();
    std::transform(extension.begin(), extension.end(), extension.begin(),
                   [](unsigned char c) { return std::tolower(c); });
    return std::find(extensions.begin(), extensions.end(), extension) != extensions.end();
}

bool hasVorbisComment(const fs::path& file) {
    return hasExtension(file, {".flac", ".ogg", ".oga", ".opus", ".spx"});
}

bool canHaveTag(const fs::path& file) {
    return TONEWRIGHT_Host_GetTagSupport(toURI(file).c_str()) != 0;
}

void checkTagged(const fs::path& file) {
    checkInput(file);
    if (isWave(file) && isWideWav(file))
        throw std::runtime_error(tr("host.Tag.rf64", "No tag is known for RF64 files"));
    if (!canHaveTag(file))
        throw std::runtime_error(
            tr("host.Tag.unknownKind", "No tag is known for %KIND%", {{"%KIND%", describeKind(file)}}));
}

std::string SWholeTag::getFirst(const std::string& name) const {
    for (const auto& [key, values] : fields)
        if (key == name) return values.front();
    return "";
}

SWholeTag readWholeTag(const fs::path& file) {
    checkTagged(file);
    clearFailure();
    const CHandle handle(TONEWRIGHT_Host_ReadTags(toURI(file).c_str()));
    if (!handle)
        throw std::runtime_error(takeFailure(tr("host.Tag.unreadable", "The tag cannot be read"), file));
    SWholeTag tag;
    for (int32_t i = 0; i < TONEWRIGHT_Host_GetTagEntryCount(handle.get()); ++i) {
        const char *name = nullptr, *value = nullptr;
        TONEWRIGHT_Host_GetTagEntry(handle.get(), i, &name, &value);
        if (!value)
            tag.others.emplace_back(name);
        else if (!tag.fields.empty() && tag.fields.back().first == name)
            tag.fields.back().second.emplace_back(value);
        else
            tag.fields.push_back({name, {value}});
    }
    for (int32_t i = 0; i < TONEWRIGHT_Host_GetTagPictureCount(handle.get()); ++i) {
        TONEWRIGHT_TagPicture picture = {};
        picture.size = sizeof picture;
        TONEWRIGHT_Host_GetTagPicture(handle.get(), i, &picture);
        tag.pictures.push_back({std::string(static_cast<const char*>(picture.data), picture.dataSize),
                                picture.mimeType, picture.description, picture.type, picture.width,
                                picture.height});
    }
    return tag;
}

TagTexts readTagTexts(CLibrary& library, const fs::path& file) {
    checkTagged(file);
    TagTexts texts;
    const CFileTag tag(library, file);
    if (tag)
        for (const STagField& field : getTagFields()) texts[field.name] = toUTF8(tag.get(field).c_str());
    // The exports do not support all fields in WAV files.
    if (tag && !isWave(file)) return texts;
    const SWholeTag whole = readWholeTag(file);
    for (const SKey& key : kKeys)
        if (texts[key.name].empty()) texts[key.name] = readText(whole, key, hasVorbisComment(file));
    return texts;
}

CTagChange::CTagChange() : m_change(TONEWRIGHT_Host_CreateTagChange()) {}

void CTagChange::setField(const std::string& name, const std::string& value) {
    clearFailure();
    if (TONEWRIGHT_Host_ChangeTagField(m_change.get(), name.c_str(), value.c_str()) != 1)
        throw std::runtime_error(
            takeFailure(tr("host.Tag.unsettable", "The field %FIELD% cannot be set", {{"%FIELD%", name}})));
}

void CTagChange::removePictures(int type) {
    TONEWRIGHT_Host_RemoveTagPictures(m_change.get(), type);
}

void CTagChange::addPicture(const STagPicture& picture) {
    clearFailure();
    const TONEWRIGHT_TagPicture given{sizeof given,
                                      picture.data.data(),
                                      picture.data.size(),
                                      picture.mimeType.c_str(),
                                      picture.description.c_str(),
                                      picture.type,
                                      picture.width,
                                      picture.height};
    if (TONEWRIGHT_Host_AddTagPicture(m_change.get(), &given) != 1)
        throw std::runtime_error(takeFailure(tr("host.Cover.unusable", "The picture cannot be used")));
}

bool CTagChange::apply(const fs::path& file) const {
    clearFailure();
    const int32_t result = TONEWRIGHT_Host_ApplyTagChange(m_change.get(), toURI(file).c_str());
    if (result < 0)
        throw std::runtime_error(
            takeFailure(tr("host.Tag.unwritable", "The tag could not be written"), file));
    return result == 1;
}

void setTagText(CTagChange& change, const fs::path& file, const std::string& name, const std::string& text) {
    for (const SKey& key : kKeys) {
        if (key.name != name) continue;
        change.setField(key.key, text);
        if (key.other && hasVorbisComment(file)) change.setField(key.other, "");
    }
}

const std::map<std::string, int>& getPictureTypes() {
    static const std::map<std::string, int> kTypes{
        {"other", 0},          {"icon", 1},      {"other-icon", 2},  {"front", 3},         {"back", 4},
        {"leaflet", 5},        {"media", 6},     {"lead-artist", 7}, {"artist", 8},        {"conductor", 9},
        {"band", 10},          {"composer", 11}, {"lyricist", 12},   {"place", 13},        {"recording", 14},
        {"concert", 15},       {"screen", 16},   {"fish", 17},       {"illustration", 18}, {"band-logo", 19},
        {"publisher-logo", 20}};
    return kTypes;
}

std::string getPictureTypeName(int type) {
    for (const auto& [name, number] : getPictureTypes())
        if (number == type) return name;
    return std::to_string(type);
}

} // namespace host
