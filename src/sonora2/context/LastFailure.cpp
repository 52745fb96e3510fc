#include "sonora2/context/LastFailure.h"

#include "peru/Errors.h"

#include <cstdlib>
#include <cxxabi.h>
#include <memory>
#include <typeinfo>

namespace sonora2::common {

namespace {

thread_local SFailure t_failure;

std::string getClassName(const std::exception& error) {
    const char* name = typeid(error).name();
    int status = 0;
    const std::unique_ptr<char, decltype(&std::free)> readable(
        abi::__cxa_demangle(name, nullptr, nullptr, &status), &std::free);
    return readable ? readable.get() : name;
}

} // namespace

SFailure describeFailure(const std::exception& error, const P<peru::IURI>& file) {
    SFailure failure;
    failure.kind = getClassName(error);
    P<peru::IURI> uri = file;
    if (const auto* own = dynamic_cast<const peru::CException*>(&error)) {
        failure.title = peru::CString::toStdString(own->getTitle());
        failure.message = peru::CString::toStdString(own->getDescription());
        const auto* withUri = dynamic_cast<const peru::CURIError*>(own);
        if (withUri && withUri->getURI()) uri = withUri->getURI();
    } else {
        failure.message = error.what();
    }
    if (uri) failure.uri = peru::CString::toStdString(uri->getAsString());
    return failure;
}

void setLastFailure(const SFailure& failure) noexcept {
    try {
        t_failure = failure;
    } catch (...) {
        t_failure = {};
    }
}

SFailure getLastFailure() {
    return t_failure;
}

void clearLastFailure() noexcept {
    t_failure = {};
}

} // namespace sonora2::common
