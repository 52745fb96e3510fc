#include "sonora2_decmpa/MpegDecoder.h"

#include <cerrno>
#include <sys/stat.h>

namespace sonora2::plugins {

namespace {

constexpr int kBytesPerSample = 2;
// How much of something else (an unknown tag, damage) may stand before the next frame.
constexpr long kResyncBytes = 64 * 1024;
// Frames decoded before the target of a seek. A frame may refer back to the bits of several earlier ones,
// and what a seek delivers must be what a run from the start delivers.
constexpr long kRunUpFrames = 16;

} // namespace

SDecodedMedia CMpegDecoder::open() {
    struct stat status;
    if (::stat(m_file.path.c_str(), &status) != 0) failSystem("could not open", m_file, errno);
    if (S_ISDIR(status.st_mode)) failSystem("could not open", m_file, EISDIR);

    int error = MPG123_OK;
    m_handle.reset(mpg123_new(nullptr, &error));
    if (!m_handle) fail("could not open %s: %s", m_file.getDisplayName(), mpg123_plain_strerror(error));
    mpg123_handle* handle = m_handle.get();
    mpg123_param(handle, MPG123_ADD_FLAGS, MPG123_QUIET | MPG123_GAPLESS | MPG123_SKIP_ID3V2, 0);
    mpg123_param(handle, MPG123_RESYNC_LIMIT, kResyncBytes, 0);
    mpg123_param(handle, MPG123_PREFRAMES, kRunUpFrames, 0);
    mpg123_param(handle, MPG123_INDEX_SIZE, -1, 0); // grows: every frame is found without a search

    long rate = 0;
    int channels = 0, encoding = 0;
    if (mpg123_open(handle, m_file.path.c_str()) != MPG123_OK) failWith("could not open");
    if (mpg123_getformat(handle, &rate, &channels, &encoding) != MPG123_OK) failWith("could not open");
    // From here on nothing but this format: a file that changes it is an error and no surprise.
    mpg123_format_none(handle);
    if (mpg123_format(handle, rate, channels, MPG123_ENC_SIGNED_16) != MPG123_OK) failWith("could not open");
    // Headers may lie about the length and many files have none: the frames are counted.
    if (mpg123_scan(handle) != MPG123_OK) failWith("could not open");
    const off_t frames = mpg123_length(handle);
    if (frames < 0) failWith("could not open");
    m_format = {static_cast<int>(rate), channels, kBytesPerSample};
    return {m_format, frames};
}

int CMpegDecoder::read(uint8_t* pcm, int frames) {
    size_t done = 0;
    const size_t wanted = static_cast<size_t>(frames) * static_cast<size_t>(m_format.frameBytes());
    int result = MPG123_NEW_FORMAT;
    // The format is announced once, before the first frame.
    for (int i = 0; i < 2 && result == MPG123_NEW_FORMAT && done == 0; ++i)
        result = mpg123_read(m_handle.get(), pcm, wanted, &done);
    if (result == MPG123_NEW_FORMAT && done == 0)
        fail("could not decode %s: its format changes within the file", m_file.getDisplayName());
    if (done == 0 && result != MPG123_OK && result != MPG123_DONE) failWith("could not decode");
    return static_cast<int>(done / static_cast<size_t>(m_format.frameBytes()));
}

void CMpegDecoder::seek(int64_t frame) {
    if (mpg123_seek(m_handle.get(), frame, SEEK_SET) < 0) failWith("could not find a place in");
}

void CMpegDecoder::failWith(const char* doing) {
    fail("%s %s: %s", doing, m_file.getDisplayName(), mpg123_strerror(m_handle.get()));
}

} // namespace sonora2::plugins
