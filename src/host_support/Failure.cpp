#include "host_support/Guard.h"
#include "peru/ClassName.h"

using namespace tonewright::host_support;

namespace {

struct SStored {
    bool isSet = false;
    std::string kind, title, message, file;
};
thread_local SStored t_stored;

} // namespace

namespace tonewright::host_support {

void storeFailure(const peru::CException& exception) noexcept {
    try {
        t_stored = {true,
                    peru::getClassName(typeid(exception)),
                    peru::CString::toStdString(exception.getTitle()),
                    peru::CString::toStdString(exception.getDescription()),
                    {}};
    } catch (...) {
        t_stored.isSet = true; // no memory for the text
    }
}

void storeFailure(const char* message) noexcept {
    try {
        t_stored = {true, "std::exception", "Error", message, {}};
    } catch (...) {
        t_stored.isSet = true;
    }
}

} // namespace tonewright::host_support

int32_t TONEWRIGHT_Host_GetLastFailure(TONEWRIGHT_Failure* failure) {
    const SStored& stored = t_stored;
    fillRecord(failure, {sizeof(*failure), stored.kind.c_str(), stored.title.c_str(), stored.message.c_str(),
                         stored.file.c_str()});
    return stored.isSet ? 1 : 0;
}

void TONEWRIGHT_Host_ClearLastFailure() {
    t_stored = {};
}
