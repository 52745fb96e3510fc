// How a read from a pipe ends without its bytes.
#pragma once

#include "peru/Errors.h"

namespace peru {

// "Pipe was closed": the peer has closed the pipe and all bytes were read.
class PERU_API CPipeClosedError : public CFinishedError {
    PERU_EXCEPTION(CPipeClosedError)
    CPipeClosedError();
};

// "Read was aborted".
class PERU_API CPipeAbortedError : public CAbortedError {
    PERU_EXCEPTION(CPipeAbortedError)
    CPipeAbortedError();
};

} // namespace peru
