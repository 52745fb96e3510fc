#include "peru/pipes/PipeErrors.h"

namespace peru {

PERU_EXCEPTION_IMPL(CPipeClosedError)
CPipeClosedError::CPipeClosedError() {
    m_description = newString("Pipe was closed");
}

PERU_EXCEPTION_IMPL(CPipeAbortedError)
CPipeAbortedError::CPipeAbortedError() {
    m_description = newString("Read was aborted");
}

} // namespace peru
