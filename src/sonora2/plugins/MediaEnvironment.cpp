#include "sonora2/plugins/MediaEnvironment.h"

#include "peru/GlobalObjFactory.h"
#include "peru/Object.h"

namespace sonora2::common {

namespace {

// A factory singleton, so that handlers that were never cleared are still released before what they use.
class CHolder : public peru::CObject {
public:
    ~CHolder() override = default;
    static P<CHolder> get() {
        static const peru::CGlobalObjFactory::SKey kKey;
        return peru::CGlobalObjFactory::get<CHolder>(kKey, [] { return peru::make<CHolder>(); });
    }

    const P<peru::IMutex> mutex = peru::getMutexFactory()->createMutex(); // guards the rest
    SMediaEnvironment environment;
};

} // namespace

void setMediaEnvironment(const SMediaEnvironment& environment) {
    SMediaEnvironment previous = environment; // swapped with the old one, which is released outside the lock
    const P<CHolder> holder = CHolder::get();
    peru::CMutexLock lock(holder->mutex);
    std::swap(holder->environment, previous);
}

SMediaEnvironment getMediaEnvironment() {
    const P<CHolder> holder = CHolder::get();
    peru::CMutexLock lock(holder->mutex);
    return holder->environment;
}

} // namespace sonora2::common
