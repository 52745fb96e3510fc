#include "ced/ItemType.h"

#include "peru/strings/IStringLocalizer.h"

namespace ced {

namespace {

struct SItem {
    const char* xml;
    const char* key;
    const char* text;
    TargetType target;
    bool isFoldable;
    graphics::SSize size;
};

constexpr SItem kItems[] = {
    {"dvd-case", "ced.ItemType.DVDCase", "DVD Case", TargetType::dvdCase, false, {273, 183}},
    {"booklet", "ced.ItemType.Booklet", "DVD Booklet", TargetType::booklet, true, {110, 180}},
    {"slim-case", "ced.ItemType.SlimCase", "Slim Case", TargetType::slimCase, true, {121, 121}},
    {"jewel-case-front",
     "ced.ItemType.JewelCaseFront",
     "Jewel Case (Front)",
     TargetType::jewelCase,
     true,
     {121, 121}},
    {"jewel-case-back",
     "ced.ItemType.JewelCaseBack",
     "Jewel Case (Back)",
     TargetType::jewelCase,
     false,
     {151, 118}},
    {"disc", "ced.ItemType.Disc", "Disc", TargetType::disc, false, {117, 117}},
    {"blu-ray-case", "ced.ItemType.BluRayCase", "Blu-ray Case", TargetType::bluRayCase, false, {270, 150}},
};

const SItem* findItem(ItemType type) {
    const int value = static_cast<int>(type);
    return value < 0 || value >= kItemTypeCount ? nullptr : &kItems[value];
}

} // namespace

std::string ItemTypeToXml(ItemType type) {
    const SItem* const item = findItem(type);
    return item ? item->xml : "unknown";
}

std::optional<ItemType> ItemTypeFromXml(std::string_view text) {
    for (int i = 0; i < kItemTypeCount; ++i)
        if (text == kItems[i].xml) return static_cast<ItemType>(i);
    return std::nullopt;
}

std::string ItemTypeToStr(ItemType type) {
    const SItem* const item = findItem(type);
    return peru::CString::toStdString(item ? peru::localize(item->key, item->text)
                                           : peru::localize("ced.ItemType.Unknown", "Unknown"));
}

std::vector<ItemType> getItemTypes(TargetType target) {
    std::vector<ItemType> types;
    for (int i = 0; i < kItemTypeCount; ++i)
        if (kItems[i].target == target) types.push_back(static_cast<ItemType>(i));
    return types;
}

bool isFoldable(ItemType type) {
    const SItem* const item = findItem(type);
    return item && item->isFoldable;
}

graphics::SSize getDefaultSize(ItemType type, bool isFolded) {
    const SItem* const item = findItem(type);
    if (!item) return {};
    return {item->size.width * (isFolded ? 2 : 1), item->size.height};
}

} // namespace ced
