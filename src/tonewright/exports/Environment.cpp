#include "disciopp/LazyLibrary.h"
#include "peru/log/ILog.h"
#include "sonora2/plugins/PluginExtensions.h"
#include "tonewright/exports/AppReference.h"
#include "tonewright/exports/Barrier.h"
#include "tonewright/exports/FileTags.h"
#include "tonewright/exports/Handles.h"

using namespace tonewright;
using namespace tonewright::exports;
using sonora2::common::IPluginExtensions;

// Without a barrier: a host learns from the exception why there are no discs.
void TONEWRIGHT_InitDiscio(uint8_t /*flag*/) {
    disciopp::getLibrary()->createDiscio();
}

void TONEWRIGHT_SetTempExtension(const char16_t* extension) {
    barrier([&] {
        requireApp()->getWritePluginHandler()->setURISuffix(toString(extension));
        setTagTempExtension(toString(extension));
    });
}

void TONEWRIGHT_SetDriveChangedCallback(TONEWRIGHT_DriveChangedCallback callback) {
    barrier([&] { requireApp()->setDriveChangedCallback(callback); });
}

void TONEWRIGHT_AddProxyLogManager(TONEWRIGHT_Handle log) {
    const P<peru::ILogManager> proxy = unwrap<peru::ILogManager>(log);
    const P<peru::ILogManager> manager = peru::getLogManager();
    // The manager as its own proxy would recurse forever.
    if (proxy && !(proxy == manager)) manager->addLog(proxy, peru::CString::empty());
}

void TONEWRIGHT_RemoveProxyLogManager(TONEWRIGHT_Handle log) {
    if (const P<peru::ILogManager> proxy = unwrap<peru::ILogManager>(log))
        peru::getLogManager()->removeLog(proxy, peru::CString::empty());
}

TONEWRIGHT_Handle TONEWRIGHT_getValidCodecExtensions(int32_t types) {
    return barrier<TONEWRIGHT_Handle>(nullptr, [&] {
        const P<CApp> app = requireApp();
        const P<IPluginExtensions> read = app->getReadPluginHandler()->getValidExtensions(types);
        // Some plug-ins only write, and belong to the other handler.
        constexpr int kFormats = sonora2::common::kVideoFormat | sonora2::common::kAudioFormat;
        if (!(types & kFormats) || (types & sonora2::common::kImage)) return wrap(read);
        const P<IPluginExtensions> written =
            app->getWritePluginHandler()->getValidExtensions(types & kFormats);
        const auto all = peru::make<sonora2::common::CPluginExtensions>();
        for (const P<IPluginExtensions>& list : {read, written})
            for (int i = 0; i < list->getCount(); ++i) all->addExtension(list->getExtension(i));
        return wrap(all);
    });
}

int32_t TONEWRIGHT_getExtensionCount(TONEWRIGHT_Handle extensions) {
    const P<IPluginExtensions> list = unwrap<IPluginExtensions>(extensions);
    return list ? list->getCount() : 0;
}

TONEWRIGHT_Handle TONEWRIGHT_getExtension(TONEWRIGHT_Handle extensions, int32_t index) {
    const P<IPluginExtensions> list = unwrap<IPluginExtensions>(extensions);
    if (!list || index < 0 || index >= list->getCount()) return nullptr;
    return wrapText(list->getExtension(index));
}
