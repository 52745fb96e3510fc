// Events of optical drives from udev, and of folders of images from inotify.
#pragma once

#include "disciopp/IDriveEvents.h"

namespace disciopp::posix {

// Throws peru::CError.
std::unique_ptr<IDriveEvents> createDriveEvents();

} // namespace disciopp::posix
