#include "exports/Handles.h"

#include <algorithm>

using namespace discio;

namespace {

const char16_t* getText(DISCIO_Drive* drive, std::string (IDrive::*get)() const, const void* function) {
    return barrier<const char16_t*>(nullptr, [&] {
        DISCIO_Drive& own = require(drive);
        return own.texts.hold(function, ((*own.drive).*get)());
    });
}

int32_t moveTray(DISCIO_Drive* drive, bool open) {
    return barrier<int32_t>(0, [&] {
        require(drive).drive->moveTray(open);
        return 1;
    });
}

} // namespace

int32_t DISCIO_DriveCheckDisc(DISCIO_Drive* drive, int32_t milliseconds, int32_t /*flags*/) {
    return barrier<int32_t>(0, [&] {
        if (!require(drive).drive->checkMedium(std::max<int32_t>(milliseconds, 0)))
            throw CDiscError(DISCIO_ERROR_NO_DISC, drive->drive->getPath());
        return 1;
    });
}

DISCIO_Disc* DISCIO_DriveOpenDisc(DISCIO_Drive* drive) {
    return barrier<DISCIO_Disc*>(nullptr, [&] {
        auto disc = std::make_shared<SDisc>();
        disc->medium = require(drive).drive->openMedium();
        DISCIO_Disc* handle = makeHandle<DISCIO_Disc>(EKind::disc);
        handle->disc = std::move(disc);
        return handle;
    });
}

int32_t DISCIO_DriveOpenTray(DISCIO_Drive* drive) {
    return moveTray(drive, true);
}

int32_t DISCIO_DriveCloseTray(DISCIO_Drive* drive) {
    return moveTray(drive, false);
}

const char16_t* DISCIO_DriveGetNameW(DISCIO_Drive* drive) {
    static const char s_key = 0;
    return getText(drive, &IDrive::getName, &s_key);
}

const char16_t* DISCIO_DriveGetPathW(DISCIO_Drive* drive) {
    static const char s_key = 0;
    return getText(drive, &IDrive::getPath, &s_key);
}

const char16_t* DISCIO_DriveGetRevisionW(DISCIO_Drive* drive) {
    static const char s_key = 0;
    return getText(drive, &IDrive::getRevision, &s_key);
}

const char16_t* DISCIO_DriveGetDriverDescriptionW(DISCIO_Drive* drive) {
    static const char s_key = 0;
    return getText(drive, &IDrive::getDriverDescription, &s_key);
}

const double* DISCIO_DriveGetReadSpeedList(DISCIO_Drive* drive) {
    return barrier<const double*>(nullptr, [&]() -> const double* {
        DISCIO_Drive& own = require(drive);
        own.speeds = own.drive->getReadSpeeds();
        if (own.speeds.empty()) return nullptr;
        own.speeds.push_back(0.0);
        return own.speeds.data();
    });
}
