#include "ced/LazyLibrary.h"
#include "tonewright/exports/AppReference.h"
#include "tonewright/exports/Barrier.h"

#include <atomic>

using namespace tonewright::exports;

TONEWRIGHT_WindowHandle TONEWRIGHT_CreateCoverEditorHandle(TONEWRIGHT_WindowHandle, const char16_t*,
                                                           TONEWRIGHT_CoverEditorCallback) {
    // All other functions of the family act on an editor that this one has created, so only it loads the
    // module. The module has documents but no windows so far.
    return barrier<TONEWRIGHT_WindowHandle>(0, [] {
        ced::getLibrary();
        return notAvailable<TONEWRIGHT_WindowHandle>("TONEWRIGHT_CreateCoverEditorHandle", 0);
    });
}

void TONEWRIGHT_ReleaseCoverEditorHandle(TONEWRIGHT_WindowHandle) {
    logNotAvailable("TONEWRIGHT_ReleaseCoverEditorHandle");
}

bool TONEWRIGHT_EMBEDDEDCOVEREDITOR_NewProject(int32_t) {
    return notAvailable("TONEWRIGHT_EMBEDDEDCOVEREDITOR_NewProject", false);
}

bool TONEWRIGHT_EMBEDDEDCOVEREDITOR_GotoNextPage() {
    return notAvailable("TONEWRIGHT_EMBEDDEDCOVEREDITOR_GotoNextPage", false);
}

bool TONEWRIGHT_EMBEDDEDCOVEREDITOR_GotoPrevPage() {
    return notAvailable("TONEWRIGHT_EMBEDDEDCOVEREDITOR_GotoPrevPage", false);
}

bool TONEWRIGHT_EMBEDDEDCOVEREDITOR_CanGotoNextPage() {
    return notAvailable("TONEWRIGHT_EMBEDDEDCOVEREDITOR_CanGotoNextPage", false);
}

bool TONEWRIGHT_EMBEDDEDCOVEREDITOR_IsLastPage() {
    return notAvailable("TONEWRIGHT_EMBEDDEDCOVEREDITOR_IsLastPage", false);
}

bool TONEWRIGHT_EMBEDDEDCOVEREDITOR_IsFirstPage() {
    return notAvailable("TONEWRIGHT_EMBEDDEDCOVEREDITOR_IsFirstPage", false);
}

int32_t TONEWRIGHT_EMBEDDEDCOVEREDITOR_GetTotalPageCount() {
    return notAvailable<int32_t>("TONEWRIGHT_EMBEDDEDCOVEREDITOR_GetTotalPageCount", 0);
}

int32_t TONEWRIGHT_EMBEDDEDCOVEREDITOR_GetCurrentPageIndex() {
    return notAvailable<int32_t>("TONEWRIGHT_EMBEDDEDCOVEREDITOR_GetCurrentPageIndex", 0);
}

void TONEWRIGHT_EMBEDDEDCOVEREDITOR_SetBackgroundColor(int32_t, int32_t, int32_t) {
    logNotAvailable("TONEWRIGHT_EMBEDDEDCOVEREDITOR_SetBackgroundColor");
}

void TONEWRIGHT_EMBEDDEDCOVEREDITOR_ShowHelp() {
    logNotAvailable("TONEWRIGHT_EMBEDDEDCOVEREDITOR_ShowHelp");
}

// Hosts call this whenever they are idle, so only the first call is logged.
void TONEWRIGHT_EMBEDDEDCOVEREDITOR_Idle() {
    static std::atomic_flag isTold = ATOMIC_FLAG_INIT;
    if (!isTold.test_and_set()) logNotAvailable("TONEWRIGHT_EMBEDDEDCOVEREDITOR_Idle");
}
