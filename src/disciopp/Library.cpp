#include "disciopp/AudioCDDiscProject.h"
#include "disciopp/DataDiscProject.h"
#include "disciopp/ILibrary.h"

namespace disciopp {

namespace {

class CLibrary : public CBase, public ILibrary {
public:
    CLibrary() = default;
    ~CLibrary() override = default;

    void createDiscio() override { getDiscio(); }
    P<IDriveManager> getDriveManager() override { return disciopp::getDriveManager(); }
    P<ITrackStream> openTrack(const P<peru::IURI>& uri) override { return disciopp::openTrack(uri); }
    P<IAudioCDProject> createAudioCDProject() override { return peru::make<CAudioCDDiscProject>(); }
    P<IDataDiscProject> createDataDiscProject() override { return peru::make<CDataDiscProject>(); }
    P<peru::ISeekableInStream> tryOpenFile(const P<peru::IURI>& uri) override {
        return disciopp::tryOpenFile(uri);
    }
};

} // namespace

} // namespace disciopp

extern "C" DISCIOPP_API void disciopp_getLibrary(disciopp::P<disciopp::ILibrary>& library) {
    library = peru::make<disciopp::CLibrary>();
}
