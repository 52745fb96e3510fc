#include "filetag/LazyLibrary.h"
#include "host_support/Guard.h"
#include "host_support/PictureFormat.h"
#include "peru/strings/LocalizedFormat.h"
#include "sonora2/plugins/PluginExtensions.h"

#include <algorithm>
#include <string_view>
#include <vector>

using namespace tonewright::host_support;
using filetag::IFileTag;
using peru::CString;
using peru::IString;

namespace {

constexpr struct {
    const char* key; // as in tag transfer
    P<IString> (IFileTag::*get)() const;
    void (IFileTag::*set)(const peru::CStringArg& text);
} kFields[] = {{"TITLE", &IFileTag::getTitle, &IFileTag::setTitle},
               {"ARTIST", &IFileTag::getArtist, &IFileTag::setArtist},
               {"ALBUM", &IFileTag::getAlbum, &IFileTag::setAlbum},
               {"ALBUMARTIST", &IFileTag::getAlbumArtist, &IFileTag::setAlbumArtist},
               {"TRACKNUMBER", &IFileTag::getTrackNumber, &IFileTag::setTrackNumber},
               {"DATE", &IFileTag::getYear, &IFileTag::setYear},
               {"GENRE", &IFileTag::getGenre, &IFileTag::setGenre},
               {"COMMENT", &IFileTag::getComment, &IFileTag::setComment}};

struct SSource {
    filetag::STags all;
    // Of a WAVE file, where the tag class of the exports finds fields that TagLib does not; parallel to
    // kFields.
    std::vector<P<IString>> texts;

    bool isEmpty() const {
        return all.fields.empty() && all.pictures.empty() &&
               std::all_of(texts.begin(), texts.end(), [](const auto& text) { return text->isEmpty(); });
    }
};

// The result is empty for file types without tags.
SSource readSource(const P<peru::IURI>& file) {
    SSource source;
    try {
        source.all = filetag::getLibrary()->readAllTags(file);
        if (sonora2::common::getLookupKey(file, nullptr)->equals("wav"))
            if (const P<IFileTag> own = filetag::getLibrary()->createTag(file))
                for (const auto& field : kFields) source.texts.push_back(((*own).*field.get)());
    } catch (const peru::CFileFormatNotSupportedError&) {
        // Keep what has been read so far.
    }
    return source;
}

// Stores the fields of a WAVE file that TagLib has missed. Returns their keys.
std::vector<std::string> complement(const SSource& source, const P<peru::IURI>& file) {
    std::vector<std::string> stored;
    const P<IFileTag> target = source.texts.empty() ? nullptr : filetag::getLibrary()->createTag(file);
    if (!target) return stored;
    for (size_t i = 0; i < source.texts.size(); ++i) {
        const auto& field = kFields[i];
        if (source.texts[i]->isEmpty() || !((*target).*field.get)()->isEmpty()) continue;
        ((*target).*field.set)(source.texts[i]);
        if (!((*target).*field.get)()->isEmpty()) stored.push_back(field.key);
    }
    if (!stored.empty()) target->store();
    return stored;
}

// Returns the names of the fields and pictures that the target cannot hold.
std::string writeTarget(const SSource& source, const P<peru::IURI>& to) {
    std::vector<std::string> lost;
    try {
        const filetag::STransferReport report = filetag::getLibrary()->addTags(to, source.all);
        const std::vector<std::string> stored = complement(source, to);
        for (const P<IString>& field : report.lostFields) {
            const std::string name = CString::toStdString(field);
            if (std::find(stored.begin(), stored.end(), name) == stored.end()) lost.push_back(name);
        }
        for (const filetag::STagPicture& picture : report.lostPictures)
            lost.push_back("picture (" + CString::toStdString(picture.mimeType) + ")");
    } catch (const peru::CFileFormatNotSupportedError&) {
        for (const filetag::STagField& field : source.all.fields)
            lost.push_back(CString::toStdString(field.key));
        if (!source.all.pictures.empty()) lost.push_back("pictures");
    }
    std::string names;
    for (const std::string& name : lost) names += (names.empty() ? "" : ", ") + name;
    return names;
}

// The extensions of formats with tags, apart from those of tracker music and video.
constexpr const char* kTagged[] = {"mp3", "flac", "ogg", "oga",  "opus", "spx", "m4a", "m4b", "mp4", "wav",
                                   "wma", "asf",  "aif", "aiff", "aifc", "ape", "wv",  "mpc", "tta"};
constexpr const char* kExported[] = {"mp3", "wav", "flac", "ogg", "wma", "asf"};

template <size_t count> bool contains(const char* const (&names)[count], const P<IString>& name) {
    return std::any_of(std::begin(names), std::end(names),
                       [&](const char* each) { return name->equals(each); });
}

std::string toText(const P<IString>& text) {
    return text ? CString::toStdString(text) : std::string();
}

struct SPicture {
    std::string data, mimeType, description;
    int32_t type = 0, width = 0, height = 0;
};

class CTagCopy : public peru::CObject {
public:
    struct SEntry {
        std::string name, value;
        bool hasText;
    };
    std::vector<SEntry> entries;
    std::vector<SPicture> pictures;

    explicit CTagCopy(const SSource& source) {
        for (const filetag::STagField& field : source.all.fields)
            for (const P<IString>& value : field.values)
                entries.push_back({toText(field.key), toText(value), true});
        for (size_t i = 0; i < source.texts.size(); ++i) {
            const bool isThere = std::any_of(entries.begin(), entries.end(), [&](const SEntry& entry) {
                return entry.name == kFields[i].key;
            });
            if (!isThere && !source.texts[i]->isEmpty())
                entries.push_back({kFields[i].key, toText(source.texts[i]), true});
        }
        std::stable_sort(entries.begin(), entries.end(),
                         [](const SEntry& a, const SEntry& b) { return a.name < b.name; });
        for (const P<IString>& name : source.all.others) entries.push_back({toText(name), "", false});
        for (const filetag::STagPicture& picture : source.all.pictures) add(picture);
    }
    ~CTagCopy() override = default;

private:
    void add(const filetag::STagPicture& source) {
        SPicture& picture = pictures.emplace_back();
        picture.data.assign(reinterpret_cast<const char*>(source.data->getData()),
                            static_cast<size_t>(source.data->getSize()));
        const SPictureFormat format = detectPictureFormat(picture.data);
        picture.mimeType = toText(source.mimeType);
        if (picture.mimeType.empty()) picture.mimeType = format.mimeType;
        picture.description = toText(source.description);
        picture.type = source.fileType;
        picture.width = source.width > 0 ? source.width : format.width;
        picture.height = source.height > 0 ? source.height : format.height;
    }
};

class CTagChange : public peru::CObject {
public:
    filetag::STagChange change;

    CTagChange() = default;
    ~CTagChange() override = default;
};

bool isFieldName(std::string_view name) {
    return !name.empty() &&
           std::all_of(name.begin(), name.end(), [](char c) { return c >= ' ' && c <= '}' && c != '='; });
}

bool hasField(const std::vector<filetag::STagField>& fields, const char* key) {
    return std::any_of(fields.begin(), fields.end(),
                       [&](const filetag::STagField& field) { return field.key->equalsIgnoreCase(key); });
}

// TagLib would drop the fields of a WAVE file that it does not find.
void keepMissedTexts(const P<peru::IURI>& file, filetag::STagChange& change) {
    if (!sonora2::common::getLookupKey(file, nullptr)->equals("wav")) return;
    const SSource source = readSource(file);
    for (size_t i = 0; i < source.texts.size(); ++i) {
        const char* const key = kFields[i].key;
        if (source.texts[i]->isEmpty() || hasField(source.all.fields, key) || hasField(change.fields, key))
            continue;
        change.fields.push_back({CString::fromUTF8(key), {source.texts[i]}});
    }
}

template <class Item> const Item& getItem(const std::vector<Item>& items, int32_t index) {
    if (index < 0 || static_cast<size_t>(index) >= items.size())
        throw peru::CError(peru::localize("tonewright.Tags.index", "The index is out of range"));
    return items[static_cast<size_t>(index)];
}

} // namespace

int32_t TONEWRIGHT_Host_CopyTags(const char16_t* source, const char16_t* target, char** lost) {
    if (lost) *lost = nullptr;
    int32_t failure = 0;
    return guard(failure, [&] {
        const P<peru::IURI> from = tonewright::exports::toURI(source),
                            to = tonewright::exports::toURI(target);
        const SSource tag = readSource(from);
        failure = -1;
        if (tag.isEmpty()) return 1;
        const std::string names = writeTarget(tag, to);
        if (lost && !names.empty()) *lost = ::strdup(names.c_str());
        return 1;
    });
}

int32_t TONEWRIGHT_Host_GetTagSupport(const char16_t* uri) {
    return guard(0, [&] {
        const P<IString> extension = sonora2::common::getLookupKey(tonewright::exports::toURI(uri), nullptr);
        if (!contains(kTagged, extension)) return 0;
        return TONEWRIGHT_TAG_FIELDS | TONEWRIGHT_TAG_PICTURES |
               (contains(kExported, extension) ? TONEWRIGHT_TAG_EXPORTS : 0);
    });
}

TONEWRIGHT_Handle TONEWRIGHT_Host_ReadTags(const char16_t* uri) {
    return guard<TONEWRIGHT_Handle>(nullptr, [&] {
        const P<peru::IURI> file = tonewright::exports::toURI(uri);
        SSource source = readSource(file);
        if (source.isEmpty()) filetag::getLibrary()->readAllTags(file); // throws if the format is unknown
        return wrap(peru::make<CTagCopy>(source));
    });
}

int32_t TONEWRIGHT_Host_GetTagEntryCount(TONEWRIGHT_Handle tags) {
    const P<CTagCopy> copy = unwrap<CTagCopy>(tags);
    return copy ? static_cast<int32_t>(copy->entries.size()) : 0;
}

int32_t TONEWRIGHT_Host_GetTagEntry(TONEWRIGHT_Handle tags, int32_t index, const char** name,
                                    const char** value) {
    return guard(0, [&] {
        const CTagCopy::SEntry& entry = getItem(require<CTagCopy>(tags, "a tag")->entries, index);
        if (name) *name = entry.name.c_str();
        if (value) *value = entry.hasText ? entry.value.c_str() : nullptr;
        return 1;
    });
}

int32_t TONEWRIGHT_Host_GetTagPictureCount(TONEWRIGHT_Handle tags) {
    const P<CTagCopy> copy = unwrap<CTagCopy>(tags);
    return copy ? static_cast<int32_t>(copy->pictures.size()) : 0;
}

int32_t TONEWRIGHT_Host_GetTagPicture(TONEWRIGHT_Handle tags, int32_t index, TONEWRIGHT_TagPicture* picture) {
    return guard(0, [&] {
        const SPicture& source = getItem(require<CTagCopy>(tags, "a tag")->pictures, index);
        fillRecord(picture,
                   {sizeof(*picture), source.data.data(), source.data.size(), source.mimeType.c_str(),
                    source.description.c_str(), source.type, source.width, source.height});
        return 1;
    });
}

TONEWRIGHT_Handle TONEWRIGHT_Host_CreateTagChange(void) {
    return guard<TONEWRIGHT_Handle>(nullptr, [] { return wrap(peru::make<CTagChange>()); });
}

int32_t TONEWRIGHT_Host_ChangeTagField(TONEWRIGHT_Handle change, const char* name, const char* value) {
    return guard(0, [&] {
        std::vector<filetag::STagField>& fields =
            require<CTagChange>(change, "a change of a tag")->change.fields;
        if (!name || !isFieldName(name))
            throw peru::CError(
                peru::localize("tonewright.Tags.fieldName", "The name of the field is invalid"));
        const P<IString> key = CString::fromUTF8(name);
        auto field = std::find_if(fields.begin(), fields.end(), [&](const filetag::STagField& other) {
            return other.key->equalsIgnoreCase(key);
        });
        if (field == fields.end()) field = fields.insert(fields.end(), {key, {}});
        if (value && *value) field->values.push_back(CString::fromUTF8(value));
        return 1;
    });
}

int32_t TONEWRIGHT_Host_RemoveTagPictures(TONEWRIGHT_Handle change, int32_t type) {
    return guard(0, [&] {
        filetag::STagChange& target = require<CTagChange>(change, "a change of a tag")->change;
        if (type < 0)
            target.removesAllPictures = true;
        else
            target.removedPictures.push_back(type);
        return 1;
    });
}

int32_t TONEWRIGHT_Host_AddTagPicture(TONEWRIGHT_Handle change, const TONEWRIGHT_TagPicture* picture) {
    return guard(0, [&] {
        filetag::STagChange& target = require<CTagChange>(change, "a change of a tag")->change;
        TONEWRIGHT_TagPicture given = {};
        if (picture) std::memcpy(&given, picture, std::min(picture->size, sizeof given));
        if (!given.data || given.dataSize == 0)
            throw peru::CError(peru::localize("tonewright.Tags.emptyPicture", "The picture is empty"));
        const std::string_view bytes(static_cast<const char*>(given.data), given.dataSize);
        const SPictureFormat format = detectPictureFormat(bytes);
        const std::string type = given.mimeType && *given.mimeType ? given.mimeType : format.mimeType;
        if (type.empty())
            throw peru::CError(peru::localize("tonewright.Tags.pictureType",
                                              "The picture is not a JPEG, PNG, GIF, BMP or WebP file"));
        filetag::STagPicture added;
        added.data = peru::make<peru::CMemoryBlock>(static_cast<int64_t>(bytes.size()));
        std::memcpy(added.data->getData(), bytes.data(), bytes.size());
        added.mimeType = CString::fromUTF8(type);
        added.description = CString::fromUTF8(given.description ? given.description : "");
        added.fileType = given.type;
        added.width = given.width > 0 ? given.width : format.width;
        added.height = given.height > 0 ? given.height : format.height;
        added.colorDepth = format.colorDepth;
        target.addedPictures.push_back(added);
        return 1;
    });
}

int32_t TONEWRIGHT_Host_ApplyTagChange(TONEWRIGHT_Handle change, const char16_t* uri) {
    return guard(-1, [&] {
        const P<peru::IURI> file = tonewright::exports::toURI(uri);
        filetag::STagChange all = require<CTagChange>(change, "a change of a tag")->change;
        keepMissedTexts(file, all);
        return filetag::getLibrary()->changeTags(file, all) ? 1 : 0;
    });
}
