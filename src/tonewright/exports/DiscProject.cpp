#include "disciopp/IProject.h"
#include "sonora2/context/LastFailure.h"
#include "sonora2/encoding/SampleReader.h"
#include "tonewright/exports/AppReference.h"
#include "tonewright/exports/Barrier.h"
#include "tonewright/exports/Handles.h"
#include "tonewright/exports/PcmStream.h"

using namespace tonewright::exports;
using sonora2::common::CSampleReader;
using sonora2::common::IAudioSource;

// An exception before the project is asked results in TONEWRIGHT_OK, which is part of the interface.
int32_t TONEWRIGHT_AudioCDProject_AddTrackFromAudioSource(TONEWRIGHT_Handle project, TONEWRIGHT_Handle source,
                                                          int32_t place) {
    return barrier<int32_t>(TONEWRIGHT_OK, [&] {
        const P<disciopp::IAudioCDProject> target = unwrap<disciopp::IAudioCDProject>(project);
        if (!target) return TONEWRIGHT_AUDIO_CD_PROJECT_FAILED;
        const P<IAudioSource> object = unwrap<IAudioSource>(source);
        if (!object) return TONEWRIGHT_AUDIO_FAILED;
        auto* wrapper =
            new peru::CInstanceWrapper(peru::make<CSampleReader>(requireApp()->getReadContext(), object));
        sonora2::common::clearLastFailure();
        try {
            target->insertTrack(kSampleReaderFuncs, wrapper, place);
        } catch (const std::exception& refusal) {
            // If the source is the reason, the stream has recorded it.
            const sonora2::common::SFailure cause = sonora2::common::getLastFailure();
            reportException(&refusal);
            if (!cause.isEmpty()) sonora2::common::setLastFailure(cause);
            return TONEWRIGHT_AUDIO_CD_PROJECT_FAILED;
        }
        return TONEWRIGHT_OK;
    });
}

int32_t TONEWRIGHT_DataDiscProject_AddFileFromAudioSource(TONEWRIGHT_Handle project, const char16_t* discPath,
                                                          const char16_t* fileURI) {
    return barrier<int32_t>(TONEWRIGHT_DATA_DISC_PROJECT_FAILED, [&] {
        const P<disciopp::IDataDiscProject> target = unwrap<disciopp::IDataDiscProject>(project);
        if (!target) return TONEWRIGHT_DATA_DISC_PROJECT_FAILED;
        const P<peru::IURI> path = toURI(discPath), from = toURI(fileURI);
        target->addFile(from, path, true);
        return TONEWRIGHT_OK;
    });
}
