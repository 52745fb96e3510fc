#include "disciopp/ProjectBase.h"

#include "disciopp/Discs.h"
#include "disciopp/Errors.h"
#include "peru/strings/StringFormat.h"

#include <atomic>

namespace disciopp {

namespace {

P<peru::IURI> makeRoot(const char* scheme) {
    static std::atomic<int32_t> s_number{0};
    return peru::make<peru::CURI>(peru::format("%s:///%d/", scheme, ++s_number));
}

P<IDisc> openDisc(DISCIO_Project* project, const P<peru::IURI>& root) {
    Handle<DISCIO_Disc> handle(DISCIO_ProjectGetVirtualDisc(project));
    if (!handle) throw CDISCIOPPException();
    return CDiscFactory::get()->create(std::move(handle), root);
}

} // namespace

CProjectBase::CProjectBase(Handle<DISCIO_Project> project, const char* scheme)
    : m_project(std::move(project)), m_root(makeRoot(scheme)), m_disc(openDisc(m_project.get(), m_root)) {}

CProjectBase::~CProjectBase() = default;

} // namespace disciopp
