#include "exports/Handles.h"
#include "projects/FunctionStream.h"
#include "projects/SourcePath.h"
#include "projects/VirtualAudioDisc.h"
#include "projects/VirtualDataDisc.h"
#include "projects/WaveStream.h"

using namespace discio;

namespace {

std::string fromText(const char16_t* text) {
    if (!text) throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "");
    return toUTF8(text);
}

template <class T> DISCIO_Project* createProject(DISCIO_Library* library) {
    return barrier<DISCIO_Project*>(nullptr, [&] {
        require(library);
        auto disc = std::make_shared<T>();
        DISCIO_Project* project = makeHandle<DISCIO_Project>(EKind::project);
        project->disc = std::move(disc);
        return project;
    });
}

// Calls `change` with the disc of a project. `code` is the error for a disc of the other kind.
template <class T, class Change> int32_t changeDisc(DISCIO_Disc* disc, int32_t code, Change change) {
    return barrier<int32_t>(0, [&] {
        IMedium& medium = *require(disc).disc->medium;
        if (!medium.isVirtual()) throw CDiscError(DISCIO_ERROR_DISC_NOT_VIRTUAL, "");
        T* own = dynamic_cast<T*>(&medium);
        if (!own) throw CDiscError(code, "");
        change(*own);
        return 1;
    });
}

template <class Change> int32_t changeAudio(DISCIO_Disc* disc, Change change) {
    return changeDisc<CVirtualAudioDisc>(disc, DISCIO_ERROR_NO_AUDIO, change);
}

template <class Change> int32_t changeData(DISCIO_Disc* disc, Change change) {
    return changeDisc<CVirtualDataDisc>(disc, DISCIO_ERROR_NO_DATA, change);
}

} // namespace

DISCIO_Project* DISCIO_CreateAudioCDProject(DISCIO_Library* library) {
    return createProject<CVirtualAudioDisc>(library);
}

DISCIO_Project* DISCIO_CreateDataDiscProject(DISCIO_Library* library) {
    return createProject<CVirtualDataDisc>(library);
}

DISCIO_Disc* DISCIO_ProjectGetVirtualDisc(DISCIO_Project* project) {
    return barrier<DISCIO_Disc*>(nullptr, [&] {
        auto disc = std::make_shared<SDisc>();
        disc->medium = require(project).disc;
        disc->volume = std::dynamic_pointer_cast<IDataVolume>(disc->medium);
        DISCIO_Disc* handle = makeHandle<DISCIO_Disc>(EKind::disc);
        handle->disc = std::move(disc);
        return handle;
    });
}

DISCIO_PCMAudioStream* DISCIO_CreatePCMAudioStreamFromFuncs(DISCIO_Library* library,
                                                            const DISCIO_PCMAudioStreamFuncs* funcs,
                                                            void* user) {
    return barrier<DISCIO_PCMAudioStream*>(nullptr, [&]() -> DISCIO_PCMAudioStream* {
        require(library);
        if (!funcs) throw CDiscError(DISCIO_ERROR_INVALID_PARAM, "");
        auto stream = std::make_shared<CFunctionStream>(*funcs, user);
        const DISCIO_PCMAudioStreamFuncs& own = stream->getFuncs();
        return new SStreamHandle(std::move(stream), &own, user);
    });
}

DISCIO_PCMAudioStream* DISCIO_CreatePCMAudioStreamFromFileW(DISCIO_Library* library, const char16_t* file) {
    return barrier<DISCIO_PCMAudioStream*>(nullptr, [&]() -> DISCIO_PCMAudioStream* {
        require(library);
        return new SStreamHandle(std::make_shared<CWaveStream>(toSourcePath(fromText(file))));
    });
}

int32_t DISCIO_DiscAudioInsertSegmentPCMAudioStream(DISCIO_Disc* disc, DISCIO_PCMAudioStream* stream,
                                                    int32_t place) {
    return changeAudio(disc, [&](CVirtualAudioDisc& own) {
        own.insert(static_cast<SStreamHandle&>(require(stream, EKind::stream)).stream, place);
    });
}

int32_t DISCIO_DiscAudioRemoveSegment(DISCIO_Disc* disc, int32_t segment) {
    return changeAudio(disc, [&](CVirtualAudioDisc& own) { own.remove(segment); });
}

int32_t DISCIO_DiscAudioSetSegmentPregap(DISCIO_Disc* disc, int32_t segment, int32_t blocks) {
    return changeAudio(disc, [&](CVirtualAudioDisc& own) { own.setPregap(segment, blocks); });
}

int32_t DISCIO_DiscAudioSetMetaDataStringW(DISCIO_Disc* disc, int32_t text, const char16_t* value) {
    return changeAudio(disc, [&](CVirtualAudioDisc& own) { own.setText(text, fromText(value)); });
}

int32_t DISCIO_DiscAudioSetSegmentMetaDataStringW(DISCIO_Disc* disc, int32_t segment, int32_t text,
                                                  const char16_t* value) {
    return changeAudio(disc,
                       [&](CVirtualAudioDisc& own) { own.setSegmentText(segment, text, fromText(value)); });
}

int32_t DISCIO_DiscDataSetTitleW(DISCIO_Disc* disc, const char16_t* title) {
    return changeData(disc, [&](CVirtualDataDisc& own) { own.setTitle(fromText(title)); });
}

int32_t DISCIO_DiscDataAddFileW(DISCIO_Disc* disc, const char16_t* path, const char16_t* source) {
    return changeData(
        disc, [&](CVirtualDataDisc& own) { own.addFile(fromText(path), toSourcePath(fromText(source))); });
}

int32_t DISCIO_DiscDataCreateFolderW(DISCIO_Disc* disc, const char16_t* path) {
    return changeData(disc, [&](CVirtualDataDisc& own) { own.createFolder(fromText(path)); });
}

int32_t DISCIO_DiscDataRemoveW(DISCIO_Disc* disc, const char16_t* path) {
    return changeData(disc, [&](CVirtualDataDisc& own) { own.remove(fromText(path)); });
}
