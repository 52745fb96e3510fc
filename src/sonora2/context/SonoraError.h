// The framework's exception.
#pragma once

#include "peru/Errors.h"
#include "sonora2/Api.h"

namespace sonora2::common {

// Thrown for every failure that the framework itself reports; carries only a message.
class SONORA2_API CSonoraError : public peru::CError {
    PERU_EXCEPTION(CSonoraError)
    explicit CSonoraError(const peru::CStringArg& message);
};

} // namespace sonora2::common
