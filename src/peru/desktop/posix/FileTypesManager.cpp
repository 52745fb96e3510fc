#include "peru/desktop/posix/FileTypesManager.h"

#include "peru/desktop/posix/GObjectPointer.h"
#include "peru/strings/IStringLocalizer.h"

#include <gio/gio.h>

namespace peru::posix {

namespace {

class CFileType : public CObject, public IFileType {
public:
    CFileType(const P<IString>& extension, const char* contentType);

    P<IString> getExtension() const override { return m_extension; }
    P<IString> getDescription() const override { return m_description; }
    P<IString> getIconName() const override { return m_iconName; }
    EFileCategory getCategory() const override { return m_category; }
    P<CMimeType> getMimeType() const override { return m_mimeType; }

private:
    P<IString> m_extension;
    P<IString> m_description;
    P<IString> m_iconName;
    EFileCategory m_category;
    P<CMimeType> m_mimeType;
};

P<IString> toString(const char* text) {
    return text ? CString::fromUTF8(text) : CString::empty();
}

P<IString> findIconName(const char* contentType, const char* genericName) {
    GIcon* icon = g_content_type_get_icon(contentType);
    P<IString> name = toString(genericName);
    if (icon && G_IS_THEMED_ICON(icon))
        if (const char* const* names = g_themed_icon_get_names(G_THEMED_ICON(icon)); names && names[0])
            name = toString(names[0]);
    if (icon) g_object_unref(icon);
    return name;
}

// System files have specific types and archives share a generic icon; the rest is decided by the major type.
EFileCategory findCategory(const char* contentType, const P<CMimeType>& mimeType, const char* genericIcon) {
    for (const char* type :
         {"application/x-sharedlib", "application/x-executable", "application/x-msdos-program",
          "application/x-ms-dos-executable", "application/vnd.microsoft.portable-executable",
          "application/x-object", "application/x-kernel-module"})
        if (g_content_type_is_a(contentType, type)) return EFileCategory::system;

    struct SMajor {
        const char* name;
        EFileCategory category;
    };
    for (const SMajor& major : {SMajor{"image", EFileCategory::image}, SMajor{"audio", EFileCategory::audio},
                                SMajor{"video", EFileCategory::video}})
        if (mimeType->getMajor()->equals(major.name)) return major.category;
    if (genericIcon && g_str_has_prefix(genericIcon, "package")) return EFileCategory::compressed;
    if (g_content_type_is_a(contentType, "text/plain") || mimeType->getMajor()->equals("text"))
        return EFileCategory::text;
    return EFileCategory::unknown;
}

CFileType::CFileType(const P<IString>& extension, const char* contentType) : m_extension(extension) {
    const CGText description(g_content_type_get_description(contentType));
    const CGText mimeType(g_content_type_get_mime_type(contentType));
    const CGText genericIcon(g_content_type_get_generic_icon_name(contentType));
    m_description = toString(description.get());
    m_iconName = findIconName(contentType, genericIcon.get());
    m_mimeType = CMimeType::parse(toString(mimeType ? mimeType.get() : "application/octet-stream"));
    m_category = findCategory(contentType, m_mimeType, genericIcon.get());
}

} // namespace

CFileTypesManager::~CFileTypesManager() = default;

P<IFileType> CFileTypesManager::getFileType(const CStringArg& extension) {
    std::string name = CString::toStdString(extension);
    if (name.starts_with('.')) name.erase(0, 1);
    const P<IString> key = CString::fromUTF8(name)->toLower();
    // An empty extension must not be looked up: the guess would be made from the name alone.
    const CGText contentType(
        name.empty()
            ? g_strdup("application/octet-stream")
            : g_content_type_guess(("name." + CString::toStdString(key)).c_str(), nullptr, 0, nullptr));
    return make<CFileType>(key, contentType.get());
}

P<IString> CFileTypesManager::getCategoryName(EFileCategory category) {
    switch (category) {
    case EFileCategory::image:
        return localize("peru.CFileTypesManager.ImageFiles", "Image files");
    case EFileCategory::audio:
        return localize("peru.CFileTypesManager.AudioFiles", "Audio files");
    case EFileCategory::video:
        return localize("peru.CFileTypesManager.VideoFiles", "Video files");
    case EFileCategory::text:
        return localize("peru.CFileTypesManager.TextFiles", "Text files");
    case EFileCategory::compressed:
        return localize("peru.CFileTypesManager.CompressedFiles", "Compressed files");
    case EFileCategory::system:
        return localize("peru.CFileTypesManager.SystemFiles", "System files");
    case EFileCategory::unknown:
        break;
    }
    return CString::empty();
}

} // namespace peru::posix
