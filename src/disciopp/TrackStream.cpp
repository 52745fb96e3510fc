#include "disciopp/AudioCDDiscProject.h"
#include "disciopp/DataDiscProject.h"
#include "disciopp/Errors.h"
#include "disciopp/FileSystems.h"
#include "disciopp/ITrackStream.h"
#include "peru/Errors.h"
#include "peru/system/IPathes.h"

namespace disciopp {

namespace {

constexpr const char* kImageScheme = "discioppdiscimage";

class CTrackStream : public CBase, public ITrackStream {
public:
    explicit CTrackStream(Handle<DISCIO_PCMAudioStream> stream) : m_stream(std::move(stream)) {}

    const DISCIO_PCMAudioStream& get() const override { return *m_stream; }
    void throwFailure() const override { throw CDISCIOPPException(); }

private:
    ~CTrackStream() override = default;

    Handle<DISCIO_PCMAudioStream> m_stream;
};

// The disc in the folder part of the URI.
Handle<DISCIO_Disc> openDisc(const P<peru::IURI>& uri) {
    const P<peru::IURI> folder = uri->getParent();
    if (!folder) throw peru::CFileNotFoundError(uri);
    const P<peru::IString> scheme = uri->getScheme();
    Handle<DISCIO_Disc> disc;
    if (scheme->equals(kImageScheme)) {
        std::string path = peru::CString::toStdString(folder->getUnescapedPath());
        if (path.ends_with('/')) path.pop_back();
        const Handle<DISCIO_Library> image =
            openImage(peru::CString::toStdU16String(peru::CString::fromUTF8(path)));
        const Handle<DISCIO_Drive> drive(DISCIO_OpenDrive(image.get(), 0));
        disc.reset(DISCIO_DriveOpenDisc(drive.get()));
    } else if (scheme->equals("file")) {
        const P<IDrive> drive = getDriveManager()->findDrive(folder);
        if (!drive) throw peru::CFileNotFoundError(uri);
        disc.reset(DISCIO_DriveOpenDisc(drive->getHandle()));
    } else if (scheme->equals(kVirtualDataScheme)) {
        throw peru::CFileNotFoundError(uri); // has no tracks
    } else {
        throw CUnknownURIScheme();
    }
    if (!disc) throw CDISCIOPPException();
    return disc;
}

} // namespace

P<ITrackStream> openTrack(const P<peru::IURI>& uri) {
    const int32_t number =
        parseTrackFileName(peru::CString::toStdString(peru::CURI::unescape(uri->getFileName())));
    if (number == 0) throw peru::CFileNotFoundError(uri);
    if (uri->getScheme()->equals(kVirtualAudioScheme)) {
        const P<IAudioCDDisc> project = CAudioCDDiscProject::findDisc(uri->getParent());
        if (!project) throw peru::CFileNotFoundError(uri);
        return peru::make<CTrackStream>(project->createStream(number - 1));
    }
    const Handle<DISCIO_Disc> disc = openDisc(uri);
    Handle<DISCIO_PCMAudioStream> stream(
        DISCIO_DiscAudioCreatePCMAudioStreamFromSegment(disc.get(), number - 1));
    if (!stream) throw CDISCIOPPException();
    return peru::make<CTrackStream>(std::move(stream));
}

} // namespace disciopp
