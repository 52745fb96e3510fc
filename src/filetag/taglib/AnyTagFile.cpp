#include "filetag/taglib/AnyTagFile.h"

#include "filetag/id3tag/OldTag.h"
#include "filetag/taglib/AsfObjects.h"
#include "filetag/taglib/CommentFields.h"
#include "filetag/taglib/FlacBlocks.h"
#include "filetag/taglib/Id3Frames.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"

#include <aifffile.h>
#include <apetag.h>
#include <asffile.h>
#include <flacfile.h>
#include <id3v1tag.h>
#include <id3v2tag.h>
#include <infotag.h>
#include <mp4file.h>
#include <mp4tag.h>
#include <mpegfile.h>
#include <oggflacfile.h>
#include <tbytevectorlist.h>
#include <unknownframe.h>
#include <wavfile.h>
#include <xiphcomment.h>

namespace filetag::taglib {
namespace {

using namespace peru;
using TagLib::ByteVector;
using TagLib::ByteVectorList;
using TagLib::String;
using TagLib::StringList;

// A free-form name consists of this, an organisation, a colon and the name of the field.
constexpr char kFreeForm[] = "----:";
constexpr char kFreeFormOfPrograms[] = "----:com.apple.iTunes:";
// Texts of the ASF content description have 16-bit lengths in bytes that include a terminating zero.
constexpr unsigned int kLongestAsfText = 0xffff / 2 - 1;

struct SInfoField {
    const char* id;
    const char* key;
};

// The second id of a key is written for other programs; the first one is ours.
constexpr SInfoField kInfoFields[] = {{"INAM", "TITLE"},       {"IART", "ARTIST"},     {"IPRD", "ALBUM"},
                                      {"ICMT", "COMMENT"},     {"IGNR", "GENRE"},      {"ICRD", "DATE"},
                                      {"TRCK", "TRACKNUMBER"}, {"IPRT", "TRACKNUMBER"}};

String getFreeFormKey(const String& name) {
    return name.substr(static_cast<unsigned int>(name.rfind(":") + 1));
}

// TagLib reports fields that it has no key for by name only.
void readFreeFields(const TagLib::MP4::Tag& tag, PropertyMap& fields) {
    const StringList names = fields.unsupportedData();
    for (const String& name : names) {
        if (!name.startsWith(kFreeForm)) continue;
        const TagLib::MP4::Item item = tag.item(name);
        if (item.atomDataType() != TagLib::MP4::TypeUTF8) continue;
        fields.insert(getFreeFormKey(name), item.toStringList());
        fields.unsupportedData().erase(fields.unsupportedData().find(name));
    }
}

void writeFreeFields(TagLib::MP4::Tag& tag, const PropertyMap& fields, const PropertyMap& unsupported) {
    std::vector<String> gone;
    for (const auto& [name, item] : tag.itemMap())
        if (name.startsWith(kFreeForm) && item.atomDataType() == TagLib::MP4::TypeUTF8 &&
            !fields.contains(getFreeFormKey(name)))
            gone.push_back(name);
    for (const String& name : gone) tag.removeItem(name);
    for (const auto& [key, values] : unsupported)
        if (key.find(":") < 0) tag.setItem(kFreeFormOfPrograms + key, values);
}

// The first value of these fields is stored apart from the attributes, and the others in an attribute.
constexpr struct {
    const char* key;
    const char* attribute;
    TagLib::String (TagLib::ASF::Tag::*get)() const;
    void (TagLib::ASF::Tag::*set)(const TagLib::String& text);
} kAsfTexts[] = {{"TITLE", "Title", &TagLib::ASF::Tag::title, &TagLib::ASF::Tag::setTitle},
                 {"ARTIST", "Author", &TagLib::ASF::Tag::artist, &TagLib::ASF::Tag::setArtist},
                 {"COMMENT", "Description", &TagLib::ASF::Tag::comment, &TagLib::ASF::Tag::setComment},
                 {"COPYRIGHT", "Copyright", &TagLib::ASF::Tag::copyright, &TagLib::ASF::Tag::setCopyright}};

String getAsfKey(const String& name) {
    for (const auto& text : kAsfTexts)
        if (name == text.attribute) return text.key;
    return name;
}

void readFreeFields(const TagLib::ASF::Tag& tag, PropertyMap& fields) {
    const StringList names = fields.unsupportedData();
    for (const String& name : names) {
        const TagLib::ASF::AttributeList attributes = tag.attribute(name);
        StringList values;
        for (const TagLib::ASF::Attribute& attribute : attributes)
            if (attribute.type() == TagLib::ASF::Attribute::UnicodeType) values.append(attribute.toString());
        if (values.isEmpty() || values.size() != attributes.size()) continue;
        fields.insert(getAsfKey(name), values);
        fields.unsupportedData().erase(fields.unsupportedData().find(name));
    }
}

void setAsfAttribute(TagLib::ASF::Tag& tag, const String& name, const StringList& values) {
    TagLib::ASF::AttributeList attributes;
    for (const String& value : values) attributes.append(TagLib::ASF::Attribute(value));
    if (attributes.isEmpty())
        tag.removeItem(name);
    else
        tag.setAttribute(name, attributes);
}

void writeFreeFields(TagLib::ASF::Tag& tag, const PropertyMap& before, const PropertyMap& fields,
                     const PropertyMap& unsupported) {
    for (const auto& [name, attributes] : TagLib::ASF::AttributeListMap(tag.attributeListMap()))
        if (before.contains(name) && (!fields.contains(name) || unsupported.contains(name)))
            tag.removeItem(name);
    for (const auto& [key, values] : unsupported) setAsfAttribute(tag, key, values);
    for (const auto& text : kAsfTexts) {
        StringList values = fields.contains(text.key) ? fields[text.key] : StringList();
        const String first = values.isEmpty() ? String() : values.front();
        (tag.*text.set)(first.size() > kLongestAsfText ? String() : first);
        if (!values.isEmpty()) values.erase(values.begin());
        setAsfAttribute(tag, text.attribute, values);
    }
}

// The INFO list is what this library's own WAVE tags change, so its texts take precedence over those of the
// ID3v2 tag, which may hold further values.
PropertyMap readWave(const TagLib::RIFF::WAV::File& file) {
    PropertyMap fields;
    if (file.hasID3v2Tag()) fields = file.ID3v2Tag()->properties();
    if (!file.hasInfoTag()) return fields;
    StringList seen;
    for (const SInfoField& field : kInfoFields) {
        const String text = file.InfoTag()->fieldText(field.id);
        if (text.isEmpty() || seen.contains(field.key)) continue;
        seen.append(field.key);
        if (!fields.contains(field.key) || fields[field.key].front() != text)
            fields.replace(field.key, StringList(text));
    }
    return fields;
}

void writeWave(TagLib::RIFF::WAV::File& file, const PropertyMap& fields, bool pictures) {
    PropertyMap others = fields;
    for (const SInfoField& field : kInfoFields) {
        const StringList values = fields.contains(field.key) ? fields[field.key] : StringList();
        file.InfoTag()->setFieldText(field.id, values.isEmpty() ? String() : values.front());
        if (values.size() < 2) others.erase(field.key);
    }
    // Few programs read the ID3v2 tag of a WAVE file, so it is added only when the list is not enough.
    if (file.hasID3v2Tag() || pictures || !others.isEmpty()) file.ID3v2Tag()->setProperties(fields);
}

// Lists of people, which TagLib drops if it has no keys for their roles.
constexpr const char* kPeopleFrames[] = {"TIPL", "TMCL"};

ByteVectorList readPeople(TagLib::MPEG::File& file) {
    ByteVectorList people;
    for (const char* id : kPeopleFrames) {
        const TagLib::ID3v2::FrameList& frames = file.ID3v2Tag(true)->frameList(id);
        const bool dropped = !frames.isEmpty() && file.properties().unsupportedData().contains(id);
        people.append(dropped ? frames.front()->render() : ByteVector());
    }
    return people;
}

void restorePeople(TagLib::MPEG::File& file, const ByteVectorList& people) {
    auto bytes = people.begin();
    for (const char* id : kPeopleFrames) {
        if (!bytes->isEmpty() && file.ID3v2Tag()->frameList(id).isEmpty())
            file.ID3v2Tag()->addFrame(new TagLib::ID3v2::UnknownFrame(*bytes));
        ++bytes;
    }
}

// Old players read the ID3v1 tag only.
void writeOtherTags(TagLib::MPEG::File& file, const PropertyMap& fields) {
    constexpr struct {
        EField field;
        const char* key;
    } kOldFields[] = {
        {EField::title, "TITLE"},    {EField::artist, "ARTIST"},           {EField::album, "ALBUM"},
        {EField::year, "DATE"},      {EField::trackNumber, "TRACKNUMBER"}, {EField::genre, "GENRE"},
        {EField::comment, "COMMENT"}};
    for (const auto& [field, key] : kOldFields) {
        const StringList values = fields.contains(key) ? fields[key] : StringList();
        id3tag::writeOldField(*file.ID3v1Tag(true), field, values.isEmpty() ? String() : values.front());
    }
    if (file.hasAPETag()) file.APETag()->setProperties(fields);
}

TagLib::Ogg::XiphComment* getComment(TagLib::File& file) {
    if (auto* flac = dynamic_cast<TagLib::FLAC::File*>(&file)) return flac->xiphComment(false);
    return dynamic_cast<TagLib::Ogg::XiphComment*>(file.tag());
}

// TagLib accepts some content by the extension alone.
bool isPlausible(TagLib::File& file, TagLib::IOStream& stream) {
    if (!file.isValid()) return false;
    if (const auto* mpeg = dynamic_cast<TagLib::MPEG::File*>(&file)) {
        const TagLib::MPEG::Properties* sound = mpeg->audioProperties();
        return (sound && sound->sampleRate() > 0) || mpeg->hasID3v2Tag() || mpeg->hasID3v1Tag() ||
               mpeg->hasAPETag();
    }
    if (dynamic_cast<TagLib::RIFF::WAV::File*>(&file)) return TagLib::RIFF::WAV::File::isSupported(&stream);
    if (dynamic_cast<TagLib::RIFF::AIFF::File*>(&file)) return TagLib::RIFF::AIFF::File::isSupported(&stream);
    return true;
}

// TagLib clears the flag of the last metadata block when that is the comment.
bool saveOggFlac(TagLib::Ogg::FLAC::File& file) {
    constexpr unsigned int kComment = 1;
    constexpr char kLastBlock = '\x80';
    constexpr char kCommentBlock = 4;
    const ByteVector before = file.packet(kComment);
    if (!file.save()) return false;
    if (before.isEmpty() || before[0] != (kLastBlock | kCommentBlock)) return true;
    ByteVector after = file.packet(kComment);
    if (after.isEmpty() || after[0] != kCommentBlock) return true;
    after[0] = before[0];
    file.setPacket(kComment, after);
    return file.TagLib::Ogg::File::save();
}

// Vorbis comments in FLAC have at most 16 MB. Leaves out the longest ones of the changed fields, so that what
// was in the file stays.
void fitComment(TagLib::FLAC::File& file, const PropertyMap& before) {
    TagLib::Ogg::XiphComment* comment = file.xiphComment(false);
    while (comment && !fitsFlacBlock(comment->render(false).size())) {
        String longest;
        unsigned int size = 0;
        for (const auto& [key, values] : comment->fieldListMap()) {
            const unsigned int length = values.toString("").size();
            if (length <= size || key == kPictureField || (before.contains(key) && before[key] == values))
                continue;
            longest = key;
            size = length;
        }
        if (size == 0) return;
        comment->removeFields(longest);
    }
}

bool save(TagLib::File& file) {
    if (auto* mpeg = dynamic_cast<TagLib::MPEG::File*>(&file))
        return mpeg->save(TagLib::MPEG::File::AllTags, TagLib::MPEG::File::StripOthers, TagLib::ID3v2::v4,
                          TagLib::MPEG::File::DoNotDuplicate);
    if (auto* flac = dynamic_cast<TagLib::FLAC::File*>(&file))
        return fitsFlacBlocks(*flac) && saveFlac(*flac);
    if (auto* flac = dynamic_cast<TagLib::Ogg::FLAC::File*>(&file)) return saveOggFlac(*flac);
    return file.save();
}

} // namespace

CAnyTagFile::CAnyTagFile(const P<IURI>& uri, posix::EAccess access) : m_uri(uri), m_stream(uri, access) {
    open();
}

void CAnyTagFile::open() {
    orderAsfObjects(m_stream);
    hideUnreadablePictures(m_stream);
    const SId3Tag id3 = prepareId3Tag(m_stream);
    m_lostFrames = id3.unsupported;
    m_file = TagLib::FileRef(&m_stream);
    if (m_file.isNull() || !isPlausible(*m_file.file(), m_stream)) throw CFileFormatNotSupportedError(m_uri);
    if (auto* mpeg = dynamic_cast<TagLib::MPEG::File*>(m_file.file()); mpeg && mpeg->hasID3v2Tag())
        keepForeignFrames(*mpeg->ID3v2Tag(), id3);
    if (auto* comment = getComment(*m_file.file())) {
        auto* ogg = dynamic_cast<TagLib::Ogg::File*>(m_file.file());
        addDroppedFields(*comment, ogg ? readOggComment(*ogg) : readFlacComment(m_stream));
    }
}

void CAnyTagFile::commit() {
    restorePictures(m_stream);
    m_stream.commit();
}

PropertyMap CAnyTagFile::readFields() const {
    TagLib::File* file = m_file.file();
    if (const auto* wave = dynamic_cast<TagLib::RIFF::WAV::File*>(file)) return readWave(*wave);
    PropertyMap fields = file->properties();
    // Programs that only measure the loudness write an APE tag next to the ID3v2 tag.
    if (auto* mpeg = dynamic_cast<TagLib::MPEG::File*>(file); mpeg && mpeg->hasAPETag())
        for (const auto& [key, values] : mpeg->APETag()->properties())
            if (!fields.contains(key)) fields.insert(key, values);
    if (fields.contains(kPictureField)) { // one that TagLib cannot decode
        fields.erase(kPictureField);
        fields.unsupportedData().append(kPictureField);
    }
    if (const auto* mp4 = dynamic_cast<TagLib::MP4::File*>(file)) readFreeFields(*mp4->tag(), fields);
    if (const auto* asf = dynamic_cast<TagLib::ASF::File*>(file)) readFreeFields(*asf->tag(), fields);
    return fields;
}

std::vector<SPicture> CAnyTagFile::readPictures() const {
    return taglib::readPictures(*m_file.file());
}

void CAnyTagFile::write(const PropertyMap& fields, const std::vector<SPicture>* pictures) {
    TagLib::File* file = m_file.file();
    if (auto* wave = dynamic_cast<TagLib::RIFF::WAV::File*>(file)) {
        writeWave(*wave, fields, pictures && !pictures->empty());
    } else {
        const PropertyMap before = readFields();
        auto* comment = getComment(*file);
        const StringList unreadable = comment ? comment->fieldListMap()[kPictureField] : StringList();
        auto* mpeg = dynamic_cast<TagLib::MPEG::File*>(file);
        const ByteVectorList people = mpeg ? readPeople(*mpeg) : ByteVectorList();
        const PropertyMap unsupported = file->setProperties(fields);
        if (mpeg) restorePeople(*mpeg, people);
        for (const String& picture : unreadable) comment->addField(kPictureField, picture, false);
        if (auto* mp4 = dynamic_cast<TagLib::MP4::File*>(file))
            writeFreeFields(*mp4->tag(), fields, unsupported);
        if (auto* asf = dynamic_cast<TagLib::ASF::File*>(file))
            writeFreeFields(*asf->tag(), before, fields, unsupported);
        if (mpeg) writeOtherTags(*mpeg, fields);
        if (auto* flac = dynamic_cast<TagLib::FLAC::File*>(file)) fitComment(*flac, before);
    }
    if (pictures) writePictures(*file, *pictures);
    if (!m_lostFrames.empty()) failLostFrame(m_lostFrames.front(), m_uri);
    if (!save(*file))
        throw CFileError(localize("filetag.CTagLibTag.StoreError", "The tag of '%FILE%' could not be stored.",
                                  {{"%FILE%", getShownName(m_uri)}}),
                         m_uri);
    open();
}

} // namespace filetag::taglib
