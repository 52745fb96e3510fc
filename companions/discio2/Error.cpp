#include "Error.h"

#include <iterator>

namespace discio {

const char* describeError(int32_t code) {
    static constexpr const char* kTexts[] = {
        "No error occurred.",
        "Internal error.",
        "The requested API version is not supported by the DISCIO component.",
        "Not enough memory.",
        "An invalid parameter was passed to the function.",
        "The specified object does not exist.",
        "The specified object was not found.",
        "The operation is not supported.",
        "The operation has been aborted.",
        "The specified object already exists.",
        "The object is not a file.",
        "The object is not a folder.",
        "Unsupported file or stream format.",
        "The object has not been prepared for the operation yet.",
        "The file format is not compatible with the requested operation.",
        "Error accessing the device.",
        "The device cannot be used for writing.",
        "A buffer underrun has occurred.",
        "There is no disc in the drive.",
        "The disc is not virtual. Only virtual discs can be changed.",
        "The disc cannot be written to.",
        "The disc is not erasable.",
        "The disc is lost, i.e. it is not in the drive any more.",
        "The contents of the disc are in use.",
        "The disc is empty.",
        "The disc is not empty.",
        "The disc has no data component.",
        "The disc has no audio component.",
        "The disc has no video component.",
        "The disc has an unsupported type.",
        "No destination disc has been set.",
        "No source disc has been set.",
        "There is not enough free space on the destination disc.",
        "The operation cannot be performed because the project has not been written yet.",
        "Error reading input data.",
        "The stream is already open.",
        "The stream has not been opened yet.",
        "The filesystem is not compatible with the operation.",
        "The filesystem on the disc is broken.",
        "The destination disc is lost.",
        "The source disc is lost.",
    };
    return code >= 0 && code < static_cast<int32_t>(std::size(kTexts)) ? kTexts[code] : "Unknown error.";
}

} // namespace discio
