// The samples of a track that is named by URI.
#pragma once

#include "disciopp/Discio.h"
#include "peru/uri/IURI.h"

namespace disciopp {

class DISCIOPP_API ITrackStream : public virtual peru::IBase {
public:
    virtual const DISCIO_PCMAudioStream& get() const = 0; // closed at first
    // Throws the reason of the stream's last failure on this thread.
    [[noreturn]] virtual void throwFailure() const = 0;
};

// Opens the track that a URI names: "file:///dev/sr0/Track01.cda" in a drive,
// "discioppdiscimage:///folder/disc.cue/Track01.cda" in an image, or
// "discioppvirtualdiscaudiocd:///1/Track01.cda" in a project (see IProject::getRootURI). Throws
// CDISCIOPPException, CUnknownURIScheme and peru::CFileNotFoundError.
DISCIOPP_API P<ITrackStream> openTrack(const P<peru::IURI>& uri);

} // namespace disciopp
