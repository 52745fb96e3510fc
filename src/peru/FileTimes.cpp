#include "peru/FileTimes.h"

namespace peru {

CFileTimes::~CFileTimes() = default;

} // namespace peru
