#include "tonewright/exports/AppReference.h"

#include "peru/Errors.h"
#include "peru/log/ILog.h"
#include "peru/strings/LocalizedFormat.h"
#include "peru/strings/StringFormat.h"
#include "tonewright/exports/Barrier.h"

#include <mutex>

namespace tonewright::exports {

namespace {

struct SReference {
    std::mutex mutex;
    P<CApp> app; // guarded by the mutex
};

// Created on first use, after the factory's own statics, and therefore destroyed before them.
SReference& reference() {
    static SReference r;
    return r;
}

} // namespace

P<CApp> getApp() {
    std::scoped_lock lock(reference().mutex);
    return reference().app;
}

P<CApp> requireApp() {
    P<CApp> app = getApp();
    if (!app) throw peru::CError("TONEWRIGHT_InitStartup has not been called");
    return app;
}

P<CApp> exchangeApp(P<CApp> app) {
    std::scoped_lock lock(reference().mutex);
    return std::exchange(reference().app, std::move(app));
}

void logNotAvailable(const char* exportName) noexcept {
    barrier([exportName] {
        peru::getLogManager()->warning(
            peru::CString::fromUTF8("tonewright_shared"),
            peru::format({"tonewright.notAvailable", "%s is not available in this build"}, exportName));
    });
}

} // namespace tonewright::exports
