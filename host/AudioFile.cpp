#include "AudioFile.h"

#include "PlainHeader.h"

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <climits>
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

// A name at the limit of the file system is cut before its extension, which selects the format, and stays
// unique by a number.
fs::path nameTemporary(const fs::path& target, const std::string& ending) {
    static std::atomic<unsigned> s_count{0};
    const std::string name = target.filename(), extension = target.extension();
    if (name.size() + ending.size() <= NAME_MAX) return target.native() + ending;
    const std::string end = "~" + std::to_string(++s_count) + extension + ending;
    return target.parent_path() / (name.substr(0, NAME_MAX - std::min<size_t>(end.size(), NAME_MAX)) + end);
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
    if (const auto plain = readPlainHeader(file)) return *plain;
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

std::string describe(const SSampleFormat& samples) {
    return std::to_string(samples.rate) + " Hz, " + std::to_string(samples.channels) +
           (samples.channels == 1 ? " channel and " : " channels and ") +
           std::to_string(samples.bytesPerSample * 8) + " bits";
}

std::string describeKind(const fs::path& file) {
    return file.has_extension() ? file.extension().string() + " files" : "files without an extension";
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
    // The other name in a message is the input's, so that this one has to be told.
    const auto refuse = [&](const std::string& reason) {
        throw std::runtime_error(target.string() + " cannot be written: " + reason);
    };
    std::error_code error;
    if (fs::is_symlink(m_target, error)) {
        const fs::path meant = fs::weakly_canonical(m_target, error);
        if (!error) m_target = meant;
    }
    struct stat status;
    if (::stat(m_target.c_str(), &status) == 0) {
        if (S_ISDIR(status.st_mode)) refuse(std::strerror(EISDIR));
        if (!S_ISREG(status.st_mode)) refuse("Is not a regular file");
        if (!replace) throw std::runtime_error(target.string() + " exists (--force replaces it)");
    } else if (errno != ENOENT) {
        refuse(std::strerror(errno));
    }
    const fs::path folder = m_target.has_parent_path() ? m_target.parent_path() : fs::path(".");
    if (::stat(folder.c_str(), &status) != 0)
        throw std::runtime_error("The folder " + folder.string() + " does not exist");
    if (!S_ISDIR(status.st_mode)) throw std::runtime_error(folder.string() + " is no folder");
    if (::access(folder.c_str(), W_OK | X_OK) != 0)
        throw std::runtime_error("The folder " + folder.string() +
                                 " cannot be written to: " + std::strerror(errno));
    m_temporary = nameTemporary(m_target, temporaryEnding);
    if (!replace && ::lstat(m_temporary.c_str(), &status) == 0)
        throw std::runtime_error(m_temporary.string() + " was left by an earlier run (--force replaces it)");
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
