#include "filetag/taglib/Id3Frames.h"

#include "filetag/taglib/Texts.h"
#include "peru/Errors.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/system/IPathes.h"

#include <attachedpictureframe.h>
#include <commentsframe.h>
#include <id3v1genres.h>
#include <id3v2framefactory.h>
#include <id3v2header.h>
#include <id3v2synchdata.h>
#include <textidentificationframe.h>
#include <tstringlist.h>
#include <unknownframe.h>
#include <unsynchronizedlyricsframe.h>

#include <algorithm>
#include <memory>

namespace filetag::taglib {
namespace {

using TagLib::ByteVector;
using TagLib::String;
using TagLib::StringList;
namespace SynchData = TagLib::ID3v2::SynchData;

constexpr unsigned int kTagHeader = 10;
constexpr unsigned int kFrameHeader = 10;
constexpr char kUTF16 = 1;
constexpr char kUTF8 = 3;

struct SRenamed {
    const char* old;
    const char* name;
};

// From version 2.2. Formats are the same except for pictures.
constexpr SRenamed kShortNames[] = {
    {"BUF", "RBUF"}, {"CNT", "PCNT"}, {"COM", "COMM"}, {"CRA", "AENC"}, {"EQU", "EQUA"}, {"ETC", "ETCO"},
    {"GEO", "GEOB"}, {"GP1", "GRP1"}, {"IPL", "IPLS"}, {"MCI", "MCDI"}, {"MLL", "MLLT"}, {"MVI", "MVIN"},
    {"MVN", "MVNM"}, {"PCS", "PCST"}, {"PIC", "APIC"}, {"POP", "POPM"}, {"REV", "RVRB"}, {"RVA", "RVAD"},
    {"SLT", "SYLT"}, {"STC", "SYTC"}, {"TAL", "TALB"}, {"TBP", "TBPM"}, {"TCM", "TCOM"}, {"TCO", "TCON"},
    {"TCP", "TCMP"}, {"TCR", "TCOP"}, {"TCT", "TCAT"}, {"TDA", "TDAT"}, {"TDR", "TDRL"}, {"TDS", "TDES"},
    {"TDY", "TDLY"}, {"TEN", "TENC"}, {"TFT", "TFLT"}, {"TID", "TGID"}, {"TIM", "TIME"}, {"TKE", "TKEY"},
    {"TKW", "TKWD"}, {"TLA", "TLAN"}, {"TLE", "TLEN"}, {"TMT", "TMED"}, {"TOA", "TOPE"}, {"TOF", "TOFN"},
    {"TOL", "TOLY"}, {"TOR", "TORY"}, {"TOT", "TOAL"}, {"TP1", "TPE1"}, {"TP2", "TPE2"}, {"TP3", "TPE3"},
    {"TP4", "TPE4"}, {"TPA", "TPOS"}, {"TPB", "TPUB"}, {"TRC", "TSRC"}, {"TRD", "TRDA"}, {"TRK", "TRCK"},
    {"TS2", "TSO2"}, {"TSA", "TSOA"}, {"TSC", "TSOC"}, {"TSI", "TSIZ"}, {"TSP", "TSOP"}, {"TSS", "TSSE"},
    {"TST", "TSOT"}, {"TT1", "TIT1"}, {"TT2", "TIT2"}, {"TT3", "TIT3"}, {"TXT", "TEXT"}, {"TXX", "TXXX"},
    {"TYE", "TYER"}, {"UFI", "UFID"}, {"ULT", "USLT"}, {"WAF", "WOAF"}, {"WAR", "WOAR"}, {"WAS", "WOAS"},
    {"WCM", "WCOM"}, {"WCP", "WCOP"}, {"WFD", "WFED"}, {"WPB", "WPUB"}, {"WXX", "WXXX"}};

bool isId(const ByteVector& id, unsigned int length) {
    return id.size() == length && std::all_of(id.begin(), id.end(), [](char c) {
               return (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9');
           });
}

// Where the texts in the encoding of the first byte start, and how many there are.
struct STexts {
    unsigned int start = 0;
    int count = 0;
};

STexts findTexts(const ByteVector& id, const ByteVector& body) {
    constexpr int kAll = 1000;
    if (body.size() < 2 || body[0] != kUTF16) return {};
    if (id.startsWith("T")) return {1, kAll};
    if (id == "WXXX") return {1, 1};
    if (id == "COMM" || id == "USLT" || id == "USER") return {4, kAll};
    const int zero = body.find('\0', 1);
    if (zero < 0) return {};
    if (id == "APIC") return {static_cast<unsigned int>(zero) + 2, 1};
    if (id == "GEOB") return {static_cast<unsigned int>(zero) + 1, 2};
    return {};
}

bool hasMark(const ByteVector& text) {
    return text.startsWith(ByteVector("\xff\xfe", 2)) || text.startsWith(ByteVector("\xfe\xff", 2));
}

// Little-endian unless zeros show that the higher byte comes first.
ByteVector guessMark(const ByteVector& text) {
    int zeros[2] = {0, 0};
    for (unsigned int i = 0; i < text.size(); ++i) zeros[i % 2] += text[i] == '\0';
    return zeros[0] > zeros[1] ? ByteVector("\xfe\xff", 2) : ByteVector("\xff\xfe", 2);
}

// A text without a byte order mark has that of the text before it, if there is one.
ByteVector addMarks(const ByteVector& id, const ByteVector& body) {
    const STexts texts = findTexts(id, body);
    if (texts.count == 0 || texts.start >= body.size()) return body;
    ByteVector result = body.mid(0, texts.start);
    ByteVector mark;
    unsigned int position = texts.start;
    for (int count = 0; count < texts.count && position < body.size(); ++count) {
        unsigned int end = position;
        while (end + 1 < body.size() && (body[end] != '\0' || body[end + 1] != '\0')) end += 2;
        const ByteVector text = body.mid(position, end - position);
        if (hasMark(text)) {
            mark = text.mid(0, 2);
        } else if (text.size() >= 2) {
            if (mark.isEmpty()) mark = guessMark(text);
            result.append(mark);
        }
        const unsigned int next = std::min(end + 2, body.size());
        result.append(body.mid(position, next - position));
        position = next;
    }
    return result.append(body.mid(position));
}

std::unique_ptr<TagLib::ID3v2::Frame> parse(const SId3Frame& frame) {
    TagLib::ID3v2::Header header; // of version 2.4
    return std::unique_ptr<TagLib::ID3v2::Frame>(TagLib::ID3v2::FrameFactory::instance()->createFrame(
        frame.render(), static_cast<const TagLib::ID3v2::Header*>(&header)));
}

StringList readTexts(const SId3Frame& frame) {
    const auto parsed = parse(frame);
    const auto* text = dynamic_cast<const TagLib::ID3v2::TextIdentificationFrame*>(parsed.get());
    return text ? text->fieldList() : StringList();
}

SId3Frame makeTextFrame(const char* id, const StringList& texts) {
    return {id, ByteVector(1, kUTF8) + texts.toString(String(std::wstring(1, L'\0'))).data(String::UTF8)};
}

// Walks the frames of one tag.
class CReader {
public:
    CReader(const ByteVector& header, const ByteVector& data, SId3Tag& tag)
        : m_header(header), m_data(data), m_tag(tag) {}

    void read() {
        const char flags = m_header[5];
        if (flags & 0x80 && m_tag.version < 4) m_data = SynchData::decode(m_data);
        if (flags & 0x40 && m_tag.version == 2) return m_tag.unsupported.push_back("ID3v2.2");
        if (m_tag.version < 4 || flags != 0) m_tag.regular = false;
        if (flags & 0x40) skipExtendedHeader();
        while (readFrame()) {
        }
    }

private:
    unsigned int getIdSize() const { return m_tag.version == 2 ? 3 : 4; }
    bool isFrameAt(unsigned int position) const {
        return position >= m_data.size() || m_data[position] == '\0' ||
               isId(m_data.mid(position, getIdSize()), getIdSize());
    }

    // Programs disagree on the form of its size, and on whether that includes itself.
    void skipExtendedHeader() {
        const unsigned int size = m_data.toUInt(0, true);
        const unsigned int small = SynchData::toUInt(m_data.mid(0, 4));
        for (const unsigned int end :
             {m_tag.version == 3 ? size + 4 : small, size + 4, size, small, small + 4})
            if (end >= 4 && end < m_data.size() && isFrameAt(end)) {
                m_position = end;
                return;
            }
    }

    unsigned int readSize(unsigned int position) const {
        if (m_tag.version == 2) return m_data.toUInt(position, 3, true);
        const unsigned int plain = m_data.toUInt(position, true);
        if (m_tag.version == 3) return plain;
        const unsigned int small = SynchData::toUInt(m_data.mid(position, 4));
        if (small == plain) return small;
        // Some programs write plain sizes into version 2.4.
        const unsigned int body = position + 6;
        return !isFrameAt(body + small) && plain <= m_data.size() - body && isFrameAt(body + plain) ? plain
                                                                                                    : small;
    }

    bool readFrame() {
        const unsigned int headerSize = m_tag.version == 2 ? 6 : kFrameHeader;
        if (m_data.size() - m_position <= headerSize) return false;
        const ByteVector id = m_data.mid(m_position, getIdSize());
        if (!isId(id, getIdSize())) return false;
        unsigned int size = readSize(m_position + getIdSize());
        const ByteVector flags = m_tag.version == 2 ? ByteVector(2, '\0') : m_data.mid(m_position + 8, 2);
        const unsigned int start = m_position + headerSize;
        if (size == 0 || size > m_data.size() - start) m_tag.regular = false;
        size = std::min(size, m_data.size() - start);
        m_position = start + size;
        if (size > 0) addFrame(id, flags, m_data.mid(start, size), start - headerSize);
        return true;
    }

    void addFrame(const ByteVector& id, const ByteVector& flags, ByteVector body, unsigned int start) {
        const bool four = m_tag.version == 4;
        const char format = flags[1];
        if (flags[0] != 0 || format != 0) m_tag.regular = false;
        if (format & (four ? 0x04 : 0x40)) return m_tag.unsupported.push_back(id);
        if (format & (four ? 0x08 : 0x80)) return addCompressed(start, kFrameHeader + body.size());
        if (format & (four ? 0x40 : 0x20)) body = body.mid(1);
        if (four && format & 0x01) body = body.mid(4);
        if (four && (format & 0x02 || m_header[5] & 0x80)) body = SynchData::decode(body);
        if (m_tag.version == 2)
            addShort(id, body);
        else
            add(id, body);
    }

    // TagLib decompresses it.
    void addCompressed(unsigned int start, unsigned int size) {
        const TagLib::ID3v2::Header header(m_header);
        const std::unique_ptr<TagLib::ID3v2::Frame> frame(
            TagLib::ID3v2::FrameFactory::instance()->createFrame(
                m_data.mid(start, size), static_cast<const TagLib::ID3v2::Header*>(&header)));
        if (frame)
            add(frame->frameID(), frame->render().mid(kFrameHeader));
        else
            m_tag.unsupported.push_back(m_data.mid(start, 4));
    }

    void addShort(const ByteVector& id, const ByteVector& body) {
        const auto* found = std::find_if(std::begin(kShortNames), std::end(kShortNames),
                                         [&id](const SRenamed& name) { return id == name.old; });
        if (found == std::end(kShortNames)) return m_tag.unsupported.push_back(id);
        if (id != "PIC" || body.size() < 5) return add(found->name, body);
        const ByteVector format = body.mid(1, 3);
        const String mimeType = format == "JPG"   ? "image/jpeg"
                                : format == "PNG" ? "image/png"
                                : format == "-->" ? "-->"
                                                  : "image/" + String(format);
        add("APIC", body.mid(0, 1) + mimeType.data(String::Latin1) + ByteVector(1, '\0') + body.mid(4));
    }

    void add(const ByteVector& id, const ByteVector& body) {
        SId3Frame frame{id, addMarks(id, body)};
        if (frame.body != body) m_tag.regular = false;
        m_tag.frames.push_back(std::move(frame));
    }

    ByteVector m_header;
    ByteVector m_data;
    SId3Tag& m_tag;
    unsigned int m_position = 0;
};

SId3Frame* findFrame(SId3Tag& tag, const char* id) {
    const auto found = std::find_if(tag.frames.begin(), tag.frames.end(),
                                    [id](const SId3Frame& frame) { return frame.id == id; });
    return found == tag.frames.end() ? nullptr : &*found;
}

String readFirst(SId3Tag& tag, const char* id) {
    const SId3Frame* frame = findFrame(tag, id);
    const StringList texts = frame ? readTexts(*frame) : StringList();
    return texts.isEmpty() ? String() : texts.front();
}

void remove(SId3Tag& tag, const char* id) {
    std::erase_if(tag.frames, [id](const SId3Frame& frame) { return frame.id == id; });
}

// Two numbers of two digits each, between 1 or 0 and their limits.
bool isPair(const String& text, int least, int firstLimit, int secondLimit) {
    bool valid = false;
    text.toInt(&valid);
    if (!valid || text.size() != 4) return false;
    const int first = text.substr(0, 2).toInt();
    const int second = text.substr(2).toInt();
    return first >= least && first <= firstLimit && second >= least && second <= secondLimit;
}

// Year, day and time of day have frames of their own before version 2.4. What does not fit stays in them.
void convertDate(SId3Tag& tag) {
    SId3Frame* year = findFrame(tag, "TYER");
    if (!year || findFrame(tag, "TDRC")) return;
    String date = readFirst(tag, "TYER");
    if (date.isEmpty()) return;
    const String day = readFirst(tag, "TDAT");
    const String time = readFirst(tag, "TIME");
    const bool hasDay = date.size() == 4 && isPair(day, 1, 31, 12);
    const bool hasTime = hasDay && isPair(time, 0, 23, 59);
    if (hasDay) date += "-" + day.substr(2) + "-" + day.substr(0, 2);
    if (hasTime) date += "T" + time.substr(0, 2) + ":" + time.substr(2);
    *year = makeTextFrame("TDRC", date);
    remove(tag, "TYER");
    if (hasDay) remove(tag, "TDAT");
    if (hasTime) remove(tag, "TIME");
}

// Numbers of genres are in parentheses before version 2.4.
void convertGenre(SId3Frame& frame) {
    StringList genres;
    for (String text : readTexts(frame)) {
        while (text.startsWith("(") && !text.startsWith("((") && text.find(")") > 0) {
            const int end = text.find(")");
            genres.append(text.substr(1, static_cast<unsigned int>(end) - 1));
            text = text.substr(static_cast<unsigned int>(end) + 1);
        }
        if (text.startsWith("((")) text = text.substr(1);
        const bool repeated = !genres.isEmpty() && TagLib::ID3v1::genre(genres.back().toInt()) == text;
        if (!text.isEmpty() && !repeated) genres.append(text);
    }
    if (!genres.isEmpty()) frame = makeTextFrame("TCON", genres);
}

void convert(SId3Tag& tag) {
    convertDate(tag);
    for (const SRenamed& name : {SRenamed{"TORY", "TDOR"}, SRenamed{"IPLS", "TIPL"}})
        if (SId3Frame* frame = findFrame(tag, name.old); frame && !findFrame(tag, name.name))
            frame->id = name.name;
    for (SId3Frame& frame : tag.frames)
        if (frame.id == "TCON") convertGenre(frame);
}

// TagLib would add what convertDate() has left to the dates, and drop it when another field is set.
bool isLeftOfDate(const SId3Frame& frame) {
    return frame.id == "TDAT" || frame.id == "TIME";
}

bool isSame(const SId3Frame& one, const SId3Frame& other) {
    if (one.id != other.id) return false;
    if (one.body == other.body) return true;
    const auto parsed = parse(one);
    const auto otherParsed = parse(other);
    if (!parsed || !otherParsed) return false;
    using namespace TagLib::ID3v2;
    if (const auto* picture = dynamic_cast<const AttachedPictureFrame*>(parsed.get())) {
        const auto* second = dynamic_cast<const AttachedPictureFrame*>(otherParsed.get());
        return second && picture->picture() == second->picture() && picture->type() == second->type();
    }
    const bool text = dynamic_cast<const TextIdentificationFrame*>(parsed.get()) ||
                      dynamic_cast<const CommentsFrame*>(parsed.get()) ||
                      dynamic_cast<const UnsynchronizedLyricsFrame*>(parsed.get());
    return text && parsed->toString() == otherParsed->toString();
}

} // namespace

ByteVector SId3Frame::render() const {
    return id + SynchData::fromUInt(body.size()) + ByteVector(2, '\0') + body;
}

SId3Tag readId3Tag(TagLib::IOStream& stream) {
    SId3Tag tag;
    stream.seek(0);
    const ByteVector header = stream.readBlock(kTagHeader);
    if (header.size() < kTagHeader || !header.startsWith("ID3") || header[3] < 2 || header[3] > 4) return tag;
    for (unsigned int i = 6; i < kTagHeader; ++i)
        if (static_cast<unsigned char>(header[i]) >= 0x80) return tag;
    tag.version = static_cast<unsigned int>(header[3]);
    tag.size = TagLib::ID3v2::Header(header).completeTagSize();
    CReader(header, stream.readBlock(SynchData::toUInt(header.mid(6, 4))), tag).read();
    if (tag.version < 4) convert(tag);
    return tag;
}

SId3Tag prepareId3Tag(TagLib::IOStream& stream) {
    const SId3Tag tag = readId3Tag(stream);
    if (!tag.regular && !tag.frames.empty()) {
        ByteVector frames;
        for (const SId3Frame& frame : tag.frames) frames.append(frame.render());
        // The sound stays where it is if there is room.
        const auto room = static_cast<unsigned int>(std::min<long>(tag.size, stream.length()));
        if (frames.size() + kTagHeader < room) frames.resize(room - kTagHeader, '\0');
        TagLib::ID3v2::Header header;
        header.setTagSize(frames.size());
        stream.insert(header.render() + frames, 0, tag.size);
    }
    stream.seek(0);
    return tag;
}

void keepForeignFrames(TagLib::ID3v2::Tag& tag, const SId3Tag& source) {
    // A copy of TagLib's own list would delete the frames.
    const std::vector<TagLib::ID3v2::Frame*> parsed(tag.frameList().begin(), tag.frameList().end());
    auto next = parsed.begin();
    for (const SId3Frame& frame : source.frames) {
        const auto found = std::find_if(next, parsed.end(), [&frame](const TagLib::ID3v2::Frame* candidate) {
            return candidate->frameID() == frame.id;
        });
        if (found != parsed.end()) {
            next = std::next(found);
            const ByteVector rendered = (*found)->render();
            if (isSame(frame, {frame.id, rendered.mid(kFrameHeader)}) && !isLeftOfDate(frame)) continue;
            tag.removeFrame(*found);
        }
        tag.addFrame(new TagLib::ID3v2::UnknownFrame(frame.render()));
    }
}

String findLostFrame(const SId3Tag& before, const SId3Tag& after, const std::vector<ByteVector>& edited) {
    std::vector<SId3Frame> left = after.frames;
    for (const SId3Frame& frame : before.frames) {
        if (std::find(edited.begin(), edited.end(), frame.id) != edited.end()) continue;
        const auto found = std::find_if(left.begin(), left.end(),
                                        [&frame](const SId3Frame& other) { return isSame(frame, other); });
        if (found == left.end()) return frame.id;
        left.erase(found);
    }
    return {};
}

void failLostFrame(const String& id, const peru::P<peru::IURI>& file) {
    throw peru::CFileError(
        peru::localize("filetag.CID3Tag.LostFrame",
                       "The frame '%FRAME%' of the file '%FILE%' cannot be kept.",
                       {{"%FRAME%", fromTagText(id)}, {"%FILE%", peru::getShownName(file)}}),
        file);
}

} // namespace filetag::taglib
