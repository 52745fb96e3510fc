#include "disciopp/Errors.h"

#include "peru/strings/StringFormat.h"

namespace disciopp {

PERU_EXCEPTION_IMPL(CDISCIOPPException)
PERU_EXCEPTION_IMPL(CUnknownURIScheme)

// The code is read first: everything else may call the library again.
CDISCIOPPException::CDISCIOPPException()
    : CException(peru::newString(DISCIO_GetErrorMessageW(nullptr, DISCIO_GetLastError(nullptr))),
                 peru::newString("Error")),
      m_code(DISCIO_GetLastError(nullptr)), m_codeText(peru::format("%d", m_code)) {}

CDISCIOPPException::CDISCIOPPException(const peru::CStringArg& description)
    : CException(peru::CString::fromUTF8(peru::CString::toStdString(description)), peru::newString("Error")),
      m_code(DISCIO_ERROR_NONE), m_codeText(peru::format("%d", m_code)) {}

CUnknownURIScheme::CUnknownURIScheme() : CDISCIOPPException("Unknown URI Scheme (%)") {}

} // namespace disciopp
