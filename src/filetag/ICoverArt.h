// One picture in a file's tag.
#pragma once

#include "filetag/Api.h"
#include "peru/MemoryManager.h"
#include "peru/strings/String.h"

namespace filetag {

using peru::P;

// What a picture shows. Files store the number of the ID3v2 APIC frame instead.
enum EPictureType : int32_t {
    kFrontCover = 0,    // 3 in the file
    kBackCover = 1,     // 4
    kOtherPicture = 2,  // 0
    kFileIcon = 3,      // 1
    kOtherFileIcon = 4, // 2
    // From here on the value equals the number in the file.
    kLeafletPage = 5,
    kMedia = 6,
    kLeadArtist = 7,
    kArtist = 8,
    kConductor = 9,
    kBand = 10,
    kComposer = 11,
    kLyricist = 12,
    kRecordingLocation = 13,
    kDuringRecording = 14,
    kDuringPerformance = 15,
    kScreenCapture = 16
};

// Writes through to the tag that returned it and is valid as long as that tag is open. The file changes when
// the tag is stored.
class FILETAG_API ICoverArt : public virtual peru::IBase {
public:
    virtual P<peru::CMemoryBlock> getData() const = 0; // the bytes of the picture file
    virtual void setData(const P<peru::CMemoryBlock>& data) = 0;
    virtual EPictureType getPictureType() const = 0;
    virtual void setPictureType(EPictureType type) = 0;
    virtual P<peru::IString> getMimeType() const = 0; // such as "image/jpeg"
    virtual void setMimeType(const peru::CStringArg& type) = 0;
    virtual P<peru::IString> getDescription() const = 0;
};

} // namespace filetag
