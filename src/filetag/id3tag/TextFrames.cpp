#include "filetag/id3tag/TextFrames.h"

#include "filetag/taglib/Id3Frames.h"

#include <commentsframe.h>
#include <id3v1genres.h>
#include <id3v2framefactory.h>
#include <mpegfile.h>
#include <tbytevectorstream.h>
#include <textidentificationframe.h>

#include <memory>

namespace filetag::id3tag {

using TagLib::ByteVector;
using taglib::EField;
using TagLib::ID3v2::CommentsFrame;
using TagLib::ID3v2::TextIdentificationFrame;
using TagLib::ID3v2::UserTextIdentificationFrame;

namespace {

const char* getFrameId(EField field) {
    switch (field) {
    case EField::title:
        return "TIT2";
    case EField::artist:
        return "TPE1";
    case EField::album:
        return "TALB";
    case EField::albumArtist:
        return "TPE2";
    case EField::trackNumber:
        return "TRCK";
    case EField::year:
        return "TDRC";
    case EField::genre:
        return "TCON";
    case EField::comment:
        return "COMM";
    }
    return "";
}

// Converts an ID3v1 genre number to its name.
TagLib::String toGenre(const TagLib::String& text) {
    bool isNumber = false;
    const int number = text.toInt(&isNumber);
    const TagLib::String name = isNumber ? TagLib::ID3v1::genre(number) : TagLib::String();
    return name.isEmpty() ? text : name;
}

// Some programs write the comment as a user text frame named "comment".
UserTextIdentificationFrame* findOtherComment(const TagLib::ID3v2::Tag& tag) {
    return UserTextIdentificationFrame::find(const_cast<TagLib::ID3v2::Tag*>(&tag), "comment");
}

// Other descriptions mark comments in which programs store data of their own.
bool isPlainComment(const TagLib::String& description) {
    const TagLib::String upper = description.upper();
    return upper.isEmpty() || upper == "COMMENT" || upper == "ID3V1 COMMENT";
}

// The one shown to users; null if there is none.
CommentsFrame* findComment(const TagLib::ID3v2::Tag& tag) {
    CommentsFrame* found = nullptr;
    for (TagLib::ID3v2::Frame* frame : tag.frameList("COMM")) {
        auto* comment = dynamic_cast<CommentsFrame*>(frame);
        if (!comment) continue;
        if (comment->description().isEmpty()) return comment;
        if (!found && isPlainComment(comment->description())) found = comment;
    }
    return found;
}

TagLib::String readComment(const TagLib::ID3v2::Tag& tag) {
    if (const CommentsFrame* comment = findComment(tag)) return comment->text();
    const UserTextIdentificationFrame* other = findOtherComment(tag);
    return other && other->fieldList().size() > 1 ? other->fieldList()[1] : TagLib::String();
}

void writeComment(TagLib::ID3v2::Tag& tag, const TagLib::String& text) {
    while (UserTextIdentificationFrame* other = findOtherComment(tag)) tag.removeFrame(other);
    if (text.isEmpty()) {
        while (CommentsFrame* comment = findComment(tag)) tag.removeFrame(comment);
        return;
    }
    CommentsFrame* comment = findComment(tag);
    if (!comment) {
        auto fresh = std::make_unique<CommentsFrame>(TagLib::String::UTF8);
        comment = fresh.get();
        tag.addFrame(fresh.release());
    }
    comment->setTextEncoding(TagLib::String::UTF8);
    comment->setText(text);
}

} // namespace

TagLib::String readTextFrame(const TagLib::ID3v2::Tag& tag, EField field) {
    if (field == EField::comment) return readComment(tag);
    const TagLib::ID3v2::FrameList frames = tag.frameList(getFrameId(field));
    if (frames.isEmpty()) return {};
    const auto* frame = dynamic_cast<const TextIdentificationFrame*>(frames.front());
    if (!frame || frame->fieldList().isEmpty()) return {};
    const TagLib::String text = frame->fieldList().front();
    return field == EField::genre ? toGenre(text) : text;
}

void writeTextFrame(TagLib::ID3v2::Tag& tag, EField field, const TagLib::String& text) {
    if (field == EField::comment) return writeComment(tag, text);
    const char* id = getFrameId(field);
    tag.removeFrames(id);
    if (text.isEmpty()) return;
    auto frame = std::make_unique<TextIdentificationFrame>(id, TagLib::String::UTF8);
    frame->setText(text);
    tag.addFrame(frame.release());
}

std::vector<ByteVector> getTextFrameIds(EField field) {
    if (field == EField::comment) return {"COMM", "TXXX"};
    return {getFrameId(field)};
}

ByteVector changeTexts(const ByteVector& bytes, const std::map<EField, TagLib::String>& texts) {
    TagLib::ByteVectorStream stream(bytes);
    const taglib::SId3Tag source = taglib::prepareId3Tag(stream);
    if (source.version == 0 || !source.unsupported.empty()) return bytes;
    // A file that ends with its tag
    TagLib::MPEG::File file(&stream, TagLib::ID3v2::FrameFactory::instance(), false);
    if (!file.hasID3v2Tag()) return bytes;
    TagLib::ID3v2::Tag& tag = *file.ID3v2Tag();
    taglib::keepForeignFrames(tag, source);
    std::vector<ByteVector> edited;
    for (const auto& [field, text] : texts) {
        if (readTextFrame(tag, field) == text) continue;
        writeTextFrame(tag, field, text);
        const std::vector<ByteVector> ids = getTextFrameIds(field);
        edited.insert(edited.end(), ids.begin(), ids.end());
    }
    if (edited.empty()) return bytes;
    const ByteVector result = tag.render(TagLib::ID3v2::v4);
    TagLib::ByteVectorStream changed(result);
    return taglib::findLostFrame(source, taglib::readId3Tag(changed), edited).isEmpty() ? result : bytes;
}

} // namespace filetag::id3tag
