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
} kFields[] = {{"TITLE", &IFileTag::getTitle},
               {"ARTIST", &IFileTag::getArtist},
               {"ALBUM", &IFileTag::getAlbum},
               {"ALBUMARTIST", &IFileTag::getAlbumArtist},
               {"TRACKNUMBER", &IFileTag::getTrackNumber},
               {"DATE", &IFileTag::getYear},
               {"GENRE", &IFileTag::getGenre},
               {"COMMENT", &IFileTag::getComment}};

bool hasField(const std::vector<filetag::STagField>& fields, const char* key) {
    return std::any_of(fields.begin(), fields.end(),
                       [&](const filetag::STagField& field) { return field.key->equalsIgnoreCase(key); });
}

// Adds the fields of a WAVE file that the tag class of the exports finds and TagLib does not, which would
// otherwise be lost with a copy or a change.
void addMissedFields(const P<peru::IURI>& file, std::vector<filetag::STagField>& fields) {
    if (!sonora2::common::getLookupKey(file, nullptr)->equals("wav")) return;
    const filetag::STags known = filetag::getLibrary()->readAllTags(file);
    const P<IFileTag> tag = filetag::getLibrary()->createTag(file);
    for (const auto& field : kFields) {
        if (!tag || hasField(known.fields, field.key) || hasField(fields, field.key)) continue;
        const P<IString> text = ((*tag).*field.get)();
        if (!text->isEmpty()) fields.push_back({CString::fromUTF8(field.key), {text}});
    }
}

// The result is empty for file types without tags.
filetag::STags readSource(const P<peru::IURI>& file) {
    filetag::STags source;
    try {
        source = filetag::getLibrary()->readAllTags(file);
        addMissedFields(file, source.fields);
    } catch (const peru::CFileFormatNotSupportedError&) {
        // Keep what has been read so far.
    }
    return source;
}

bool isEmpty(const filetag::STags& tags) {
    return tags.fields.empty() && tags.pictures.empty() && tags.others.empty();
}

// Returns the names of the fields and pictures that the target cannot hold.
std::string writeTarget(const filetag::STags& source, const P<peru::IURI>& to) {
    std::vector<std::string> lost;
    try {
        filetag::STags all = source;
        addMissedFields(to, all.fields);
        const filetag::STransferReport report = filetag::getLibrary()->addTags(to, all);
        for (const P<IString>& field : report.lostFields) lost.push_back(CString::toStdString(field));
        for (const filetag::STagPicture& picture : report.lostPictures)
            lost.push_back("picture (" + CString::toStdString(picture.mimeType) + ")");
    } catch (const peru::CFileFormatNotSupportedError&) {
        for (const filetag::STagField& field : source.fields) lost.push_back(CString::toStdString(field.key));
        if (!source.pictures.empty()) lost.push_back("pictures");
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

    explicit CTagCopy(const filetag::STags& source) {
        for (const filetag::STagField& field : source.fields)
            for (const P<IString>& value : field.values)
                entries.push_back({toText(field.key), toText(value), true});
        std::stable_sort(entries.begin(), entries.end(),
                         [](const SEntry& a, const SEntry& b) { return a.name < b.name; });
        for (const P<IString>& name : source.others) entries.push_back({toText(name), "", false});
        for (const filetag::STagPicture& picture : source.pictures) add(picture);
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
        const filetag::STags tag = readSource(from);
        failure = -1;
        if (isEmpty(tag)) return 1;
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
        const filetag::STags source = readSource(file);
        if (isEmpty(source)) filetag::getLibrary()->readAllTags(file); // throws if the format is unknown
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
        if (value && *value)
            field->values.push_back(CString::fromUTF8(value));
        else
            field->values.clear();
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
        addMissedFields(file, all.fields);
        return filetag::getLibrary()->changeTags(file, all) ? 1 : 0;
    });
}
