// Projects of audio CDs and data discs.
#include "disciopp/LazyLibrary.h"
#include "host_support/Guard.h"

using namespace tonewright::host_support;

TONEWRIGHT_Handle TONEWRIGHT_Host_CreateAudioCDProject(void) {
    return guard<TONEWRIGHT_Handle>(nullptr,
                                    [] { return wrap(disciopp::getLibrary()->createAudioCDProject()); });
}

TONEWRIGHT_Handle TONEWRIGHT_Host_CreateDataDiscProject(void) {
    return guard<TONEWRIGHT_Handle>(nullptr,
                                    [] { return wrap(disciopp::getLibrary()->createDataDiscProject()); });
}

DISCIO_Project* TONEWRIGHT_Host_GetDiscProject(TONEWRIGHT_Handle project) {
    return guard<DISCIO_Project*>(
        nullptr, [&] { return require<disciopp::IProject>(project, "a disc project")->getProjectHandle(); });
}

char16_t* TONEWRIGHT_Host_GetDiscProjectURI(TONEWRIGHT_Handle project) {
    return guard<char16_t*>(nullptr, [&] {
        const P<peru::IURI> root = require<disciopp::IProject>(project, "a disc project")->getRootURI();
        return TONEWRIGHT_Host_ToUTF16(peru::CString::toStdString(root->getAsString()).c_str());
    });
}
