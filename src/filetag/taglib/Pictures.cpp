#include "filetag/taglib/Pictures.h"

#include "filetag/taglib/FlacBlocks.h"

#include <aifffile.h>
#include <apefile.h>
#include <apetag.h>
#include <asffile.h>
#include <asfpicture.h>
#include <attachedpictureframe.h>
#include <flacfile.h>
#include <id3v2tag.h>
#include <mp4coverart.h>
#include <mp4file.h>
#include <mp4tag.h>
#include <mpcfile.h>
#include <mpegfile.h>
#include <trueaudiofile.h>
#include <wavfile.h>
#include <wavpackfile.h>
#include <xiphcomment.h>

#include <memory>

namespace filetag::taglib {
namespace {

using TagLib::ByteVector;

constexpr int kFront = 3;
constexpr int kBack = 4;
constexpr char kAsfPicture[] = "WM/Picture";
constexpr char kMp4Pictures[] = "covr";

struct SSignature {
    const char* bytes;
    const char* mimeType;
    TagLib::MP4::CoverArt::Format format;
};

constexpr SSignature kSignatures[] = {{"\xff\xd8\xff", "image/jpeg", TagLib::MP4::CoverArt::JPEG},
                                      {"\x89PNG", "image/png", TagLib::MP4::CoverArt::PNG},
                                      {"GIF8", "image/gif", TagLib::MP4::CoverArt::GIF},
                                      {"BM", "image/bmp", TagLib::MP4::CoverArt::BMP}};

// For formats that store the bytes only. Null for other content.
const SSignature* findSignature(const ByteVector& data) {
    for (const SSignature& signature : kSignatures)
        if (data.startsWith(signature.bytes)) return &signature;
    return nullptr;
}

TagLib::String detectMimeType(const ByteVector& data) {
    const SSignature* signature = findSignature(data);
    return signature ? signature->mimeType : "";
}

TagLib::MP4::CoverArt::Format getMp4Format(const SPicture& picture) {
    const SSignature* signature = findSignature(picture.data);
    for (const SSignature& known : kSignatures)
        if (!signature && picture.mimeType == known.mimeType) signature = &known;
    return signature ? signature->format : TagLib::MP4::CoverArt::Unknown;
}

// The tag that holds the pictures of a file; at most one of them is set.
struct SHolder {
    TagLib::ID3v2::Tag* id3 = nullptr;
    TagLib::FLAC::File* flac = nullptr;
    TagLib::Ogg::XiphComment* xiph = nullptr;
    TagLib::ASF::Tag* asf = nullptr;
    TagLib::MP4::Tag* mp4 = nullptr;
    TagLib::APE::Tag* ape = nullptr;
};

SHolder findHolder(TagLib::File& file, bool create) {
    SHolder holder;
    if (auto* mpeg = dynamic_cast<TagLib::MPEG::File*>(&file))
        holder.id3 = mpeg->ID3v2Tag(create);
    else if (auto* aiff = dynamic_cast<TagLib::RIFF::AIFF::File*>(&file))
        holder.id3 = aiff->tag();
    else if (auto* wav = dynamic_cast<TagLib::RIFF::WAV::File*>(&file))
        holder.id3 = wav->ID3v2Tag();
    else if (auto* trueAudio = dynamic_cast<TagLib::TrueAudio::File*>(&file))
        holder.id3 = trueAudio->ID3v2Tag(create);
    else if (auto* flac = dynamic_cast<TagLib::FLAC::File*>(&file))
        holder.flac = flac;
    else if (auto* asf = dynamic_cast<TagLib::ASF::File*>(&file))
        holder.asf = asf->tag();
    else if (auto* mp4 = dynamic_cast<TagLib::MP4::File*>(&file))
        holder.mp4 = mp4->tag();
    else if (auto* ape = dynamic_cast<TagLib::APE::File*>(&file))
        holder.ape = ape->APETag(create);
    else if (auto* wavPack = dynamic_cast<TagLib::WavPack::File*>(&file))
        holder.ape = wavPack->APETag(create);
    else if (auto* musepack = dynamic_cast<TagLib::MPC::File*>(&file))
        holder.ape = musepack->APETag(create);
    else
        holder.xiph = dynamic_cast<TagLib::Ogg::XiphComment*>(file.tag());
    return holder;
}

SPicture fromFlac(const TagLib::FLAC::Picture& picture) {
    return {picture.data(),  picture.mimeType(), picture.description(), picture.type(),
            picture.width(), picture.height(),   picture.colorDepth(),  picture.numColors()};
}

std::unique_ptr<TagLib::FLAC::Picture> toFlac(const SPicture& source) {
    auto picture = std::make_unique<TagLib::FLAC::Picture>();
    picture->setData(source.data);
    picture->setMimeType(source.mimeType);
    picture->setDescription(source.description);
    picture->setType(static_cast<TagLib::FLAC::Picture::Type>(source.type));
    picture->setWidth(source.width);
    picture->setHeight(source.height);
    picture->setColorDepth(source.colorDepth);
    picture->setNumColors(source.colorCount);
    return picture;
}

// ID3v2 and ASF pictures have the same members.
template <class Picture> SPicture fromFrame(const Picture& picture) {
    return {picture.picture(), picture.mimeType(), picture.description(), picture.type()};
}

template <class Picture> void fillFrame(Picture& picture, const SPicture& source) {
    picture.setPicture(source.data);
    picture.setMimeType(source.mimeType);
    picture.setDescription(source.description);
    picture.setType(static_cast<typename Picture::Type>(source.type));
}

const char* getApeKey(int type) {
    return type == kFront ? "COVER ART (FRONT)" : type == kBack ? "COVER ART (BACK)" : nullptr;
}

std::vector<SPicture> readApe(TagLib::APE::Tag& tag) {
    std::vector<SPicture> pictures;
    for (const int type : {kFront, kBack}) {
        const auto& items = tag.itemListMap();
        const auto found = items.find(getApeKey(type));
        if (found == items.end() || found->second.type() != TagLib::APE::Item::Binary) continue;
        // A file name, a zero, the picture.
        const ByteVector bytes = found->second.binaryData();
        const int zero = bytes.find('\0');
        const ByteVector data = zero < 0 ? bytes : bytes.mid(static_cast<unsigned int>(zero) + 1);
        pictures.push_back({data, detectMimeType(data), "", type});
    }
    return pictures;
}

void writeApe(TagLib::APE::Tag& tag, const std::vector<SPicture>& pictures) {
    for (const int type : {kFront, kBack}) tag.removeItem(getApeKey(type));
    for (const SPicture& picture : pictures) {
        const char* key = getApeKey(picture.type);
        if (!key || tag.itemListMap().contains(key)) continue;
        const bool png = picture.mimeType == "image/png";
        const ByteVector name(png ? "cover.png" : "cover.jpg");
        tag.setItem(key, TagLib::APE::Item(key, name + ByteVector(1, '\0') + picture.data, true));
    }
}

} // namespace

std::vector<SPicture> readPictures(TagLib::File& file) {
    std::vector<SPicture> pictures;
    const SHolder holder = findHolder(file, false);
    if (holder.id3) {
        for (const TagLib::ID3v2::Frame* frame : holder.id3->frameList("APIC"))
            if (const auto* picture = dynamic_cast<const TagLib::ID3v2::AttachedPictureFrame*>(frame))
                pictures.push_back(fromFrame(*picture));
    } else if (holder.flac) {
        for (const TagLib::FLAC::Picture* picture : holder.flac->pictureList())
            pictures.push_back(fromFlac(*picture));
    } else if (holder.xiph) {
        for (const TagLib::FLAC::Picture* picture : holder.xiph->pictureList())
            pictures.push_back(fromFlac(*picture));
    } else if (holder.asf) {
        for (const TagLib::ASF::Attribute& attribute : holder.asf->attribute(kAsfPicture))
            if (const TagLib::ASF::Picture picture = attribute.toPicture(); picture.isValid())
                pictures.push_back(fromFrame(picture));
    } else if (holder.mp4) {
        // The format has no types; players show the first picture as the front cover.
        for (const TagLib::MP4::CoverArt& cover : holder.mp4->item(kMp4Pictures).toCoverArtList())
            pictures.push_back(
                {cover.data(), detectMimeType(cover.data()), "", pictures.empty() ? kFront : 0});
    } else if (holder.ape) {
        return readApe(*holder.ape);
    }
    return pictures;
}

void writePictures(TagLib::File& file, const std::vector<SPicture>& pictures) {
    const SHolder holder = findHolder(file, !pictures.empty());
    if (holder.id3) {
        const TagLib::ID3v2::FrameList& frames = holder.id3->frameList("APIC");
        for (TagLib::ID3v2::Frame* frame : std::vector<TagLib::ID3v2::Frame*>(frames.begin(), frames.end()))
            if (dynamic_cast<TagLib::ID3v2::AttachedPictureFrame*>(frame)) holder.id3->removeFrame(frame);
        for (const SPicture& source : pictures) {
            auto frame = std::make_unique<TagLib::ID3v2::AttachedPictureFrame>();
            frame->setTextEncoding(TagLib::String::UTF8);
            fillFrame(*frame, source);
            holder.id3->addFrame(frame.release());
        }
    } else if (holder.flac) {
        holder.flac->removePictures();
        for (const SPicture& source : pictures)
            if (auto picture = toFlac(source); fitsFlacBlock(picture->render().size()))
                holder.flac->addPicture(picture.release());
    } else if (holder.xiph) {
        holder.xiph->removeAllPictures();
        for (const SPicture& source : pictures) holder.xiph->addPicture(toFlac(source).release());
    } else if (holder.asf) {
        holder.asf->removeItem(kAsfPicture);
        for (const SPicture& source : pictures) {
            TagLib::ASF::Picture picture;
            fillFrame(picture, source);
            holder.asf->addAttribute(kAsfPicture, TagLib::ASF::Attribute(picture));
        }
    } else if (holder.mp4) {
        TagLib::MP4::CoverArtList covers;
        for (const SPicture& source : pictures)
            covers.append(TagLib::MP4::CoverArt(getMp4Format(source), source.data));
        holder.mp4->removeItem(kMp4Pictures);
        if (!covers.isEmpty()) holder.mp4->setItem(kMp4Pictures, covers);
    } else if (holder.ape) {
        writeApe(*holder.ape, pictures);
    }
}

} // namespace filetag::taglib
