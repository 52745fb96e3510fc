#include "peru/threads/posix/SignalFactory.h"

#include "peru/GlobalObjFactory.h"
#include "peru/threads/posix/SignalImpl.h"

namespace peru::posix {

P<ISignal> CSignalFactory::createSignal() {
    return make<CSignalImpl>();
}

} // namespace peru::posix

namespace peru {

P<ISignalFactory> getSignalFactory() {
    static const CGlobalObjFactory::SKey key;
    return CGlobalObjFactory::get<ISignalFactory>(
        key, [] { return P<ISignalFactory>(make<posix::CSignalFactory>()); });
}

} // namespace peru
