#include "tonewright/exports/FileTags.h"

#include "filetag/LazyLibrary.h"
#include "tonewright/exports/Barrier.h"
#include "tonewright/exports/Handles.h"

#include <mutex>

using namespace tonewright::exports;
using filetag::IFileTag;

namespace {

// Setting the extension must not load the library.
std::mutex g_mutex; // guards the two below
P<peru::IString> g_tempExtension;
bool g_isExtensionNew = false;

const P<filetag::ILibrary>& getTagLibrary() {
    const P<filetag::ILibrary>& library = filetag::getLibrary();
    std::lock_guard lock(g_mutex);
    if (g_isExtensionNew) library->setTempExtension(g_tempExtension);
    g_isExtensionNew = false;
    return library;
}

template <P<peru::IString> (IFileTag::*get)() const> TONEWRIGHT_Handle getField(TONEWRIGHT_Handle tag) {
    return barrier<TONEWRIGHT_Handle>(nullptr, [&]() -> TONEWRIGHT_Handle {
        const P<IFileTag> object = unwrap<IFileTag>(tag);
        return object ? wrapText((object.get()->*get)()) : nullptr;
    });
}

template <void (IFileTag::*set)(const peru::CStringArg&)>
void setField(TONEWRIGHT_Handle tag, const char16_t* text) {
    barrier([&] {
        if (const P<IFileTag> object = unwrap<IFileTag>(tag)) (object.get()->*set)(toString(text));
    });
}

} // namespace

void tonewright::exports::setTagTempExtension(const P<peru::IString>& extension) {
    std::lock_guard lock(g_mutex);
    g_tempExtension = extension;
    g_isExtensionNew = true;
}

TONEWRIGHT_Handle TONEWRIGHT_CreateFileTag(const char16_t* uri) {
    return barrier<TONEWRIGHT_Handle>(nullptr, [&] { return wrap(getTagLibrary()->createTag(toURI(uri))); });
}

int32_t TONEWRIGHT_StoreFileTag(TONEWRIGHT_Handle tag) {
    return barrier<int32_t>(TONEWRIGHT_FILE_TAG_FAILED, [&] {
        const P<IFileTag> object = unwrap<IFileTag>(tag);
        if (!object) return TONEWRIGHT_FILE_TAG_FAILED;
        object->store();
        return TONEWRIGHT_OK;
    });
}

#define FIELD(name)                                                                                          \
    TONEWRIGHT_Handle TONEWRIGHT_FileTag_Get##name(TONEWRIGHT_Handle tag) {                                  \
        return getField<&IFileTag::get##name>(tag);                                                          \
    }                                                                                                        \
    void TONEWRIGHT_FileTag_Set##name(TONEWRIGHT_Handle tag, const char16_t* text) {                         \
        setField<&IFileTag::set##name>(tag, text);                                                           \
    }
FIELD(Title)
FIELD(Artist)
FIELD(Album)
FIELD(AlbumArtist)
FIELD(TrackNumber)
FIELD(Year)
FIELD(Genre)
FIELD(Comment)
#undef FIELD
