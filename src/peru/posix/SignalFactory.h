// Makes events.
#pragma once

#include "peru/ISignal.h"
#include "peru/Object.h"

namespace peru::posix {

class CSignalFactory : public CObject, public ISignalFactory {
public:
    P<ISignal> createSignal() override;
};

} // namespace peru::posix
