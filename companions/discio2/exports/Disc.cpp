#include "exports/Handles.h"

using namespace discio;

namespace {

template <class R, class Get> R ask(DISCIO_Disc* disc, R failure, Get get) {
    return barrier<R>(failure, [&] { return static_cast<R>(get(*require(disc).disc->medium)); });
}

const STrack& requireTrack(const IMedium& medium, int32_t index) {
    const auto& tracks = medium.getContents().tracks;
    if (index < 0 || index >= static_cast<int32_t>(tracks.size()))
        throw CDiscError(DISCIO_ERROR_NO_SUCH_OBJECT, "track " + std::to_string(index));
    return tracks[static_cast<size_t>(index)];
}

} // namespace

int32_t DISCIO_DiscGetMediumType(DISCIO_Disc* disc) {
    return ask(disc, int32_t{-1}, [](const IMedium& medium) { return medium.getState().type; });
}

int32_t DISCIO_DiscIsEmpty(DISCIO_Disc* disc) {
    return ask(disc, 0, [](const IMedium& medium) { return medium.getState().isEmpty; });
}

int32_t DISCIO_DiscIsErasable(DISCIO_Disc* disc) {
    return ask(disc, 0, [](const IMedium& medium) { return medium.getState().isErasable; });
}

int32_t DISCIO_DiscIsVirtual(DISCIO_Disc* disc) {
    return ask(disc, 0, [](const IMedium& medium) { return medium.isVirtual(); });
}

int32_t DISCIO_DiscIsWritable(DISCIO_Disc* disc) {
    return ask(disc, 0, [](const IMedium& medium) { return medium.getState().isWritable; });
}

int32_t DISCIO_DiscHasAudioComponent(DISCIO_Disc* disc) {
    return ask(disc, 0, [](const IMedium& medium) { return medium.hasComponent(true); });
}

int32_t DISCIO_DiscHasDataComponent(DISCIO_Disc* disc) {
    return ask(disc, 0, [](const IMedium& medium) { return medium.hasComponent(false); });
}

int64_t DISCIO_DiscGetCapacityBytes(DISCIO_Disc* disc) {
    return ask(disc, int64_t{-1}, [](const IMedium& medium) { return medium.getState().capacityBytes; });
}

double DISCIO_DiscGetFreeSpaceFraction(DISCIO_Disc* disc) {
    return ask(disc, -1.0, [](const IMedium& medium) { return medium.getState().freeFraction; });
}

int32_t DISCIO_DiscGetComponentCount(DISCIO_Disc* disc) {
    return DISCIO_DiscGetTrackCount(disc);
}

int32_t DISCIO_DiscGetComponentType(DISCIO_Disc* disc, int32_t index) {
    return ask(disc, -1, [&](const IMedium& medium) { return requireTrack(medium, index).isAudio ? 1 : 2; });
}

int32_t DISCIO_DiscGetTrackCount(DISCIO_Disc* disc) {
    return ask(disc, -1, [](const IMedium& medium) { return medium.getContents().tracks.size(); });
}

int32_t DISCIO_DiscGetTrackLengthBlocks(DISCIO_Disc* disc, int32_t index) {
    return ask(disc, -1, [&](const IMedium& medium) { return requireTrack(medium, index).length; });
}

int32_t DISCIO_DiscGetTrackStartBlocks(DISCIO_Disc* disc, int32_t index) {
    return ask(disc, INT32_MIN, [&](const IMedium& medium) {
        const STableOfContents& contents = medium.getContents();
        if (index == static_cast<int32_t>(contents.tracks.size())) return contents.leadOut;
        return requireTrack(medium, index).start;
    });
}

int32_t DISCIO_DiscGetTrackPregap(DISCIO_Disc* disc, int32_t index) {
    return ask(disc, -1, [&](const IMedium& medium) { return requireTrack(medium, index).pregap; });
}
