#include "crashhandler/CrashHandler.h"
#include "peru/GlobalObjFactory.h"
#include "peru/log/ILog.h"
#include "peru/strings/StringFormat.h"
#include "tonewright/exports/AppReference.h"
#include "tonewright/exports/Barrier.h"
#include "tonewright/exports/Handles.h"
#include "zvr_lang_manager/InstalledLanguages.h"

#include <cstring>
#include <string>

using namespace tonewright;
using namespace tonewright::exports;

namespace {

// Appended to the host's path, which has no trailing separator.
constexpr const char* kCoverEditorFolder = "/covereditor";

} // namespace

int32_t TONEWRIGHT_InitStartup() {
    return barrier<int32_t>(TONEWRIGHT_INIT_FAILED, [] {
        peru::getLogManager()->info(peru::CString::fromUTF8("tonewright_shared"), "TONEWRIGHT_InitStartup");
        const P<CApp> app = CApp::get();
        exchangeApp(app);
        return app && app->init() ? TONEWRIGHT_OK : TONEWRIGHT_INIT_FAILED;
    });
}

int32_t TONEWRIGHT_InitGui(const char16_t*, const char16_t*, const char16_t*, int32_t,
                           const char16_t* userDataPath, const char16_t*) {
    return barrier<int32_t>(TONEWRIGHT_INIT_FAILED, [&] {
        requireApp()->setUserDataPath(toString(userDataPath) + kCoverEditorFolder);
        return TONEWRIGHT_OK;
    });
}

// install() copies the names to memory that the crash handler can read.
void TONEWRIGHT_Init_Crashhandler(const char16_t* application, const char16_t* report, const char16_t* dump) {
    const std::string applicationName = peru::CString::toStdString(application);
    const std::string reportPath = peru::CString::toStdString(report);
    const std::string dumpPath = peru::CString::toStdString(dump);
    crashhandler::install({applicationName.c_str(), reportPath.c_str(), dumpPath.c_str()});
}

uint8_t TONEWRIGHT_OnWindowShown(TONEWRIGHT_WindowHandle /*window*/) {
    return 0;
}

void TONEWRIGHT_DeInitAll() {
    barrier([] {
        if (P<CApp> app = exchangeApp(nullptr)) app->shutdown();
        // The factory now holds the last reference, so its singletons are destroyed in order. Even without an
        // application some may exist, such as the log if a host used it before starting.
        peru::CGlobalObjFactory::shutdown();
    });
}

void TONEWRIGHT_SetLanguageID(const char16_t* language) {
    barrier([&] {
        if (!language) return;
        const zvr_lang::SLanguageId id =
            zvr_lang::findLanguageId(language, zvr_lang::ELanguageIdKind::languageAndCountry);
        if (id.valid) {
            requireApp()->setLanguageId(id);
            zvr_lang::applyLanguage(id);
            return;
        }
        peru::SLogMessage message;
        message.level = peru::kLogError;
        message.source = peru::CString::empty();
        message.text =
            peru::format("TONEWRIGHT_SetLanguageID: could not find languageId for %s", toString(language));
        peru::getLogManager()->write(message);
    });
}

void TONEWRIGHT_fillFeatures(void* buffer) {
    if (!buffer) return;
    const P<CApp> app = getApp();
    const SFeatures features = app ? app->getFeatures() : SFeatures();
    std::memcpy(buffer, &features, features.size);
}
