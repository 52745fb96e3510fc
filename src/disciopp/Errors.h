// Failures of the disc access library.
#pragma once

#include "disciopp/Discio.h"
#include "peru/Exception.h"
#include "peru/strings/String.h"

namespace disciopp {

// Takes code and message of the library's last failure on this thread.
class DISCIOPP_API CDISCIOPPException : public peru::CException {
    PERU_EXCEPTION(CDISCIOPPException)
    CDISCIOPPException();

    int32_t getCode() const { return m_code; }
    const P<peru::IString>& getCodeText() const { return m_codeText; }

protected:
    explicit CDISCIOPPException(const peru::CStringArg& description);

private:
    int32_t m_code;
    P<peru::IString> m_codeText;
};

class DISCIOPP_API CUnknownURIScheme : public CDISCIOPPException {
    PERU_EXCEPTION(CUnknownURIScheme)
    CUnknownURIScheme();
};

} // namespace disciopp
