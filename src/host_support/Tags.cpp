#include "filetag/LazyLibrary.h"
#include "host_support/Guard.h"
#include "sonora2/plugins/PluginExtensions.h"

#include <algorithm>
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
