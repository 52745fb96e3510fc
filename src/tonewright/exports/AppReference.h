// The exports' reference on the application.
#pragma once

#include "tonewright/App.h"

namespace tonewright::exports {

using peru::P;

// Empty unless TONEWRIGHT_InitStartup has been called. Any thread.
P<CApp> getApp();
// The same, but throws CError where there is none.
P<CApp> requireApp();
// Exchanges the reference for another.
P<CApp> exchangeApp(P<CApp> app);

// For a function whose object this library cannot make: tells the log so, in one line.
void logNotAvailable(const char* exportName) noexcept;
template <class R> R notAvailable(const char* exportName, R failure) noexcept {
    logNotAvailable(exportName);
    return failure;
}

} // namespace tonewright::exports
