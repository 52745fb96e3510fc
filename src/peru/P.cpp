#include "peru/P.h"

#include "peru/Errors.h"

namespace peru {

void throwCastError(const IBase* object, const std::type_info& target) {
    throw CCastError(P<IBase>::share(const_cast<IBase*>(object)), typeid(*object), target);
}

} // namespace peru
