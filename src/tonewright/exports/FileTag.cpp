#include "filetag/FileTagFactory.h"
#include "tonewright/exports/Barrier.h"
#include "tonewright/exports/Handles.h"

using namespace tonewright::exports;
using filetag::IFileTag;

namespace {

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

TONEWRIGHT_Handle TONEWRIGHT_CreateFileTag(const char16_t* uri) {
    return barrier<TONEWRIGHT_Handle>(
        nullptr, [&] { return wrap(filetag::CFileTagFactory::get()->create(toURI(uri))); });
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
