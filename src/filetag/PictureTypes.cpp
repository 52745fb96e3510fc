#include "filetag/PictureTypes.h"

namespace filetag {
namespace {

struct SPair {
    EPictureType type;
    int32_t number;
};

constexpr SPair kMoved[] = {
    {kFrontCover, 3}, {kBackCover, 4}, {kOtherPicture, 0}, {kFileIcon, 1}, {kOtherFileIcon, 2}};

} // namespace

int32_t toFileNumber(EPictureType type) {
    for (const SPair& pair : kMoved)
        if (pair.type == type) return pair.number;
    return type >= kLeafletPage && type <= kScreenCapture ? type : 0;
}

EPictureType fromFileNumber(int32_t number) {
    for (const SPair& pair : kMoved)
        if (pair.number == number) return pair.type;
    return number >= kLeafletPage && number <= kScreenCapture ? static_cast<EPictureType>(number)
                                                              : kOtherPicture;
}

} // namespace filetag
