#include "filetag/TagTransfer.h"

#include "host_support/Guard.h"

#include <cstdlib>

using namespace tonewright::host_support;
using peru::CString;

int32_t TONEWRIGHT_Host_CopyTags(const char16_t* source, const char16_t* target, char** lost) {
    if (lost) *lost = nullptr;
    return guard(0, [&] {
        const filetag::STransferReport report =
            filetag::transferTags(tonewright::exports::toURI(source), tonewright::exports::toURI(target));
        std::string names;
        const auto add = [&](const std::string& name) { names += (names.empty() ? "" : ", ") + name; };
        for (const P<peru::IString>& field : report.lostFields) add(CString::toStdString(field));
        for (const filetag::STagPicture& picture : report.lostPictures)
            add("picture (" + CString::toStdString(picture.mimeType) + ")");
        if (lost && !names.empty()) *lost = ::strdup(names.c_str());
        return 1;
    });
}
