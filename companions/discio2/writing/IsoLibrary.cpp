#include "writing/IsoLibrary.h"
#include "writing/LoadedLibrary.h"

namespace discio {

SIsoLibrary::SIsoLibrary() {
    const CLoadedLibrary library("libisofs.so.6");
#define DISCIO_FIND(name) library.find(#name, name);
    DISCIO_ISO_FUNCTIONS(DISCIO_FIND)
#undef DISCIO_FIND
    check(iso_init(), "libisofs");
    char queued[] = "NEVER", printed[] = "NEVER", prefix[] = "", charset[] = "UTF-8";
    iso_set_msgs_severities(queued, printed, prefix);
    iso_set_local_charset(charset, 0); // of the names, whatever the host's locale is
}

const SIsoLibrary& SIsoLibrary::get() {
    static const SIsoLibrary s_library;
    return s_library;
}

int SIsoLibrary::check(int result, const std::string& subject) const {
    if (result >= 0) return result;
    const char* reason = iso_error_to_msg(result);
    throw CDiscError(DISCIO_ERROR_INTERNAL, subject + ": " + (reason ? reason : "unknown error"));
}

} // namespace discio
