#include "tonewright/ReasonedError.h"

namespace tonewright {

PERU_EXCEPTION_IMPL(CReasonedError)

CReasonedError::CReasonedError(const peru::CStringArg& text, const sonora2::common::SFailure& cause)
    : CError(text), m_cause(cause) {}

} // namespace tonewright
