#include "support/MediaFile.h"

#include "peru/IPathes.h"

#include <algorithm>
#include <system_error>

namespace sonora2::plugins {

SMediaFile::SMediaFile(const P<peru::IURI>& uri)
    : uri(uri), path(peru::CString::toStdString(peru::getPathes()->toPlatformPath(uri))) {}

std::string SMediaFile::getExtension(const std::vector<std::string>& known) const {
    std::string rest = peru::CString::toStdString(uri->getFileName()->toLower());
    const auto isKnown = [&](const std::string& text) {
        return std::ranges::find(known, text) != known.end();
    };
    for (size_t point = rest.rfind('.'); point != std::string::npos; point = rest.rfind('.')) {
        const std::string extension = rest.substr(point + 1);
        if (isKnown(extension)) return extension;
        const std::string* longest = nullptr;
        for (const std::string& candidate : known)
            if (extension.starts_with(candidate) && (!longest || candidate.size() > longest->size()))
                longest = &candidate;
        if (longest) return *longest;
        rest.resize(point);
    }
    return known.empty() ? std::string() : known.front();
}

P<peru::IString> SMediaFile::getDisplayName() const {
    return path.empty() ? uri->getAsString() : peru::CString::fromUTF8(path);
}

void failSystem(const char* doing, const SMediaFile& file, int errorNumber) {
    fail("%s %s: %s", doing, file.getDisplayName(),
         peru::CString::fromUTF8(std::generic_category().message(errorNumber)));
}

} // namespace sonora2::plugins
