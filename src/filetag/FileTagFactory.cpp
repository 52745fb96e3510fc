#include "filetag/FileTagFactory.h"

#include "filetag/flactag/FLACTag.h"
#include "filetag/id3tag/ID3Tag.h"
#include "filetag/oggtag/OGGTag.h"
#include "filetag/rifftag/RIFFTag.h"
#include "filetag/wmatag/WMATag.h"
#include "peru/GlobalObjFactory.h"

namespace filetag {

using namespace peru;

namespace {

template <class Tag> P<IFileTag> makeTag(const P<IURI>& file) {
    return make<Tag>(file);
}

struct SKind {
    const char* extension;
    P<IFileTag> (*create)(const P<IURI>& file);
};

constexpr SKind kKinds[] = {{".mp3", &makeTag<id3tag::CID3Tag>},    {".wav", &makeTag<rifftag::CRIFFTag>},
                            {".flac", &makeTag<flactag::CFLACTag>}, {".ogg", &makeTag<oggtag::COGGTag>},
                            {".wma", &makeTag<wmatag::CWMATag>},    {".asf", &makeTag<wmatag::CWMATag>}};

} // namespace

P<CFileTagFactory> CFileTagFactory::get() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<CFileTagFactory>(key, [] { return make<CFileTagFactory>(); });
}

CFileTagFactory::CFileTagFactory() : m_tempExtension(CString::empty()) {}

CFileTagFactory::~CFileTagFactory() = default;

void CFileTagFactory::setTempExtension(const P<IString>& extension) {
    m_tempExtension = extension ? extension : CString::empty();
}

P<IFileTag> CFileTagFactory::create(const P<IURI>& file) {
    // Applied to the whole name, because the temporary suffix usually is an extension of its own.
    P<IString> name = file->getFileName();
    if (!m_tempExtension->isEmpty() && name->endsWith(m_tempExtension))
        name = name->remove(name->getPosition(name->getLength() - m_tempExtension->getLength()));
    const SStringPos point = name->findLastChar(U'.');
    if (!point.isFound() || point.index == 0) return nullptr;
    const P<IString> extension = name->substring(point);
    for (const SKind& kind : kKinds) {
        if (!extension->equalsIgnoreCase(kind.extension)) continue;
        const P<IFileTag> tag = kind.create(file);
        if (!tag->isOpened()) tag->open();
        return tag;
    }
    return nullptr;
}

} // namespace filetag
