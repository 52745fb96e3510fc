#include "ced/TargetType.h"

#include "peru/strings/IStringLocalizer.h"

namespace ced {

namespace {

struct STarget {
    const char* xml;
    const char* key;
    const char* text;
};

// By value; the last one stands for all other values.
constexpr STarget kTargets[] = {
    {"dvd-case", "ced.TargetType.DVDCase", "DVD Case"},
    {"booklet", "ced.TargetType.Booklet", "DVD Booklet"},
    {"slim-case", "ced.TargetType.SlimCase", "Slim Case"},
    {"jewel-case", "ced.TargetType.JewelCase", "Jewel Case"},
    {"blu-ray-case", "ced.TargetType.BluRay", "Blu-ray Case"},
    {"disc", "ced.TargetType.Disc", "Disc"},
    {"unknown", "ced.TargetType.Unknown", "Unknown"},
};

const STarget& getTarget(TargetType type) {
    const int value = static_cast<int>(type);
    return kTargets[value < 0 || value > kTargetTypeCount ? kTargetTypeCount : value];
}

} // namespace

std::string TargetTypeToXml(TargetType type) {
    return getTarget(type).xml;
}

std::optional<TargetType> TargetTypeFromXml(std::string_view text) {
    for (int i = 0; i < kTargetTypeCount; ++i)
        if (text == kTargets[i].xml) return static_cast<TargetType>(i);
    return std::nullopt;
}

std::string TargetTypeToStr(TargetType type) {
    const STarget& target = getTarget(type);
    return peru::CString::toStdString(peru::localize(target.key, target.text));
}

} // namespace ced
