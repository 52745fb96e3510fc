#include "tonewright/DiscStreamFactory.h"

#include "disciopp/LazyLibrary.h"
#include "peru/Errors.h"

namespace tonewright {

namespace {

bool isInImage(const peru::P<peru::IURI>& uri) {
    return uri->getScheme()->equals("discioppdiscimage");
}

} // namespace

void CDiscStreamFactory::reportMissing(const peru::P<peru::IURI>& uri) const {
    if (isInImage(uri)) throw peru::CFileNotFoundError(uri);
}

peru::P<peru::ISeekableInStream> CDiscStreamFactory::tryGetSeekableInStream(const peru::P<peru::IURI>& uri) {
    const bool isInDrive = disciopp::LazyLibrary::isLoaded() && uri->getScheme()->equals("file");
    return isInImage(uri) || isInDrive ? disciopp::getLibrary()->tryOpenFile(uri) : nullptr;
}

} // namespace tonewright
