#include "writing/BurnLibrary.h"
#include "writing/LoadedLibrary.h"

namespace discio {

SBurnLibrary::SBurnLibrary() {
    const CLoadedLibrary library("libburn.so.4");
#define DISCIO_FIND(name) library.find(#name, name);
    DISCIO_BURN_FUNCTIONS(DISCIO_FIND)
#undef DISCIO_FIND
    if (burn_initialize() != 1) throw CDiscError(DISCIO_ERROR_INTERNAL, "libburn does not start");
    char queued[] = "SORRY", printed[] = "NEVER", prefix[] = "";
    burn_msgs_set_severities(queued, printed, prefix);
}

const SBurnLibrary& SBurnLibrary::get() {
    static const SBurnLibrary s_library;
    return s_library;
}

std::string SBurnLibrary::takeMessage() const {
    std::string message;
    char least[] = "SORRY", text[BURN_MSGS_MESSAGE_LEN] = "", severity[80] = "";
    for (int code = 0, error = 0; burn_msgs_obtain(least, &code, text, &error, severity) == 1;)
        message = text;
    return message;
}

} // namespace discio
