#include "base/InputFile.h"

#include "base/Translation.h"

#include <cerrno>
#include <cstring>
#include <stdexcept>
#include <sys/stat.h>
#include <unistd.h>

namespace host {

namespace fs = std::filesystem;

namespace {

[[noreturn]] void throwSystem(int error) {
    throw std::runtime_error(std::strerror(error));
}

} // namespace

void checkInput(const fs::path& file) {
    struct stat status;
    if (::stat(file.c_str(), &status) != 0) throwSystem(errno);
    if (S_ISDIR(status.st_mode)) throwSystem(EISDIR);
    if (!S_ISREG(status.st_mode)) throw std::runtime_error(tr("host.notRegular", "Is not a regular file"));
    if (status.st_size == 0) throw std::runtime_error(tr("host.emptyFile", "The file is empty"));
    if (::access(file.c_str(), R_OK) != 0) throwSystem(errno);
}

bool isSameFile(const fs::path& a, const fs::path& b) {
    std::error_code none;
    return fs::equivalent(a, b, none);
}

} // namespace host
