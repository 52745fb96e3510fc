// The library as modules use it that load it on first use.
#pragma once

#include "freedb/AudioCDInfo.h"
#include "freedb/FreeDBDiscDesc.h"
#include "freedb/FreeDBReply.h"
#include "freedb/FreeDBSettings.h"

#include <vector>

namespace freedb {

// Look-ups that wait. One thread at a time, except for cancel().
class FREEDB_API IFreeDBClient : public virtual peru::IBase {
public:
    // Offsets as for CFreeDBDiscInfo::fromOffsets. Throws CError, CAbortedError after a cancel.
    virtual SFreeDBCandidates query(const std::vector<int32_t>& offsets, int32_t leadOut) = 0;
    virtual P<CAudioCDInfo> read(const P<CFreeDBDiscDesc>& candidate) = 0;
    // Ends the running call at once, and every later one when it begins. Any thread.
    virtual void cancel() = 0;
};

class FREEDB_API ILibrary : public virtual peru::IBase {
public:
    virtual P<IFreeDBClient> createClient(const SFreeDBSettings& settings) = 0;
    // See CFreeDBDiscInfo. Throws CInvalidArgError.
    virtual uint32_t getDiscId(const std::vector<int32_t>& offsets, int32_t leadOut) = 0;
};

// The function "freedb_getLibrary" that the library exports.
using GetLibraryFunction = void (*)(P<ILibrary>& library);
inline constexpr const char* kGetLibraryName = "freedb_getLibrary";

} // namespace freedb
