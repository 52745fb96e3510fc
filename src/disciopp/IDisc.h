// Discs.
#pragma once

#include "disciopp/Discio.h"
#include "disciopp/IFileSystem.h"
#include "peru/strings/String.h"

namespace disciopp {

// Functions that fail throw CDISCIOPPException. Any thread.
class DISCIOPP_API IDisc : public virtual peru::IBase {
public:
    virtual DISCIO_Disc* getHandle() = 0; // valid as long as the disc
    virtual int32_t getMediumType() = 0;  // a value of DISCIO_DiscGetMediumType
    virtual bool isEmpty() = 0;
    virtual bool isErasable() = 0;
    virtual bool isVirtual() = 0;
    virtual bool isWritable() = 0;
    virtual int64_t getCapacityBytes() = 0;
    virtual double getFreeSpaceFraction() = 0; // 0.0 to 1.0
    virtual P<peru::IString> getTitle() = 0;   // never empty
    virtual P<peru::IString> getDisplayName() = 0;
    virtual P<IFileSystem> getFileSystem() = 0;
};

class DISCIOPP_API IAudioCDDisc : public virtual IDisc {
public:
    virtual int32_t getSegmentCount() = 0;
    // DISCIO_TEXT_TITLE and so on; segment -1 stands for the whole disc.
    virtual P<peru::IString> getText(int32_t segment, int32_t text) = 0;
    // The samples of a track; closed.
    virtual Handle<DISCIO_PCMAudioStream> createStream(int32_t segment) = 0;
};

// "CD-R" and so on, in the user's language for the unknown types.
DISCIOPP_API P<peru::IString> getMediumTypeText(int32_t type);

} // namespace disciopp
