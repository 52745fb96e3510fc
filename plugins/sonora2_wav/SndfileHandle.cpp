#include "sonora2_wav/SndfileHandle.h"

#include <mutex>

namespace sonora2::plugins::wav {

SOpenedSndfile openSndfile(SF_VIRTUAL_IO io, int mode, SF_INFO& info, void* user) {
    static std::mutex s_mutex;
    const std::scoped_lock lock(s_mutex);
    SOpenedSndfile opened;
    opened.handle.reset(sf_open_virtual(&io, mode, &info, user));
    if (opened.handle) return opened;
    opened.isUnsupportedCodec = sf_error(nullptr) == SF_ERR_UNSUPPORTED_ENCODING;
    opened.reason = sf_strerror(nullptr);
    return opened;
}

} // namespace sonora2::plugins::wav
