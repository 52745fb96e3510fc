#include "peru/IInstanceWrapper.h"

namespace peru {

CStringInstanceWrapper::CStringInstanceWrapper(const CStringArg& text)
    : m_text(CString::toStdU16String(text)) {}

CStringInstanceWrapper::~CStringInstanceWrapper() = default;

void CStringInstanceWrapper::destroy() {
    delete this;
}

} // namespace peru
