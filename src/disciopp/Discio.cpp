#include "disciopp/Discio.h"

#include "disciopp/Errors.h"
#include "peru/GlobalObjFactory.h"

namespace disciopp {

namespace {

class CDiscio : public CBase {
public:
    CDiscio() : m_library(DISCIO_CreateEx(DISCIO_API_VERSION, nullptr)) {
        if (!m_library)
            throw peru::CException(peru::newString("Could not create DISCIO Object"),
                                   peru::newString("Error"));
    }
    DISCIO_Library* get() const { return m_library.get(); }

private:
    ~CDiscio() override = default;

    Handle<DISCIO_Library> m_library;
};

} // namespace

DISCIO_Library* getDiscio() {
    static const peru::CGlobalObjFactory::SKey kKey;
    return peru::CGlobalObjFactory::get<CDiscio>(kKey, [] { return peru::make<CDiscio>(); })->get();
}

Handle<DISCIO_Library> openImage(const std::u16string& path) {
    const DISCIO_Options options{sizeof options, 0, path.c_str()};
    Handle<DISCIO_Library> library(DISCIO_CreateEx(DISCIO_API_VERSION, &options));
    if (!library || DISCIO_EnumerateDrives(library.get()) != 1) throw CDISCIOPPException();
    return library;
}

CBase::~CBase() = default;

} // namespace disciopp
