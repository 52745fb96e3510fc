// What a source or format in a slave knows about itself after an operation.
#pragma once

#include "peru/ISerializable.h"
#include "peru/Object.h"
#include "sonora2/boxed/RemoteTools.h"

namespace sonora2::common {

// Interfaces that an object in a slave may have beside ISource and IFormat; bits of a mask.
enum ERemoteFacet : int32_t {
    kFacetVideo = 1,
    kFacetAudio = 2,
    kFacetFloatSamples = 4,
    kFacetMediaDescription = 8,
    kFacetSalvage = 16,
    kFacetClippingPrevention = 32,
    kFacetDiscardable = 64,
    kFacetFormatSettings = 128,
};

// Fetched after each operation that has no answer of its own: one round trip brings its error and everything
// that it may have changed.
class SONORA2_API CRemoteMediaState : public peru::CObject, public virtual peru::ISerializable {
public:
    bool isOpened = false;
    bool isEOF = true;
    int32_t facets = 0;
    double duration = 0.0;
    double startTime = 0.0;
    int32_t sampleRate = 0;
    int32_t channelCount = 0;
    int32_t bytesPerSample = 0;
    uint32_t usedSettings = 0; // of IFormatSettings
    // The first error of an operation without an answer since the last fetch; empty if there is none.
    P<peru::IString> failure = peru::CString::empty();
    P<peru::IString> log = peru::CString::empty(); // as for getLog

    void writeTo(const P<peru::IDataOutStream>& stream) const override;
    void readFrom(const P<peru::IDataInStream>& stream) override;
};

class getStateFunction : public TRemoteFunction<peru::CRemoteVarObject> {
public:
    getStateFunction() : TRemoteFunction("getState") {}
};

} // namespace sonora2::common
