// Creates events.
#pragma once

#include "peru/Object.h"
#include "peru/threads/ISignal.h"

namespace peru::posix {

class CSignalFactory : public CObject, public ISignalFactory {
public:
    P<ISignal> createSignal() override;
};

} // namespace peru::posix
