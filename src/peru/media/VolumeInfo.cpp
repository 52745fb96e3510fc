#include "peru/media/VolumeInfo.h"

namespace peru::media {

CVolumeInfo::~CVolumeInfo() = default;

} // namespace peru::media
