#include "disciopp/Discs.h"

#include "disciopp/Errors.h"
#include "disciopp/FileSystems.h"
#include "peru/GlobalObjFactory.h"
#include "peru/strings/IStringLocalizer.h"
#include "peru/strings/StringFormat.h"
#include "peru/system/IPathes.h"

#include <iterator>

namespace disciopp {

using peru::CString;

P<peru::IString> getMediumTypeText(int32_t type) {
    static constexpr const char* kTexts[] = {"",         "CD-ROM",   "CD-R",   "CD-RW", "DVD-ROM",
                                             "DVD-RAM",  "DVD-R",    "DVD-RW", "DVD+R", "DVD+RW",
                                             "DVD+R DL", "DVD-R DL", "BD-ROM", "BD-R",  "BD-RE"};
    if (type == 0) return peru::localize("disciopp.disctype.none", "None");
    if (type < 0 || type >= static_cast<int32_t>(std::size(kTexts)))
        return peru::localize("disciopp.disctype.unknown", "Unknown");
    return peru::newString(kTexts[type]);
}

CDiscBase::CDiscBase(Handle<DISCIO_Disc> handle, const P<peru::IURI>& root)
    : m_handle(std::move(handle)), m_root(root) {}
CDiscBase::~CDiscBase() = default;

P<peru::IString> CDiscBase::getDisplayName() {
    std::string path = CString::toStdString(m_root->getUnescapedPath());
    if (path.size() > 1 && path.ends_with('/')) path.pop_back();
    return peru::format("(%s) %s", CString::fromUTF8(path), getTitle());
}

P<peru::IString> CDataDisc::getTitle() {
    std::scoped_lock lock(m_mutex);
    const char16_t* found = DISCIO_DiscDataGetTitleW(m_handle.get());
    if (!found) throw CDISCIOPPException();
    const P<peru::IString> title = peru::newString(found);
    return title->isEmpty() ? peru::localize("disciopp.disc.no_title", "[No Title]") : title;
}

P<IFileSystem> CDataDisc::getFileSystem() {
    return peru::make<CDataDiscFileSystem>(m_root, P<IDisc>::share(this));
}

P<peru::IString> CAudioCDDisc::getTitle() {
    const P<peru::IString> title = getText(-1, DISCIO_TEXT_TITLE);
    return title->isEmpty() ? peru::localize("disciopp.audiocd.default_title", "Audio CD") : title;
}

P<IFileSystem> CAudioCDDisc::getFileSystem() {
    return peru::make<CAudioCDDiscFileSystem>(m_root, P<IAudioCDDisc>::share(this));
}

int32_t CAudioCDDisc::getSegmentCount() {
    const int32_t count = DISCIO_DiscAudioGetSegmentCount(m_handle.get());
    if (count < 0) throw CDISCIOPPException();
    return count;
}

P<peru::IString> CAudioCDDisc::getText(int32_t segment, int32_t text) {
    std::scoped_lock lock(m_mutex);
    const char16_t* found = segment < 0
                                ? DISCIO_DiscAudioGetMetaDataStringW(m_handle.get(), text)
                                : DISCIO_DiscAudioGetSegmentMetaDataStringW(m_handle.get(), segment, text);
    if (!found) throw CDISCIOPPException();
    return peru::newString(found);
}

Handle<DISCIO_PCMAudioStream> CAudioCDDisc::createStream(int32_t segment) {
    Handle<DISCIO_PCMAudioStream> stream(
        DISCIO_DiscAudioCreatePCMAudioStreamFromSegment(m_handle.get(), segment));
    if (!stream) throw CDISCIOPPException();
    return stream;
}

P<peru::IString> CEmptyDisc::getTitle() {
    return peru::localize("disciopp.emptydisc.default_title", "Blank %DISC_TYPE%",
                          {{"%DISC_TYPE%", getMediumTypeText(getMediumType())}});
}

P<IFileSystem> CEmptyDisc::getFileSystem() {
    return peru::make<CEmptyDiscFileSystem>(m_root);
}

CDiscFactory::~CDiscFactory() = default;

P<CDiscFactory> CDiscFactory::get() {
    static const peru::CGlobalObjFactory::SKey kKey;
    return peru::CGlobalObjFactory::get<CDiscFactory>(kKey, [] { return peru::make<CDiscFactory>(); });
}

P<IDisc> CDiscFactory::create(Handle<DISCIO_Disc> handle, const P<peru::IURI>& root) {
    if (!handle) return nullptr;
    if (DISCIO_DiscHasDataComponent(handle.get()) == 1) return peru::make<CDataDisc>(std::move(handle), root);
    if (DISCIO_DiscHasAudioComponent(handle.get()) == 1)
        return peru::make<CAudioCDDisc>(std::move(handle), root);
    if (DISCIO_DiscIsEmpty(handle.get()) == 1) return peru::make<CEmptyDisc>(std::move(handle), root);
    return nullptr;
}

} // namespace disciopp
