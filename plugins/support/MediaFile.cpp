#include "support/MediaFile.h"

#include "peru/system/IPathes.h"

#include <algorithm>
#include <cerrno>
#include <fcntl.h>
#include <filesystem>
#include <sys/stat.h>
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

namespace {

constexpr peru::SLocalizedText kOpenFailed{"sonora2.plugins.open", "could not open %s: %s"};

} // namespace

InputFile openForReading(const SMediaFile& file) {
    std::error_code error;
    // A pipe would block, and a codec needs to seek.
    const std::filesystem::file_status status = std::filesystem::status(file.path, error);
    if (error) failSystem(kOpenFailed, file, error.value());
    if (std::filesystem::is_directory(status)) failSystem(kOpenFailed, file, EISDIR);
    if (!std::filesystem::is_regular_file(status))
        fail({"sonora2.plugins.noFile", "%s is not a file"}, file.getDisplayName());
    InputFile input(std::fopen(file.path.c_str(), "rbe")); // closed in programs that are started meanwhile
    if (!input) failSystem(kOpenFailed, file, errno);
    return input;
}

SFileIdentity identify(const InputFile& file) {
    struct stat status;
    if (::fstat(::fileno(file.get()), &status) != 0) return {};
    return {status.st_dev, status.st_ino, status.st_size, status.st_mtim.tv_sec, status.st_mtim.tv_nsec};
}

bool isPipe(const SMediaFile& file) {
    std::error_code none;
    return std::filesystem::is_fifo(file.path, none);
}

InputFile openPipe(const SMediaFile& file) {
    // Waits for nobody if the other end has gone.
    const int descriptor = ::open(file.path.c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
    if (descriptor < 0 || ::fcntl(descriptor, F_SETFL, 0) != 0) failSystem(kOpenFailed, file, errno);
    InputFile input(::fdopen(descriptor, "rb"));
    if (!input) failSystem(kOpenFailed, file, errno);
    return input;
}

void failSystem(const peru::SLocalizedText& text, const SMediaFile& file, int errorNumber) {
    fail(text, file.getDisplayName(), peru::CString::fromUTF8(std::generic_category().message(errorNumber)));
}

void failSystem(const char* doing, const SMediaFile& file, int errorNumber) {
    fail("%s %s: %s", doing, file.getDisplayName(),
         peru::CString::fromUTF8(std::generic_category().message(errorNumber)));
}

} // namespace sonora2::plugins
