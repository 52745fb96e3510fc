// The disc access library: its root object and its handles.
#pragma once

#include "disciopp/Api.h"
#include "peru/Object.h"

#include <memory>
#include <tonewright/discio2.h>

namespace disciopp {

using peru::P;

struct SReleaseHandle {
    template <class T> void operator()(T* handle) const { DISCIO_Release(handle); }
};
// Owns a handle.
template <class T> using Handle = std::unique_ptr<T, SReleaseHandle>;

// The process's only root object for the drives of the machine, created on first use. Any thread. Throws
// peru::CException.
DISCIOPP_API DISCIO_Library* getDiscio();
// A root object whose only drive contains the disc image. Throws CDISCIOPPException.
Handle<DISCIO_Library> openImage(const std::u16string& path);

// Common base of the classes of this library.
class DISCIOPP_API CBase : public peru::CObject {
protected:
    ~CBase() override;
};

} // namespace disciopp
