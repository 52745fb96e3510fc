#include "filetag/TagTransfer.h"

#include "filetag/taglib/AnyTagFile.h"
#include "filetag/taglib/Texts.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"

#include <algorithm>

namespace filetag {

using namespace peru;
using taglib::CAnyTagFile;
using taglib::fromTagText;
using TagLib::PropertyMap;
using taglib::SPicture;
using TagLib::String;
using TagLib::StringList;
using taglib::toTagText;

namespace {

// These describe how the source was encoded, which does not apply to the target.
constexpr const char* kTechnical[] = {"ENCODER",
                                      "ENCODING",
                                      "ENCODERSETTINGS",
                                      "LENGTH",
                                      "FILETYPE",
                                      "COMMENT:ITUNSMPB",
                                      "ITUNSMPB",
                                      "ISVBR",
                                      "WMFSDKVERSION",
                                      "WMFSDKNEEDED",
                                      "WM/ENCODINGSETTINGS",
                                      "WM/ENCODINGTIME",
                                      "DEVICECONFORMANCETEMPLATE",
                                      "WAVEFORMATEXTENSIBLE_CHANNEL_MASK",
                                      "MAJOR_BRAND",
                                      "MINOR_VERSION",
                                      "COMPATIBLE_BRANDS"};
// Names of pictures, which TagLib reports as fields without a key in some formats.
constexpr const char* kPictures[] = {
    "APIC", "PIC", "WM/PICTURE", "COVR", "COVER ART (FRONT)", "COVER ART (BACK)"};
// Stored as numbers by some formats.
constexpr const char* kNumbers[] = {"TRACKNUMBER", "DISCNUMBER", "BPM", "COMPILATION", "MOVEMENTNUMBER"};

template <size_t count> bool contains(const char* const (&names)[count], const String& key) {
    return std::any_of(std::begin(names), std::end(names),
                       [&](const char* name) { return key.upper() == name; });
}

STagPicture toPublic(const SPicture& picture) {
    return {taglib::fromTagBytes(picture.data),
            fromTagText(picture.mimeType),
            fromTagText(picture.description),
            picture.type,
            picture.width,
            picture.height,
            picture.colorDepth,
            picture.colorCount};
}

SPicture fromPublic(const STagPicture& picture) {
    const auto toText = [](const P<IString>& text) { return text ? toTagText(text) : String(); };
    return {taglib::toTagBytes(picture.data),
            toText(picture.mimeType),
            toText(picture.description),
            picture.fileType,
            picture.width,
            picture.height,
            picture.colorDepth,
            picture.colorCount};
}

PropertyMap fromPublic(const std::vector<STagField>& fields) {
    PropertyMap result;
    for (const STagField& field : fields)
        for (const P<IString>& value : field.values) result.insert(toTagText(field.key), toTagText(value));
    return result;
}

std::vector<SPicture> fromPublic(const std::vector<STagPicture>& pictures) {
    std::vector<SPicture> result;
    for (const STagPicture& picture : pictures) result.push_back(fromPublic(picture));
    return result;
}

// "03/12" and "3/12" are the same number, and so are "3/0" and "3".
String toNumber(const String& text) {
    String number;
    for (const String& part : text.split("/")) {
        bool valid = false;
        const int value = part.toInt(&valid);
        if (!valid) return text;
        if (number.isEmpty() || value != 0) number += (number.isEmpty() ? "" : "/") + String::number(value);
    }
    return number;
}

bool isSame(const String& key, const StringList& one, const StringList& other) {
    if (one == other) return true;
    if (!contains(kNumbers, key) || one.size() != other.size()) return false;
    return std::equal(one.begin(), one.end(), other.begin(),
                      [](const String& a, const String& b) { return toNumber(a) == toNumber(b); });
}

std::vector<P<IString>> findLostFields(const PropertyMap& wanted, const PropertyMap& found) {
    std::vector<P<IString>> lost;
    for (const auto& [key, values] : wanted)
        if (!values.isEmpty() && (!found.contains(key) || !isSame(key, values, found[key])))
            lost.push_back(fromTagText(key));
    return lost;
}

std::vector<STagPicture> findLostPictures(const std::vector<SPicture>& wanted, std::vector<SPicture> found) {
    std::vector<STagPicture> lost;
    for (const SPicture& picture : wanted) {
        const auto same = std::find_if(found.begin(), found.end(),
                                       [&](const SPicture& other) { return other.data == picture.data; });
        if (same == found.end())
            lost.push_back(toPublic(picture));
        else
            found.erase(same);
    }
    return lost;
}

// Makes a change to the file as it is then, and does so again if a program that ignores locks has changed it
// meanwhile.
template <class Change> auto changeFile(const P<IURI>& file, Change change) {
    for (int attempt = 1;; ++attempt) {
        CAnyTagFile target(file, posix::EAccess::exclusive);
        try {
            return change(target);
        } catch (const posix::CFileChangedError&) {
            if (attempt == posix::kAttempts) throw;
        }
    }
}

bool hasPicture(const std::vector<SPicture>& pictures, const SPicture& picture) {
    return std::any_of(pictures.begin(), pictures.end(),
                       [&](const SPicture& other) { return other.data == picture.data; });
}

[[noreturn]] void failField(const P<IString>& key, const P<IURI>& file) {
    throw CFileError(localize("filetag.SetTagField.NotSupported",
                              "The field '%FIELD%' cannot be stored in the file '%FILE%'.",
                              {{"%FIELD%", key}, {"%FILE%", getShownName(file)}}),
                     file);
}

STransferReport write(CAnyTagFile& file, const PropertyMap& fields, const std::vector<SPicture>* pictures) {
    file.write(fields, pictures);
    STransferReport report;
    report.lostFields = findLostFields(fields, file.readFields());
    if (pictures) report.lostPictures = findLostPictures(*pictures, file.readPictures());
    return report;
}

// Formats have two names for some fields. A field that the target knows only by the other name would be
// invisible to most programs.
void useCommonNames(PropertyMap& fields) {
    constexpr struct {
        const char* rare;
        const char* common;
    } kNames[] = {{"DESCRIPTION", "COMMENT"},
                  {"TRACKNUM", "TRACKNUMBER"},
                  {"YEAR", "DATE"},
                  {"ALBUM ARTIST", "ALBUMARTIST"}};
    const auto rename = [&fields](const String& rare, const String& common) {
        const StringList values = fields[rare];
        fields.erase(rare);
        fields.insert(common, values);
    };
    for (const auto& names : kNames)
        if (fields.contains(names.rare) && !fields.contains(names.common)) rename(names.rare, names.common);
    for (const char* key : {"COMMENT:ID3V1 COMMENT", "COMMENT:COMMENT"})
        if (fields.contains(key) && !fields.contains("COMMENT")) rename(key, "COMMENT");
}

} // namespace

STags readAllTags(const P<IURI>& file) {
    const CAnyTagFile source(file);
    const PropertyMap fields = source.readFields();
    STags tags;
    for (const auto& [key, values] : fields) {
        STagField& field = tags.fields.emplace_back(STagField{fromTagText(key), {}});
        for (const String& value : values) field.values.push_back(fromTagText(value));
    }
    for (const SPicture& picture : source.readPictures()) tags.pictures.push_back(toPublic(picture));
    const String unknown = "UNKNOWN/"; // how TagLib names a frame that it does not parse
    for (const String& name : fields.unsupportedData())
        if (!contains(kPictures, name))
            tags.others.push_back(fromTagText(name.startsWith(unknown) ? name.substr(unknown.size()) : name));
    return tags;
}

STransferReport writeAllTags(const P<IURI>& file, const STags& tags) {
    const PropertyMap fields = fromPublic(tags.fields);
    const std::vector<SPicture> pictures = fromPublic(tags.pictures);
    return changeFile(file, [&](CAnyTagFile& target) {
        STransferReport report = write(target, fields, &pictures);
        target.commit();
        return report;
    });
}

void setTagField(const P<IURI>& file, const CStringArg& key, const std::vector<P<IString>>& values) {
    changeTags(file, {{{fromTagText(toTagText(key)), values}}, {}, false, {}});
}

std::vector<STagPicture> setTagPictures(const P<IURI>& file, const std::vector<STagPicture>& pictures) {
    const std::vector<SPicture> wanted = fromPublic(pictures);
    return changeFile(file, [&](CAnyTagFile& target) {
        STransferReport report = write(target, target.readFields(), &wanted);
        target.commit();
        return std::move(report.lostPictures);
    });
}

STransferReport addTags(const P<IURI>& file, const STags& tags) {
    PropertyMap carried = fromPublic(tags.fields);
    for (const char* key : kTechnical) carried.erase(key);
    useCommonNames(carried);
    const std::vector<SPicture> carriedPictures = fromPublic(tags.pictures);
    return changeFile(file, [&](CAnyTagFile& target) {
        PropertyMap fields = target.readFields();
        for (const auto& [key, values] : carried) fields.replace(key, values);
        std::vector<SPicture> pictures = carriedPictures;
        for (const SPicture& picture : target.readPictures())
            if (!hasPicture(carriedPictures, picture)) pictures.push_back(picture);

        STransferReport report = write(target, fields, &pictures);
        for (const P<IString>& name : tags.others)
            if (!contains(kTechnical, toTagText(name))) report.lostFields.push_back(name);
        target.commit();
        return report;
    });
}

bool changeTags(const P<IURI>& file, const STagChange& change) {
    PropertyMap wanted, removed;
    for (const STagField& field : change.fields) {
        const String key = toTagText(field.key).upper();
        removed.insert(key, StringList());
        for (const P<IString>& value : field.values)
            if (value && !value->isEmpty()) wanted.insert(key, toTagText(value));
    }
    const std::vector<SPicture> added = fromPublic(change.addedPictures);
    const auto isRemoved = [&](const SPicture& picture) {
        const std::vector<int32_t>& types = change.removedPictures;
        return change.removesAllPictures ||
               std::find(types.begin(), types.end(), picture.type) != types.end();
    };
    return changeFile(file, [&](CAnyTagFile& target) {
        const PropertyMap before = target.readFields();
        PropertyMap fields = before;
        for (const auto& entry : removed) fields.erase(entry.first);
        fields.merge(wanted);
        const std::vector<SPicture> old = target.readPictures();
        std::vector<SPicture> pictures = old;
        pictures.erase(std::remove_if(pictures.begin(), pictures.end(), isRemoved), pictures.end());
        // In front, since formats without types show the first one.
        pictures.insert(pictures.begin(), added.begin(), added.end());
        const bool picturesChange = !std::equal(pictures.begin(), pictures.end(), old.begin(), old.end(),
                                                [](const SPicture& a, const SPicture& b) {
                                                    return a.data == b.data && a.type == b.type &&
                                                           a.mimeType == b.mimeType &&
                                                           a.description == b.description;
                                                });
        if (fields == before && !picturesChange) return false;

        const STransferReport report = write(target, fields, picturesChange ? &pictures : nullptr);
        for (const P<IString>& name : report.lostFields)
            if (wanted.contains(toTagText(name)) || before.contains(toTagText(name))) failField(name, file);
        if (!report.lostPictures.empty())
            throw CFileError(localize("filetag.ChangeTags.Picture",
                                      "The picture cannot be stored in the file '%FILE%'.",
                                      {{"%FILE%", getShownName(file)}}),
                             file);
        target.commit();
        return true;
    });
}

STransferReport transferTags(const P<IURI>& source, const P<IURI>& target) {
    return addTags(target, readAllTags(source));
}

} // namespace filetag
