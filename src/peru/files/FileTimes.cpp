#include "peru/files/FileTimes.h"

namespace peru {

CFileTimes::~CFileTimes() = default;

} // namespace peru
