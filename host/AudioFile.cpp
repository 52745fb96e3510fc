#include "AudioFile.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <stdexcept>
#include <sys/stat.h>
#include <unistd.h>

// First, since the others lean on it.
#include <taglib/fileref.h>

#include <taglib/aiffproperties.h>
#include <taglib/flacproperties.h>
#include <taglib/wavproperties.h>

namespace host {

namespace fs = std::filesystem;

namespace {

[[noreturn]] void throwSystem(int error) {
    throw std::runtime_error(std::strerror(error));
}

int bitsPerSample(const TagLib::AudioProperties& properties) {
    if (auto* wav = dynamic_cast<const TagLib::RIFF::WAV::Properties*>(&properties))
        return wav->bitsPerSample();
    if (auto* aiff = dynamic_cast<const TagLib::RIFF::AIFF::Properties*>(&properties))
        return aiff->bitsPerSample();
    if (auto* flac = dynamic_cast<const TagLib::FLAC::Properties*>(&properties)) return flac->bitsPerSample();
    return 16;
}

} // namespace

SSampleFormat readSampleFormat(const fs::path& file) {
    SSampleFormat format;
    TagLib::FileRef reader(file.c_str(), true, TagLib::AudioProperties::Fast);
    if (reader.isNull() || !reader.audioProperties()) return format;
    const TagLib::AudioProperties& properties = *reader.audioProperties();
    if (properties.sampleRate() > 0) format.rate = properties.sampleRate();
    if (properties.channels() > 0) format.channels = properties.channels();
    if (const int bits = bitsPerSample(properties); bits > 0)
        format.bytesPerSample = std::clamp((bits + 7) / 8, 1, 4);
    return format;
}

void checkInput(const fs::path& file) {
    struct stat status;
    if (::stat(file.c_str(), &status) != 0) throwSystem(errno);
    if (S_ISDIR(status.st_mode)) throwSystem(EISDIR);
    if (!S_ISREG(status.st_mode)) throw std::runtime_error("Is not a regular file");
    if (status.st_size == 0) throw std::runtime_error("The file is empty");
    if (::access(file.c_str(), R_OK) != 0) throwSystem(errno);
}

std::string codecName(const fs::path& file) {
    std::string extension = file.extension();
    std::transform(extension.begin(), extension.end(), extension.begin(),
                   [](unsigned char c) { return std::tolower(c); });
    static constexpr struct {
        const char* extension;
        const char* codec;
    } kCodecs[] = {{".flac", "FLAC"}, {".mp3", "MP3"},  {".ogg", "Ogg Vorbis"}, {".oga", "Ogg Vorbis"},
                   {".wav", "WAV"},   {".wave", "WAV"}, {".aif", "AIFF"},       {".aiff", "AIFF"},
                   {".au", "AU"},     {".snd", "AU"},   {".caf", "CAF"},        {".w64", "Wave64"},
                   {".rf64", "RF64"}};
    for (const auto& known : kCodecs)
        if (extension == known.extension) return known.codec;
    return extension.empty() ? "unknown" : extension.substr(1);
}

bool isSameFile(const fs::path& a, const fs::path& b) {
    std::error_code none;
    return fs::equivalent(a, b, none);
}

COutputPlace::COutputPlace(const fs::path& target, const std::string& temporaryEnding, bool replace)
    : m_target(target), m_replace(replace) {
    std::error_code error;
    if (fs::is_symlink(m_target, error)) {
        const fs::path meant = fs::weakly_canonical(m_target, error);
        if (!error) m_target = meant;
    }
    struct stat status;
    if (::stat(m_target.c_str(), &status) == 0) {
        if (S_ISDIR(status.st_mode)) throwSystem(EISDIR);
        if (!S_ISREG(status.st_mode)) throw std::runtime_error("Is not a regular file");
        if (!replace) throw std::runtime_error("The file exists (--force replaces it)");
    } else if (errno != ENOENT) {
        throwSystem(errno);
    }
    const fs::path folder = m_target.has_parent_path() ? m_target.parent_path() : fs::path(".");
    if (::stat(folder.c_str(), &status) != 0)
        throw std::runtime_error("The folder " + folder.string() + " does not exist");
    if (!S_ISDIR(status.st_mode)) throw std::runtime_error(folder.string() + " is no folder");
    if (::access(folder.c_str(), W_OK | X_OK) != 0)
        throw std::runtime_error("The folder " + folder.string() +
                                 " cannot be written to: " + std::strerror(errno));
    m_temporary = m_target;
    m_temporary += temporaryEnding;
}

COutputPlace::~COutputPlace() {
    if (!m_committed) ::unlink(m_temporary.c_str());
}

void COutputPlace::commit() {
    const int file = ::open(m_temporary.c_str(), O_RDONLY | O_CLOEXEC);
    if (file < 0) throwSystem(errno);
    struct stat status;
    if (m_replace && ::stat(m_target.c_str(), &status) == 0) {
        // Best effort: the folder is ours, the file may have been another user's.
        if (::fchown(file, status.st_uid, status.st_gid) != 0) errno = 0;
        ::fchmod(file, status.st_mode & 07777);
    }
    int error = ::fsync(file) == 0 ? 0 : errno;
    ::close(file);
    if (error == 0) {
        // Without --force a file that has come into being meanwhile is not replaced either.
        if (::renameat2(AT_FDCWD, m_temporary.c_str(), AT_FDCWD, m_target.c_str(),
                        m_replace ? 0 : RENAME_NOREPLACE) != 0) {
            error = errno;
            if (error == EINVAL && !m_replace) // a file system without that flag
                error = ::link(m_temporary.c_str(), m_target.c_str()) == 0 ? ::unlink(m_temporary.c_str())
                                                                           : errno;
        }
    }
    if (error != 0) throwSystem(error);
    m_committed = true;
}

} // namespace host
