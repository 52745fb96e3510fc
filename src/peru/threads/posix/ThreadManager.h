// Creates this platform's threads.
#pragma once

#include "peru/Object.h"
#include "peru/threads/IThreadManager.h"

namespace peru::posix {

class CThreadManager : public CObject, public IThreadManager {
public:
    P<IThread> createThread(const SThreadBody& body) override;
    P<IThread> createThread(const P<IAction>& action) override;
    void sleep(uint32_t milliseconds) override;
    void yield(bool longer) override;
    P<IThread> getCurrentThread() override;
};

} // namespace peru::posix
