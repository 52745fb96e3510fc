#include "media/InputContent.h"

#include "base/Cancel.h"
#include "base/Translation.h"
#include "media/Download.h"
#include "media/SoundFile.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <climits>
#include <cstring>
#include <fcntl.h>
#include <fstream>
#include <poll.h>
#include <stdexcept>
#include <string_view>
#include <unistd.h>
#include <vector>

namespace host {

namespace fs = std::filesystem;

namespace {

constexpr size_t kBlock = 256 * 1024;
constexpr int kPollMilliseconds = 100;

class CDescriptor {
public:
    explicit CDescriptor(int descriptor) : m_descriptor(descriptor) {}
    ~CDescriptor() {
        if (m_descriptor >= 0) ::close(m_descriptor);
    }
    CDescriptor(const CDescriptor&) = delete;
    CDescriptor& operator=(const CDescriptor&) = delete;
    int get() const { return m_descriptor; }

private:
    int m_descriptor;
};

[[noreturn]] void failSystem(const std::string& doing) {
    throw std::runtime_error(doing + ": " + std::strerror(errno));
}

// Another thread may receive the signal of Ctrl-C, which then does not interrupt a blocked call of this one.
bool waitFor(int descriptor, short events) {
    pollfd waiting{descriptor, events, 0};
    while (!isCancelled())
        if (const int ready = ::poll(&waiting, 1, kPollMilliseconds);
            ready > 0 || (ready < 0 && errno != EINTR))
            return true;
    return false;
}

// Returns 0 at the end.
size_t readSome(int descriptor, std::vector<char>& block, const std::string& doing) {
    ssize_t size;
    do size = ::read(descriptor, block.data(), block.size());
    while (size < 0 && (errno == EINTR || errno == EAGAIN) && waitFor(descriptor, POLLIN));
    if (size < 0) failSystem(doing);
    return static_cast<size_t>(size);
}

// A frame header of MPEG audio: 11 bits of synchronisation, and no reserved version, layer, bit rate or
// sample rate.
bool isMpegFrame(std::string_view bytes) {
    if (bytes.size() < 3) return false;
    const auto at = [&](size_t i) { return static_cast<unsigned char>(bytes[i]); };
    return at(0) == 0xFF && (at(1) & 0xE0) == 0xE0 && (at(1) & 0x18) != 0x08 && (at(1) & 0x06) != 0 &&
           (at(2) & 0xF0) != 0xF0 && (at(2) & 0x0C) != 0x0C;
}

std::string readStart(std::ifstream& stream, size_t offset) {
    std::array<char, 64> bytes{};
    stream.clear();
    stream.seekg(static_cast<std::streamoff>(offset));
    stream.read(bytes.data(), bytes.size());
    return {bytes.data(), static_cast<size_t>(stream.gcount())};
}

} // namespace

bool isStandardStream(const fs::path& file) {
    return file == "-";
}

std::string detectExtension(const fs::path& file) {
    std::ifstream stream(file, std::ios::binary);
    std::string start = readStart(stream, 0);
    bool hasTag = false;
    if (start.starts_with("ID3") && start.size() >= 10) {
        size_t size = 10;
        for (size_t i = 6; i < 10; ++i) size += static_cast<size_t>(start[i] & 0x7F) << (7 * (9 - i));
        start = readStart(stream, size);
        hasTag = true;
    }
    const auto has = [&](size_t offset, std::string_view magic) {
        return start.size() >= offset + magic.size() && start.compare(offset, magic.size(), magic) == 0;
    };
    if ((has(0, "RIFF") || has(0, "RIFX") || has(0, "RF64")) && has(8, "WAVE")) return ".wav";
    if (has(0, "fLaC")) return ".flac";
    if (has(0, "OggS")) return has(28, "OpusHead") ? ".opus" : has(28, "Speex") ? ".spx" : ".ogg";
    if (has(0, "FORM") && (has(8, "AIFF") || has(8, "AIFC"))) return ".aiff";
    if (has(0, ".snd")) return ".au";
    if (has(0, "caff")) return ".caf";
    if (has(0, "riff\x2e\x91\xcf\x11")) return ".w64";
    if (has(4, "ftyp")) return ".m4a";
    if (has(0, "\x30\x26\xb2\x75\x8e\x66\xcf\x11")) return ".wma";
    if (has(0, "\x1a\x45\xdf\xa3")) return ".mka";
    if (has(0, "wvpk")) return ".wv";
    if (has(0, "MAC ")) return ".ape";
    if (has(0, "TTA1")) return ".tta";
    if (has(0, "MPCK") || has(0, "MP+")) return ".mpc";
    // A tag may be followed by padding before the first frame.
    return isMpegFrame(start) || hasTag ? ".mp3" : "";
}

CInputContent::CInputContent(const fs::path& input) : m_path(input) {
    if (isStandardStream(input)) {
        copyStandardInput();
        if (isCancelled()) return;
        const std::string extension = detectExtension(m_path);
        if (extension.empty()) {
            checkInput(m_path);
            throw std::runtime_error(
                tr("host.Input.unknownFormat",
                   "The format is unknown: standard input must be a sound file, such as WAV or FLAC"));
        }
        nameCopy(extension);
        return;
    }
    if (isWebAddress(input)) {
        m_folder.emplace();
        m_path = m_folder->getPath() / "input";
        if (!download(input, m_path)) return;
        // A name may say more than the content: Opus and Vorbis begin alike.
        const std::string detected = detectExtension(m_path);
        const fs::path named = getWebName(input).extension();
        const bool isNamed = detected.empty() || (detected == ".ogg" && !named.empty());
        nameCopy(isNamed ? named : fs::path(detected));
        return;
    }
    checkInput(input);
    if (input.has_extension()) return;
    const std::string extension = detectExtension(input);
    if (extension.empty()) return;
    m_folder.emplace();
    m_path = m_folder->getPath() / ("input" + extension);
    fs::create_symlink(fs::absolute(input), m_path);
}

void CInputContent::nameCopy(const fs::path& extension) {
    const fs::path named = m_path.native() + extension.native();
    fs::rename(m_path, named);
    m_path = named;
}

void CInputContent::copyStandardInput() {
    m_folder.emplace();
    m_path = m_folder->getPath() / "input";
    const CDescriptor copy(::open(m_path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600));
    if (copy.get() < 0)
        failSystem(tr("host.Standard.copyFailed", "Standard input cannot be copied to a temporary file"));
    std::vector<char> block(kBlock);
    while (waitFor(STDIN_FILENO, POLLIN)) {
        const size_t size =
            readSome(STDIN_FILENO, block, tr("host.Standard.unreadable", "Standard input cannot be read"));
        if (size == 0) return;
        for (size_t written = 0; written < size;) {
            const ssize_t part = ::write(copy.get(), block.data() + written, size - written);
            if (part < 0 && errno != EINTR)
                failSystem(
                    tr("host.Standard.copyFailed", "Standard input cannot be copied to a temporary file"));
            written += part > 0 ? static_cast<size_t>(part) : 0;
        }
    }
}

bool copyToStandardOutput(const fs::path& file) {
    const CDescriptor from(::open(file.c_str(), O_RDONLY | O_CLOEXEC));
    if (from.get() < 0) failSystem(tr("host.Standard.resultUnreadable", "The result cannot be read"));
    std::vector<char> block(kBlock);
    while (const size_t size = readSome(from.get(), block,
                                        tr("host.Standard.resultUnreadable", "The result cannot be read"))) {
        for (size_t written = 0; written < size;) {
            if (!waitFor(STDOUT_FILENO, POLLOUT)) return false;
            // A pipe that is ready takes this much without blocking.
            const size_t most = std::min<size_t>(size - written, PIPE_BUF);
            const ssize_t part = ::write(STDOUT_FILENO, block.data() + written, most);
            if (part < 0 && errno == EPIPE) return false;
            if (part < 0 && errno != EINTR && errno != EAGAIN)
                failSystem(tr("host.Standard.unwritable", "Standard output cannot be written"));
            written += part > 0 ? static_cast<size_t>(part) : 0;
        }
    }
    return true;
}

} // namespace host
