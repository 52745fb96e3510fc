#include "ced/ILibrary.h"

namespace ced {

namespace {

class CLibrary : public peru::CObject, public ILibrary {
public:
    CLibrary() = default;
    ~CLibrary() override = default;

    P<peru::IString> getVersion() override { return peru::CString::fromUTF8(COVEREDITOR_VERSION); }
};

} // namespace

} // namespace ced

extern "C" GRAPHICS_API void tonewright_covereditor_getLibrary(ced::P<ced::ILibrary>& library) {
    library = peru::make<ced::CLibrary>();
}
