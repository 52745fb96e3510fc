#include "filetag/FileTagFactory.h"
#include "filetag/ILibrary.h"
#include "peru/Object.h"

namespace filetag {

namespace {

class CLibrary : public peru::CObject, public ILibrary {
public:
    CLibrary() = default;
    ~CLibrary() override = default;

    P<IFileTag> createTag(const P<peru::IURI>& file) override { return CFileTagFactory::get()->create(file); }
    void setTempExtension(const P<peru::IString>& extension) override {
        CFileTagFactory::get()->setTempExtension(extension);
    }
    STags readAllTags(const P<peru::IURI>& file) override { return filetag::readAllTags(file); }
    STransferReport addTags(const P<peru::IURI>& file, const STags& tags) override {
        return filetag::addTags(file, tags);
    }
    bool changeTags(const P<peru::IURI>& file, const STagChange& change) override {
        return filetag::changeTags(file, change);
    }
};

} // namespace

} // namespace filetag

extern "C" FILETAG_API void filetag_getLibrary(filetag::P<filetag::ILibrary>& library) {
    library = peru::make<filetag::CLibrary>();
}
