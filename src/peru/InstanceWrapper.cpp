#include "peru/IInstanceWrapper.h"

namespace peru {

CInstanceWrapper::~CInstanceWrapper() = default;

void CInstanceWrapper::destroy() {
    delete this;
}

CStringInstanceWrapper::CStringInstanceWrapper(const CStringArg& text)
    : m_text(CString::toStdU16String(text)) {}

CStringInstanceWrapper::~CStringInstanceWrapper() = default;

void CStringInstanceWrapper::destroy() {
    delete this;
}

} // namespace peru
