#include "peru/pipes/PipeErrors.h"

#include "peru/strings/LocalizedFormat.h"

namespace peru {

PERU_EXCEPTION_IMPL(CPipeClosedError)
CPipeClosedError::CPipeClosedError() {
    m_description = localize("peru.CPipeClosedError.Desc", "Pipe was closed");
}

PERU_EXCEPTION_IMPL(CPipeAbortedError)
CPipeAbortedError::CPipeAbortedError() {
    m_description = localize("peru.CPipeAbortedError.Desc", "Read was aborted");
}

} // namespace peru
