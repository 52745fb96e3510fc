#include "exports/Handles.h"
#include "writing/DiscWriter.h"
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

std::string requireDevice(DISCIO_Drive* drive) {
    const IDrive& own = *require(drive).drive;
    if (!own.isOptical())
        throw CDiscError(DISCIO_ERROR_NOT_SUPPORTED, own.getPath() + " is not an optical drive");
    return own.getPath();
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

int32_t DISCIO_ProjectWriteDisc(DISCIO_Project* project, DISCIO_Drive* drive,
                                const DISCIO_WriteOptions* options) {
    return barrier<int32_t>(0, [&] {
        const auto& disc = require(project).disc;
        const std::string device = requireDevice(drive);
        const uint32_t flags = getFlags(options);
        SDiscSettings settings;
        settings.isDummy = flags & DISCIO_WRITE_DUMMY;
        settings.mayBlank = flags & DISCIO_WRITE_BLANK;
        settings.isVerified = flags & DISCIO_WRITE_VERIFY;
        settings.withTexts = flags & DISCIO_WRITE_CD_TEXT;
        settings.speed = options ? options->speed : 0;
        const CVirtualDisc::CWriting writing(disc);
        const CProgress progress(options);
        if (const auto* audio = dynamic_cast<const CVirtualAudioDisc*>(disc.get()))
            writeAudioDisc(*audio, device, settings, progress);
        else
            writeDataDisc(dynamic_cast<const CVirtualDataDisc&>(*disc), device, settings, progress);
        return 1;
    });
}

int32_t DISCIO_DriveBlankDisc(DISCIO_Drive* drive, int32_t whole, const DISCIO_WriteOptions* options) {
    return barrier<int32_t>(0, [&] {
        const std::string device = requireDevice(drive);
        getFlags(options);
        blankDisc(device, whole != 0, CProgress(options));
        return 1;
    });
}
