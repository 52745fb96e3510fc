// An error whose fixed text hides why it happened.
#pragma once

#include "peru/Errors.h"
#include "sonora2/context/LastFailure.h"

namespace tonewright {

// The boundary logs the cause behind the text, and reports the cause to hosts.
class CReasonedError : public peru::CError {
    PERU_EXCEPTION(CReasonedError)
    CReasonedError(const peru::CStringArg& text, const sonora2::common::SFailure& cause);
    const sonora2::common::SFailure& getCause() const { return m_cause; }

private:
    sonora2::common::SFailure m_cause;
};

} // namespace tonewright
