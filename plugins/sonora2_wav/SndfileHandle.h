// Files opened with libsndfile.
#pragma once

#include <memory>
#include <sndfile.h>
#include <string>

namespace sonora2::plugins::wav {

struct SSndfileCloser {
    void operator()(SNDFILE* file) const { sf_close(file); }
};
using SndfileHandle = std::unique_ptr<SNDFILE, SSndfileCloser>;

struct SOpenedSndfile {
    SndfileHandle handle; // null after a failure
    bool isUnsupportedCodec = false;
    std::string reason;
};

// The library keeps the reason of a failure in one place for all threads, so files are opened one at a time.
SOpenedSndfile openSndfile(SF_VIRTUAL_IO io, int mode, SF_INFO& info, void* user);

} // namespace sonora2::plugins::wav
