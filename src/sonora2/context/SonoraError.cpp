#include "sonora2/context/SonoraError.h"

namespace sonora2::common {

PERU_EXCEPTION_IMPL(CSonoraError)

CSonoraError::CSonoraError(const peru::CStringArg& message) : CError(message) {}

} // namespace sonora2::common
