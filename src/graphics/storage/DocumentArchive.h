// Whole archives and XML files.
#pragma once

#include "graphics/storage/Base64Resources.h"
#include "graphics/storage/ZipCatalogue.h"
#include "graphics/storage/ZipResources.h"

#include <functional>

namespace graphics {

// The main entry of an archive and the name of its root element.
struct SArchiveForm {
    const char* entry;
    const char* root;
};

inline constexpr SArchiveForm kProjectForm{"project.xml", "project"};
inline constexpr SArchiveForm kTemplateForm{"template.xml", "template"};
inline constexpr SArchiveForm kThemeForm{"theme.xml", "theme"};
inline constexpr SArchiveForm kClipboardForm{"graphic-document.xml", "project"};
inline constexpr const char* kClipboardFormat = "zelvanor.graphics.graphic-document";

using SaveContent = std::function<void(const P<peru::IXmlNode>& root, IResourceOutputStore& store)>;
using LoadContent = std::function<void(const P<peru::IXmlNode>& root, IResourceInputStore& store)>;

// A further entry, which nothing in the XML has to refer to.
struct SArchiveEntry {
    std::string name;
    std::string bytes;
};

// The bytes of an archive; the same content gives the same bytes. Throws CError.
GRAPHICS_API std::string WriteArchive(const SArchiveForm& form, const SaveContent& save,
                                      bool isLossless = false,
                                      const std::vector<SArchiveEntry>& entries = {});
// Throws CError, which names the entry, if the main entry is missing or damaged or has another root.
GRAPHICS_API void ReadArchive(const SArchiveForm& form, std::string bytes, const LoadContent& load);
GRAPHICS_API void ReadArchive(const SArchiveForm& form, CZipCatalogue& catalogue, const LoadContent& load);

// The same as one XML file.
GRAPHICS_API std::string WriteXml(const char* root, const SaveContent& save,
                                  CBase64Resources::EMode mode = CBase64Resources::EMode::embedded);
GRAPHICS_API void ReadXml(const char* root, const std::string& bytes, const LoadContent& load,
                          CBase64Resources::EMode mode = CBase64Resources::EMode::embedded);

} // namespace graphics
