// The exports' reference to the application.
#pragma once

#include "tonewright/App.h"

namespace tonewright::exports {

using peru::P;

// Empty unless TONEWRIGHT_InitStartup has been called. Any thread.
P<CApp> getApp();
// The same, but throws CError if there is none.
P<CApp> requireApp();
// Replaces the reference and returns the old one.
P<CApp> exchangeApp(P<CApp> app);

// For exports whose object this build cannot create: logs one line.
void logNotAvailable(const char* exportName) noexcept;
template <class R> R notAvailable(const char* exportName, R failure) noexcept {
    logNotAvailable(exportName);
    return failure;
}

} // namespace tonewright::exports
