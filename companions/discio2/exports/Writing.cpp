#include "exports/Handles.h"
#include "writing/ImageWriter.h"

using namespace discio;

namespace {

uint32_t getFlags(const DISCIO_WriteOptions* options) {
    if (!options) return DISCIO_WRITE_VERIFY | DISCIO_WRITE_CD_TEXT;
    constexpr uint32_t kKnown =
        DISCIO_WRITE_DUMMY | DISCIO_WRITE_BLANK | DISCIO_WRITE_VERIFY | DISCIO_WRITE_CD_TEXT;
    if (options->size < sizeof(DISCIO_WriteOptions) || (options->flags & ~kKnown) || !(options->speed >= 0))
        throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "");
    return options->flags;
}

} // namespace

int32_t DISCIO_ProjectWriteImageW(DISCIO_Project* project, const char16_t* path,
                                  const DISCIO_WriteOptions* options) {
    return barrier<int32_t>(0, [&] {
        const auto& disc = require(project).disc;
        const uint32_t flags = getFlags(options);
        if (!path) throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "");
        if (flags & (DISCIO_WRITE_DUMMY | DISCIO_WRITE_BLANK))
            throw CDiscError(DISCIO_ERROR_NOT_SUPPORTED, "an image can be neither a dummy nor blanked");
        const CVirtualDisc::CWriting writing(disc);
        const CProgress progress(options);
        if (const auto* audio = dynamic_cast<const CVirtualAudioDisc*>(disc.get()))
            writeAudioImage(*audio, toUTF8(path), flags & DISCIO_WRITE_CD_TEXT, progress);
        else
            writeDataImage(dynamic_cast<const CVirtualDataDisc&>(*disc), toUTF8(path), progress);
        return 1;
    });
}
