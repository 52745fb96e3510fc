/*
 * The audio tools: measuring loudness and equalizing.
 *
 * libtonewright and libtonewright_host load the shared library "audiotools" by its name when one of these is
 * first needed, and find its functions by their names. Hosts do not link it. Another library may take its
 * place if it exports the first three functions; the others are used only if they exist, except where
 * documented otherwise.
 *
 * Objects are pointers to a record whose first member points to a table of operations, which is the layout of
 * a C++ object without data whose class has only virtual functions. The first entry of each table is not
 * used.
 *
 * Samples are interleaved, little-endian: 8 bits unsigned, 16, 24 and 32 bits signed. No function throws. An
 * object must not be used by two threads at a time; different objects are independent.
 */
#ifndef TONEWRIGHT_AUDIOTOOLS_H
#define TONEWRIGHT_AUDIOTOOLS_H

#include <stdint.h>

#ifdef AUDIOTOOLS_BUILD
#define AUDIOTOOLS_API __attribute__((visibility("default")))
#else
#define AUDIOTOOLS_API
#endif

#ifdef __cplusplus
extern "C" {
#endif

/* --- Loudness ------------------------------------------------------------------------------------ */

/* Measures loudness. For one thread at a time. */
typedef struct TONEWRIGHT_Analysator TONEWRIGHT_Analysator;

/* The operations of an analyser, each with the analyser as its first argument. */
typedef struct TONEWRIGHT_AnalysatorOperations {
    void (*unused)(void);
    /* Starts a measurement; a previous one is discarded. */
    void (*initialise)(TONEWRIGHT_Analysator* self, int32_t channelCount, int32_t bytesPerSample,
                       int32_t sampleRate);
    /* Called last. */
    void (*destroy)(TONEWRIGHT_Analysator* self);
    /* Adds samples. A call may end within a frame, which the next call continues. */
    void (*analyse)(TONEWRIGHT_Analysator* self, const void* samples, int64_t byteCount);
    /* The integrated loudness (EBU R 128) of everything added, in LUFS. Negative infinity if nothing was
     * louder than -70 LUFS for 400 ms, NaN if the format cannot be measured or memory was exhausted. */
    double (*result)(TONEWRIGHT_Analysator* self);
} TONEWRIGHT_AnalysatorOperations;

/* What createNormalizeAnalysator returns. */
struct TONEWRIGHT_Analysator {
    const TONEWRIGHT_AnalysatorOperations* operations;
};

/* Null if memory is exhausted. */
AUDIOTOOLS_API TONEWRIGHT_Analysator* createNormalizeAnalysator(void);

/* A linear value for a difference in decibels: 32767 for 0. A difference without an end, such as the distance
 * from silence to a level, is not a change that samples could be given: it results in 32767 as well, and so
 * does NaN. */
AUDIOTOOLS_API double convertDeltaDBValue(double decibels);

/* What an analyser measures beside the loudness. */
typedef enum TONEWRIGHT_AnalysatorFlags {
    TONEWRIGHT_ANALYSATOR_PEAKS = 1, /* takes several times as long */
    TONEWRIGHT_ANALYSATOR_FLOAT = 2, /* samples are IEEE numbers of 4 or 8 bytes with full scale 1.0; infinite
                                        ones and NaN count as 0 */
    TONEWRIGHT_ANALYSATOR_RANGE = 4  /* the loudness range, too */
} TONEWRIGHT_AnalysatorFlags;

/* An analyser as above, with TONEWRIGHT_AnalysatorFlags. */
AUDIOTOOLS_API TONEWRIGHT_Analysator* createLoudnessAnalysator(int32_t flags);

/* The highest sample of all channels, and the highest value of the curve through the samples (ITU-R BS.1770),
 * as factors of full scale. Either pointer may be null. 1, or 0 for an analyser without peaks. */
AUDIOTOOLS_API int32_t getAnalysatorPeaks(TONEWRIGHT_Analysator* analysator, double* samplePeak,
                                          double* truePeak);

/* The integrated loudness of several recordings as one, such as the tracks of an album. The values are those
 * of the operation "result". */
AUDIOTOOLS_API double getAnalysatorLoudness(TONEWRIGHT_Analysator* const* analysators, int32_t count);

/* The loudness range (EBU Tech 3342) of one or several recordings, in LU: 0 for sound shorter than 3 seconds.
 * NaN unless all analysers have TONEWRIGHT_ANALYSATOR_RANGE. */
AUDIOTOOLS_API double getAnalysatorRange(TONEWRIGHT_Analysator* const* analysators, int32_t count);

/* No more samples follow: releases memory that only they would need. The results stay. */
AUDIOTOOLS_API void finishAnalysator(TONEWRIGHT_Analysator* analysator);

/* The peaks of what has been added so far do not count from now on. A long recording can so be measured in
 * parts, by several analysers: the 64 frames before a part are added first, and then forgotten, since the
 * curve through the samples depends on them. The highest peaks of all parts are those of the recording. 1, or
 * 0 for an analyser without peaks or without a format. */
AUDIOTOOLS_API int32_t forgetAnalysatorPeaks(TONEWRIGHT_Analysator* analysator);

/* --- Equalizer ----------------------------------------------------------------------------------- */

/* Changes the level of ten bands. For one thread at a time. */
typedef struct TONEWRIGHT_Equalizer TONEWRIGHT_Equalizer;

/* The operations of an equalizer, each with the equalizer as its first argument. */
typedef struct TONEWRIGHT_EqualizerOperations {
    void (*unused)(void);
    /* Sets the format of the samples and forgets those before. Formats that do not exist are accepted; their
     * samples are not changed. */
    void (*configure)(TONEWRIGHT_Equalizer* self, int32_t sampleRate, int32_t bytesPerSample,
                      int32_t channelCount);
    /* Selects a preset by its number, also between samples; 0 and unknown numbers change nothing. */
    void (*select)(TONEWRIGHT_Equalizer* self, int32_t preset);
    /* Changes whole frames in place; values beyond full scale clip. */
    void (*process)(TONEWRIGHT_Equalizer* self, void* samples, int64_t byteCount);
    void (*destroy)(TONEWRIGHT_Equalizer* self);
} TONEWRIGHT_EqualizerOperations;

/* What createEqualizer returns. */
struct TONEWRIGHT_Equalizer {
    const TONEWRIGHT_EqualizerOperations* operations;
};

/* Ten bands, one octave wide, with centres at 31.25 Hz times a power of two. Bands at and above half the
 * sample rate have no effect. Null if memory is exhausted. */
AUDIOTOOLS_API TONEWRIGHT_Equalizer* createEqualizer(void);

#define TONEWRIGHT_EQUALIZER_BANDS 10

/* The name of a preset (English, static) and its gains in decibels, lowest band first. Numbers start at 1 and
 * have no gaps; the number of a preset never changes. Null for other numbers. `gains` may be null. */
AUDIOTOOLS_API const char* getEqualizerPreset(int32_t preset, double gains[TONEWRIGHT_EQUALIZER_BANDS]);

#ifdef __cplusplus
} /* extern "C" */
#endif

#endif
