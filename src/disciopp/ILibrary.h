// The library as modules use it that load it on first use.
#pragma once

#include "disciopp/DataFileStream.h"
#include "disciopp/IDrive.h"
#include "disciopp/IProject.h"
#include "disciopp/ITrackStream.h"

namespace disciopp {

class DISCIOPP_API ILibrary : public virtual peru::IBase {
public:
    // Creates the root object of the disc access library. Throws peru::CException.
    virtual void createDiscio() = 0;
    // The functions of the same names.
    virtual P<IDriveManager> getDriveManager() = 0;
    virtual P<ITrackStream> openTrack(const P<peru::IURI>& uri) = 0;
    // Empty projects. Throw CDISCIOPPException.
    virtual P<IAudioCDProject> createAudioCDProject() = 0;
    virtual P<IDataDiscProject> createDataDiscProject() = 0;
    virtual P<peru::ISeekableInStream> tryOpenFile(const P<peru::IURI>& uri) = 0;
};

// The function "disciopp_getLibrary" that the library exports.
using GetLibraryFunction = void (*)(P<ILibrary>& library);
inline constexpr const char* kGetLibraryName = "disciopp_getLibrary";

} // namespace disciopp
